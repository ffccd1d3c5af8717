// SPDX-License-Identifier: Apache-2.0
#include <optional>

#include "diagnosticslib/call_frame.h"
#include "quo_base/generalSAR.h"
#include "quo_base/generalSAR_configuration.h"
#include "quorelxmllib/guarded.h"
#include "quorelxmllib/header_session.h"

namespace {

constexpr const char* kSource = "generalSAR_configuration";
constexpr int kSwaths = 7;
// The numbers that DataSetInfo_Obj gives the polarisations.
enum Polarization { kHH = 0, kVV = 1, kHV = 2, kVH = 3 };

std::optional<double> factor_of_swath(const double (&factors)[kSwaths], int swath) {
    return swath >= 0 && swath < kSwaths ? std::optional{factors[swath]} : std::nullopt;
}

std::optional<double> stripmap_factor(const EnvisatCalibrationFactors& table, int polarization, int swath) {
    if (polarization == kHH) return factor_of_swath(table.IM_HH, swath);
    if (polarization == kVV) return factor_of_swath(table.IM_VV, swath);
    return std::nullopt;
}

std::optional<double> double_polarization_factor(const EnvisatCalibrationFactors& table, int polarization,
                                                 int swath) {
    switch (polarization) {
        case kHH:
            return factor_of_swath(table.AP_HH, swath);
        case kVV:
            return factor_of_swath(table.AP_VV, swath);
        case kHV:
            return factor_of_swath(table.AP_HV, swath);
        case kVH:
            return factor_of_swath(table.AP_VH, swath);
        default:
            return std::nullopt;
    }
}

std::optional<double> wide_swath_factor(const EnvisatCalibrationFactors& table, int polarization, bool multilook) {
    if (polarization == kHH) return multilook ? table.WSML_HH : table.WSS_HH;
    if (polarization == kVV) return multilook ? table.WSML_VV : table.WSS_VV;
    return std::nullopt;
}

std::optional<double> factor_of(const EnvisatCalibrationFactors& table, const DataSetInfo_Obj& info) {
    using Info = DataSetInfo_Obj;
    if (!info.IsSensorType(Info::dsAsar)) return std::nullopt;
    const int polarization = info.getPolarizationNbr(), swath = info.getISNbr();
    const bool focused = info.IsImageType(Info::dsAzimuthFocused);
    if (info.IsAcqMode(Info::dsStripmap) && focused) return stripmap_factor(table, polarization, swath);
    if (info.IsAcqMode(Info::dsDoublePolarization) && focused) {
        return double_polarization_factor(table, polarization, swath);
    }
    if (info.IsAcqMode(Info::dsScansar) && info.IsImageType(Info::dsMultilook)) {
        return wide_swath_factor(table, polarization, info.RangeLooks > 1);
    }
    return std::nullopt;
}

}  // namespace

int EnvisatCalibrationFactors::writeFactor(GeneralSAR* product) const {
    quo::CallFrame frame{"EnvisatCalibrationFactors::writeFactor", kSource};
    if (!product) return frame.fail(QUO_REFUSED, "No product");
    const auto factor = factor_of(*this, product->dataSetInfo);
    if (!factor) return frame.fail(QUO_REFUSED, "No factor for this sensor, mode, image type and polarisation");
    product->dataSetInfo.ExternalCalibrationFactor = *factor;
    return frame.success();
}

int EnvisatCalibrationFactors::writeFactor(const char* header_file) const {
    quo::CallFrame frame{"EnvisatCalibrationFactors::writeFactor", kSource};
    return quo::guarded(frame, [&] {
        quo::JoinedSession session{header_file};  // parses the file once, and tells whether it could be saved
        GeneralSAR product;
        int status = product.GSread(header_file);
        if (status == QUO_OK) status = writeFactor(&product);
        if (status == QUO_OK) status = product.GSwrite(header_file);
        if (status == QUO_OK) status = session.commit();
        product.GSdestroy();
        return status == QUO_OK ? frame.success() : frame.callee(status);
    });
}

// SPDX-License-Identifier: Apache-2.0
#include "missions/mission.h"

#include <algorithm>
#include <cmath>

#include "missions/mission_xml.h"
#include "quo_base/geometry.h"
#include "sarutillib/ground/residuals.h"

namespace quo {

bool TiePoints::find_times(const GeneralSAROrbit& orbit) {
    azimuth_s.resize(count());
    range_s.resize(count());
    const OrbitTargets targets{count(), latitude.data(), longitude.data(), height_m.data()};
    return orbit.earth2sat(targets, {azimuth_s.data(), range_s.data(), nullptr}) == QUO_OK &&
           std::ranges::any_of(azimuth_s, [](double t) { return std::isfinite(t); });
}

void TiePoints::drop_wrong(const ImageGrid_Obj& grid, const GeneralSAROrbit& orbit, const std::string& source) {
    TiePoints kept;
    for (std::size_t i = 0; i < count(); ++i) {
        const TiePoints one{{line[i]},     {sample[i]},    {latitude[i]}, {longitude[i]},
                            {height_m[i]}, {azimuth_s[i]}, {range_s[i]}};
        const quo_tie_points off = one.compare(grid, orbit);
        if (std::max(std::abs(off.most_line), std::abs(off.most_sample)) > kMost) continue;
        for (std::vector<double> TiePoints::*const list :
             {&TiePoints::line, &TiePoints::sample, &TiePoints::latitude, &TiePoints::longitude,
              &TiePoints::height_m, &TiePoints::azimuth_s, &TiePoints::range_s})
            (kept.*list).push_back((one.*list)[0]);
    }
    const std::size_t dropped = count() - kept.count();
    if (10 * dropped > count())
        throw MissionRefusal{QUO_REFUSED, source + ": " + std::to_string(dropped) + " of " +
                                              std::to_string(count()) +
                                              " tie points are more than a pixel off the image's times"};
    *this = std::move(kept);
}

quo_tie_points TiePoints::compare(const ImageGrid_Obj& grid, const GeneralSAROrbit& orbit) const {
    const std::size_t n = count();
    std::vector<double> first(n), second(n), found(n), pixel_azimuth_s(n), pixel_range_s(n), x(n), y(n), z(n);
    OrbitGround ground{};
    ground.x_m = x.data();
    ground.y_m = y.data();
    ground.z_m = z.data();
    const OrbitSamples samples{n, pixel_azimuth_s.data(), pixel_range_s.data(), nullptr, height_m.data()};
    if (grid.timePixels({n, azimuth_s.data(), range_s.data()}, {first.data(), second.data(), found.data()}) !=
            QUO_OK ||
        grid.pixelTimes({n, line.data(), sample.data()}, {pixel_azimuth_s.data(), pixel_range_s.data()}) !=
            QUO_OK ||
        orbit.sat2earth(samples, ground) != QUO_OK)
        return {};
    Residuals lines, columns, places;
    for (std::size_t i = 0; i < n; ++i) {
        if (std::isnan(first[i]) || std::isnan(x[i])) continue;  // in no burst
        const double off = first[i] - line[i], other = second[i] - line[i];
        lines.add(std::abs(other) < std::abs(off) ? other : off);
        columns.add(found[i] - sample[i]);
        places.add(norm(Vec3{x[i], y[i], z[i]} - from_geodetic({latitude[i], longitude[i], height_m[i]})));
    }
    return {static_cast<std::int32_t>(lines.count()),
            static_cast<std::int32_t>(n),
            lines.rms(),
            lines.largest(),
            columns.rms(),
            columns.largest(),
            places.rms(),
            places.largest()};
}

void write_mission_header(MissionProduct& product, const std::string& header) {
    for (int i = 0; i < GeneralSAR::kObjects; ++i)
        product.header.GSget(static_cast<GSObject>(i))->setExactNumbers(true);
    product.header.roi.Roi.setExactNumbers(true);
    product.grid.setExactNumbers(true);
    if (product.grid.writehdr(header.c_str()) != QUO_OK || product.header.GSwrite(header.c_str()) != QUO_OK)
        throw MissionRefusal{QUO_WRITE_FAILED, header + ": cannot be written"};
}

}  // namespace quo

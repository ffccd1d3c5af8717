#ifndef QUO_ORBIT_TABLE_H
#define QUO_ORBIT_TABLE_H

#include "quorelxmllib/field_table.h"

namespace quo {

/** The state-vector block, the same for both orbit classes. */
template <typename Obj>
inline constexpr FieldTable kStateVectorTable{
    "StateVectorData",
    QUO_FIELD(pSV_m, "pos", QUO_LENGTH(nSV_n, 3)),
    QUO_FIELD(vSV_mOs, "vel", QUO_LENGTH(nSV_n, 3)),
    QUO_FIELD(t0SV_s, "TimeFirst"),
    QUO_FIELD(dtSV_s, "TimeDelta"),
    QUO_FIELD(nSV_n, "nStateVectors"),
};

/** Allocates what the table lists. A negative count, which the table would take for none, is refused too. */
template <typename Obj>
int create_state_vectors(Obj& object) {
    return object.nSV_n < 0 ? static_cast<int>(QUO_REFUSED) : kStateVectorTable<Obj>.create_buffers(object);
}

constexpr const char* buffer_message(int status) {
    return status == QUO_NO_MEMORY ? "Memory allocation failure" : "The number of state vectors is not plausible";
}

/** Reads the block from the XML section, else from the parameter file. `buffer_status` is where the object's
 * createBuffers() leaves its result: neither reader passes a lack of memory on.
 * @return 0; 7; 4 when neither form is there and complete. */
template <typename Obj>
int read_state_vectors(Obj& object, const char* file, int& buffer_status) {
    const auto& table = kStateVectorTable<Obj>;
    buffer_status = QUO_OK;
    if (!file) return QUO_READ_FAILED;
    if (object.readAuxiliaryFile(file, 1, table.section())) return QUO_OK;
    if (buffer_status == QUO_NO_MEMORY) return QUO_NO_MEMORY;
    if (table.read_profile(object, file) == QUO_OK) return QUO_OK;
    return buffer_status == QUO_NO_MEMORY ? QUO_NO_MEMORY : QUO_READ_FAILED;
}

}  // namespace quo

#endif

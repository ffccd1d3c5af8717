// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ORBIT_TABLE_H
#define QUO_ORBIT_TABLE_H

#include "quorelxmllib/field_table.h"

namespace quo {

/** The state-vector block, the same for both orbit classes. */
template <typename Obj>
inline constexpr FieldTable kStateVectorTable{
    "StateVectorData",
    QUO_FIELD(pSV_m, "pos", QUO_LENGTH(nSV_n, 3), quo::unit("m")),
    QUO_FIELD(vSV_mOs, "vel", QUO_LENGTH(nSV_n, 3), quo::unit("m/s")),
    QUO_FIELD(t0SV_s, "TimeFirst", quo::unit("s")),
    QUO_FIELD(dtSV_s, "TimeDelta", quo::unit("s")),
    QUO_FIELD(nSV_n, "nStateVectors"),
};

/** Allocates what the table lists, and by `make_more` what the class adds to that. A negative count, which the
 * table would take for none, is refused too; a failure leaves nothing behind. */
template <typename Obj, typename MakeMore>
int create_state_vectors(CallFrame& frame, Obj& object, MakeMore make_more) {
    int status = object.nSV_n < 0 ? static_cast<int>(QUO_REFUSED) : kStateVectorTable<Obj>.create_buffers(object);
    if (status == QUO_OK && !make_more()) status = QUO_NO_MEMORY;
    if (status == QUO_OK) return frame.success();
    object.Obj::destroyBuffers();
    return frame.fail(status, status == QUO_NO_MEMORY ? "Memory allocation failure"
                                                      : "The number of state vectors is not plausible");
}

/** Reads the block from the XML section, else from the parameter file.
 * @return 0; 7; 4 when neither form is there and complete. */
template <typename Obj>
int read_state_vectors(Obj& object, const char* file) {
    const int status = file ? kStateVectorTable<Obj>.read(object, file) : static_cast<int>(QUO_REFUSED);
    return status == QUO_REFUSED ? static_cast<int>(QUO_READ_FAILED) : status;
}

}  // namespace quo

#endif

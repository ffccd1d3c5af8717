// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_ORBIT_CHECK_H
#define QUO_ORBIT_CHECK_H

#include <vector>

#include "generalSAR/orbit/orbit_interpolation.h"
#include "quo_base/generalSARorbit.h"

namespace quo {

/** What is wrong with the state vectors, in their order; see SVFinding. Throws std::bad_alloc. */
std::vector<SVFinding> check_state_vectors(const StateVectors& states, double t0);

/** Whether a finding says that the vectors are not one spacing apart from each other. */
constexpr bool is_uneven(const SVFinding& finding) noexcept {
    return finding.problem == SVFinding::kGap || finding.problem == SVFinding::kDuplicate ||
           finding.problem == SVFinding::kOrder;
}

}  // namespace quo

#endif

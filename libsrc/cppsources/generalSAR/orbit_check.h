#ifndef QUO_ORBIT_CHECK_H
#define QUO_ORBIT_CHECK_H

#include <vector>

#include "generalSAR/orbit_interpolation.h"
#include "quo_base/generalSARorbit.h"

namespace quo {

/** What is wrong with the state vectors, in their order; see SVFinding. Throws std::bad_alloc. */
std::vector<SVFinding> check_state_vectors(const StateVectors& states, double t0);

}  // namespace quo

#endif

// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_PLACE_TREE_H
#define QUO_PLACE_TREE_H

#include <cstdint>
#include <span>

#include "sarutillib/geometry/geometry_kernels.h"

namespace quo {

/** A place that an orbit passes, and the number of the run that starts there. */
struct OrbitPlace {
    Vec3 at;
    std::int32_t run;
    float least_radius_m = 0.0F;  // of all places in the part of the tree that this one parts
};

/** Orders places into a tree: the one in the middle parts the others by x, each half is a tree that begins with y,
 * then z, then x again. */
void plant_tree(std::span<OrbitPlace> places) noexcept;

/** The run at the place of such a tree that is nearest to a point; 0 where there is none. Few places are looked
 * at.
 */
std::int32_t nearest_in_tree(std::span<const OrbitPlace> tree, const Vec3& point) noexcept;

}  // namespace quo

#endif

// SPDX-License-Identifier: Apache-2.0
#ifndef QUO_SENTINEL1_H
#define QUO_SENTINEL1_H

#include "missions/mission.h"

namespace quo {

/** @name The two functions of the mission's reader, see MissionReader
 * @{ */
MissionFiles find_sentinel1_files(const std::string& source, const std::string& swath,
                                  const std::string& polarization);
void describe_sentinel1(const MissionFiles& files, const std::string& orbit_file, MissionProduct& product);
/** @} */

inline constexpr MissionReader kSentinel1{find_sentinel1_files, describe_sentinel1};

}  // namespace quo

#endif

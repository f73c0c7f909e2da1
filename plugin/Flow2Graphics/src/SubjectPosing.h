#pragma once

#include <Flow2Graphics/VFlowSubjectSceneArrangement.h>

#include <CoreMoxelTypes/Subject.h>

#include <cstdint>
#include <string>

namespace Flow2Graphics
{

/// The structure in one of its poses: joint state, bones and markers, all of them seen. Its root stands at the place,
/// as high as the pose has it, but a pose far below the floor is lifted onto it. Structures are z up; with `i_bYUp` the
/// result is turned for a world whose y is up. False when there are no poses of such a structure; `o_rMessage` is set
/// then, and when the pose was no good and is the neutral one instead.
bool PoseSubject( const CoreMoxelTypes::VSubjectParametrised& i_rSubject, std::int32_t i_Pose,
                  const VSubjectPlace& i_rPlace, bool i_bYUp, CoreMoxelTypes::VSubjectDynamicParameters& o_rPosed,
                  std::string& o_rMessage );

/// How far bones and markers of the neutral pose reach to any side of the root, in mm, at most a hundred metres.
/// Negative when it cannot be posed.
double NeutralReach( const CoreMoxelTypes::VSubjectParametrised& i_rSubject );

} // namespace Flow2Graphics

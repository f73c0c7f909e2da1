#pragma once

// What readers of skeletons work with. Vectors and quaternions are plain arrays; rotations act on column vectors.

#include <HostSources/VRecording.h>

#include <array>
#include <string>

namespace HostSources
{

using VVector = std::array< double, 3 >;
/// w, x, y, z.
using VQuaternion = std::array< double, 4 >;

VQuaternion operator*( const VQuaternion& i_rA, const VQuaternion& i_rB );
/// About an axis of length 1.
VQuaternion TurnAbout( const VVector& i_rAxis, double i_Angle );
/// Of a length of at most pi.
VVector RotationVector( const VQuaternion& i_rTurn );
CoreMoxelTypes::Rigid RigidOf( const VQuaternion& i_rTurn, const VVector& i_rShift );
/// First `i_rB`, then `i_rA`.
CoreMoxelTypes::Rigid operator*( const CoreMoxelTypes::Rigid& i_rA, const CoreMoxelTypes::Rigid& i_rB );
CoreMoxelTypes::Rigid Inverse( const CoreMoxelTypes::Rigid& i_rRigid );
double LengthOf( const VVector& i_rVector );
/// A bone up to this length has no direction, mm.
inline constexpr double ShortestBone = 1e-6;
/// The turn that lays x along the vector; none for one of at most `ShortestBone`.
CoreMoxelTypes::Rigid TurnTo( const VVector& i_rVector );

/// Farther from the origin nothing of a recording stands, mm.
inline constexpr double Farthest = 1e9;

/// Poses may need far more room in memory than their text has on disk. False, with a message, where they would need
/// room out of all proportion to `i_TextSize` bytes.
bool HasRoomForPoses( std::size_t i_Poses, std::size_t i_StateSize, std::size_t i_TextSize, std::string& o_rMessage );

/// Where the joints go, for the floor; of very long recordings every so many frames.
void AddToBounds( const VRecordingSkeleton& i_rSkeleton, VRecording& io_rRecording );

} // namespace HostSources

#pragma once

#include "SimulationMath.h"

#include <ComputeSubjectFK/VComputeSubjectFK.h>
#include <CoreMoxelTypes/Subject.h>

#include <array>
#include <cstddef>
#include <memory>
#include <span>
#include <vector>

namespace HostSources::Simulation
{

inline constexpr std::size_t WalkerMarkers = 53;

/// The bones of a plain body, in the order of its segments.
enum EBone : std::uint32_t
{
  EHips,
  ESpine,
  EChest,
  ENeck,
  EHead,
  EHeadEnd,
  ELeftClavicle,
  ELeftUpperArm,
  ELeftForearm,
  ELeftHand,
  ERightClavicle,
  ERightUpperArm,
  ERightForearm,
  ERightHand,
  ELeftThigh,
  ELeftShin,
  ELeftFoot,
  ELeftToes,
  ELeftToesEnd,
  ERightThigh,
  ERightShin,
  ERightFoot,
  ERightToes,
  ERightToesEnd,
  EBones
};
/// From a bone of the left to that of the right.
inline constexpr std::uint32_t ArmBones = ERightClavicle - ELeftClavicle, LegBones = ERightThigh - ELeftThigh;

constexpr std::size_t DegreesOf( CoreMoxelTypes::EJointType i_Joint )
{
  constexpr std::size_t Degrees[] = { 6, 3, 2, 1, 1, 0 };
  return Degrees[static_cast< std::size_t >( i_Joint )];
}
constexpr CoreMoxelTypes::EJointType JointOf( std::size_t i_Bone )
{
  using enum CoreMoxelTypes::EJointType;
  constexpr CoreMoxelTypes::EJointType Joints[EBones] = {
      Free,   Ball,  Ball,        HardySpicer, Ball,   Dummy,                     // trunk and head
      Slider, Ball,  Hinge,       HardySpicer, Slider, Ball,  Hinge, HardySpicer, // shoulders rise and fall
      Ball,   Hinge, HardySpicer, Hinge,       Dummy,  Ball,  Hinge, HardySpicer, Hinge, Dummy };
  return Joints[i_Bone];
}
/// The place in a body's joint state of the first number of a bone.
constexpr std::size_t DegreeOf( std::size_t i_Bone )
{
  std::size_t Degree = 0;
  for ( std::size_t Bone = 0; Bone < i_Bone; ++Bone )
  {
    Degree += DegreesOf( JointOf( Bone ) );
  }
  return Degree;
}
inline constexpr std::size_t WalkerDegrees = DegreeOf( EBones );
using VWalkerState = std::array< double, WalkerDegrees >;

/// Proportions. With 1 each a body is 1.77 m tall.
struct VBodyShape
{
  double Legs = 1, Trunk = 1, Arms = 1, Head = 1, Breadth = 1;
};
VBodyShape ShapeScaled( double i_Scale );
/// Of a character that a performer drives: small, with a big head and long arms.
inline constexpr VBodyShape CharacterShape{ .Legs = 0.68, .Trunk = 0.72, .Arms = 0.8, .Head = 1.15, .Breadth = 0.85 };

// Lengths of a leg of 1, mm.
inline constexpr double ThighLength = 430, ShinLength = 420, AnkleHeight = 80, ToeJointHeight = 18;
inline constexpr double BallToAnkle = 130, BallToHeel = 175, HipWidth = 90;
inline constexpr double HipsHeight = ThighLength + ShinLength + AnkleHeight; ///< of someone who stands straight

const std::array< const char*, WalkerMarkers >& WalkerMarkerNames();

/// Pairs of markers to join by a stick.
std::span< const std::array< std::uint32_t, 2 > > WalkerSticks();

/// How a marker moves on the skin: a swing about its place on the bone, in the bone's axes.
struct VSkinSway
{
  D3 Amplitude; ///< mm
  double Sine = 0, Cosine = 1;
};

/// The bones of a body and the places of markers on them. With a joint state of zeros it stands straight on the origin,
/// arms hanging, and looks along x.
class VWalkerBody
{
public:
  enum class EDetail
  {
    Plain, ///< the bones of `EBone`
    Full   ///< the spine in two, with the pelvis's sides, heels and fingertips
  };
  explicit VWalkerBody( const VBodyShape& i_rShape, EDetail i_Detail = EDetail::Plain );

  /// Without number and name.
  const CoreMoxelTypes::VSubject& Subject() const { return m_Subject; }
  const ComputeSubject::VComputeSubjectFK& Tree() const { return *m_pTree; }
  const VBodyShape& Shape() const { return m_Shape; }
  /// Where the bones are with a state of zeros, by segment.
  std::span< const VFrame > Neutral() const { return m_Neutral; }
  /// The segment of each bone.
  const std::array< std::uint32_t, EBones >& Places() const { return m_Places; }
  const std::array< VSkinSway, WalkerMarkers >& Sways() const { return m_Sways; }
  /// A plain body's joint state as one of this body.
  void TakeState( const VWalkerState& i_rState, std::span< double > o_State ) const;

private:
  friend class VBodyBuilder;

  VBodyShape m_Shape;
  CoreMoxelTypes::VSubject m_Subject;
  std::vector< VFrame > m_Neutral;
  std::array< std::uint32_t, EBones > m_Places{};
  std::int32_t m_SecondSpine = -1;
  std::array< VSkinSway, WalkerMarkers > m_Sways;
  std::unique_ptr< ComputeSubject::VComputeSubjectFK > m_pTree;
};

} // namespace HostSources::Simulation

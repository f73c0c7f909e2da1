#pragma once

#include <ComputeSubjectFK/IJointFK.h>

namespace ComputeSubject
{

enum class ETargetKind : std::uint32_t
{
  LocalPointToWorldPoint,
  LocalLineToWorldPoint,
  LocalPlaneToWorldPoint,
  RigidBody,
  LocalRotationToWorldRotation,
  LocalDirectionToWorldDirection,
  BadTargetKind
};

/// A point in mm, a direction of length 1 and a rotation row by row; a target uses those that its kind has.
struct VTargetPose
{
  double Point[3] = {};
  double Direction[3] = { 0, 0, 1 };
  double Rotation[9] = { 1, 0, 0, 0, 1, 0, 0, 0, 1 };
};

/// What a target is made from.
struct VTargetRecord
{
  ETargetKind Kind = ETargetKind::BadTargetKind;
  std::size_t Segment = 0;
  std::size_t Marker = 0; ///< which of the positions it predicts; those on a point only
  double Weight = 1;
  VTargetPose Local; ///< fixed to the segment; a line goes through the point along the direction, a plane is normal
  VTargetPose Goal;  ///< where it should be in the world
};

/// Something fixed to a segment that should be somewhere in the world. Residuals carry the weight.
class ITargetFK
{
public:
  virtual ~ITargetFK() = default;
  virtual ETargetKind TargetKind() const = 0;
  virtual std::size_t ResidualCount() const = 0;
  virtual std::size_t SegmentIndex() const = 0;
  virtual std::size_t MarkerIdx() const = 0;
  /// `i_rWorld` is the pose of the segment in the world.
  virtual void Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const = 0;
  /// As the segment turns about the world's origin by `i_Angular` and moves by `i_LinearAtOrigin`.
  virtual void Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3], const double i_LinearAtOrigin[3],
                           double* o_pDerivative ) const = 0;
  virtual std::unique_ptr< ITargetFK > Clone() const = 0;
  virtual const VTargetPose& Local() const = 0;
  /// Changes where it should be, in every frame. Not checked: residuals of nonsense are nonsense.
  virtual void SetGoal( const VTargetPose& i_rGoal ) = 0;
};

/// Makes targets of one kind. Thread: any.
class ITargetFKFactory
{
public:
  virtual ~ITargetFKFactory() = default;
  virtual ETargetKind TargetKind() const = 0;
  /// Throws `VConstructionException` for a record of another kind (`InvalidType`), for numbers that are not finite, for
  /// directions and rotations off by more than 1e-6 and for a negative weight (`InvalidValue`).
  virtual std::unique_ptr< ITargetFK > Create( const VTargetRecord& i_rRecord ) const = 0;
};

/// Throws `VConstructionException` (`InvalidType`) for `BadTargetKind` and numbers beyond.
const ITargetFKFactory& FindTargetFactory( ETargetKind i_Kind );

} // namespace ComputeSubject

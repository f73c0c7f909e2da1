#pragma once

#include <ComputeSubjectFK/ITargetFK.h>

namespace ComputeSubject
{

/// What the targets have in common.
template < typename TTarget, ETargetKind KindOfTarget, std::size_t Rows >
class VTargetFK : public ITargetFK
{
public:
  static constexpr ETargetKind Kind = KindOfTarget;

  explicit VTargetFK( const VTargetRecord& i_rRecord )
    : m_Record( i_rRecord )
  {
  }
  ETargetKind TargetKind() const final { return Kind; }
  std::size_t ResidualCount() const final { return Rows; }
  std::size_t SegmentIndex() const final { return m_Record.Segment; }
  std::size_t MarkerIdx() const final { return m_Record.Marker; }
  std::unique_ptr< ITargetFK > Clone() const final
  {
    return std::make_unique< TTarget >( static_cast< const TTarget& >( *this ) );
  }
  const VTargetPose& Local() const final { return m_Record.Local; }
  void SetGoal( const VTargetPose& i_rGoal ) final { m_Record.Goal = i_rGoal; }

protected:
  const VTargetPose& Goal() const { return m_Record.Goal; }
  double Weight() const { return m_Record.Weight; }

private:
  VTargetRecord m_Record;
};

/// Three rows: the point less its goal.
class VTargetFKLocalPointToWorldPoint final
  : public VTargetFK< VTargetFKLocalPointToWorldPoint, ETargetKind::LocalPointToWorldPoint, 3 >
{
public:
  using VTargetFK::VTargetFK;
  void Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const override;
  void Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3], const double i_LinearAtOrigin[3],
                   double* o_pDerivative ) const override;
};

/// Three rows: the shortest way from the goal point to the line.
class VTargetFKLocalLineToWorldPoint final
  : public VTargetFK< VTargetFKLocalLineToWorldPoint, ETargetKind::LocalLineToWorldPoint, 3 >
{
public:
  using VTargetFK::VTargetFK;
  void Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const override;
  void Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3], const double i_LinearAtOrigin[3],
                   double* o_pDerivative ) const override;
};

/// One row: how far the goal point is above the plane.
class VTargetFKLocalPlaneToWorldPoint final
  : public VTargetFK< VTargetFKLocalPlaneToWorldPoint, ETargetKind::LocalPlaneToWorldPoint, 1 >
{
public:
  using VTargetFK::VTargetFK;
  void Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const override;
  void Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3], const double i_LinearAtOrigin[3],
                   double* o_pDerivative ) const override;
};

/// Six rows: the point less its goal, then the rotation vector from the goal rotation.
class VTargetFKRigidBody final : public VTargetFK< VTargetFKRigidBody, ETargetKind::RigidBody, 6 >
{
public:
  using VTargetFK::VTargetFK;
  void Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const override;
  void Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3], const double i_LinearAtOrigin[3],
                   double* o_pDerivative ) const override;
};

/// Three rows: the rotation vector from the goal rotation, of a length in [0, pi].
class VTargetFKLocalRotationToWorldRotation final
  : public VTargetFK< VTargetFKLocalRotationToWorldRotation, ETargetKind::LocalRotationToWorldRotation, 3 >
{
public:
  using VTargetFK::VTargetFK;
  void Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const override;
  void Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3], const double i_LinearAtOrigin[3],
                   double* o_pDerivative ) const override;
};

/// Three rows: the direction less its goal.
class VTargetFKLocalDirectionToWorldDirection final
  : public VTargetFK< VTargetFKLocalDirectionToWorldDirection, ETargetKind::LocalDirectionToWorldDirection, 3 >
{
public:
  using VTargetFK::VTargetFK;
  void Residual( const VRigidTransform& i_rWorld, double* o_pResidual ) const override;
  void Derivative( const VRigidTransform& i_rWorld, const double i_Angular[3], const double i_LinearAtOrigin[3],
                   double* o_pDerivative ) const override;
};

/// Throws `VConstructionException` unless a target of kind `i_Kind` can be made from the record.
void CheckTargetRecord( const VTargetRecord& i_rRecord, ETargetKind i_Kind );

template < class TTarget >
class VTargetFKFactory final : public ITargetFKFactory
{
public:
  ETargetKind TargetKind() const override { return TTarget::Kind; }
  std::unique_ptr< ITargetFK > Create( const VTargetRecord& i_rRecord ) const override
  {
    CheckTargetRecord( i_rRecord, TTarget::Kind );
    return std::make_unique< TTarget >( i_rRecord );
  }
};

} // namespace ComputeSubject

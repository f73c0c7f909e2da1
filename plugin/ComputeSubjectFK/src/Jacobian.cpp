#include <ComputeSubjectFK/VComputeSubjectFK.h>

#include "RotationVector.h"

namespace ComputeSubject
{
namespace
{
constexpr std::size_t MostRows = 6;

/// The turn and the shift of the world's origin that an axis gives.
struct VTwist
{
  double Angular[3], LinearAtOrigin[3];

  explicit VTwist( const VJointAxis& i_rAxis )
  {
    Cross( i_rAxis.Origin, i_rAxis.Angular, LinearAtOrigin );
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      Angular[Axis] = i_rAxis.Angular[Axis];
      LinearAtOrigin[Axis] += i_rAxis.Linear[Axis];
    }
  }
};
} // namespace

void VComputeSubjectFK::Residuals( std::vector< double >& o_rResiduals ) const
{
  o_rResiduals.resize( m_ResidualCount );
  double* pRow = o_rResiduals.data();
  for ( const auto& pTarget : m_Targets )
  {
    pTarget->Residual( WorldTransforms()[pTarget->SegmentIndex()], pRow );
    pRow += pTarget->ResidualCount();
  }
}

void VComputeSubjectFK::Jacobian( std::vector< double >& o_rRowMajor ) const
{
  const std::size_t Columns = m_State.size();
  o_rRowMajor.assign( m_ResidualCount * Columns, 0.0 );
  std::vector< VJointAxis > Axes( Columns + 1 );
  for ( std::size_t Segment = 0; Segment < m_SegmentTree.size(); ++Segment )
  {
    const IJointFK& rJoint = m_SegmentTree[Segment]->Joint();
    const std::size_t Parent = m_Parents[Segment];
    const VRigidTransform Fixed =
        Parent == NoParent ? rJoint.PreTransform() : WorldTransforms()[Parent] * rJoint.PreTransform();
    rJoint.ComputeAxes( Fixed, Axes.data() + m_FirstDegrees[Segment] );
  }
  std::size_t FirstRow = 0;
  for ( const auto& pTarget : m_Targets )
  {
    const VRigidTransform& rWorld = WorldTransforms()[pTarget->SegmentIndex()];
    const std::size_t Rows = pTarget->ResidualCount();
    for ( std::size_t Segment = pTarget->SegmentIndex(); Segment != NoParent; Segment = m_Parents[Segment] )
    {
      const std::size_t First = m_FirstDegrees[Segment];
      const std::size_t Degrees = m_SegmentTree[Segment]->Joint().DegreesOfFreedom();
      for ( std::size_t Column = First; Column < First + Degrees; ++Column )
      {
        const VTwist Twist( Axes[Column] );
        double Derivative[MostRows];
        pTarget->Derivative( rWorld, Twist.Angular, Twist.LinearAtOrigin, Derivative );
        for ( std::size_t Row = 0; Row < Rows; ++Row )
        {
          o_rRowMajor[( FirstRow + Row ) * Columns + Column] = Derivative[Row];
        }
      }
    }
    FirstRow += Rows;
  }
}

} // namespace ComputeSubject

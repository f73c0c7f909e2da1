#include <ComputeSubjectFK/VComputeSegmentFK.h>

#include <cassert>

namespace ComputeSubject
{

VComputeSegmentFK::VComputeSegmentFK( std::shared_ptr< const VComputeSegmentFK > i_pParent,
                                      std::unique_ptr< IJointFK > i_pJoint )
  : m_pParent( std::move( i_pParent ) )
  , m_Depth( m_pParent ? m_pParent->TreeDepth() + 1 : 1 )
  , m_pJoint( std::move( i_pJoint ) )
{
  if ( !m_pJoint )
  {
    throw VConstructionException( "A segment needs a joint.", ZEK::IResult::InvalidPointer );
  }
  m_Result = FixedTransform() * JointTransform();
}

void VComputeSegmentFK::LoadState( ConstStateIterator& io_rState )
{
  m_pJoint->LoadState( io_rState );
  m_Result = FixedTransform() * JointTransform();
  m_pViewed = nullptr;
}

VRigidTransform VComputeSegmentFK::FixedTransform() const
{
  return m_pParent ? m_pParent->WorldTransform() * m_pJoint->PreTransform() : m_pJoint->PreTransform();
}

VRigidTransform VComputeSegmentFK::JointTransform() const
{
  VRigidTransform Moving;
  m_pJoint->ComputeTransform( Moving );
  return Moving;
}

const VRigidTransform& VComputeSegmentFK::Transform() const
{
  return m_pViewed ? *m_pViewed : m_Result;
}

VRigidTransform VComputeSegmentFK::WorldTransform() const
{
  return Transform() * m_pJoint->PostTransform();
}

std::shared_ptr< VComputeSegmentFK >
VComputeSegmentFK::CloneOn( std::shared_ptr< const VComputeSegmentFK > i_pParent ) const
{
  auto pCloneFK = std::make_shared< VComputeSegmentFK >( i_pParent, m_pJoint->Clone() );
  assert( pCloneFK->m_pJoint );
  assert( i_pParent ? pCloneFK->m_Depth == i_pParent->TreeDepth() + 1 : pCloneFK->m_Depth == 1 );
  return pCloneFK;
}

void VComputeSegmentFK::View( const double* i_pState, const VRigidTransform* i_pResult )
{
  m_pJoint->ViewState( i_pState );
  m_pViewed = i_pResult;
}

} // namespace ComputeSubject

#include <ComputeSubjectFK/VComputeSubjectFK.h>

#include "VPosePlan.h"

#include <cassert>
#include <cmath>
#include <limits>
#include <unordered_map>

namespace ComputeSubject
{

VComputeSubjectFK::VComputeSubjectFK()
  : m_pPlan( std::make_unique< VPosePlan >() )
{
}

VComputeSubjectFK::~VComputeSubjectFK()
{
  // Leaves first: a chain that lets go of its parents one inside the other needs as much stack as it is deep.
  while ( !m_SegmentTree.empty() )
  {
    m_SegmentTree.pop_back();
  }
}

std::size_t VComputeSubjectFK::AddSegment( std::size_t i_Parent, const VJointRecord& i_rJoint )
{
  const std::size_t Index = m_SegmentTree.size();
  if ( i_Parent != NoParent && i_Parent >= Index )
  {
    throw VConstructionException( std::string( "Segment " )
                                      .append( std::to_string( Index ) )
                                      .append( " has a parent that does not stand before it." ),
                                  ZEK::IResult::InvalidIndex );
  }
  std::unique_ptr< IJointFK > pJoint = FindJointFactory( i_rJoint.m_Type ).Create( i_rJoint );
  std::shared_ptr< VComputeSegmentFK > pParent;
  if ( i_Parent != NoParent )
  {
    pParent = m_SegmentTree[i_Parent];
  }
  Append( i_Parent, std::make_shared< VComputeSegmentFK >( std::move( pParent ), std::move( pJoint ) ) );
  return Index;
}

void VComputeSubjectFK::Append( std::size_t i_Parent, std::shared_ptr< VComputeSegmentFK > i_pSegment )
{
  const IJointFK& rJoint = i_pSegment->Joint();
  const std::size_t Index = m_SegmentTree.size(), First = m_State.size();
  const bool bRoot = i_Parent == NoParent;
  const VRigidTransform Fixed =
      bRoot ? rJoint.PreTransform() : m_SegmentTree[i_Parent]->Joint().PostTransform() * rJoint.PreTransform();
  m_State.resize( First + rJoint.DegreesOfFreedom() );
  auto State = m_State.begin() + static_cast< std::ptrdiff_t >( First );
  rJoint.CopyState( State );
  m_Results.push_back( i_pSegment->Transform() );
  m_Worlds.push_back( i_pSegment->WorldTransform() );
  m_Parents.push_back( i_Parent );
  m_FirstDegrees.push_back( First );
  m_SegmentTree.push_back( std::move( i_pSegment ) );
  m_pPlan->Append( rJoint.JointType(), bRoot ? -1 : static_cast< std::int32_t >( i_Parent ),
                   static_cast< std::uint32_t >( First ), Fixed, rJoint.PostTransform() );
  if ( !m_bPosts && m_pPlan->HasPosts() )
  {
    m_bPosts = true;
    m_pPlan->ApplyPosts( m_Results.data(), m_Worlds.data() );
  }
  // The arrays may have moved.
  const bool bMoved = m_pViewedState != m_State.data() || m_pViewedResults != m_Results.data();
  for ( std::size_t Segment = bMoved ? 0 : Index; Segment <= Index; ++Segment )
  {
    m_SegmentTree[Segment]->View( m_State.data() + m_FirstDegrees[Segment], &m_Results[Segment] );
  }
  m_pViewedState = m_State.data();
  m_pViewedResults = m_Results.data();
}

void VComputeSubjectFK::AddTarget( std::unique_ptr< ITargetFK > i_pTarget )
{
  if ( !i_pTarget )
  {
    throw VConstructionException( "There is no target.", ZEK::IResult::InvalidPointer );
  }
  if ( i_pTarget->SegmentIndex() >= m_SegmentTree.size() )
  {
    throw VConstructionException( "The target is on a segment that is not there.", ZEK::IResult::InvalidIndex );
  }
  m_ResidualCount += i_pTarget->ResidualCount();
  m_Targets.push_back( std::move( i_pTarget ) );
}

ZEK::IResult VComputeSubjectFK::LoadState( std::span< const double > i_State )
{
  if ( i_State.size() != m_State.size() )
  {
    return ZEK::IResult::InvalidArgument;
  }
  // Nothing times a number that is none is none.
  double Nothing[4] = {};
  std::size_t Index = 0;
  for ( ; Index + 4 <= i_State.size(); Index += 4 )
  {
    for ( std::size_t Lane = 0; Lane < 4; ++Lane )
    {
      const double Value = i_State[Index + Lane];
      m_State[Index + Lane] = Value;
      Nothing[Lane] += 0 * Value;
    }
  }
  for ( ; Index < i_State.size(); ++Index )
  {
    m_State[Index] = i_State[Index];
    Nothing[0] += 0 * i_State[Index];
  }
  m_pPlan->Pose( m_State.data(), m_Results.data() );
  if ( m_bPosts )
  {
    m_pPlan->ApplyPosts( m_Results.data(), m_Worlds.data() );
  }
  const bool bFinite = Nothing[0] + Nothing[1] + Nothing[2] + Nothing[3] == 0;
  return bFinite ? ZEK::IResult::Ok : ZEK::IResult::OkButPartial;
}

void VComputeSubjectFK::CopyState( std::vector< double >& o_rState ) const
{
  o_rState.resize( m_State.size() );
  StateIterator StateIter = o_rState.begin();
  for ( const auto& pSegment : m_SegmentTree )
  {
    pSegment->Joint().CopyState( StateIter );
  }
  assert( StateIter == o_rState.end() );
}

ZEK::IResult VComputeSubjectFK::NormaliseState( std::vector< double >& io_rState ) const
{
  if ( io_rState.size() != m_State.size() )
  {
    return ZEK::IResult::InvalidArgument;
  }
  StateIterator StateIter = io_rState.begin();
  for ( const auto& pSegment : m_SegmentTree )
  {
    pSegment->Joint().NormaliseState( StateIter );
  }
  assert( StateIter == io_rState.end() );
  return {};
}

ZEK::IResult VComputeSubjectFK::Pose( std::span< const double > i_States, std::size_t i_Count,
                                      std::span< VRigidTransform > o_Poses ) const
{
  const std::size_t Size = m_State.size(), Segments = m_SegmentTree.size();
  const auto Matches = [&]( std::size_t i_Numbers, std::size_t i_Each )
  {
    return i_Each == 0 ? i_Numbers == 0 : i_Numbers % i_Each == 0 && i_Numbers / i_Each == i_Count;
  };
  if ( !Matches( i_States.size(), Size ) || !Matches( o_Poses.size(), Segments ) )
  {
    return ZEK::IResult::InvalidArgument;
  }
  for ( std::size_t Index = 0; Index < i_Count && Segments > 0; ++Index )
  {
    VRigidTransform* pPoses = o_Poses.data() + Index * Segments;
    m_pPlan->Pose( i_States.data() + Index * Size, pPoses );
    if ( m_bPosts )
    {
      m_pPlan->ApplyPosts( pPoses, pPoses );
    }
  }
  return {};
}

ZEK::IResult VComputeSubjectFK::Positions( std::vector< std::array< double, 3 > >& io_rPositions ) const
{
  ZEK::IResult Result;
  for ( const auto& pTarget : m_Targets )
  {
    if ( pTarget->TargetKind() != ETargetKind::LocalPointToWorldPoint )
    {
      continue;
    }
    if ( pTarget->MarkerIdx() >= io_rPositions.size() )
    {
      Result = ZEK::IResult::OkButPartial;
      continue;
    }
    WorldTransforms()[pTarget->SegmentIndex()].Place( pTarget->Local().Point,
                                                      io_rPositions[pTarget->MarkerIdx()].data() );
  }
  return Result;
}

std::unique_ptr< VComputeSubjectFK > VComputeSubjectFK::Clone() const
{
  auto pClone = std::make_unique< VComputeSubjectFK >();
  std::unordered_map< const VComputeSegmentFK*, std::shared_ptr< VComputeSegmentFK > > OldToNewSegmentMap;
  for ( std::size_t Index = 0; Index < m_SegmentTree.size(); ++Index )
  {
    const VComputeSegmentFK& rOld = *m_SegmentTree[Index];
    std::shared_ptr< VComputeSegmentFK > pParent;
    if ( rOld.Parent() )
    {
      const auto Found = OldToNewSegmentMap.find( rOld.Parent().get() );
      assert( Found != OldToNewSegmentMap.end() );
      pParent = Found->second;
    }
    auto pCloneFK = rOld.CloneOn( std::move( pParent ) );
    OldToNewSegmentMap.emplace( &rOld, pCloneFK );
    pClone->Append( m_Parents[Index], std::move( pCloneFK ) );
  }
  // To the last bit, which the products above need not have.
  pClone->m_Results = m_Results;
  pClone->m_Worlds = m_Worlds;
  for ( const auto& pTarget : m_Targets )
  {
    pClone->AddTarget( pTarget->Clone() );
  }
  // The map's deep chains go leaves first as well.
  OldToNewSegmentMap.clear();
  return pClone;
}

} // namespace ComputeSubject

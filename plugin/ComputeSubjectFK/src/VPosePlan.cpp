#include "VPosePlan.h"

namespace ComputeSubject
{
namespace
{
EPoseKind KindOf( EJointType i_Type )
{
  switch ( i_Type )
  {
  case EJointType::Free:
    return EPoseFree;
  case EJointType::Ball:
    return EPoseBall;
  case EJointType::HardySpicer:
    return EPoseHardySpicer;
  case EJointType::Hinge:
    return EPoseHinge;
  case EJointType::Slider:
    return EPoseSlider;
  default:
    return EPoseKinds;
  }
}

void FillLane( VPoseBlock& o_rBlock, std::size_t i_Lane, const VRigidTransform& i_rFixed, std::uint32_t i_State,
               std::uint32_t i_Segment )
{
  for ( std::size_t Index = 0; Index < 9; ++Index )
  {
    o_rBlock.Fixed[Index][i_Lane] = i_rFixed.m_Rotation[Index];
  }
  for ( std::size_t Index = 0; Index < 3; ++Index )
  {
    o_rBlock.Fixed[9 + Index][i_Lane] = i_rFixed.m_Translation[Index];
  }
  o_rBlock.State[i_Lane] = i_State;
  o_rBlock.Segment[i_Lane] = i_Segment;
}
} // namespace

void VPosePlan::Append( EJointType i_Type, std::int32_t i_Parent, std::uint32_t i_State,
                        const VRigidTransform& i_rFixed, const VRigidTransform& i_rPost )
{
  const auto Segment = static_cast< std::uint32_t >( m_Parents.size() );
  const EPoseKind Kind = KindOf( i_Type );
  if ( Kind == EPoseKinds )
  {
    VPoseStill Still{};
    for ( std::size_t Row = 0; Row < 3; ++Row )
    {
      std::copy_n( i_rFixed.m_Rotation + 3 * Row, 3, Still.Rows + 4 * Row );
      Still.Rows[4 * Row + 3] = i_rFixed.m_Translation[Row];
    }
    Still.Segment = Segment;
    m_Stills.push_back( Still );
  }
  else
  {
    const std::size_t Lane = m_Counts[Kind]++ % PoseLanes;
    if ( Lane == 0 )
    {
      m_Blocks[Kind].emplace_back();
    }
    for ( std::size_t Other = Lane; Other < ( Lane == 0 ? PoseLanes : Lane + 1 ); ++Other )
    {
      FillLane( m_Blocks[Kind].back(), Other, i_rFixed, i_State, Segment );
    }
  }
  if ( !( i_rPost == VRigidTransform::Identity() ) )
  {
    m_Posts.push_back( { Segment, i_rPost } );
  }
  m_Parents.push_back( i_Parent );
}

VPoseTree VPosePlan::Tree() const
{
  VPoseTree Result{};
  for ( std::size_t Kind = 0; Kind < EPoseKinds; ++Kind )
  {
    Result.pBlocks[Kind] = m_Blocks[Kind].data();
    Result.BlockCounts[Kind] = static_cast< std::uint32_t >( m_Blocks[Kind].size() );
  }
  Result.pStills = m_Stills.data();
  Result.StillCount = static_cast< std::uint32_t >( m_Stills.size() );
  Result.pParents = m_Parents.data();
  Result.SegmentCount = static_cast< std::uint32_t >( m_Parents.size() );
  return Result;
}

void VPosePlan::Pose( const double* i_pState, VRigidTransform* o_pResults ) const
{
  static const VPoseFunction Best = BestPose();
  if ( !m_Parents.empty() )
  {
    Best( Tree(), i_pState, o_pResults->m_Rotation );
  }
}

void VPosePlan::ApplyPosts( const VRigidTransform* i_pResults, VRigidTransform* o_pWorlds ) const
{
  if ( i_pResults != o_pWorlds )
  {
    std::copy_n( i_pResults, m_Parents.size(), o_pWorlds );
  }
  for ( const VPost& rPost : m_Posts )
  {
    o_pWorlds[rPost.Segment] = o_pWorlds[rPost.Segment] * rPost.Transform;
  }
}

bool HasAvx2()
{
  return __builtin_cpu_supports( "avx2" ) && __builtin_cpu_supports( "fma" );
}

VPoseFunction BestPose()
{
  return HasAvx2() ? PoseAvx2 : PoseBaseline;
}

} // namespace ComputeSubject

#include "RecordingSkeletons.h"

#include <CoreMoxelTypes/FlowTypes.h>

namespace HostSources
{
using namespace CoreMoxelTypes;

namespace
{
constexpr u32 BoneColour = 0xFFC8C8C8u;

template < typename TFlow, typename TFill >
ZEK::IResult MakeNamed( const VStateMaker& i_rMaker, const std::string& i_rName, ZEK::VFlowItemRef& o_rItem,
                        TFill&& i_rFill )
{
  ZEK::IResult Result;
  if ( auto* pValue = MakeItem< TFlow >( i_rMaker, o_rItem, Result ) )
  {
    i_rFill( *pValue );
    o_rItem->MutableValue().SetName( ZEK::EFlowNameObject, i_rName );
  }
  return Result;
}
} // namespace

VRecordingSkeletons::VRecordingSkeletons( const VRecording& i_rRecording, std::uint32_t i_FirstId )
{
  for ( const VRecordingSkeleton& rSkeleton : i_rRecording.Skeletons )
  {
    VPlayed Played;
    Played.pSkeleton = &rSkeleton;
    Played.Id = i_FirstId++;
    std::string Ignored; // the joint state is shown even where the bones cannot be
    (void)ComputeSubject::VComputeSubjectFK::Build( rSkeleton.Subject, Played.pSubject, Ignored );
    m_Played.push_back( std::move( Played ) );
  }
}

ZEK::IResult VRecordingSkeletons::MakeSlowItems( const VStateMaker& i_rMaker,
                                                 std::vector< ZEK::VFlowItemRef >& io_rSlow )
{
  ZEK::IResult Result;
  for ( VPlayed& rPlayed : m_Played )
  {
    rPlayed.Item.Reset();
    rPlayed.Of = -1;
    VSubject Subject = rPlayed.pSkeleton->Subject;
    Subject.Id = rPlayed.Id;
    ZEK::VFlowItemRef Items[3];
    Result = MakeNamed< FlowSubject >( i_rMaker, Subject.Name, Items[0],
                                       [&]( VSubject& o_rValue )
                                       {
                                         o_rValue = Subject;
                                       } );
    Result = Result.IsError() ? Result
                              : MakeNamed< FlowSubjectApplicationData >( i_rMaker, Subject.Name, Items[1],
                                                                         [&]( VSubjectApplicationData& o_rValue )
                                                                         {
                                                                           o_rValue.SegmentColours.assign(
                                                                               Subject.Segments.size(), BoneColour );
                                                                         } );
    // The neutral pose and the first one, for views of the structure alone.
    Result = Result.IsError() ? Result
                              : MakeNamed< FlowSubjectParametrised >(
                                    i_rMaker, Subject.Name, Items[2],
                                    [&]( VSubjectParametrised& o_rValue )
                                    {
                                      const auto First = rPlayed.pSkeleton->State( 0 );
                                      o_rValue.Base = Subject;
                                      o_rValue.Poses = { std::vector< f64 >( First.size() ),
                                                         std::vector< f64 >( First.begin(), First.end() ) };
                                      o_rValue.PoseNames = { "Neutral", "First frame" };
                                    } );
    if ( Result.IsError() )
    {
      return Result;
    }
    io_rSlow.insert( io_rSlow.end(), std::begin( Items ), std::end( Items ) );
  }
  return Result;
}

ZEK::IResult VRecordingSkeletons::MakeFastItems( const VStateMaker& i_rMaker, std::int64_t i_Index )
{
  for ( VPlayed& rPlayed : m_Played )
  {
    const auto State = rPlayed.pSkeleton->State( i_Index );
    if ( rPlayed.Of >= 0 && SameBits( rPlayed.pSkeleton->State( rPlayed.Of ), State ) )
    {
      continue;
    }
    const auto Fill = [&]( VSubjectDynamicParameters& o_rValue )
    {
      o_rValue.JointState.assign( State.begin(), State.end() );
      if ( rPlayed.pSubject && rPlayed.pSubject->LoadState( State ).IsOk() )
      {
        for ( const ComputeSubject::VRigidTransform& rPose : rPlayed.pSubject->WorldTransforms() )
        {
          o_rValue.Segments.push_back( rPose.ToRigid() );
        }
        o_rValue.SegmentHealth.assign( o_rValue.Segments.size(), 1 );
      }
    };
    const ZEK::IResult Result =
        MakeNamed< FlowSubjectDynamicParameters >( i_rMaker, rPlayed.pSkeleton->Subject.Name, rPlayed.Item, Fill );
    rPlayed.Of = Result.IsOk() ? i_Index : -1;
    if ( Result.IsError() )
    {
      return Result;
    }
  }
  return {};
}

void VRecordingSkeletons::AddItems( ZEK::IFlowState& io_rState ) const
{
  for ( const VPlayed& rPlayed : m_Played )
  {
    io_rState.AddItem( rPlayed.Item );
  }
}

} // namespace HostSources

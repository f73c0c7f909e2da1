#include "RecordingSkeletons.h"

#include "RecordingSubjects.h"

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

/// From a world whose y is up into one whose z is.
Rigid TurnedUp( const Rigid& i_rRigid )
{
  using ComputeSubject::VRigidTransform;
  VRigidTransform Turn; // by 90 degrees about x
  Turn.m_Rotation[0] = 1;
  Turn.m_Rotation[5] = -1;
  Turn.m_Rotation[7] = 1;
  return ( Turn * VRigidTransform::From( i_rRigid ) ).ToRigid();
}

void FillMarkerColours( const VSubject& i_rSubject, VSubjectApplicationData& o_rLook )
{
  for ( std::size_t Index = 0; Index < i_rSubject.Markers.size(); ++Index )
  {
    o_rLook.MarkerColours.push_back( MarkerColour( i_rSubject.Id - 1, Index ) );
  }
}

/// Where the pose has the model's markers.
void FillMarkers( const ComputeSubject::VComputeSubjectFK& i_rSubject, std::size_t i_Count,
                  VSubjectDynamicParameters& o_rMoves )
{
  constexpr double None = std::numeric_limits< double >::quiet_NaN();
  std::vector< std::array< double, 3 > > Places( i_Count, { None, None, None } );
  (void)i_rSubject.Positions( Places ); // those past the end are on no segment
  for ( const auto& rPlace : Places )
  {
    o_rMoves.MarkerPositions.push_back( { rPlace[0], rPlace[1], rPlace[2] } );
  }
  o_rMoves.MarkerVisible.assign( i_Count, 1 );
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
    ZEK::VFlowItemRef Items[2];
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
                                                                           FillMarkerColours( Subject, o_rValue );
                                                                         } );
    if ( Result.IsError() )
    {
      return Result;
    }
    io_rSlow.insert( io_rSlow.end(), std::begin( Items ), std::end( Items ) );
  }
  return Result;
}

ZEK::IResult VRecordingSkeletons::MakePoses( const VStateMaker& i_rMaker, EUpAxis i_Up )
{
  ZEK::IResult Result;
  for ( VPlayed& rPlayed : m_Played )
  {
    const VRecordingSkeleton& rSkeleton = *rPlayed.pSkeleton;
    // The neutral pose and the first one.
    const auto Fill = [&]( VSubjectParametrised& o_rValue )
    {
      const auto First = rSkeleton.State( 0 );
      o_rValue.Base = rSkeleton.Subject;
      o_rValue.Base.Id = rPlayed.Id;
      for ( VSegment& rSegment : o_rValue.Base.Segments )
      {
        if ( i_Up == EUpAxis::Y && rSegment.Parent < 0 )
        {
          rSegment.Pre = TurnedUp( rSegment.Pre );
        }
      }
      o_rValue.Poses = { std::vector< f64 >( First.size() ), std::vector< f64 >( First.begin(), First.end() ) };
      o_rValue.PoseNames = { "Neutral", "First frame" };
    };
    Result = MakeNamed< FlowSubjectParametrised >( i_rMaker, rSkeleton.Subject.Name, rPlayed.Poses, Fill );
    if ( Result.IsError() )
    {
      return Result;
    }
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
        FillMarkers( *rPlayed.pSubject, rPlayed.pSkeleton->Subject.Markers.size(), o_rValue );
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

void VRecordingSkeletons::AddItems( const ZEK::VFlowTimeKey& i_rSlowKey, ZEK::IFlowState& io_rState ) const
{
  for ( const VPlayed& rPlayed : m_Played )
  {
    io_rState.AddItemAt( rPlayed.Poses, i_rSlowKey );
    io_rState.AddItem( rPlayed.Item );
  }
}

} // namespace HostSources

#include <Flow2Graphics/VFlowSubjectSceneTransform.h>

#include "StateUpAxis.h"
#include "SubjectPosing.h"

#include <Flow2Graphics/IFlowRenderType.h>
#include <ZEK/Log.h>

#include <algorithm>
#include <array>
#include <charconv>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;

/// What of a live state reaches the view.
constexpr std::array< std::uint32_t, 9 > PassedTags{
    ZEK::FlowTag< FlowWorldAxis >,
    ZEK::FlowTag< FlowSubject >,
    ZEK::FlowTag< FlowSubjectForSolving >,
    ZEK::FlowTag< FlowSubjectParametrised >,
    ZEK::FlowTag< FlowSubjectParametrisedForSolving >,
    ZEK::FlowTag< FlowSubjectApplicationData >,
    ZEK::FlowTag< FlowSubjectApplicationDataForSolving >,
    ZEK::FlowTag< FlowSubjectSettings >,
    ZEK::FlowTag< FlowSmartObject >,
};

ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "SubjectScene" );
  return rCategory;
}

std::int32_t ReadIndex( const ZEK::VFlowParameterMap& i_rParameters, const char* i_pKey, std::int32_t i_Default )
{
  const auto It = i_rParameters.find( i_pKey );
  const auto* const pText = It != i_rParameters.end() ? std::get_if< std::string >( &It->second ) : nullptr;
  if ( !pText )
  {
    return i_Default;
  }
  constexpr const char* Blanks = " \t";
  const std::size_t First = std::min( pText->find_first_not_of( Blanks ), pText->size() );
  const std::size_t Last = pText->find_last_not_of( Blanks );
  const char* const pEnd = pText->data() + ( Last == std::string::npos ? pText->size() : Last + 1 );
  std::int32_t Index = 0;
  const auto [pStop, Fault] = std::from_chars( pText->data() + First, pEnd, Index );
  return Fault == std::errc() && pStop == pEnd ? Index : i_Default;
}
} // namespace

VFlowSubjectSceneTransform::VFlowSubjectSceneTransform( ZEK::VFlowStoreRef i_Store )
  : m_StoreHandle( std::move( i_Store ) )
  , m_pExtractor( std::make_shared< Flow2TypesUtils::VTaggedCoreTypeExtractor >() )
  , m_pArrangement( std::make_shared< VFlowSubjectSceneArrangement >() )
{
  constexpr auto Optional = Flow2TypesUtils::ETagRequirement::Optional;
  m_pExtractor->AddCache< FlowSubjectParametrised >( Optional );
  m_pExtractor->AddCache< FlowSubjectParametrisedForSolving >( Optional );
  m_pExtractor->AddCache< FlowSubjectSettings >( Optional );
}

VFlowSubjectSceneTransform::~VFlowSubjectSceneTransform() = default;

ZEK::VFlowStateRef& VFlowSubjectSceneTransform::Transform( ZEK::VFlowStateRef& o_rState,
                                                           const ZEK::VFlowStateRef& i_rInput,
                                                           const ZEK::VFlowParameterMap& i_rParameters )
{
  ZEK::VFlowStateRef State;
  const ZEK::IFlowState& rInput = *i_rInput;
  const ZEK::VFlowTimeKey Key = rInput.GetKey();
  const ZEK::IResult Made = rInput.GetFactory()->CreateState( State, Key, rInput.GetInfoA(), rInput.GetInfoB() );
  if ( Made.IsError() )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "The subjects are not shown: %1%", Made.Text() );
    o_rState = nullptr;
    return o_rState;
  }
  State->CopyItems( rInput, PassedTags );
  // The input, which stays as it is, has the same items; the new state is still being built.
  m_pExtractor->Update( rInput, ZEK::EFlowNameObject, ZEK::EFlowTimeMatch::Overlap, Key );

  const std::int32_t Pose = ReadIndex( i_rParameters, "PoseIndex", 0 );
  m_LabellingPose.SetPose( ReadIndex( i_rParameters, "LabellingPoseIndex", Pose ) );
  m_SolvingPose.SetPose( ReadIndex( i_rParameters, "SolvingPoseIndex", Pose ) );

  const bool bYUp = IsYUp( rInput, false );
  const bool bArranged = m_pArrangement->Update( *m_pExtractor );
  ApplyPose< FlowSubjectParametrised, FlowSubjectDynamicParameters >( m_LabellingPose, bYUp, *State );
  ApplyPose< FlowSubjectParametrisedForSolving, FlowSubjectDynamicParametersForSolving >( m_SolvingPose, bYUp, *State );
  if ( bArranged )
  {
    UpdateVolume();
  }
  if ( m_Volume )
  {
    State->AddItem( m_Volume );
  }
  o_rState = std::move( State );
  return o_rState;
}

void VFlowSubjectSceneTransform::VPoseRecord::SetPose( std::int32_t i_Index )
{
  if ( PoseIndex != i_Index )
  {
    PoseIndex = i_Index;
    Sources.clear();
    Posed.clear();
    Places.clear();
  }
}

template < typename TParametrised, typename TDynamics >
void VFlowSubjectSceneTransform::ApplyPose( VPoseRecord& io_rRecord, bool i_bYUp, ZEK::IFlowState& io_rState )
{
  m_pExtractor->Items< TParametrised >( m_Sources );
  TakeSources( io_rRecord );
  m_Sources.clear();
  const bool bTurned = std::exchange( io_rRecord.bYUp, i_bYUp ) != i_bYUp;
  const std::vector< VSubjectPlace >& rPlaces = m_pArrangement->Places();
  for ( std::size_t Slot = 0; Slot < io_rRecord.Sources.size(); ++Slot )
  {
    const ZEK::VFlowItemRef& rSource = io_rRecord.Sources[Slot];
    ZEK::VFlowItemRef& rPosed = io_rRecord.Posed[Slot];
    const bool bMoved = std::exchange( io_rRecord.Places[Slot], rPlaces[Slot] ) != rPlaces[Slot];
    // What could not be posed has no place and is not tried again.
    if ( rSource && ( bTurned || bMoved ) )
    {
      rPosed = Posed( ZEK::FlowValueType< TDynamics >::Descriptor, *rSource, io_rRecord, rPlaces[Slot] );
    }
    if ( rPosed )
    {
      io_rState.AddItem( rPosed );
    }
  }
}

void VFlowSubjectSceneTransform::TakeSources( VPoseRecord& io_rRecord )
{
  const auto IsSame = []( const ZEK::VFlowItemRef& i_rOld, const ZEK::VFlowItemRef& i_rNew )
  {
    return !IsOtherValue( i_rOld, i_rNew );
  };
  if ( std::ranges::equal( io_rRecord.Sources, m_Sources, IsSame ) )
  {
    return;
  }
  // Unlike every place, so that what is new counts as moved.
  constexpr double Nowhere = std::numeric_limits< double >::infinity();
  std::vector< ZEK::VFlowItemRef > Posed( m_Sources.size() );
  std::vector< VSubjectPlace > Places( m_Sources.size(), { Nowhere, Nowhere } );
  for ( std::size_t Slot = 0; Slot < m_Sources.size(); ++Slot )
  {
    const auto Old = std::ranges::find_if( io_rRecord.Sources,
                                           [&]( const ZEK::VFlowItemRef& i_rOld )
                                           {
                                             return i_rOld && IsSame( i_rOld, m_Sources[Slot] );
                                           } );
    if ( Old != io_rRecord.Sources.end() )
    {
      const auto Index = static_cast< std::size_t >( Old - io_rRecord.Sources.begin() );
      Posed[Slot] = io_rRecord.Posed[Index];
      Places[Slot] = io_rRecord.Places[Index];
    }
  }
  io_rRecord.Sources = m_Sources;
  io_rRecord.Posed = std::move( Posed );
  io_rRecord.Places = std::move( Places );
}

ZEK::VFlowItemRef VFlowSubjectSceneTransform::Posed( const ZEK::VFlowItemType& i_rType, const ZEK::IFlowItem& i_rSource,
                                                     const VPoseRecord& i_rRecord, const VSubjectPlace& i_rPlace ) const
{
  const auto* const pSubject = ZEK::FlowPayload< VSubjectParametrised >( &i_rSource );
  std::string_view Name;
  ZEK::IResult Status;
  ZEK::VFlowItemRef Item;
  std::string Message;
  if ( pSubject && i_rSource.Value().GetName( ZEK::EFlowNameObject, Name ) )
  {
    m_StoreHandle->CreateItem( Status, i_rType, Item );
    auto* const pPosed = ZEK::FlowMutablePayload< VSubjectDynamicParameters >( Item.Get() );
    Message = pPosed ? std::string() : Status.Text();
    if ( pPosed && PoseSubject( *pSubject, i_rRecord.PoseIndex, i_rPlace, i_rRecord.bYUp, *pPosed, Message ) )
    {
      Item->MutableValue().SetName( ZEK::EFlowNameObject, Name );
    }
    else
    {
      Item.Reset();
    }
  }
  if ( !Message.empty() )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "A subject cannot be shown as asked: %1%", Message );
  }
  return Item;
}

void VFlowSubjectSceneTransform::UpdateVolume()
{
  ZEK::IResult Status;
  ZEK::VFlowItemRef Item;
  m_StoreHandle->CreateItem( Status, ZEK::FlowValueType< FlowVolumeProperties >::Descriptor, Item );
  auto* const pVolume = ZEK::FlowMutablePayload< VVolumeProperties >( Item.Get() );
  if ( !pVolume )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "The floor of the subjects stays as it was: %1%", Status.Text() );
    return;
  }
  const std::array< std::int32_t, 4 >& rVolume = m_pArrangement->Volume();
  pVolume->XMin = rVolume[0];
  pVolume->YMin = rVolume[1];
  pVolume->XMax = rVolume[2];
  pVolume->YMax = rVolume[3];
  m_Volume = std::move( Item );
}

} // namespace Flow2Graphics

#include <HarrowGraphics/VHarrowSubjectScene.h>

#include <Flow2Graphics/VFlowSubjectSceneTransform.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <algorithm>
#include <array>
#include <cmath>

namespace HarrowGraphics
{
namespace
{
using namespace CoreMoxelTypes;

constexpr std::uint32_t AllItemGroups = 31;
constexpr std::uint32_t NewestState = 2;
constexpr float BoneRadius = 100; // mm, what of a body lies around its bones
constexpr std::array ParametrisedTags{ ZEK::FlowTag< FlowSubjectParametrised >,
                                       ZEK::FlowTag< FlowSubjectParametrisedForSolving > };
constexpr std::array PosedTags{ ZEK::FlowTag< FlowSubjectDynamicParameters >,
                                ZEK::FlowTag< FlowSubjectDynamicParametersForSolving > };

template < typename TVisit >
void VisitItems( const ZEK::IFlowState& i_rState, std::uint32_t i_Tag, TVisit&& i_rVisit )
{
  ZEK::VFlowCursor It, End;
  i_rState.TagBegin( It, i_Tag, ZEK::EFlowTimeMatch::Overlap );
  i_rState.TagEnd( End, i_Tag, ZEK::EFlowTimeMatch::Overlap );
  for ( ; It != End; ++It )
  {
    i_rVisit( *It->pItem );
  }
}

QStringList NamesOfPoses( const VSubjectParametrised& i_rSubject )
{
  QStringList Names;
  for ( std::size_t Pose = 0; Pose < i_rSubject.Poses.size(); ++Pose )
  {
    const QString Name =
        Pose < i_rSubject.PoseNames.size() ? QString::fromStdString( i_rSubject.PoseNames[Pose] ) : QString();
    Names << ( Name.isEmpty() ? QString( "Pose %1" ).arg( Pose ) : Name );
  }
  return Names;
}

QVariantList TagsOf( const ZEK::IFlowState& i_rState )
{
  QVariantList Tags;
  [&]< typename... T >( std::tuple< T*... >* )
  {
    const auto Add = [&]( std::uint32_t i_Tag )
    {
      ZEK::VFlowItemRef First;
      i_rState.FindItem( First, i_Tag, ZEK::EFlowTimeMatch::Overlap );
      if ( First )
      {
        Tags << QString( "0x%1" ).arg( i_Tag, 0, 16 );
      }
    };
    ( Add( ZEK::FlowTag< T > ), ... );
  }( static_cast< VAllFlowTypes* >( nullptr ) );
  return Tags;
}
} // namespace

VHarrowSubjectScene::VHarrowSubjectScene( VHarrowSubjectSceneArguments i_Arguments )
  : VFlowScene( i_Arguments.pRenderResources, i_Arguments.pSelection, i_Arguments.pMeshCache, i_Arguments.pPostal,
                i_Arguments.bDeveloperMode )
  , m_Arguments( std::move( i_Arguments ) )
  , m_pCache( std::make_shared< Flow2StateCache::VFlowStateCacheTransform >() )
{
  const auto pTransform =
      std::make_shared< Flow2Graphics::VFlowSubjectSceneTransform >( m_Arguments.SubjectFlowContext );
  m_pCache->SetSource( m_Arguments.pContext ? m_Arguments.pContext->Cache() : nullptr );
  m_pCache->SetTransform( pTransform );
}

VHarrowSubjectScene::~VHarrowSubjectScene() = default;

void VHarrowSubjectScene::Start()
{
  const auto MarkSelf = [pSelf = QPointer( this )]
  {
    if ( pSelf )
    {
      pSelf->MarkDirty();
    }
  };
  m_pStatesChanged = std::make_unique< ZEK::VDispatchCollapser >( MarkSelf, m_Arguments.pPostal );
  m_Connections.push_back( m_pCache->StatesChanged().Connect( m_pStatesChanged->Callback(), nullptr ) );
  m_Connections.push_back( m_pCache->Notifier6().Connect( m_pStatesChanged->Callback(), nullptr ) );
  if ( m_Arguments.pSelection )
  {
    // The flags of a frame's ids are copies, so the same state is taken again to show a new selection.
    m_pSelectionChanged = m_Arguments.pSelection->ForKinds( {} );
    m_Connections.push_back( m_pSelectionChanged->Connect( MarkSelf, m_Arguments.pPostal ) );
  }
}

void VHarrowSubjectScene::SetPoses( const VSubjectPoses& i_rPoses )
{
  if ( m_Poses == i_rPoses )
  {
    return;
  }
  m_Poses = i_rPoses;
  ZEK::VFlowParameterMap Parameters{ { "PoseIndex", std::to_string( m_Poses.Pose ) } };
  if ( m_Poses.Labelling )
  {
    Parameters["LabellingPoseIndex"] = std::to_string( *m_Poses.Labelling );
  }
  if ( m_Poses.Solving )
  {
    Parameters["SolvingPoseIndex"] = std::to_string( *m_Poses.Solving );
  }
  m_pCache->SetParameters( Parameters );
}

ZEK::VFlowStateRef VHarrowSubjectScene::FetchState()
{
  ZEK::VFlowStateRef State;
  m_pCache->Fetch( State, AllItemGroups, NewestState, 0 );
  if ( State )
  {
    TakeShown( State );
  }
  return State;
}

ZEK::VFlowStateRef VHarrowSubjectScene::Shown() const
{
  const std::lock_guard Lock( m_ShownGuard );
  return m_Shown;
}

void VHarrowSubjectScene::TakeShown( const ZEK::VFlowStateRef& i_rState )
{
  ZEK::VFlowStateRef Before = i_rState; // goes after the lock
  {
    const std::lock_guard Lock( m_ShownGuard );
    std::swap( m_Shown, Before );
  }
  std::size_t Count = 0;
  bool bSame = true;
  for ( const std::uint32_t Tag : ParametrisedTags )
  {
    VisitItems( *i_rState, Tag,
                [&]( const ZEK::IFlowItem& i_rItem )
                {
                  bSame = bSame && Count < m_Parametrised.size() && m_Parametrised[Count] == i_rItem.Id();
                  ++Count;
                } );
  }
  if ( bSame && Count == m_Parametrised.size() )
  {
    return;
  }
  m_Parametrised.clear();
  for ( const std::uint32_t Tag : ParametrisedTags )
  {
    VisitItems( *i_rState, Tag,
                [&]( const ZEK::IFlowItem& i_rItem )
                {
                  m_Parametrised.push_back( i_rItem.Id() );
                } );
  }
  QMetaObject::invokeMethod( this, &VHarrowSubjectScene::ReadNames, Qt::QueuedConnection );
}

void VHarrowSubjectScene::ReadNames()
{
  const ZEK::VFlowStateRef State = Shown();
  QStringList Poses, Subjects;
  for ( const std::uint32_t Tag : ParametrisedTags )
  {
    VisitItems( *State, Tag,
                [&]( const ZEK::IFlowItem& i_rItem )
                {
                  const auto* const pSubject = ZEK::FlowPayload< VSubjectParametrised >( &i_rItem );
                  if ( pSubject && pSubject->Poses.size() > static_cast< std::size_t >( Poses.size() ) )
                  {
                    Poses = NamesOfPoses( *pSubject );
                  }
                } );
  }
  for ( const std::uint32_t Tag : PosedTags )
  {
    VisitItems( *State, Tag,
                [&]( const ZEK::IFlowItem& i_rItem )
                {
                  std::string_view Name;
                  (void)i_rItem.Value().GetName( ZEK::EFlowNameObject, Name );
                  Subjects << QString::fromUtf8( Name.data(), static_cast< qsizetype >( Name.size() ) );
                } );
  }
  Subjects.sort();
  Subjects.removeDuplicates();
  if ( Poses != m_PoseNames || Subjects != m_SubjectNames )
  {
    m_PoseNames = Poses;
    m_SubjectNames = Subjects;
    emit PosesChanged();
  }
}

QVariantMap VHarrowSubjectScene::SceneReport()
{
  QVariantMap Report = VFlowScene::SceneReport();
  QVariantMap Own{ { "pose", m_Poses.Pose },
                   { "labellingPose", m_Poses.Labelling.value_or( m_Poses.Pose ) },
                   { "solvingPose", m_Poses.Solving.value_or( m_Poses.Pose ) } };
  if ( const ZEK::VFlowStateRef State = Shown() )
  {
    ReadNames();
    Own["tags"] = TagsOf( *State );
  }
  Own["poses"] = QVariantList( m_PoseNames.begin(), m_PoseNames.end() );
  Own["subjects"] = QVariantList( m_SubjectNames.begin(), m_SubjectNames.end() );
  Report["subjectScene"] = Own;
  return Report;
}

std::vector< MoxelGraphics::VScenePoint > VHarrowSubjectScene::HomePoints()
{
  std::vector< MoxelGraphics::VScenePoint > Points;
  const ZEK::VFlowStateRef State = Shown();
  if ( !State )
  {
    return Points;
  }
  const auto Add = [&]( const double* i_pPlace )
  {
    Points.push_back( { static_cast< float >( i_pPlace[0] ), static_cast< float >( i_pPlace[1] ),
                        static_cast< float >( i_pPlace[2] ), BoneRadius } );
  };
  for ( const std::uint32_t Tag : PosedTags )
  {
    VisitItems( *State, Tag,
                [&]( const ZEK::IFlowItem& i_rItem )
                {
                  const auto* const pPosed = ZEK::FlowPayload< VSubjectDynamicParameters >( &i_rItem );
                  for ( std::size_t Index = 0; pPosed && Index < pPosed->Segments.size(); ++Index )
                  {
                    Add( pPosed->Segments[Index].T );
                  }
                  for ( std::size_t Index = 0; pPosed && Index < pPosed->MarkerPositions.size(); ++Index )
                  {
                    Add( &pPosed->MarkerPositions[Index].x );
                  }
                } );
  }
  return Points;
}

} // namespace HarrowGraphics

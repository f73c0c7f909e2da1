#include <HarrowGraphics/VHarrowScene.h>

namespace HarrowGraphics
{
namespace
{
constexpr std::uint32_t AllItemGroups = 31;
constexpr std::uint32_t NewestState = 2;
} // namespace

VHarrowScene::VHarrowScene( VHarrowSceneArguments i_Arguments )
  : VFlowScene( i_Arguments.pRenderResources, i_Arguments.pSelection, i_Arguments.pMeshCache, i_Arguments.pPostal,
                i_Arguments.bDeveloperMode )
  , m_Arguments( std::move( i_Arguments ) )
  , m_pCache( m_Arguments.pContext ? m_Arguments.pContext->Cache() : nullptr )
{
}

VHarrowScene::~VHarrowScene() = default;

void VHarrowScene::Start()
{
  const auto MarkSelf = [pSelf = QPointer( this )]
  {
    if ( pSelf )
    {
      pSelf->MarkDirty();
    }
  };
  const auto& rpPostal = m_Arguments.pPostal;
  if ( m_pCache )
  {
    m_pStatesChanged = std::make_unique< ZEK::VDispatchCollapser >( MarkSelf, rpPostal );
    m_Connections.push_back( m_pCache->StatesChanged().Connect( m_pStatesChanged->Callback(), nullptr ) );
    m_Connections.push_back( m_pCache->Notifier6().Connect( m_pStatesChanged->Callback(), nullptr ) );
  }
  if ( m_Arguments.pSelection )
  {
    // The flags of a frame's ids are copies, so a paused view takes the same state again to show a new selection.
    m_pSelectionChanged = m_Arguments.pSelection->ForKinds( {} );
    m_Connections.push_back( m_pSelectionChanged->Connect( MarkSelf, rpPostal ) );
  }
  if ( m_Arguments.pActivityMode )
  {
    m_Connections.push_back( m_Arguments.pActivityMode->Changed().Connect( MarkSelf, rpPostal ) );
  }
  if ( m_Arguments.pVolumeManipulator )
  {
    m_Connections.push_back( m_Arguments.pVolumeManipulator->Changed().Connect( MarkSelf, rpPostal ) );
  }
  if ( m_Arguments.pPlaybackRange )
  {
    m_Connections.push_back( m_Arguments.pPlaybackRange->Changed().Connect(
        [pSelf = QPointer( this )]
        {
          if ( pSelf )
          {
            pSelf->OnPlaybackChanged();
          }
        },
        rpPostal ) );
    OnPlaybackChanged();
  }
}

void VHarrowScene::OnPlaybackChanged()
{
  const HarrowPluginInterface::IPlaybackRange& rRange = *m_Arguments.pPlaybackRange;
  const std::int64_t Tick = rRange.CurrentTick();
  const bool bWithin = !rRange.IsPlayback() || ( Tick >= rRange.RangeBegin() && Tick <= rRange.RangeEnd() );
  if ( bWithin != m_bWithinRange )
  {
    m_bWithinRange = bWithin;
    emit CurrentTimeWithinRangeChanged();
  }
}

void VHarrowScene::FetchAround( const ZEK::VFlowTimeRange& i_rRange, std::vector< ZEK::VFlowStateRef >& o_rStates )
{
  if ( !m_pCache || !m_pCache->FetchMany( i_rRange, o_rStates, 0 ) )
  {
    o_rStates.clear();
  }
}

ZEK::VFlowStateRef VHarrowScene::FetchState()
{
  ZEK::VFlowStateRef State;
  if ( m_pCache )
  {
    m_pCache->Fetch( State, AllItemGroups, NewestState, 0 );
  }
  return State;
}

} // namespace HarrowGraphics

#include <HostWindow/Session.h>

#include "PerformerMeshes.h"

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>
#include <HostMeshes/ReadMesh.h>
#include <HostQml/Modules.h>

#include <QtCore/QString>

#include <algorithm>
#include <cmath>

namespace HostWindow
{
namespace
{
constexpr std::uint32_t LiveClock = 1;
constexpr std::uint32_t PlaybackClock = 2;
constexpr int TickMs = 8;
constexpr std::int64_t FramesAround = 60; ///< to each side of the one that is shown

/// Passes on to stderr what the user asked to see there; the ring beside it gets at least the warnings.
class VQuietStderr final : public ZEK::ILogSink
{
public:
  explicit VQuietStderr( int i_Level )
    : m_Level( i_Level )
  {
  }
  void Take( const ZEK::VLogLine& i_rLine ) override
  {
    if ( i_rLine.Level <= m_Level )
    {
      m_Stderr.Take( i_rLine );
    }
  }

private:
  int m_Level;
  ZEK::VLogStderr m_Stderr;
};

HostServices::VHostOptions HostOptions( const VCommonOptions& i_rOptions )
{
  HostServices::VHostOptions Options;
  Options.ContentRoot = i_rOptions.ContentRoot;
  Options.FeatureFlags =
      i_rOptions.Flags ? "0x" + QString::number( *i_rOptions.Flags, 16 ) : QString::fromStdString( i_rOptions.Profile );
  Options.bDeveloperMode = i_rOptions.bDeveloper;
  return Options;
}
} // namespace

VSession::VSession( const VCommonOptions& i_rOptions )
  : m_Options( i_rOptions )
  , m_pMeshes( std::make_shared< HostMeshes::VMeshCache >( HostMeshes::FindMeshReader() ) )
{
  StartLog( i_rOptions.LogLevel );
  m_pHost = std::make_unique< HostServices::VHost >( HostOptions( i_rOptions ) );
  m_pHost->SetMeshCache( m_pMeshes );
  HostQml::RegisterModules( *m_pHost );
  m_UpChoice = i_rOptions.Up;
  m_FrameConnection = Clock().FrameChanged().Connect(
      [this]
      {
        OnFrame();
      },
      nullptr );
  m_Tick.setTimerType( Qt::PreciseTimer );
  m_Tick.setInterval( TickMs );
  connect( &m_Tick, &QTimer::timeout, this,
           [this]
           {
             Clock().Advance();
           } );
}

VSession::~VSession()
{
  m_Tick.stop();
  m_FrameConnection.Disconnect();
  m_pLivePump.reset();
  m_pPlaybackPump.reset();
  if ( m_Module.Stage() == HostServices::VPluginModule::EContent )
  {
    (void)m_Module.Release();
  }
  (void)m_Module.Destroy();
  m_pHost.reset();
  ZEK::GlobalLog().RemoveSink( m_pStderr );
  ZEK::GlobalLog().RemoveSink( m_pLogRing );
}

void VSession::StartLog( int i_Level )
{
  m_pLogRing = std::make_shared< ZEK::VLogRing >();
  m_pStderr = std::make_shared< VQuietStderr >( i_Level );
  ZEK::GlobalLog().SetMaximumLevel( std::max< int >( i_Level, ZEK::ELogWarning ) );
  ZEK::GlobalLog().AddSink( m_pLogRing );
  ZEK::GlobalLog().AddSink( m_pStderr );
}

std::string VSession::StartPlugin()
{
  const std::filesystem::path Path = m_Options.Plugin.empty() ? HostServices::VPluginModule::DefaultPath()
                                                              : std::filesystem::absolute( m_Options.Plugin );
  const ZEK::IResult Result = m_Module.Start( Path, *m_pHost );
  if ( Result.IsOk() )
  {
    return {};
  }
  return m_Module.Error().empty() ? Path.string() + ": " + Result.Text() : m_Module.Error();
}

std::string VSession::FindWindowKind( const std::string& i_rText ) const
{
  const QString Wanted = QString::fromStdString( i_rText ).toLower();
  for ( const std::string& rName : m_pHost->Factories()->Names() )
  {
    const QString Name = QString::fromStdString( rName ).toLower();
    if ( Name == Wanted || Name.section( ' ', 0, 0 ) == Wanted )
    {
      return rName;
    }
  }
  return {};
}

HostSources::VStateMaker VSession::Maker( std::uint32_t i_Clock ) const
{
  return { m_pHost->StateFactory(), m_pHost->ItemStore(), i_Clock };
}

void VSession::GoLive()
{
  m_OtherContext.clear();
  m_bLive = true;
  if ( !m_pLive )
  {
    AddPerformerMeshes( m_Options.Simulated, *m_pMeshes );
    m_pLive = std::make_shared< HostSources::VSimulatedCapture >( m_Options.Simulated );
    m_pLivePump =
        std::make_unique< HostSources::VSourcePump >( m_pLive, m_pHost->Contexts()->LiveCache(), Maker( LiveClock ) );
    ApplyUpAxis( m_pLivePump.get(), m_pLive.get(), HostSources::EUpAxis::Z );
  }
  Clock().Pause();
  Clock().SetPlayback( false );
  m_pHost->Activity()->SetName( "Live" );
  RunPumps();
  emit SourceChanged();
}

void VSession::OpenRecording( std::shared_ptr< const HostSources::VRecording > i_pRecording, bool i_bShow )
{
  m_pPlaybackPump.reset();
  m_pHost->Contexts()->PlaybackCache()->Clear();
  m_FoundUp = i_pRecording->UpAxis;
  m_pRecording = std::make_shared< HostSources::VRecordingSource >( std::move( i_pRecording ) );
  m_pPlaybackPump = std::make_unique< HostSources::VSourcePump >( m_pRecording, m_pHost->Contexts()->PlaybackCache(),
                                                                  Maker( PlaybackClock ) );
  // What lies around a frame is for views that show where markers were and will be.
  if ( auto pCache = std::dynamic_pointer_cast< HostFlow::IHostStateCache >( m_pHost->Contexts()->PlaybackCache() ) )
  {
    m_pPlaybackPump->KeepAround( FramesAround,
                                 [pCache]( std::vector< ZEK::VFlowStateRef >& io_rStates, bool i_bTell )
                                 {
                                   pCache->SetAround( io_rStates, i_bTell );
                                 } );
  }
  ApplyUpAxis( m_pPlaybackPump.get(), m_pRecording.get(), m_FoundUp );
  m_LastShown = -1;
  const ZEK::IResult Opened = Clock().Open( m_pRecording->FrameCount(), m_pRecording->TicksPerFrame() );
  if ( Opened.IsError() )
  {
    static const ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Session" );
    ZEK::Log( rCategory, ZEK::ELogFailure, "The recording cannot be played: %1%", Opened.Text() );
  }
  if ( i_bShow || !m_bLive )
  {
    GoPlayback();
    return;
  }
  Clock().SetPlayback( false );
  emit SourceChanged();
}

void VSession::GoPlayback()
{
  if ( !m_pRecording )
  {
    return;
  }
  m_OtherContext.clear();
  m_bLive = false;
  m_pHost->Activity()->SetName( "Playback" );
  Clock().SetPlayback( true );
  RunPumps();
  m_pPlaybackPump->Show( Clock().CurrentFrame(), true );
  m_LastShown = Clock().CurrentFrame();
  emit SourceChanged();
}

void VSession::RunPumps()
{
  const bool bLive = m_bLive && m_bSeen;
  if ( m_pLivePump && bLive != m_pLivePump->IsRunning() )
  {
    if ( bLive )
    {
      m_pLivePump->StartLive( std::max< std::int64_t >( 0, m_pLivePump->ShownIndex() ) );
    }
    else
    {
      m_pLivePump->Stop();
    }
  }
  const bool bPlayback = !m_bLive && m_bSeen;
  if ( m_pPlaybackPump && bPlayback && !m_pPlaybackPump->IsRunning() )
  {
    m_pPlaybackPump->StartFollow();
  }
  if ( bPlayback )
  {
    m_Tick.start();
  }
  else
  {
    m_Tick.stop();
  }
}

void VSession::OnFrame()
{
  if ( m_bLive || !m_pPlaybackPump || Clock().CurrentFrame() == m_LastShown )
  {
    return;
  }
  m_LastShown = Clock().CurrentFrame();
  m_pPlaybackPump->Show( m_LastShown );
}

const HostSources::IFrameSource* VSession::Source() const
{
  if ( m_bLive )
  {
    return m_pLive.get();
  }
  return m_pRecording.get();
}

void VSession::ShowContext( const std::string& i_rName )
{
  m_OtherContext = i_rName;
  emit SourceChanged();
}

std::shared_ptr< HarrowPluginInterface::IStateCacheContext > VSession::Context() const
{
  if ( !m_OtherContext.empty() )
  {
    if ( auto pOther = m_pHost->Contexts()->Find( m_OtherContext ) )
    {
      return pOther;
    }
  }
  return m_pHost->Contexts()->Find( m_bLive ? HostServices::LiveContextName : HostServices::PlaybackContextName );
}

std::int64_t VSession::ShownFrame() const
{
  if ( m_Still >= 0 )
  {
    return m_Still;
  }
  if ( m_bLive )
  {
    return m_pLivePump ? m_pLivePump->ShownIndex() : -1;
  }
  return m_LastShown;
}

namespace
{
/// What lies around a frame, for views that show where markers were and will be. Video is left alone: it would have to
/// be decoded frame by frame.
void AddAround( HostSources::IFrameSource& io_rSource, const HostSources::VStateMaker& i_rMaker,
                const ZEK::IFlowState& i_rState, std::int64_t i_Index, ZEK::IFlowWritableStateCache& io_rCache )
{
  ZEK::VFlowItemRef Video;
  i_rState.FindItem( Video, ZEK::FlowTag< CoreMoxelTypes::FlowVideoFrame >, ZEK::EFlowTimeMatch::Overlap );
  const std::int64_t First = std::max< std::int64_t >( i_Index - FramesAround, 0 );
  const std::int64_t End = std::min( i_Index + FramesAround + 1, io_rSource.FrameCount() );
  for ( std::int64_t Index = First; !Video && Index < End; ++Index )
  {
    ZEK::VFlowStateRef State;
    if ( Index != i_Index && io_rSource.MakeState( Index, i_rMaker, State ).IsOk() )
    {
      (void)io_rCache.Add( State );
    }
  }
}
} // namespace

ZEK::IResult VSession::ShowStill( double i_Seconds, std::int64_t& o_rIndex )
{
  // No pump may put another frame after this one.
  SetSeen( false );
  if ( m_pPlaybackPump )
  {
    m_pPlaybackPump->Stop();
  }
  HostSources::IFrameSource* pSource =
      m_bLive ? static_cast< HostSources::IFrameSource* >( m_pLive.get() ) : m_pRecording.get();
  if ( !pSource )
  {
    return ZEK::IResult::NotAvailable;
  }
  o_rIndex = m_bLive ? std::llround( i_Seconds * pSource->RateHz() ) : m_pRecording->NearestFrame( i_Seconds );
  ZEK::VFlowStateRef State;
  const ZEK::IResult Made = pSource->MakeState( o_rIndex, Maker( m_bLive ? LiveClock : PlaybackClock ), State );
  if ( Made.IsError() )
  {
    return Made;
  }
  const auto& rpCache = m_bLive ? m_pHost->Contexts()->LiveCache() : m_pHost->Contexts()->PlaybackCache();
  rpCache->Clear();
  if ( !m_bLive )
  {
    Clock().SeekFrame( o_rIndex );
  }
  m_Still = o_rIndex;
  if ( !m_bLive )
  {
    AddAround( *pSource, Maker( PlaybackClock ), *State, o_rIndex, *rpCache );
  }
  return rpCache->Add( State );
}

void VSession::ApplyUpAxis( HostSources::VSourcePump* i_pPump, HostSources::IFrameSource* i_pSource,
                            HostSources::EUpAxis i_Found )
{
  const HostSources::EUpAxis Axis = m_UpChoice.value_or( i_Found );
  if ( i_pPump && i_pSource && i_pSource->UpAxis() != Axis )
  {
    i_pPump->WithSource(
        [Axis]( HostSources::IFrameSource& io_rSource )
        {
          io_rSource.SetUpAxis( Axis );
        } );
  }
}

void VSession::SetUpAxis( std::optional< HostSources::EUpAxis > i_Axis )
{
  m_UpChoice = i_Axis;
  ApplyUpAxis( m_pLivePump.get(), m_pLive.get(), HostSources::EUpAxis::Z );
  ApplyUpAxis( m_pPlaybackPump.get(), m_pRecording.get(), m_FoundUp );
  if ( !m_bLive && m_pPlaybackPump )
  {
    m_pPlaybackPump->Show( Clock().CurrentFrame(), true );
  }
  emit SourceChanged();
}

void VSession::SetSeen( bool i_bSeen )
{
  m_bSeen = i_bSeen;
  RunPumps();
}

} // namespace HostWindow

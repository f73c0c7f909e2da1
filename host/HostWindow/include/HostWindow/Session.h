#pragma once

#include <HostWindow/CommandLine.h>

#include <HostMeshes/VMeshCache.h>
#include <HostServices/VHost.h>
#include <HostServices/VPluginModule.h>
#include <HostSources/VRecordingSource.h>
#include <HostSources/VSimulatedCapture.h>
#include <HostSources/VSourcePump.h>
#include <ZEK/Log.h>

#include <QtCore/QObject>
#include <QtCore/QTimer>

#include <memory>
#include <optional>

namespace HostWindow
{

/// What the program runs on: the services, the loaded plug-in, and the sources that fill the two contexts.
///
/// Windows must be closed before it goes. Thread: GUI.
class VSession : public QObject
{
  Q_OBJECT

public:
  explicit VSession( const VCommonOptions& i_rOptions );
  ~VSession() override;

  /// Loads the module and lets it publish its windows. An empty text means success.
  std::string StartPlugin();

  HostServices::VHost& Host() { return *m_pHost; }
  /// The meshes that all views draw from.
  HostMeshes::VMeshCache& Meshes() { return *m_pMeshes; }
  HostServices::VPlaybackClock& Clock() { return *m_pHost->Playback(); }
  /// The lines of levels 2 and 3, and of those that --log asks for.
  const std::shared_ptr< ZEK::VLogRing >& LogRing() const { return m_pLogRing; }
  /// The name under which a window of that kind is published: "3d" stands for "3D View". Empty when there is none.
  std::string FindWindowKind( const std::string& i_rText ) const;

  const VCommonOptions& Options() const { return m_Options; }
  /// The views show the simulated capture.
  void GoLive();
  /// The views show this recording, from its first frame. Without `i_bShow` they stay live if they are, and show it
  /// after `GoPlayback`.
  void OpenRecording( std::shared_ptr< const HostSources::VRecording > i_pRecording, bool i_bShow = true );
  /// The views show the open recording again, where it stands.
  void GoPlayback();
  bool IsLive() const { return m_bLive; }
  bool HasRecording() const { return m_pRecording != nullptr; }
  /// What the views show; null before the first.
  const HostSources::IFrameSource* Source() const;
  /// The context that the views of now belong to.
  std::shared_ptr< HarrowPluginInterface::IStateCacheContext > Context() const;
  /// The views show a context that neither capture nor recordings fill, such as one of the plug-in's, until they go
  /// live or play again. One that is not there is not shown.
  void ShowContext( const std::string& i_rName );

  /// The index of the frame in the cache; -1 before the first.
  std::int64_t ShownFrame() const;
  /// Puts one frame into the cache at once: the one nearest to that time. For pictures.
  ZEK::IResult ShowStill( double i_Seconds, std::int64_t& o_rIndex );

  /// Nothing stands for the axis that the source itself found.
  void SetUpAxis( std::optional< HostSources::EUpAxis > i_Axis );
  std::optional< HostSources::EUpAxis > UpAxisChoice() const { return m_UpChoice; }

  /// A window that nobody sees needs no frames.
  void SetSeen( bool i_bSeen );

signals:
  /// The context, the source or its up axis is another one.
  void SourceChanged();

private:
  void StartLog( int i_Level );
  void ApplyUpAxis( HostSources::VSourcePump* i_pPump, HostSources::IFrameSource* i_pSource,
                    HostSources::EUpAxis i_Found );
  void RunPumps();
  void OnFrame();
  HostSources::VStateMaker Maker( std::uint32_t i_Clock ) const;

  VCommonOptions m_Options;
  std::shared_ptr< ZEK::VLogRing > m_pLogRing;
  std::shared_ptr< ZEK::ILogSink > m_pStderr;
  const std::shared_ptr< HostMeshes::VMeshCache > m_pMeshes;
  std::unique_ptr< HostServices::VHost > m_pHost;
  HostServices::VPluginModule m_Module;
  std::shared_ptr< HostSources::VSimulatedCapture > m_pLive;
  std::shared_ptr< HostSources::VRecordingSource > m_pRecording;
  std::unique_ptr< HostSources::VSourcePump > m_pLivePump;
  std::unique_ptr< HostSources::VSourcePump > m_pPlaybackPump;
  HostSources::EUpAxis m_FoundUp = HostSources::EUpAxis::Z; ///< by the recording
  std::optional< HostSources::EUpAxis > m_UpChoice;
  std::string m_OtherContext; ///< that the views show in place of capture or recording
  bool m_bLive = true;
  bool m_bSeen = true;
  std::int64_t m_LastShown = -1;
  std::int64_t m_Still = -1; ///< frame of ShowStill
  QTimer m_Tick;
  ZEK::VConnection m_FrameConnection;
};

} // namespace HostWindow

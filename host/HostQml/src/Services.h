#pragma once

#include <HostServices/VPlaybackClock.h>
#include <HostServices/VPostalService.h>
#include <HostServices/VSelectionService.h>

#include <QtCore/QObject>
#include <QtCore/QVariant>

class QQmlEngine;

namespace HostQml
{

/// The host's services as a child of its engine, where the singletons of that engine find them.
class VServices final : public QObject
{
  Q_OBJECT

public:
  using QObject::QObject;

  /// Null for an engine that no host bound.
  static VServices* Of( const QQmlEngine* i_pEngine );

  std::shared_ptr< HostServices::VPlaybackClock > pClock;
  std::shared_ptr< HostServices::VSelectionService > pSelection;
  std::shared_ptr< HostServices::VPostalService > pPostal;
};

/// The singleton `Playback`: how a document scrubs and jogs, and where playback stands.
class VPlaybackQml final : public QObject
{
  Q_OBJECT
  /// Writing seeks; ticks stay below the whole numbers that QML can hold.
  Q_PROPERTY( qint64 tick READ Tick WRITE SetTick NOTIFY tickChanged )
  Q_PROPERTY( qint64 frame READ Frame NOTIFY tickChanged )
  Q_PROPERTY( bool playing READ IsPlaying NOTIFY stateChanged )
  Q_PROPERTY( bool active READ IsActive NOTIFY stateChanged )

public:
  explicit VPlaybackQml( VServices* i_pServices );

  /// Whether a drag with the middle button moves the time.
  Q_INVOKABLE bool middleMouseScrub() const { return true; }
  /// Above 1; 5 is one frame a pixel.
  Q_INVOKABLE double middleMouseScrubSensitivity() const { return 3.0; }
  /// Whether the wheel moves the time instead of the camera.
  Q_INVOKABLE bool mouseWheelJog() const { return false; }
  /// Frames a wheel step.
  Q_INVOKABLE double jogSensitivity() const { return 1.0; }
  /// Ticks a frame.
  Q_INVOKABLE qint64 framePeriod() const;
  Q_INVOKABLE void togglePlay();

signals:
  void tickChanged();
  void stateChanged();

private:
  qint64 Tick() const;
  void SetTick( qint64 i_Tick );
  qint64 Frame() const;
  bool IsPlaying() const;
  bool IsActive() const;

  std::shared_ptr< HostServices::VPlaybackClock > m_pClock;
  ZEK::VConnection m_TickConnection;
  ZEK::VConnection m_StateConnection;
};

/// The singleton `Selection`.
class VSelectionQml final : public QObject
{
  Q_OBJECT

public:
  explicit VSelectionQml( VServices* i_pServices );

  /// The number of selected items of the given kinds; of all kinds for an empty list.
  Q_INVOKABLE int count( const QVariantList& i_rKinds = {} ) const;

signals:
  void selectionChanged();

private:
  std::shared_ptr< HostServices::VSelectionService > m_pSelection;
  ZEK::VConnection m_Connection;
};

/// How a view follows objects; equal to the values that a scene item takes.
namespace Tracking
{
Q_NAMESPACE

enum ETracking
{
  ETrackNone,
  ETrackCurrent,
  ETrackSelection,
  ELockCurrent
};
Q_ENUM_NS( ETracking )
} // namespace Tracking

/// Which rays from cameras to reconstructions are drawn.
namespace CentroidAssignments
{
Q_NAMESPACE

enum ECentroidAssignments
{
  ENone,
  EReconstructions,
  ECameras,
  EUnion,
  EIntersection
};
Q_ENUM_NS( ECentroidAssignments )
} // namespace CentroidAssignments

} // namespace HostQml

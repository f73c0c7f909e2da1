#include <HostQml/Modules.h>

#include "Services.h"

#include <HostServices/VHost.h>

#include <QtQml/QQmlEngine>
#include <QtQml/qqml.h>

#include <mutex>

namespace HostQml
{
namespace
{
template < typename T >
void RegisterSingleton( const char* i_pModule, const char* i_pName )
{
  qmlRegisterSingletonType< T >( i_pModule, 1, 0, i_pName,
                                 []( QQmlEngine* i_pEngine, QJSEngine* ) -> QObject*
                                 {
                                   return new T( VServices::Of( i_pEngine ) );
                                 } );
}

void RegisterTypes()
{
  RegisterSingleton< VPlaybackQml >( "Moxel.Playback", "Playback" );
  RegisterSingleton< VSelectionQml >( "Moxel.Selection", "Selection" );
  const auto Reason = QStringLiteral( "This type only holds the values of an enumeration." );
  qmlRegisterUncreatableMetaObject( Tracking::staticMetaObject, "Moxel.Graphics", 1, 0, "ETracking", Reason );
  qmlRegisterUncreatableMetaObject( CentroidAssignments::staticMetaObject, "Moxel.Graphics", 1, 0,
                                    "ECentroidAssignments", Reason );
}
} // namespace

void RegisterModules( HostServices::VHost& i_rHost )
{
  static std::once_flag Registered;
  std::call_once( Registered, RegisterTypes );
  QQmlEngine* pEngine = i_rHost.Quick()->Engine();
  if ( !pEngine || VServices::Of( pEngine ) )
  {
    return;
  }
  auto* pServices = new VServices( pEngine );
  pServices->pClock = i_rHost.Playback();
  pServices->pSelection = i_rHost.Selection();
  pServices->pPostal = i_rHost.Postal();
}

VServices* VServices::Of( const QQmlEngine* i_pEngine )
{
  return i_pEngine ? i_pEngine->findChild< VServices* >( QString(), Qt::FindDirectChildrenOnly ) : nullptr;
}

VPlaybackQml::VPlaybackQml( VServices* i_pServices )
  : m_pClock( i_pServices ? i_pServices->pClock : nullptr )
{
  if ( !m_pClock )
  {
    return;
  }
  // What is delivered after the connections went finds them gone, and both go and deliver on this thread.
  m_TickConnection = m_pClock->Changed().Connect(
      [this]
      {
        emit tickChanged();
      },
      i_pServices->pPostal );
  m_StateConnection = m_pClock->StateChanged().Connect(
      [this]
      {
        emit stateChanged();
      },
      i_pServices->pPostal );
}

qint64 VPlaybackQml::framePeriod() const
{
  return m_pClock ? m_pClock->TicksPerFrame() : 1;
}

void VPlaybackQml::togglePlay()
{
  if ( m_pClock )
  {
    m_pClock->TogglePlay();
  }
}

qint64 VPlaybackQml::Tick() const
{
  return m_pClock ? m_pClock->CurrentTick() : 0;
}

void VPlaybackQml::SetTick( qint64 i_Tick )
{
  if ( m_pClock )
  {
    m_pClock->Seek( i_Tick );
  }
}

qint64 VPlaybackQml::Frame() const
{
  return m_pClock ? m_pClock->CurrentFrame() : 0;
}

bool VPlaybackQml::IsPlaying() const
{
  return m_pClock && m_pClock->IsPlaying();
}

bool VPlaybackQml::IsActive() const
{
  return m_pClock && m_pClock->IsPlayback();
}

VSelectionQml::VSelectionQml( VServices* i_pServices )
  : m_pSelection( i_pServices ? i_pServices->pSelection : nullptr )
{
  if ( !m_pSelection )
  {
    return;
  }
  m_Connection = m_pSelection->ForKinds( {} )->Connect(
      [this]
      {
        emit selectionChanged();
      },
      i_pServices->pPostal );
}

int VSelectionQml::count( const QVariantList& i_rKinds ) const
{
  if ( !m_pSelection )
  {
    return 0;
  }
  std::vector< std::uint32_t > Kinds;
  for ( const QVariant& rKind : i_rKinds )
  {
    Kinds.push_back( rKind.toUInt() );
  }
  ZEK::VSelection Selection;
  (void)m_pSelection->Get( ZEK::ISelectionService::EPrimary, Kinds, Selection );
  return static_cast< int >( Selection.size() );
}

} // namespace HostQml

#include "VOverlay.h"

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VOverlayObjects.h>

#include <CoreGraphics/VCameraController.h>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
const QColor PlainName( 0xF0, 0xF0, 0xF0 );
const QColor CurrentName( 231, 101, 0 );

bool HoldsDevice( const ZEK::VSelection& i_rSelection, const std::string& i_rDevice )
{
  return std::any_of( i_rSelection.begin(), i_rSelection.end(),
                      [&]( const ZEK::VSelectionItem& i_rItem )
                      {
                        return i_rItem.Kind == ZEK::ESelectDevice && i_rItem.Device == i_rDevice;
                      } );
}

bool Holds( const ZEK::VSelection& i_rSelection, const ZEK::VSelectionItem& i_rItem )
{
  return std::find( i_rSelection.begin(), i_rSelection.end(), i_rItem ) != i_rSelection.end();
}

bool IsInFront( const QVector4D& i_rClip )
{
  return i_rClip.w() > 0 && std::isfinite( i_rClip.x() ) && std::isfinite( i_rClip.y() ) &&
         std::isfinite( i_rClip.z() ) && std::isfinite( i_rClip.w() );
}

/// Writes what differs; true when something did.
template < typename T >
bool Write( T& o_rField, const T& i_rValue )
{
  const bool bDiffers = o_rField != i_rValue;
  o_rField = i_rValue;
  return bDiffers;
}

void Drop( const QList< QObject* >& i_rObjects, const QList< QObject* >& i_rKept )
{
  for ( QObject* const pObject : i_rObjects )
  {
    if ( !i_rKept.contains( pObject ) )
    {
      // A document may be in the middle of reading it.
      pObject->deleteLater();
    }
  }
}
} // namespace

bool VOverlay::Collect( VMoxelScene& io_rScene, const CoreGraphics::VCameraFields& i_rCamera, QSizeF i_ItemSize )
{
  m_View = i_rCamera.view;
  m_ToClip = i_rCamera.projection * i_rCamera.view;
  m_Size = i_ItemSize;
  CollectSelection( io_rScene );
  const bool bCameras = CollectCameras( io_rScene );
  const bool bSubjects = CollectSubjects( io_rScene );
  return bCameras || bSubjects;
}

void VOverlay::CollectSelection( const VMoxelScene& i_rScene )
{
  const auto& rpService = i_rScene.SelectionService();
  const std::uint64_t Generation = rpService ? rpService->Generation() : 0;
  if ( Generation == m_SelectionGeneration )
  {
    return;
  }
  m_SelectionGeneration = Generation;
  m_Selected = rpService->Get( ZEK::ISelectionService::EPrimary );
  m_Preselected = rpService->Get( ZEK::ISelectionService::ESecondary );
}

QVector4D VOverlay::ToClip( const QVector3D& i_rPoint ) const
{
  return m_ToClip * QVector4D( i_rPoint, 1.0f );
}

QPointF VOverlay::ToItem( const QVector4D& i_rClip ) const
{
  return { ( i_rClip.x() / i_rClip.w() + 1 ) / 2 * m_Size.width(),
           ( 1 - i_rClip.y() / i_rClip.w() ) / 2 * m_Size.height() };
}

/// Whether anything that the cameras' records are made of is another than it was.
bool VOverlay::CamerasMoved( const VMoxelScene& i_rScene )
{
  const VSeen New{ &i_rScene, i_rScene.CameraGeneration(), m_SelectionGeneration, m_ToClip, m_Size };
  const bool bMoved = !( m_Seen == New );
  m_Seen = New;
  return bMoved;
}

bool VOverlay::CollectCameras( VMoxelScene& io_rScene )
{
  if ( !CamerasMoved( io_rScene ) )
  {
    return false;
  }
  // Records are written over: names keep their memory.
  std::size_t Count = 0;
  bool bHeld = false;
  for ( const VCameraDefinition& rDefinition : io_rScene.CameraDefinitions() )
  {
    const bool bSelected = HoldsDevice( m_Selected, rDefinition.DeviceURN );
    const bool bPreselected = HoldsDevice( m_Preselected, rDefinition.DeviceURN );
    bHeld = bHeld || bSelected || bPreselected;
    const QVector4D Clip = ToClip( { rDefinition.Position[0], rDefinition.Position[1], rDefinition.Position[2] } );
    if ( rDefinition.bCalibrated && IsInFront( Clip ) )
    {
      const QPointF Place = ToItem( Clip );
      const auto Depth = static_cast< float >( ( Clip.z() / Clip.w() + 1 ) / 2 );
      if ( Count == m_NewCameras.size() )
      {
        m_NewCameras.emplace_back();
      }
      VOverlayCamera& rCamera = m_NewCameras[Count++];
      rCamera.DeviceURN = rDefinition.DeviceURN;
      rCamera.UserId = rDefinition.UserId;
      rCamera.Position = { static_cast< float >( Place.x() ), static_cast< float >( Place.y() ), Depth };
      rCamera.bSelected = bSelected;
      rCamera.bPreselected = bPreselected;
    }
  }
  m_NewCameras.resize( Count );
  const bool bHeldChanged = Write( m_bCameraHeld, bHeld );
  const bool bChanged = m_NewCameras != m_Cameras;
  m_Cameras.swap( m_NewCameras );
  return bChanged || bHeldChanged;
}

bool VOverlay::CollectSubjects( VMoxelScene& io_rScene )
{
  m_NewSubjects.clear();
  for ( const VSceneLabel* const pLabel : io_rScene.GetLabels( true ) )
  {
    const QVector3D World( pLabel->Position[0], pLabel->Position[1], pLabel->Position[2] );
    const QVector4D Clip = ToClip( World );
    const float Away = -m_View.map( World ).z();
    const bool bSeen = IsInFront( Clip ) && Away > 0;
    const QPointF Place = bSeen ? ToItem( Clip ) : QPointF();
    m_NewSubjects.push_back(
        { pLabel->Item, pLabel->Text,
          QVector3D( static_cast< float >( Place.x() ), static_cast< float >( Place.y() ), bSeen ? Away : -1.0f ),
          pLabel->bFlag, Holds( m_Selected, pLabel->Item ) } );
  }
  // The scene keeps its labels in no order.
  std::sort( m_NewSubjects.begin(), m_NewSubjects.end(),
             []( const VOverlaySubject& i_rA, const VOverlaySubject& i_rB )
             {
               return i_rA.Item < i_rB.Item;
             } );
  m_NewSubjects.erase( std::unique( m_NewSubjects.begin(), m_NewSubjects.end(),
                                    []( const VOverlaySubject& i_rA, const VOverlaySubject& i_rB )
                                    {
                                      return i_rA.Item == i_rB.Item;
                                    } ),
                       m_NewSubjects.end() );
  const bool bChanged = m_NewSubjects != m_Subjects;
  m_Subjects.swap( m_NewSubjects );
  return bChanged;
}

bool UpdateCameraObjects( QList< QObject* >& io_rObjects, const std::vector< VOverlayCamera >& i_rCameras,
                          QObject& io_rParent )
{
  QList< QObject* > Objects;
  Objects.reserve( static_cast< qsizetype >( i_rCameras.size() ) );
  for ( const VOverlayCamera& rCamera : i_rCameras )
  {
    const QString URN = QString::fromStdString( rCamera.DeviceURN );
    const auto Is = [&]( const QObject* i_pObject )
    {
      return static_cast< const VCameraObject* >( i_pObject )->DeviceURN() == URN;
    };
    // Nearly always it stands where it stood: great numbers are not searched one for the other.
    const qsizetype Place = Objects.size();
    const auto Found = Place < io_rObjects.size() && Is( io_rObjects[Place] )
                           ? io_rObjects.begin() + Place
                           : std::find_if( io_rObjects.begin(), io_rObjects.end(), Is );
    auto* const pObject =
        Found == io_rObjects.end() ? new VCameraObject( URN, &io_rParent ) : static_cast< VCameraObject* >( *Found );
    Objects.append( pObject );
    const bool bId = Write( pObject->m_UserId, static_cast< quint32 >( rCamera.UserId ) );
    const bool bCalibrated = Write( pObject->m_bCalibrated, true );
    const bool bSelected = Write( pObject->m_bSelected, rCamera.bSelected );
    if ( Write( pObject->m_bPreselected, rCamera.bPreselected ) || bId || bCalibrated || bSelected )
    {
      emit pObject->Changed();
    }
    if ( Write( pObject->m_Position, rCamera.Position ) )
    {
      emit pObject->PositionChanged();
    }
  }
  Drop( io_rObjects, Objects );
  return Write( io_rObjects, Objects );
}

bool UpdateSubjectObjects( QList< QObject* >& io_rObjects, std::vector< ZEK::VSelectionItem >& io_rKeys,
                           const std::vector< VOverlaySubject >& i_rSubjects, QObject& io_rParent )
{
  QList< QObject* > Objects;
  std::vector< ZEK::VSelectionItem > Keys;
  for ( const VOverlaySubject& rSubject : i_rSubjects )
  {
    const auto Found = std::find( io_rKeys.begin(), io_rKeys.end(), rSubject.Item );
    auto* const pObject =
        Found == io_rKeys.end()
            ? new VSubjectObject( rSubject.Item.Kind, &io_rParent )
            : static_cast< VSubjectObject* >( io_rObjects[static_cast< qsizetype >( Found - io_rKeys.begin() )] );
    Objects.append( pObject );
    Keys.push_back( rSubject.Item );
    const bool bName = Write( pObject->m_Name, QString::fromStdString( rSubject.Name ) );
    const bool bColour = Write( pObject->m_Colour, rSubject.bCurrent ? CurrentName : PlainName );
    if ( Write( pObject->m_bSelected, rSubject.bSelected ) || bName || bColour )
    {
      emit pObject->Changed();
    }
    if ( Write( pObject->m_Position, rSubject.Position ) )
    {
      emit pObject->PositionChanged();
    }
  }
  Drop( io_rObjects, Objects );
  io_rKeys = std::move( Keys );
  return Write( io_rObjects, Objects );
}

} // namespace MoxelGraphics

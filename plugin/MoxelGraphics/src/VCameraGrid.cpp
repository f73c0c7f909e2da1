#include <MoxelGraphics/VCameraGrid.h>

#include "TileLayout.h"

#include <QtCore/QPointer>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
constexpr QLatin1String VideoInput( "vi:" );
constexpr QLatin1String VideoFile( "vf:" );

QStringView Device( QStringView i_URN )
{
  return i_URN.startsWith( VideoInput ) || i_URN.startsWith( VideoFile ) ? i_URN.mid( VideoInput.size() ) : i_URN;
}

bool IsSameCameras( const VCameraTiles& i_rA, const VCameraTiles& i_rB )
{
  return std::equal( i_rA.begin(), i_rA.end(), i_rB.begin(), i_rB.end(),
                     []( const VCameraTile& i_rLeft, const VCameraTile& i_rRight )
                     {
                       return i_rLeft.DeviceURN == i_rRight.DeviceURN;
                     } );
}

QVariant SelectionValue( const ZEK::VSelectionItem& i_rItem )
{
  return QVariantMap{ { QStringLiteral( "kind" ), i_rItem.Kind },
                      { QStringLiteral( "device" ), QString::fromStdString( i_rItem.Device ) },
                      { QStringLiteral( "object" ), QVariant::fromValue( quint64( i_rItem.Object ) ) },
                      { QStringLiteral( "sub" ), i_rItem.Sub } };
}

/// Forgets the entries of URNs without a tile; true when there were any.
template < typename THash >
bool KeepOnly( THash& io_rHash, const QHash< QString, int >& i_rIndex )
{
  return erase_if( io_rHash,
                   [&]( const typename THash::iterator& i_rEntry )
                   {
                     return !i_rIndex.contains( i_rEntry.key() );
                   } ) > 0;
}
} // namespace

bool IsSameDevice( QStringView i_A, QStringView i_B )
{
  return Device( i_A ) == Device( i_B );
}

VCameraGrid::VCameraGrid( bool i_bSingleView, QObject* i_pParent )
  : QAbstractListModel( i_pParent )
  , m_bSingleView( i_bSingleView )
{
}

VCameraGrid::~VCameraGrid() = default;

VCameraGrid::VView VCameraGrid::DefaultView() const
{
  return { m_bSingleView ? 1.0f : 0.9f, 0.5f, 0.5f };
}

void VCameraGrid::SetCameras( std::vector< VCameraDefinition > i_Cameras )
{
  if ( i_Cameras == m_Cameras )
  {
    return;
  }
  m_Cameras = std::move( i_Cameras );
  Rebuild();
  emit CamerasChanged();
}

void VCameraGrid::SetShownCameras( const VURNs& i_rShown )
{
  if ( i_rShown != m_Shown )
  {
    m_Shown = i_rShown;
    Rebuild();
  }
}

void VCameraGrid::SetPinnedCameras( const VURNs& i_rPinned, bool i_bPinned )
{
  m_Pinned = i_bPinned ? i_rPinned : VURNs();
  m_bPinned = i_bPinned;
  Rebuild();
}

void VCameraGrid::PinTiles( bool i_bPinned )
{
  VURNs Pinned;
  for ( const VCameraTile& rTile : m_Tiles )
  {
    Pinned.insert( rTile.DeviceURN );
  }
  SetPinnedCameras( Pinned, i_bPinned );
}

bool VCameraGrid::GetPinnedCameras( VURNs& o_rPinned, QStringList& o_rTiles ) const
{
  o_rPinned = m_Pinned;
  o_rTiles.clear();
  for ( const VCameraTile& rTile : m_Tiles )
  {
    o_rTiles.append( rTile.DeviceURN );
  }
  return m_bPinned;
}

bool VCameraGrid::HasCamera( const QString& i_rURN ) const
{
  return std::any_of( m_Cameras.begin(), m_Cameras.end(),
                      [&]( const VCameraDefinition& i_rCamera )
                      {
                        return IsSameDevice( QString::fromStdString( i_rCamera.DeviceURN ), i_rURN );
                      } );
}

void VCameraGrid::SetRotation( bool i_bRotated, bool i_bSnapped )
{
  if ( i_bRotated != m_bRotated || i_bSnapped != m_bSnapped )
  {
    m_bRotated = i_bRotated;
    m_bSnapped = i_bSnapped;
    const float Aspect = AspectRatio();
    LayOut();
    Report( { TileRect } );
    if ( AspectRatio() != Aspect )
    {
      emit AspectRatioChanged();
    }
  }
}

void VCameraGrid::Resize( QSize i_Size, float i_PixelRatio )
{
  m_FrameSize = i_Size.expandedTo( QSize( 0, 0 ) );
  const float Ratio = i_PixelRatio > 0 && std::isfinite( i_PixelRatio ) ? i_PixelRatio : 1.0f;
  if ( Ratio != m_PixelRatio )
  {
    m_PixelRatio = Ratio;
    Report( { TileRect } );
  }
  LayOut();
  Report( { TileRect } );
}

VCameraTile VCameraGrid::MakeTile( const VCameraDefinition& i_rCamera )
{
  VCameraTile Tile = MakeImageTile( i_rCamera );
  VView View = DefaultView();
  if ( const int Former = m_Index.value( Tile.DeviceURN, -1 ); Former >= 0 )
  {
    const VCameraTile& rFormer = m_Tiles[static_cast< std::size_t >( Former )];
    View = { rFormer.Zoom, rFormer.PanX, rFormer.PanY };
    Tile.Rect = rFormer.Rect;
    Tile.Viewport = rFormer.Viewport;
  }
  else if ( m_Restored.contains( Tile.DeviceURN ) )
  {
    View = m_Restored.take( Tile.DeviceURN );
  }
  Tile.Zoom = View.Zoom;
  Tile.PanX = View.PanX;
  Tile.PanY = View.PanY;
  return Tile;
}

VCameraTiles VCameraGrid::MakeTiles()
{
  const VURNs& rFilter = m_bPinned ? m_Pinned : m_Shown;
  QSet< QStringView > Devices;
  for ( const QString& rURN : rFilter )
  {
    Devices.insert( Device( rURN ) );
  }
  VCameraTiles Tiles;
  VURNs Met;
  for ( const VCameraDefinition& rCamera : m_Cameras )
  {
    const QString URN = QString::fromStdString( rCamera.DeviceURN );
    const bool bShown = Devices.isEmpty() || Devices.contains( Device( URN ) );
    if ( bShown && !URN.isEmpty() && !Met.contains( URN ) )
    {
      Met.insert( URN );
      Tiles.push_back( MakeTile( rCamera ) );
    }
  }
  return Tiles;
}

void VCameraGrid::Rebuild()
{
  VCameraTiles Tiles = MakeTiles();
  if ( IsSameCameras( Tiles, m_Tiles ) )
  {
    TakeInPlace( std::move( Tiles ) );
  }
  else
  {
    TakeAnew( std::move( Tiles ) );
  }
  if ( !m_Index.contains( m_PressedURN ) )
  {
    EndGesture();
  }
  const bool bItems = KeepOnly( m_SelectionItems, m_Index );
  if ( KeepOnly( m_AdditionalData, m_Index ) || bItems )
  {
    Report( { TileSelectionItem, TileAdditionalData } );
  }
}

void VCameraGrid::TakeInPlace( VCameraTiles i_Tiles )
{
  if ( i_Tiles.empty() )
  {
    return;
  }
  const float Aspect = AspectRatio();
  bool bVideo = false;
  for ( std::size_t Index = 0; Index < i_Tiles.size(); ++Index )
  {
    bVideo = bVideo || i_Tiles[Index].bVideo != m_Tiles[Index].bVideo;
  }
  m_Tiles.swap( i_Tiles );
  LayOut();
  Report( { TileRect, TileUserId, TileDisplayType } );
  if ( bVideo )
  {
    Report( { TileVideo } );
  }
  if ( AspectRatio() != Aspect )
  {
    emit AspectRatioChanged();
  }
}

void VCameraGrid::TakeAnew( VCameraTiles i_Tiles )
{
  beginResetModel();
  m_Tiles.swap( i_Tiles );
  m_Index.clear();
  for ( std::size_t Index = 0; Index < m_Tiles.size(); ++Index )
  {
    m_Index.insert( m_Tiles[Index].DeviceURN, static_cast< int >( Index ) );
  }
  // Delegates are made at the end of the reset: they find their places and their data.
  LayOut();
  ReadAdditionalData( false );
  endResetModel();
  Report( { TileRect } );
  emit CountChanged();
  emit AspectRatioChanged();
}

void VCameraGrid::LayOut()
{
  for ( VCameraTile& rTile : m_Tiles )
  {
    MeasureRotated( rTile, m_bRotated, m_bSnapped );
  }
  if ( !m_FrameSize.isEmpty() && !m_Tiles.empty() )
  {
    PlaceTiles( m_Tiles, m_FrameSize, ChooseShape( m_Tiles, m_FrameSize ) );
  }
  Touch();
}

void VCameraGrid::Touch()
{
  m_pSnapshot.reset();
  emit ViewsChanged();
}

void VCameraGrid::Report( const QList< int >& i_rRoles )
{
  if ( !m_Tiles.empty() )
  {
    emit dataChanged( index( 0 ), index( Count() - 1 ), i_rRoles );
  }
}

VCameraTilesRef VCameraGrid::Snapshot() const
{
  if ( !m_pSnapshot && !m_Tiles.empty() )
  {
    m_pSnapshot = std::make_shared< const VCameraTiles >( m_Tiles );
  }
  return m_pSnapshot;
}

void VCameraGrid::SetSelectionItems( const ZEK::VSelection& i_rSelection )
{
  QHash< QString, ZEK::VSelectionItem > Devices;
  for ( const ZEK::VSelectionItem& rItem : i_rSelection )
  {
    if ( rItem.Kind == ZEK::ESelectDevice )
    {
      Devices.insert( Device( QString::fromStdString( rItem.Device ) ).toString(), rItem );
    }
  }
  QHash< QString, ZEK::VSelectionItem > Items;
  for ( const VCameraTile& rTile : m_Tiles )
  {
    const auto Found = Devices.constFind( Device( rTile.DeviceURN ).toString() );
    if ( Found != Devices.constEnd() )
    {
      Items.insert( rTile.DeviceURN, *Found );
    }
  }
  if ( Items != m_SelectionItems )
  {
    m_SelectionItems = std::move( Items );
    Report( { TileSelectionItem } );
  }
}

void VCameraGrid::SetAdditionalDataSource( std::shared_ptr< ICameraModelAdditionalDataSource > i_pSource,
                                           std::shared_ptr< ZEK::IPostalService > i_pPostal )
{
  m_SourceConnection.Disconnect();
  m_pSource = std::move( i_pSource );
  if ( m_pSource )
  {
    m_SourceConnection = m_pSource->Changed().Connect(
        [pSelf = QPointer( this )]
        {
          if ( pSelf )
          {
            pSelf->ReadAdditionalData( true );
          }
        },
        std::move( i_pPostal ) );
  }
  ReadAdditionalData( true );
}

void VCameraGrid::ReadAdditionalData( bool i_bReport )
{
  for ( int Row = 0; Row < Count(); ++Row )
  {
    const QString& rURN = m_Tiles[static_cast< std::size_t >( Row )].DeviceURN;
    const QVariantMap Data = m_pSource ? m_pSource->AdditionalData( rURN ) : QVariantMap();
    const auto Former = m_AdditionalData.constFind( rURN );
    const bool bKnown = Former != m_AdditionalData.constEnd();
    if ( bKnown ? *Former == Data : Data.isEmpty() )
    {
      continue;
    }
    m_AdditionalData.insert( rURN, Data );
    if ( i_bReport )
    {
      emit dataChanged( index( Row ), index( Row ), { TileAdditionalData } );
    }
  }
}

float VCameraGrid::AspectRatio() const
{
  return m_Tiles.size() == 1 ? static_cast< float >( m_Tiles.front().RotatedAspect ) : 1.0f;
}

int VCameraGrid::rowCount( const QModelIndex& i_rParent ) const
{
  return i_rParent.isValid() ? 0 : Count();
}

QVariant VCameraGrid::data( const QModelIndex& i_rIndex, int i_Role ) const
{
  if ( !i_rIndex.isValid() || i_rIndex.row() >= Count() || i_rIndex.column() != 0 )
  {
    return {};
  }
  const VCameraTile& rTile = m_Tiles[static_cast< std::size_t >( i_rIndex.row() )];
  switch ( i_Role )
  {
  case TileUserId:
    return QString::number( rTile.UserId );
  case TileDisplayType:
    return rTile.DisplayType;
  case TileDeviceURN:
    return rTile.DeviceURN;
  case TileRect:
  {
    const double Ratio = static_cast< double >( m_PixelRatio );
    const int Top = m_FrameSize.height() - rTile.Rect.y() - rTile.Rect.height();
    return QRectF( rTile.Rect.x() / Ratio, Top / Ratio, rTile.Rect.width() / Ratio, rTile.Rect.height() / Ratio );
  }
  case TileVideo:
    return rTile.bVideo;
  case TileVideoInput:
    return rTile.DeviceURN.startsWith( VideoInput );
  case TileVideoFile:
    return rTile.DeviceURN.startsWith( VideoFile );
  case TileSelectionItem:
  {
    const auto Found = m_SelectionItems.constFind( rTile.DeviceURN );
    return Found == m_SelectionItems.constEnd() ? QVariant() : SelectionValue( *Found );
  }
  case TileAdditionalData:
    return m_AdditionalData.value( rTile.DeviceURN );
  default:
    return {};
  }
}

QHash< int, QByteArray > VCameraGrid::roleNames() const
{
  return { { TileUserId, "tileUserId" },
           { TileType, "tileType" },
           { TileDisplayType, "tileDisplayType" },
           { TileDeviceURN, "tileDeviceURN" },
           { TileRect, "tileRect" },
           { TileVideo, "tileVideo" },
           { TileVideoInput, "tileVideoInput" },
           { TileVideoFile, "tileVideoFile" },
           { TileSelectionItem, "tileSelectionItem" },
           { TileAdditionalData, "tileAdditionalData" } };
}

} // namespace MoxelGraphics

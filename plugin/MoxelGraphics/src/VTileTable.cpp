#include "VTileTable.h"

#include <MoxelGraphics/CameraDistortion.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>

#include <algorithm>

namespace MoxelGraphics
{
namespace
{
float Single( double i_Value )
{
  return static_cast< float >( i_Value );
}

bool SamePlace( const QVector4D& i_rA, const QVector4D& i_rB )
{
  // Exactly: a view that moved by a hair has moved.
  return i_rA.x() == i_rB.x() && i_rA.y() == i_rB.y() && i_rA.z() == i_rB.z() && i_rA.w() == i_rB.w();
}

/// From sensor pixels behind the lens to the frame, about the pixel that stands in the middle of the tile: all that a
/// program adds up is small there, however far the view is zoomed in.
void FillRow( const VSensorView& i_rView, const QRect& i_rTile, const QRect& i_rFrame, float* o_pRow )
{
  const double W = i_rView.SensorSize[0], H = i_rView.SensorSize[1];
  const double FrameW = std::max( i_rFrame.width(), 1 ), FrameH = std::max( i_rFrame.height(), 1 );
  const QVector4D& rView2D = i_rView.View2D;
  const double Sx = 2.0 * rView2D.x() / W * i_rTile.width() / FrameW;
  const double Sy = -2.0 * rView2D.y() / H * i_rTile.height() / FrameH;
  const auto &rTurn = i_rView.Rotation, &rBack = i_rView.RotationInverse;
  const double Ox = W * rView2D.z() - i_rView.RotationCentre[0], Oy = H * rView2D.w() - i_rView.RotationCentre[1];
  const double MiddleX = rBack[0] * Ox + rBack[1] * Oy + i_rView.RotationCentre[0] - 0.5;
  const double MiddleY = rBack[2] * Ox + rBack[3] * Oy + i_rView.RotationCentre[1] - 0.5;
  const auto X = static_cast< float >( i_rTile.x() ), Y = static_cast< float >( i_rTile.y() );
  const std::array< float, 20 > Row{ Single( Sx * rTurn[0] ),
                                     Single( Sx * rTurn[1] ),
                                     Single( Sy * rTurn[2] ),
                                     Single( Sy * rTurn[3] ),
                                     Single( MiddleX ),
                                     Single( MiddleY ),
                                     Single( ( 2.0 * ( i_rTile.x() - i_rFrame.x() ) + i_rTile.width() ) / FrameW - 1 ),
                                     Single( ( 2.0 * ( i_rTile.y() - i_rFrame.y() ) + i_rTile.height() ) / FrameH - 1 ),
                                     i_rView.DistortionCentre[0],
                                     i_rView.DistortionCentre[1],
                                     i_rView.DistortionParameters[0],
                                     i_rView.DistortionParameters[1],
                                     i_rView.DistortionParameters[2],
                                     2 * static_cast< float >( i_rTile.width() ) * rView2D.x() / i_rView.SensorSize[0],
                                     0,
                                     0,
                                     X,
                                     Y,
                                     X + static_cast< float >( i_rTile.width() ),
                                     Y + static_cast< float >( i_rTile.height() ) };
  std::copy( Row.begin(), Row.end(), o_pRow );
}
} // namespace

VTileTable::VTileTable( std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider )
  : m_pProvider( std::move( i_pProvider ) )
{
}

void VTileTable::Collect( const CoreGraphics::VRenderContext& i_rContext, const VSceneOptions& i_rOptions )
{
  if ( m_Collected == m_Tiles.size() )
  {
    m_Tiles.emplace_back();
  }
  VTile& rTile = m_Tiles[m_Collected++];
  rTile = { i_rOptions.OverlayCamera, i_rContext.View2D(), i_rContext.Viewport() };
}

VTileTable::VView& VTileTable::FindView( bool& o_rbSame )
{
  const auto SameTile = []( const VTile& i_rA, const VTile& i_rB )
  {
    return i_rA.Rect == i_rB.Rect && SamePlace( i_rA.View2D, i_rB.View2D ) && i_rA.Camera == i_rB.Camera;
  };
  VView* pOldest = nullptr;
  for ( const auto& rpView : m_Views )
  {
    if ( rpView->Tiles.size() == m_Collected &&
         std::equal( rpView->Tiles.begin(), rpView->Tiles.end(), m_Tiles.begin(), SameTile ) )
    {
      o_rbSame = true;
      return *rpView;
    }
    pOldest = pOldest && pOldest->Used <= rpView->Used ? pOldest : rpView.get();
  }
  o_rbSame = false;
  if ( m_Views.size() < MostViews )
  {
    pOldest = m_Views.emplace_back( std::make_unique< VView >() ).get();
  }
  pOldest->Tiles.assign( m_Tiles.begin(), m_Tiles.begin() + static_cast< std::ptrdiff_t >( m_Collected ) );
  pOldest->Names.resize( m_Collected );
  for ( std::size_t Index = 0; Index < m_Collected; ++Index )
  {
    pOldest->Names[Index] = m_Tiles[Index].Camera.toStdString();
  }
  return *pOldest;
}

void VTileTable::MakeRows( const VView& i_rView, const VSceneOptions& i_rOptions )
{
  m_NewRows.assign( m_pProvider->GetCameras().size() * RowFloats, 0.0F );
  for ( std::size_t Row = 0; Row < m_NewRows.size(); Row += RowFloats )
  {
    m_NewRows[Row + 6] = m_NewRows[Row + 7] = 8; // out of sight
  }
  for ( std::size_t Index = 0; Index < i_rView.Tiles.size(); ++Index )
  {
    const ZEK::VRenderCameraRef pCamera = m_pProvider->GetCamera( i_rView.Names[Index] );
    const std::size_t Row = pCamera ? pCamera->GetInfo().Number * RowFloats : m_NewRows.size();
    if ( Row < m_NewRows.size() )
    {
      const VTile& rTile = i_rView.Tiles[Index];
      FillRow( MakeSensorView( *pCamera, i_rOptions, rTile.View2D ), rTile.Rect, i_rView.Key.Frame, &m_NewRows[Row] );
    }
  }
}

bool VTileTable::Write( CoreGraphics::VRenderContext& io_rContext, VView& io_rView,
                        const std::vector< float >& i_rRows )
{
  io_rView.Rows.clear();
  void* const pTexels = io_rView.Table.Map( io_rContext, i_rRows.size() * sizeof( float ), false );
  if ( !pTexels )
  {
    return false;
  }
  std::copy( i_rRows.begin(), i_rRows.end(), static_cast< float* >( pTexels ) );
  if ( !io_rView.Table.Unmap( io_rContext ) )
  {
    return false;
  }
  io_rView.Rows.assign( i_rRows.begin(), i_rRows.end() );
  return true;
}

CoreGraphics::VTexelBuffer* VTileTable::Prepare( CoreGraphics::VRenderContext& io_rContext,
                                                 const VSceneOptions& i_rOptions )
{
  m_Last = m_Collected;
  if ( m_Collected == 0 || m_pProvider->GetCameras().empty() )
  {
    m_Collected = 0;
    return nullptr;
  }
  const VKey Key{ m_pProvider->GetGeneration(), io_rContext.Viewport(), Distort2D( i_rOptions ),
                  i_rOptions.CameraShowRotated, i_rOptions.CameraSnap90Degrees };
  bool bSame = false;
  VView& rView = FindView( bSame );
  rView.Used = ++m_Clock;
  m_Collected = 0;
  if ( !bSame || Key.Provider == 0 || !( rView.Key == Key ) || !rView.Table.Bind( io_rContext, 0 ) )
  {
    rView.Key = Key;
    MakeRows( rView, i_rOptions );
    const bool bHeld = m_NewRows == rView.Rows && rView.Table.Bind( io_rContext, 0 );
    if ( !bHeld && !Write( io_rContext, rView, m_NewRows ) )
    {
      return nullptr;
    }
  }
  return &rView.Table;
}

} // namespace MoxelGraphics

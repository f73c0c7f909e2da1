#pragma once

#include "CameraTest.h"

#include <MoxelGraphics/CameraDistortion.h>

#include <cmath>
#include <numbers>

namespace FlowTest
{
using MoxelGraphics::VCameraTile;

inline constexpr QSize FrameSize( 600, 400 );
inline constexpr QRgb Empty = 0xFF202020;
inline const std::string Name = "camera:1";

/// How the tile of one camera is looked at.
struct VLook
{
  const char* pName;
  bool bLens, bRotated, bSnapped;
  float Zoom, PanX, PanY;
  bool bES;
};
inline const VLook Looks[] = {
    { "Plain", false, false, false, 0.9F, 0.5F, 0.5F, false },
    { "Lens", true, false, false, 0.9F, 0.5F, 0.5F, true },
    { "Snapped", false, true, true, 0.9F, 0.5F, 0.5F, false },
    { "LensTurnedZoomed", true, true, false, 3.0F, 0.55F, 0.42F, false },
    { "LensSnappedFar", true, true, true, 6.0F, 0.48F, 0.53F, true },
};

inline VCameraCalibration Strong()
{
  VCameraCalibration Value = Calibration();
  Value.RadialParameters = { -1.2e-7, 3e-14 };
  Value.DistortionCentre[0] = 651;
  Value.DistortionCentre[1] = 498;
  return Value;
}

/// Where a centroid is to be seen, in pixels of the frame, y down; from the values of the items alone.
inline QPointF Expected( double i_X, double i_Y, const VCameraCalibration& i_rLens, const VLook& i_rLook,
                         const VCameraTile& i_rTile )
{
  const double W = 1280, H = 1024, Cx = i_rLens.DistortionCentre[0], Cy = i_rLens.DistortionCentre[1];
  if ( i_rLook.bLens )
  {
    const double D = ( i_X - Cx ) * ( i_X - Cx ) + ( i_Y - Cy ) * ( i_Y - Cy );
    const double Factor = 1 + D * ( i_rLens.RadialParameters[0] + D * i_rLens.RadialParameters[1] );
    i_X = Cx + ( i_X - Cx ) * Factor;
    i_Y = Cy + ( i_Y - Cy ) * Factor;
  }
  double Dx = i_X + 0.5 - Cx, Dy = i_Y + 0.5 - Cy;
  if ( i_rLook.bRotated )
  {
    // How far the image turns for the world's z to be up: of the rotation's matrix, by Rodrigues.
    const D3& rTurn = i_rLens.Rotation;
    const double Angle = std::hypot( rTurn.x, rTurn.y, rTurn.z ), C = std::cos( Angle ), S = std::sin( Angle );
    const double Kx = rTurn.x / Angle, Ky = rTurn.y / Angle, Kz = rTurn.z / Angle;
    double Roll = std::atan2( Kz * Kx * ( 1 - C ) + Ky * S, -( Kz * Ky * ( 1 - C ) - Kx * S ) );
    if ( i_rLook.bSnapped )
    {
      Roll = std::round( Roll * 2 / std::numbers::pi ) * std::numbers::pi / 2;
    }
    const double X = Dx, Y = Dy;
    Dx = std::cos( Roll ) * X + std::sin( Roll ) * Y;
    Dy = -std::sin( Roll ) * X + std::cos( Roll ) * Y;
  }
  const double Zoom = static_cast< double >( i_rTile.Zoom );
  const double U = ( ( Cx + Dx ) / W - static_cast< double >( i_rTile.PanX ) ) * i_rTile.ScaleX * Zoom + 0.5;
  const double V = ( ( Cy + Dy ) / H - static_cast< double >( i_rTile.PanY ) ) * i_rTile.ScaleY * Zoom + 0.5;
  const QRect& rRect = i_rTile.Rect;
  return { rRect.x() + U * rRect.width(), FrameSize.height() - rRect.y() - rRect.height() + V * rRect.height() };
}

inline VGreyscaleBlobSet Blobs( int i_X, int i_Y, int i_Side, int i_First = 40 )
{
  VGreyscaleBlobSet Set;
  Set.Blobs.push_back( { 0, static_cast< u32 >( i_Side ) } );
  for ( int Row = 0; Row < i_Side; ++Row )
  {
    Set.Lines.push_back( { static_cast< u16 >( i_X ), static_cast< u16 >( i_Y + Row ), static_cast< u16 >( i_Side ),
                           static_cast< u32 >( Set.Pixels.size() ) } );
    for ( int Column = 0; Column < i_Side; ++Column )
    {
      Set.Pixels.push_back( static_cast< u8 >( i_First + Row * 4 + Column * 4 ) );
    }
  }
  return Set;
}
/// A frame of two tiles that stand side by side, each of one camera.
class VCameraView : public testing::TestWithParam< VLook >
{
protected:
  void Make( const VLook& i_rLook )
  {
    QSurfaceFormat Format = QSurfaceFormat::defaultFormat();
    if ( i_rLook.bES )
    {
      Format = QSurfaceFormat();
      Format.setRenderableType( QSurfaceFormat::OpenGLES );
      Format.setVersion( 3, 0 );
    }
    pOffscreen = std::make_unique< MoxelGraphics::VOffscreen >( !i_rLook.bES, Format );
    pScene = std::make_shared< VScene >();
    pFrame =
        std::make_unique< MoxelGraphics::VSceneFrame >( pScene, std::make_shared< CoreGraphics::VCameraController >() );
    auto& rOptions = Options();
    rOptions.CameraView = true;
    rOptions.Show3DOverlay = i_rLook.bLens;
    rOptions.FloorGrid = rOptions.GlobalAxis = rOptions.Cameras = rOptions.Reconstructions = false;
    rOptions.CameraShowRotated = i_rLook.bRotated;
    rOptions.CameraSnap90Degrees = i_rLook.bSnapped;
    Tiles.assign( 2, {} );
    for ( int Index = 0; Index < 2; ++Index )
    {
      VCameraTile& rTile = Tiles[static_cast< std::size_t >( Index )];
      rTile.DeviceURN = QStringLiteral( "camera:%1" ).arg( 1 + Index );
      rTile.ImageWidth = 1280;
      rTile.ImageHeight = 1024;
      rTile.Rect = rTile.Viewport = QRect( 300 * Index, 17, 300, 383 );
      rTile.ScaleX = 1;
      rTile.ScaleY = 300.0F / 383 * 1024 / 1280;
      rTile.Zoom = i_rLook.Zoom;
      rTile.PanX = i_rLook.PanX;
      rTile.PanY = i_rLook.PanY;
    }
  }
  void TearDown() override
  {
    if ( pOffscreen )
    {
      pOffscreen->MakeCurrent();
      pFrame.reset();
    }
  }
  MoxelGraphics::VSceneOptions& Options() { return pFrame->Input().Options; }
  void Show( const std::vector< VFlowItemRef >& i_rItems )
  {
    State = Maker.State( ++Number, i_rItems );
    pScene->State = State;
    pScene->MarkDirty();
  }
  QImage Draw()
  {
    pFrame->Input().Tiles = std::make_shared< const MoxelGraphics::VCameraTiles >( Tiles );
    return pOffscreen->Draw( *pFrame, FrameSize );
  }
  ZEK::VSelection Pick( QPoint i_From, QPoint i_To, int i_Mode )
  {
    pFrame->Input().PickMode = i_Mode;
    pFrame->Input().BandStart = i_From;
    pFrame->Input().Pointer = i_To;
    Draw();
    pFrame->Input().PickMode = MoxelGraphics::EPickNone;
    return pFrame->Result().Selection;
  }
  std::vector< VFlowItemRef > Cameras()
  {
    return { Maker.Device< FlowCameraHardware >( Hardware(), "camera:1" ),
             Maker.Device< FlowCameraHardware >( Hardware(), "camera:2" ),
             Maker.Device< FlowCameraCalibration >( Strong(), "camera:1" ),
             Maker.Device< FlowCameraCalibration >( Strong(), "camera:2" ) };
  }
  template < typename TFlow >
  VFlowItemRef Item( const typename ZEK::FlowValueType< TFlow >::type& i_rValue, const std::string& i_rName = Name )
  {
    return Maker.Device< TFlow >( i_rValue, i_rName );
  }
  void ShowAll( std::initializer_list< VFlowItemRef > i_Items )
  {
    std::vector< VFlowItemRef > Items = Cameras();
    Items.insert( Items.end(), i_Items.begin(), i_Items.end() );
    Show( Items );
  }

  VMaker Maker;
  ZEK::VFlowStateRef State;
  std::int64_t Number = 0;
  std::unique_ptr< MoxelGraphics::VOffscreen > pOffscreen;
  std::shared_ptr< VScene > pScene;
  std::unique_ptr< MoxelGraphics::VSceneFrame > pFrame;
  MoxelGraphics::VCameraTiles Tiles;
};

} // namespace FlowTest

#pragma once

#include "FrameFixture.h"

#include <MoxelGraphics/VCameraTile.h>
#include <MoxelGraphics/VRenderCameraBackdrop.h>

#include <ComputeCameraModel/VCameraModel.h>
#include <CoreMoxelTypes/Camera.h>
#include <ZEK/RenderCamera.h>

#include <array>
#include <optional>

namespace MoxelGraphics
{

/// A camera that is what a test says.
class VTestCamera final : public ZEK::IRenderCamera
{
public:
  const std::string& GetName() const override { return Name; }
  const ComputeCameraModel::VCameraModel& GetModel() const override { return Model; }
  const std::string& GetDisplayName() const override { return Name; }
  bool GetGreyscaleFlag() const override { return false; }
  bool GetVideoFlag() const override { return false; }
  const CoreMoxelTypes::VVideoFrame* GetVideoFrame() const override { return Video ? &*Video : nullptr; }
  const CoreMoxelTypes::VImageSet* GetImageSet( std::uint64_t& o_rId ) const override
  {
    o_rId = ImagesId;
    return ImagesId != 0 ? &Images : nullptr;
  }
  void GetDrawData2D( std::uint32_t, ZEK::ECentroidColourScheme, bool, ZEK::VCameraLists2D&,
                      ZEK::VDrawWords& ) const override
  {
  }
  void GetDrawData3D( ZEK::VDrawWords&, ZEK::VCameraLists3D&, ZEK::ECentroidColourScheme ) const override {}
  const ZEK::VRenderCameraInfo& GetInfo() const override { return Info; }

  std::string Name = "a";
  ComputeCameraModel::VCameraModel Model;
  ZEK::VRenderCameraInfo Info;
  std::optional< CoreMoxelTypes::VVideoFrame > Video;
  CoreMoxelTypes::VImageSet Images;
  std::uint64_t ImagesId = 0;
};

class VTestProvider final : public ZEK::IRenderCameraProvider
{
public:
  ZEK::VRenderCameraRef GetCamera( const std::string& i_rName ) const override
  {
    const auto It = std::find_if( List.begin(), List.end(),
                                  [&]( const auto& i_rpCamera )
                                  {
                                    return i_rpCamera->GetName() == i_rName;
                                  } );
    return It == List.end() ? nullptr : *It;
  }
  const std::vector< ZEK::VRenderCameraRef >& GetCameras() const override { return List; }

  std::vector< ZEK::VRenderCameraRef > List;
};

/// Points in the world, seen by one camera.
class VBackdropScene : public VTestScene
{
public:
  void Initialise( CoreGraphics::VRenderContext& io_rContext ) override
  {
    VTestScene::Initialise( io_rContext );
    if ( !pBackdrop && CanDraw() )
    {
      pBackdrop = std::make_shared< VRenderCameraBackdrop >( *this, pProvider );
      m_RenderList.push_back( pBackdrop );
      m_pBackdrop = pBackdrop;
    }
  }
  /// As a provider of cameras does after a change.
  void Tell()
  {
    std::vector< VCameraDefinition > Definitions;
    for ( const auto& rpCamera : pProvider->List )
    {
      VCameraDefinition& rDefinition = Definitions.emplace_back();
      rDefinition.DeviceURN = rpCamera->GetName();
      rDefinition.ImageWidth = static_cast< std::int32_t >( rpCamera->GetInfo().SensorWidth );
      rDefinition.ImageHeight = static_cast< std::int32_t >( rpCamera->GetInfo().SensorHeight );
    }
    SetCameraDefinitions( Definitions );
  }

  const std::shared_ptr< VTestProvider > pProvider = std::make_shared< VTestProvider >();
  std::shared_ptr< VRenderCameraBackdrop > pBackdrop;
};

/// A lens in double precision, apart from the model that draws: a place in the camera's own axes to a place on the
/// sensor, and the world's place of one.
struct VTestLens
{
  static constexpr double Focal = 500, Px = 325, Py = 236, Cx = 330, Cy = 250, K1 = 4e-7, K2 = 1e-13;
  static constexpr std::array< double, 3 > Turn{ -1.4, 0.3, 0.2 }, Position{ 200, -3000, 1000 };

  static CoreMoxelTypes::VCameraCalibration Calibration()
  {
    CoreMoxelTypes::VCameraCalibration Value;
    Value.Rotation = { Turn[0], Turn[1], Turn[2] };
    Value.Position = { Position[0], Position[1], Position[2] };
    Value.PrincipalPoint[0] = Px;
    Value.PrincipalPoint[1] = Py;
    Value.RadialParameters = { K1, K2 };
    Value.DistortionCentre[0] = Cx;
    Value.DistortionCentre[1] = Cy;
    Value.FocalLength = Focal;
    return Value;
  }
  /// Where a lens without distortion shows what the sensor sees at a place.
  static QPointF Corrected( QPointF i_Raw )
  {
    const double X = i_Raw.x() - Cx, Y = i_Raw.y() - Cy, D = X * X + Y * Y;
    return QPointF( Cx, Cy ) + QPointF( X, Y ) * ( 1 + D * ( K1 + D * K2 ) );
  }
  /// A point of the world at that depth, shown there by a lens without distortion.
  static VScenePoint World( QPointF i_Corrected, double i_Depth )
  {
    const std::array< double, 3 > Camera{ ( i_Corrected.x() - Px ) / Focal * i_Depth,
                                          ( i_Corrected.y() - Py ) / Focal * i_Depth, i_Depth };
    // Back from the camera: turned about the axis the other way.
    const double Angle = std::hypot( Turn[0], Turn[1], Turn[2] );
    const std::array< double, 3 > Axis{ Turn[0] / Angle, Turn[1] / Angle, Turn[2] / Angle };
    const double Along = Axis[0] * Camera[0] + Axis[1] * Camera[1] + Axis[2] * Camera[2];
    const double C = std::cos( -Angle ), S = std::sin( -Angle );
    std::array< float, 3 > Place;
    for ( std::size_t Index = 0; Index < 3; ++Index )
    {
      const std::size_t Next = ( Index + 1 ) % 3, Last = ( Index + 2 ) % 3;
      const double Cross = Axis[Next] * Camera[Last] - Axis[Last] * Camera[Next];
      Place[Index] =
          static_cast< float >( Position[Index] + C * Camera[Index] + S * Cross + ( 1 - C ) * Along * Axis[Index] );
    }
    return { Place[0], Place[1], Place[2], 0 };
  }
};

/// One tile of one camera of 640 by 480, in a context of either kind.
class VBackdropTest : public testing::TestWithParam< bool >
{
protected:
  static constexpr int W = 640, H = 480;

  static QSurfaceFormat Format( bool i_bES )
  {
    QSurfaceFormat Wanted = QSurfaceFormat::defaultFormat();
    if ( i_bES )
    {
      Wanted.setRenderableType( QSurfaceFormat::OpenGLES );
      Wanted.setProfile( QSurfaceFormat::NoProfile );
      Wanted.setVersion( 3, 0 );
    }
    return Wanted;
  }
  explicit VBackdropTest( bool i_bES = false )
    : Offscreen( !i_bES, Format( i_bES ) )
  {
    pFrame = std::make_unique< VSceneFrame >( pScene, std::make_shared< CoreGraphics::VCameraController >() );
    Sensor( W, H );
    pScene->pProvider->List = { pCamera };
    pScene->Tell();
    Tile.DeviceURN = QStringLiteral( "a" );
    Tile.Zoom = 1;
    Options().CameraView = true;
    Options().FloorGrid = false;
    Options().CameraShowRotated = false;
    Options().ReconstructionScale = 4;
  }
  ~VBackdropTest() override
  {
    Offscreen.MakeCurrent();
    pFrame.reset();
    pScene.reset();
  }

  void Sensor( int i_Width, int i_Height )
  {
    pCamera->Info.SensorWidth = static_cast< std::uint32_t >( i_Width );
    pCamera->Info.SensorHeight = static_cast< std::uint32_t >( i_Height );
    Tile.ImageWidth = i_Width;
    Tile.ImageHeight = i_Height;
    Tile.Rect = Tile.Viewport = QRect( 0, 0, i_Width, i_Height );
    FrameSize = { i_Width, i_Height };
  }
  void Calibrate()
  {
    CoreMoxelTypes::VCameraHardware Hardware;
    Hardware.SensorWidth = W;
    Hardware.SensorHeight = H;
    pCamera->Model.Set( Hardware, VTestLens::Calibration() );
    ASSERT_TRUE( pCamera->Model.IsFinite() );
    pCamera->Info.bCalibrated = true;
  }
  VSceneOptions& Options() { return pFrame->Input().Options; }
  QImage Draw()
  {
    pFrame->Input().Tiles = std::make_shared< const VCameraTiles >( VCameraTiles{ Tile } );
    return Offscreen.Draw( *pFrame, FrameSize );
  }
  VIds Pick( QPoint i_Point )
  {
    pFrame->Input().PickMode = EPickHover;
    pFrame->Input().Pointer = i_Point;
    Draw();
    pFrame->Input().PickMode = EPickNone;
    return pFrame->Result().Ids;
  }
  VIds Band( const QRect& i_rBand )
  {
    pFrame->Input().BandStart = i_rBand.topLeft();
    pFrame->Input().PickMode = EPickBandDone;
    pFrame->Input().Pointer = i_rBand.topLeft() + QPoint( i_rBand.width(), i_rBand.height() );
    Draw();
    pFrame->Input().PickMode = EPickNone;
    return pFrame->Result().Ids;
  }
  void Video( CoreMoxelTypes::VVideoFrame i_Frame ) { pCamera->Video = std::move( i_Frame ); }
  /// A frame of one grey.
  static CoreMoxelTypes::VVideoFrame Grey( std::uint8_t i_Level, std::uint32_t i_Width, std::uint32_t i_Height )
  {
    CoreMoxelTypes::VVideoFrame Frame;
    Frame.Width = Frame.Stride[0] = i_Width;
    Frame.Height = i_Height;
    Frame.Data = std::make_shared< const std::vector< std::uint8_t > >( std::size_t{ i_Width } * i_Height, i_Level );
    return Frame;
  }
  /// Where the tile shows a place of the sensor, in pixels of the picture from its top left.
  QPointF Shown( QPointF i_Sensor ) const
  {
    const double X = 0.5 + Tile.ScaleX * Tile.Zoom * ( ( i_Sensor.x() + 0.5 ) / W - Tile.PanX );
    const double Y = 0.5 + Tile.ScaleY * Tile.Zoom * ( ( i_Sensor.y() + 0.5 ) / H - Tile.PanY );
    return { Tile.Rect.x() + X * Tile.Rect.width(),
             FrameSize.height() - Tile.Rect.y() - Tile.Rect.height() + Y * Tile.Rect.height() };
  }
  /// The middle of the pixels that have the colour of a point; no place where there are none.
  static QPointF Found( const QImage& i_rImage )
  {
    double X = 0, Y = 0, Count = 0;
    for ( int Row = 0; Row < i_rImage.height(); ++Row )
    {
      for ( int Column = 0; Column < i_rImage.width(); ++Column )
      {
        const QRgb Pixel = i_rImage.pixel( Column, Row );
        if ( qRed( Pixel ) > qGreen( Pixel ) + 20 && std::abs( qRed( Pixel ) - qBlue( Pixel ) ) < 6 )
        {
          X += Column + 0.5;
          Y += Row + 0.5;
          ++Count;
        }
      }
    }
    return Count > 0 ? QPointF( X / Count, Y / Count ) : QPointF( -1e6, -1e6 );
  }

  VOffscreen Offscreen;
  std::shared_ptr< VBackdropScene > pScene = std::make_shared< VBackdropScene >();
  std::shared_ptr< VTestCamera > pCamera = std::make_shared< VTestCamera >();
  std::unique_ptr< VSceneFrame > pFrame;
  VCameraTile Tile;
  QSize FrameSize;
};

} // namespace MoxelGraphics

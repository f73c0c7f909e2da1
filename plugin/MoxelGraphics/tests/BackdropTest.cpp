#include "BackdropFixture.h"

#include <MoxelGraphics/CameraDistortion.h>

#include <CoreVideoUtils/VideoPlanes.h>
#include <CoreVideoUtils/VideoTestPattern.h>
#include <TestSupport/Golden.h>
#include <TestSupport/LogGuard.h>
#include <TestSupport/VideoReference.h>

namespace MoxelGraphics
{
namespace
{
using CoreMoxelTypes::EPixelFormat;
using CoreMoxelTypes::VVideoFrame;

/// In a context of either kind.
class VEveryContext : public VBackdropTest
{
protected:
  VEveryContext()
    : VBackdropTest( GetParam() )
  {
  }
};
INSTANTIATE_TEST_SUITE_P( Contexts, VEveryContext, testing::Bool(),
                          []( const auto& i_rInfo )
                          {
                            return i_rInfo.param ? "ES" : "Desktop";
                          } );

int Middle( const QImage& i_rImage )
{
  return qRed( i_rImage.pixel( i_rImage.width() / 2, i_rImage.height() / 2 ) );
}
} // namespace

TEST_P( VEveryContext, ColoursOfEachFormatAreThoseOfTheDefinition )
{
  Options().Show3DOverlay = false;
  for ( std::uint32_t Format = 0; Format < CoreVideoUtils::PixelFormatCount; ++Format )
  {
    for ( const auto& [Width, Height] : { std::pair{ 64, 48 }, { 37, 23 }, { 24, 720 } } )
    {
      Sensor( Width, Height );
      const VVideoFrame Frame =
          TestSupport::NoiseFrame( static_cast< EPixelFormat >( Format ), static_cast< std::uint32_t >( Width ),
                                   static_cast< std::uint32_t >( Height ), Format );
      const TestSupport::VVideoReference Reference( Frame );
      for ( const bool bTurned : { false, true } )
      {
        Video( Frame );
        pCamera->Video->Flags = bTurned ? CoreVideoUtils::VideoBottomUp : 0;
        const QImage Image = Draw();
        ASSERT_EQ( Offscreen.IsES(), GetParam() );
        double Worst = 0;
        for ( int Y = 0; Y < Height; ++Y )
        {
          for ( int X = 0; X < Width; ++X )
          {
            const QRgb Seen = Image.pixel( X, bTurned ? Height - 1 - Y : Y );
            const auto Expected = Reference.At( X, Y );
            Worst = std::max( { Worst, std::abs( qRed( Seen ) - Expected[0] ), std::abs( qGreen( Seen ) - Expected[1] ),
                                std::abs( qBlue( Seen ) - Expected[2] ) } );
          }
        }
        EXPECT_LE( Worst, 3 ) << Format << ' ' << Width << " x " << Height << ( bTurned ? " turned" : "" );
      }
    }
  }
}

TEST_P( VEveryContext, SettingsOfACameraAndOfTheDeveloper )
{
  Options().Show3DOverlay = false;
  VVideoFrame Bars;
  ASSERT_EQ( CoreVideoUtils::ColourBars( EPixelFormat::YUYV, W, H, Bars ), ZEK::IResult::Ok );
  Video( Bars );
  const auto Yellow = [&]
  {
    return Draw().pixel( 120, 100 );
  };
  EXPECT_LE( Distance( Yellow(), qRgb( 255, 255, 0 ) ), 4 );
  pCamera->Info.VideoSaturation = 0.5F;
  EXPECT_LE( Distance( Yellow(), qRgb( 240, 240, 113 ) ), 5 ) << "halfway to its luma of 226";
  Options().DebugVideo = 2;
  EXPECT_LE( Distance( Yellow(), qRgb( 255, 255, 0 ) ), 4 );
  Options().DebugVideo = 1;
  EXPECT_LE( Distance( Yellow(), qRgb( 226, 226, 226 ) ), 5 );
  Options().DebugVideo = 0;
  Video( Grey( 64, 8, 8 ) );
  EXPECT_NEAR( Middle( Draw() ), 64, 1 ) << "stretched over the whole sensor";
  pCamera->Info.GammaCorrection = 2;
  EXPECT_NEAR( Middle( Draw() ), 128, 2 );
  // A mosaic as it came has no colours.
  const VVideoFrame Mosaic = TestSupport::NoiseFrame( EPixelFormat::BayerGBRG8, W, H, 3 );
  Video( Mosaic );
  Options().DebugVideo = 1;
  EXPECT_NEAR( Middle( Draw() ), ( *Mosaic.Data )[Mosaic.Offset[0] + Mosaic.Stride[0] * H / 2 + W / 2], 1 );
  Options().Video = false;
  EXPECT_EQ( Draw().pixel( W / 2, H / 2 ), Background );
}

TEST_P( VEveryContext, AFrameLiesWhereItSaysOrOverTheWholeSensor )
{
  Options().Show3DOverlay = false;
  // Left dark, right bright: stretched in both directions, whether it is larger or smaller than the sensor.
  for ( const auto& [Width, Height] : { std::pair{ 100u, 700u }, { 1000u, 40u } } )
  {
    VVideoFrame Frame = Grey( 40, Width, Height );
    auto Bytes = *Frame.Data;
    for ( std::size_t Pixel = 0; Pixel < Bytes.size(); ++Pixel )
    {
      Bytes[Pixel] = static_cast< std::uint8_t >( ( Pixel % Width >= Width * 3 / 4 ? 100 : 0 ) +
                                                  ( Pixel / Width >= Height * 3 / 4 ? 50 : 0 ) + 40 );
    }
    Frame.Data = std::make_shared< const std::vector< std::uint8_t > >( Bytes );
    Video( Frame );
    const QImage Image = Draw();
    EXPECT_EQ( qRed( Image.pixel( 2, 2 ) ), 40 );
    EXPECT_EQ( qRed( Image.pixel( W * 3 / 4 - 8, H * 3 / 4 - 16 ) ), 40 );
    EXPECT_EQ( qRed( Image.pixel( W * 3 / 4 + 8, 2 ) ), 140 );
    EXPECT_EQ( qRed( Image.pixel( 2, H * 3 / 4 + 16 ) ), 90 );
    EXPECT_EQ( qRed( Image.pixel( W - 1, H - 1 ) ), 190 );
  }
  // 100 by 50 pixels, each 4 by 3 of the sensor's, the first one around (100, 60): from 98.5 to 498.5.
  VVideoFrame Part = Grey( 200, 100, 50 );
  Part.SensorOffset = { 100, 60 };
  Part.SensorScale = { 4, 3 };
  Video( Part );
  const QImage Image = Draw();
  EXPECT_EQ( Image.pixel( 97, 100 ), qRgb( 0, 0, 0 ) ) << "the rest of the sensor is black";
  EXPECT_EQ( qRed( Image.pixel( 99, 100 ) ), 200 );
  EXPECT_EQ( qRed( Image.pixel( 497, 100 ) ), 200 );
  EXPECT_EQ( qRed( Image.pixel( 499, 100 ) ), 0 );
  EXPECT_EQ( qRed( Image.pixel( 200, 58 ) ), 0 );
  EXPECT_EQ( qRed( Image.pixel( 200, 60 ) ), 200 );
  EXPECT_EQ( qRed( Image.pixel( 200, 208 ) ), 200 );
  EXPECT_EQ( qRed( Image.pixel( 200, 210 ) ), 0 );
  // Nonsense is no place.
  pCamera->Video->SensorScale = { -1, std::nanf( "" ) };
  EXPECT_NEAR( qRed( Draw().pixel( 2, 2 ) ), 200, 1 );
}

TEST_P( VEveryContext, ImagesAreFoundByTheirTagsAndLieOverTheVideo )
{
  Options().Show3DOverlay = false;
  Video( Grey( 100, W, H ) );
  const auto Image = []( const char* i_pTag, std::vector< std::uint8_t > i_Pixel )
  {
    return CoreMoxelTypes::VImageSet::I{ i_pTag, 1, 1, static_cast< std::uint32_t >( i_Pixel.size() ), i_Pixel };
  };
  pCamera->Images.Images = { Image( "Threshold", { 200 } ), Image( "edge Map", { 0, 255, 0, 128 } ) };
  pCamera->ImagesId = 1;
  const auto Colour = [&]
  {
    return Draw().pixel( 7, 7 );
  };
  EXPECT_LE( Distance( Colour(), qRgb( 100, 228, 100 ) ), 1 );
  Options().ImageSetSearchExpression = QStringLiteral( "THRESH" );
  EXPECT_EQ( Colour(), qRgb( 200, 200, 200 ) );
  Options().ImageSetOpacity = 0.25F;
  EXPECT_LE( Distance( Colour(), qRgb( 125, 125, 125 ) ), 1 );
  Options().ImageSetSearchExpression = QStringLiteral( "none" );
  EXPECT_EQ( Colour(), qRgb( 100, 100, 100 ) );
  Options().ImageSetSearchExpression.clear();
  Options().ImageSetOpacity = 0;
  EXPECT_EQ( Colour(), qRgb( 100, 100, 100 ) );
  // Another set; what is wrong in it is told once and left out.
  Options().ImageSetOpacity = 1;
  pCamera->Images.Images = { Image( "good", { 9, 8, 7 } ), Image( "bad", { 1, 2, 3, 4, 5 } ) };
  pCamera->ImagesId = 2;
  EXPECT_EQ( Colour(), qRgb( 9, 8, 7 ) );
  Draw();
  EXPECT_EQ( TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogWarning ).size(), 1u );
}

using VBackdrop = VBackdropTest;

TEST_F( VBackdrop, WhatDoesNotHoldTogetherIsToldOnceAndShown )
{
  Options().Show3DOverlay = false;
  VVideoFrame Short = TestSupport::NoiseFrame( EPixelFormat::I420, 64, 48, 1 );
  Short.Data = std::make_shared< const std::vector< std::uint8_t > >( 3000, 200 );
  VVideoFrame Narrow = Grey( 200, 64, 48 );
  Narrow.Stride[0] = 63;
  VVideoFrame Unknown = Grey( 200, 64, 48 );
  Unknown.Format = static_cast< EPixelFormat >( 77 );
  VVideoFrame Huge = Grey( 200, 32768, 1 );
  std::size_t Lines = 0;
  for ( const VVideoFrame& rBad : { Short, Narrow, Unknown, Huge } )
  {
    Video( rBad );
    EXPECT_EQ( Draw().pixel( W / 2, H / 2 ), qRgb( 64, 5, 5 ) );
    Draw();
    EXPECT_EQ( TestSupport::LogTexts( "MoxelGraphics", ZEK::ELogWarning ).size(), ++Lines );
  }
  Video( Grey( 80, 64, 48 ) );
  EXPECT_EQ( Middle( Draw() ), 80 );
  pCamera->Video.reset();
  EXPECT_EQ( Draw().pixel( W / 2, H / 2 ), Background );
  // Cameras that are not there, or have no sensor.
  Video( Grey( 80, 64, 48 ) );
  pCamera->Info.SensorWidth = 0;
  EXPECT_EQ( Draw().pixel( W / 2, H / 2 ), Background );
  for ( const char* pName : { "vi:", "vf:", "b" } )
  {
    Tile.DeviceURN = QString::fromLatin1( pName );
    EXPECT_EQ( Draw().pixel( W / 2, H / 2 ), Background );
  }
}

TEST_F( VBackdrop, PixelsAreTakenAlongOnceAndGoWithTheirCamera )
{
  Video( Grey( 100, 64, 48 ) );
  Draw();
  const auto& rpBackdrop = pScene->pBackdrop;
  EXPECT_EQ( rpBackdrop->BytesUploaded(), 64u * 48 );
  Draw();
  const VVideoFrame Copy = *pCamera->Video; // the same pixels in another item
  Video( Copy );
  pCamera->Video->PresentationTime = 2;
  pCamera->Video->Flags = CoreVideoUtils::VideoBottomUp;
  Draw();
  EXPECT_EQ( rpBackdrop->BytesUploaded(), 64u * 48 );
  Video( Grey( 120, 64, 48 ) );
  EXPECT_EQ( Middle( Draw() ), 120 );
  EXPECT_EQ( rpBackdrop->BytesUploaded(), 2u * 64 * 48 );
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 64u * 48 );
  Video( TestSupport::NoiseFrame( EPixelFormat::I420, 32, 16, 1 ) ); // another size in the same textures
  Draw();
  EXPECT_EQ( rpBackdrop->BytesUploaded(), 2u * 64 * 48 + 32 * 16 * 3 / 2 );
  // Off, and while it is picked, nothing is taken.
  Options().Video = false;
  Video( Grey( 7, 64, 48 ) );
  Pick( { 100, 100 } );
  EXPECT_EQ( rpBackdrop->BytesUploaded(), 2u * 64 * 48 + 32 * 16 * 3 / 2 );
  EXPECT_EQ( rpBackdrop->CameraCount(), 1u );
  // Another camera of the same name is another one; gone, it leaves nothing, even when no tile asks for it.
  Options().Video = true;
  pCamera = std::make_shared< VTestCamera >();
  Sensor( W, H );
  Video( Grey( 30, 64, 48 ) );
  pScene->pProvider->List = { pCamera };
  EXPECT_EQ( Middle( Draw() ), 30 );
  EXPECT_EQ( rpBackdrop->CameraCount(), 1u );
  pScene->pProvider->List.clear();
  pScene->Tell();
  Options().CameraView = false;
  Draw();
  EXPECT_EQ( rpBackdrop->CameraCount(), 0u );
}

TEST_P( VEveryContext, TheWorldLiesOverTheImageWhereTheLensShowsIt )
{
  Calibrate();
  Video( Grey( 0, W, H ) );
  struct VCase
  {
    QPointF Raw; // sensor pixels
    QRect Rect;
    float Zoom, PanX, PanY;
  };
  // The middle, places next to the corners, which a lens without distortion shows beside the sensor; zoomed; a tile
  // of odd size beside the frame's corner.
  const QRect All( 0, 0, W, H ), Part( 41, 33, 501, 377 );
  const VCase Cases[] = { { { 325, 236 }, All, 1, 0.5F, 0.5F },    { { 14, 15 }, All, 1, 0.5F, 0.5F },
                          { { 625, 12 }, All, 1, 0.5F, 0.5F },     { { 622, 466 }, All, 0.9F, 0.5F, 0.5F },
                          { { 120, 400 }, All, 3, 0.25F, 0.75F },  { { 30, 440 }, Part, 1, 0.5F, 0.5F },
                          { { 600, 100 }, Part, 2.5F, 0.8F, 0.3F } };
  for ( const VCase& rCase : Cases )
  {
    SCOPED_TRACE( testing::Message() << rCase.Raw.x() << ", " << rCase.Raw.y() << " zoom " << rCase.Zoom );
    Tile.Rect = Tile.Viewport = rCase.Rect;
    Tile.Zoom = rCase.Zoom;
    Tile.PanX = rCase.PanX;
    Tile.PanY = rCase.PanY;
    const QPointF Corrected = VTestLens::Corrected( rCase.Raw );
    pScene->Change( { VTestLens::World( Corrected, 3000 ) } );
    for ( const double Opacity : { 1.0, 0.6 } )
    {
      Options().Opacity3DOverlay = Opacity;
      Options().Distort3D = true;
      const QPointF Bent = Found( Draw() ), Expected = Shown( rCase.Raw );
      EXPECT_LE( std::hypot( Bent.x() - Expected.x(), Bent.y() - Expected.y() ), 1 ) << Bent.x() << ", " << Bent.y();
      // It is picked where it is seen.
      EXPECT_EQ( Pick( Expected.toPoint() ).size(), 1u );
      EXPECT_TRUE( Pick( Expected.toPoint() + QPoint( rCase.Raw.x() < W / 2.0 ? 45 : -45, 0 ) ).empty() );
      Options().Distort3D = false;
      const QPointF Straight = Shown( Corrected ), Seen = Found( Draw() );
      if ( QRectF( rCase.Rect )
               .adjusted( 12, 12, -12, -12 )
               .contains( { Straight.x(), FrameSize.height() - Straight.y() } ) )
      {
        EXPECT_LE( std::hypot( Seen.x() - Straight.x(), Seen.y() - Straight.y() ), 1 );
        EXPECT_EQ( Pick( Straight.toPoint() ).size(), 1u );
      }
    }
  }
}

TEST_F( VBackdrop, ABandTakesWhatTheLensShowsInIt )
{
  Calibrate();
  Options().Distort3D = true;
  // A frame of points along the borders of the sensor: without the lens the larger picture would hold them farther in.
  std::vector< VScenePoint > Points;
  for ( int Step = 0; Step < 5; ++Step )
  {
    for ( const QPointF& rRaw : { QPointF( 20 + 150 * Step, 15 ), QPointF( 20 + 150 * Step, 465 ),
                                  QPointF( 15, 70 + 80 * Step ), QPointF( 625, 70 + 80 * Step ) } )
    {
      Points.push_back( VTestLens::World( VTestLens::Corrected( rRaw ), 3000 ) );
    }
  }
  pScene->Change( Points );
  EXPECT_EQ( Band( { 0, 0, W, H } ).size(), Points.size() );
  EXPECT_EQ( Band( { 0, 0, W, 34 } ).size(), 5u );
  EXPECT_TRUE( Band( { 34, 34, W - 68, H - 68 } ).empty() );
  Options().Distort3D = false;
  EXPECT_TRUE( Band( { 60, 60, W - 120, H - 120 } ).empty() );
}

TEST_F( VBackdrop, AFreeViewThroughACameraShowsAllOfItsImageInTheMiddle )
{
  Calibrate();
  pScene->Tell();
  Video( Grey( 80, 64, 48 ) );
  Options().CameraView = false;
  Options().OverlayCamera = QStringLiteral( "a" );
  const QPointF Raw( 120, 400 );
  pScene->Change( { VTestLens::World( VTestLens::Corrected( Raw ), 3000 ) } );
  for ( const QSize& rSize : { QSize( 900, 480 ), QSize( 640, 700 ) } )
  {
    FrameSize = rSize;
    const double Scale = std::min( rSize.width() / 640.0, rSize.height() / 480.0 );
    const QPointF Corner( ( rSize.width() - W * Scale ) / 2, ( rSize.height() - H * Scale ) / 2 );
    const auto Place = [&]( QPointF i_Sensor )
    {
      return Corner + ( i_Sensor + QPointF( 0.5, 0.5 ) ) * Scale;
    };
    for ( const bool bLens : { true, false } )
    {
      SCOPED_TRACE( testing::Message() << rSize.width() << ( bLens ? " with" : " without" ) );
      Options().Distort3D = bLens;
      const QPointF Expected = Place( bLens ? Raw : VTestLens::Corrected( Raw ) );
      for ( int Times = 0; Times < 2; ++Times ) // the second time after a band
      {
        const QImage Image = Draw();
        const QPointF Seen = Found( Image );
        EXPECT_LE( std::hypot( Seen.x() - Expected.x(), Seen.y() - Expected.y() ), 1 ) << Seen.x() << ", " << Seen.y();
        const auto IsVideo = [&]( QPointF i_Place )
        {
          return qRed( Image.pixel( i_Place.toPoint() ) ) == 80;
        };
        // Beside the image there is nothing, be it left or below.
        EXPECT_TRUE( IsVideo( Place( { 40, 40 } ) ) && IsVideo( Place( { 600, 440 } ) ) );
        EXPECT_FALSE( IsVideo( { Corner.x() / 2, Corner.y() / 2 } ) );
        EXPECT_EQ( Pick( Expected.toPoint() ).size(), 1u );
        EXPECT_EQ( Band( QRect( Expected.toPoint() - QPoint( 9, 9 ), QSize( 18, 18 ) ) ).size(), 1u );
        // What is drawn or painted over the world finds the projection of the world.
        CoreGraphics::VRenderContext& rContext = *pFrame->Context();
        EXPECT_EQ( rContext.Projection(), ImageProjection( *pCamera, Options(), rContext.View2D() ) );
      }
    }
  }
}

TEST_F( VBackdrop, AWorldThatMayNotBeSeenIsNotPickedEither )
{
  Calibrate();
  Video( Grey( 60, W, H ) );
  const QPoint Place( W / 2, H / 2 );
  pScene->Change( { VTestLens::World( Place, 3000 ) } );
  EXPECT_EQ( Pick( Place ).size(), 1u );
  const auto ExpectVideoAlone = [&]
  {
    EXPECT_TRUE( Pick( Place ).empty() );
    EXPECT_EQ( Draw().pixel( Place ), qRgb( 60, 60, 60 ) );
  };
  Options().Opacity3DOverlay = 0;
  ExpectVideoAlone();
  Options().Opacity3DOverlay = 1;
  Options().Show3DOverlay = false;
  ExpectVideoAlone();
  Options().Show3DOverlay = true;
  pCamera->Info.bCalibrated = false;
  ExpectVideoAlone();
  Options().Distort3D = true;
  ExpectVideoAlone();
  // What is marked is marked where it is seen, and a view that shows nothing of it is not marked at all.
  pCamera->Info.bCalibrated = true;
  pScene->Change( { VTestLens::World( VTestLens::Corrected( { 60, 420 } ), 3000 ) } );
  const QImage Plain = Draw();
  pScene->Select( { Recon( 0 ) } );
  const QImage Marked = Draw();
  EXPECT_NE( Plain.copy( 44, 404, 32, 32 ), Marked.copy( 44, 404, 32, 32 ) );
  EXPECT_EQ( Plain.copy( 100, 0, 540, 480 ), Marked.copy( 100, 0, 540, 480 ) );
}

TEST_F( VBackdrop, PicturesOfVideoAndWorld )
{
  Calibrate();
  Options().FloorGrid = true;
  Options().ReconstructionScale = 8;
  VVideoFrame Bars;
  ASSERT_EQ( CoreVideoUtils::ColourBars( EPixelFormat::NV12, 320, 200, Bars ), ZEK::IResult::Ok );
  Video( Bars );
  std::vector< VScenePoint > Points;
  for ( int Y = 0; Y <= 4; ++Y )
  {
    for ( int X = 0; X <= 4; ++X )
    {
      Points.push_back( VTestLens::World( VTestLens::Corrected( { 20.0 + X * 150, 20.0 + Y * 110 } ), 2500 ) );
    }
  }
  pScene->Change( Points );
  Tile.Rect = Tile.Viewport = QRect( 20, 20, 600, 440 );
  Tile.Zoom = 0.9F;
  EXPECT_TRUE( TestSupport::MatchesGolden( Draw(), "backdrop-video" ) );
  Options().Distort3D = true;
  Options().Opacity3DOverlay = 0.5;
  EXPECT_TRUE( TestSupport::MatchesGolden( Draw(), "backdrop-distorted-half" ) );
  Options().Distort3D = false;
  EXPECT_TRUE( TestSupport::MatchesGolden( Draw(), "backdrop-half" ) );
}

} // namespace MoxelGraphics

#include "CameraViewFixture.h"

#include <TestSupport/Golden.h>

#include <limits>

// What cameras see in their own tiles: where it stands, to the pixel, and that picks agree with it.

namespace FlowTest
{
using VCameraPlace = VCameraView;

INSTANTIATE_TEST_SUITE_P( Looks, VCameraPlace, testing::ValuesIn( Looks ),
                          []( const auto& i_rInfo )
                          {
                            return std::string( i_rInfo.param.pName );
                          } );

TEST_P( VCameraPlace, CentroidsStandWhereTheLensAndTheViewPutThemAndArePickedThere )
{
  Make( GetParam() );
  VCentroidSet Set;
  std::vector< QPointF > Places;
  for ( int Row = 0; Row < 12; ++Row )
  {
    for ( int Column = 0; Column < 15; ++Column )
    {
      Set.Centroids.push_back(
          { 31.3F + 85.7F * static_cast< f32 >( Column ), 22.9F + 86.1F * static_cast< f32 >( Row ), 0 } );
      const VCentroid& rLast = Set.Centroids.back();
      Places.push_back( Expected( rLast.x, rLast.y, Strong(), GetParam(), Tiles[0] ) );
    }
  }
  ShowAll( { Item< FlowCentroidSet >( Set ) } );
  const QImage Picture = Draw();
  const QRectF Tile( 0, 0, 300, 383 );
  std::size_t Inside = 0, Near = 0;
  for ( std::size_t Index = 0; Index < Places.size(); ++Index )
  {
    const QPointF Place = Places[Index];
    // What lies this near to a border of pixels may show in either.
    const auto Edge = []( double i_Value )
    {
      return std::abs( i_Value - std::round( i_Value ) );
    };
    if ( !Tile.contains( Place ) || std::min( Edge( Place.x() ), Edge( Place.y() ) ) < 0.05 )
    {
      Near += Tile.adjusted( -1, -1, 1, 1 ).contains( Place ) ? 1 : 0;
      continue;
    }
    ++Inside;
    const QPoint Pixel( static_cast< int >( std::floor( Place.x() ) ), static_cast< int >( std::floor( Place.y() ) ) );
    EXPECT_NE( Picture.pixel( Pixel ), Empty ) << Index << " at " << Place.x() << ' ' << Place.y();
    if ( Index % 7 == 0 || GetParam().Zoom > 5 )
    {
      const ZEK::VSelection Picked = Pick( Pixel, Pixel, MoxelGraphics::EPickHover );
      ASSERT_EQ( Picked.size(), 1u );
      EXPECT_EQ( Picked[0], ( ZEK::VSelectionItem{ ZEK::ESelectCentroid, Name, 0, static_cast< u32 >( Index ) } ) );
    }
  }
  int Lit = 0;
  for ( int Y = 0; Y < FrameSize.height(); ++Y )
  {
    for ( int X = 0; X < FrameSize.width(); ++X )
    {
      Lit += Picture.pixel( X, Y ) != Empty ? 1 : 0;
    }
  }
  EXPECT_GT( Inside, 0u );
  EXPECT_GE( static_cast< std::size_t >( Lit ), Inside );
  // A dot is two pixels wide.
  EXPECT_LE( static_cast< std::size_t >( Lit ), 4 * ( Inside + Near ) );
  // A band takes the same, whether pixels or computation found them.
  const QRect Band( 41, 57, 200, 230 );
  std::vector< u32 > Wanted, Found;
  std::size_t Unsure = 0;
  for ( std::size_t Index = 0; Index < Places.size(); ++Index )
  {
    const QRectF Sure = QRectF( Band ).adjusted( 3, 3, -3, -3 ), Perhaps = QRectF( Band ).adjusted( -3, -3, 3, 3 );
    if ( Sure.contains( Places[Index] ) )
    {
      Wanted.push_back( static_cast< u32 >( Index ) );
    }
    Unsure += Perhaps.contains( Places[Index] ) && !Sure.contains( Places[Index] ) ? 1 : 0;
  }
  for ( const ZEK::VSelectionItem& rItem : Pick( Band.topLeft(), QPoint( 241, 287 ), MoxelGraphics::EPickBandDone ) )
  {
    Found.push_back( rItem.Sub );
  }
  std::sort( Found.begin(), Found.end() );
  EXPECT_TRUE( std::includes( Found.begin(), Found.end(), Wanted.begin(), Wanted.end() ) );
  EXPECT_LE( Found.size(), Wanted.size() + Unsure );
}

TEST_P( VCameraPlace, ThePictureIsThatOfTheProgramsForOneObjectAtATime )
{
  Make( GetParam() );
  // Large enough to be discs; the blob at the middle of the view, its pixels larger than those of the screen.
  float MiddleX = 0, MiddleY = 0;
  double Nearest = 1e9;
  for ( int X = 0; X < 1280; ++X )
  {
    for ( int Y = 0; Y < 1024; ++Y )
    {
      const QPointF Away = Expected( X, Y, Strong(), GetParam(), Tiles[0] ) - QPointF( 150, 191.5 );
      if ( QPointF::dotProduct( Away, Away ) < Nearest )
      {
        Nearest = QPointF::dotProduct( Away, Away );
        MiddleX = static_cast< float >( X );
        MiddleY = static_cast< float >( Y );
      }
    }
  }
  VCentroidSet Set;
  for ( int Index = 0; Index < 5; ++Index )
  {
    const float Step = 40.0F / GetParam().Zoom * static_cast< float >( Index - 2 );
    Set.Centroids.push_back( { MiddleX + Step, MiddleY + Step, ( 30.0F + 6 * Index ) / GetParam().Zoom } );
  }
  Tiles[0].Zoom = GetParam().Zoom;
  for ( const bool bGrey : { false, true } )
  {
    if ( bGrey )
    {
      Tiles[0].Zoom = 30;
    }
    const VGreyscaleBlobSet Grey = Blobs( static_cast< int >( MiddleX ) - 12, static_cast< int >( MiddleY ) - 12, 25 );
    ShowAll( { bGrey ? Item< FlowGreyscaleBlobSet >( Grey ) : Item< FlowCentroidSet >( Set ) } );
    const QImage Batch = Draw().copy( 0, 0, 300, 383 );
    pOffscreen->MakeCurrent();
    CoreGraphics::VRenderContext& rContext = *pFrame->Context();
    rContext.ResetState();
    const auto pTarget = MoxelGraphics::VSceneFrame::MakeTarget( FrameSize, false );
    rContext.BindFramebuffer( pTarget.get() );
    rContext.SetRenderMode( CoreGraphics::ERenderModeNormal );
    rContext.SetScissor( QRect( QPoint(), FrameSize ) );
    rContext.SetClearColour( QColor( Empty ) );
    rContext.Clear( true, true );
    ApplyTile( Tiles[0], rContext );
    std::vector< ZEK::VCentroidVertex > Points;
    ZEK::VCameraLists2D Lists;
    ZEK::VDrawWords Colours;
    const auto pCamera = pScene->CameraProvider()->GetCamera( Name );
    ASSERT_TRUE( pCamera );
    pCamera->GetDrawData2D( 1, ZEK::EColourConnection, true, Lists, Colours );
    for ( const VGreyscaleLine& rLine : Grey.Lines )
    {
      for ( u32 Column = 0; Column < rLine.length; ++Column )
      {
        const u32 Value = Grey.Pixels[rLine.First + Column];
        Points.push_back( { static_cast< f32 >( rLine.x + Column ), static_cast< f32 >( rLine.y ), 0,
                            0xFF000000u | Value * 0x010101u } );
      }
    }
    Points = bGrey ? Points : *Lists.pCentroids;
    const std::string Program = bGrey ? "Greyscale2D" : "Centroid2D";
    const auto pProgram = pScene->Resources()->GetProgram( Program, Program );
    ASSERT_TRUE( rContext.UseProgram( pProgram ) );
    MoxelGraphics::VSensorUniforms Uniforms;
    Uniforms.Set( *pProgram, MoxelGraphics::MakeSensorView( *pCamera, Options(), rContext.View2D() ) );
    pProgram->SetUniform( pProgram->UniformLocation( "u_SensorImageOffsetScale" ), QVector4D( 0, 0, 1, 1 ) );
    CoreGraphics::VDynamicBuffer Buffer;
    ASSERT_TRUE( Buffer.Write( std::span( std::as_const( Points ) ) ) );
    using namespace CoreGraphics;
    static const VVertexLayout Layout(
        sizeof( ZEK::VCentroidVertex ), 0,
        { { EAttributePosition, 3, GL_FLOAT, false, 0 }, { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 12 } } );
    ASSERT_TRUE( rContext.SetVertexBuffer( { &Buffer, &Layout, 0 } ) );
    VRenderState Look;
    Look.depthTest = Look.depthWrite = false;
    Look.colourBlend = EColourBlendAlpha;
    rContext.SetRenderState( Look );
    rContext.DrawArrays( GL_POINTS, static_cast< int >( Points.size() ) );
    const QImage Single = pTarget->toImage().copy( 0, 0, 300, 383 );
    rContext.ResetState();
    rContext.ReleaseVertexArray();
    // Points round to the grid of the device, and grey ones reach a quarter of a pixel into their neighbours.
    EXPECT_TRUE( TestSupport::SamePicture( Batch, Single, { 24, bGrey ? 0.02 : 0.005 } ) ) << bGrey;
    QImage None = Batch;
    None.fill( QColor( Empty ) );
    EXPECT_FALSE( TestSupport::SamePicture( Batch, None, { 24, 0.004 } ) ) << bGrey;
  }
}

TEST_F( VCameraView, TheSameStateAgainTouchesNoBufferAndAMovedViewOnlyItsTable )
{
  Make( Looks[0] );
  ShowAll( { Item< FlowCentroidSet >( Centroids( 60 ) ), Item< FlowGreyscaleBlobSet >( Blobs( 300, 300, 90 ) ),
             Item< FlowCentroidSet >( Centroids( 20 ), "camera:2" ) } );
  const QImage First = Draw();
  EXPECT_GT( pFrame->Figures().BytesUploaded, 8100u );
  const std::uint64_t Draws = pFrame->Figures().DrawCalls;
  EXPECT_EQ( Draw(), First );
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  EXPECT_EQ( pFrame->Figures().DrawCalls, Draws );
  pScene->MarkDirty();
  EXPECT_EQ( Draw(), First );
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  // Zoomed: large centroids become discs, in one draw more.
  Tiles[0].Zoom = 20;
  EXPECT_NE( Draw(), First );
  const std::uint64_t Table = pFrame->Figures().BytesUploaded;
  EXPECT_LT( Table, 4u * 32768u ); // a row of texels a kind
  EXPECT_EQ( pFrame->Figures().DrawCalls, Draws + 1 );
  // One tile is picked from the same buffers: nothing but the words of its objects is written.
  EXPECT_TRUE( Pick( { 5, 5 }, { 5, 5 }, MoxelGraphics::EPickHover ).empty() );
  EXPECT_LT( pFrame->Figures().BytesUploaded, 3u * 32768u );
  Tiles[0].Zoom = 0.9F;
  Draw();
  EXPECT_EQ( Draw(), First );
  // A camera that leaves takes its objects along.
  Show( { Item< FlowCameraHardware >( Hardware(), "camera:2" ),
          Item< FlowCentroidSet >( Centroids( 20 ), "camera:2" ) } );
  QImage None( 300, 383, First.format() );
  None.fill( QColor( Empty ) );
  EXPECT_EQ( Draw().copy( 0, 0, 300, 383 ), None );
}

TEST_F( VCameraView, NothingReachesIntoTheNextTileAndNonsenseDrawsNothing )
{
  Make( Looks[0] );
  Tiles[0].Zoom = 4;
  const f32 NotANumber = std::numeric_limits< f32 >::quiet_NaN(), Infinite = std::numeric_limits< f32 >::infinity();
  VCentroidSet Set;
  Set.Centroids = { { 800, 512, 60 },
                    { NotANumber, 100, 4 },
                    { 100, Infinite, 4 },
                    { 300, 300, NotANumber },
                    { 300, 300, Infinite } };
  VGreyscaleBlobSet Grey = Blobs( 780, 480, 90 );
  // Beyond the sensor, past the pixels, no line, lines that are not there.
  Grey.Lines.push_back( { 60000, 60000, 500, 0 } );
  Grey.Lines.push_back( { 700, 500, 65535, 100 } );
  Grey.Blobs.push_back( { 90, 2 } );
  Grey.Blobs.push_back( { 0, 0 } );
  Grey.Blobs.push_back( { 4000000000u, 4000000000u } );
  ShowAll( { Item< FlowCentroidSet >( Set ), Item< FlowGreyscaleBlobSet >( Grey ) } );
  const QImage Picture = Draw();
  QImage Right( 300, 383, Picture.format() );
  Right.fill( QColor( Empty ) );
  EXPECT_EQ( Picture.copy( 300, 0, 300, 383 ), Right );
  EXPECT_NE( Picture.copy( 0, 0, 300, 383 ), Right );
  // Images of no size, cameras without a sensor.
  for ( const float Scale : { 0.0F, NotANumber } )
  {
    Grey.SensorScale.x = Scale;
    VCameraHardware None;
    Show(
        { Item< FlowCameraHardware >( None ), Item< FlowGreyscaleBlobSet >( Grey ), Item< FlowCentroidSet >( Set ) } );
    EXPECT_EQ( Draw().copy( 300, 0, 300, 383 ), Right );
  }
}

TEST_F( VCameraView, OptionsTurnTheirPartsOffAndOn )
{
  Make( Looks[0] );
  ShowAll( { Item< FlowCentroidSet >( Centroids( 60 ) ), Item< FlowGreyscaleBlobSet >( Blobs( 300, 300, 90 ) ) } );
  const QImage All = Draw();
  Options().CameraCentroids = false;
  const QImage Grey = Draw();
  Options().CameraGreyscale = false;
  const QImage None = Draw();
  Options().CameraCentroids = true;
  const QImage Dots = Draw();
  EXPECT_NE( All, Grey );
  EXPECT_NE( All, Dots );
  EXPECT_NE( None, Grey );
  EXPECT_NE( None, Dots );
  Options().CentroidColourScheme = ZEK::EColourGenerator;
  EXPECT_NE( Draw(), Dots );
}

TEST_F( VCameraView, MaximisedGreyFillsTheImageWithWhatShowedLately )
{
  Make( Looks[0] );
  Tiles.resize( 1 );
  Options().CameraMaximiseGreyscale = true;
  Options().CameraMaximiseGreyscaleHistory = 1;
  const auto Lit = [&]
  {
    const QImage Picture = Draw();
    int Count = 0;
    for ( int Y = 0; Y < 383; Y += 2 )
    {
      for ( int X = 0; X < 300; X += 2 )
      {
        Count += Picture.pixel( X, Y ) != Empty ? 4 : 0;
      }
    }
    return Count;
  };
  const double Image = 270.0 * 270 * 1024 / 1280;
  ShowAll( { Item< FlowGreyscaleBlobSet >( Blobs( 300, 300, 40 ) ) } );
  EXPECT_NEAR( Lit(), Image, Image / 20 );
  // With a longer memory the former columns and rows keep their place, and stand empty.
  ShowAll( { Item< FlowGreyscaleBlobSet >( Blobs( 700, 600, 40 ) ) } );
  Options().CameraMaximiseGreyscaleHistory = 2;
  EXPECT_NEAR( Lit(), Image / 4, Image / 20 );
  Options().CameraMaximiseGreyscaleFactor = 1;
  EXPECT_NEAR( Lit(), 270.0 * 270 / 1280 / 1280 * 1600, 80 );
}

TEST_F( VCameraView, PicturesOfSelectedCentroidsAndOfMaximisedGrey )
{
  Make( Looks[0] );
  VCentroidSet Set = Centroids( 6, 12 );
  VGreyscaleBlobSet Grey = Blobs( 116, 196, 9, 60 );
  Set.Centroids.push_back( { 106, 210, 9 } );
  ShowAll( { Item< FlowCentroidSet >( Set ), Item< FlowGreyscaleBlobSet >( Grey ) } );
  Tiles.resize( 1 );
  Tiles[0].Rect = Tiles[0].Viewport = QRect( QPoint(), FrameSize );
  Tiles[0].ScaleX = 600.0F / 400 * 0.5F;
  Tiles[0].ScaleY = 0.9375F;
  Tiles[0].Zoom = 14;
  Tiles[0].PanX = 125.0F / 1280;
  Tiles[0].PanY = 203.0F / 1024;
  pScene->Select( { { ZEK::ESelectCentroid, Name, 0, 1 },
                    { ZEK::ESelectCentroid, Name, 0, 6 },
                    { ZEK::ESelectGreyscaleBlob, Name, 0, 0 } } );
  EXPECT_TRUE( TestSupport::MatchesGolden( Draw(), "centroids-selected" ) );
  pScene->Select( { { ZEK::ESelectGreyscaleBlob, Name, 0, 0 } } );
  Tiles[0].Zoom = 0.9F;
  Tiles[0].PanX = Tiles[0].PanY = 0.5F;
  Options().CameraMaximiseGreyscale = true;
  EXPECT_TRUE( TestSupport::MatchesGolden( Draw(), "greyscale-maximised" ) );
}

TEST_F( VCameraView, DataStandOnTheImagePlanesOfTheFrustums )
{
  Make( Looks[0] );
  Options().CameraView = false;
  Options().Show3DOverlay = true;
  Options().Cameras = true;
  Options().CameraCylinder = Options().CameraAxes = false;
  VCentroidSet Set;
  Set.Centroids = { { 200, 300, 3 }, { 1000, 800, 3 }, { 500, 620, 3 } };
  VCameraCalibration Free = Calibration( 900 );
  Free.Position = { 0, 0, 900 };
  Free.RadialParameters = { 0, 0 };
  const auto Items = [&]( bool i_bCalibrated )
  {
    std::vector< VFlowItemRef > All{ Item< FlowCameraHardware >( Hardware() ), Item< FlowCentroidSet >( Set ) };
    if ( i_bCalibrated )
    {
      All.push_back( Item< FlowCameraCalibration >( Free ) );
    }
    return All;
  };
  Show( Items( true ) );
  Options().CameraCentroids = false;
  const QImage Without = Draw();
  Options().CameraCentroids = true;
  const QImage With = Draw();
  const auto& rModel = pScene->CameraProvider()->GetCamera( Name )->GetModel();
  const QMatrix4x4 World = QMatrix4x4( rModel.WorldFromCamera.data() ).transposed();
  const float Length = 500 / std::hypot( 1280.0F, 1024.0F, 2800.0F );
  const CoreGraphics::VCameraFields& rView = pFrame->Controller().Fields();
  for ( std::size_t Index = 0; Index < Set.Centroids.size(); ++Index )
  {
    const VCentroid& rCentroid = Set.Centroids[Index];
    const QVector3D Place = World.map( QVector3D( 2 * rCentroid.x - 1280, 2 * rCentroid.y - 1024, 2800 ) * Length );
    const QVector3D Clip = ( rView.projection * rView.view ).map( Place );
    const QPoint Pixel( static_cast< int >( ( Clip.x() + 1 ) * 300 ), static_cast< int >( ( 1 - Clip.y() ) * 200 ) );
    bool bSeen = false;
    for ( int X = -1; X <= 1; ++X )
    {
      for ( int Y = -1; Y <= 1; ++Y )
      {
        bSeen = bSeen || With.pixel( Pixel + QPoint( X, Y ) ) != Without.pixel( Pixel + QPoint( X, Y ) );
      }
    }
    EXPECT_TRUE( bSeen ) << Index;
    EXPECT_EQ( Pick( Pixel, Pixel, MoxelGraphics::EPickHover ),
               ZEK::VSelection( { { ZEK::ESelectCentroid, Name, 0, static_cast< u32 >( Index ) } } ) );
  }
  Show( Items( false ) );
  Options().CameraCentroids = false;
  const QImage Uncalibrated = Draw();
  Options().CameraCentroids = true;
  EXPECT_EQ( Draw(), Uncalibrated );
}

} // namespace FlowTest

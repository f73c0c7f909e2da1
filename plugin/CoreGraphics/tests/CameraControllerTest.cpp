#include "TestContext.h"

#include <CoreGraphics/VCameraController.h>
#include <CoreGraphics/VInteractionMapper.h>

#include <QtGui/QMouseEvent>
#include <QtGui/QWheelEvent>

#include <cmath>

using namespace CoreGraphics;

namespace
{
constexpr double Degree = 3.14159265358979323846 / 180.0;

struct VPoint
{
  double X, Y, Z;
};

// Turns by hand, independent of the matrix class.
VPoint AboutX( VPoint i_P, double i_Degrees )
{
  const double C = std::cos( i_Degrees * Degree ), S = std::sin( i_Degrees * Degree );
  return { i_P.X, i_P.Y * C - i_P.Z * S, i_P.Y * S + i_P.Z * C };
}
VPoint AboutY( VPoint i_P, double i_Degrees )
{
  const double C = std::cos( i_Degrees * Degree ), S = std::sin( i_Degrees * Degree );
  return { i_P.X * C + i_P.Z * S, i_P.Y, -i_P.X * S + i_P.Z * C };
}
VPoint AboutZ( VPoint i_P, double i_Degrees )
{
  const double C = std::cos( i_Degrees * Degree ), S = std::sin( i_Degrees * Degree );
  return { i_P.X * C - i_P.Y * S, i_P.X * S + i_P.Y * C, i_P.Z };
}

// A world point in view space, as the rotations are told: the one named last turns the point first.
VPoint InView( const VCameraFields& i_rFields, QVector3D i_World )
{
  VPoint P{ i_World.x() - i_rFields.centre.x(), i_World.y() - i_rFields.centre.y(),
            i_World.z() - i_rFields.centre.z() };
  if ( i_rFields.viewType == EViewPerspective )
  {
    P = i_rFields.yUp ? AboutX( P, 90 ) : P;
    P = AboutX( AboutZ( P, i_rFields.azimuth ), i_rFields.tilt );
    return { P.X, P.Y, P.Z - i_rFields.distance };
  }
  P = i_rFields.yUp ? P : AboutX( AboutZ( P, 180 ), -90 );
  switch ( i_rFields.viewType )
  {
  case EViewBack:
    P = AboutY( P, 180 );
    break;
  case EViewLeft:
    P = AboutY( P, -90 );
    break;
  case EViewRight:
    P = AboutY( P, 90 );
    break;
  case EViewTop:
    P = AboutX( P, 90 );
    break;
  case EViewBottom:
    P = AboutX( P, -90 );
    break;
  default:
    break;
  }
  return { P.X, P.Y, P.Z - i_rFields.farPlane * 0.5 };
}

class CameraControllerTest : public testing::Test
{
public:
  CameraControllerTest()
  {
    SetInteractionMapper( std::make_shared< VInteractionMapper >() );
    Camera.SetSize( { 800, 600 } );
  }
  ~CameraControllerTest() override { SetInteractionMapper( nullptr ); }

  void Press( double i_X, double i_Y, Qt::MouseButtons i_Buttons, double i_Ratio = 1 )
  {
    const QMouseEvent Event( QEvent::MouseButtonPress, { i_X, i_Y }, { i_X, i_Y }, Qt::LeftButton, i_Buttons, {} );
    Camera.OnMousePress( Event, i_Ratio );
  }
  void Move( double i_X, double i_Y, Qt::MouseButtons i_Buttons, double i_Ratio = 1 )
  {
    const QMouseEvent Event( QEvent::MouseMove, { i_X, i_Y }, { i_X, i_Y }, Qt::NoButton, i_Buttons, {} );
    Camera.OnMouseMove( Event, i_Ratio );
  }
  void Release( Qt::MouseButtons i_Buttons )
  {
    const QMouseEvent Event( QEvent::MouseButtonRelease, QPointF(), QPointF(), Qt::LeftButton, i_Buttons, {} );
    Camera.OnMouseRelease( Event, 1 );
  }
  void Wheel( int i_Delta )
  {
    Camera.OnWheel( QWheelEvent( {}, {}, {}, { 0, i_Delta }, {}, {}, Qt::NoScrollPhase, false ) );
  }
  // Where a world point lies on the screen, device pixels from the top left.
  QPointF Screen( const QVector3D& i_rWorld )
  {
    Camera.Step();
    const VCameraFields& rFields = Camera.Fields();
    const QVector3D Clip = ( rFields.projection * rFields.view ).map( i_rWorld );
    return { ( Clip.x() * 0.5 + 0.5 ) * rFields.viewportSize.width(),
             ( 0.5 - Clip.y() * 0.5 ) * rFields.viewportSize.height() };
  }

  VCameraController Camera;
};
} // namespace

TEST_F( CameraControllerTest, TheViewOfEveryTypeAndUpAxis )
{
  for ( const bool bYUp : { false, true } )
  {
    for ( int Type = 0; Type < ViewTypeCount; ++Type )
    {
      Camera.SetYUp( bYUp );
      Camera.SetViewType( Type );
      const std::array< QVector4D, 1 > Focus = { QVector4D( 100, -200, 300, 0 ) };
      Camera.SetFocusPoints( Focus, false );
      Camera.Step();
      for ( const QVector3D World : { QVector3D( 0, 0, 0 ), QVector3D( 1000, 0, 0 ), QVector3D( 0, 500, 2000 ) } )
      {
        const QVector3D Seen = Camera.Fields().view.map( World );
        const VPoint Wanted = InView( Camera.Fields(), World );
        EXPECT_NEAR( Seen.x(), Wanted.X, 0.02 ) << ViewTypeName( Type ) << bYUp;
        EXPECT_NEAR( Seen.y(), Wanted.Y, 0.02 ) << ViewTypeName( Type ) << bYUp;
        EXPECT_NEAR( Seen.z(), Wanted.Z, 0.02 ) << ViewTypeName( Type ) << bYUp;
      }
      // In a view from the side, up in the world is up on the screen.
      if ( Type < EViewTop )
      {
        const QVector3D Up = bYUp ? QVector3D( 0, 1, 0 ) : QVector3D( 0, 0, 1 );
        EXPECT_LT( Screen( Camera.Fields().centre + Up * 100 ).y(), 299 ) << ViewTypeName( Type ) << bYUp;
      }
      const QPointF Middle = Screen( Camera.Fields().centre );
      EXPECT_NEAR( Middle.x(), 400, 0.01 );
      EXPECT_NEAR( Middle.y(), 300, 0.01 );
    }
  }
  Camera.SetViewType( 99 );
  Camera.SetViewType( -1 );
  EXPECT_EQ( Camera.GetViewType(), EViewBottom );
  EXPECT_STREQ( ViewTypeName( 5 ), "Top" );
  EXPECT_STREQ( ViewTypeName( 7 ), "" );
}

TEST_F( CameraControllerTest, ProjectionsFollowSizeTypeAndScale )
{
  const auto Near = []( double i_A, double i_B )
  {
    return std::abs( i_A - i_B ) < 1e-5 * std::max( 1.0, std::abs( i_B ) );
  };
  const double Cotangent = 1.0 / std::tan( 22.5 * Degree );
  EXPECT_TRUE( Near( Camera.Fields().projection( 1, 1 ), Cotangent ) );
  EXPECT_TRUE( Near( Camera.Fields().projection( 0, 0 ), Cotangent * 600 / 800 ) );
  Camera.SetViewType( EViewTop );
  EXPECT_TRUE( Near( Camera.Fields().projection( 0, 0 ), 2.0 / ( 800 * 4.0 ) ) );
  EXPECT_TRUE( Near( Camera.Fields().projection( 1, 1 ), 2.0 / ( 600 * 4.0 ) ) );
  Camera.SetSize( { 400, 200 } );
  EXPECT_TRUE( Near( Camera.Fields().projection( 1, 1 ), 2.0 / ( 200 * 4.0 ) ) );
  Camera.SetViewType( EViewPerspective );
  Camera.SetSize( { 400, 0 } );
  EXPECT_TRUE( std::isfinite( Camera.Fields().projection( 0, 0 ) ) );
}

TEST_F( CameraControllerTest, APanCarriesThePointUnderThePointerAlong )
{
  for ( const int Type : { EViewPerspective, EViewFront, EViewTop } )
  {
    for ( const double Ratio : { 1.0, 2.0, 1.5 } )
    {
      Camera.SetViewType( Type );
      const QVector3D Point = Camera.Fields().centre;
      const QPointF Before = Screen( Point );
      Press( 100, 100, Qt::LeftButton | Qt::RightButton, Ratio );
      EXPECT_TRUE( Camera.Fields().panning );
      EXPECT_FALSE( Camera.Fields().orbiting );
      Move( 140, 70, Qt::LeftButton | Qt::RightButton, Ratio );
      const QPointF After = Screen( Point );
      EXPECT_NEAR( After.x() - Before.x(), 40 * Ratio, 0.05 ) << ViewTypeName( Type );
      EXPECT_NEAR( After.y() - Before.y(), -30 * Ratio, 0.05 ) << ViewTypeName( Type );
      Release( {} );
      EXPECT_FALSE( Camera.Fields().panning );
    }
  }
}

TEST_F( CameraControllerTest, OrbitAndZoomByDragging )
{
  Press( 10.9, 20.9, Qt::LeftButton );
  EXPECT_EQ( Camera.Fields().lastPosition, QPoint( 10, 20 ) ) << "a press truncates";
  Move( 20.5, 14.4, Qt::LeftButton );
  EXPECT_EQ( Camera.Fields().lastPosition, QPoint( 21, 14 ) ) << "a move rounds";
  EXPECT_FLOAT_EQ( Camera.Fields().azimuth, 45 + 11 * 0.2f );
  EXPECT_FLOAT_EQ( Camera.Fields().tilt, -60 - 6 * 0.2f );
  Move( 21, 2014, Qt::LeftButton );
  EXPECT_FLOAT_EQ( Camera.Fields().tilt, -60 - 6 * 0.2f + 400 ) << "over the pole";
  Release( {} );
  Move( 500, 500, {} );
  EXPECT_FLOAT_EQ( Camera.Fields().azimuth, 45 + 11 * 0.2f ) << "no gesture";

  Press( 0, 0, Qt::RightButton );
  Move( 0, 10, Qt::RightButton );
  EXPECT_FLOAT_EQ( Camera.Fields().distance, 7000 + 150 );
  Release( {} );
  Camera.SetViewType( EViewLeft );
  Press( 0, 0, Qt::LeftButton );
  EXPECT_FALSE( Camera.Fields().orbiting || Camera.Fields().zooming ) << "nothing to orbit";
  Press( 0, 0, Qt::RightButton );
  Move( 0, 20, Qt::RightButton );
  EXPECT_FLOAT_EQ( Camera.Fields().orthoScale, 4 * ( 1 + 20 * 0.0025f ) );
  EXPECT_NEAR( Camera.Fields().projection( 1, 1 ), 2.0 / ( 600 * 4.2 ), 1e-8 );
  Move( 0, -5000, Qt::RightButton );
  EXPECT_GT( Camera.Fields().orthoScale, 0.0f ) << "a jump cannot turn the view inside out";
}

TEST_F( CameraControllerTest, ButtonsThatChangeDuringAGesture )
{
  Press( 10, 10, Qt::LeftButton );
  Press( 50, 50, Qt::LeftButton | Qt::MiddleButton );
  EXPECT_TRUE( Camera.Fields().panning );
  EXPECT_FALSE( Camera.Fields().orbiting );
  EXPECT_EQ( Camera.Fields().lastPosition, QPoint( 10, 10 ) ) << "kept from the first press";
  Release( Qt::LeftButton );
  EXPECT_TRUE( Camera.Fields().orbiting ) << "the left button is still down";
  Press( 0, 0, Qt::MiddleButton );
  EXPECT_FALSE( Camera.Fields().panning || Camera.Fields().orbiting || Camera.Fields().zooming );
  SetInteractionMapper( nullptr );
  Press( 0, 0, Qt::LeftButton );
  EXPECT_FALSE( Camera.Fields().orbiting );
}

TEST_F( CameraControllerTest, WheelKeysAndReset )
{
  Wheel( 120 );
  EXPECT_FLOAT_EQ( Camera.Fields().distance, 6300 );
  Wheel( 0 );
  EXPECT_FLOAT_EQ( Camera.Fields().distance, 5670 );
  Wheel( -120 );
  EXPECT_FLOAT_EQ( Camera.Fields().distance, 6237 );
  const std::array< QVector4D, 1 > Focus = { QVector4D( 10, 20, 30, 5 ) };
  Camera.SetFocusPoints( Focus, false );
  QMatrix4x4 Pose;
  Pose.translate( 1, 2, 3 );
  Camera.SetLockPose( Pose );
  EXPECT_FALSE( Camera.OnKeyPress( Qt::Key_End ) );
  EXPECT_FLOAT_EQ( Camera.Fields().distance, 6237 );
  EXPECT_TRUE( Camera.OnKeyPress( Qt::Key_Home ) );
  EXPECT_EQ( Camera.Fields().centre, QVector3D( 0, 20, 0 ) );
  EXPECT_TRUE( Camera.Fields().lockPose.isIdentity() );
  EXPECT_EQ( Camera.Fields().distance, 7000 );
  EXPECT_EQ( Camera.Fields().tilt, -60 );
  Camera.Reset( true );
  EXPECT_EQ( Camera.Fields().distance, 1000 );
  EXPECT_EQ( Camera.Fields().tilt, -90 );
  EXPECT_EQ( Camera.Fields().azimuth, 0 );
}

TEST_F( CameraControllerTest, ALockedViewMovesWithItsPose )
{
  const QVector3D Point( 200, 100, 50 );
  const QPointF Before = Screen( Point );
  QMatrix4x4 Pose;
  Pose.translate( 1000, -500, 700 );
  Pose.rotate( 30, 0, 0, 1 );
  Camera.SetLockPose( Pose );
  const QPointF After = Screen( Pose.map( Point ) );
  EXPECT_NEAR( After.x(), Before.x(), 0.01 );
  EXPECT_NEAR( After.y(), Before.y(), 0.01 );
}

TEST_F( CameraControllerTest, AFocusCentresOnTheBoxOfTheSpheres )
{
  const std::array< QVector4D, 3 > Spheres = { QVector4D( 0, 0, 0, 100 ), QVector4D( 1000, 50, -20, 10 ),
                                               QVector4D( std::nanf( "" ), 0, 0, 1 ) };
  Camera.SetFocusPoints( Spheres, false );
  EXPECT_EQ( Camera.Fields().centre, QVector3D( 455, 0, 0 ) );
  EXPECT_EQ( Camera.Fields().distance, 7000 );
  Camera.SetFocusPoints( {}, true );
  Camera.SetFocusPoints( std::span( Spheres ).subspan( 2 ), true );
  EXPECT_EQ( Camera.Fields().centre, QVector3D( 455, 0, 0 ) );
  EXPECT_EQ( Camera.Fields().distance, 7000 );
}

TEST_F( CameraControllerTest, AFitShowsEverySphereWithItsMargin )
{
  const std::array< QVector4D, 1 > One = { QVector4D( 10, 20, 30, 0 ) };
  Camera.SetFocusPoints( One, true );
  EXPECT_EQ( Camera.Fields().centre, QVector3D( 10, 20, 30 ) );
  EXPECT_NEAR( Camera.Fields().distance, 250 / std::sin( 22.5 * Degree ), 0.01 );
  Camera.SetViewType( EViewFront );
  Camera.SetFocusPoints( One, true );
  EXPECT_FLOAT_EQ( Camera.Fields().orthoScale, 500.0f / 600.0f );

  const std::array< QVector4D, 4 > Spheres = { QVector4D( -900, 0, 0, 100 ), QVector4D( 300, 1200, 40, 5 ),
                                               QVector4D( 0, 0, 1800, 50 ), QVector4D( 500, -700, 900, 0 ) };
  for ( const bool bYUp : { false, true } )
  {
    for ( int Type = 0; Type < ViewTypeCount; ++Type )
    {
      // At 1:1 the side planes are exact; the closest sphere then touches its plane.
      Camera.SetSize( Type == EViewPerspective ? QSize( 700, 700 ) : QSize( 800, 600 ) );
      Camera.SetYUp( bYUp );
      Camera.SetViewType( Type );
      Camera.SetFocusPoints( Spheres, true );
      double Tightest = 1e9;
      for ( const QVector4D& rSphere : Spheres )
      {
        const VPoint P = InView( Camera.Fields(), rSphere.toVector3D() );
        const double Radius = rSphere.w() + 250;
        const double S = std::sin( 22.5 * Degree ), C = std::cos( 22.5 * Degree );
        const VCameraFields& rFields = Camera.Fields();
        const double Vertical =
            Type == EViewPerspective ? -P.Z * S - std::abs( P.Y ) * C : rFields.orthoScale * 300.0 - std::abs( P.Y );
        const double Horizontal =
            Type == EViewPerspective ? -P.Z * S - std::abs( P.X ) * C : rFields.orthoScale * 400.0 - std::abs( P.X );
        Tightest = std::min( { Tightest, Vertical - Radius, Horizontal - Radius } );
      }
      EXPECT_NEAR( Tightest, 0.0, 0.05 ) << ViewTypeName( Type ) << bYUp;
    }
  }
}

TEST_F( CameraControllerTest, ApplyHandsOverEverything )
{
  VRenderContext Render;
  Camera.Step();
  Camera.Apply( Render );
  EXPECT_EQ( Render.Projection(), Camera.Fields().projection );
  EXPECT_EQ( Render.View(), Camera.Fields().view );
  EXPECT_EQ( Render.Viewport(), QRect( 0, 0, 800, 600 ) );
  EXPECT_EQ( Render.FrameSize(), QSize( 800, 600 ) );
}

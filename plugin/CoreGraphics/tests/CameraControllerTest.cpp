#include "TestContext.h"

#include <CoreGraphics/VCameraController.h>
#include <CoreGraphics/VInteractionMapper.h>

#include <QtGui/QMouseEvent>
#include <QtGui/QQuaternion>
#include <QtGui/QWheelEvent>

#include <cmath>

using namespace CoreGraphics;

namespace
{
constexpr double Degree = 3.14159265358979323846 / 180.0;
const QVector3D AxisX( 1, 0, 0 ), AxisY( 0, 1, 0 ), AxisZ( 0, 0, 1 );

QVector3D Turned( const QVector3D& i_rPoint, const QVector3D& i_rAxis, float i_Degrees )
{
  return QQuaternion::fromAxisAndAngle( i_rAxis, i_Degrees ).rotatedVector( i_rPoint );
}

// A world point in view space, by turns one after the other.
QVector3D InView( const VCameraFields& i_rFields, const QVector3D& i_rWorld )
{
  static const std::pair< QVector3D, float > Sides[] = { { AxisX, 0 },  { AxisX, 0 },  { AxisY, 180 }, { AxisY, -90 },
                                                         { AxisY, 90 }, { AxisX, 90 }, { AxisX, -90 } };
  const QVector3D Offset = i_rWorld - i_rFields.centre;
  if ( i_rFields.viewType == EViewPerspective )
  {
    const QVector3D Upright = Turned( Offset, AxisX, i_rFields.yUp ? 90 : 0 );
    const QVector3D Seen = Turned( Turned( Upright, AxisZ, i_rFields.azimuth ), AxisX, i_rFields.tilt );
    return Seen - QVector3D( 0, 0, i_rFields.distance );
  }
  const QVector3D Upright = i_rFields.yUp ? Offset : Turned( Turned( Offset, AxisZ, 180 ), AxisX, -90 );
  const auto& [rAxis, Degrees] = Sides[i_rFields.viewType];
  return Turned( Upright, rAxis, Degrees ) - QVector3D( 0, 0, i_rFields.farPlane * 0.5f );
}
} // namespace

class CameraControllerTest : public testing::Test
{
public:
  CameraControllerTest()
  {
    SetInteractionMapper( std::make_shared< VInteractionMapper >() );
    Camera.SetSize( { 800, 600 } );
  }
  ~CameraControllerTest() override { SetInteractionMapper( nullptr ); }

  static QMouseEvent Mouse( QEvent::Type i_Type, const QPointF& i_rPlace, Qt::MouseButtons i_Buttons )
  {
    return { i_Type, i_rPlace, i_rPlace, Qt::LeftButton, i_Buttons, {} };
  }
  void Press( double i_X, double i_Y, Qt::MouseButtons i_Buttons, double i_Ratio = 1 )
  {
    Camera.OnMousePress( Mouse( QEvent::MouseButtonPress, { i_X, i_Y }, i_Buttons ), i_Ratio );
  }
  void Move( double i_X, double i_Y, Qt::MouseButtons i_Buttons, double i_Ratio = 1 )
  {
    Camera.OnMouseMove( Mouse( QEvent::MouseMove, { i_X, i_Y }, i_Buttons ), i_Ratio );
  }
  void Release( Qt::MouseButtons i_Buttons )
  {
    Camera.OnMouseRelease( Mouse( QEvent::MouseButtonRelease, {}, i_Buttons ), 1 );
  }
  // Where a world point lies on the screen, device pixels from the top left.
  QVector2D Screen( const QVector3D& i_rWorld )
  {
    Camera.Step();
    const QVector3D Clip = ( Fields.projection * Fields.view ).map( i_rWorld );
    return { ( Clip.x() * 0.5f + 0.5f ) * float( Fields.viewportSize.width() ),
             ( 0.5f - Clip.y() * 0.5f ) * float( Fields.viewportSize.height() ) };
  }

  VCameraController Camera;
  const VCameraFields& Fields = Camera.Fields();
};

TEST_F( CameraControllerTest, TheViewOfEveryTypeAndUpAxis )
{
  const std::array< QVector4D, 1 > Focus = { QVector4D( 100, -200, 300, 0 ) };
  for ( int Case = 0; Case < ViewTypeCount * 2; ++Case )
  {
    const int Type = Case / 2;
    Camera.SetYUp( Case % 2 );
    Camera.SetViewType( Type );
    Camera.SetFocusPoints( Focus, false );
    Camera.Step();
    for ( const QVector3D World : { QVector3D( 0, 0, 0 ), QVector3D( 1000, 0, 0 ), QVector3D( 0, 500, 2000 ) } )
    {
      EXPECT_LT( ( Fields.view.map( World ) - InView( Fields, World ) ).length(), 0.03f ) << Case;
    }
    // In a view from the side, up in the world is up on the screen.
    const QVector3D Up = Fields.yUp ? AxisY : AxisZ;
    EXPECT_TRUE( Type >= EViewTop || Screen( Fields.centre + Up * 100 ).y() < 299 ) << Case;
  }
  Camera.SetViewType( 99 );
  Camera.SetViewType( -1 );
  EXPECT_EQ( Camera.GetViewType(), EViewBottom );
  EXPECT_STREQ( ViewTypeName( 5 ), "Top" );
  EXPECT_STREQ( ViewTypeName( 7 ), "" );
}

TEST_F( CameraControllerTest, ProjectionsFollowSizeTypeAndScale )
{
  const double Cotangent = 1.0 / std::tan( 22.5 * Degree );
  const std::tuple< int, QSize, double, double > Cases[] = {
      { EViewPerspective, { 400, 0 }, Cotangent / 400, Cotangent },
      { EViewPerspective, { 800, 600 }, Cotangent * 600 / 800, Cotangent },
      { EViewTop, { 800, 600 }, 2.0 / ( 800 * 4.0 ), 2.0 / ( 600 * 4.0 ) },
      { EViewTop, { 400, 200 }, 2.0 / ( 400 * 4.0 ), 2.0 / ( 200 * 4.0 ) } };
  for ( const auto& [Type, Size, X, Y] : Cases )
  {
    Camera.SetViewType( Type );
    Camera.SetSize( Size );
    EXPECT_NEAR( Fields.projection( 0, 0 ), X, X * 1e-5 );
    EXPECT_NEAR( Fields.projection( 1, 1 ), Y, Y * 1e-5 );
  }
  VRenderContext Render;
  Camera.Step();
  Camera.Apply( Render );
  EXPECT_EQ( Render.Projection(), Fields.projection );
  EXPECT_EQ( Render.View(), Fields.view );
  EXPECT_EQ( Render.Viewport(), QRect( 0, 0, 400, 200 ) );
  EXPECT_EQ( Render.FrameSize(), QSize( 400, 200 ) );
}

TEST_F( CameraControllerTest, APanCarriesThePointUnderThePointerAlong )
{
  for ( const int Type : { EViewPerspective, EViewFront, EViewTop } )
  {
    for ( const float Ratio : { 1.0f, 2.0f, 1.5f } )
    {
      Camera.SetViewType( Type );
      const QVector3D Point = Fields.centre;
      const QVector2D Before = Screen( Point );
      Press( 100, 100, Qt::LeftButton | Qt::RightButton, Ratio );
      EXPECT_TRUE( Fields.panning && !Fields.orbiting );
      Move( 140, 70, Qt::LeftButton | Qt::RightButton, Ratio );
      EXPECT_LT( ( Screen( Point ) - Before - QVector2D( 40, -30 ) * Ratio ).length(), 0.07f ) << Type;
      Release( {} );
      EXPECT_FALSE( Fields.panning );
    }
  }
}

TEST_F( CameraControllerTest, OrbitAndZoomByDragging )
{
  Press( 10.9, 20.9, Qt::LeftButton );
  EXPECT_EQ( Fields.lastPosition, QPoint( 10, 20 ) ) << "a press truncates";
  Move( 20.5, 14.4, Qt::LeftButton );
  EXPECT_EQ( Fields.lastPosition, QPoint( 21, 14 ) ) << "a move rounds";
  EXPECT_FLOAT_EQ( Fields.azimuth, 45 + 11 * 0.2f );
  EXPECT_FLOAT_EQ( Fields.tilt, -60 - 6 * 0.2f );
  Move( 21, 2014, Qt::LeftButton );
  EXPECT_FLOAT_EQ( Fields.tilt, -60 - 6 * 0.2f + 400 ) << "over the pole";
  Release( {} );
  Move( 500, 500, {} );
  EXPECT_FLOAT_EQ( Fields.azimuth, 45 + 11 * 0.2f ) << "no gesture";

  Press( 0, 0, Qt::RightButton );
  Move( 0, 10, Qt::RightButton );
  EXPECT_FLOAT_EQ( Fields.distance, 7000 + 150 );
  Release( {} );
  Camera.SetViewType( EViewLeft );
  Press( 0, 0, Qt::LeftButton );
  EXPECT_FALSE( Fields.orbiting || Fields.zooming ) << "nothing to orbit";
  Press( 0, 0, Qt::RightButton );
  Move( 0, 20, Qt::RightButton );
  EXPECT_FLOAT_EQ( Fields.orthoScale, 4 * ( 1 + 20 * 0.0025f ) );
  EXPECT_NEAR( Fields.projection( 1, 1 ), 2.0 / ( 600 * 4.2 ), 1e-8 );
  Move( 0, -5000, Qt::RightButton );
  EXPECT_GT( Fields.orthoScale, 0.0f ) << "a jump cannot turn the view inside out";
}

TEST_F( CameraControllerTest, ButtonsThatChangeDuringAGesture )
{
  Press( 10, 10, Qt::LeftButton );
  Press( 50, 50, Qt::LeftButton | Qt::MiddleButton );
  EXPECT_TRUE( Fields.panning && !Fields.orbiting );
  EXPECT_EQ( Fields.lastPosition, QPoint( 10, 10 ) ) << "kept from the first press";
  Release( Qt::LeftButton );
  EXPECT_TRUE( Fields.orbiting ) << "the left button is still down";
  Press( 0, 0, Qt::MiddleButton );
  EXPECT_FALSE( Fields.panning || Fields.orbiting || Fields.zooming );
  SetInteractionMapper( nullptr );
  Press( 0, 0, Qt::LeftButton );
  EXPECT_FALSE( Fields.orbiting );
}

TEST_F( CameraControllerTest, WheelKeysAndReset )
{
  for ( const auto& [Delta, Distance] : { std::pair( 120, 6300.0f ), { 0, 5670.0f }, { -120, 6237.0f } } )
  {
    Camera.OnWheel( QWheelEvent( {}, {}, {}, { 0, Delta }, {}, {}, Qt::NoScrollPhase, false ) );
    EXPECT_FLOAT_EQ( Fields.distance, Distance );
  }
  const std::array< QVector4D, 1 > Focus = { QVector4D( 10, 20, 30, 5 ) };
  QMatrix4x4 Pose;
  Pose.translate( 1, 2, 3 );
  Camera.SetFocusPoints( Focus, false );
  Camera.SetLockPose( Pose );
  EXPECT_FALSE( Camera.OnKeyPress( Qt::Key_End ) );
  EXPECT_FLOAT_EQ( Fields.distance, 6237 );
  EXPECT_TRUE( Camera.OnKeyPress( Qt::Key_Home ) );
  EXPECT_EQ( Fields.centre, QVector3D( 0, 20, 0 ) );
  EXPECT_TRUE( Fields.lockPose.isIdentity() );
  EXPECT_EQ( QVector3D( Fields.distance, Fields.tilt, Fields.azimuth ), QVector3D( 7000, -60, 45 ) );
  Camera.Reset( true );
  EXPECT_EQ( QVector3D( Fields.distance, Fields.tilt, Fields.azimuth ), QVector3D( 1000, -90, 0 ) );
}

TEST_F( CameraControllerTest, ALockedViewMovesWithItsPose )
{
  const QVector3D Point( 200, 100, 50 );
  const QVector2D Before = Screen( Point );
  QMatrix4x4 Pose;
  Pose.translate( 1000, -500, 700 );
  Pose.rotate( 30, 0, 0, 1 );
  Camera.SetLockPose( Pose );
  EXPECT_LT( ( Screen( Pose.map( Point ) ) - Before ).length(), 0.02f );
}

TEST_F( CameraControllerTest, AFocusCentresOnTheBoxAndAFitShowsEverySphereWithItsMargin )
{
  const std::array< QVector4D, 3 > Spheres = { QVector4D( 0, 0, 0, 100 ), QVector4D( 1000, 50, -20, 10 ),
                                               QVector4D( std::nanf( "" ), 0, 0, 1 ) };
  Camera.SetFocusPoints( Spheres, false );
  Camera.SetFocusPoints( {}, true );
  Camera.SetFocusPoints( std::span( Spheres ).subspan( 2 ), true );
  EXPECT_EQ( Fields.centre, QVector3D( 455, 0, 0 ) );
  EXPECT_EQ( Fields.distance, 7000 );
  const std::array< QVector4D, 1 > One = { QVector4D( 10, 20, 30, 0 ) };
  Camera.SetFocusPoints( One, true );
  EXPECT_EQ( Fields.centre, QVector3D( 10, 20, 30 ) );
  EXPECT_NEAR( Fields.distance, 250 / std::sin( 22.5 * Degree ), 0.01 );
  Camera.SetViewType( EViewFront );
  Camera.SetFocusPoints( One, true );
  EXPECT_FLOAT_EQ( Fields.orthoScale, 500.0f / 600.0f );

  const std::array< QVector4D, 4 > Many = { QVector4D( -900, 0, 0, 100 ), QVector4D( 300, 1200, 40, 5 ),
                                            QVector4D( 0, 0, 1800, 50 ), QVector4D( 500, -700, 900, 0 ) };
  for ( int Case = 0; Case < ViewTypeCount * 2; ++Case )
  {
    // At 1:1 the side planes are exact; the closest sphere then touches its plane.
    const bool bPerspective = Case / 2 == EViewPerspective;
    Camera.SetSize( bPerspective ? QSize( 700, 700 ) : QSize( 800, 600 ) );
    Camera.SetYUp( Case % 2 );
    Camera.SetViewType( Case / 2 );
    Camera.SetFocusPoints( Many, true );
    double Tightest = 1e9;
    for ( const QVector4D& rSphere : Many )
    {
      const QVector3D P = InView( Fields, rSphere.toVector3D() );
      for ( const auto& [Half, Place] : { std::pair( 300, std::abs( P.y() ) ), { 400, std::abs( P.x() ) } } )
      {
        const double Room = bPerspective ? -P.z() * std::sin( 22.5 * Degree ) - Place * std::cos( 22.5 * Degree )
                                         : Fields.orthoScale * float( Half ) - Place;
        Tightest = std::min( Tightest, Room - rSphere.w() - 250 );
      }
    }
    EXPECT_NEAR( Tightest, 0.0, 0.05 ) << Case;
  }
}

#include <ComputeCameraModel/VCameraModel.h>

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numbers>
#include <random>

using namespace ComputeCameraModel;
using CoreMoxelTypes::VCameraCalibration;
using CoreMoxelTypes::VCameraHardware;

namespace
{
/// Row-major, in double precision.
using VRows = std::array< double, 16 >;
using VTurn = std::array< double, 9 >;

/// World to camera through a quaternion, which the model does not use.
VTurn TurnOf( const CoreMoxelTypes::D3& i_rVector )
{
  const double Angle = std::sqrt( i_rVector.x * i_rVector.x + i_rVector.y * i_rVector.y + i_rVector.z * i_rVector.z );
  const double S = Angle > 0 ? std::sin( Angle / 2 ) / Angle : 0.5, W = std::cos( Angle / 2 );
  const double X = i_rVector.x * S, Y = i_rVector.y * S, Z = i_rVector.z * S;
  return { 1 - 2 * ( Y * Y + Z * Z ), 2 * ( X * Y - W * Z ),     2 * ( X * Z + W * Y ),
           2 * ( X * Y + W * Z ),     1 - 2 * ( X * X + Z * Z ), 2 * ( Y * Z - W * X ),
           2 * ( X * Z - W * Y ),     2 * ( Y * Z + W * X ),     1 - 2 * ( X * X + Y * Y ) };
}

/// The model's matrices as closed forms of a camera's numbers.
struct VExact
{
  double W, H, A, F, S, Px, Py, Roll = 0;
  VTurn R;
  VRows WorldFromCamera, FrustumTransform, CameraFromWorld;
  std::array< double, 2 > Dc;

  VExact( const VCameraHardware& i_rHardware, const VCameraCalibration& i_rC )
    : W( i_rHardware.SensorWidth )
    , H( i_rHardware.SensorHeight )
    , A( i_rC.AspectRatio * i_rHardware.PixelAspect )
    , F( i_rC.FocalLength )
    , S( i_rC.Skew )
    , Px( i_rC.PrincipalPoint[0] )
    , Py( i_rC.PrincipalPoint[1] )
    , R( TurnOf( i_rC.Rotation ) )
    , Dc{ i_rC.DistortionCentre[0], i_rC.DistortionCentre[1] }
  {
    const auto& P = i_rC.Position;
    const auto Along = [&]( std::size_t i_Row )
    {
      return R[3 * i_Row] * P.x + R[3 * i_Row + 1] * P.y + R[3 * i_Row + 2] * P.z;
    };
    WorldFromCamera = { R[0], R[3], R[6], P.x, R[1], R[4], R[7], P.y, R[2], R[5], R[8], P.z, 0, 0, 0, 1 };
    CameraFromWorld = { R[0],  R[1],  R[2],  -Along( 0 ), -R[3], -R[4], -R[5], Along( 1 ),
                        -R[6], -R[7], -R[8], Along( 2 ),  0,     0,     0,     1 };
    Roll = std::atan2( R[2], -R[5] );
    // The frustum's own x and y are those of its far corners, whose rays the lens decides.
    const double Size = 500 / std::sqrt( W * W + H * A * H * A + 4 * F * F );
    const double X[3] = { W * Size, -W * Size * A * S * H / ( W * F ), W * Size * ( 1 - 2 * Px / W ) };
    const double Y[2] = { H * A * Size, H * A * Size * ( 1 - 2 * Py / ( H * A ) ) };
    for ( std::size_t Row = 0; Row < 3; ++Row )
    {
      const double* pWorld = &WorldFromCamera[4 * Row];
      FrustumTransform[4 * Row] = pWorld[0] * X[0];
      FrustumTransform[4 * Row + 1] = pWorld[0] * X[1] + pWorld[1] * Y[0];
      FrustumTransform[4 * Row + 2] = pWorld[0] * X[2] + pWorld[1] * Y[1] + pWorld[2] * 2 * F * Size;
      FrustumTransform[4 * Row + 3] = pWorld[3];
    }
    std::copy_n( std::begin( { 0.0, 0.0, 0.0, 1.0 } ), 4, FrustumTransform.begin() + 12 );
  }

  /// Turned clockwise on the screen by minus that angle, about the centre of distortion.
  VRows Image( double i_Angle ) const
  {
    const double K = std::sqrt( W * H * A ) / F, C = std::cos( i_Angle ), N = std::sin( i_Angle );
    const double U[3] = { F, -S, Dc[0] - ( Px + 0.5 ) }, V[3] = { 0, -F / A, Dc[1] - ( Py + 0.5 ) / A };
    VRows Rows{};
    for ( std::size_t Column = 0; Column < 3; ++Column )
    {
      const bool bDepth = Column == 2;
      Rows[Column] = ( C * U[Column] + N * V[Column] - ( bDepth ? Dc[0] : 0 ) ) / W * K;
      Rows[4 + Column] = ( -N * U[Column] + C * V[Column] - ( bDepth ? Dc[1] : 0 ) ) / H * K;
    }
    Rows[10] = -100001.0 / 99999.0 * K;
    Rows[11] = -200000.0 / 99999.0 * K;
    Rows[14] = -K;
    return Rows;
  }
};

void ExpectNear( const ZEK::VMatrix4& i_rSeen, const VRows& i_rExact, const char* i_pName )
{
  double Largest = 0, Worst = 0;
  for ( std::size_t Index = 0; Index < 16; ++Index )
  {
    const double Exact = i_rExact[Index % 4 * 4 + Index / 4];
    Largest = std::max( Largest, std::abs( Exact ) );
    Worst = std::max( Worst, std::abs( static_cast< double >( i_rSeen[Index] ) - Exact ) );
  }
  EXPECT_LE( Worst, 1e-5 * Largest ) << i_pName;
}

void ExpectModel( const VCameraModel& i_rModel, const VExact& i_rExact )
{
  ExpectNear( i_rModel.WorldFromCamera, i_rExact.WorldFromCamera, "WorldFromCamera" );
  ExpectNear( i_rModel.FrustumTransform, i_rExact.FrustumTransform, "FrustumTransform" );
  ExpectNear( i_rModel.CameraFromWorld, i_rExact.CameraFromWorld, "CameraFromWorld" );
  ExpectNear( i_rModel.ImageTransform, i_rExact.Image( 0 ), "ImageTransform" );
  ExpectNear( i_rModel.ImageTransformRotated, i_rExact.Image( static_cast< double >( i_rModel.Roll ) ), "Rotated" );
  ExpectNear( i_rModel.ImageTransformSnapped, i_rExact.Image( static_cast< double >( i_rModel.SnappedRoll ) ),
              "Snapped" );
}

VCameraHardware Hardware()
{
  VCameraHardware Value;
  Value.SensorWidth = 1280;
  Value.SensorHeight = 1024;
  return Value;
}

VCameraCalibration Calibration( const CoreMoxelTypes::D3& i_rRotation )
{
  VCameraCalibration Value;
  Value.Rotation = i_rRotation;
  Value.Position = { 3000, -2500, 1800 };
  Value.PrincipalPoint[0] = 641.5;
  Value.PrincipalPoint[1] = 509;
  Value.RadialParameters = { -1e-8, 1e-15 };
  Value.DistortionCentre[0] = 630;
  Value.DistortionCentre[1] = 515;
  Value.FocalLength = 1400;
  return Value;
}

VCameraModel ModelOf( const VCameraCalibration& i_rCalibration )
{
  VCameraModel Model;
  Model.Set( Hardware(), i_rCalibration );
  return Model;
}
} // namespace

TEST( VCameraModel, AgreesWithClosedFormsInDoublePrecision )
{
  for ( std::uint32_t Seed = 0; Seed < 200; ++Seed )
  {
    SCOPED_TRACE( testing::Message() << "seed " << Seed );
    std::mt19937 Random( Seed );
    const auto In = [&]( double i_Low, double i_High )
    {
      return std::uniform_real_distribution( i_Low, i_High )( Random );
    };
    // Angles from next to nothing to many turns.
    const double Reach = std::pow( 10.0, In( -8, 4 ) );
    VCameraCalibration C = Calibration( { In( -Reach, Reach ), In( -Reach, Reach ), In( -Reach, Reach ) } );
    C.Position = { In( -9e3, 9e3 ), In( -9e3, 9e3 ), In( 0, 4e3 ) };
    C.FocalLength = std::pow( 10.0, In( 2, 4.5 ) );
    C.Skew = In( -20, 20 );
    C.AspectRatio = In( 0.5, 2 );
    C.PrincipalPoint[0] = In( 300, 900 );
    C.DistortionCentre[1] = In( 300, 800 );
    VCameraHardware H = Hardware();
    H.SensorWidth = static_cast< std::uint32_t >( In( 64, 8192 ) );
    H.PixelAspect = In( 0.8, 1.25 );
    VCameraModel Model;
    Model.Set( H, C );
    const VExact Exact( H, C );
    ExpectModel( Model, Exact );
    if ( std::hypot( Exact.R[2], Exact.R[5] ) > 0.01 )
    {
      EXPECT_NEAR( std::remainder( static_cast< double >( Model.Roll ) - Exact.Roll, 2 * std::numbers::pi ), 0, 1e-4 );
    }
  }
}

/// A camera that looks along world y and is turned about its own axis.
TEST( VCameraModel, TheRollTurnsWorldUpToTheTopOfTheScreen )
{
  constexpr double Degree = std::numbers::pi / 180;
  struct VCase
  {
    double Degrees, Snapped;
  };
  for ( const auto& [Degrees, Snapped] : { VCase{ 0, 0 }, { 50, 90 }, { -50, -90 }, { 44, 0 }, { 170, 180 } } )
  {
    // Half the turn on each side of the quarter that lays a camera down: quaternions multiplied by hand.
    const double Half = Degrees / 2 * Degree, Q = std::sqrt( 0.5 );
    const double W = Q * std::cos( Half ), X = Q * std::cos( Half ), Y = Q * std::sin( Half ), Z = Q * std::sin( Half );
    const double Length = std::sqrt( X * X + Y * Y + Z * Z ), Angle = 2 * std::atan2( Length, W );
    const VCameraModel Model = ModelOf( Calibration( { X / Length * Angle, Y / Length * Angle, Z / Length * Angle } ) );
    SCOPED_TRACE( testing::Message() << Degrees << " degrees" );
    EXPECT_NEAR( static_cast< double >( Model.Roll ), Degrees * Degree, 1e-5 );
    EXPECT_NEAR( static_cast< double >( Model.SnappedRoll ), Snapped * Degree, 1e-5 );
    // World up, seen in the image, is turned to point up on a screen whose y goes down.
    const float UpX = Model.WorldFromCamera[2], UpY = Model.WorldFromCamera[6];
    const VMatrix2& rR = Model.RollRotation;
    EXPECT_NEAR( rR[0] * UpX + rR[1] * UpY, 0, 1e-5 );
    EXPECT_NEAR( rR[2] * UpX + rR[3] * UpY, -1, 1e-5 );
    const VMatrix2& rI = Model.RollInverse;
    EXPECT_NEAR( rR[0] * rI[1] + rR[1] * rI[3], 0, 1e-6 );
    EXPECT_NEAR( rR[0] * rI[0] + rR[1] * rI[2], 1, 1e-6 );
    EXPECT_NEAR( Model.SnappedRotation[1], std::sin( static_cast< float >( Snapped * Degree ) ), 1e-6 );
    const VMatrix2& rS = Model.SnappedRotation;
    EXPECT_EQ( Model.SnappedInverse, ( VMatrix2{ rS[0], rS[2], rS[1], rS[3] } ) );
  }
}

TEST( VCameraModel, KeepsWhatACalibrationDoesNotSay )
{
  // A model that was turned before, with a lens of three parameters.
  VCameraCalibration Tilted = Calibration( { -1.2, 0.4, 0.3 } );
  Tilted.RadialModel = 1;
  Tilted.RadialParameters = { 1e-8, 2e-15, 3e-22 };
  VCameraModel Model = ModelOf( Tilted );
  const float Roll = Model.Roll;
  ASSERT_NE( Roll, 0 );
  EXPECT_EQ( Model.DistortionParameters, ( std::array{ 1e-8F, 2e-15F, 3e-22F } ) );

  VCameraCalibration Down = Calibration( {} );
  Down.RadialModel = 2;
  Down.RadialParameters.clear();
  Model.Set( Hardware(), Down );
  EXPECT_EQ( Model.Roll, Roll ) << "up has no direction in the image";
  EXPECT_EQ( Model.DistortionParameters[0], 1e-8F ) << "this model has no parameters to take";
  const ZEK::VMatrix4 Placed{ 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 3000, -2500, 1800, 1 };
  EXPECT_EQ( Model.WorldFromCamera, Placed );

  Down.RadialModel = 0;
  Down.RadialParameters = { 5e-9 };
  Model.Set( Hardware(), Down );
  EXPECT_EQ( Model.DistortionParameters, ( std::array{ 5e-9F, 0.0F, 0.0F } ) );
}

TEST( VCameraModel, NonsenseShowsInItsNumbers )
{
  constexpr double NaN = std::numeric_limits< double >::quiet_NaN();
  EXPECT_TRUE( ModelOf( Calibration( { 1e-9, 0, 0 } ) ).IsFinite() );
  EXPECT_TRUE( ModelOf( Calibration( { 1e150, -3e150, 0 } ) ).IsFinite() );
  EXPECT_TRUE( ModelOf( Calibration( { 1e-320, 0, 0 } ) ).IsFinite() );
  EXPECT_FALSE( ModelOf( Calibration( { NaN, 0, 0 } ) ).IsFinite() );
  EXPECT_FALSE( ModelOf( Calibration( { 1.7e308, 1.7e308, 0 } ) ).IsFinite() ) << "of a length beyond all numbers";
  const auto Broken = []( auto&& i_rBreak )
  {
    VCameraCalibration Value = Calibration( { -1.2, 0.4, 0.3 } );
    VCameraHardware H = Hardware();
    i_rBreak( Value, H );
    VCameraModel Model;
    Model.Set( H, Value );
    return !Model.IsFinite();
  };
  EXPECT_TRUE( Broken(
      []( auto& o_rC, auto& )
      {
        o_rC.Position.y = NaN;
      } ) );
  EXPECT_TRUE( Broken(
      []( auto& o_rC, auto& )
      {
        o_rC.PrincipalPoint[1] = NaN;
      } ) );
  EXPECT_TRUE( Broken(
      []( auto& o_rC, auto& )
      {
        o_rC.RadialParameters[1] = NaN;
      } ) );
  EXPECT_TRUE( Broken(
      []( auto& o_rC, auto& )
      {
        o_rC.DistortionCentre[0] = NaN;
      } ) );
  EXPECT_TRUE( Broken(
      []( auto& o_rC, auto& )
      {
        o_rC.AspectRatio = 0;
      } ) );
  EXPECT_TRUE( Broken(
      []( auto& o_rC, auto& )
      {
        o_rC.FocalLength = 1e-300;
      } ) );
  EXPECT_TRUE( Broken(
      []( auto&, auto& o_rH )
      {
        o_rH.SensorWidth = 0;
      } ) );
  EXPECT_TRUE( Broken(
      []( auto&, auto& o_rH )
      {
        o_rH.SensorHeight = 0;
      } ) );
  VCameraCalibration Unusable = Calibration( {} );
  Unusable.FocalLength = NaN;
  EXPECT_FALSE( IsUsable( Unusable ) );
}

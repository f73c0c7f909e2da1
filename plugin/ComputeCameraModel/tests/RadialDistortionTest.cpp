#include <ComputeCameraModel/VRadialDistortion.h>

#include <TestSupport/LogGuard.h>

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <numbers>
#include <random>

using namespace ComputeCameraModel;

namespace
{
constexpr double NoLimit = std::numeric_limits< double >::max();

VImagePoint At( const VImagePoint& i_rCentre, double i_Radius, double i_Direction )
{
  return { i_rCentre.x + i_Radius * std::cos( i_Direction ), i_rCentre.y + i_Radius * std::sin( i_Direction ) };
}

/// A lens whose terms reach up to the offset itself at the corner of the sensor.
VLensCalibration RandomLens( std::mt19937& io_rRandom )
{
  const auto In = [&]( double i_Low, double i_High )
  {
    return std::uniform_real_distribution( i_Low, i_High )( io_rRandom );
  };
  VLensCalibration Lens;
  Lens.Centre = { In( 200, 1500 ), In( 200, 1500 ) };
  Lens.Model = io_rRandom() % 2;
  const double Size = std::pow( 10.0, In( -4, 0 ) );
  const double CornerSq = Lens.Centre.x * Lens.Centre.x + Lens.Centre.y * Lens.Centre.y;
  double Unit = 1;
  for ( std::size_t Count = 0; Count < 2 + Lens.Model; ++Count )
  {
    Unit /= CornerSq;
    Lens.m_RadialParameters.push_back( In( -Size, Size ) * Unit );
  }
  return Lens;
}

/// The limit as the rule has it, stepping outwards.
double SteppedLimitSq( const VLensCalibration& i_rLens )
{
  std::array< double, 3 > K{};
  std::copy( i_rLens.m_RadialParameters.begin(), i_rLens.m_RadialParameters.end(), K.begin() );
  const double C = std::hypot( i_rLens.Centre.x, i_rLens.Centre.y );
  for ( double R = 0.2 * C; R < 40 * C; R *= 1.05 )
  {
    if ( 3 * K[0] * R * R + 5 * K[1] * std::pow( R, 4 ) + 7 * K[2] * std::pow( R, 6 ) < -1 )
    {
      return R * R * 0.9070294784580498;
    }
  }
  return 0;
}
} // namespace

TEST( VRadialDistortion, DistortingUndoesCorrectingAllOverTheDomain )
{
  int Folded = 0, Free = 0;
  for ( std::uint32_t Seed = 0; Seed < 2000; ++Seed )
  {
    SCOPED_TRACE( testing::Message() << "seed " << Seed );
    std::mt19937 Random( Seed );
    const VLensCalibration Lens = RandomLens( Random );
    const VRadialDistortion Distortion( Lens );
    const double Reach = std::hypot( Lens.Centre.x, Lens.Centre.y );
    const bool bFree = Distortion.MaxRawRadiusSq() == NoLimit;
    const double Most = bFree ? 40 * Reach : std::sqrt( Distortion.MaxRawRadiusSq() );
    ( bFree ? Free : Folded ) += 1;
    const double Limit = SteppedLimitSq( Lens );
    if ( !bFree && Limit > 0 && Limit > 0.04 * Reach * Reach )
    {
      // Where the steps stride over a fold the domain ends before that one.
      EXPECT_LE( Distortion.MaxRawRadiusSq(), Limit * ( 1 + 1e-12 ) );
    }
    std::uniform_real_distribution< double > Part( 0, 1 ), Direction( 0, 2 * std::numbers::pi );
    for ( int Point = 0; Point < 40; ++Point )
    {
      // Some places lie next to the centre, some at the very limit.
      const double Radius = Point < 4 ? std::pow( 10.0, -8.0 + Point * 2 ) : Point == 4 ? Most : Most * Part( Random );
      const VImagePoint Raw = At( Lens.Centre, Radius, Direction( Random ) );
      const double Distance = std::hypot( Raw.x - Lens.Centre.x, Raw.y - Lens.Centre.y );
      VImagePoint Corrected, Back;
      if ( !Distortion.Correct( Raw, Corrected ) || !Distortion.Distort( Corrected, Back ) )
      {
        EXPECT_GE( Distance, Most * ( 1 - 1e-12 ) ) << "refused inside of the domain";
        continue;
      }
      const bool bFine = Distortion.Slope( Distance ) > 0.01 && Distance > 1e-5;
      EXPECT_LE( std::hypot( Back.x - Raw.x, Back.y - Raw.y ), bFine ? 1e-9 : 1e-6 )
          << Distance << " px from the centre, slope " << Distortion.Slope( Distance );
    }
    VImagePoint Left{ -1, -1 };
    if ( !bFree )
    {
      EXPECT_FALSE( Distortion.Correct( At( Lens.Centre, Most * 1.001, 1 ), Left ) );
      EXPECT_FALSE(
          Distortion.Distort( At( Lens.Centre, std::sqrt( Distortion.MaxCorrectedRadiusSq() ) * 1.001, 1 ), Left ) );
      EXPECT_EQ( Left.x, -1 );
    }
  }
  EXPECT_GT( Folded, 500 );
  EXPECT_GT( Free, 200 );
}

TEST( VRadialDistortion, TheDomainEndsAStepBeforeTheFold )
{
  // 1 + 3 K1 r^2 turns negative at r = 1000.
  const VImagePoint Centre{ 640, 512 };
  const VRadialDistortion Barrel( { 0, { -1.0 / 3e6, 0 }, Centre } );
  double R = 0.2 * std::hypot( 640, 512 );
  while ( R <= 1000 )
  {
    R *= 1.05;
  }
  EXPECT_NEAR( std::sqrt( Barrel.MaxRawRadiusSq() ), R / 1.05, 1e-6 );
  const double Limit = R / 1.05;
  EXPECT_NEAR( std::sqrt( Barrel.MaxCorrectedRadiusSq() ), Limit - Limit * Limit * Limit / 3e6, 1e-6 );

  // Falls nowhere within 40 times the centre's distance: the last step is the limit.
  const double Reach = std::hypot( 640, 512 );
  const VRadialDistortion Weak( { 0, { -1e-12, 0 }, Centre } );
  EXPECT_GT( std::sqrt( Weak.MaxRawRadiusSq() ), 40 / 1.05 * Reach * 0.999 );
  EXPECT_LT( std::sqrt( Weak.MaxRawRadiusSq() ), 40 * Reach );

  // Folds before the first step, and a fold that lies between two steps.
  const VRadialDistortion Early( { 0, { -1.0 / ( 3 * 50 * 50 ), 0 }, Centre } );
  EXPECT_NEAR( std::sqrt( Early.MaxRawRadiusSq() ), 50 / 1.05, 1e-6 );
  // 1 - 2.001 s + s^2 with s = r^2 / 800^2 is negative from 0.969 to 1.032: less than a step wide.
  const double Unit = 1.0 / ( 800.0 * 800 );
  const VRadialDistortion Narrow( { 0, { -2.001 / 3 * Unit, Unit * Unit / 5 }, { 850, 0.001 } } );
  EXPECT_LT( Narrow.MaxRawRadiusSq(), 0.97 * 800 * 800 );
  EXPECT_GT( Narrow.MaxRawRadiusSq(), 0.8 * 800 * 800 );
}

TEST( VRadialDistortion, LensesThatChangeNothing )
{
  TestSupport::VAssertRecorder Asserts;
  const VImagePoint Point{ 1000, -3000 };
  const auto Same = [&]( const VLensCalibration& i_rLens )
  {
    const VRadialDistortionJacobian Lens( i_rLens );
    VImagePoint Corrected, Raw;
    VRadialDistortionJacobian::VJacobian J{};
    const bool bDone = Lens.Correct( Point, Corrected, J ) && Lens.Distort( Point, Raw );
    return bDone && Corrected.x == Point.x && Corrected.y == Point.y && Raw.x == Point.x && Raw.y == Point.y &&
           J == VRadialDistortionJacobian::VJacobian{ 1, 0, 0, 1 } && Lens.MaxRawRadiusSq() == NoLimit;
  };
  EXPECT_TRUE( Same( { 2, {}, { 640, 512 } } ) );
  EXPECT_TRUE( Same( { 0, { 0, 0 }, { 640, 512 } } ) );
  EXPECT_TRUE( Same( { 0, { -1e-6, 0 }, { 0, 0 } } ) ) << "a centre of (0, 0) means no distortion";
  EXPECT_TRUE( Asserts.Expressions().empty() );

  EXPECT_TRUE( Same( { 3, { -1e-7 }, { 640, 512 } } ) );
  EXPECT_TRUE( Same( { 0, { -1e-7 }, { 640, 512 } } ) );
  EXPECT_TRUE( Same( { 2, { -1e-7 }, { 640, 512 } } ) );
  const std::string Count = "m_LensCalibration.m_RadialParameters.size() == m_NumParameters";
  EXPECT_EQ( Asserts.Expressions(), ( std::vector< std::string >{ "Bad Radial Model", Count, Count } ) );

  const VRadialDistortion NoNumber( { 0, { std::nan( "" ), 0 }, { 640, 512 } } );
  VImagePoint Left{ 1, 2 };
  EXPECT_FALSE( NoNumber.Distort( Point, Left ) || NoNumber.Correct( Point, Left ) );
}

TEST( VRadialDistortionJacobian, GivesTheDerivativesOfBothMaps )
{
  const VRadialDistortionJacobian Lens( { 1, { -2e-7, 3e-14, -1e-21 }, { 640, 512 } } );
  constexpr double Step = 1e-3;
  for ( const VImagePoint& rAt : { VImagePoint{ 640, 512 }, { 641, 700 }, { 100, 30 }, { 1200, 900 } } )
  {
    const auto Check = [&]( auto i_pMap )
    {
      VRadialDistortionJacobian::VJacobian J{};
      VImagePoint Out, MoreX, LessX, MoreY, LessY;
      ASSERT_TRUE( ( Lens.*i_pMap )( rAt, Out, J ) );
      VRadialDistortionJacobian::VJacobian Unused{};
      ( Lens.*i_pMap )( { rAt.x + Step, rAt.y }, MoreX, Unused );
      ( Lens.*i_pMap )( { rAt.x - Step, rAt.y }, LessX, Unused );
      ( Lens.*i_pMap )( { rAt.x, rAt.y + Step }, MoreY, Unused );
      ( Lens.*i_pMap )( { rAt.x, rAt.y - Step }, LessY, Unused );
      EXPECT_NEAR( J[0], ( MoreX.x - LessX.x ) / ( 2 * Step ), 1e-7 );
      EXPECT_NEAR( J[1], ( MoreY.x - LessY.x ) / ( 2 * Step ), 1e-7 );
      EXPECT_NEAR( J[2], ( MoreX.y - LessX.y ) / ( 2 * Step ), 1e-7 );
      EXPECT_NEAR( J[3], ( MoreY.y - LessY.y ) / ( 2 * Step ), 1e-7 );
    };
    using VMap = bool ( VRadialDistortionJacobian::* )( const VImagePoint&, VImagePoint&,
                                                        VRadialDistortionJacobian::VJacobian& ) const;
    Check( static_cast< VMap >( &VRadialDistortionJacobian::Correct ) );
    Check( static_cast< VMap >( &VRadialDistortionJacobian::Distort ) );
  }
}

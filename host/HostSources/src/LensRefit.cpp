#include <ComputeCameraModel/VRadialDistortion.h>
#include <HostSources/CameraCalibrations.h>

#include <algorithm>
#include <cmath>

namespace HostSources
{
namespace
{
using ComputeCameraModel::VImagePoint;
using ComputeCameraModel::VRadialDistortion;

/// A place in the raw image, and where a perfect lens would show the same.
struct VSample
{
  VImagePoint Raw, Ideal;
};

constexpr int Columns = 33, Rows = 25;
constexpr std::size_t Unknowns = 5;
/// K1 to K3, for distances in units of the sensor's half diagonal, and the centre's offset in the same unit.
using VUnknowns = std::array< double, Unknowns >;

std::vector< VSample > SampleSensor( const VPinholeCamera& i_rPinhole, double i_Width, double i_Height )
{
  std::vector< VSample > Samples;
  Samples.reserve( static_cast< std::size_t >( Columns * Rows ) );
  for ( int Row = 0; Row < Rows; ++Row )
  {
    for ( int Column = 0; Column < Columns; ++Column )
    {
      const VImagePoint Raw{ i_Width * Column / ( Columns - 1 ) - 0.5, i_Height * Row / ( Rows - 1 ) - 0.5 };
      VPinholeCamera::VPoint Direction;
      if ( i_rPinhole.ToDirection( { Raw.x, Raw.y }, Direction ) )
      {
        const auto Ideal = i_rPinhole.ToImage( Direction, false );
        Samples.push_back( { Raw, { Ideal.x, Ideal.y } } );
      }
    }
  }
  return Samples;
}

/// Least squares by damped steps. What is fitted is the correction; each error is divided by the slope of the lens
/// there, so that it counts as it shows in the raw image.
class VLensFit
{
public:
  VLensFit( const std::vector< VSample >& i_rSamples, const VImagePoint& i_rStart, double i_Unit, std::size_t i_Terms )
    : m_rSamples( i_rSamples )
    , m_Start( i_rStart )
    , m_Unit( i_Unit )
    , m_Terms( i_Terms )
  {
  }

  void Run()
  {
    constexpr int MostRounds = 60;
    double Damping = 1e-4;
    double Error = Sum( m_Values );
    for ( int Round = 0; Round < MostRounds && Damping < 1e8; ++Round )
    {
      VUnknowns Step{};
      if ( !Solve( Damping, Step ) )
      {
        Damping *= 10;
        continue;
      }
      VUnknowns Next = m_Values;
      for ( std::size_t Index = 0; Index < Unknowns; ++Index )
      {
        Next[Index] += Step[Index];
      }
      const double NextError = Sum( Next );
      if ( !( NextError < Error ) )
      {
        Damping *= 10;
        continue;
      }
      const bool bDone = Error - NextError < 1e-12 * Error;
      m_Values = Next;
      Error = NextError;
      Damping = std::max( Damping / 10, 1e-12 );
      if ( bDone )
      {
        break;
      }
    }
  }

  ComputeCameraModel::VLensCalibration Lens() const
  {
    const double Sq = m_Unit * m_Unit;
    ComputeCameraModel::VLensCalibration Lens;
    Lens.Model = m_Terms == 3 ? 1 : 0;
    Lens.m_RadialParameters = { m_Values[0] / Sq, m_Values[1] / ( Sq * Sq ) };
    if ( m_Terms == 3 )
    {
      Lens.m_RadialParameters.push_back( m_Values[2] / ( Sq * Sq * Sq ) );
    }
    Lens.Centre = { m_Start.x + m_Values[3] * m_Unit, m_Start.y + m_Values[4] * m_Unit };
    return Lens;
  }

private:
  /// The two errors of a sample and their derivatives.
  struct VError
  {
    double X = 0, Y = 0;
    std::array< double, Unknowns > ByX{}, ByY{};
  };
  VError ErrorOf( const VSample& i_rSample, const VUnknowns& i_rAt ) const
  {
    const double X = ( i_rSample.Raw.x - m_Start.x ) / m_Unit - i_rAt[3];
    const double Y = ( i_rSample.Raw.y - m_Start.y ) / m_Unit - i_rAt[4];
    const double S = X * X + Y * Y;
    const double Factor = S * ( i_rAt[0] + S * ( i_rAt[1] + S * i_rAt[2] ) );
    const double Growth = 2 * ( i_rAt[0] + S * ( 2 * i_rAt[1] + S * 3 * i_rAt[2] ) );
    const double Weight = WeightOf( i_rSample );
    VError Error;
    Error.X = Weight * ( ( i_rSample.Raw.x - i_rSample.Ideal.x ) / m_Unit + X * Factor );
    Error.Y = Weight * ( ( i_rSample.Raw.y - i_rSample.Ideal.y ) / m_Unit + Y * Factor );
    double Power = Weight;
    for ( std::size_t Term = 0; Term < m_Terms; ++Term )
    {
      Power *= S;
      Error.ByX[Term] = X * Power;
      Error.ByY[Term] = Y * Power;
    }
    Error.ByX[3] = -Weight * ( Factor + Growth * X * X );
    Error.ByX[4] = Error.ByY[3] = -Weight * Growth * X * Y;
    Error.ByY[4] = -Weight * ( Factor + Growth * Y * Y );
    return Error;
  }
  /// One over the local stretch of the correction, roughly: the ratio of the two offsets.
  double WeightOf( const VSample& i_rSample ) const
  {
    const double Raw = std::hypot( i_rSample.Raw.x - m_Start.x, i_rSample.Raw.y - m_Start.y );
    const double Ideal = std::hypot( i_rSample.Ideal.x - m_Start.x, i_rSample.Ideal.y - m_Start.y );
    const double Stretch = Raw > 1 ? Ideal / Raw : 1;
    return 1 / std::max( Stretch * Stretch * Stretch, 0.1 );
  }
  double Sum( const VUnknowns& i_rAt ) const
  {
    double Sum = 0;
    for ( const VSample& rSample : m_rSamples )
    {
      const VError Error = ErrorOf( rSample, i_rAt );
      Sum += Error.X * Error.X + Error.Y * Error.Y;
    }
    return Sum;
  }
  bool Solve( double i_Damping, VUnknowns& o_rStep ) const
  {
    std::array< std::array< double, Unknowns + 1 >, Unknowns > M{};
    for ( const VSample& rSample : m_rSamples )
    {
      const VError Error = ErrorOf( rSample, m_Values );
      for ( std::size_t Row = 0; Row < Unknowns; ++Row )
      {
        for ( std::size_t Column = 0; Column < Unknowns; ++Column )
        {
          M[Row][Column] += Error.ByX[Row] * Error.ByX[Column] + Error.ByY[Row] * Error.ByY[Column];
        }
        M[Row][Unknowns] -= Error.ByX[Row] * Error.X + Error.ByY[Row] * Error.Y;
      }
    }
    for ( std::size_t Row = 0; Row < Unknowns; ++Row )
    {
      // A floor besides the share: the centre of a lens that bends nothing is not to wander.
      M[Row][Row] += i_Damping * M[Row][Row] + 1e-9;
    }
    for ( std::size_t Row = 0; Row < Unknowns; ++Row )
    {
      if ( !( M[Row][Row] > 0 ) )
      {
        return false;
      }
      for ( std::size_t Other = 0; Other < Unknowns; ++Other )
      {
        const double Share = Other == Row ? 0 : M[Other][Row] / M[Row][Row];
        for ( std::size_t Column = Row; Column <= Unknowns && Share != 0; ++Column )
        {
          M[Other][Column] -= Share * M[Row][Column];
        }
      }
    }
    for ( std::size_t Row = 0; Row < Unknowns; ++Row )
    {
      o_rStep[Row] = M[Row][Unknowns] / M[Row][Row];
    }
    return true;
  }

  const std::vector< VSample >& m_rSamples;
  VImagePoint m_Start;
  double m_Unit;
  std::size_t m_Terms;
  VUnknowns m_Values{};
};

VLensRefit Judge( const VRadialDistortion& i_rLens, const std::vector< VSample >& i_rSamples )
{
  VLensRefit Refit;
  double Sum = 0;
  std::size_t Count = 0;
  for ( const VSample& rSample : i_rSamples )
  {
    VImagePoint Raw;
    if ( i_rLens.Distort( rSample.Ideal, Raw ) )
    {
      const double Miss = std::hypot( Raw.x - rSample.Raw.x, Raw.y - rSample.Raw.y );
      Sum += Miss * Miss;
      Refit.Worst = std::max( Refit.Worst, Miss );
      ++Count;
    }
  }
  Refit.Rms = Count > 0 ? std::sqrt( Sum / static_cast< double >( Count ) ) : 0;
  Refit.Covered = static_cast< double >( Count ) / ( Columns * Rows );
  return Refit;
}

/// The lens of the most terms that covers the most of the sensor.
bool RefitLens( const VPinholeCamera& i_rPinhole, double i_Width, double i_Height,
                CoreMoxelTypes::VCameraCalibration& io_rCalibration, VLensRefit& o_rRefit )
{
  const std::vector< VSample > Samples = SampleSensor( i_rPinhole, i_Width, i_Height );
  if ( Samples.size() < 4 * Unknowns )
  {
    return false;
  }
  o_rRefit = {};
  o_rRefit.Covered = -1;
  for ( const std::size_t Terms : { 3u, 2u } )
  {
    VLensFit Fit( Samples, { i_rPinhole.Cx, i_rPinhole.Cy }, std::hypot( i_Width, i_Height ) / 2, Terms );
    Fit.Run();
    const ComputeCameraModel::VLensCalibration Lens = Fit.Lens();
    const VLensRefit Refit = Judge( VRadialDistortion( Lens ), Samples );
    if ( Refit.Covered > o_rRefit.Covered )
    {
      o_rRefit = Refit;
      io_rCalibration.RadialModel = Lens.Model;
      io_rCalibration.RadialParameters = Lens.m_RadialParameters;
      io_rCalibration.DistortionCentre[0] = Lens.Centre.x;
      io_rCalibration.DistortionCentre[1] = Lens.Centre.y;
    }
  }
  return true;
}
} // namespace

bool ConvertPinhole( const VPinholeCamera& i_rPinhole, VCalibratedCamera& io_rCamera, std::string& o_rReason )
{
  const auto& rP = i_rPinhole;
  const auto& rD = rP.Distortion;
  double All = rP.Fx + rP.Fy + rP.Cx + rP.Cy + rP.Skew + rP.Rotation.x + rP.Rotation.y + rP.Rotation.z +
               rP.Translation.x + rP.Translation.y + rP.Translation.z;
  for ( const double Term : rD )
  {
    All += Term;
  }
  if ( !std::isfinite( All ) )
  {
    o_rReason = "a number of its calibration is not finite";
    return false;
  }
  if ( !( rP.Fx > 0 && rP.Fy > 0 ) )
  {
    o_rReason = "its focal length is not above 0";
    return false;
  }
  const double Width = io_rCamera.Hardware.SensorWidth, Height = io_rCamera.Hardware.SensorHeight;
  CoreMoxelTypes::VCameraCalibration Calibration;
  const double Aspect = rP.Fx / rP.Fy;
  Calibration.FocalLength = rP.Fx;
  Calibration.AspectRatio = Aspect / io_rCamera.Hardware.PixelAspect;
  Calibration.Skew = rP.Skew;
  Calibration.PrincipalPoint[0] = rP.Cx;
  Calibration.PrincipalPoint[1] = Aspect * ( rP.Cy + 0.5 ) - 0.5;
  Calibration.Rotation = rP.Rotation;
  const std::array< double, 9 > R = RotationMatrix( rP.Rotation );
  const auto& rT = rP.Translation;
  Calibration.Position = { -( R[0] * rT.x + R[3] * rT.y + R[6] * rT.z ), -( R[1] * rT.x + R[4] * rT.y + R[7] * rT.z ),
                           -( R[2] * rT.x + R[5] * rT.y + R[8] * rT.z ) };
  Calibration.RadialParameters = { 0, 0 };
  Calibration.DistortionCentre[0] = rP.Cx;
  Calibration.DistortionCentre[1] = rP.Cy;
  io_rCamera.Refit = {};
  const bool bBends = std::any_of( rD.begin(), rD.end(),
                                   []( double i_Term )
                                   {
                                     return i_Term != 0;
                                   } );
  if ( bBends && !RefitLens( rP, Width, Height, Calibration, io_rCamera.Refit ) )
  {
    o_rReason = "its lens has no inverse on the sensor";
    return false;
  }
  io_rCamera.Calibration = std::move( Calibration );
  io_rCamera.Pinhole = rP;
  return true;
}

} // namespace HostSources

#include <ComputeCameraModel/VCameraModel.h>

#include <cmath>
#include <limits>
#include <numbers>

namespace ComputeCameraModel
{
namespace
{
using ZEK::VMatrix4;

constexpr double LeastAngle = 1e-6;
constexpr float LeastUp = 1e-6F;
constexpr float LeastLength = 1e-5F;
constexpr float FrustumLength = 500; // mm
constexpr float Near = 1, Far = 100000;

float Single( double i_Value )
{
  return static_cast< float >( i_Value );
}

/// Written by rows, as one reads it.
VMatrix4 Rows( const std::array< float, 16 >& i_rRows )
{
  VMatrix4 Matrix;
  for ( std::size_t Index = 0; Index < Matrix.size(); ++Index )
  {
    Matrix[Index % 4 * 4 + Index / 4] = i_rRows[Index];
  }
  return Matrix;
}

VMatrix4 operator*( const VMatrix4& i_rA, const VMatrix4& i_rB )
{
  VMatrix4 Product{};
  for ( std::size_t Column = 0; Column < 4; ++Column )
  {
    for ( std::size_t Row = 0; Row < 4; ++Row )
    {
      for ( std::size_t Step = 0; Step < 4; ++Step )
      {
        Product[Column * 4 + Row] += i_rA[Step * 4 + Row] * i_rB[Column * 4 + Step];
      }
    }
  }
  return Product;
}

VMatrix4 Translation( float i_X, float i_Y, float i_Z )
{
  return Rows( { 1, 0, 0, i_X, 0, 1, 0, i_Y, 0, 0, 1, i_Z, 0, 0, 0, 1 } );
}

VMatrix4 Scaling( float i_X, float i_Y, float i_Z )
{
  return Rows( { i_X, 0, 0, 0, 0, i_Y, 0, 0, 0, 0, i_Z, 0, 0, 0, 0, 1 } );
}

/// In the plane of x and y, from the upper left block that is given.
VMatrix4 PlaneRotation( const VMatrix2& i_rBlock )
{
  return Rows( { i_rBlock[0], i_rBlock[1], 0, 0, i_rBlock[2], i_rBlock[3], 0, 0, 0, 0, 1, 0, 0, 0, 0, 1 } );
}

/// About an axis of length 1. The turn is taken in double precision: an angle may be many turns.
VMatrix4 AxisRotation( double i_Angle, const std::array< double, 3 >& i_rAxis )
{
  const double C = std::cos( i_Angle ), S = std::sin( i_Angle ), V = 1 - C;
  const auto& [X, Y, Z] = i_rAxis;
  return Rows( { Single( C + V * X * X ), Single( V * X * Y - S * Z ), Single( V * X * Z + S * Y ), 0,
                 Single( V * X * Y + S * Z ), Single( C + V * Y * Y ), Single( V * Y * Z - S * X ), 0,
                 Single( V * X * Z - S * Y ), Single( V * Y * Z + S * X ), Single( C + V * Z * Z ), 0, 0, 0, 0, 1 } );
}

/// Of a perspective whose near plane is the image of a lens of focal length 1 / `i_Right`.
VMatrix4 Frustum( float i_Left, float i_Right, float i_Bottom, float i_Top )
{
  const float Width = i_Right - i_Left, Height = i_Top - i_Bottom, Depth = Far - Near;
  return Rows( { 2 * Near / Width, 0, ( i_Left + i_Right ) / Width, 0, 0, 2 * Near / Height,
                 ( i_Top + i_Bottom ) / Height, 0, 0, 0, -( Near + Far ) / Depth, -2 * Near * Far / Depth, 0, 0, -1,
                 0 } );
}

/// So that the image keeps unit area.
VMatrix4 Normalised( VMatrix4 i_Matrix )
{
  const float Factor = 1 / std::sqrt( std::abs( i_Matrix[0] * i_Matrix[5] - i_Matrix[4] * i_Matrix[1] ) );
  for ( float& rElement : i_Matrix )
  {
    rElement *= Factor;
  }
  return i_Matrix;
}

/// The image turned by `i_Angle` against the sense in which the sensor's axes turn into one another.
void FillRotation( float i_Cosine, float i_Sine, VMatrix2& o_rRotation, VMatrix2& o_rInverse )
{
  o_rRotation = { i_Cosine, i_Sine, -i_Sine, i_Cosine };
  o_rInverse = { i_Cosine, -i_Sine, i_Sine, i_Cosine };
}

/// What of the two values the matrices are made from.
struct VLens
{
  float W, H, A, F, S, Px, Py;
};

VMatrix4 MakeFrustumTransform( const VMatrix4& i_rWorldFromCamera, const VLens& i_rLens )
{
  const auto& [W, H, A, F, S, Px, Py] = i_rLens;
  float X = W, Y = H * A, Z = 2 * F;
  const float Length = std::hypot( X, Y, Z );
  const float Divisor = std::abs( Length - 1 ) <= LeastLength || Length <= LeastLength ? 1 : Length;
  const float Factor = FrustumLength / Divisor;
  const VMatrix4 Shear =
      Rows( { 1, -A * S * H / ( W * F ), 1 - 2 * Px / W, 0, 0, 1, 1 - 2 * Py / ( H * A ), 0, 0, 0, 1, 0, 0, 0, 0, 1 } );
  return i_rWorldFromCamera * ( Scaling( X * Factor, Y * Factor, Z * Factor ) * Shear );
}

/// From the view to sensor pixels; the corner of the sensor is (0, 0).
VMatrix4 MakeSensorTransform( const VLens& i_rLens )
{
  const auto& [W, H, A, F, S, Px, Py] = i_rLens;
  const VMatrix4 Skew = Rows( { 1, S * A / F, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1 } );
  return Translation( Px + 0.5F, ( Py + 0.5F ) / A, 0 ) * Skew * Frustum( -1 / F, 1 / F, A / F, -A / F );
}
} // namespace

void VCameraModel::SetRoll( float i_Roll )
{
  if ( i_Roll == Roll || !std::isfinite( i_Roll ) )
  {
    return;
  }
  Roll = i_Roll;
  FillRotation( std::cos( Roll ), std::sin( Roll ), RollRotation, RollInverse );
  const float Quarters = std::round( Roll * 2 / std::numbers::pi_v< float > );
  SnappedRoll = Quarters * std::numbers::pi_v< float > / 2;
  // Exactly a quarter: pixels stay pixels.
  static constexpr std::array< float, 4 > Cosines{ 1, 0, -1, 0 };
  const auto Turn = static_cast< std::size_t >( static_cast< int >( std::fmod( Quarters, 4.0F ) ) & 3 );
  FillRotation( Cosines[Turn], Cosines[( Turn + 3 ) % 4], SnappedRotation, SnappedInverse );
}

void VCameraModel::Set( const CoreMoxelTypes::VCameraHardware& i_rHardware,
                        const CoreMoxelTypes::VCameraCalibration& i_rCalibration )
{
  const CoreMoxelTypes::D3& rTurn = i_rCalibration.Rotation;
  const double Angle = std::hypot( rTurn.x, rTurn.y, rTurn.z );
  const std::array< double, 3 > Axis =
      Angle > 0 ? std::array< double, 3 >{ rTurn.x / Angle, rTurn.y / Angle, rTurn.z / Angle }
                : std::array< double, 3 >{};
  const float X = Single( i_rCalibration.Position.x ), Y = Single( i_rCalibration.Position.y ),
              Z = Single( i_rCalibration.Position.z );
  // An angle that is not a number has to show in the matrices.
  WorldFromCamera = Translation( X, Y, Z );
  if ( !( Angle <= LeastAngle ) )
  {
    WorldFromCamera = WorldFromCamera * AxisRotation( -Angle, Axis );
  }
  const float UpX = WorldFromCamera[2], UpY = WorldFromCamera[6];
  if ( std::abs( UpX ) + std::abs( UpY ) > LeastUp )
  {
    SetRoll( std::atan2( UpX, -UpY ) );
  }

  const VLens Lens{ Single( i_rHardware.SensorWidth ),
                    Single( i_rHardware.SensorHeight ),
                    Single( i_rCalibration.AspectRatio * i_rHardware.PixelAspect ),
                    Single( i_rCalibration.FocalLength ),
                    Single( i_rCalibration.Skew ),
                    Single( i_rCalibration.PrincipalPoint[0] ),
                    Single( i_rCalibration.PrincipalPoint[1] ) };
  FrustumTransform = MakeFrustumTransform( WorldFromCamera, Lens );

  const VMatrix4 Sensor = MakeSensorTransform( Lens );
  const VMatrix4 ToUnit = Scaling( 1 / Lens.W, 1 / Lens.H, 1 );
  DistortionCentre = { Single( i_rCalibration.DistortionCentre[0] ), Single( i_rCalibration.DistortionCentre[1] ) };
  const auto CentreX = DistortionCentre[0], CentreY = DistortionCentre[1];
  const auto Turned = [&]( const VMatrix2& i_rRotation )
  {
    return Normalised( ToUnit * Translation( CentreX, CentreY, 0 ) * PlaneRotation( i_rRotation ) *
                       Translation( -CentreX, -CentreY, 0 ) * Sensor );
  };
  ImageTransform = Normalised( ToUnit * Sensor );
  ImageTransformRotated = Turned( RollRotation );
  ImageTransformSnapped = Turned( SnappedRotation );

  // Half a turn about z, then about y: from the sensor's axes to those of a view.
  CameraFromWorld = Rows( { 1, 0, 0, 0, 0, -1, 0, 0, 0, 0, -1, 0, 0, 0, 0, 1 } ) * AxisRotation( Angle, Axis ) *
                    Translation( -X, -Y, -Z );

  if ( i_rCalibration.RadialModel > 1 )
  {
    return;
  }
  const std::size_t Count = i_rCalibration.RadialModel == 0 ? 2 : 3;
  for ( std::size_t Index = 0; Index < DistortionParameters.size(); ++Index )
  {
    const auto& rParameters = i_rCalibration.RadialParameters;
    DistortionParameters[Index] = Index < Count && Index < rParameters.size() ? Single( rParameters[Index] ) : 0.0F;
  }
}

bool VCameraModel::IsFinite() const
{
  const auto AllFinite = []( const auto&... i_rArrays )
  {
    bool bFinite = true;
    const auto Look = [&]( const auto& i_rArray )
    {
      for ( const float Value : i_rArray )
      {
        bFinite = bFinite && std::isfinite( Value );
      }
    };
    ( Look( i_rArrays ), ... );
    return bFinite;
  };
  return AllFinite( WorldFromCamera, FrustumTransform, CameraFromWorld, ImageTransform, ImageTransformSnapped,
                    ImageTransformRotated, DistortionCentre, DistortionParameters );
}

} // namespace ComputeCameraModel

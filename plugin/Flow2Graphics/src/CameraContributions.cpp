#include <Flow2Graphics/CameraContributions.h>

#include <ComputeCameraModel/VCameraModel.h>

#include <algorithm>
#include <cmath>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;

double Dot( const D3& i_rA, const D3& i_rB )
{
  return i_rA.x * i_rB.x + i_rA.y * i_rB.y + i_rA.z * i_rB.z;
}

/// The rows of the turn by a vector: its length the angle, its direction the axis.
std::array< D3, 3 > TurnRows( const D3& i_rTurn )
{
  const double Angle = std::sqrt( Dot( i_rTurn, i_rTurn ) );
  if ( !( Angle > 0 ) )
  {
    return { D3{ 1, 0, 0 }, D3{ 0, 1, 0 }, D3{ 0, 0, 1 } };
  }
  const double X = i_rTurn.x / Angle, Y = i_rTurn.y / Angle, Z = i_rTurn.z / Angle;
  const double C = std::cos( Angle ), S = std::sin( Angle ), V = 1 - C;
  return { D3{ C + V * X * X, V * X * Y - S * Z, V * X * Z + S * Y },
           D3{ V * X * Y + S * Z, C + V * Y * Y, V * Y * Z - S * X },
           D3{ V * X * Z - S * Y, V * Y * Z + S * X, C + V * Z * Z } };
}

bool IsFinite( const VCameraCalibration& i_rC )
{
  double Sum = i_rC.Rotation.x + i_rC.Rotation.y + i_rC.Rotation.z + i_rC.Position.x + i_rC.Position.y +
               i_rC.Position.z + i_rC.PrincipalPoint[0] + i_rC.PrincipalPoint[1] + i_rC.DistortionCentre[0] +
               i_rC.DistortionCentre[1] + i_rC.FocalLength + i_rC.Skew;
  for ( const double Parameter : i_rC.RadialParameters )
  {
    Sum += Parameter;
  }
  return std::isfinite( Sum );
}

VContribution Measure( const VContributor& i_rCamera, std::uint32_t i_Camera, std::size_t i_Centroid,
                       const VReconstructionSet& i_rSet, std::uint32_t i_Reconstruction )
{
  VContribution Found;
  Found.Camera = i_Camera;
  Found.Centroid = static_cast< std::uint32_t >( i_Centroid );
  Found.Reconstruction = i_Reconstruction;
  if ( !i_rCamera.pProjection || !i_rCamera.pProjection->IsUsable() )
  {
    return Found;
  }
  const VCentroid& rSeen = i_rCamera.pCentroids->Centroids[i_Centroid];
  ComputeCameraModel::VImagePoint Image;
  if ( !i_rCamera.pProjection->Project( i_rSet.Items[i_Reconstruction].Position, Image ) )
  {
    Found.State = EContribution::NotInImage;
    return Found;
  }
  Found.State = EContribution::Measured;
  Found.Error = std::hypot( Image.x - static_cast< double >( rSeen.x ), Image.y - static_cast< double >( rSeen.y ) );
  return Found;
}

/// Of one camera, of those reconstructions that `i_rWanted` takes.
template < typename TWanted >
void FindOf( const VContributor& i_rCamera, std::uint32_t i_Camera, const VReconstructionSet& i_rSet,
             const TWanted& i_rWanted, std::vector< VContribution >& io_rFound )
{
  if ( !i_rCamera.pCentroids || !i_rCamera.pAssignments )
  {
    return;
  }
  const auto& rAssigned = i_rCamera.pAssignments->Reconstruction;
  const std::size_t Count = std::min( rAssigned.size(), i_rCamera.pCentroids->Centroids.size() );
  for ( std::size_t Centroid = 0; Centroid < Count; ++Centroid )
  {
    const auto Index = static_cast< std::uint32_t >( rAssigned[Centroid] );
    if ( rAssigned[Centroid] >= 0 && Index < i_rSet.Items.size() && i_rWanted( Index ) )
    {
      io_rFound.push_back( Measure( i_rCamera, i_Camera, Centroid, i_rSet, Index ) );
    }
  }
}
} // namespace

VSensorProjection::VSensorProjection( const VCameraHardware& i_rHardware, const VCameraCalibration& i_rCalibration )
  : m_Rows( TurnRows( i_rCalibration.Rotation ) )
  , m_Position( i_rCalibration.Position )
  , m_Fx( i_rCalibration.FocalLength )
  , m_Skew( i_rCalibration.Skew )
  , m_Px( i_rCalibration.PrincipalPoint[0] )
{
  const double Aspect = i_rCalibration.AspectRatio * i_rHardware.PixelAspect;
  if ( !ComputeCameraModel::IsUsable( i_rCalibration ) || !( Aspect > 0 ) || !std::isfinite( Aspect ) ||
       !IsFinite( i_rCalibration ) )
  {
    return;
  }
  m_Fy = m_Fx / Aspect;
  // Counted from the sensor's edge the place is scaled, and the edge lies half a pixel before the first centre.
  m_Py = ( i_rCalibration.PrincipalPoint[1] + 0.5 ) / Aspect - 0.5;
  ComputeCameraModel::VLensCalibration Lens;
  Lens.Model = i_rCalibration.RadialModel;
  Lens.m_RadialParameters = i_rCalibration.RadialParameters;
  Lens.m_RadialParameters.resize( Lens.Model == 0 ? 2 : 3 ); // those that are missing count as 0
  Lens.Centre = { i_rCalibration.DistortionCentre[0], i_rCalibration.DistortionCentre[1] };
  m_Lens.emplace( std::move( Lens ) );
}

bool VSensorProjection::Project( const D3& i_rPlace, ComputeCameraModel::VImagePoint& o_rImage ) const
{
  const D3 Away{ i_rPlace.x - m_Position.x, i_rPlace.y - m_Position.y, i_rPlace.z - m_Position.z };
  const double Depth = Dot( m_Rows[2], Away );
  if ( !m_Lens || !( Depth > 0 ) )
  {
    return false;
  }
  const double X = Dot( m_Rows[0], Away ) / Depth, Y = Dot( m_Rows[1], Away ) / Depth;
  const bool bSeen = m_Lens->Distort( { m_Px + m_Fx * X + m_Skew * Y, m_Py + m_Fy * Y }, o_rImage );
  return bSeen && std::isfinite( o_rImage.x ) && std::isfinite( o_rImage.y );
}

void FindContributions( std::span< const VContributor > i_Cameras, const VReconstructionSet& i_rSet,
                        std::uint32_t i_Reconstruction, std::vector< VContribution >& io_rFound )
{
  for ( std::size_t Camera = 0; Camera < i_Cameras.size(); ++Camera )
  {
    FindOf(
        i_Cameras[Camera], static_cast< std::uint32_t >( Camera ), i_rSet,
        [&]( std::uint32_t i_Index )
        {
          return i_Index == i_Reconstruction;
        },
        io_rFound );
  }
}

void FindCameraContributions( std::span< const VContributor > i_Cameras, const VReconstructionSet& i_rSet,
                              std::uint32_t i_Camera, std::vector< VContribution >& io_rFound )
{
  if ( i_Camera < i_Cameras.size() )
  {
    FindOf(
        i_Cameras[i_Camera], i_Camera, i_rSet,
        []( std::uint32_t )
        {
          return true;
        },
        io_rFound );
  }
}

std::uint32_t ReprojectionErrorColour( double i_Error )
{
  struct VStop
  {
    double Error;
    std::array< double, 3 > Colour;
  };
  static constexpr VStop Stops[] = { { 0, { 64, 192, 72 } }, { 1, { 240, 208, 48 } }, { 3, { 224, 56, 48 } } };
  if ( std::isnan( i_Error ) )
  {
    return 0x808489;
  }
  const double Error = std::clamp( i_Error, 0.0, 3.0 );
  const VStop& rFrom = Stops[Error < 1 ? 0 : 1];
  const VStop& rTo = Stops[Error < 1 ? 1 : 2];
  const double Part = ( Error - rFrom.Error ) / ( rTo.Error - rFrom.Error );
  std::uint32_t Colour = 0;
  for ( std::size_t Channel = 0; Channel < 3; ++Channel )
  {
    const double Mixed = rFrom.Colour[Channel] + Part * ( rTo.Colour[Channel] - rFrom.Colour[Channel] );
    Colour = Colour << 8 | static_cast< std::uint32_t >( std::lround( Mixed ) );
  }
  return Colour;
}

} // namespace Flow2Graphics

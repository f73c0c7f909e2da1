#include "SimulatedLens.h"

#include <cmath>

namespace HostSources::Simulation
{
namespace
{

constexpr double Nearest = 100; // mm: what is nearer is no marker on a stage

/// Turned by an angle-axis vector.
D3 Turned( const D3& i_rPoint, const D3& i_rTurn )
{
  const double Angle = Length( i_rTurn );
  if ( !( Angle > 0 ) )
  {
    return i_rPoint;
  }
  const D3 Axis = i_rTurn * ( 1 / Angle );
  const double C = std::cos( Angle ), S = std::sin( Angle );
  return i_rPoint * C + Cross( Axis, i_rPoint ) * S + Axis * ( Dot( Axis, i_rPoint ) * ( 1 - C ) );
}

} // namespace

VSensorView::VSensorView( const CoreMoxelTypes::VCameraHardware& i_rHardware,
                          const CoreMoxelTypes::VCameraCalibration& i_rCalibration )
  : m_Position( i_rCalibration.Position )
  , m_Focal( i_rCalibration.FocalLength )
  , m_FocalY( i_rCalibration.FocalLength / ( i_rCalibration.AspectRatio * i_rHardware.PixelAspect ) )
  , m_Skew( i_rCalibration.Skew )
  , m_Px( i_rCalibration.PrincipalPoint[0] )
  , m_Py( ( i_rCalibration.PrincipalPoint[1] + 0.5 ) / ( i_rCalibration.AspectRatio * i_rHardware.PixelAspect ) - 0.5 )
  , m_Width( i_rHardware.SensorWidth )
  , m_Height( i_rHardware.SensorHeight )
  , m_Lens( { i_rCalibration.RadialModel,
              i_rCalibration.RadialParameters,
              { i_rCalibration.DistortionCentre[0], i_rCalibration.DistortionCentre[1] } } )
{
  // The way back turns the camera's axes into the world's.
  const D3 Back = i_rCalibration.Rotation * -1;
  m_Rows[0] = Turned( { 1, 0, 0 }, Back );
  m_Rows[1] = Turned( { 0, 1, 0 }, Back );
  m_Rows[2] = Turned( { 0, 0, 1 }, Back );
}

bool VSensorView::Project( const D3& i_rPoint, VSensorPoint& o_rPoint ) const
{
  const D3 Away = i_rPoint - m_Position;
  const double Depth = Dot( m_Rows[2], Away );
  if ( !( Depth > Nearest ) )
  {
    return false;
  }
  const double X = Dot( m_Rows[0], Away ) / Depth, Y = Dot( m_Rows[1], Away ) / Depth;
  // No lens brings back what lies that far out, and searching for it costs.
  if ( std::abs( X ) * m_Focal > 2 * m_Width || std::abs( Y ) * m_FocalY > 2 * m_Height )
  {
    return false;
  }
  ComputeCameraModel::VImagePoint Raw;
  if ( !m_Lens.Distort( { m_Px + m_Focal * X + m_Skew * Y, m_Py + m_FocalY * Y }, Raw ) )
  {
    return false;
  }
  if ( !( Raw.x >= -0.5 && Raw.y >= -0.5 && Raw.x < m_Width - 0.5 && Raw.y < m_Height - 0.5 ) )
  {
    return false;
  }
  const auto& rCentre = m_Lens.LensCalibration().Centre;
  const double OffX = Raw.x - rCentre.x, OffY = Raw.y - rCentre.y;
  const double Slope = m_Lens.Slope( std::sqrt( OffX * OffX + OffY * OffY ) );
  o_rPoint = { Raw.x, Raw.y, Depth, m_Focal / Depth / Slope };
  return true;
}

} // namespace HostSources::Simulation

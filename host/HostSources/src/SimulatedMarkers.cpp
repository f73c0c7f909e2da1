#include "SimulatedMarkers.h"

#include "SimulatedStage.h"

#include <cmath>

namespace HostSources::Simulation
{
namespace
{

constexpr double GapWindow = 0.2;   // s: a gap lies within one window
constexpr double ExtraWindow = 0.5; // s: that an extra point stays or is away

} // namespace

VMarkerStage::VMarkerStage( const VSimulatedCaptureOptions& i_rOptions )
  : m_rOptions( i_rOptions )
  , m_Hash( i_rOptions.Seed )
{
  for ( std::uint32_t Performer = 0; Performer < i_rOptions.Performers; ++Performer )
  {
    m_Styles.push_back( PerformerStyle( i_rOptions, Performer ) );
  }
}

std::size_t VMarkerStage::MostMarkers() const
{
  return m_Styles.size() * WalkerMarkers + ObjectMarkers + m_rOptions.ExtraPoints;
}

bool VMarkerStage::IsInGap( std::uint32_t i_Number, double i_Seconds ) const
{
  const double Window = std::floor( i_Seconds / GapWindow );
  const VHash Gap = m_Hash.With( EStreamGap ).With( i_Number ).With( static_cast< std::uint64_t >( Window ) );
  if ( Gap.Uniform() >= m_rOptions.GapProbability )
  {
    return false;
  }
  const double Begin = Gap.With( 1 ).Uniform() * 0.5, End = 0.5 + Gap.With( 2 ).Uniform() * 0.5;
  const double Share = i_Seconds / GapWindow - Window;
  return Share >= Begin && Share < End;
}

void VMarkerStage::AddPerformer( std::uint32_t i_Performer, double i_Seconds,
                                 std::vector< VStageMarker >& io_rMarkers ) const
{
  VWalkerPose Pose;
  PoseWalker( m_Styles[i_Performer], i_Seconds, Pose );
  D3 Middle;
  for ( const D3& rMarker : Pose.Markers )
  {
    Middle = Middle + rMarker * ( 1.0 / WalkerMarkers );
  }
  for ( std::uint32_t Marker = 0; Marker < WalkerMarkers; ++Marker )
  {
    VStageMarker& rMarker = io_rMarkers.emplace_back();
    rMarker.Position = Pose.Markers[Marker];
    rMarker.Number = static_cast< std::uint32_t >( i_Performer * WalkerMarkers + Marker );
    rMarker.SubjectId = i_Performer + 1;
    rMarker.MarkerId = Marker;
    rMarker.bLost = IsInGap( rMarker.Number, i_Seconds );
    const D3 Away{ rMarker.Position.x - Middle.x, rMarker.Position.y - Middle.y, 0 };
    const double Distance = Length( Away );
    rMarker.Outward = Distance > 1 ? Away * ( 1 / Distance ) : D3{};
  }
}

void VMarkerStage::AddExtraPoints( double i_Seconds, std::vector< VStageMarker >& io_rMarkers ) const
{
  const auto First = static_cast< std::uint32_t >( m_Styles.size() * WalkerMarkers + ObjectMarkers );
  const auto Window = static_cast< std::uint64_t >( i_Seconds / ExtraWindow );
  for ( std::uint32_t Extra = 0; Extra < m_rOptions.ExtraPoints; ++Extra )
  {
    const VHash Place = m_Hash.With( EStreamExtra ).With( Extra ).With( Window );
    if ( Place.Uniform() < 0.5 )
    {
      const auto Across = [&]( std::uint64_t i_Axis )
      {
        return ( 2 * Place.With( i_Axis ).Uniform() - 1 ) * ( FloorHalf - 100 );
      };
      VStageMarker& rMarker = io_rMarkers.emplace_back();
      rMarker.Position = { Across( 1 ), Across( 2 ), 200 + 2000 * Place.With( 3 ).Uniform() };
      rMarker.Number = First + Extra;
    }
  }
}

void VMarkerStage::At( double i_Seconds, std::vector< VStageMarker >& o_rMarkers ) const
{
  o_rMarkers.clear();
  for ( std::uint32_t Performer = 0; Performer < m_Styles.size(); ++Performer )
  {
    AddPerformer( Performer, i_Seconds, o_rMarkers );
  }
  if ( m_rOptions.bObjects )
  {
    std::array< D3, ObjectMarkers > Objects;
    PoseObjects( i_Seconds, Objects );
    auto Number = static_cast< std::uint32_t >( m_Styles.size() * WalkerMarkers );
    for ( const D3& rPosition : Objects )
    {
      VStageMarker& rMarker = o_rMarkers.emplace_back();
      rMarker.Position = rPosition;
      rMarker.Number = Number++;
    }
  }
  AddExtraPoints( i_Seconds, o_rMarkers );
}

} // namespace HostSources::Simulation

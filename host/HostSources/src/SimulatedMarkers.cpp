#include "SimulatedMarkers.h"

#include "SimulatedStage.h"

#include <cmath>
#include <utility>

namespace HostSources::Simulation
{
namespace
{

constexpr double GapWindow = 0.2;   // s: a gap lies within one window
constexpr double ExtraWindow = 0.5; // s: that an extra point stays or is away
constexpr double SwapWindow = 0.5;  // s: a swap lies within one window

/// Markers that are near each other, by name: who labels takes one for the other.
constexpr std::uint32_t NearMarkers[][2] = { { 0, 1 },   { 14, 16 }, { 19, 20 }, { 22, 23 }, { 24, 25 },
                                             { 28, 29 }, { 31, 32 }, { 33, 34 }, { 36, 37 }, { 39, 40 },
                                             { 42, 43 }, { 45, 46 }, { 48, 49 }, { 51, 52 } };

/// Whether a fault that comes with a probability in each window of time, and then lasts for a part of it, is there.
bool IsWithin( const VHash& i_rOf, double i_Window, double i_Probability, double i_Seconds )
{
  const double Window = std::floor( i_Seconds / i_Window );
  const VHash Fault = i_rOf.With( static_cast< std::uint64_t >( Window ) );
  if ( Fault.Uniform() >= i_Probability )
  {
    return false;
  }
  const double Begin = Fault.With( 1 ).Uniform() * 0.5, End = 0.5 + Fault.With( 2 ).Uniform() * 0.5;
  const double Share = i_Seconds / i_Window - Window;
  return Share >= Begin && Share < End;
}

} // namespace

VMarkerStage::VMarkerStage( const VSimulatedCaptureOptions& i_rOptions )
  : m_rOptions( i_rOptions )
  , m_Hash( i_rOptions.Seed )
{
  for ( std::uint32_t Performer = 0; Performer < i_rOptions.Performers; ++Performer )
  {
    m_Styles.push_back( PerformerStyle( i_rOptions, Performer ) );
    m_Bodies.emplace_back( PerformerShape( i_rOptions, Performer ) );
  }
}

std::size_t VMarkerStage::MostMarkers() const
{
  return m_Styles.size() * WalkerMarkers + ObjectMarkers + m_rOptions.ExtraPoints;
}

bool VMarkerStage::IsInGap( std::uint32_t i_Number, double i_Seconds ) const
{
  return IsWithin( m_Hash.With( EStreamGap ).With( i_Number ), GapWindow, m_rOptions.GapProbability, i_Seconds );
}

void VMarkerStage::AddPerformer( std::uint32_t i_Performer, double i_Seconds, const VWalkerPose& i_rPose,
                                 std::vector< VStageMarker >& io_rMarkers ) const
{
  D3 Middle;
  for ( const D3& rMarker : i_rPose.Markers )
  {
    Middle = Middle + rMarker * ( 1.0 / WalkerMarkers );
  }
  const std::uint32_t Colour = PerformerColour( i_Performer );
  for ( std::uint32_t Marker = 0; Marker < WalkerMarkers; ++Marker )
  {
    VStageMarker& rMarker = io_rMarkers.emplace_back();
    rMarker.Position = i_rPose.Markers[Marker];
    rMarker.Number = static_cast< std::uint32_t >( i_Performer * WalkerMarkers + Marker );
    rMarker.SubjectId = PerformerId( i_Performer );
    rMarker.MarkerId = Marker;
    rMarker.Colour = Colour;
    rMarker.bLost = IsInGap( rMarker.Number, i_Seconds );
    const D3 Away{ rMarker.Position.x - Middle.x, rMarker.Position.y - Middle.y, 0 };
    const double Distance = Length( Away );
    rMarker.Outward = Distance > 1 ? Away * ( 1 / Distance ) : D3{};
  }
  SwapLabels( i_Performer, i_Seconds, &io_rMarkers[io_rMarkers.size() - WalkerMarkers] );
}

void VMarkerStage::SwapLabels( std::uint32_t i_Performer, double i_Seconds, VStageMarker* io_pMarkers ) const
{
  if ( m_rOptions.SwapProbability <= 0 )
  {
    return;
  }
  const VHash Own = m_Hash.With( EStreamSwap ).With( i_Performer );
  for ( const auto& rPair : NearMarkers )
  {
    if ( IsWithin( Own.With( rPair[0] ), SwapWindow, m_rOptions.SwapProbability, i_Seconds ) )
    {
      VStageMarker& rFirst = io_pMarkers[rPair[0]];
      VStageMarker& rSecond = io_pMarkers[rPair[1]];
      std::swap( rFirst.MarkerId, rSecond.MarkerId );
      rFirst.bSwapped = rSecond.bSwapped = true;
    }
  }
}

void VMarkerStage::AddObjects( double i_Seconds, std::vector< VStageMarker >& io_rMarkers ) const
{
  std::array< D3, ObjectMarkers > Objects;
  PoseObjects( i_Seconds, Objects );
  const auto First = static_cast< std::uint32_t >( m_Styles.size() * WalkerMarkers );
  for ( std::uint32_t Index = 0; Index < ObjectMarkers; ++Index )
  {
    VStageMarker& rMarker = io_rMarkers.emplace_back();
    const bool bProp = Index < PropMarkers;
    rMarker.Position = Objects[Index];
    rMarker.Number = First + Index;
    rMarker.SubjectId = bProp ? PropId( m_rOptions.Performers ) : WandId( m_rOptions.Performers );
    rMarker.MarkerId = bProp ? Index : static_cast< std::uint32_t >( Index - PropMarkers );
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

void VMarkerStage::At( double i_Seconds, std::vector< VStageMarker >& o_rMarkers, VWalkerPose* o_pPoses ) const
{
  o_rMarkers.clear();
  VWalkerPose Own;
  for ( std::uint32_t Performer = 0; Performer < m_Styles.size(); ++Performer )
  {
    VWalkerPose& rPose = o_pPoses ? o_pPoses[Performer] : Own;
    PoseWalker( m_Styles[Performer], m_Bodies[Performer], i_Seconds, rPose );
    AddPerformer( Performer, i_Seconds, rPose, o_rMarkers );
  }
  if ( m_rOptions.bObjects )
  {
    AddObjects( i_Seconds, o_rMarkers );
  }
  AddExtraPoints( i_Seconds, o_rMarkers );
}

} // namespace HostSources::Simulation

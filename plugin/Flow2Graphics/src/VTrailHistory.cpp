#include "VTrailHistory.h"

#include <CoreMoxelTypes/FlowTypes.h>

#include <algorithm>
#include <cmath>
#include <limits>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;

constexpr std::size_t MostMarkers = 1u << 13;
constexpr float NotSeen = std::numeric_limits< float >::quiet_NaN();

ZEK::VFlowItemRef Find( const ZEK::IFlowState& i_rState, std::uint32_t i_Tag )
{
  ZEK::VFlowItemRef Item;
  i_rState.FindItem( Item, i_Tag, ZEK::EFlowTimeMatch::Overlap );
  return Item;
}

bool IsBefore( const VTrailHistory::VFrame& i_rFrame, std::int64_t i_Ticks )
{
  return i_rFrame.Ticks < i_Ticks;
}
} // namespace

VTrailItems VTrailItems::Of( const ZEK::IFlowState& i_rState )
{
  return { Find( i_rState, ZEK::FlowTag< FlowReconstructionSet > ),
           Find( i_rState, ZEK::FlowTag< FlowReconstructionLabelSet > ),
           Find( i_rState, ZEK::FlowTag< FlowReconstructionTrackSet > ) };
}

bool VTrailHistory::IsFull() const
{
  return m_Markers.size() > MostMarkers;
}

void VTrailHistory::Clear()
{
  const bool bFull = IsFull();
  Keep( 1, 0 );
  if ( bFull )
  {
    m_Markers.clear();
    m_ByLabel.clear();
    m_ByTrack.clear();
  }
}

void VTrailHistory::Keep( std::int64_t i_First, std::int64_t i_Last )
{
  std::erase_if( m_Frames,
                 [&]( VFrame& io_rFrame )
                 {
                   const bool bGoes = io_rFrame.Ticks < i_First || io_rFrame.Ticks > i_Last;
                   if ( bGoes )
                   {
                     m_Spare.push_back( std::move( io_rFrame.Places ) );
                   }
                   return bGoes;
                 } );
}

bool VTrailHistory::Has( std::int64_t i_Ticks ) const
{
  const auto At = std::lower_bound( m_Frames.begin(), m_Frames.end(), i_Ticks, IsBefore );
  return At != m_Frames.end() && At->Ticks == i_Ticks;
}

std::int64_t VTrailHistory::FindTrack( std::uint64_t i_Track ) const
{
  const auto Found = m_ByTrack.find( i_Track );
  return Found == m_ByTrack.end() ? -1 : Found->second;
}

void VTrailHistory::Add( std::int64_t i_Ticks, const VTrailItems& i_rItems )
{
  const auto At = std::lower_bound( m_Frames.begin(), m_Frames.end(), i_Ticks, IsBefore );
  if ( At != m_Frames.end() && At->Ticks == i_Ticks )
  {
    return;
  }
  VFrame Frame{ i_Ticks, {} };
  if ( !m_Spare.empty() )
  {
    Frame.Places = std::move( m_Spare.back() );
    m_Spare.pop_back();
  }
  Frame.Places.assign( m_Markers.size(), { NotSeen, NotSeen, NotSeen } );
  if ( const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( i_rItems.Set.Get() ) )
  {
    m_Taken.assign( pSet->Items.size(), 0 );
    AddLabelled( *pSet, i_rItems, Frame );
    AddTracks( *pSet, i_rItems, Frame );
  }
  m_Frames.insert( At, std::move( Frame ) );
}

void VTrailHistory::AddLabelled( const VReconstructionSet& i_rSet, const VTrailItems& i_rItems, VFrame& io_rFrame )
{
  const auto* const pLabels = ZEK::FlowPayload< VReconstructionLabelSet >( i_rItems.Labels.Get() );
  for ( std::size_t Index = 0; pLabels && Index < pLabels->Labels.size(); ++Index )
  {
    const VReconstructionLabelSet::L& rLabel = pLabels->Labels[Index];
    if ( rLabel.Reconstruction < i_rSet.Items.size() && m_Taken[rLabel.Reconstruction] == 0 )
    {
      m_Taken[rLabel.Reconstruction] = 1;
      Place( io_rFrame, NumberOf( { false, rLabel.SubjectId, rLabel.MarkerId, 0 } ),
             i_rSet.Items[rLabel.Reconstruction] );
    }
  }
}

void VTrailHistory::AddTracks( const VReconstructionSet& i_rSet, const VTrailItems& i_rItems, VFrame& io_rFrame )
{
  const auto* const pTracks = ZEK::FlowPayload< VReconstructionTrackSet >( i_rItems.Tracks.Get() );
  for ( std::size_t Index = 0; pTracks && Index < pTracks->Tracks.size(); ++Index )
  {
    const VReconstructionTrackSet::T& rTrack = pTracks->Tracks[Index];
    if ( rTrack.Reconstruction < i_rSet.Items.size() && m_Taken[rTrack.Reconstruction] == 0 )
    {
      m_Taken[rTrack.Reconstruction] = 1;
      Place( io_rFrame, NumberOf( { true, 0, 0, rTrack.TrackId } ), i_rSet.Items[rTrack.Reconstruction] );
    }
  }
}

std::uint32_t VTrailHistory::NumberOf( const VMarker& i_rMarker )
{
  const std::uint64_t Key =
      i_rMarker.bTrack ? i_rMarker.Track : std::uint64_t{ i_rMarker.Subject } << 32 | i_rMarker.Marker;
  auto& rNumbers = i_rMarker.bTrack ? m_ByTrack : m_ByLabel;
  const auto Found = rNumbers.find( Key );
  if ( Found != rNumbers.end() )
  {
    return Found->second;
  }
  const auto Number = static_cast< std::uint32_t >( m_Markers.size() );
  m_Markers.push_back( i_rMarker );
  rNumbers.emplace( Key, Number );
  return Number;
}

void VTrailHistory::Place( VFrame& io_rFrame, std::uint32_t i_Number, const VReconstruction& i_rAt )
{
  if ( i_Number >= io_rFrame.Places.size() )
  {
    io_rFrame.Places.resize( i_Number + std::size_t{ 1 }, { NotSeen, NotSeen, NotSeen } );
  }
  VPlace& rPlace = io_rFrame.Places[i_Number];
  if ( std::isfinite( rPlace[0] ) )
  {
    return; // the first one counts
  }
  const VPlace New{ static_cast< float >( i_rAt.Position.x ), static_cast< float >( i_rAt.Position.y ),
                    static_cast< float >( i_rAt.Position.z ) };
  const bool bPlace = std::isfinite( New[0] ) && std::isfinite( New[1] ) && std::isfinite( New[2] );
  rPlace = bPlace ? New : VPlace{ NotSeen, NotSeen, NotSeen };
}

} // namespace Flow2Graphics

#include <Flow2Graphics/VFlowRenderMarkerTrails.h>

#include "VTrailHistory.h"

#include <Flow2Graphics/VFlowScene.h>

#include <MoxelGraphics/VSceneOptions.h>

#include <algorithm>
#include <cmath>
#include <utility>

namespace Flow2Graphics
{
namespace
{
using MoxelGraphics::VSubjectGroup;
using ZEK::FlowTicksPerSecond;

/// A present that is farther from the last one is another moment, not the next.
constexpr std::int64_t JumpTicks = FlowTicksPerSecond / 2;
/// So many frames are asked for at once and in one direction.
constexpr std::int64_t FramesAtOnce = 32;
/// No more is drawn; of more frames some are left out.
constexpr std::int64_t MostPoints = 1 << 18;
constexpr std::int64_t LongestSeconds = 60;

constexpr std::uint32_t TrackColour = 0xFFFFA0FF;
constexpr std::array< std::uint32_t, 6 > Palette{ 0xFFE8B45A, 0xFF6FC97F, 0xFF5AA9F2,
                                                  0xFFD78BE0, 0xFF7FD6DC, 0xFFB0B8C4 };

std::int64_t SpanOf( const ZEK::VFlowTimeKey& i_rKey )
{
  return std::clamp< std::int64_t >( i_rKey.Span, 1, FlowTicksPerSecond );
}

std::int64_t LengthOf( int i_Length, int i_Unit, const ZEK::VFlowTimeKey& i_rKey )
{
  const std::int64_t One = i_Unit == MoxelGraphics::ETrailSeconds ? FlowTicksPerSecond : SpanOf( i_rKey );
  return std::clamp< std::int64_t >( std::int64_t{ i_Length } * One, 0, LongestSeconds * FlowTicksPerSecond );
}
} // namespace

VFlowRenderMarkerTrails::VFlowRenderMarkerTrails( VFlowScene& i_rScene )
  : VRenderMarkerTrails( i_rScene )
  , m_rFlowScene( i_rScene )
  , m_pHistory( std::make_unique< VTrailHistory >() )
  , m_pItems( std::make_unique< VTrailItems >() )
  , m_pFollowed( std::make_unique< VTrailItems >() )
{
}

VFlowRenderMarkerTrails::~VFlowRenderMarkerTrails() = default;

void VFlowRenderMarkerTrails::Update( const ZEK::IFlowState& i_rState )
{
  *m_pItems = VTrailItems::Of( i_rState );
  m_Key = i_rState.GetKey();
  ++m_States;
}

/// The newest state becomes the present.
void VFlowRenderMarkerTrails::Follow()
{
  const std::int64_t Passed = m_Key.Frame - m_FollowedKey.Frame;
  const bool bOn = m_Followed != 0 && !m_pHistory->IsFull() && m_Key.Clock == m_FollowedKey.Clock && Passed >= 0 &&
                   Passed <= JumpTicks && ( Passed > 0 || *m_pItems == *m_pFollowed );
  const std::int64_t Former = m_FollowedKey.Frame;
  if ( !bOn )
  {
    m_pHistory->Clear();
    m_KnownFrom = m_Key.Frame;
  }
  m_pHistory->Add( m_Key.Frame, *m_pItems );
  if ( bOn && Passed > SpanOf( m_Key ) )
  {
    Fetch( Former + 1, m_Key.Frame - 1 ); // states that came between two frames
  }
  m_WantedBefore = std::exchange( m_Wanted, {} );
  m_Followed = m_States;
  m_FollowedKey = m_Key;
  *m_pFollowed = *m_pItems;
  m_FutureAsked = m_Key.Frame;
}

void VFlowRenderMarkerTrails::Fetch( std::int64_t i_First, std::int64_t i_Last )
{
  if ( i_First > i_Last )
  {
    return;
  }
  m_rFlowScene.FetchAround( { { i_First, 1, m_Key.Clock }, { i_Last, 1, m_Key.Clock } }, m_Fetched );
  for ( const ZEK::VFlowStateRef& rState : m_Fetched )
  {
    // Two states of one time are the same, and the present itself is known.
    if ( rState && !m_pHistory->Has( rState->GetKey().Frame ) )
    {
      m_pHistory->Add( rState->GetKey().Frame, VTrailItems::Of( *rState ) );
    }
  }
  m_Fetched.clear();
}

void VFlowRenderMarkerTrails::FetchMissing( std::int64_t i_Past, std::int64_t i_Future )
{
  const std::int64_t First = m_Key.Frame - i_Past, Last = m_Key.Frame + i_Future;
  const std::int64_t AtOnce = std::max( FramesAtOnce * SpanOf( m_Key ), FlowTicksPerSecond / 4 );
  // A frame that is kept waits for all of it.
  const bool bAll = m_rScene.IsSettled();
  do
  {
    if ( m_KnownFrom > First )
    {
      const std::int64_t From = std::max( First, m_KnownFrom - AtOnce );
      Fetch( From, m_KnownFrom - 1 );
      m_KnownFrom = From;
    }
    if ( m_FutureAsked < Last )
    {
      const std::int64_t To = std::min( Last, m_FutureAsked + AtOnce );
      Fetch( m_FutureAsked + 1, To );
      m_FutureAsked = To;
    }
  } while ( bAll && ( m_KnownFrom > First || m_FutureAsked < Last ) );
}

/// Which trails are shown: those of the markers that are selected, those of a selected subject, or all.
void VFlowRenderMarkerTrails::MarkChosen()
{
  const auto* const pTracks = ZEK::FlowPayload< CoreMoxelTypes::VReconstructionTrackSet >( m_pItems->Tracks.Get() );
  const auto& rMarkers = m_pHistory->Markers();
  m_Chosen.clear();
  for ( const auto& [rItem, Flags] : m_rScene.Registry().Marks() )
  {
    const bool bMarker = rItem.Kind == ZEK::ESelectMarker, bPoint = rItem.Kind == ZEK::ESelectReconstruction;
    const bool bSubject =
        rItem.Kind == ZEK::ESelectSubject || rItem.Kind == ZEK::ESelectSegment || rItem.Kind == ZEK::ESelectRigidObject;
    if ( ( Flags & MoxelGraphics::EIdSelected ) == 0 || !( bMarker || bPoint || bSubject ) )
    {
      continue;
    }
    m_Chosen.resize( std::max< std::size_t >( rMarkers.size(), 1 ), 0 );
    for ( std::size_t Index = 0; !bPoint && Index < rMarkers.size(); ++Index )
    {
      const VTrailHistory::VMarker& rMarker = rMarkers[Index];
      const bool bIts = !rMarker.bTrack && rMarker.Subject == rItem.Object;
      m_Chosen[Index] |= bIts && ( bSubject || rMarker.Marker == rItem.Sub ) ? 1 : 0;
    }
    for ( std::size_t Index = 0; bPoint && pTracks && Index < pTracks->Tracks.size(); ++Index )
    {
      const std::int64_t Number = pTracks->Tracks[Index].Reconstruction == rItem.Sub
                                      ? m_pHistory->FindTrack( pTracks->Tracks[Index].TrackId )
                                      : -1;
      if ( Number >= 0 )
      {
        m_Chosen[static_cast< std::size_t >( Number )] = 1;
      }
    }
  }
}

std::uint32_t VFlowRenderMarkerTrails::ColourOf( std::size_t i_Marker ) const
{
  const VTrailHistory::VMarker& rMarker = m_pHistory->Markers()[i_Marker];
  for ( std::size_t Group = 0; !rMarker.bTrack && Group < m_Groups.size(); ++Group )
  {
    for ( std::size_t Index = 0; m_Groups[Group] && Index < m_Groups[Group]->Records.size(); ++Index )
    {
      const MoxelGraphics::VSubjectRecord& rRecord = m_Groups[Group]->Records[Index];
      const std::size_t Place = std::size_t{ rRecord.Markers.First } + rMarker.Marker;
      if ( rRecord.Item.Object == rMarker.Subject && rMarker.Marker < rRecord.Markers.Count &&
           Place < m_Groups[Group]->MarkerColours.size() )
      {
        return m_Groups[Group]->MarkerColours[Place];
      }
    }
  }
  return rMarker.bTrack ? TrackColour : Palette[rMarker.Subject % Palette.size()];
}

void VFlowRenderMarkerTrails::AddTrail( std::size_t i_Marker, const VMade& i_rMade, std::int64_t i_Step )
{
  const std::int64_t Span = SpanOf( m_Key );
  const std::int64_t Hole = std::max( 4 * Span * i_Step, FlowTicksPerSecond / 10 );
  const std::uint32_t Colour = ColourOf( i_Marker );
  bool bOn = false; // a place stands before
  std::int64_t Former = 0;
  for ( const VTrailHistory::VFrame& rFrame : m_pHistory->Frames() )
  {
    const std::int64_t Away = rFrame.Ticks - i_rMade.Now;
    if ( Away < -i_rMade.Past || Away > i_rMade.Future || ( Away != 0 && rFrame.Ticks / Span % i_Step != 0 ) )
    {
      continue;
    }
    const bool bPlace = i_Marker < rFrame.Places.size() && std::isfinite( rFrame.Places[i_Marker][0] );
    if ( bOn && ( !bPlace || rFrame.Ticks - Former > Hole ) )
    {
      m_Points.push_back( {} );
    }
    if ( bPlace )
    {
      const auto Length = static_cast< double >( Away < 0 ? -i_rMade.Past : i_rMade.Future );
      const double Strength = Away == 0 ? 1 : 1 - static_cast< double >( Away ) / Length;
      const VTrailHistory::VPlace& rPlace = rFrame.Places[i_Marker];
      m_Points.push_back( { rPlace[0], rPlace[1], rPlace[2], static_cast< float >( Strength ), Colour } );
      Former = rFrame.Ticks;
    }
    bOn = bPlace;
  }
  if ( bOn )
  {
    m_Points.push_back( {} );
  }
}

void VFlowRenderMarkerTrails::MakePoints( const VMade& i_rMade )
{
  MarkChosen();
  const std::size_t Markers = m_pHistory->Markers().size();
  const auto Most = static_cast< std::int64_t >( m_pHistory->Frames().size() ) *
                    static_cast< std::int64_t >(
                        m_Chosen.empty() ? Markers : std::size_t( std::count( m_Chosen.begin(), m_Chosen.end(), 1 ) ) );
  const std::int64_t Step = 1 + Most / MostPoints;
  m_Points.clear();
  for ( std::size_t Marker = 0; Marker < Markers; ++Marker )
  {
    if ( m_Chosen.empty() || m_Chosen[Marker] != 0 )
    {
      AddTrail( Marker, i_rMade, Step );
    }
  }
}

bool VFlowRenderMarkerTrails::FillTrails( const MoxelGraphics::VSceneOptions& i_rOptions )
{
  if ( m_States == 0 )
  {
    return false;
  }
  const std::uint64_t Looks = std::exchange( m_Looks, m_rFlowScene.Looks() );
  if ( m_Followed != m_States )
  {
    Follow();
  }
  else if ( m_Looks != Looks )
  {
    m_KnownFrom = m_FutureAsked = m_Key.Frame; // others may have come around the one that is still shown
  }
  const std::int64_t Past = LengthOf( i_rOptions.trialLengthPast, i_rOptions.TrailUnit, m_Key );
  const std::int64_t Future = LengthOf( i_rOptions.trialLengthFuture, i_rOptions.TrailUnit, m_Key );
  m_Wanted = { std::max( m_Wanted[0], Past ), std::max( m_Wanted[1], Future ) };
  FetchMissing( Past, Future );
  const std::int64_t First = m_Key.Frame - std::max( m_Wanted[0], m_WantedBefore[0] );
  m_pHistory->Keep( First, m_Key.Frame + std::max( m_Wanted[1], m_WantedBefore[1] ) );
  m_KnownFrom = std::max( m_KnownFrom, First );
  VMade New{ m_Key.Frame, Past, Future, m_pHistory->Frames().size(), m_States, m_rScene.Registry().MarksGeneration(),
             {} };
  for ( std::size_t Group = 0; Group < m_Groups.size(); ++Group )
  {
    New.Structure[Group] = m_Groups[Group] ? m_Groups[Group]->StructureGeneration : 0;
  }
  if ( New == m_Made )
  {
    return false;
  }
  m_Made = New;
  MakePoints( New );
  return true;
}

} // namespace Flow2Graphics

#include "SimulatedObjects.h"

#include <iterator>
#include <string_view>

using namespace CoreMoxelTypes;

namespace HostSources::Simulation
{
namespace
{

constexpr u32 PropColour = 0xFF5AC8FAu, WandColour = 0xFFE0E0E0u;
constexpr D3 PropPoints[PropMarkers] = {
    { 0, 0, 0 }, { 160, 0, 0 }, { 0, 90, 20 }, { -70, -60, 40 }, { 60, -40, 120 } };
constexpr D3 WandPoints[WandMarkers] = { { 0, 0, 0 }, { 0, 120, 0 }, { 0, -240, 0 }, { 180, 0, 0 }, { 360, 0, 0 } };
constexpr u32 PropSticks[][2] = { { 0, 1 }, { 0, 2 }, { 0, 3 }, { 0, 4 }, { 1, 4 }, { 2, 4 }, { 3, 4 } };
constexpr u32 WandSticks[][2] = { { 1, 0 }, { 0, 2 }, { 0, 3 }, { 3, 4 } };

void AddMarkers( std::string_view i_Name, std::span< const D3 > i_Points, std::vector< VMarker >& o_rMarkers )
{
  for ( const D3& rPoint : i_Points )
  {
    VMarker& rMarker = o_rMarkers.emplace_back();
    rMarker.Id = static_cast< u32 >( o_rMarkers.size() - 1 );
    rMarker.Name = std::string( i_Name ).append( std::to_string( o_rMarkers.size() ) );
    rMarker.Segment = 0;
    rMarker.Local = rPoint;
    rMarker.Radius = 7;
    for ( const int Axis : { 0, 4, 8 } )
    {
      rMarker.Covariance[Axis] = 0.25;
    }
  }
}

template < typename TData >
void AddColours( u32 i_Colour, std::size_t i_Markers, std::span< const u32[2] > i_Sticks, TData& o_rData )
{
  o_rData.MarkerColours.assign( i_Markers, i_Colour );
  for ( const auto& rStick : i_Sticks )
  {
    o_rData.Sticks.push_back( { rStick[0], rStick[1], i_Colour, i_Colour } );
  }
}

} // namespace

std::string PerformerName( std::uint32_t i_Performer )
{
  static constexpr const char* Names[] = { "Ada", "Ben", "Cleo", "Dan", "Eve", "Finn", "Gil",  "Hana",
                                           "Ivo", "Joy", "Kai",  "Lea", "Max", "Nora", "Olaf", "Pia" };
  return i_Performer < std::size( Names ) ? Names[i_Performer] : "Performer " + std::to_string( i_Performer + 1 );
}

std::uint32_t PerformerColour( std::uint32_t i_Performer )
{
  constexpr u32 Colours[] = { 0xFF4FB4FFu, 0xFFFFB84Fu, 0xFF7ED957u, 0xFFC77DFFu,
                              0xFF5CE1E6u, 0xFF6B6BFFu, 0xFFE6C229u, 0xFFB0B0B0u };
  return Colours[i_Performer % std::size( Colours )];
}

std::uint32_t Mixed( std::uint32_t i_Colour, std::uint32_t i_Towards, double i_Share )
{
  u32 Result = 0xFF000000u;
  for ( const int Shift : { 0, 8, 16 } )
  {
    const double From = ( i_Colour >> Shift ) & 0xFF, To = ( i_Towards >> Shift ) & 0xFF;
    Result |= static_cast< u32 >( From + ( To - From ) * i_Share + 0.5 ) << Shift;
  }
  return Result;
}

void FillColours( const VSubject& i_rSubject, std::uint32_t i_Colour, VSubjectApplicationData& o_rData )
{
  const u32 Lighter = Mixed( i_Colour, 0xFFFFFFFFu, 0.35 ), Darker = Mixed( i_Colour, 0xFF000000u, 0.3 );
  for ( const VMarker& rMarker : i_rSubject.Markers )
  {
    o_rData.MarkerColours.push_back( rMarker.Name[0] == 'L' ? Lighter : rMarker.Name[0] == 'R' ? Darker : i_Colour );
  }
  for ( const VSegment& rSegment : i_rSubject.Segments )
  {
    o_rData.SegmentColours.push_back( rSegment.Name.starts_with( "Left" )    ? Lighter
                                      : rSegment.Name.starts_with( "Right" ) ? Darker
                                                                             : i_Colour );
  }
  if ( i_rSubject.Markers.size() == WalkerMarkers )
  {
    for ( const auto& rStick : WalkerSticks() )
    {
      o_rData.Sticks.push_back(
          { rStick[0], rStick[1], o_rData.MarkerColours[rStick[0]], o_rData.MarkerColours[rStick[1]] } );
    }
  }
}

VFrame PropAt( double i_Seconds )
{
  VFrame Prop;
  Prop.Origin = { -2450, -2450, 900 };
  return Yawed( Prop, 0.4 * i_Seconds );
}

VFrame WandAt( double i_Seconds )
{
  VFrame Wand = Pitched( Yawed( {}, 0.8 * std::sin( 1.3 * i_Seconds ) ), 0.9 * std::sin( 2.1 * i_Seconds ) );
  Wand.Origin = { 2400 + 120 * std::sin( 1.7 * i_Seconds ), -2400 + 120 * std::cos( 1.1 * i_Seconds ),
                  1200 + 250 * std::sin( 0.9 * i_Seconds ) };
  return Wand;
}

void PoseObjects( double i_Seconds, std::array< D3, ObjectMarkers >& o_rMarkers )
{
  const VFrame Prop = PropAt( i_Seconds ), Wand = WandAt( i_Seconds );
  auto* pNext = o_rMarkers.data();
  for ( const D3& rPoint : PropPoints )
  {
    *pNext++ = Prop.Point( rPoint.x, rPoint.y, rPoint.z );
  }
  for ( const D3& rPoint : WandPoints )
  {
    *pNext++ = Wand.Point( rPoint.x, rPoint.y, rPoint.z );
  }
}

void FillProp( VSubject& o_rProp, VSubjectApplicationData& o_rData )
{
  o_rProp.Name = "Prop";
  VSegment& rBone = o_rProp.Segments.emplace_back();
  rBone.Name = "Prop";
  rBone.BoneLength = 160;
  AddMarkers( "Prop", PropPoints, o_rProp.Markers );
  for ( u32 Marker = 0; Marker < PropMarkers; ++Marker )
  {
    o_rProp.Clusters.emplace_back( 0u, Marker );
  }
  AddColours( PropColour, PropMarkers, PropSticks, o_rData );
  o_rData.SegmentColours.assign( 1, PropColour );
}

void FillWand( VRigidObject& o_rWand, VRigidObjectApplicationData& o_rData )
{
  o_rWand.Name = "Wand";
  AddMarkers( "Wand", WandPoints, o_rWand.Markers );
  o_rData.Colour = WandColour;
  AddColours( WandColour, WandMarkers, WandSticks, o_rData );
}

} // namespace HostSources::Simulation

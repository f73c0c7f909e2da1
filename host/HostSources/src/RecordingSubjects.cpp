#include "RecordingSubjects.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <filesystem>
#include <unordered_map>

namespace HostSources
{
namespace
{
struct VSplitName
{
  std::string Subject, Marker;
};

VSplitName Split( const std::string& i_rLabel, const std::string& i_rDefault )
{
  const std::size_t Colon = i_rLabel.find( ':' );
  if ( Colon == std::string::npos || Colon == 0 || Colon + 1 == i_rLabel.size() )
  {
    return { i_rDefault, i_rLabel };
  }
  return { i_rLabel.substr( 0, Colon ), i_rLabel.substr( Colon + 1 ) };
}

/// Whether a program numbered the point, rather than a person named it: "*12", "U*3", "C_12", "Unlabeled 4".
bool IsAutomatic( const std::string& i_rMarker )
{
  if ( i_rMarker.find( '*' ) != std::string::npos )
  {
    return true;
  }
  std::string Word = i_rMarker.substr( 0, i_rMarker.find_last_not_of( "0123456789" ) + 1 );
  std::transform( Word.begin(), Word.end(), Word.begin(),
                  []( unsigned char i_Letter )
                  {
                    return static_cast< char >( std::tolower( i_Letter ) );
                  } );
  if ( Word == "c_" || Word == "u_" )
  {
    return Word.size() < i_rMarker.size();
  }
  Word.resize( Word.find_last_not_of( " _-." ) + 1 );
  constexpr std::string_view Words[] = { "unlabeled", "unlabelled", "unnamed", "uname", "unidentified" };
  return std::find( std::begin( Words ), std::end( Words ), Word ) != std::end( Words );
}
} // namespace

std::uint32_t MarkerColour( std::size_t i_Subject, std::size_t i_Marker )
{
  // In turns of the wheel: neighbours of either kind lie apart, a subject keeps to a third of it.
  constexpr double GoldenTurn = 0.6180339887498949, First = 0.42, Spread = 1.0 / 3;
  const auto Step = []( std::size_t i_Index )
  {
    return std::fmod( static_cast< double >( i_Index ) * GoldenTurn, 1.0 );
  };
  const double Hue = std::fmod( 1 + First + Step( i_Subject ) + Spread * ( Step( i_Marker ) - 0.5 ), 1.0 ) * 6;
  const auto Channel = [&]( double i_Shift )
  {
    const double Distance = std::abs( std::fmod( Hue + i_Shift, 6.0 ) - 3 ) - 1;
    return static_cast< std::uint32_t >( std::lround( 255 * ( 0.4 + 0.55 * std::clamp( Distance, 0.0, 1.0 ) ) ) );
  };
  return 0xFF000000u | Channel( 2 ) << 16 | Channel( 4 ) << 8 | Channel( 0 );
}

VRecordingSubjects SubjectsOf( const VRecording& i_rRecording )
{
  std::string Default = std::filesystem::path( i_rRecording.Name ).stem().string();
  Default = Default.empty() ? "Recording" : Default;
  VRecordingSubjects All;
  std::unordered_map< std::string, std::uint32_t > Ids;
  All.Places.resize( i_rRecording.PointCount() );
  for ( std::size_t Point = 0; Point < All.Places.size(); ++Point )
  {
    VSplitName Name = Split( i_rRecording.Labels[Point], Default );
    if ( Name.Marker.empty() || IsAutomatic( Name.Marker ) )
    {
      continue;
    }
    const auto [It, bNew] = Ids.try_emplace( Name.Subject, static_cast< std::uint32_t >( Ids.size() + 1 ) );
    if ( bNew )
    {
      CoreMoxelTypes::VSubject Subject;
      Subject.Id = It->second;
      Subject.Name = Name.Subject;
      All.Subjects.push_back( std::move( Subject ) );
      All.Colours.emplace_back();
    }
    auto& rMarkers = All.Subjects[It->second - 1].Markers;
    CoreMoxelTypes::VMarker Marker;
    Marker.Id = static_cast< std::uint32_t >( rMarkers.size() ); // as labels name it
    Marker.Name = std::move( Name.Marker );
    Marker.Radius = MarkerRadius;
    All.Places[Point] = { It->second, static_cast< std::uint32_t >( rMarkers.size() ) };
    All.Colours[It->second - 1].push_back( MarkerColour( It->second - 1, rMarkers.size() ) );
    rMarkers.push_back( std::move( Marker ) );
  }
  return All;
}

} // namespace HostSources

#include "RecordingSubjects.h"

#include <algorithm>
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
} // namespace

std::uint32_t MarkerColour( std::size_t i_Index )
{
  constexpr double GoldenTurn = 0.6180339887498949;
  const double Hue = std::fmod( static_cast< double >( i_Index ) * GoldenTurn, 1.0 ) * 6;
  const auto Channel = [&]( double i_Shift )
  {
    const double Distance = std::abs( std::fmod( Hue + i_Shift, 6.0 ) - 3 ) - 1;
    return static_cast< std::uint32_t >( std::lround( 255 * ( 0.3 + 0.7 * std::clamp( Distance, 0.0, 1.0 ) ) ) );
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
    if ( i_rRecording.Labels[Point].empty() )
    {
      continue;
    }
    VSplitName Name = Split( i_rRecording.Labels[Point], Default );
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
    All.Colours[It->second - 1].push_back( MarkerColour( rMarkers.size() ) );
    rMarkers.push_back( std::move( Marker ) );
  }
  return All;
}

} // namespace HostSources

#pragma once

#include <HostSources/VRecording.h>

#include <CoreMoxelTypes/Subject.h>

#include <vector>

namespace HostSources
{

/// Passive markers of the usual size, mm.
constexpr float MarkerRadius = 7;

/// The subjects that the names of a recording's points speak of.
struct VRecordingSubjects
{
  struct VPlace
  {
    std::uint32_t SubjectId = 0; ///< 0 for a point without a name
    std::uint32_t MarkerIndex = 0;
  };

  std::vector< CoreMoxelTypes::VSubject > Subjects;    ///< Id 1, 2, … in the order in which the names come
  std::vector< std::vector< std::uint32_t > > Colours; ///< one a marker
  std::vector< VPlace > Places;                        ///< one a point
};

/// 0xAABBGGRR; colours of neighbours lie far apart.
std::uint32_t MarkerColour( std::size_t i_Index );

/// "Subject:Marker" belongs to "Subject"; a name without a colon to the file's name without its suffix.
VRecordingSubjects SubjectsOf( const VRecording& i_rRecording );

} // namespace HostSources

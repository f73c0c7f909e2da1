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
    std::uint32_t SubjectId = 0; ///< 0 for a point of no subject
    std::uint32_t MarkerIndex = 0;
  };

  std::vector< CoreMoxelTypes::VSubject > Subjects;    ///< Id 1, 2, … in the order in which the names come
  std::vector< std::vector< std::uint32_t > > Colours; ///< one a marker
  std::vector< VPlace > Places;                        ///< one a point
};

/// 0xAABBGGRR, of the marker of that place in its subject. A subject has its part of the colour wheel.
std::uint32_t MarkerColour( std::size_t i_Subject, std::size_t i_Marker );

/// "Subject:Marker" belongs to "Subject"; a name without a colon to the file's name without its suffix.
/// Points that have no name, or a number that a program gave them, such as "*12" or "C_12", belong to no subject.
VRecordingSubjects SubjectsOf( const VRecording& i_rRecording );

} // namespace HostSources

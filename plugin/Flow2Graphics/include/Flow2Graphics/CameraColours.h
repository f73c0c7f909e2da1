#pragma once

#include <CoreMoxelTypes/Reconstruction.h>
#include <CoreMoxelTypes/Subject.h>

#include <cstdint>
#include <span>
#include <utility>
#include <vector>

namespace Flow2Graphics
{

/// The colours of all markers and sticks of all subjects, for centroids that carry a label, and which reconstructions
/// of the frame are labelled.
struct VCameraColours
{
  /// Ascending by subject id, in the high half, and marker id; the value is an index into `LabelColours`.
  std::vector< std::pair< std::uint64_t, std::uint32_t > > LabelIndex;
  std::vector< std::uint32_t > LabelColours; ///< 0xAABBGGRR
  std::vector< std::uint32_t > StickIndices; ///< two a stick, into `LabelColours`
  std::vector< std::pair< std::uint32_t, std::uint32_t > > StickColours;
  std::vector< std::uint8_t > LabelledReconstructions; ///< by index in the set: 1 for one that has a label
  std::uint64_t Generation = 1;                        ///< grows with each change

  void Clear();
  /// Leaves a subject out whose colours are not one a marker, and sticks that name no marker.
  void AddSubject( const CoreMoxelTypes::VSubject& i_rSubject,
                   const CoreMoxelTypes::VSubjectApplicationData& i_rApplicationData );
  /// Null takes all labels away.
  void SetReconstructionLabels( const CoreMoxelTypes::VReconstructionLabelSet* i_pLabels );

  /// False, with the colour left alone, for a pair that is in no subject.
  bool FindColour( std::uint32_t i_SubjectId, std::uint32_t i_MarkerId, std::uint32_t& o_rColour ) const;
  bool IsLabelled( std::int32_t i_Reconstruction ) const
  {
    return i_Reconstruction >= 0 && static_cast< std::size_t >( i_Reconstruction ) < LabelledReconstructions.size() &&
           LabelledReconstructions[static_cast< std::size_t >( i_Reconstruction )] != 0;
  }
};

} // namespace Flow2Graphics

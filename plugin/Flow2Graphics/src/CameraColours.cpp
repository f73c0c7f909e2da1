#include <Flow2Graphics/CameraColours.h>

#include <algorithm>

namespace Flow2Graphics
{
namespace
{
constexpr std::uint64_t Pack( std::uint32_t i_SubjectId, std::uint32_t i_MarkerId )
{
  return std::uint64_t{ i_SubjectId } << 32 | i_MarkerId;
}

bool LiesBefore( const std::pair< std::uint64_t, std::uint32_t >& i_rEntry, std::uint64_t i_Key )
{
  return i_rEntry.first < i_Key;
}

/// A label that names a reconstruction beyond this names none: it is no size for a table.
constexpr std::uint32_t MostReconstructions = 1u << 20;
} // namespace

void VCameraColours::Clear()
{
  LabelIndex.clear();
  LabelColours.clear();
  StickIndices.clear();
  StickColours.clear();
  ++Generation;
}

void VCameraColours::AddSubject( const CoreMoxelTypes::VSubject& i_rSubject,
                                 const CoreMoxelTypes::VSubjectApplicationData& i_rApplicationData )
{
  const auto& rMarkers = i_rSubject.Markers;
  if ( rMarkers.size() != i_rApplicationData.MarkerColours.size() )
  {
    return;
  }
  const auto First = static_cast< std::uint32_t >( LabelColours.size() );
  for ( std::size_t Marker = 0; Marker < rMarkers.size(); ++Marker )
  {
    const std::uint64_t Key = Pack( i_rSubject.Id, rMarkers[Marker].Id );
    auto It = std::lower_bound( LabelIndex.begin(), LabelIndex.end(), Key, LiesBefore );
    if ( It == LabelIndex.end() || It->first != Key )
    {
      It = LabelIndex.insert( It, { Key, 0 } );
    }
    It->second = static_cast< std::uint32_t >( LabelColours.size() );
    LabelColours.push_back( i_rApplicationData.MarkerColours[Marker] );
  }
  for ( const CoreMoxelTypes::VStick& rStick : i_rApplicationData.Sticks )
  {
    if ( rStick.A < rMarkers.size() && rStick.B < rMarkers.size() )
    {
      StickColours.push_back( { rStick.ColourA, rStick.ColourB } );
      StickIndices.push_back( First + rStick.A );
      StickIndices.push_back( First + rStick.B );
    }
  }
  ++Generation;
}

void VCameraColours::SetReconstructionLabels( const CoreMoxelTypes::VReconstructionLabelSet* i_pLabels )
{
  LabelledReconstructions.clear();
  if ( i_pLabels )
  {
    for ( const auto& rLabel : i_pLabels->Labels )
    {
      if ( rLabel.Reconstruction < MostReconstructions )
      {
        if ( rLabel.Reconstruction >= LabelledReconstructions.size() )
        {
          LabelledReconstructions.resize( rLabel.Reconstruction + 1 );
        }
        LabelledReconstructions[rLabel.Reconstruction] = 1;
      }
    }
  }
  ++Generation;
}

bool VCameraColours::FindColour( std::uint32_t i_SubjectId, std::uint32_t i_MarkerId, std::uint32_t& o_rColour ) const
{
  const std::uint64_t Key = Pack( i_SubjectId, i_MarkerId );
  const auto It = std::lower_bound( LabelIndex.begin(), LabelIndex.end(), Key, LiesBefore );
  if ( It == LabelIndex.end() || It->first != Key )
  {
    return false;
  }
  o_rColour = LabelColours[It->second];
  return true;
}

} // namespace Flow2Graphics

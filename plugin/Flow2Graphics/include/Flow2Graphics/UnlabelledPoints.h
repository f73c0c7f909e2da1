#pragma once

#include <CoreMoxelTypes/Reconstruction.h>
#include <CoreMoxelTypes/Subject.h>
#include <MoxelGraphics/VSelectionRegistry.h>
#include <ZEK/FlowState.h>

#include <cstdint>
#include <vector>

namespace Flow2Graphics
{

/// The reconstructions of a frame that carry no label, as members of one range of selection ids.
class VUnlabelledPoints : public MoxelGraphics::IRangeResolver
{
public:
  std::vector< MoxelGraphics::VScenePoint > Points;
  std::vector< std::uint32_t > Reconstruction; ///< index in the set of the frame, ascending
  std::vector< std::uint32_t > Ids;            ///< the number that the reconstruction carries
  std::vector< float > Residuals;              ///< mm

  bool ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const override;
  bool FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const override;
  bool GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const override;
  void Clear();
};

/// The subjects of a frame, each with the colours of its markers.
struct VLabellingSubject
{
  ZEK::VFlowItemRef Subject;
  ZEK::VFlowItemRef ApplicationData; ///< may be null
  const CoreMoxelTypes::VSubject* pSubject = nullptr;
  const CoreMoxelTypes::VSubjectApplicationData* pApplicationData = nullptr;
};

/// The reconstructions of a frame that carry a label, as members of one range of selection ids. A member's item and
/// label are «subject:marker».
class VLabelledPoints : public MoxelGraphics::IRangeResolver
{
public:
  struct VMember
  {
    std::uint32_t Subject; ///< index into `Subjects`
    std::uint32_t Marker;  ///< index into the subject's markers
  };
  std::vector< VLabellingSubject > Subjects;
  std::vector< MoxelGraphics::VScenePoint > Points;
  std::vector< std::uint32_t > Colours; ///< 0xAABBGGRR
  std::vector< float > Residuals;       ///< mm
  std::vector< VMember > Members;

  /// Adds a point; false when the label names no subject or no marker of this frame.
  bool Add( const CoreMoxelTypes::VReconstructionLabelSet::L& i_rLabel, const MoxelGraphics::VScenePoint& i_rPoint,
            float i_Residual );
  bool ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const override;
  bool FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const override;
  bool GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const override;
  void ClearPoints();
};

} // namespace Flow2Graphics

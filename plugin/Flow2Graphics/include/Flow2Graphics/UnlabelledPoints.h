#pragma once

#include <MoxelGraphics/VSelectionRegistry.h>
#include <ZEK/FlowTypes.h>

#include <cstdint>
#include <vector>

namespace Flow2Graphics
{

/// The reconstructions of a frame that are no marker of a subject, as members of one range of selection ids.
class VUnlabelledPoints : public MoxelGraphics::IRangeResolver
{
public:
  std::vector< MoxelGraphics::VScenePoint > Points;
  std::vector< std::uint32_t > Reconstruction; ///< index in the set of the frame, ascending
  ZEK::VFlowItemRef Set;                       ///< that the indices are of

  bool ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const override;
  bool FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const override;
  bool GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const override;
};

} // namespace Flow2Graphics

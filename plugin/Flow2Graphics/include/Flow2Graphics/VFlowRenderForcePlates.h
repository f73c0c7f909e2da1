#pragma once

#include <Flow2Graphics/IFlowRenderType.h>

#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>
#include <MoxelGraphics/VRenderForcePlates.h>
#include <MoxelGraphics/VSelectionRegistry.h>

#include <string>
#include <vector>

namespace Flow2Graphics
{

/// The force plates of a frame as members of one range of selection ids. A plate's item is its device URN, its label
/// the device's name.
class VPlateMembers : public MoxelGraphics::IRangeResolver
{
public:
  struct VMember
  {
    ZEK::VSelectionItem Item;
    std::string Label;
    MoxelGraphics::VScenePoint Point; ///< the sphere about the surface
    MoxelGraphics::VScenePose Pose;   ///< of the surface's middle: z up, x along the first side
    std::size_t Slot = 0;             ///< in the join of the frame's devices
  };
  std::vector< VMember > Members; ///< ascending by URN

  bool ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const override;
  bool FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const override;
  bool GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const override;
};

/// Feeds the devices of a frame that are force plates, with what they feel at the time of the frame: the first sample
/// of the frame's own, which is as old as the points. A plate that spans no area is left out; a load that is no number
/// is none.
class VFlowRenderForcePlates : public MoxelGraphics::VRenderForcePlates, public IFlowRenderType
{
public:
  explicit VFlowRenderForcePlates( MoxelGraphics::VMoxelScene& i_rScene );

  void Update( const ZEK::IFlowState& i_rState ) override;

  const VPlateMembers& Members() const { return m_Members; }

private:
  void Rebuild( bool i_bYUp );
  void TakeLoads();
  void GiveIds();

  Flow2TypesUtils::VTaggedCoreTypeExtractor m_Devices;
  VPlateMembers m_Members;
  bool m_bYUp = false;
  std::vector< MoxelGraphics::VForcePlate > m_Made;
  std::vector< MoxelGraphics::VPlateLoad > m_MadeLoads;
  std::vector< std::uint8_t > m_Flags;
};

} // namespace Flow2Graphics

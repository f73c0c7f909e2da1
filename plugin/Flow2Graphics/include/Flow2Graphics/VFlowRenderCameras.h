#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <Flow2Graphics/VFlowRenderCameraProvider.h>

#include <MoxelGraphics/VRenderCameras.h>
#include <MoxelGraphics/VSelectionRegistry.h>

#include <cstdint>
#include <limits>
#include <memory>
#include <vector>

namespace Flow2Graphics
{

/// The cameras that have a body, as one range of selection ids. Items are device URNs.
class VCameraBodyMembers : public MoxelGraphics::IRangeResolver
{
public:
  std::vector< ZEK::VRenderCameraRef > Cameras; ///< ascending by name

  bool ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const override;
  bool FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const override;
  bool GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const override;
  bool GetPose( std::uint32_t i_Index, MoxelGraphics::VScenePose& o_rPose ) const override;
};

/// Feeds the cameras of the provider, with the ids of their bodies and, of the one camera whose mask can be edited,
/// those of its cells: the only one that is selected or, where none is, the only one with cells that are. What a wand
/// leaves in a camera's view is kept for its newest 500 frames; it ages with the frames in which a camera saw the wand
/// and, while none does, with those of the states. A frame in which no camera changed costs the same for any number of
/// cameras.
class VFlowRenderCameras : public MoxelGraphics::VRenderCameras, public IFlowRenderType
{
public:
  /// The provider is updated before this is.
  VFlowRenderCameras( MoxelGraphics::VMoxelScene& i_rScene,
                      std::shared_ptr< const VFlowRenderCameraProvider > i_pProvider );

  void Update( const ZEK::IFlowState& i_rState ) override;

  /// Where the wand was seen by a camera, oldest first; at most this many points are kept.
  static constexpr std::size_t MostWandPoints = 4096;
  static constexpr float WandFrames = 500;

private:
  /// What was taken from a camera, held so that another value is another item.
  struct VKept
  {
    std::shared_ptr< const VFlowRenderCamera > pCamera;
    ZEK::VFlowItemRef Mask, Edges, WandItem;
    std::vector< MoxelGraphics::VMarkedCell > MarkedCells;
    std::vector< MoxelGraphics::VWandPoint > Wand;
  };

  /// What this update brought of the wand.
  struct VSeen
  {
    double Newest = -std::numeric_limits< double >::infinity();
    bool bAny = false;  ///< it was seen in another frame
    bool bBack = false; ///< a camera's time went back
  };

  void GiveBodyIds();
  void TakePictures();
  static void TakeMarkedCells( VKept& io_rKept, MoxelGraphics::VCameraPictures& io_rPictures );
  void TakeWand( VKept& io_rKept, MoxelGraphics::VCameraPictures& io_rPictures );
  /// After all cameras gave what they saw of the wand: what its age is counted from.
  void SettleWand( const ZEK::VFlowTimeKey& i_rKey );
  /// False while there are none.
  bool GiveCellIds();
  /// Null for none and for several.
  std::shared_ptr< VFlowRenderCamera > EditedCamera() const;

  std::shared_ptr< const VFlowRenderCameraProvider > m_pCameras;
  VCameraBodyMembers m_Members;
  VCameraMembers m_Cells;
  std::vector< std::uint8_t > m_Flags;
  std::vector< VKept > m_Kept; ///< by number
  std::vector< MoxelGraphics::VCameraPictures > m_Pictures;
  std::uint64_t m_Generation = 0;
  std::uint64_t m_MarksGeneration = 0, m_CamerasGeneration = 0;
  VSeen m_Seen;
  double m_NewestWand = 0;      ///< the newest frame in which a camera saw the wand
  double m_WandAge = 0;         ///< states since then
  std::int64_t m_WandState = 0; ///< the time of the state that brought it, in ticks
};

} // namespace Flow2Graphics

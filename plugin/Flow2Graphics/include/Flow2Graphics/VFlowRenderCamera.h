#pragma once

#include <Flow2Graphics/CameraColours.h>

#include <ComputeCameraModel/VCameraModel.h>
#include <ZEK/FlowState.h>
#include <ZEK/RenderCamera.h>

#include <array>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace Flow2Graphics
{

class VCameraDrawData;

/// What a camera is given in each frame, in the order of giving.
enum ECameraItem : std::uint32_t
{
  ECameraHardware,
  ECameraSettings,
  ECameraPhysicalSensorData,
  ECameraCalibration,
  ECameraMaskGrid,
  ECameraCentroids,
  ECameraCentroidLabels,
  ECameraCentroidAssignments,
  ECameraReconstructionLabels, ///< of the whole state
  ECameraEdgePairs,
  ECameraImageSet,
  ECameraGreyscaleBlobs,
  ECameraVideoFrame,
  ECameraWand,
  ECameraItemCount
};

/// What of a camera is selected or lies under the pointer.
struct VCameraMarks
{
  struct VMember
  {
    std::uint32_t Sub = 0;
    std::uint32_t Flags = 0; ///< of a selection word

    friend bool operator==( const VMember&, const VMember& ) = default;
  };
  std::uint32_t Device = 0;                           ///< flags of the camera itself
  std::vector< VMember > Centroids, Blobs, MaskCells; ///< ascending

  void Clear();
  friend bool operator==( const VCameraMarks&, const VCameraMarks& ) = default;
};

/// One camera of the capture system, as long as its name is there. It keeps the items of its newest frame and makes
/// of them what views draw with. Thread: render thread.
class VFlowRenderCamera final : public ZEK::IRenderCamera
{
public:
  VFlowRenderCamera( std::string i_Name, std::shared_ptr< const VCameraColours > i_pColours );
  ~VFlowRenderCamera() override;

  const std::string& GetName() const override { return m_Name; }
  const ComputeCameraModel::VCameraModel& GetModel() const override { return m_Model; }
  const std::string& GetDisplayName() const override { return m_DisplayName; }
  bool GetGreyscaleFlag() const override;
  bool GetVideoFlag() const override;
  const CoreMoxelTypes::VVideoFrame* GetVideoFrame() const override;
  const CoreMoxelTypes::VImageSet* GetImageSet( std::uint64_t& o_rId ) const override;
  void GetDrawData2D( std::uint32_t i_Id, ZEK::ECentroidColourScheme i_Mode, bool i_bWide,
                      ZEK::VCameraLists2D& o_rLists, ZEK::VDrawWords& o_rColours ) const override;
  void GetDrawData3D( ZEK::VDrawWords& o_rIds, ZEK::VCameraLists3D& o_rLists,
                      ZEK::ECentroidColourScheme i_Colours ) const override;
  const ZEK::VRenderCameraInfo& GetInfo() const override { return m_Info; }

  const VCameraMarks& GetMarks() const { return m_Marks; }
  /// Null when the camera has none.
  const ZEK::IFlowItem* GetItem( ECameraItem i_Which ) const { return m_Items[i_Which].Get(); }
  template < typename TCoreType >
  const TCoreType* Value( ECameraItem i_Which ) const
  {
    return ZEK::FlowPayload< TCoreType >( m_Items[i_Which].Get() );
  }
  std::size_t CentroidCount() const;
  std::size_t BlobCount() const;

  // What its provider gives it.
  /// Does nothing for the value that is held; null takes the item away.
  void SetItem( ECameraItem i_Which, ZEK::IFlowItem* i_pNew );
  /// Swaps; does nothing when they are equal.
  void SetMarks( VCameraMarks& io_rMarks );
  void SetFirstIds( std::uint32_t i_Centroid, std::uint32_t i_Blob );
  /// The camera's number in its provider's list.
  void SetNumber( std::uint32_t i_Number );

private:
  void TakeHardware();
  void TakeSettings();
  void TakeCalibration();
  void ClearCalibrated();

  std::string m_Name;
  ComputeCameraModel::VCameraModel m_Model;
  ZEK::VRenderCameraInfo m_Info;
  std::string m_DisplayName;
  std::array< ZEK::VFlowItemRef, ECameraItemCount > m_Items;
  VCameraMarks m_Marks;
  std::unique_ptr< VCameraDrawData > m_pDrawData;
};

} // namespace Flow2Graphics

#pragma once

#include <MoxelGraphics/IRenderType.h>

#include <ZEK/RenderCamera.h>

#include <QtGui/QVector4D>

#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace CoreMoxelTypes
{
struct VCameraMaskGrid;
struct VEdgePairSet;
} // namespace CoreMoxelTypes

namespace MoxelGraphics
{
class VMoxelScene;

/// Where a wand was seen; sensor pixels.
struct VWandPoint
{
  float X = 0, Y = 0;
  float Frame = 0;

  friend bool operator==( const VWandPoint&, const VWandPoint& ) = default;
};

/// A cell of a mask that is selected or lies under the pointer.
struct VMarkedCell
{
  std::uint32_t Cell = 0;  ///< row-major
  std::uint32_t Flags = 0; ///< of a selection word

  friend bool operator==( const VMarkedCell&, const VMarkedCell& ) = default;
};

/// What a camera's own view shows beside video, centroids and grey blobs. All of it stays until it is set anew. A
/// generation is another number whenever what it stands for is another, and not 0 where there is something.
struct VCameraPictures
{
  const CoreMoxelTypes::VCameraMaskGrid* pMask = nullptr;
  std::uint64_t MaskGeneration = 0;
  /// Of the mask's cells, in the order of their numbers; 0: they cannot be picked.
  std::uint32_t FirstCellId = 0;
  std::span< const VMarkedCell > MarkedCells; ///< ascending
  const CoreMoxelTypes::VEdgePairSet* pEdges = nullptr;
  std::uint64_t EdgesGeneration = 0;
  std::span< const VWandPoint > Wand; ///< in the order of frames
  std::uint64_t WandGeneration = 0;
};

/// How many cells of a mask are there to be seen: none unless its numbers agree with one another.
std::uint32_t CellCount( const CoreMoxelTypes::VCameraMaskGrid& i_rMask );

/// The cameras of the system. In the 3D view a body, a frustum of 500 mm, axes and rays of each calibrated one, and
/// the edges of what it sees on the far face of the frustum; in a camera's own view its mask, edges, the smear of the
/// wand and the border of its sensor, for all tiles at once.
///
/// Bodies are one draw, as are the frustums of the cameras that are not selected; the selected ones follow. Nothing is
/// taken to the GPU unless it changed. A camera without a calibration has no body, a mask whose numbers disagree is not
/// drawn. Thread: render thread.
class VRenderCameras : public IRenderType
{
public:
  /// The scene owns this object. The provider's cameras are those of the last `TakeCameras`.
  VRenderCameras( VMoxelScene& i_rScene, std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider );
  ~VRenderCameras() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;
  void RenderTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions ) override;
  /// Of the camera whose tile the context shows: its centroids.
  void PickInRect( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, const QRect& i_rRect,
                   std::vector< std::uint32_t >& io_rIds ) override;
  /// The lines of the frustums of all cameras that are selected, or of all that are not. Selected ones are white, the
  /// current one has the primary colour.
  virtual void DrawFrustums( CoreGraphics::VRenderContext& io_rContext, bool i_bSelected );

  /// Looks at the provider's cameras; to be called after each of its updates. Geometry is made anew where a camera's
  /// change count is another. True when other cameras than before have a body, or in another order.
  bool TakeCameras();
  /// The cameras that have a body.
  std::span< const ZEK::VRenderCameraRef > Bodies() const { return m_Bodies; }
  /// Body i has `i_FirstId` + i; 0: none can be picked. `i_Flags` is empty or holds for each body the bits of its
  /// selection word from EIdSelected up, shifted down by 21.
  void SetIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags );
  std::uint32_t FirstId() const { return m_FirstId; }
  /// By the cameras' numbers, as many as the provider has cameras. `i_Frame` is the newest in which the wand was
  /// seen, and the states since: the age of what the wand left counts from it.
  void SetPictures( std::span< const VCameraPictures > i_Pictures, double i_Frame );
  /// The same pictures in another frame.
  void SetPicturesFrame( double i_Frame );

  void SetPrimaryColour( const QVector4D& i_rColour ) { m_PrimaryColour = i_rColour; }

protected:
  VMoxelScene& m_rScene;
  const std::shared_ptr< const ZEK::IRenderCameraProvider > m_pProvider;

private:
  struct VTaken
  {
    ZEK::VRenderCameraRef pCamera;
    std::int32_t ChangeCount = 0;
  };
  struct VParts;

  void RenderOpaque( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );

  std::vector< VTaken > m_Taken;
  std::vector< ZEK::VRenderCameraRef > m_Bodies;
  std::vector< ZEK::VRenderCameraRef > m_NewBodies;
  std::uint32_t m_FirstId = 0;
  QVector4D m_PrimaryColour{ 231.0F / 255.0F, 101.0F / 255.0F, 0.0F, 1.0F };
  std::unique_ptr< VParts > m_pParts;
};

} // namespace MoxelGraphics

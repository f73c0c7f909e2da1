#pragma once

#include "CameraMeshes.h"
#include "VHeldBuffer.h"

#include <CoreGraphics/VProgramPair.h>
#include <CoreGraphics/VRenderContext.h>
#include <ZEK/RenderCamera.h>

#include <cstdint>
#include <span>
#include <vector>

namespace CoreMoxelTypes
{
struct VEdgePairSet;
}

namespace MoxelGraphics
{
class VMoxelScene;

/// Places of the cameras that the 3D view shows; each list has one entry a camera. Written whole.
struct VCameraPlaces
{
  std::vector< ZEK::VMatrix4 > Bodies;   ///< world from camera
  std::vector< ZEK::VMatrix4 > Frustums; ///< world from the frustum whose far face is z = 1
};

/// The cameras in the world. Thread: render thread; OpenGL objects are made when they are first drawn.
class VCameraWorld
{
public:
  explicit VCameraWorld( const VMoxelScene& i_rScene );

  /// To be filled, then `PlacesChanged` called. Flags and ids are those of the cameras before until they are set.
  VCameraPlaces& Places() { return m_Places; }
  void PlacesChanged();
  std::size_t Count() const { return m_Places.Bodies.size(); }
  /// As `VRenderCameras::SetIds`.
  void SetIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags );
  /// Something is selected or lies under the pointer.
  bool IsMarked() const { return m_bMarked; }
  std::uint32_t FirstId() const { return m_FirstId; }

  /// In every mode: in the selection mode ids, in the highlight mode those of marked cameras.
  void DrawBodies( CoreGraphics::VRenderContext& io_rContext );
  void DrawFrustumIds( CoreGraphics::VRenderContext& io_rContext );
  // The rest in the visible mode alone.
  void DrawAxes( CoreGraphics::VRenderContext& io_rContext );
  void DrawFrustums( CoreGraphics::VRenderContext& io_rContext, bool i_bSelected, const QVector4D& i_rPrimary );
  /// Of the selected cameras.
  void DrawFaces( CoreGraphics::VRenderContext& io_rContext, const QVector4D& i_rPrimary );
  void DrawRays( CoreGraphics::VRenderContext& io_rContext );

private:
  /// Cameras that stand together in `m_Sorted`.
  struct VRun
  {
    std::size_t First = 0, Count = 0;
  };

  /// A camera as a pick draws it; the flags are as those of VPickedSphere.
  struct VPicked
  {
    ZEK::VMatrix4 Place;
    std::uint32_t Flags = 0;
  };

  /// Draws those of the cameras that reach into a pick's window. The corners are those of what stands in each place.
  void DrawPicked( CoreGraphics::VRenderContext& io_rContext, CoreGraphics::VInstancedProgramPair& io_rPair,
                   const std::vector< ZEK::VMatrix4 >& i_rPlaces, std::span< const QVector3D > i_Corners,
                   const CoreGraphics::VVertexStream& i_rShape, CoreGraphics::VMesh* i_pMesh );
  bool FeedFlags();
  void Sort();
  void DrawIds( CoreGraphics::VRenderContext& io_rContext, CoreGraphics::VInstancedProgramPair& io_rPair,
                std::span< const CoreGraphics::VVertexStream > i_Streams, CoreGraphics::VMesh* i_pMesh,
                std::size_t i_Count );
  void DrawRun( CoreGraphics::VRenderContext& io_rContext, CoreGraphics::VStaticBuffer& io_rShape, GLenum i_Mode,
                int i_Vertices, const VRun& i_rRun, const QVector4D& i_rColour );
  void MakeRays();

  const VMoxelScene& m_rScene;
  VCameraPlaces m_Places;
  std::vector< std::uint8_t > m_Flags;
  std::vector< ZEK::VMatrix4 > m_Sorted; ///< frustums: plain, then selected, then the current one; empty for all plain
  VRun m_Plain, m_Selected, m_Primary;
  std::vector< float > m_RayVertices;
  std::uint32_t m_FirstId = 0;
  bool m_bMarked = false;
  std::uint64_t m_PlacesGeneration = 1, m_FlagsGeneration = 1;
  std::uint64_t m_SortedPlaces = 0, m_SortedFlags = 0; ///< that `m_Sorted` was made of
  std::uint64_t m_SortedGeneration = 1;
  std::uint64_t m_RaysPlaces = 0;

  CoreGraphics::VInstancedProgramPair m_BodyPair, m_LinePair;
  std::shared_ptr< CoreGraphics::VShaderProgram > m_pUniformLines, m_pRays;
  CoreGraphics::VUniform m_Colour{ "u_Colour" };
  CoreGraphics::VMesh m_Body = MakeCameraMesh();
  CoreGraphics::VStaticBuffer m_Lines, m_Faces, m_Axes;
  int m_LineVertices = 0, m_FaceVertices = 0, m_AxisVertices = 0;
  std::vector< VPicked > m_Picked;
  CoreGraphics::VDynamicBuffer m_PickedBuffer;
  VHeldBuffer m_BodyBuffer, m_FrustumBuffer, m_SortedBuffer, m_FlagsBuffer, m_RayBuffer;
  CoreGraphics::VRenderState m_BodyState, m_LineState, m_VeilState;
};

} // namespace MoxelGraphics

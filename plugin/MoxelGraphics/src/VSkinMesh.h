#pragma once

#include "VTexture.h"

#include <MoxelGraphics/MeshPose.h>

#include <CoreGraphics/VMesh.h>
#include <HarrowPluginInterface/VMeshScene.h>

#include <deque>
#include <memory>
#include <vector>

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{

/// A mesh as the device has it: its surfaces put together by material. Thread: render thread with a context current.
class VSkinMesh
{
public:
  using VMeshRef = std::shared_ptr< const HarrowPluginInterface::VMeshScene >;
  /// What `FBXSkin` takes.
  static constexpr std::size_t MostBones = 250;

  struct VPart
  {
    VPart( const CoreGraphics::VVertexLayout& i_rLayout, std::span< const std::byte > i_Vertices,
           std::span< const std::uint32_t > i_Indices, const HarrowPluginInterface::VMeshMaterial& i_rMaterial,
           std::size_t i_FirstVertex )
      : Mesh( i_rLayout, i_Vertices, i_Indices )
      , rMaterial( i_rMaterial )
      , FirstVertex( i_FirstVertex )
      , pTexture( i_rMaterial.pPicture ? std::make_shared< VTexture >() : nullptr )
    {
    }

    CoreGraphics::VMesh Mesh; ///< position, normal, uv and, unless the mesh has too many of them, bones
    const HarrowPluginInterface::VMeshMaterial& rMaterial;
    const std::size_t FirstVertex;        ///< among those of all parts
    std::shared_ptr< VTexture > pTexture; ///< null: white
  };

  /// The mesh must be sound.
  explicit VSkinMesh( VMeshRef i_pMesh );

  /// Whether its lists are as long as they should be, and no index leads out of them.
  static bool IsSound( const HarrowPluginInterface::VMeshScene& i_rMesh );

  const HarrowPluginInterface::VMeshScene& Mesh() const { return *m_pMesh; }
  std::deque< VPart >& Parts() { return m_Parts; }
  std::size_t VertexCount() const { return m_VertexCount; }
  /// Moves the vertices of all parts, in order; room for `VertexCount`.
  void Skin( std::span< const VSkinMatrix > i_Bones, VSkinVertex* o_pVertices ) const;
  /// Binds the picture of a part to unit 0, or white; it is written first where the device does not have it.
  void BindTexture( CoreGraphics::VRenderContext& io_rContext, VPart& io_rPart );

  /// The streams of a skin that was moved here: what was moved, and what did not have to be.
  static const CoreGraphics::VVertexLayout& MovedLayout();
  static const CoreGraphics::VVertexLayout& UVLayout();

private:
  void AddPart( std::uint32_t i_Material );

  VMeshRef m_pMesh;
  std::deque< VPart > m_Parts;
  std::vector< std::size_t > m_SurfaceOrder; ///< as they lie in the parts
  std::size_t m_VertexCount = 0;
  VTexture m_White;
};

} // namespace MoxelGraphics

#pragma once

#include <CoreGraphics/VVertexBuffer.h>
#include <CoreGraphics/VVertexLayout.h>

#include <QtGui/QVector3D>

#include <cstdint>
#include <span>
#include <vector>

namespace CoreGraphics
{

/// Vertices and indices that do not change. Thread: as `VVertexBuffer`.
class VMesh
{
public:
  /// Both are copied. An index past the vertices makes the mesh empty.
  template < typename TVertex >
  VMesh( const VVertexLayout& i_rLayout, const std::vector< TVertex >& i_rVertices,
         const std::vector< std::uint32_t >& i_rIndices )
    : VMesh( i_rLayout, std::as_bytes( std::span( i_rVertices ) ), i_rIndices )
  {
  }
  VMesh( const VVertexLayout& i_rLayout, std::span< const std::byte > i_Vertices,
         std::span< const std::uint32_t > i_Indices );

  /// The stream of the vertices, for `SetVertexBuffer` and `SetVertexStreams`.
  VVertexStream Stream() { return { &m_Vertices, &m_Layout, 0 }; }
  VVertexBuffer& Indices() { return m_Indices; }
  int IndexCount() const { return m_IndexCount; }
  GLenum IndexType() const { return m_IndexType; }

private:
  VVertexLayout m_Layout;
  VStaticBuffer m_Vertices;
  VStaticBuffer m_Indices;
  int m_IndexCount = 0;
  GLenum m_IndexType = GL_UNSIGNED_SHORT;
};

/// The layout of meshes that hold positions alone: three floats.
const VVertexLayout& PositionLayout();

/// A unit sphere of triangles, counter-clockwise from outside, `EAttributePosition` alone. The subdivision of an
/// icosahedron: 0 gives 20 triangles, 1 80, 2 320.
VMesh MakeSphereMesh( int i_Subdivision );

} // namespace CoreGraphics

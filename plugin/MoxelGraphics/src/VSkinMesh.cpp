#include "VSkinMesh.h"

#include <CoreGraphics/VRenderContext.h>

#include <algorithm>
#include <utility>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;
using namespace HarrowPluginInterface;

struct VVertex
{
  std::array< float, 3 > Position, Normal;
  std::array< float, 2 > UV;
  std::array< std::uint8_t, 4 > Bones;
  std::array< float, 4 > Weights;
};
static_assert( sizeof( VVertex ) == 52 );

constexpr VVertexLayout VertexLayout( sizeof( VVertex ), 0,
                                      { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                        { EAttributeNormal, 3, GL_FLOAT, false, 12 },
                                        { EAttributeUV, 2, GL_FLOAT, false, 24 },
                                        { EAttributeBoneIndices, 4, GL_UNSIGNED_BYTE, false, 32 },
                                        { EAttributeBoneWeights, 4, GL_FLOAT, false, 36 } } );

VVertex MakeVertex( const VMeshSurface& i_rSurface, std::size_t i_Vertex, bool i_bBones )
{
  // Pictures begin at the top.
  const std::array< float, 2 >& rUV = i_rSurface.UVs[i_Vertex];
  VVertex Vertex{ i_rSurface.Positions[i_Vertex], i_rSurface.Normals[i_Vertex], { rUV[0], 1 - rUV[1] }, {}, { 1 } };
  if ( !i_bBones )
  {
    return Vertex;
  }
  if ( i_rSurface.Influences.empty() )
  {
    Vertex.Bones[0] = static_cast< std::uint8_t >( i_rSurface.Bone );
    return Vertex;
  }
  const VMeshInfluence& rInfluence = i_rSurface.Influences[i_Vertex];
  std::transform( rInfluence.Bones.begin(), rInfluence.Bones.end(), Vertex.Bones.begin(),
                  []( std::uint16_t i_Bone )
                  {
                    return static_cast< std::uint8_t >( i_Bone );
                  } );
  Vertex.Weights = rInfluence.Weights;
  return Vertex;
}

bool IsPictureSound( const VMeshPicture& i_rPicture )
{
  return i_rPicture.Width > 0 && i_rPicture.Height > 0 &&
         i_rPicture.Pixels.size() / 4 / static_cast< std::size_t >( i_rPicture.Width ) >=
             static_cast< std::size_t >( i_rPicture.Height );
}

bool IsSurfaceSound( const VMeshScene& i_rMesh, const VMeshSurface& i_rSurface )
{
  const std::size_t Vertices = i_rSurface.Positions.size(), Bones = i_rMesh.Bones.size();
  const bool bLists = i_rSurface.Normals.size() == Vertices && i_rSurface.UVs.size() == Vertices &&
                      ( i_rSurface.Influences.empty() || i_rSurface.Influences.size() == Vertices );
  const bool bIndices = i_rSurface.Material < i_rMesh.Materials.size() && i_rSurface.Bone < Bones &&
                        std::all_of( i_rSurface.Triangles.begin(), i_rSurface.Triangles.end(),
                                     [&]( std::uint32_t i_Vertex )
                                     {
                                       return i_Vertex < Vertices;
                                     } );
  return bLists && bIndices &&
         std::all_of( i_rSurface.Influences.begin(), i_rSurface.Influences.end(),
                      [&]( const VMeshInfluence& i_rInfluence )
                      {
                        return std::all_of( i_rInfluence.Bones.begin(), i_rInfluence.Bones.end(),
                                            [&]( std::uint16_t i_Bone )
                                            {
                                              return i_Bone < Bones;
                                            } );
                      } );
}
} // namespace

bool VSkinMesh::IsSound( const VMeshScene& i_rMesh )
{
  for ( std::size_t Node = 0; Node < i_rMesh.Nodes.size(); ++Node )
  {
    if ( i_rMesh.Nodes[Node].Parent >= static_cast< std::int32_t >( Node ) )
    {
      return false;
    }
  }
  for ( const VMeshAnimation& rAnimation : i_rMesh.Animations )
  {
    for ( const VMeshChannel& rChannel : rAnimation.Channels )
    {
      if ( rChannel.Node >= i_rMesh.Nodes.size() || rChannel.Positions.empty() || rChannel.Rotations.empty() ||
           rChannel.Scales.empty() )
      {
        return false;
      }
    }
  }
  return std::all_of( i_rMesh.Bones.begin(), i_rMesh.Bones.end(),
                      [&]( const VMeshBone& i_rBone )
                      {
                        return i_rBone.Node < i_rMesh.Nodes.size();
                      } ) &&
         std::all_of( i_rMesh.Surfaces.begin(), i_rMesh.Surfaces.end(),
                      [&]( const VMeshSurface& i_rSurface )
                      {
                        return IsSurfaceSound( i_rMesh, i_rSurface );
                      } ) &&
         std::all_of( i_rMesh.Materials.begin(), i_rMesh.Materials.end(),
                      []( const VMeshMaterial& i_rMaterial )
                      {
                        return !i_rMaterial.pPicture || IsPictureSound( *i_rMaterial.pPicture );
                      } );
}

const VVertexLayout& VSkinMesh::MovedLayout()
{
  static constexpr VVertexLayout Layout(
      sizeof( VSkinVertex ), 0,
      { { EAttributePosition, 3, GL_FLOAT, false, 0 }, { EAttributeNormal, 3, GL_FLOAT, false, 12 } } );
  return Layout;
}

const VVertexLayout& VSkinMesh::UVLayout()
{
  static constexpr VVertexLayout Layout( sizeof( VVertex ), 0, { { EAttributeUV, 2, GL_FLOAT, false, 24 } } );
  return Layout;
}

VSkinMesh::VSkinMesh( VMeshRef i_pMesh )
  : m_pMesh( std::move( i_pMesh ) )
{
  for ( std::uint32_t Material = 0; Material < m_pMesh->Materials.size(); ++Material )
  {
    AddPart( Material );
  }
}

void VSkinMesh::AddPart( std::uint32_t i_Material )
{
  std::vector< VVertex > Vertices;
  std::vector< std::uint32_t > Indices;
  const bool bBones = m_pMesh->Bones.size() <= MostBones;
  for ( std::size_t Index = 0; Index < m_pMesh->Surfaces.size(); ++Index )
  {
    const VMeshSurface& rSurface = m_pMesh->Surfaces[Index];
    if ( rSurface.Material != i_Material )
    {
      continue;
    }
    const auto First = static_cast< std::uint32_t >( Vertices.size() );
    for ( std::size_t Vertex = 0; Vertex < rSurface.Positions.size(); ++Vertex )
    {
      Vertices.push_back( MakeVertex( rSurface, Vertex, bBones ) );
    }
    for ( const std::uint32_t Vertex : rSurface.Triangles )
    {
      Indices.push_back( First + Vertex );
    }
    m_SurfaceOrder.push_back( Index );
  }
  if ( Indices.empty() )
  {
    return;
  }
  m_Parts.emplace_back( VertexLayout, std::as_bytes( std::span( Vertices ) ), Indices, m_pMesh->Materials[i_Material],
                        m_VertexCount );
  m_VertexCount += Vertices.size();
}

void VSkinMesh::Skin( std::span< const VSkinMatrix > i_Bones, VSkinVertex* o_pVertices ) const
{
  for ( const std::size_t Index : m_SurfaceOrder )
  {
    const VMeshSurface& rSurface = m_pMesh->Surfaces[Index];
    SkinSurface( rSurface, i_Bones, o_pVertices );
    o_pVertices += rSurface.Positions.size();
  }
}

void VSkinMesh::BindTexture( VRenderContext& io_rContext, VPart& io_rPart )
{
  static constexpr std::array< std::uint8_t, 4 > White{ 255, 255, 255, 255 };
  VTexture& rTexture = io_rPart.pTexture ? *io_rPart.pTexture : m_White;
  if ( rTexture.IsThere( io_rContext ) )
  {
    rTexture.Bind( io_rContext, 0 );
    return;
  }
  const VMeshPicture* const pPicture = io_rPart.pTexture ? io_rPart.rMaterial.pPicture.get() : nullptr;
  const auto Stride = pPicture ? std::size_t{ 4 } * static_cast< std::size_t >( pPicture->Width ) : 4;
  const bool bWritten = pPicture ? rTexture.Write( io_rContext, ETexel::RGBA8, pPicture->Width, pPicture->Height,
                                                   pPicture->Pixels.data(), Stride )
                                 : rTexture.Write( io_rContext, ETexel::RGBA8, 1, 1, White.data(), Stride );
  if ( !bWritten )
  {
    // Too large for this device, white then; one that refuses a single texel refuses everything.
    if ( std::exchange( io_rPart.pTexture, nullptr ) )
    {
      BindTexture( io_rContext, io_rPart );
    }
    return;
  }
  // Pictures of meshes go on beyond their rims.
  QOpenGLExtraFunctions& rGl = *io_rContext.Functions();
  rGl.glGenerateMipmap( GL_TEXTURE_2D );
  rGl.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, GL_LINEAR_MIPMAP_LINEAR );
  rGl.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, GL_REPEAT );
  rGl.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, GL_REPEAT );
}

} // namespace MoxelGraphics

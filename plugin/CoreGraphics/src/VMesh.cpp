#include <CoreGraphics/VMesh.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <map>

namespace CoreGraphics
{

const char* AttributeName( EVertexAttribute i_Attribute )
{
  static constexpr std::array< const char*, EAttributeCount > Names = { "a_position",
                                                                        "a_normal",
                                                                        "a_colour",
                                                                        "a_uv",
                                                                        "a_BoneIndices",
                                                                        "a_BoneWeights",
                                                                        "u_ModelTransform",
                                                                        "u_ReconPosAndSize",
                                                                        "u_TargetPosAndSize",
                                                                        "u_ModelColour",
                                                                        "u_StickColourA",
                                                                        "u_StickColourB",
                                                                        "u_SegmentColour",
                                                                        "a_InstanceFlags",
                                                                        "a_Tile",
                                                                        "u_StickA",
                                                                        "u_StickB" };
  return Names[i_Attribute];
}

VMesh::VMesh( const VVertexLayout& i_rLayout, std::span< const std::byte > i_Vertices,
              std::span< const std::uint32_t > i_Indices )
  : m_Layout( i_rLayout )
  , m_Indices( QOpenGLBuffer::IndexBuffer )
{
  const std::size_t VertexCount = i_rLayout.Stride ? i_Vertices.size() / i_rLayout.Stride : 0;
  const auto Largest = std::max_element( i_Indices.begin(), i_Indices.end() );
  if ( Largest == i_Indices.end() || *Largest >= VertexCount )
  {
    return;
  }
  m_Vertices.SetContents( i_Vertices );
  m_IndexCount = int( i_Indices.size() );
  if ( *Largest < 0xFFFF )
  {
    const std::vector< std::uint16_t > Short( i_Indices.begin(), i_Indices.end() );
    m_Indices.SetContents( std::span( Short ) );
    return;
  }
  m_IndexType = GL_UNSIGNED_INT;
  m_Indices.SetContents( i_Indices );
}

const VVertexLayout& PositionLayout()
{
  static constexpr VVertexLayout Layout( 12, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 } } );
  return Layout;
}

namespace
{
using VEdgeMap = std::map< std::pair< std::uint32_t, std::uint32_t >, std::uint32_t >;

std::uint32_t Middle( std::uint32_t i_A, std::uint32_t i_B, std::vector< QVector3D >& io_rPoints, VEdgeMap& io_rEdges )
{
  const auto [It, bNew] = io_rEdges.try_emplace( std::minmax( i_A, i_B ), std::uint32_t( io_rPoints.size() ) );
  if ( bNew )
  {
    io_rPoints.push_back( ( io_rPoints[i_A] + io_rPoints[i_B] ).normalized() );
  }
  return It->second;
}

std::vector< QVector3D > IcosahedronPoints()
{
  const float Golden = ( 1.0f + std::sqrt( 5.0f ) ) * 0.5f;
  std::vector< QVector3D > Points;
  for ( const float A : { -1.0f, 1.0f } )
  {
    for ( const float B : { -Golden, Golden } )
    {
      Points.push_back( QVector3D( A, B, 0.0f ).normalized() );
      Points.push_back( QVector3D( 0.0f, A, B ).normalized() );
      Points.push_back( QVector3D( B, 0.0f, A ).normalized() );
    }
  }
  return Points;
}

// The faces are the triples of mutual neighbours.
std::vector< std::uint32_t > IcosahedronFaces( const std::vector< QVector3D >& i_rPoints )
{
  const auto Near = [&]( std::uint32_t i_A, std::uint32_t i_B )
  {
    return QVector3D::dotProduct( i_rPoints[i_A], i_rPoints[i_B] ) > 0.4f;
  };
  std::vector< std::uint32_t > Faces;
  for ( std::uint32_t A = 0; A < 12; ++A )
  {
    for ( std::uint32_t B = A + 1; B < 12; ++B )
    {
      for ( std::uint32_t C = B + 1; C < 12; ++C )
      {
        if ( !Near( A, B ) || !Near( B, C ) || !Near( A, C ) )
        {
          continue;
        }
        const QVector3D Normal = QVector3D::crossProduct( i_rPoints[B] - i_rPoints[A], i_rPoints[C] - i_rPoints[A] );
        const bool bOutward = QVector3D::dotProduct( Normal, i_rPoints[A] ) > 0.0f;
        Faces.insert( Faces.end(), { A, bOutward ? B : C, bOutward ? C : B } );
      }
    }
  }
  return Faces;
}
} // namespace

VMesh MakeSphereMesh( int i_Subdivision )
{
  std::vector< QVector3D > Points = IcosahedronPoints();
  std::vector< std::uint32_t > Faces = IcosahedronFaces( Points );
  for ( int Level = 0; Level < std::min( i_Subdivision, 5 ); ++Level )
  {
    VEdgeMap Edges;
    std::vector< std::uint32_t > Finer;
    for ( std::size_t Face = 0; Face < Faces.size(); Face += 3 )
    {
      const std::uint32_t A = Faces[Face], B = Faces[Face + 1], C = Faces[Face + 2];
      const std::uint32_t AB = Middle( A, B, Points, Edges );
      const std::uint32_t BC = Middle( B, C, Points, Edges );
      const std::uint32_t CA = Middle( C, A, Points, Edges );
      Finer.insert( Finer.end(), { A, AB, CA, AB, B, BC, CA, BC, C, AB, BC, CA } );
    }
    Faces = std::move( Finer );
  }
  static_assert( sizeof( QVector3D ) == 12 );
  return VMesh( PositionLayout(), Points, Faces );
}

} // namespace CoreGraphics

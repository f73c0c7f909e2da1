#include "TestContext.h"

#include <random>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
// What draws would read: copied out by the device.
template < typename T >
std::vector< T > Contents( VVertexBuffer& i_rBuffer, GLenum i_Target )
{
  std::vector< T > Elements( i_rBuffer.Size() / sizeof( T ) );
  EXPECT_TRUE( i_rBuffer.Bind() );
  auto* pGl = QOpenGLContext::currentContext()->extraFunctions();
  const auto* pFirst = static_cast< const T* >( pGl->glMapBufferRange(
      i_Target, GLintptr( i_rBuffer.Offset() ), GLsizeiptr( i_rBuffer.Size() ), GL_MAP_READ_BIT ) );
  EXPECT_NE( pFirst, nullptr );
  std::copy_n( pFirst, pFirst ? Elements.size() : 0, Elements.begin() );
  pGl->glUnmapBuffer( i_Target );
  return Elements;
}
} // namespace

// Many writes in a frame, each drawn before the next.
TEST( VertexBuffer, EachDrawReadsTheWriteBeforeIt )
{
  VTestScene& Context = SharedScene( EKindCore );
  struct VVertex
  {
    float X, Y, Z;
    std::uint32_t Colour;
    std::uint8_t Odd;
  };
  constexpr VVertexLayout Layout(
      20, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 }, { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 12 } } );
  VDynamicBuffer Buffer;
  EXPECT_FALSE( Buffer.Bind() );
  Context.Begin();
  ASSERT_TRUE( Context.pRender->UseProgram( Context.Resources.GetProgram( "Simple3DVertexColour", "Colour" ) ) );
  std::mt19937 Random( 7 );
  std::uint64_t LastSerial = 0;
  std::size_t LastEnd = 0;
  int Exchanges = 0, Wrong = 0;
  for ( std::uint32_t Pixel = 0; Pixel < 64 * 64; ++Pixel )
  {
    const float X = ( float( Pixel % 64 ) + 0.5f ) / 32 - 1, Y = ( float( Pixel / 64 ) + 0.5f ) / 32 - 1;
    const std::vector< VVertex > Points( 1 + Random() % ( Pixel % 100 ? 20 : 2000 ), { X, Y, 0, ~Pixel, 0 } );
    const std::span< const std::byte > Bytes = std::as_bytes( std::span( Points ) ).first( Points.size() * 20 - 3 );
    const std::uint64_t Before = VVertexBuffer::TotalBytesUploaded();
    ASSERT_TRUE( Buffer.Write( Bytes ) );
    ASSERT_EQ( VVertexBuffer::TotalBytesUploaded() - Before, Bytes.size() );
    ASSERT_EQ( Buffer.Offset() % 4, 0u );
    // A draw may still read the former write: the next lies behind it, or in new storage once in a few writes.
    ASSERT_TRUE( Buffer.Offset() >= LastEnd || Buffer.Offset() == 0 );
    ASSERT_NE( Buffer.Serial(), LastSerial );
    Exchanges += Buffer.Offset() == 0;
    LastEnd = Buffer.Offset() + Bytes.size();
    LastSerial = Buffer.Serial();
    ASSERT_TRUE( Context.pRender->SetVertexBuffer( { &Buffer, &Layout, ( Points.size() - 1 ) * 20 } ) );
    Context.pRender->DrawArrays( GL_POINTS, 1 );
  }
  const std::vector< std::uint32_t > Pixels = Context.Pixels();
  for ( std::uint32_t Pixel = 0; Pixel < 64 * 64; ++Pixel )
  {
    Wrong += Pixels[Pixel] != ~Pixel;
  }
  EXPECT_EQ( Wrong, 0 );
  EXPECT_LT( Exchanges, 64 * 64 / 3 );
  EXPECT_FALSE( Buffer.Write( std::span< const std::byte >() ) );
  EXPECT_FALSE( Buffer.Bind() ) << "an empty write leaves nothing to draw";
  EXPECT_EQ( Buffer.Map( std::size_t( 1 ) << 40 ), nullptr );
}

TEST( VertexBuffer, ASphereMeshIsAClosedUnitSphereSeenFromOutside )
{
  SharedScene( EKindCore ).Begin();
  for ( int Subdivision = 0, Triangles = 20; Subdivision < 3; ++Subdivision, Triangles *= 4 )
  {
    VMesh Mesh = MakeSphereMesh( Subdivision );
    ASSERT_EQ( Mesh.IndexCount(), Triangles * 3 );
    ASSERT_EQ( Mesh.IndexType(), GLenum( GL_UNSIGNED_SHORT ) );
    const auto Points = Contents< QVector3D >( *Mesh.Stream().pBuffer, GL_ARRAY_BUFFER );
    const auto Indices = Contents< std::uint16_t >( Mesh.Indices(), GL_ELEMENT_ARRAY_BUFFER );
    ASSERT_EQ( Indices.size(), std::size_t( Triangles * 3 ) );
    int Edges = 0; // of each triangle the directed edges sum to nothing over a closed surface
    for ( std::size_t Face = 0; Face < Indices.size(); Face += 3 )
    {
      const std::array< std::uint16_t, 3 > Corners = { Indices[Face], Indices[Face + 1], Indices[Face + 2] };
      const QVector3D A = Points.at( Corners[0] ), B = Points.at( Corners[1] ), C = Points.at( Corners[2] );
      EXPECT_NEAR( A.length(), 1.0f, 1e-5f );
      EXPECT_GT( QVector3D::dotProduct( QVector3D::crossProduct( B - A, C - A ), A ), 0.0f );
      for ( std::size_t Corner = 0; Corner < 3; ++Corner )
      {
        Edges += Corners[Corner] < Corners[( Corner + 1 ) % 3] ? 1 : -1;
      }
    }
    EXPECT_EQ( Edges, 0 );
    EXPECT_EQ( Points.size(), std::size_t( Triangles / 2 + 2 ) );
  }
}

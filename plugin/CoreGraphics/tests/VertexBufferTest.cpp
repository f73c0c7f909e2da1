#include "TestContext.h"

#include <cstring>
#include <random>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
// What draws would read: copied out by the device.
std::vector< std::byte > Contents( VTestContext& i_rContext, VVertexBuffer& i_rBuffer )
{
  std::vector< std::byte > Bytes( i_rBuffer.Size() );
  EXPECT_TRUE( i_rBuffer.Bind() );
  auto* pFunctions = i_rContext.pRender->Functions();
  const void* pMemory = pFunctions->glMapBufferRange( GL_ARRAY_BUFFER, GLintptr( i_rBuffer.Offset() ),
                                                      GLsizeiptr( Bytes.size() ), GL_MAP_READ_BIT );
  EXPECT_NE( pMemory, nullptr );
  if ( pMemory )
  {
    std::memcpy( Bytes.data(), pMemory, Bytes.size() );
    pFunctions->glUnmapBuffer( GL_ARRAY_BUFFER );
  }
  return Bytes;
}
} // namespace

TEST( VertexBuffer, ADynamicBufferHoldsEachWriteWhole )
{
  VTestContext Context( EKindCore );
  VDynamicBuffer Buffer;
  EXPECT_FALSE( Buffer.Bind() );
  std::mt19937 Random( 7 );
  std::uint64_t LastSerial = 0;
  std::size_t LastEnd = 0;
  int Exchanges = 0;
  for ( int Write = 0; Write < 200; ++Write )
  {
    std::vector< std::byte > Wanted( 1 + Random() % ( Write % 20 == 0 ? 50000 : 3000 ) );
    for ( std::byte& rByte : Wanted )
    {
      rByte = std::byte( Random() );
    }
    const std::uint64_t Before = VVertexBuffer::TotalBytesUploaded();
    ASSERT_TRUE( Buffer.Write( std::span( Wanted ) ) );
    EXPECT_EQ( VVertexBuffer::TotalBytesUploaded() - Before, Wanted.size() );
    EXPECT_EQ( Buffer.Offset() % 4, 0u );
    // A draw may still read the former write: the next lies behind it, or in new storage once in a few writes.
    EXPECT_TRUE( Buffer.Offset() >= LastEnd || Buffer.Offset() == 0 );
    LastEnd = Buffer.Offset() + Wanted.size();
    Exchanges += Buffer.Offset() == 0;
    EXPECT_NE( Buffer.Serial(), LastSerial );
    LastSerial = Buffer.Serial();
    ASSERT_EQ( Contents( Context, Buffer ), Wanted );
  }
  EXPECT_LT( Exchanges, 200 / 3 );
  EXPECT_FALSE( Buffer.Write( std::span< const std::byte >() ) );
  EXPECT_FALSE( Buffer.Bind() ) << "an empty write leaves nothing to draw";
  EXPECT_EQ( Buffer.Map( std::size_t( 1 ) << 40 ), nullptr );
}

// Many writes in a frame, each drawn before the next.
TEST( VertexBuffer, EachDrawReadsTheWriteBeforeIt )
{
  VTestContext Context( EKindCore );
  VResources Resources;
  ASSERT_TRUE( Resources.Prepare() );
  const auto pProgram = Resources.GetProgram( "Simple3DVertexColour", "Colour" );
  struct VVertex
  {
    float X, Y, Z;
    std::uint32_t Colour;
  };
  constexpr VVertexLayout Layout(
      16, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 }, { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 12 } } );
  VDynamicBuffer Buffer;
  Context.Begin();
  ASSERT_TRUE( Context.pRender->UseProgram( pProgram ) );
  const auto Place = []( int i_Pixel )
  {
    return ( float( i_Pixel ) + 0.5f ) / 32.0f - 1.0f;
  };
  for ( int Pixel = 0; Pixel < 64 * 64; ++Pixel )
  {
    const std::array< VVertex, 1 > Point = {
        { { Place( Pixel % 64 ), Place( Pixel / 64 ), 0.0f, 0xFF000000u | std::uint32_t( Pixel + 1 ) } } };
    ASSERT_TRUE( Buffer.Write( std::span( Point ) ) );
    ASSERT_TRUE( Context.pRender->SetVertexBuffer( { &Buffer, &Layout, 0 } ) );
    Context.pRender->Functions()->glDrawArrays( GL_POINTS, 0, 1 );
  }
  const std::vector< std::uint32_t > Pixels = Context.Pixels();
  int Wrong = 0;
  for ( int Pixel = 0; Pixel < 64 * 64; ++Pixel )
  {
    Wrong += Pixels[std::size_t( Pixel )] != ( 0xFF000000u | std::uint32_t( Pixel + 1 ) );
  }
  EXPECT_EQ( Wrong, 0 );
}

TEST( VertexBuffer, ASphereMeshIsAClosedUnitSphereSeenFromOutside )
{
  VTestContext Context( EKindCore );
  for ( int Subdivision = 0, Triangles = 20; Subdivision < 3; ++Subdivision, Triangles *= 4 )
  {
    VMesh Mesh = MakeSphereMesh( Subdivision );
    ASSERT_EQ( Mesh.IndexCount(), Triangles * 3 );
    ASSERT_EQ( Mesh.IndexType(), GLenum( GL_UNSIGNED_SHORT ) );
    const std::vector< std::byte > Raw = Contents( Context, *Mesh.Stream().pBuffer );
    std::vector< QVector3D > Points( Raw.size() / sizeof( QVector3D ) );
    std::memcpy( static_cast< void* >( Points.data() ), Raw.data(), Raw.size() );
    ASSERT_TRUE( Mesh.Indices().Bind() );
    const auto* pIndices = static_cast< const std::uint16_t* >( Context.pRender->Functions()->glMapBufferRange(
        GL_ELEMENT_ARRAY_BUFFER, 0, Mesh.IndexCount() * 2, GL_MAP_READ_BIT ) );
    ASSERT_NE( pIndices, nullptr );
    int Edges = 0; // of each triangle the directed edges sum to nothing over a closed surface
    for ( int Face = 0; Face < Triangles; ++Face )
    {
      const QVector3D A = Points[pIndices[Face * 3]];
      const QVector3D B = Points[pIndices[Face * 3 + 1]];
      const QVector3D C = Points[pIndices[Face * 3 + 2]];
      EXPECT_NEAR( A.length(), 1.0f, 1e-5f );
      EXPECT_GT( QVector3D::dotProduct( QVector3D::crossProduct( B - A, C - A ), A ), 0.0f );
      for ( int Corner = 0; Corner < 3; ++Corner )
      {
        Edges += pIndices[Face * 3 + Corner] < pIndices[Face * 3 + ( Corner + 1 ) % 3] ? 1 : -1;
      }
    }
    EXPECT_EQ( Edges, 0 );
    EXPECT_EQ( Points.size(), std::size_t( Triangles / 2 + 2 ) );
    Context.pRender->Functions()->glUnmapBuffer( GL_ELEMENT_ARRAY_BUFFER );
  }
}

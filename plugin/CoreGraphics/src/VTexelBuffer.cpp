#include <CoreGraphics/VTexelBuffer.h>

#include <CoreGraphics/VRenderContext.h>

#include <QtGui/QOpenGLContext>

#include <algorithm>
#include <array>

namespace CoreGraphics
{
namespace
{
constexpr GLenum TextureBuffer = 0x8C2A;

struct VFormat
{
  std::size_t Bytes;
  GLenum Internal, Format, Type;
};

const VFormat& FormatOf( ETexelFormat i_Format )
{
  static constexpr std::array< VFormat, 3 > Formats = { { { 1, GL_R8, GL_RED, GL_UNSIGNED_BYTE },
                                                          { 8, GL_RG32UI, GL_RG_INTEGER, GL_UNSIGNED_INT },
                                                          { 16, GL_RGBA32F, GL_RGBA, GL_FLOAT } } };
  return Formats[i_Format];
}
} // namespace

VTexelBuffer::~VTexelBuffer()
{
  Release();
}

void VTexelBuffer::Release()
{
  // Where no context of the group is current the texture goes with the group.
  QOpenGLContext* pContext = QOpenGLContext::currentContext();
  if ( m_Texture != 0 && pContext && m_pGroup && pContext->shareGroup() == m_pGroup )
  {
    pContext->functions()->glDeleteTextures( 1, &m_Texture );
  }
  m_Texture = m_Attached = 0;
  m_bFilled = false;
}

bool VTexelBuffer::IsAlive( const VRenderContext& i_rContext ) const
{
  return m_Texture != 0 && m_pGroup && m_pGroup == i_rContext.Context()->shareGroup();
}

bool VTexelBuffer::Fits( const VRenderContext& i_rContext, ETexelFormat i_Format, std::size_t i_Bytes )
{
  // A ring holds several tables, and indices count from its start.
  constexpr std::size_t TablesPerRing = 8;
  return i_Bytes / FormatOf( i_Format ).Bytes * TablesPerRing <=
         static_cast< std::size_t >( i_rContext.MaximumBufferTexels() );
}

std::size_t VTexelBuffer::MostTextureBytes( VRenderContext& io_rContext, ETexelFormat i_Format )
{
  GLint Most = 0;
  io_rContext.Functions()->glGetIntegerv( GL_MAX_TEXTURE_SIZE, &Most );
  return static_cast< std::size_t >( std::max( Most, 0 ) ) * Width * FormatOf( i_Format ).Bytes;
}

int VTexelBuffer::First() const
{
  return m_bBuffer ? static_cast< int >( m_Buffer.Offset() / FormatOf( m_Format ).Bytes ) : 0;
}

void* VTexelBuffer::Map( VRenderContext& io_rContext, std::size_t i_Bytes, bool i_bBuffer )
{
  m_bFilled = false;
  if ( m_bBuffer != i_bBuffer || !IsAlive( io_rContext ) )
  {
    Release();
  }
  m_bBuffer = i_bBuffer;
  if ( i_bBuffer )
  {
    return m_Buffer.Map( i_Bytes );
  }
  const VFormat& rFormat = FormatOf( m_Format );
  if ( i_Bytes == 0 || i_Bytes > MostTextureBytes( io_rContext, m_Format ) )
  {
    return nullptr;
  }
  m_Rows = ( i_Bytes / rFormat.Bytes + Width - 1 ) / Width;
  m_Texels.resize( m_Rows * Width * rFormat.Bytes );
  return m_Texels.data();
}

bool VTexelBuffer::MakeTexture( VRenderContext& io_rContext )
{
  if ( !IsAlive( io_rContext ) )
  {
    m_pGroup = io_rContext.Context()->shareGroup();
    m_Attached = 0;
    io_rContext.Functions()->glGenTextures( 1, &m_Texture );
  }
  return m_Texture != 0;
}

bool VTexelBuffer::Unmap( VRenderContext& io_rContext )
{
  QOpenGLExtraFunctions& rGl = *io_rContext.Functions();
  const VFormat& rFormat = FormatOf( m_Format );
  if ( !MakeTexture( io_rContext ) )
  {
    return false;
  }
  if ( m_bBuffer )
  {
    m_bFilled = m_Buffer.Unmap();
    return m_bFilled;
  }
  io_rContext.BindTexture( 0, m_Texture );
  rGl.glPixelStorei( GL_UNPACK_ALIGNMENT, 1 );
  rGl.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, GL_NEAREST );
  rGl.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, GL_NEAREST );
  rGl.glTexImage2D( GL_TEXTURE_2D, 0, GLint( rFormat.Internal ), Width, GLsizei( m_Rows ), 0, rFormat.Format,
                    rFormat.Type, m_Texels.data() );
  rGl.glPixelStorei( GL_UNPACK_ALIGNMENT, 4 );
  VVertexBuffer::CountBytes( m_Texels.size() );
  m_bFilled = true;
  return true;
}

bool VTexelBuffer::Bind( VRenderContext& io_rContext, int i_Unit )
{
  if ( !m_bFilled || !IsAlive( io_rContext ) || ( m_bBuffer && m_Buffer.Id() == 0 ) )
  {
    return false;
  }
  if ( !m_bBuffer )
  {
    io_rContext.BindTexture( i_Unit, m_Texture );
    return true;
  }
  io_rContext.BindBufferTexture( i_Unit, m_Texture );
  if ( m_Attached != m_Buffer.Id() )
  {
    m_Attached = m_Buffer.Id();
    io_rContext.Functions()->glTexBuffer( TextureBuffer, FormatOf( m_Format ).Internal, m_Attached );
  }
  return true;
}

} // namespace CoreGraphics

#include "VTexture.h"

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VVertexBuffer.h>

#include <QtGui/QOpenGLContext>

namespace MoxelGraphics
{
namespace
{
struct VForm
{
  GLenum Internal, External;
};

VForm FormOf( ETexel i_Texel )
{
  switch ( i_Texel )
  {
  case ETexel::R8:
    return { GL_R8, GL_RED };
  case ETexel::RG8:
    return { GL_RG8, GL_RG };
  default:
    return { GL_RGBA8, GL_RGBA };
  }
}
} // namespace

VTexture::~VTexture()
{
  Free();
}

void VTexture::Free()
{
  // Where no context of the group is current the texture goes with the group.
  QOpenGLContext* const pContext = QOpenGLContext::currentContext();
  if ( m_Id != 0 && pContext && m_pGroup && pContext->shareGroup() == m_pGroup )
  {
    pContext->functions()->glDeleteTextures( 1, &m_Id );
  }
  m_Id = 0;
  m_Width = m_Height = 0;
}

bool VTexture::IsThere( const CoreGraphics::VRenderContext& i_rContext ) const
{
  return m_Id != 0 && m_pGroup == i_rContext.Context()->shareGroup();
}

void VTexture::Bind( CoreGraphics::VRenderContext& io_rContext, int i_Unit ) const
{
  io_rContext.BindTexture( i_Unit, m_Id );
}

bool VTexture::Make( CoreGraphics::VRenderContext& io_rContext, ETexel i_Texel, int i_Width, int i_Height )
{
  QOpenGLExtraFunctions& rGl = *io_rContext.Functions();
  GLint Longest = 0;
  rGl.glGetIntegerv( GL_MAX_TEXTURE_SIZE, &Longest );
  if ( i_Width > Longest || i_Height > Longest )
  {
    return false;
  }
  if ( !IsThere( io_rContext ) )
  {
    rGl.glGenTextures( 1, &m_Id );
    m_pGroup = io_rContext.Context()->shareGroup();
  }
  io_rContext.BindTexture( 0, m_Id );
  const auto [Internal, External] = FormOf( i_Texel );
  rGl.glTexImage2D( GL_TEXTURE_2D, 0, static_cast< GLint >( Internal ), i_Width, i_Height, 0, External,
                    GL_UNSIGNED_BYTE, nullptr );
  for ( const auto& [Name, Value] : { std::pair{ GL_TEXTURE_MIN_FILTER, GL_LINEAR },
                                      { GL_TEXTURE_MAG_FILTER, GL_LINEAR },
                                      { GL_TEXTURE_WRAP_S, GL_CLAMP_TO_EDGE },
                                      { GL_TEXTURE_WRAP_T, GL_CLAMP_TO_EDGE } } )
  {
    rGl.glTexParameteri( GL_TEXTURE_2D, static_cast< GLenum >( Name ), Value );
  }
  m_Texel = i_Texel;
  m_Width = i_Width;
  m_Height = i_Height;
  return true;
}

bool VTexture::Write( CoreGraphics::VRenderContext& io_rContext, ETexel i_Texel, int i_Width, int i_Height,
                      const std::uint8_t* i_pData, std::size_t i_Stride )
{
  const bool bFits = IsThere( io_rContext ) && m_Texel == i_Texel && m_Width == i_Width && m_Height == i_Height;
  if ( !bFits && !Make( io_rContext, i_Texel, i_Width, i_Height ) )
  {
    return false;
  }
  io_rContext.BindTexture( 0, m_Id );
  QOpenGLExtraFunctions& rGl = *io_rContext.Functions();
  const GLenum Form = FormOf( i_Texel ).External;
  const auto Bytes = static_cast< std::size_t >( i_Texel );
  rGl.glPixelStorei( GL_UNPACK_ALIGNMENT, 1 );
  if ( i_Stride % Bytes == 0 )
  {
    rGl.glPixelStorei( GL_UNPACK_ROW_LENGTH, static_cast< GLint >( i_Stride / Bytes ) );
    rGl.glTexSubImage2D( GL_TEXTURE_2D, 0, 0, 0, i_Width, i_Height, Form, GL_UNSIGNED_BYTE, i_pData );
    rGl.glPixelStorei( GL_UNPACK_ROW_LENGTH, 0 );
  }
  else
  {
    // Rows that do not begin at a whole texel go one by one.
    for ( int Row = 0; Row < i_Height; ++Row, i_pData += i_Stride )
    {
      rGl.glTexSubImage2D( GL_TEXTURE_2D, 0, 0, Row, i_Width, 1, Form, GL_UNSIGNED_BYTE, i_pData );
    }
  }
  rGl.glPixelStorei( GL_UNPACK_ALIGNMENT, 4 );
  CoreGraphics::VVertexBuffer::CountBytes( Bytes * static_cast< std::size_t >( i_Width ) *
                                           static_cast< std::size_t >( i_Height ) );
  return true;
}

} // namespace MoxelGraphics

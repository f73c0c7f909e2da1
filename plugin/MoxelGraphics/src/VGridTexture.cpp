#include "VGridTexture.h"

#include "Log.h"

#include <CoreGraphics/VRenderContext.h>

#include <QtGui/QOpenGLContext>

#include <vector>

namespace MoxelGraphics
{
namespace
{
constexpr int Side = 1024;
constexpr int Frame = 2;
constexpr GLenum MaximumAnisotropy = 0x84FE; // GL_TEXTURE_MAX_ANISOTROPY, an extension below 4.6

std::vector< std::uint8_t > Pixels()
{
  std::vector< std::uint8_t > Cell( static_cast< std::size_t >( Side ) * Side, 0 );
  for ( int Row = 0; Row < Side; ++Row )
  {
    for ( int Column = 0; Column < Side; ++Column )
    {
      const bool bFrame = Row < Frame || Row >= Side - Frame || Column < Frame || Column >= Side - Frame;
      Cell[static_cast< std::size_t >( Row * Side + Column )] = bFrame ? 255 : 0;
    }
  }
  return Cell;
}
} // namespace

VGridTexture::~VGridTexture()
{
  // Where no context of the group is current the texture goes with the group.
  QOpenGLContext* pContext = QOpenGLContext::currentContext();
  if ( m_Id != 0 && pContext && m_pGroup && pContext->shareGroup() == m_pGroup )
  {
    pContext->functions()->glDeleteTextures( 1, &m_Id );
  }
}

GLuint VGridTexture::Id( CoreGraphics::VRenderContext& io_rContext )
{
  if ( m_Id == 0 || m_pGroup != io_rContext.Context()->shareGroup() )
  {
    Make( io_rContext );
  }
  return m_Id;
}

void VGridTexture::Make( CoreGraphics::VRenderContext& io_rContext )
{
  QOpenGLExtraFunctions& rGl = *io_rContext.Functions();
  m_pGroup = io_rContext.Context()->shareGroup();
  rGl.glGenTextures( 1, &m_Id );
  io_rContext.BindTexture( 0, m_Id );
  rGl.glPixelStorei( GL_UNPACK_ALIGNMENT, 4 );
  rGl.glTexImage2D( GL_TEXTURE_2D, 0, GL_R8, Side, Side, 0, GL_RED, GL_UNSIGNED_BYTE, Pixels().data() );
  rGl.glGenerateMipmap( GL_TEXTURE_2D );
  const float Level = io_rContext.Anisotropy();
  if ( Level > 1.0f )
  {
    rGl.glTexParameterf( GL_TEXTURE_2D, MaximumAnisotropy, Level );
  }
  ZEK::Log( LogCategory(), ZEK::ELogDetail, "Floor grid texture with anisotropy %1%", Level );
}

} // namespace MoxelGraphics

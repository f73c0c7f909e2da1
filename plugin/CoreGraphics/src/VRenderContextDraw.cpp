#include <CoreGraphics/VRenderContext.h>

#include <ZEK/DebugServices.h>

#include <QtOpenGL/QOpenGLDebugLogger>
#include <QtOpenGL/QOpenGLVertexArrayObject>

// The part of the context that feeds attributes and draws.

namespace CoreGraphics
{
namespace
{
constexpr int MatrixColumns = 4;
constexpr int LargestVector = 4;

const void* AsPointer( std::size_t i_Offset )
{
  return reinterpret_cast< const void* >( i_Offset );
}
} // namespace

bool VRenderContext::SetVertexBuffer( const VVertexStream& i_rStream )
{
  return SetVertexStreams( std::span( &i_rStream, 1 ) );
}

bool VRenderContext::SetVertexStreams( std::span< const VVertexStream > i_Streams )
{
  if ( !m_pFunctions || !m_pProgram )
  {
    return false;
  }
  std::uint32_t Enabled = 0;
  int Count = 0;
  for ( const VVertexStream& rStream : i_Streams )
  {
    if ( !SetStream( rStream, Enabled, Count ) )
    {
      return false;
    }
  }
  SetEnabledArrays( Enabled );
  return true;
}

bool VRenderContext::SetStream( const VVertexStream& i_rStream, std::uint32_t& io_rEnabled, int& io_rCount )
{
  if ( !i_rStream.pBuffer || !i_rStream.pLayout || !i_rStream.pBuffer->Bind() )
  {
    return false;
  }
  for ( std::size_t Index = 0; Index < i_rStream.pLayout->Count; ++Index )
  {
    const VVertexElement& rElement = i_rStream.pLayout->Elements[Index];
    const int Location = m_pProgram->AttributeLocation( rElement.Attribute );
    if ( Location < 0 )
    {
      continue;
    }
    if ( !DebugServices::Check( ++io_rCount <= MaximumAttributes, "Attributes <= 8", __FILE__, __LINE__ ) )
    {
      return false;
    }
    const bool bMatrix = rElement.Components > LargestVector;
    SetPointer( Location, i_rStream, rElement );
    io_rEnabled |= ( bMatrix ? 0xFu : 1u ) << Location;
  }
  return true;
}

void VRenderContext::SetPointer( int i_Location, const VVertexStream& i_rStream, const VVertexElement& i_rElement )
{
  const VVertexLayout& rLayout = *i_rStream.pLayout;
  const int Columns = i_rElement.Components > LargestVector ? MatrixColumns : 1;
  VPointer Wanted;
  Wanted.Serial = i_rStream.pBuffer->Serial();
  Wanted.Offset = i_rStream.pBuffer->Offset() + i_rStream.Offset + i_rElement.Offset;
  Wanted.Type = i_rElement.Type;
  Wanted.Stride = rLayout.Stride;
  Wanted.Components = static_cast< std::uint8_t >( i_rElement.Components / Columns );
  Wanted.Divisor = rLayout.Divisor;
  Wanted.bNormalised = i_rElement.bNormalised;
  for ( int Column = 0; Column < Columns; ++Column )
  {
    const auto Location = GLuint( i_Location + Column );
    VPointer& rKnown = m_Pointers[Location];
    if ( rKnown != Wanted )
    {
      m_pFunctions->glVertexAttribPointer( Location, Wanted.Components, Wanted.Type,
                                           Wanted.bNormalised ? GL_TRUE : GL_FALSE, Wanted.Stride,
                                           AsPointer( Wanted.Offset ) );
      if ( rKnown.Divisor != Wanted.Divisor )
      {
        m_pFunctions->glVertexAttribDivisor( Location, Wanted.Divisor );
      }
      rKnown = Wanted;
    }
    Wanted.Offset += Wanted.Components * sizeof( float );
  }
}

void VRenderContext::SetEnabledArrays( std::uint32_t i_Mask )
{
  std::uint32_t Changed = m_EnabledArrays ^ i_Mask;
  m_EnabledArrays = i_Mask;
  for ( GLuint Location = 0; Changed != 0; ++Location, Changed >>= 1 )
  {
    if ( Changed & 1u )
    {
      i_Mask >> Location & 1u ? m_pFunctions->glEnableVertexAttribArray( Location )
                              : m_pFunctions->glDisableVertexAttribArray( Location );
    }
  }
}

void VRenderContext::SetConstantAttribute( EVertexAttribute i_Attribute, const QVector4D& i_rValue )
{
  const int Location = m_pProgram ? m_pProgram->AttributeLocation( i_Attribute ) : -1;
  if ( Location >= 0 )
  {
    m_pFunctions->glVertexAttrib4f( GLuint( Location ), i_rValue.x(), i_rValue.y(), i_rValue.z(), i_rValue.w() );
  }
}

void VRenderContext::DrawArrays( GLenum i_Mode, int i_Count, int i_First )
{
  if ( m_pProgram && i_Count > 0 )
  {
    ++m_DrawCalls;
    m_pFunctions->glDrawArrays( i_Mode, i_First, i_Count );
  }
}

void VRenderContext::DrawArraysInstanced( GLenum i_Mode, int i_Count, int i_Instances )
{
  if ( m_pProgram && i_Count > 0 && i_Instances > 0 )
  {
    ++m_DrawCalls;
    m_pFunctions->glDrawArraysInstanced( i_Mode, 0, i_Count, i_Instances );
  }
}

void VRenderContext::DrawElements( GLenum i_Mode, VMesh& i_rMesh )
{
  // The binding belongs to the vertex array object.
  if ( m_pProgram && i_rMesh.Indices().Bind() )
  {
    ++m_DrawCalls;
    m_pFunctions->glDrawElements( i_Mode, i_rMesh.IndexCount(), i_rMesh.IndexType(), nullptr );
  }
}

void VRenderContext::DrawElementsInstanced( GLenum i_Mode, VMesh& i_rMesh, int i_Instances )
{
  if ( m_pProgram && i_Instances > 0 && i_rMesh.Indices().Bind() )
  {
    ++m_DrawCalls;
    m_pFunctions->glDrawElementsInstanced( i_Mode, i_rMesh.IndexCount(), i_rMesh.IndexType(), nullptr, i_Instances );
  }
}

} // namespace CoreGraphics

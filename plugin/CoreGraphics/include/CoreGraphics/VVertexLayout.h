#pragma once

#include <QtGui/qopengl.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <initializer_list>

namespace CoreGraphics
{

class VVertexBuffer;

/// The attributes that a stream can feed. The first six are those of the vertices; the rest are the per-object
/// uniforms of the shader sources, which an instanced program takes from a stream instead.
enum EVertexAttribute : std::uint8_t
{
  EAttributePosition = 0,
  EAttributeNormal,
  EAttributeColour,
  EAttributeUV,
  EAttributeBoneIndices,
  EAttributeBoneWeights,
  EAttributeModelTransform,   ///< mat4: 16 floats, column-major
  EAttributeReconPosAndSize,  ///< vec4: x, y, z, radius
  EAttributeTargetPosAndSize, ///< vec4
  EAttributeModelColour,      ///< vec4
  EAttributeStickColourA,     ///< vec4
  EAttributeStickColourB,     ///< vec4
  EAttributeSegmentColour,    ///< vec4
  EAttributeInstanceFlags,    ///< EInstanceFlag bits, not normalised; from bit 8 on, ids left out so far, below 0x4000
  EAttributeTile,             ///< float: the row of a table that the object is placed by
  EAttributeStickA,           ///< vec3: where a stick begins
  EAttributeStickB,           ///< vec3: where it ends
  EAttributeCount
};

constexpr int FixedAttributeCount = 6;

/// Bits of the byte that an instanced selection program takes for each instance.
enum EInstanceFlag : std::uint8_t
{
  EInstanceSelected = 0x01,
  EInstancePreselected = 0x02,
  EInstancePrimary = 0x04,
  EInstanceHidden = 0x80 ///< not drawn in the selection mode: its id is ignored
};

/// The name by which shader sources know an attribute.
const char* AttributeName( EVertexAttribute i_Attribute );

struct VVertexElement
{
  EVertexAttribute Attribute = EAttributePosition;
  std::uint8_t Components = 4; ///< 1 to 4, 16 for a matrix, 12 for one whose columns lack the last row
  GLenum Type = GL_FLOAT;
  bool bNormalised = false;
  std::uint16_t Offset = 0; ///< bytes from the start of a record
};

/// How the records of one buffer feed attributes. Usually a constant of the code that fills the buffer.
struct VVertexLayout
{
  static constexpr std::size_t MaximumElements = 8;

  constexpr VVertexLayout( std::uint16_t i_Stride, std::uint8_t i_Divisor,
                           std::initializer_list< VVertexElement > i_Elements )
    : Stride( i_Stride )
    , Divisor( i_Divisor )
  {
    for ( const VVertexElement& rElement : i_Elements )
    {
      if ( Count < MaximumElements )
      {
        Elements[Count++] = rElement;
      }
    }
  }

  std::array< VVertexElement, MaximumElements > Elements{};
  std::uint8_t Count = 0;
  std::uint16_t Stride; ///< bytes from record to record
  std::uint8_t Divisor; ///< 0: a record a vertex; n: a record for n instances
};

/// One buffer as a draw reads it. Buffer and layout must outlive the draw.
struct VVertexStream
{
  VVertexBuffer* pBuffer = nullptr;
  const VVertexLayout* pLayout = nullptr;
  std::size_t Offset = 0; ///< bytes into the buffer's contents
};

} // namespace CoreGraphics

#pragma once

#include <QtGui/QVector3D>

#include <cstdint>

namespace CoreGraphics
{

/// Parts of a selection id word.
enum ESelectionIdBits : std::uint32_t
{
  ESelectionIdMask = 0x1FFFFF,
  ESelectionIdSelected = 0x200000,
  ESelectionIdPreselected = 0x400000,
  ESelectionIdPrimary = 0x800000,
  ESelectionWordMask = 0xFFFFFF
};

/// The colour that an object writes in the selection and highlight modes: bits 0-7, 8-15, 16-23 as r, g, b.
inline QVector3D SelectionColour( std::uint32_t i_Word )
{
  constexpr float Scale = 1.0f / 255.0f;
  return { float( i_Word & 0xFF ) * Scale, float( ( i_Word >> 8 ) & 0xFF ) * Scale,
           float( ( i_Word >> 16 ) & 0xFF ) * Scale };
}

/// The word of a pixel read back as RGBA bytes; 0 where nothing was drawn.
inline std::uint32_t SelectionWord( std::uint32_t i_Pixel )
{
  return i_Pixel & ESelectionWordMask;
}

} // namespace CoreGraphics

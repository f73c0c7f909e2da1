#pragma once

#include <CoreGraphics/VVertexBuffer.h>

#include <cstdint>
#include <span>
#include <vector>

namespace MoxelGraphics
{

/// A buffer and the generation of what it holds, 0 for nothing.
struct VHeldBuffer
{
  CoreGraphics::VDynamicBuffer Buffer;
  std::uint64_t Generation = 0;

  /// Writes unless it holds that generation. False when it holds nothing.
  template < typename T >
  bool Feed( const std::vector< T >& i_rValues, std::uint64_t i_Generation )
  {
    // A second try is for buffers that died with their windows.
    if ( Generation != i_Generation || !Buffer.Bind() )
    {
      Generation = Buffer.Write( std::span( i_rValues ) ) ? i_Generation : 0;
    }
    return Generation != 0;
  }
};

} // namespace MoxelGraphics

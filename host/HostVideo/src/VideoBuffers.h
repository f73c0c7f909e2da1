#pragma once

#include <CoreMoxelTypes/Basic.h>

#include <cstddef>
#include <memory>
#include <vector>

namespace HostVideo
{

/// The bytes of frames, which are used again when the last holder of a frame let go of it, from whatever thread.
class VVideoBuffers
{
public:
  /// So many that nobody holds are kept.
  explicit VVideoBuffers( std::size_t i_MostFree );

  /// As many bytes as asked, with anything in them.
  std::shared_ptr< std::vector< CoreMoxelTypes::u8 > > Take( std::size_t i_Size );

private:
  struct VShelf;
  std::shared_ptr< VShelf > m_pShelf;
};

} // namespace HostVideo

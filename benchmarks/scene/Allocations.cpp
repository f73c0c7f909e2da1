#include "Allocations.h"

#include <atomic>
#include <cstdlib>
#include <new>

namespace
{
std::atomic< std::uint64_t > Count{ 0 };
}

namespace SceneBench
{
std::uint64_t AllocationCount()
{
  return Count.load( std::memory_order_relaxed );
}
} // namespace SceneBench

void* operator new( std::size_t i_Size )
{
  Count.fetch_add( 1, std::memory_order_relaxed );
  if ( void* const pMemory = std::malloc( i_Size == 0 ? 1 : i_Size ) )
  {
    return pMemory;
  }
  throw std::bad_alloc();
}

void operator delete( void* i_pMemory ) noexcept
{
  std::free( i_pMemory );
}
void operator delete( void* i_pMemory, std::size_t ) noexcept
{
  std::free( i_pMemory );
}

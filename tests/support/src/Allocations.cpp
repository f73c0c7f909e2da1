#include <TestSupport/Allocations.h>

#include <atomic>
#include <cstdlib>
#include <new>

static std::atomic< std::uint64_t > s_Allocations{ 0 };

#if !defined( __SANITIZE_ADDRESS__ ) && !defined( __SANITIZE_THREAD__ )
void* operator new( std::size_t i_Size )
{
  s_Allocations.fetch_add( 1, std::memory_order_relaxed );
  if ( void* const pMemory = std::malloc( i_Size ? i_Size : 1 ) )
  {
    return pMemory;
  }
  throw std::bad_alloc();
}

void* operator new( std::size_t i_Size, std::align_val_t i_Alignment )
{
  s_Allocations.fetch_add( 1, std::memory_order_relaxed );
  const auto Alignment = static_cast< std::size_t >( i_Alignment );
  if ( void* const pMemory = std::aligned_alloc( Alignment, ( i_Size + Alignment - 1 ) / Alignment * Alignment ) )
  {
    return pMemory;
  }
  throw std::bad_alloc();
}

void operator delete( void* i_pMemory ) noexcept
{
  std::free( i_pMemory );
}

void operator delete( void* i_pMemory, std::align_val_t ) noexcept
{
  std::free( i_pMemory );
}

void operator delete( void* i_pMemory, std::size_t, std::align_val_t ) noexcept
{
  std::free( i_pMemory );
}

void operator delete( void* i_pMemory, std::size_t ) noexcept
{
  std::free( i_pMemory );
}
#endif

std::uint64_t TestSupport::AllocationCount()
{
  return s_Allocations.load( std::memory_order_relaxed );
}

#include "VideoBuffers.h"

#include <mutex>
#include <utility>

namespace HostVideo
{
using CoreMoxelTypes::u8;

struct VVideoBuffers::VShelf
{
  void PutBack( std::unique_ptr< std::vector< u8 > > i_pBytes )
  {
    const std::lock_guard Lock( Guard );
    if ( Free.size() < MostFree )
    {
      Free.push_back( std::move( i_pBytes ) ); // there is room for all of them
    }
  }

  std::mutex Guard;
  std::size_t MostFree = 0;
  std::vector< std::unique_ptr< std::vector< u8 > > > Free;
};

VVideoBuffers::VVideoBuffers( std::size_t i_MostFree )
  : m_pShelf( std::make_shared< VShelf >() )
{
  m_pShelf->MostFree = i_MostFree;
  m_pShelf->Free.reserve( i_MostFree );
}

std::shared_ptr< std::vector< u8 > > VVideoBuffers::Take( std::size_t i_Size )
{
  std::unique_ptr< std::vector< u8 > > pBytes;
  {
    const std::lock_guard Lock( m_pShelf->Guard );
    if ( !m_pShelf->Free.empty() )
    {
      pBytes = std::move( m_pShelf->Free.back() );
      m_pShelf->Free.pop_back();
    }
  }
  if ( !pBytes )
  {
    pBytes = std::make_unique< std::vector< u8 > >();
  }
  pBytes->resize( i_Size );
  const auto PutBack = [pShelf = m_pShelf]( std::vector< u8 >* i_pBytes )
  {
    pShelf->PutBack( std::unique_ptr< std::vector< u8 > >( i_pBytes ) );
  };
  return { pBytes.release(), PutBack };
}

} // namespace HostVideo

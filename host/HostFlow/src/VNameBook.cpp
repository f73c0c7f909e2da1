#include "VNameBook.h"

#include <algorithm>
#include <functional>
#include <limits>

namespace HostFlow
{

std::uint64_t HashOfName( std::string_view i_Name )
{
  return std::hash< std::string_view >()( i_Name );
}

VNameBook& VNameBook::Instance()
{
  // Never destroyed, as the pools of items.
  static VNameBook& rBook = *new VNameBook;
  return rBook;
}

VName& VNameBook::Take( std::string_view i_Text )
{
  const std::uint64_t Hash = HashOfName( i_Text );
  const std::lock_guard Lock( m_Guard );
  if ( ( m_Names.size() + 1 ) * 2 > m_Places.size() )
  {
    DropUnused();
    // Room for as many more as there are, or names that come and go would be looked through for each new one.
    if ( ( m_Names.size() + 1 ) * 4 > m_Places.size() )
    {
      Rehash( std::max< std::size_t >( 256, m_Places.size() * 2 ) );
    }
  }
  VName*& rpPlace = Find( Hash, i_Text );
  if ( !rpPlace )
  {
    auto pName = std::make_unique< VName >();
    pName->Text = i_Text;
    pName->Hash = Hash;
    m_Names.push_back( std::move( pName ) );
    rpPlace = m_Names.back().get();
    rpPlace->Number = m_LastNumber == std::numeric_limits< std::uint32_t >::max() ? 0 : ++m_LastNumber;
  }
  rpPlace->Uses.fetch_add( 1, std::memory_order_relaxed );
  return *rpPlace;
}

VName*& VNameBook::Find( std::uint64_t i_Hash, std::string_view i_Text )
{
  const std::size_t Mask = m_Places.size() - 1;
  std::size_t Place = i_Hash & Mask;
  while ( m_Places[Place] && ( m_Places[Place]->Hash != i_Hash || m_Places[Place]->Text != i_Text ) )
  {
    Place = ( Place + 1 ) & Mask;
  }
  return m_Places[Place];
}

void VNameBook::DropUnused()
{
  const auto bUnused = []( const std::unique_ptr< VName >& i_rpName )
  {
    return i_rpName->Uses.load( std::memory_order_acquire ) == 0;
  };
  if ( std::erase_if( m_Names, bUnused ) > 0 )
  {
    Rehash( m_Places.size() );
  }
}

void VNameBook::Rehash( std::size_t i_Places )
{
  m_Places.assign( i_Places, nullptr );
  for ( const auto& rpName : m_Names )
  {
    Find( rpName->Hash, rpName->Text ) = rpName.get();
  }
}

void VNameBook::Trim()
{
  const std::lock_guard Lock( m_Guard );
  DropUnused();
}

std::size_t VNameBook::Count() const
{
  const std::lock_guard Lock( m_Guard );
  return m_Names.size();
}

} // namespace HostFlow

#include "PendingChildren.h"

#include "Entry.h"

#include <algorithm>
#include <cstring>

namespace Store
{
namespace
{
int CompareBytes( std::string_view i_A, std::string_view i_B )
{
  // memcmp takes bytes as unsigned on every platform, and no null even for no bytes.
  const std::size_t Both = std::min( i_A.size(), i_B.size() );
  const int Common = Both == 0 ? 0 : std::memcmp( i_A.data(), i_B.data(), Both );
  return Common != 0 || i_A.size() == i_B.size() ? Common : ( i_A.size() < i_B.size() ? -1 : 1 );
}
} // namespace

std::uint64_t LeafKey( std::string_view i_Name )
{
  std::uint64_t Key = 0;
  for ( std::size_t Place = 0; Place < sizeof( Key ); ++Place )
  {
    Key = Key << 8 | ( Place < i_Name.size() ? static_cast< std::uint8_t >( i_Name[Place] ) : 0 );
  }
  return Key;
}

bool ChildLess( const VStoreEntry* i_pA, const VStoreEntry* i_pB )
{
  if ( i_pA->m_LeafKey != i_pB->m_LeafKey )
  {
    return i_pA->m_LeafKey < i_pB->m_LeafKey;
  }
  const int Leaf = CompareBytes( i_pA->m_Path.LeafView(), i_pB->m_Path.LeafView() );
  return Leaf != 0 ? Leaf < 0 : CompareBytes( i_pA->m_Path.Text(), i_pB->m_Path.Text() ) < 0;
}

int CompareLeaf( const VStoreEntry* i_pEntry, std::string_view i_Name )
{
  return CompareBytes( i_pEntry->m_Path.LeafView(), i_Name );
}

VChildRange FindChildren( const std::vector< VStoreEntry* >& i_rSorted, std::string_view i_Name )
{
  const auto Begin = std::lower_bound( i_rSorted.begin(), i_rSorted.end(), i_Name,
                                       []( const VStoreEntry* i_pEntry, std::string_view i_Wanted )
                                       {
                                         return CompareLeaf( i_pEntry, i_Wanted ) < 0;
                                       } );
  auto End = Begin;
  while ( End != i_rSorted.end() && CompareLeaf( *End, i_Name ) == 0 )
  {
    ++End;
  }
  return { i_rSorted.data() + ( Begin - i_rSorted.begin() ), i_rSorted.data() + ( End - i_rSorted.begin() ) };
}

void VPendingChildren::Add( VStoreEntry& io_rChild )
{
  io_rChild.m_pChange->m_Place = m_Items.size();
  m_Items.push_back( &io_rChild );
}

void VPendingChildren::Remove( VStoreEntry& io_rChild )
{
  m_Items[io_rChild.m_pChange->m_Place] = nullptr;
  ++m_Gone;
}

void VPendingChildren::Assign( const std::vector< VStoreEntry* >& i_rSorted )
{
  m_Items = i_rSorted;
  m_Sorted = m_Items.size();
  m_Gone = 0;
  for ( std::size_t Place = 0; Place < m_Items.size(); ++Place )
  {
    m_Items[Place]->m_pChange->m_Place = Place;
  }
}

void VPendingChildren::Clear()
{
  m_Items.clear();
  m_Sorted = 0;
  m_Gone = 0;
}

const std::vector< VStoreEntry* >& VPendingChildren::Sorted()
{
  if ( m_Gone == 0 && m_Sorted == m_Items.size() )
  {
    return m_Items;
  }
  const auto Middle = m_Items.begin() + static_cast< std::ptrdiff_t >( m_Sorted );
  const std::ptrdiff_t Sorted = Middle - m_Items.begin() - std::count( m_Items.begin(), Middle, nullptr );
  std::erase( m_Items, nullptr );
  // Often everything is new, and often in order.
  if ( !std::is_sorted( m_Items.begin() + Sorted, m_Items.end(), ChildLess ) )
  {
    std::sort( m_Items.begin() + Sorted, m_Items.end(), ChildLess );
  }
  if ( Sorted != 0 )
  {
    std::inplace_merge( m_Items.begin(), m_Items.begin() + Sorted, m_Items.end(), ChildLess );
  }
  m_Sorted = m_Items.size();
  m_Gone = 0;
  for ( std::size_t Place = 0; Place < m_Items.size(); ++Place )
  {
    m_Items[Place]->m_pChange->m_Place = Place;
  }
  return m_Items;
}

} // namespace Store

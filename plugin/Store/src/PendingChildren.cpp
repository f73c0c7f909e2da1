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

namespace
{
bool PendingLess( const VPendingChild& i_rA, const VPendingChild& i_rB )
{
  return i_rA.m_Key != i_rB.m_Key ? i_rA.m_Key < i_rB.m_Key : ChildLess( i_rA.m_pEntry, i_rB.m_pEntry );
}
} // namespace

void VPendingChildren::Add( VStoreEntry& io_rChild )
{
  const std::size_t Place = m_Items.size();
  io_rChild.m_pChange->m_Place = static_cast< std::uint32_t >( Place );
  // Many come in order, or alone.
  m_Sorted += m_Sorted == Place && ( Place == 0 || m_Items.back().m_Key < io_rChild.m_LeafKey ) ? 1 : 0;
  m_Items.push_back( { io_rChild.m_LeafKey, &io_rChild } );
}

void VPendingChildren::Remove( VStoreEntry& io_rChild )
{
  m_Items[io_rChild.m_pChange->m_Place].m_pEntry = nullptr;
  ++m_Gone;
}

void VPendingChildren::Assign( const std::vector< VStoreEntry* >& i_rSorted )
{
  Clear();
  m_Items.reserve( i_rSorted.size() );
  for ( VStoreEntry* const pChild : i_rSorted )
  {
    pChild->m_pChange->m_Place = static_cast< std::uint32_t >( m_Items.size() );
    m_Items.push_back( { pChild->m_LeafKey, pChild } );
  }
  m_Sorted = static_cast< std::uint32_t >( m_Items.size() );
}

void VPendingChildren::Clear()
{
  m_Items.clear();
  m_Sorted = 0;
  m_Gone = 0;
  m_Next = 0;
  m_Moved = 0;
}

void VPendingChildren::Sort()
{
  const auto IsGone = []( const VPendingChild& i_rChild )
  {
    return i_rChild.m_pEntry == nullptr;
  };
  const auto Middle = m_Items.begin() + static_cast< std::ptrdiff_t >( m_Sorted );
  const std::ptrdiff_t Sorted = Middle - m_Items.begin() - std::count_if( m_Items.begin(), Middle, IsGone );
  if ( m_Gone != 0 )
  {
    std::erase_if( m_Items, IsGone );
  }
  std::sort( m_Items.begin() + Sorted, m_Items.end(), PendingLess );
  if ( Sorted != 0 )
  {
    std::inplace_merge( m_Items.begin(), m_Items.begin() + Sorted, m_Items.end(), PendingLess );
  }
  m_Sorted = static_cast< std::uint32_t >( m_Items.size() );
  m_Gone = 0;
  std::uint32_t Place = 0;
  for ( const VPendingChild& rChild : m_Items )
  {
    rChild.m_pEntry->m_pChange->m_Place = Place++;
  }
}

} // namespace Store

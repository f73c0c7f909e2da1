#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

namespace Store
{

class VStoreEntry;

/// By leaf name, bytes compared as numbers from 0 to 255, the shorter first; equal leaf names by full path.
bool ChildLess( const VStoreEntry* i_pA, const VStoreEntry* i_pB );
/// The first eight bytes of a name as a number: where two differ, they are in the order of their names.
std::uint64_t LeafKey( std::string_view i_Name );
/// Less than 0, 0 or greater for the leaf name of the entry against a name.
int CompareLeaf( const VStoreEntry* i_pEntry, std::string_view i_Name );

/// A pending child, and its key, so that most are ordered without a look at them.
struct VPendingChild
{
  std::uint64_t m_Key;
  VStoreEntry* m_pEntry; ///< null where one was taken out
};
inline VStoreEntry* EntryOf( VStoreEntry* i_pChild )
{
  return i_pChild;
}
inline VStoreEntry* EntryOf( const VPendingChild& i_rChild )
{
  return i_rChild.m_pEntry;
}

/// Those of a sorted list with that leaf name: two only where a path begins with a `/`.
template < typename TChild >
std::span< const TChild > FindChildren( const std::vector< TChild >& i_rSorted, std::string_view i_Name )
{
  const auto Begin = std::lower_bound( i_rSorted.begin(), i_rSorted.end(), i_Name,
                                       []( const TChild& i_rChild, std::string_view i_Wanted )
                                       {
                                         return CompareLeaf( EntryOf( i_rChild ), i_Wanted ) < 0;
                                       } );
  auto End = Begin;
  while ( End != i_rSorted.end() && CompareLeaf( EntryOf( *End ), i_Name ) == 0 )
  {
    ++End;
  }
  return { Begin, End };
}

/// The children of an entry that have pending records. Adding and taking out cost nothing but a slot; the order is
/// made when somebody asks for it.
class VPendingChildren
{
public:
  void Add( VStoreEntry& io_rChild );
  void Remove( VStoreEntry& io_rChild );
  /// The list becomes exactly these, which all have records.
  void Assign( const std::vector< VStoreEntry* >& i_rSorted );
  void Clear();
  bool IsEmpty() const { return m_Items.size() == m_Gone; }
  /// In child order, none taken out. Stays as it is until a child is added or taken out.
  const std::vector< VPendingChild >& Sorted()
  {
    if ( m_Gone != 0 || m_Sorted != m_Items.size() )
    {
      Sort();
    }
    return m_Items;
  }
  /// In any order.
  const std::vector< VPendingChild >& Items() const { return m_Items; }

  // The merge goes through the sorted children once, and keeps those that came or went at the front of the list.
  /// Null at the end.
  VStoreEntry* Next() { return m_Next < m_Items.size() ? m_Items[m_Next++].m_pEntry : nullptr; }
  /// So many after the next; null past the end.
  const VStoreEntry* Ahead( std::size_t i_Steps ) const
  {
    return m_Next + i_Steps < m_Items.size() ? m_Items[m_Next + i_Steps].m_pEntry : nullptr;
  }
  void KeepMoved( VStoreEntry& i_rChild ) { m_Items[m_Moved++].m_pEntry = &i_rChild; }
  std::span< const VPendingChild > Moved() const { return { m_Items.data(), m_Moved }; }

private:
  void Sort();

  std::vector< VPendingChild > m_Items;
  std::uint32_t m_Sorted = 0; ///< so many at the front are in order
  std::uint32_t m_Gone = 0;
  std::uint32_t m_Next = 0;
  std::uint32_t m_Moved = 0;
};

} // namespace Store

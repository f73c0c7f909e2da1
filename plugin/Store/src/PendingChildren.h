#pragma once

#include <cstddef>
#include <cstdint>
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

/// Those of a sorted list with that leaf name: two only where a path begins with a `/`.
struct VChildRange
{
  VStoreEntry* const* m_pBegin;
  VStoreEntry* const* m_pEnd;
  VStoreEntry* const* begin() const { return m_pBegin; }
  VStoreEntry* const* end() const { return m_pEnd; }
};
VChildRange FindChildren( const std::vector< VStoreEntry* >& i_rSorted, std::string_view i_Name );

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
  /// In child order. Stays as it is until a child is added or taken out.
  const std::vector< VStoreEntry* >& Sorted();

private:
  std::vector< VStoreEntry* > m_Items; ///< null where one was taken out
  std::size_t m_Sorted = 0;            ///< so many at the front are in order
  std::size_t m_Gone = 0;
};

} // namespace Store

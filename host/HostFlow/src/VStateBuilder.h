#pragma once

#include "VItemPool.h"

#include <ZEK/FlowState.h>

#include <cstdint>
#include <memory>
#include <vector>

namespace HostFlow
{

/// Where the entries of one tag lie in a settled state.
struct VTagRange
{
  std::uint32_t Tag = 0;
  std::uint32_t First = 0;
  std::uint32_t Last = 0; ///< one past the last
  ZEK::VFlowItemsId Id;
};

/// What a state needs while it grows: the entries in the order they came, and the table that finds the entry which a
/// new one replaces. Lent to one state at a time, so that the hundreds of states in a ring do not each keep one.
class VStateBuilder
{
public:
  ~VStateBuilder() { Clear(); }

  static std::unique_ptr< VStateBuilder > Take();
  /// Keeps the memory for the next state.
  static void GiveBack( std::unique_ptr< VStateBuilder > i_pBuilder );
  static void Trim();

  /// Adds with a reference of its own, or replaces the entry of equal tag, key and names.
  void Add( const ZEK::VFlowTimeKey& i_rKey, ZEK::IFlowItem& i_rItem );
  /// Takes the entries of a settled state over, with the references that they hold.
  void Load( std::vector< ZEK::VFlowEntry >& io_rEntries );
  /// Hands the entries and their references over, in the order of a state. The key is the state's.
  void Settle( const ZEK::VFlowTimeKey& i_rKey, std::vector< ZEK::VFlowEntry >& o_rEntries,
               std::vector< VTagRange >& o_rTags );
  std::size_t Count() const { return m_Entries.size(); }

private:
  struct VTag
  {
    std::uint32_t Tag = 0;
    std::uint32_t Count = 0;
    std::uint32_t Next = 0;
    const VItemPool* pPool = nullptr;
  };
  struct VSlot
  {
    std::uint32_t Hash = 0;
    std::uint32_t Entry = 0; ///< index + 1; 0 is a free slot
  };
  struct VOrdered
  {
    ZEK::VFlowEntry Entry;
    std::uint32_t Order = 0;
  };

  void Clear();
  void Forget();
  std::uint32_t TagIndex( std::uint32_t i_Tag );
  VSlot& FindSlot( std::uint32_t i_Hash, const ZEK::VFlowEntry& i_rEntry );
  void Grow();
  void Append( const ZEK::VFlowEntry& i_rEntry );
  void SortByKey( ZEK::VFlowEntry* i_pFirst, ZEK::VFlowEntry* i_pLast );

  std::vector< ZEK::VFlowEntry > m_Entries;
  std::vector< std::uint32_t > m_TagOf; ///< index into m_Tags, by entry
  std::vector< VTag > m_Tags;
  std::vector< VSlot > m_Table;
  std::vector< VOrdered > m_Scratch;
  std::uint32_t m_LastTag = 0;
};

} // namespace HostFlow

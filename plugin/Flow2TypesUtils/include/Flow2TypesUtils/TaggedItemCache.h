#pragma once

#include <ZEK/FlowState.h>

#include <cstdint>
#include <span>
#include <string_view>
#include <typeinfo>
#include <utility>
#include <vector>

namespace Flow2TypesUtils
{

/// What a tag means for the objects of a join.
enum class ETagRequirement : std::uint32_t
{
  Required = 0,      ///< an object must have an item of the tag; without any item of the tag there are no objects
  RequiredIfAny = 1, ///< the same, unless the tag does not occur in the state at all
  Optional = 2       ///< an object may have one
};

/// What one update asks of a state.
struct VJoinQuery
{
  const ZEK::IFlowState& rState;
  std::uint32_t NameSelector = 0;
  ZEK::EFlowTimeMatch Match = ZEK::EFlowTimeMatch::Overlap;
  ZEK::VFlowTimeKey Key;
};

class VNameTable;

/// The items of one tag within a join. Used by its extractor.
class VItemCache
{
public:
  VItemCache( std::uint32_t i_Tag, ETagRequirement i_Requirement );
  virtual ~VItemCache();

  /// The start of an update: what is at hand becomes what was before.
  void Begin() { m_bSameIds = true; }
  /// Walks the tag's items and counts them in the rows. False when the tag is required and has no item; `o_rbRequired`
  /// says whether the tag counts for this state.
  bool Collect( const VJoinQuery& i_rQuery, std::uint32_t i_CacheNumber, VNameTable& io_rTable, bool& o_rbRequired );
  /// Gives every object its slot, after the rows have theirs.
  void Resize( std::size_t i_Count, ZEK::VFlowCursor i_EndEntry, VNameTable& io_rTable );
  /// Empties the present vectors; with `i_bKeepAsPrevious` the ids become those of the update before.
  void Clear( bool i_bKeepAsPrevious );

  /// Takes the entries of a new state for those that were joined, as long as they are the same objects in the same
  /// places. False, with the join no longer good, when they are not.
  bool Keep( const VJoinQuery& i_rQuery, ZEK::VFlowCursor i_EndEntry, VNameTable& io_rTable );

  /// Whether the ids differ from those of the update before, in number or in any.
  bool Changed() const;
  /// One bit a slot, clear where the id occurs anywhere among those of the update before: a value that moved to
  /// another slot did not change.
  void ChangedBits( std::vector< bool >& o_rBits ) const;
  /// By slot, the end cursor where an object has none.
  const std::vector< ZEK::VFlowCursor >& Entries() const;
  bool Occurs() const { return !m_Seen.empty(); }
  ETagRequirement Requirement() const { return m_Requirement; }
  std::uint32_t Tag() const { return m_Tag; }
  std::span< const ZEK::VFlowValueId > Ids() const { return m_Ids; }

  /// The core type of the payloads.
  virtual const std::type_info& ValueType() const = 0;

protected:
  static constexpr std::uint32_t None = ~std::uint32_t{ 0 };
  /// An item of the last update in the order of the state, as far as it passed the time test.
  struct VSeen
  {
    ZEK::VFlowValueId Id;
    const ZEK::IFlowItem* pItem = nullptr;
    std::uint32_t Row = None;  ///< none: the item has no name
    std::uint32_t Slot = None; ///< none: another item of the name came first, or the object lacks something
  };

  /// Whether the payloads are still to be looked up for the items at hand; they are then taken to be.
  bool TakeValues() const { return !std::exchange( m_bValuesTaken, true ); }
  std::span< const VSeen > Seen() const { return m_Seen; }

private:
  /// Where the tag's entries lie in the state of the last update, and which of them count.
  struct VRange
  {
    std::span< const ZEK::VFlowEntry > Entries;
    ZEK::EFlowTimeMatch Match = ZEK::EFlowTimeMatch::Overlap;
    ZEK::VFlowTimeKey Key;
    ZEK::VFlowCursor EndEntry;
  };
  VRange RangeOf( const VJoinQuery& i_rQuery ) const;
  /// What tells whether another state has the same items; unknown where not all of them pass.
  ZEK::VFlowItemsId ItemsIdOf( const VJoinQuery& i_rQuery ) const;
  /// The rest of `Keep`, from the first entry that holds another item than before.
  template < typename TWalk >
  bool KeepOthers( VSeen* i_pSeen, const ZEK::VFlowEntry* i_pEntry, TWalk i_Walk, std::uint32_t i_NameSelector,
                   VNameTable& io_rTable );

  std::uint32_t m_Tag;
  ETagRequirement m_Requirement;
  std::vector< VSeen > m_Seen;
  ZEK::VFlowItemsId m_ItemsId; ///< of those that are joined
  mutable VRange m_Range;
  const ZEK::IFlowState* m_pState = nullptr; ///< where the range is still to be looked up
  mutable std::vector< ZEK::VFlowCursor > m_Entries;
  std::vector< ZEK::VFlowValueId > m_Ids;
  std::vector< ZEK::VFlowValueId > m_PreviousIds; ///< not kept up while `m_bSameIds`
  mutable std::vector< ZEK::VFlowValueId > m_Sorted;
  mutable bool m_bValuesTaken = false;
  mutable bool m_bEntriesTaken = false;
  bool m_bSameIds = false; ///< the ids of the update before are those at hand
};

template < typename TCoreType >
class VItemCacheTyped final : public VItemCache
{
public:
  using VItemCache::VItemCache;

  /// Looked up when somebody asks: most of what changes in a frame is asked for once, some of it never.
  const std::vector< const TCoreType* >& Values() const
  {
    if ( TakeValues() )
    {
      m_Values.assign( Ids().size(), nullptr );
      for ( const VSeen& rSeen : Seen() )
      {
        if ( rSeen.Slot != None )
        {
          m_Values[rSeen.Slot] = ZEK::FlowPayload< TCoreType >( rSeen.pItem );
        }
      }
    }
    return m_Values;
  }
  const std::type_info& ValueType() const override { return typeid( TCoreType ); }

private:
  mutable std::vector< const TCoreType* > m_Values;
};

} // namespace Flow2TypesUtils

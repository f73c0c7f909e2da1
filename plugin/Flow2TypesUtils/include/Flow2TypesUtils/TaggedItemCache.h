#pragma once

#include <ZEK/FlowState.h>

#include <cstdint>
#include <span>
#include <string_view>
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

/// One object name of a join.
struct VJoinRow
{
  static constexpr std::uint32_t None = ~std::uint32_t{ 0 };
  std::string_view Name;      ///< in the items while joining, in the extractor afterwards
  std::uint32_t HitCount = 0; ///< tags that count and have an item of this name
  std::uint32_t Index = None; ///< slot, or none for an object that lacks something
  std::uint32_t LastCache = None;
};

/// Finds or makes the row of a name.
class IJoinRows
{
public:
  virtual std::uint32_t RowOf( std::string_view i_Name ) = 0;
  virtual VJoinRow& Row( std::uint32_t i_Row ) = 0;

protected:
  ~IJoinRows() = default;
};

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
  bool Collect( const VJoinQuery& i_rQuery, std::uint32_t i_CacheNumber, IJoinRows& io_rRows, bool& o_rbRequired );
  /// Gives every object its slot, after the rows have theirs.
  void Resize( std::size_t i_Count, ZEK::VFlowCursor i_EndEntry, IJoinRows& io_rRows );
  /// Empties the present vectors; with `i_bKeepAsPrevious` the ids become those of the update before.
  void Clear( bool i_bKeepAsPrevious );

  /// Takes the entries of a new state for those that were joined, as long as they are the same objects in the same
  /// places. False, with the join no longer good, when they are not.
  bool Keep( const VJoinQuery& i_rQuery, IJoinRows& io_rRows );
  /// The end of a join that was kept: slots without an entry hold the new state's end cursor.
  void Renew( ZEK::VFlowCursor i_EndEntry );

  /// Whether the ids differ from those of the update before, in number or in any.
  bool Changed() const;
  /// One bit a slot, clear where the id occurs anywhere among those of the update before: a value that moved to
  /// another slot did not change.
  void ChangedBits( std::vector< bool >& o_rBits ) const;
  const std::vector< ZEK::VFlowCursor >& Entries() const { return m_Entries; }
  ETagRequirement Requirement() const { return m_Requirement; }
  std::uint32_t Tag() const { return m_Tag; }
  std::span< const ZEK::VFlowValueId > Ids() const { return m_Ids; }

protected:
  virtual void ResizeValues( std::size_t i_Count ) = 0;
  virtual void TakeValue( std::size_t i_Slot, const ZEK::IFlowItem* i_pItem ) = 0;

private:
  /// An item of the last update in the order of the state, as far as it passed the time test.
  struct VSeen
  {
    ZEK::VFlowValueId Id;
    const ZEK::IFlowItem* pItem = nullptr;
    std::uint32_t Row = VJoinRow::None;  ///< none: the item has no name
    std::uint32_t Slot = VJoinRow::None; ///< none: another item of the name came first, or the object lacks something
  };
  bool KeepEntry( VSeen& io_rSeen, const ZEK::VFlowCursor& i_rEntry, std::uint32_t i_NameSelector,
                  IJoinRows& io_rRows );

  std::uint32_t m_Tag;
  ETagRequirement m_Requirement;
  std::vector< VSeen > m_Seen;
  std::vector< ZEK::VFlowCursor > m_SeenEntries; ///< while a join is made anew, one an item seen
  std::vector< ZEK::VFlowCursor > m_Entries;
  std::vector< ZEK::VFlowValueId > m_Ids;
  std::vector< ZEK::VFlowValueId > m_PreviousIds; ///< not kept up while `m_bSameIds`
  mutable std::vector< ZEK::VFlowValueId > m_Sorted;
  std::vector< std::uint32_t > m_Holes; ///< slots without an entry
  bool m_bSameIds = false;              ///< the ids of the update before are those at hand
};

template < typename TCoreType >
class VItemCacheTyped final : public VItemCache
{
public:
  using VItemCache::VItemCache;
  const std::vector< const TCoreType* >& Values() const { return m_Values; }

protected:
  void ResizeValues( std::size_t i_Count ) override { m_Values.assign( i_Count, nullptr ); }
  void TakeValue( std::size_t i_Slot, const ZEK::IFlowItem* i_pItem ) override
  {
    m_Values[i_Slot] = ZEK::FlowPayload< TCoreType >( i_pItem );
  }

private:
  std::vector< const TCoreType* > m_Values;
};

} // namespace Flow2TypesUtils

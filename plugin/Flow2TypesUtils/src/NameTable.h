#pragma once

#include <ZEK/FlowTypes.h>

#include <bit>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace Flow2TypesUtils
{

/// One object name of a join.
struct VJoinRow
{
  static constexpr std::uint32_t None = ~std::uint32_t{ 0 };
  std::string_view Name;      ///< in the items while joining, in the extractor afterwards
  std::uint32_t HitCount = 0; ///< tags that count and have an item of this name
  std::uint32_t Index = None; ///< slot, or none for an object that lacks something
  std::uint32_t LastCache = None;
};

/// The rows of a join, found by name. Keeps its room from join to join.
class VNameTable
{
public:
  static constexpr std::uint32_t None = VJoinRow::None;

  void Clear();
  /// The row of the item's name, made if need be; none when the item has no name under the selector.
  std::uint32_t RowOf( const ZEK::IFlowItem& i_rItem, std::uint32_t i_Selector );
  /// Whether that would be this row, which may be none.
  bool IsRowOf( std::uint32_t i_Row, const ZEK::IFlowItem& i_rItem, std::uint32_t i_Selector );
  /// By row, the number of an item that had the name; 0 when none is known.
  const std::uint32_t* Numbers() const { return m_Numbers.data(); }
  VJoinRow& Row( std::uint32_t i_Row ) { return m_Rows[i_Row]; }

  /// Gives slots to the rows that were hit `i_Needed` times, in the order of their names' bytes, and takes the names
  /// of all rows out of the items: into `o_rNames` and a list of its own.
  void Number( std::uint32_t i_Needed, std::vector< std::string >& o_rNames );

private:
  /// Where the row of a number stands, if it is known.
  struct VNumbered
  {
    std::uint32_t Number = 0;
    std::uint32_t Row = 0;
  };

  std::uint32_t RowOf( std::string_view i_Name );
  VNumbered& Numbered( std::uint32_t i_Number );
  void Grow();
  /// The high bits: those of a product that every bit of the name has a part in.
  std::size_t BucketOf( std::uint64_t i_Hash ) const
  {
    return static_cast< std::size_t >( i_Hash >> ( 64 - std::bit_width( m_Buckets.size() - 1 ) ) );
  }

  std::vector< VJoinRow > m_Rows;
  std::vector< std::uint32_t > m_Numbers;
  std::vector< std::uint64_t > m_Hashes;  ///< one a row
  std::vector< std::uint32_t > m_Buckets; ///< row + 1, 0 for none; a power of two, at most half full
  /// As large as the buckets. A place is taken by the number met last, so it may have to be found by the text again.
  std::vector< VNumbered > m_Numbered;
  std::vector< std::uint32_t > m_Order;
  std::vector< std::string > m_Dropped;
};

} // namespace Flow2TypesUtils

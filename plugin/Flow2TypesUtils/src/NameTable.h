#pragma once

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
  void Clear();
  std::uint32_t RowOf( std::string_view i_Name );
  VJoinRow& Row( std::uint32_t i_Row ) { return m_Rows[i_Row]; }

  /// Gives slots to the rows that were hit `i_Needed` times, in the order of their names' bytes, and takes the names
  /// of all rows out of the items: into `o_rNames` and a list of its own.
  void Number( std::uint32_t i_Needed, std::vector< std::string >& o_rNames );

private:
  void Grow();
  /// The high bits: those of a product that every bit of the name has a part in.
  std::size_t BucketOf( std::uint64_t i_Hash ) const
  {
    return static_cast< std::size_t >( i_Hash >> ( 64 - std::bit_width( m_Buckets.size() - 1 ) ) );
  }

  std::vector< VJoinRow > m_Rows;
  std::vector< std::uint64_t > m_Hashes;  ///< one a row
  std::vector< std::uint32_t > m_Buckets; ///< row + 1, 0 for none; a power of two, at most half full
  std::vector< std::uint32_t > m_Order;
  std::vector< std::string > m_Dropped;
};

} // namespace Flow2TypesUtils

#pragma once

#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>

namespace Flow2TypesUtils
{

/// The rows of a join, found by name. Keeps its room from join to join.
class VTaggedCoreTypeExtractor::VNameTable final : public IJoinRows
{
public:
  void Clear();
  std::uint32_t RowOf( std::string_view i_Name ) override;
  VJoinRow& Row( std::uint32_t i_Row ) override { return m_Rows[i_Row]; }

  /// Gives slots to the rows that were hit `i_Needed` times, in the order of their names' bytes, and takes the names
  /// of all rows out of the items: into `o_rNames` and a list of its own.
  void Number( std::uint32_t i_Needed, std::vector< std::string >& o_rNames );

private:
  void Grow();

  std::vector< VJoinRow > m_Rows;
  std::vector< std::uint64_t > m_Hashes;  ///< one a row
  std::vector< std::uint32_t > m_Buckets; ///< row + 1, 0 for none; a power of two, at most half full
  std::vector< std::uint32_t > m_Order;
  std::vector< std::string > m_Dropped;
};

} // namespace Flow2TypesUtils

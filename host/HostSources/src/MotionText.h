#pragma once

#include "TrcText.h"

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace HostSources
{

/// Reads a table of motion (.mot, .sto): a header up to "endheader", a line of names, a row of numbers a frame. Throws
/// `VReadFault`.
class VMotionText
{
public:
  /// Reads the header and the names.
  explicit VMotionText( std::string_view i_Text );

  const std::vector< std::string >& Columns() const { return m_Columns; } ///< the first is the time
  std::optional< bool > Degrees() const { return m_Degrees; }             ///< none where the header does not say
  std::optional< std::int64_t > PromisedRows() const { return m_Promised; }
  std::size_t PromisedColumns() const { return m_PromisedColumns; } ///< 0 where the header does not say
  std::size_t Position() const { return m_Lines.Position(); }
  std::uint64_t Line() const { return m_Lines.Number(); }

  /// What is not wanted may be no number, and is left as it was.
  void Want( std::vector< bool > i_bWanted ) { m_bWanted = std::move( i_bWanted ); }
  enum class ERow
  {
    Row,
    End,
    Cut ///< the text ends within a row
  };
  /// `io_rRow` has one number a column.
  ERow NextRow( std::vector< double >& io_rRow );

private:
  void ReadHeader();
  void TakeHeaderLine( std::string_view i_Line );
  void ReadNames();
  [[noreturn]] void Fail( const std::string& i_rExpected, std::string_view i_Found ) const;

  Trc::VLines m_Lines;
  std::vector< std::string > m_Columns;
  std::vector< bool > m_bWanted;
  std::optional< bool > m_Degrees;
  std::optional< std::int64_t > m_Promised;
  std::size_t m_PromisedColumns = 0;
  std::int64_t m_Rows = 0;
};

} // namespace HostSources

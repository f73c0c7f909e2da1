#pragma once

#include <HostSources/VProgress.h>

#include <ZEK/Result.h>

#include <cstdint>
#include <initializer_list>
#include <string>
#include <string_view>
#include <vector>

namespace HostSources
{

/// Numbers out of some columns of a table of comma-separated values with a line of names.
struct VCsvTable
{
  std::vector< double > Cells; ///< row after row; NaN for a blank one
  std::size_t Columns = 0;
  std::uint64_t BadRows = 0; ///< rows left out: too few cells, or no number where one belongs
  std::string FirstBad;
  bool bCutOff = false; ///< the last row ends within the file's last line

  std::size_t Rows() const { return Columns > 0 ? Cells.size() / Columns : 0; }
  const double* Row( std::size_t i_Row ) const { return Cells.data() + i_Row * Columns; }
};

/// A column to read; the numbers of one that may be missing are then NaN.
struct VCsvColumn
{
  std::string_view Name;
  bool bRequired = true;
};

/// The names of the columns, in lower case.
std::vector< std::string > CsvHeader( std::string_view i_Text );

/// `InvalidFormat` for a missing column; `EndOfData` without any row; `Canceled`. The message names no file.
ZEK::IResult ReadCsv( std::string_view i_Text, std::initializer_list< VCsvColumn > i_Columns, VCsvTable& o_rTable,
                      std::string& o_rMessage, const VProgress& i_rProgress );

} // namespace HostSources

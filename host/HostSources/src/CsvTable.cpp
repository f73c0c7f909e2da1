#include "CsvTable.h"

#include "TrcText.h"

#include <algorithm>
#include <cctype>
#include <cmath>

namespace HostSources
{
namespace
{
template < typename TTake >
std::size_t ForEachCell( std::string_view i_Line, TTake&& i_rTake )
{
  std::size_t Count = 0;
  for ( std::size_t Begin = 0; Begin <= i_Line.size(); ++Count )
  {
    const std::size_t End = std::min( i_Line.find( ',', Begin ), i_Line.size() );
    std::string_view Cell = Trc::Trim( i_Line.substr( Begin, End - Begin ) );
    if ( Cell.size() >= 2 && Cell.front() == '"' && Cell.back() == '"' )
    {
      Cell = Cell.substr( 1, Cell.size() - 2 );
    }
    i_rTake( Count, Cell );
    Begin = End + 1;
  }
  return Count;
}

std::vector< std::string > NamesOf( std::string_view i_Line )
{
  std::vector< std::string > Names;
  ForEachCell( i_Line,
               [&]( std::size_t, std::string_view i_Cell )
               {
                 std::string& rName = Names.emplace_back( i_Cell );
                 for ( char& rCharacter : rName )
                 {
                   rCharacter = static_cast< char >( std::tolower( static_cast< unsigned char >( rCharacter ) ) );
                 }
               } );
  return Names;
}

/// Where the columns that are wanted go, by column of the file; -1 for the others.
bool Place( const std::vector< std::string >& i_rNames, std::initializer_list< VCsvColumn > i_Columns,
            std::vector< int >& o_rPlaces, std::string& o_rMessage )
{
  o_rPlaces.assign( i_rNames.size(), -1 );
  std::string Missing, Wanted;
  int Place = 0;
  for ( const VCsvColumn& rColumn : i_Columns )
  {
    const auto It = std::find( i_rNames.begin(), i_rNames.end(), rColumn.Name );
    if ( It != i_rNames.end() )
    {
      o_rPlaces[static_cast< std::size_t >( It - i_rNames.begin() )] = Place;
    }
    else if ( rColumn.bRequired )
    {
      Missing.append( Missing.empty() ? "" : ", " ).append( rColumn.Name );
    }
    if ( rColumn.bRequired )
    {
      Wanted.append( Wanted.empty() ? "" : ", " ).append( rColumn.Name );
    }
    ++Place;
  }
  if ( !Missing.empty() )
  {
    o_rMessage = "line 1: expected the columns " + Wanted + ", found no " + Missing;
  }
  return Missing.empty();
}

/// False, with a reason, for a row that is none.
bool TakeRow( std::string_view i_Line, const std::vector< int >& i_rPlaces, double* o_pRow, std::string& o_rReason )
{
  bool bGood = true;
  const std::size_t Count = ForEachCell( i_Line,
                                         [&]( std::size_t i_Column, std::string_view i_Cell )
                                         {
                                           if ( i_Column >= i_rPlaces.size() || i_rPlaces[i_Column] < 0 )
                                           {
                                             return;
                                           }
                                           double& rValue = o_pRow[i_rPlaces[i_Column]];
                                           if ( Trc::ReadNumber( i_Cell, rValue ) == Trc::ECell::Wrong && bGood )
                                           {
                                             bGood = false;
                                             o_rReason =
                                                 "expected a number in column " + std::to_string( i_Column + 1 );
                                           }
                                         } );
  if ( Count < i_rPlaces.size() )
  {
    o_rReason = "expected " + std::to_string( i_rPlaces.size() ) + " cells, found " + std::to_string( Count );
    return false;
  }
  return bGood;
}
} // namespace

std::vector< std::string > CsvHeader( std::string_view i_Text )
{
  Trc::VLines Lines( i_Text );
  std::string_view Line;
  return Lines.Next( Line ) ? NamesOf( Line ) : std::vector< std::string >();
}

ZEK::IResult ReadCsv( std::string_view i_Text, std::initializer_list< VCsvColumn > i_Columns, VCsvTable& o_rTable,
                      std::string& o_rMessage, const VProgress& i_rProgress )
{
  o_rTable = {};
  o_rTable.Columns = i_Columns.size();
  Trc::VLines Lines( i_Text );
  std::string_view Line;
  std::vector< int > Places;
  if ( !Lines.Next( Line ) )
  {
    o_rMessage = "line 1: expected the names of columns, found an empty file";
    return ZEK::IResult::EndOfData;
  }
  if ( !Place( NamesOf( Line ), i_Columns, Places, o_rMessage ) )
  {
    return ZEK::IResult::InvalidFormat;
  }
  std::string Reason;
  while ( Lines.Next( Line ) )
  {
    if ( i_rProgress && Lines.Number() % 4096 == 2 &&
         !i_rProgress( static_cast< double >( Lines.Position() ) / static_cast< double >( i_Text.size() ) ) )
    {
      o_rMessage = "the reading was stopped";
      return ZEK::IResult::Canceled;
    }
    if ( Trc::Trim( Line ).empty() )
    {
      continue;
    }
    const std::size_t Begin = o_rTable.Cells.size();
    o_rTable.Cells.resize( Begin + o_rTable.Columns, std::nan( "" ) );
    if ( !TakeRow( Line, Places, o_rTable.Cells.data() + Begin, Reason ) )
    {
      o_rTable.Cells.resize( Begin );
      o_rTable.bCutOff = !Lines.Ended();
      if ( o_rTable.BadRows++ == 0 )
      {
        o_rTable.FirstBad = "line " + std::to_string( Lines.Number() ) + ": " + Reason;
      }
    }
  }
  if ( o_rTable.Cells.empty() )
  {
    o_rMessage = o_rTable.BadRows > 0 ? o_rTable.FirstBad : "line 2: expected rows, found the end of the file";
    return o_rTable.BadRows > 0 ? ZEK::IResult::InvalidFormat : ZEK::IResult::EndOfData;
  }
  return ZEK::IResult::Ok;
}

} // namespace HostSources

#include "MotionText.h"

#include "C3dParameters.h"
#include "ReaderSupport.h"
#include "XmlTree.h"

#include <algorithm>
#include <cmath>

namespace HostSources
{
namespace
{
constexpr std::size_t MostHeaderLines = 10000, MostColumns = 65536;

/// A count, or none where the text is not one.
std::optional< std::int64_t > CountOf( std::string_view i_Text )
{
  double Value = 0;
  const bool bCount = Trc::ReadNumber( i_Text, Value ) == Trc::ECell::Number && Value >= 0 && Value < 1e15;
  return bCount ? std::optional( static_cast< std::int64_t >( Value ) ) : std::nullopt;
}

bool Same( std::string_view i_A, const char* i_pB )
{
  return C3d::SameName( std::string( i_A ), i_pB );
}
} // namespace

VMotionText::VMotionText( std::string_view i_Text )
  : m_Lines( i_Text )
{
  ReadHeader();
  ReadNames();
}

void VMotionText::Fail( const std::string& i_rExpected, std::string_view i_Found ) const
{
  std::string Message = std::string( "line " )
                            .append( std::to_string( m_Lines.Number() ) )
                            .append( ": expected " )
                            .append( i_rExpected )
                            .append( ", found " );
  Message += i_Found.empty() ? std::string( "the end of the file" )
                             : std::string( "\"" ).append( ToUtf8( i_Found.substr( 0, 40 ) ) ).append( "\"" );
  throw VReadFault( std::move( Message ), i_Found.empty() ? ZEK::IResult::EndOfData : ZEK::IResult::InvalidFormat );
}

void VMotionText::TakeHeaderLine( std::string_view i_Line )
{
  const std::size_t Equals = i_Line.find( '=' );
  const auto Words = Xml::Words( i_Line );
  const bool bPair = Equals == std::string_view::npos && Words.size() == 2;
  const std::string_view Key = bPair ? Words[0] : Trc::Trim( i_Line.substr( 0, Equals ) );
  const std::string_view Value = bPair                              ? Words[1]
                                 : Equals == std::string_view::npos ? std::string_view()
                                                                    : Trc::Trim( i_Line.substr( Equals + 1 ) );
  if ( Same( Key, "inDegrees" ) )
  {
    if ( !Same( Value, "yes" ) && !Same( Value, "no" ) )
    {
      Fail( "inDegrees=yes or inDegrees=no", i_Line );
    }
    m_Degrees = Same( Value, "yes" );
  }
  else if ( Same( Key, "nRows" ) || Same( Key, "datarows" ) )
  {
    m_Promised = CountOf( Value );
    if ( !m_Promised )
    {
      Fail( "a count of rows", i_Line );
    }
  }
  else if ( Same( Key, "nColumns" ) || Same( Key, "datacolumns" ) )
  {
    m_PromisedColumns = static_cast< std::size_t >( CountOf( Value ).value_or( 0 ) );
  }
}

void VMotionText::ReadHeader()
{
  std::string_view Line;
  for ( std::size_t Count = 0; m_Lines.Next( Line ) && Count < MostHeaderLines; ++Count )
  {
    if ( const auto Words = Xml::Words( Line ); Words.size() == 1 && Same( Words[0], "endheader" ) )
    {
      return;
    }
    TakeHeaderLine( Line );
  }
  Fail( "\"endheader\" behind a header", {} );
}

void VMotionText::ReadNames()
{
  std::string_view Line;
  while ( m_Lines.Next( Line ) && Xml::Words( Line ).empty() )
  {
  }
  const bool bTabs = Line.find( '\t' ) != std::string_view::npos;
  for ( const std::string_view Cell : bTabs ? Trc::SplitCells( Line ) : Xml::Words( Line ) )
  {
    m_Columns.emplace_back( Cell );
  }
  while ( !m_Columns.empty() && m_Columns.back().empty() )
  {
    m_Columns.pop_back();
  }
  if ( m_Columns.empty() || !Same( m_Columns[0], "time" ) )
  {
    Fail( "names of columns, \"time\" first", m_Columns.empty() ? std::string_view() : m_Columns[0] );
  }
  if ( m_Columns.size() > MostColumns )
  {
    Fail( "at most " + std::to_string( MostColumns ) + " columns", "more" );
  }
  m_bWanted.assign( m_Columns.size(), true );
}

VMotionText::ERow VMotionText::NextRow( std::vector< double >& io_rRow )
{
  constexpr std::string_view Spaces = " \t\r\f\v";
  std::string_view Line;
  do
  {
    if ( !m_Lines.Next( Line ) )
    {
      return ERow::End;
    }
    Line.remove_prefix( std::min( Line.find_first_not_of( Spaces ), Line.size() ) );
  } while ( Line.empty() );
  const bool bLast = m_Lines.Rest().find_first_not_of( " \t\r\n" ) == std::string_view::npos;
  // A last number without anything behind it may have lost digits, unless its row is the last that was promised.
  if ( bLast && !m_Lines.Ended() && m_Rows > 0 && m_Promised.value_or( m_Rows + 1 ) > m_Rows + 1 )
  {
    return ERow::Cut;
  }
  std::size_t Column = 0;
  for ( ; !Line.empty(); ++Column )
  {
    const std::string_view Cell = Line.substr( 0, Line.find_first_of( Spaces ) );
    Line.remove_prefix( Cell.size() );
    Line.remove_prefix( std::min( Line.find_first_not_of( Spaces ), Line.size() ) );
    if ( Column >= m_Columns.size() )
    {
      Fail( std::to_string( m_Columns.size() ) + " numbers, one a column", Cell );
    }
    if ( m_bWanted[Column] )
    {
      double& rValue = io_rRow[Column];
      if ( Trc::ReadNumber( Cell, rValue ) != Trc::ECell::Number || !std::isfinite( rValue ) )
      {
        Fail( "a number for " + ToUtf8( m_Columns[Column].substr( 0, 60 ) ), Cell );
      }
    }
  }
  if ( Column < m_Columns.size() )
  {
    if ( bLast && m_Rows > 0 )
    {
      return ERow::Cut;
    }
    Fail( std::to_string( m_Columns.size() ) + " numbers, one a column", std::to_string( Column ) + " of them" );
  }
  ++m_Rows;
  return ERow::Row;
}

} // namespace HostSources

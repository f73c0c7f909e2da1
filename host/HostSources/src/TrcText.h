#pragma once

// Lines and tab-separated cells of a text, without copying it.

#include <charconv>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>
#include <string_view>
#include <vector>

namespace HostSources::Trc
{

inline std::string_view Trim( std::string_view i_Text )
{
  while ( !i_Text.empty() && ( i_Text.front() == ' ' || i_Text.front() == '\r' ) )
  {
    i_Text.remove_prefix( 1 );
  }
  while ( !i_Text.empty() && ( i_Text.back() == ' ' || i_Text.back() == '\r' ) )
  {
    i_Text.remove_suffix( 1 );
  }
  return i_Text;
}

/// Steps through lines that end in LF or CR LF.
class VLines
{
public:
  explicit VLines( std::string_view i_Text )
    : m_Rest( i_Text )
    , m_Size( i_Text.size() )
  {
  }

  /// False at the end of the text.
  bool Next( std::string_view& o_rLine )
  {
    if ( m_Rest.empty() )
    {
      return false;
    }
    const std::size_t End = m_Rest.find( '\n' );
    m_bEnded = End != std::string_view::npos;
    o_rLine = m_Rest.substr( 0, End );
    m_Rest.remove_prefix( m_bEnded ? End + 1 : m_Rest.size() );
    if ( !o_rLine.empty() && o_rLine.back() == '\r' )
    {
      o_rLine.remove_suffix( 1 );
    }
    ++m_Number;
    return true;
  }
  std::uint64_t Number() const { return m_Number; } ///< of the line last given, from 1
  bool Ended() const { return m_bEnded; }           ///< whether that line had a line feed
  std::size_t Position() const { return m_Size - m_Rest.size(); }
  std::string_view Rest() const { return m_Rest; }

private:
  std::string_view m_Rest;
  std::size_t m_Size = 0;
  std::uint64_t m_Number = 0;
  bool m_bEnded = true;
};

/// Steps through the cells of a line.
class VCells
{
public:
  explicit VCells( std::string_view i_Line )
    : m_pNext( i_Line.data() )
    , m_pEnd( i_Line.data() + i_Line.size() )
    , m_bMore( true )
  {
  }

  bool Next( std::string_view& o_rCell )
  {
    if ( !m_bMore )
    {
      return false;
    }
    const char* pTab = m_pNext;
    while ( pTab != m_pEnd && *pTab != '\t' )
    {
      ++pTab;
    }
    o_rCell = { m_pNext, static_cast< std::size_t >( pTab - m_pNext ) };
    m_bMore = pTab != m_pEnd;
    m_pNext = m_bMore ? pTab + 1 : m_pEnd;
    return true;
  }

private:
  const char* m_pNext;
  const char* m_pEnd;
  bool m_bMore;
};

enum class ECell
{
  Blank,
  Number,
  Wrong
};

/// A number too large for its type is infinite.
template < typename T >
ECell ReadNumber( std::string_view i_Cell, T& o_rValue )
{
  std::string_view Text = Trim( i_Cell );
  if ( Text.empty() )
  {
    return ECell::Blank;
  }
  if ( Text.front() == '+' )
  {
    Text.remove_prefix( 1 );
  }
  const auto [pEnd, Error] = std::from_chars( Text.data(), Text.data() + Text.size(), o_rValue );
  if ( pEnd != Text.data() + Text.size() || Error == std::errc::invalid_argument )
  {
    return ECell::Wrong;
  }
  if ( Error == std::errc::result_out_of_range )
  {
    o_rValue = std::numeric_limits< T >::infinity();
  }
  return ECell::Number;
}

inline std::vector< std::string_view > SplitCells( std::string_view i_Line )
{
  std::vector< std::string_view > All;
  VCells Cells( i_Line );
  std::string_view Cell;
  while ( Cells.Next( Cell ) )
  {
    All.push_back( Trim( Cell ) );
  }
  return All;
}

} // namespace HostSources::Trc

#pragma once

#include <algorithm>
#include <cstdint>
#include <string_view>

namespace HostSources::Bvh
{

inline constexpr std::string_view Spaces = " \t\r\n\f\v";

/// Steps through words, whatever stands between them.
class VWords
{
public:
  explicit VWords( std::string_view i_Text )
    : m_Text( i_Text )
  {
  }

  /// Empty at the end of the text.
  std::string_view Next()
  {
    Skip( Spaces );
    const std::size_t End = std::min( m_Text.find_first_of( Spaces, m_At ), m_Text.size() );
    const std::string_view Word = m_Text.substr( m_At, End - m_At );
    m_At = End;
    return Word;
  }
  /// What is left of the line before a brace, without the spaces about it.
  std::string_view NextName()
  {
    Skip( " \t\r" );
    const std::size_t End = std::min( m_Text.find_first_of( "\n{", m_At ), m_Text.size() );
    std::string_view Name = m_Text.substr( m_At, End - m_At );
    m_At = End;
    return Name.substr( 0, Name.find_last_not_of( Spaces ) + 1 );
  }
  bool IsAtEnd()
  {
    Skip( Spaces );
    return m_At == m_Text.size();
  }
  std::uint64_t Line() const { return m_Line; }
  std::size_t Position() const { return m_At; }
  std::size_t Left() const { return m_Text.size() - m_At; }

private:
  void Skip( std::string_view i_What )
  {
    while ( m_At < m_Text.size() && i_What.find( m_Text[m_At] ) != std::string_view::npos )
    {
      m_Line += m_Text[m_At++] == '\n' ? 1u : 0u;
    }
  }

  std::string_view m_Text;
  std::size_t m_At = 0;
  std::uint64_t m_Line = 1;
};

} // namespace HostSources::Bvh

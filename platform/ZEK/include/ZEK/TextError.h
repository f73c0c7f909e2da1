#pragma once

#include <cstddef>
#include <string>

namespace ZEK::IO
{

/// Why a text was refused, and where.
struct VTextError
{
  std::size_t m_Position = 0; ///< bytes from the beginning of the text
  std::string m_Message;

  /// "expected ',' or ']' at position 7"
  std::string Text() const { return m_Message + " at position " + std::to_string( m_Position ); }
};

} // namespace ZEK::IO

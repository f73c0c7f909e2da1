#pragma once

#include <cstdint>
#include <string>
#include <string_view>

namespace ZEK::IO
{

inline constexpr std::uint32_t ReplacementCharacter = 0xfffd;

/// Appends the UTF-8 form; the replacement character for a surrogate and for a number that is no character.
void AppendUtf8( std::uint32_t i_Character, std::string& io_rText );

/// Takes one character from the front; false, with one byte taken, when the text does not begin with one.
bool TakeUtf8( std::string_view& io_rText, std::uint32_t& o_rCharacter );

} // namespace ZEK::IO

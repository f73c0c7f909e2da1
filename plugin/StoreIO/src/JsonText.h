#pragma once

#include <ZEK/Result.h>

#include <rapidjson/document.h>

#include <cstddef>
#include <iosfwd>
#include <memory>
#include <string>
#include <string_view>

namespace StoreIO
{

using VJsonPool = rapidjson::Document::AllocatorType;

/// The brackets that may be open at once: the root, two for each component of a path, and within a node two for each
/// container of its schema and one for the names of an Enum.
inline constexpr std::size_t SchemaBrackets = 2 * 64 + 1;
std::size_t MaximumBrackets();

/// A JSON text and what it says. The text is parsed in its own memory, where the strings then lie.
class VJsonText
{
public:
  VJsonText();

  /// Both leave a null document behind when they fail.
  ZEK::IResult ReadStream( std::istream& io_rStream );
  ZEK::IResult ReadText( std::string_view i_Text );

  /// No document, and the reason.
  void Refuse( std::string i_Error );

  const rapidjson::Value& Root() const { return m_Document; }
  /// Why the text was refused, and where.
  const std::string& Error() const { return m_Error; }

private:
  void Clear();
  void Reserve( std::size_t i_Capacity );
  ZEK::IResult Parse();
  std::string Place( std::size_t i_Offset ) const;

  std::unique_ptr< char[] > m_pText;
  std::size_t m_Size = 0;
  std::size_t m_Capacity = 0;
  std::unique_ptr< VJsonPool > m_pPool;
  rapidjson::Document m_Document;
  std::string m_Error;
};

} // namespace StoreIO

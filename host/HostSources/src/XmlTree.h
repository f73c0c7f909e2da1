#pragma once

// XML as a tree of elements, for readers of models.

#include <HostSources/VRecording.h>

#include <ZEK/Result.h>

#include <rapidxml/rapidxml.hpp>

#include <cstddef>
#include <exception>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace HostSources
{

/// What a reader cannot go on from; it stays within the reader.
class VReadFault : public std::exception
{
public:
  explicit VReadFault( std::string i_Message, ZEK::IResult::ECode i_Code = ZEK::IResult::InvalidFormat )
    : m_Message( std::move( i_Message ) )
    , m_Code( i_Code )
  {
  }
  const char* what() const noexcept override { return m_Message.c_str(); }
  ZEK::IResult::ECode Code() const { return m_Code; }

private:
  std::string m_Message;
  ZEK::IResult::ECode m_Code;
};

namespace Xml
{

/// Null stands for an element that is not there: it has no children, no text and no attributes.
using VNode = const rapidxml::xml_node< char >*;

/// Holds the text that nodes point into.
class VDocument
{
public:
  /// Throws `VReadFault` for what is no XML, for one that is nested deeper than any model is, or too large, or declares
  /// a type of document, as such declarations could stand for far more text than the file has.
  explicit VDocument( std::span< const std::byte > i_Bytes );

  VNode Root() const { return m_Document.first_node(); }

private:
  std::vector< char > m_Text;
  rapidxml::xml_document< char > m_Document;
};

/// The first child of that name.
VNode Child( VNode i_pNode, std::string_view i_Name );
/// The first child element, whatever its name, and the next one beside an element.
VNode FirstChild( VNode i_pNode );
VNode Next( VNode i_pNode );
std::string_view Name( VNode i_pNode );
/// Without the spaces about it.
std::string_view Text( VNode i_pNode );
std::string_view Attribute( VNode i_pNode, std::string_view i_Name );
/// The words of a text, which spaces and line ends part.
std::vector< std::string_view > Words( std::string_view i_Text );
/// The finite numbers of a text; throws `VReadFault` for anything else. `i_rWhat` names them in messages.
std::vector< double > Numbers( std::string_view i_Text, const std::string& i_rWhat );

} // namespace Xml
} // namespace HostSources

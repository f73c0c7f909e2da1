#include "XmlTree.h"

#include "ReaderSupport.h"
#include "TrcText.h"

#include <algorithm>
#include <cmath>

namespace HostSources::Xml
{
namespace
{
constexpr std::size_t Deepest = 200, Mebibyte = std::size_t{ 1 } << 20, Largest = 32 * Mebibyte;
constexpr std::string_view Spaces = " \t\r\n\f\v";

/// Where `i_Mark` ends that is sought from `i_From` on; the end of the text without one.
std::size_t Behind( std::string_view i_Text, std::string_view i_Mark, std::size_t i_From )
{
  const std::size_t At = i_Text.find( i_Mark, i_From );
  return At == std::string_view::npos ? i_Text.size() : At + i_Mark.size();
}

/// The end of a tag, which a quoted value may hide. A quote is one, as for the parser, only behind "=" and behind the
/// name of the element.
std::size_t BehindTag( std::string_view i_Text, std::size_t i_From )
{
  constexpr std::string_view Blanks = " \t\r\n";
  char Quote = 0, Before = 0;
  for ( std::size_t At = i_Text.find_first_of( " \t\r\n/>?", i_From ); At < i_Text.size(); ++At )
  {
    const char Letter = i_Text[At];
    if ( Quote != 0 )
    {
      Quote = Letter == Quote ? '\0' : Quote;
    }
    else if ( ( Letter == '"' || Letter == '\'' ) && Before == '=' )
    {
      Quote = Letter;
    }
    else if ( Letter == '>' )
    {
      return At + 1;
    }
    Before = Blanks.find( Letter ) == std::string_view::npos ? Letter : Before;
  }
  return i_Text.size();
}

std::string LineAt( std::string_view i_Text, std::size_t i_At )
{
  const auto Before = i_Text.substr( 0, i_At );
  return std::string( "line " )
      .append( std::to_string( 1 + std::count( Before.begin(), Before.end(), '\n' ) ) )
      .append( ": " );
}

/// The parser calls itself for each level, so that what is nested too deep must not reach it.
void CheckDepth( std::string_view i_Text )
{
  std::size_t Depth = 0;
  for ( std::size_t At = i_Text.find( '<' ); At < i_Text.size(); At = i_Text.find( '<', At ) )
  {
    const std::string_view Rest = i_Text.substr( At );
    if ( Rest.starts_with( "<!--" ) )
    {
      At = Behind( i_Text, "-->", At + 4 );
    }
    else if ( Rest.starts_with( "<![CDATA[" ) )
    {
      At = Behind( i_Text, "]]>", At + 9 );
    }
    else if ( Rest.starts_with( "<?" ) )
    {
      At = Behind( i_Text, "?>", At + 2 );
    }
    else if ( Rest.starts_with( "<!" ) )
    {
      throw VReadFault( LineAt( i_Text, At ) + "expected elements, found a declaration of the type of document",
                        ZEK::IResult::NotSupported );
    }
    else
    {
      const bool bCloses = Rest.starts_with( "</" );
      const std::size_t End = bCloses ? Behind( i_Text, ">", At ) : BehindTag( i_Text, At + 1 );
      const bool bEmpty = i_Text.substr( At, End - At ).ends_with( "/>" );
      Depth = bCloses ? Depth - std::min< std::size_t >( Depth, 1 ) : Depth + ( bEmpty ? 0 : 1 );
      if ( Depth > Deepest )
      {
        throw VReadFault( LineAt( i_Text, At ) + "expected at most " + std::to_string( Deepest ) +
                              " elements within each other",
                          ZEK::IResult::NotSupported );
      }
      At = End;
    }
  }
}
} // namespace

VDocument::VDocument( std::span< const std::byte > i_Bytes )
{
  if ( i_Bytes.size() > Largest )
  {
    throw VReadFault( "expected a model of at most " + std::to_string( Largest / Mebibyte ) + " MiB",
                      ZEK::IResult::NotSupported );
  }
  const std::string_view Text( reinterpret_cast< const char* >( i_Bytes.data() ), i_Bytes.size() );
  if ( Text.find( '\0' ) != std::string_view::npos )
  {
    throw VReadFault( LineAt( Text, Text.find( '\0' ) ) + "expected a text, found a zero byte" );
  }
  CheckDepth( Text );
  m_Text.assign( Text.begin(), Text.end() );
  m_Text.push_back( '\0' );
  try
  {
    m_Document.parse< rapidxml::parse_trim_whitespace | rapidxml::parse_validate_closing_tags >( m_Text.data() );
  }
  catch ( const rapidxml::parse_error& rError )
  {
    const auto At = static_cast< std::size_t >( rError.where< char >() - m_Text.data() );
    throw VReadFault( LineAt( Text, std::min( At, Text.size() ) ) +
                      "expected XML, found a fault in it: " + rError.what() );
  }
  if ( Root() == nullptr )
  {
    throw VReadFault( "expected an XML element, found none", ZEK::IResult::EndOfData );
  }
}

VNode Child( VNode i_pNode, std::string_view i_Name )
{
  return i_pNode ? i_pNode->first_node( i_Name.data(), i_Name.size() ) : nullptr;
}

VNode FirstChild( VNode i_pNode )
{
  VNode pChild = i_pNode ? i_pNode->first_node() : nullptr;
  return pChild && pChild->type() != rapidxml::node_element ? Next( pChild ) : pChild;
}

VNode Next( VNode i_pNode )
{
  do
  {
    i_pNode = i_pNode->next_sibling();
  } while ( i_pNode && i_pNode->type() != rapidxml::node_element );
  return i_pNode;
}

std::string_view Name( VNode i_pNode )
{
  return i_pNode ? std::string_view( i_pNode->name(), i_pNode->name_size() ) : std::string_view();
}

std::string_view Text( VNode i_pNode )
{
  std::string_view Value = i_pNode ? std::string_view( i_pNode->value(), i_pNode->value_size() ) : std::string_view();
  Value.remove_prefix( std::min( Value.find_first_not_of( Spaces ), Value.size() ) );
  return Value.substr( 0, Value.find_last_not_of( Spaces ) + 1 );
}

std::string_view Attribute( VNode i_pNode, std::string_view i_Name )
{
  const auto* pAttribute = i_pNode ? i_pNode->first_attribute( i_Name.data(), i_Name.size() ) : nullptr;
  return pAttribute ? std::string_view( pAttribute->value(), pAttribute->value_size() ) : std::string_view();
}

std::vector< std::string_view > Words( std::string_view i_Text )
{
  std::vector< std::string_view > All;
  while ( true )
  {
    i_Text.remove_prefix( std::min( i_Text.find_first_not_of( Spaces ), i_Text.size() ) );
    if ( i_Text.empty() )
    {
      return All;
    }
    All.push_back( i_Text.substr( 0, i_Text.find_first_of( Spaces ) ) );
    i_Text.remove_prefix( All.back().size() );
  }
}

std::vector< double > Numbers( std::string_view i_Text, const std::string& i_rWhat )
{
  std::vector< double > All;
  for ( const std::string_view Word : Words( i_Text ) )
  {
    double Value = 0;
    if ( Trc::ReadNumber( Word, Value ) != Trc::ECell::Number || !std::isfinite( Value ) )
    {
      throw VReadFault( std::string( "expected numbers for " )
                            .append( i_rWhat )
                            .append( ", found \"" )
                            .append( ToUtf8( Word.substr( 0, 40 ) ) )
                            .append( "\"" ) );
    }
    All.push_back( Value );
  }
  return All;
}

} // namespace HostSources::Xml

#include <ZEK/EntryPath.h>

#include <algorithm>
#include <functional>
#include <utility>

namespace ZEK
{

VEntryPath::VEntryPath( std::string i_Text )
  : m_Text( std::move( i_Text ) )
  , m_Wildcard( m_Text.find( '*' ) )
  , m_Leaf( m_Text.rfind( '/' ) + 1 ) // 0 without a '/'
  , m_Hash( HashPathBytes( m_Text ) )
{
  static_assert( std::string::npos == NoWildcard && std::string::npos + 1 == 0 );
}

VEntryPath VEntryPath::Parent() const
{
  return m_Leaf == 0 ? VEntryPath() : VEntryPath( m_Text.substr( 0, m_Leaf - 1 ) );
}

void VEntryPath::AssignChild( const VEntryPath& i_rParent, std::string_view i_Name )
{
  if ( this != &i_rParent )
  {
    *this = i_rParent;
  }
  const std::size_t Old = m_Text.size();
  if ( Old != 0 )
  {
    m_Text += '/';
  }
  m_Text += i_Name;
  const std::string_view Added = std::string_view( m_Text ).substr( Old );
  m_Hash = HashPathBytes( Added, m_Hash );
  // The name is not checked: it may hold a '/' of its own.
  m_Leaf = m_Text.rfind( '/' ) + 1;
  if ( m_Wildcard == NoWildcard )
  {
    m_Wildcard = m_Text.find( '*', Old );
  }
}

bool operator<( const VEntryPatternSet& i_rA, const VEntryPatternSet& i_rB )
{
  const auto ByHandle =
      std::lexicographical_compare_three_way( i_rA.m_Handles.begin(), i_rA.m_Handles.end(), i_rB.m_Handles.begin(),
                                              i_rB.m_Handles.end(), std::compare_three_way() );
  return ByHandle != 0 ? ByHandle < 0 : i_rA.m_Paths < i_rB.m_Paths;
}

} // namespace ZEK

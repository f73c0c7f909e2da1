#include "PatternTree.h"

#include "Resolve.h"

namespace Store
{
namespace
{
/// The root has no components; every other path has one at least.
std::optional< std::string_view > Components( std::string_view i_Text )
{
  return i_Text.empty() ? std::nullopt : std::optional( i_Text );
}
} // namespace

void VPatternTree::Add( const ZEK::VEntryPath& i_rPattern, VHandlerCallback& i_rHandler )
{
  VNode* pNode = &m_Root;
  for ( auto Rest = Components( i_rPattern.Text() ); Rest; )
  {
    const std::string_view Name = TakeComponent( Rest );
    auto It = pNode->m_Children.find( Name );
    if ( It == pNode->m_Children.end() )
    {
      It = pNode->m_Children.emplace( std::string( Name ), std::make_unique< VNode >() ).first;
    }
    pNode = It->second.get();
  }
  pNode->m_Handlers.push_back( &i_rHandler );
}

void VPatternTree::Remove( const ZEK::VEntryPath& i_rPattern, const VHandlerCallback& i_rHandler )
{
  RemoveBelow( m_Root, Components( i_rPattern.Text() ), i_rHandler );
}

bool VPatternTree::RemoveBelow( VNode& io_rNode, std::optional< std::string_view > i_Rest,
                                const VHandlerCallback& i_rHandler )
{
  if ( !i_Rest )
  {
    std::erase( io_rNode.m_Handlers, &i_rHandler );
  }
  else if ( const auto It = io_rNode.m_Children.find( TakeComponent( i_Rest ) ); It != io_rNode.m_Children.end() )
  {
    if ( RemoveBelow( *It->second, i_Rest, i_rHandler ) )
    {
      io_rNode.m_Children.erase( It );
    }
  }
  return io_rNode.IsUnused();
}

void VPatternTree::Match( const VStoreEntry& i_rEntry, VHandlerList& io_rHandlers ) const
{
  if ( IsEmpty() )
  {
    return;
  }
  // A plain path names the entry of that very text.
  if ( const VNode* const pNode = FindName( i_rEntry.m_Path ) )
  {
    io_rHandlers.insert( io_rHandlers.end(), pNode->m_Handlers.begin(), pNode->m_Handlers.end() );
  }
  // A pattern is walked from child to child: "/a" is the child "a" of the root.
  std::string_view Names = i_rEntry.m_Path.Text();
  if ( Names.starts_with( '/' ) )
  {
    Names.remove_prefix( 1 );
    MatchPattern( m_Root, Names, false, io_rHandlers );
  }
  else
  {
    MatchPattern( m_Root, Components( Names ), false, io_rHandlers );
  }
}

const VPatternTree::VNode* VPatternTree::FindName( const ZEK::VEntryPath& i_rPath ) const
{
  const VNode* pNode = &m_Root;
  for ( auto Rest = Components( i_rPath.Text() ); Rest; )
  {
    const std::string_view Name = TakeComponent( Rest );
    const auto It = Name == "*" ? pNode->m_Children.end() : pNode->m_Children.find( Name );
    if ( It == pNode->m_Children.end() )
    {
      return nullptr;
    }
    pNode = It->second.get();
  }
  return pNode;
}

void VPatternTree::MatchPattern( const VNode& i_rNode, std::optional< std::string_view > i_Rest, bool i_bStar,
                                 VHandlerList& io_rHandlers )
{
  if ( !i_Rest )
  {
    if ( i_bStar )
    {
      io_rHandlers.insert( io_rHandlers.end(), i_rNode.m_Handlers.begin(), i_rNode.m_Handlers.end() );
    }
    return;
  }
  const std::string_view Name = TakeComponent( i_Rest );
  if ( const auto It = i_rNode.m_Children.find( Name ); Name != "*" && It != i_rNode.m_Children.end() )
  {
    MatchPattern( *It->second, i_Rest, i_bStar, io_rHandlers );
  }
  if ( const auto It = i_rNode.m_Children.find( std::string_view( "*" ) ); It != i_rNode.m_Children.end() )
  {
    MatchPattern( *It->second, i_Rest, true, io_rHandlers );
  }
}

} // namespace Store

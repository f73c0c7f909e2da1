#include "PatternTree.h"

#include "Resolve.h"

#include <utility>

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
  // The nodes on the way, each with the name that leads on.
  std::vector< std::pair< VNode*, std::string_view > > Way;
  VNode* pNode = &m_Root;
  for ( auto Rest = Components( i_rPattern.Text() ); Rest; )
  {
    const std::string_view Name = TakeComponent( Rest );
    const auto It = pNode->m_Children.find( Name );
    if ( It == pNode->m_Children.end() )
    {
      return;
    }
    Way.emplace_back( pNode, Name );
    pNode = It->second.get();
  }
  std::erase( pNode->m_Handlers, &i_rHandler );
  for ( ; !Way.empty() && pNode->IsUnused(); Way.pop_back() )
  {
    pNode = Way.back().first;
    pNode->m_Children.erase( pNode->m_Children.find( Way.back().second ) );
  }
}

VPatternTree::~VPatternTree()
{
  // From the root on, so that no node ends with nodes below it: they would end in one another.
  std::vector< std::unique_ptr< VNode > > Left;
  const auto Take = [&Left]( VNode& io_rNode )
  {
    for ( auto& [rName, rpChild] : io_rNode.m_Children )
    {
      Left.push_back( std::move( rpChild ) );
    }
  };
  Take( m_Root );
  while ( !Left.empty() )
  {
    const std::unique_ptr< VNode > pNode = std::move( Left.back() );
    Left.pop_back();
    Take( *pNode );
  }
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
    MatchPatterns( Names, io_rHandlers );
  }
  else
  {
    MatchPatterns( Components( Names ), io_rHandlers );
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

void VPatternTree::MatchPatterns( std::optional< std::string_view > i_Names, VHandlerList& io_rHandlers ) const
{
  struct VPlace
  {
    const VNode* m_pNode;
    std::optional< std::string_view > m_Rest;
    bool m_bStar; ///< there was one on the way
  };
  std::vector< VPlace > Left{ { &m_Root, i_Names, false } };
  while ( !Left.empty() )
  {
    VPlace Place = Left.back();
    Left.pop_back();
    const VNode& rNode = *Place.m_pNode;
    if ( !Place.m_Rest )
    {
      if ( Place.m_bStar )
      {
        io_rHandlers.insert( io_rHandlers.end(), rNode.m_Handlers.begin(), rNode.m_Handlers.end() );
      }
      continue;
    }
    const std::string_view Name = TakeComponent( Place.m_Rest );
    if ( const auto It = rNode.m_Children.find( std::string_view( "*" ) ); It != rNode.m_Children.end() )
    {
      Left.push_back( { It->second.get(), Place.m_Rest, true } );
    }
    if ( const auto It = rNode.m_Children.find( Name ); Name != "*" && It != rNode.m_Children.end() )
    {
      Left.push_back( { It->second.get(), Place.m_Rest, Place.m_bStar } );
    }
  }
}

} // namespace Store

#include "HandlerRegistry.h"

#include "Resolve.h"

namespace Store
{

std::shared_ptr< VHandlerCallback >
VHandlerRegistry::FindOrMake( const ZEK::VEntryPatternSet& i_rSet,
                              const std::function< std::shared_ptr< VHandlerCallback >() >& i_rMake )
{
  std::weak_ptr< VHandlerCallback >& rpKnown = m_Handlers[i_rSet];
  if ( std::shared_ptr< VHandlerCallback > pHandler = rpKnown.lock() )
  {
    return pHandler;
  }
  // A handler that is just ending may still stand in the node; it finds that it is no longer its own.
  const std::shared_ptr< VHandlerCallback > pHandler = i_rMake();
  rpKnown = pHandler;
  for ( VStoreEntry* const pEntry : i_rSet.m_Handles )
  {
    if ( pEntry != nullptr )
    {
      pEntry->m_Handlers.push_back( pHandler.get() );
    }
  }
  for ( const ZEK::VEntryPath& rPath : i_rSet.m_Paths )
  {
    for ( VStoreEntry* const pEntry : FindCommitted( m_rTable, rPath ) )
    {
      pEntry->m_PatternHandlers.push_back( pHandler.get() );
    }
    m_Patterns.Add( rPath, *pHandler );
  }
  return pHandler;
}

void VHandlerRegistry::Forget( const VHandlerCallback& i_rHandler )
{
  for ( VStoreEntry* const pEntry : i_rHandler.Set().m_Handles )
  {
    if ( pEntry != nullptr )
    {
      std::erase( pEntry->m_Handlers, &i_rHandler );
    }
  }
  for ( const ZEK::VEntryPath& rPath : i_rHandler.Set().m_Paths )
  {
    for ( VStoreEntry* const pEntry : FindCommitted( m_rTable, rPath ) )
    {
      std::erase( pEntry->m_PatternHandlers, &i_rHandler );
    }
    m_Patterns.Remove( rPath, i_rHandler );
  }
  const auto It = m_Handlers.find( i_rHandler.Set() );
  if ( It != m_Handlers.end() && It->second.expired() )
  {
    m_Handlers.erase( It );
  }
}

std::vector< std::shared_ptr< VHandlerCallback > > VHandlerRegistry::Living() const
{
  std::vector< std::shared_ptr< VHandlerCallback > > Found;
  for ( const auto& [rSet, rpHandler] : m_Handlers )
  {
    if ( std::shared_ptr< VHandlerCallback > pHandler = rpHandler.lock() )
    {
      Found.push_back( std::move( pHandler ) );
    }
  }
  return Found;
}

} // namespace Store

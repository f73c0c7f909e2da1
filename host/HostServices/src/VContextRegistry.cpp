#include <HostServices/VContextRegistry.h>

#include <ZEK/Log.h>

#include <algorithm>

namespace HostServices
{
namespace
{
class VContext final : public HarrowPluginInterface::IStateCacheContext
{
public:
  VContext( std::string i_Name, std::shared_ptr< ZEK::IFlowStateCache > i_pCache )
    : m_Name( std::move( i_Name ) )
    , m_pCache( std::move( i_pCache ) )
  {
  }

  std::string Name() const override { return m_Name; }
  std::shared_ptr< ZEK::IFlowStateCache > Cache() const override { return m_pCache; }

private:
  std::string m_Name;
  std::shared_ptr< ZEK::IFlowStateCache > m_pCache;
};

std::shared_ptr< ZEK::IFlowWritableStateCache > MakeCache( ZEK::IFlowStateCacheManager& i_rManager,
                                                           const char* i_pName )
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "ContextRegistry" );
  std::shared_ptr< ZEK::IFlowWritableStateCache > pCache;
  const ZEK::IResult Result = i_rManager.CreateCache( pCache, i_pName, 0 );
  if ( !pCache )
  {
    ZEK::Log( rCategory, ZEK::ELogFailure, "No cache for context %1%: %2%", i_pName, Result.Text() );
  }
  return pCache;
}
} // namespace

VContextRegistry::VContextRegistry( std::shared_ptr< ZEK::IFlowStateCacheManager > i_pManager )
  : m_pManager( std::move( i_pManager ) )
  , m_pLive( MakeCache( *m_pManager, LiveContextName ) )
  , m_pPlayback( MakeCache( *m_pManager, PlaybackContextName ) )
{
}

std::shared_ptr< HarrowPluginInterface::IStateCacheContext > VContextRegistry::Find( const std::string& i_rName ) const
{
  const auto Known = m_Contexts.find( i_rName );
  if ( Known != m_Contexts.end() )
  {
    return Known->second;
  }
  auto pCache = m_pManager->FindCache( i_rName );
  if ( !pCache )
  {
    return nullptr;
  }
  auto pContext = std::make_shared< VContext >( i_rName, std::move( pCache ) );
  m_Contexts.emplace( i_rName, pContext );
  return pContext;
}

std::vector< std::string > VContextRegistry::Names() const
{
  std::vector< std::string > Names{ LiveContextName, PlaybackContextName };
  for ( std::string& rName : m_pManager->Names() )
  {
    if ( std::find( Names.begin(), Names.end(), rName ) == Names.end() )
    {
      Names.push_back( std::move( rName ) );
    }
  }
  return Names;
}

} // namespace HostServices

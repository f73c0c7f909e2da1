#include <HarrowGraphics/VSceneManager.h>

#include <HarrowGraphics/VHarrowScene.h>
#include <ZEK/DebugServices.h>
#include <ZEK/Log.h>

namespace HarrowGraphics
{

VSceneManager::VSceneManager( HarrowPluginInterface::IHarrowApplication& io_rApplication,
                              HarrowPluginInterface::IHarrowWorkspace& io_rWorkspace )
  : m_rApplication( io_rApplication )
  , m_pRenderResources( io_rWorkspace.RenderResources() )
  , m_pMeshCache( io_rWorkspace.MeshCache() )
{
}

VSceneManager::~VSceneManager() = default;

std::shared_ptr< VHarrowScene >
VSceneManager::ForContext( const std::shared_ptr< HarrowPluginInterface::IStateCacheContext >& i_rpContext )
{
  const std::string Name = i_rpContext->Name();
  if ( const auto It = m_Scenes.find( Name ); It != m_Scenes.end() )
  {
    return It->second;
  }
  VHarrowSceneArguments Arguments;
  Arguments.pRenderResources = m_pRenderResources;
  Arguments.pSelection = m_rApplication.Selection();
  Arguments.pMeshCache = m_pMeshCache;
  Arguments.pPostal = m_rApplication.PostalService();
  Arguments.bDeveloperMode = m_rApplication.DeveloperMode();
  Arguments.pContext = i_rpContext;
  Arguments.pActivityMode = m_rApplication.ActivityMode();
  Arguments.pVolumeManipulator = m_rApplication.VolumeManipulator();
  const auto pServices = m_rApplication.SceneServices();
  Arguments.pPlaybackRange = pServices ? pServices->PlaybackRange() : nullptr;
  const auto pScene = ZEK::MakeShared< VHarrowScene >( std::move( Arguments ) );
  m_Scenes.emplace( Name, pScene );
  return pScene;
}

std::shared_ptr< VHarrowScene > VSceneManager::ForContextName( const std::string& i_rName )
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "SceneManager" );
  ZEK::Log( rCategory, ZEK::ELogDetail, "Create scene for context %1%", i_rName );
  const auto pStateCacheContext = m_rApplication.ContextRegistry()->Find( i_rName );
  if ( !DebugServices::Check( pStateCacheContext != nullptr, "pStateCacheContext", __FILE__, __LINE__ ) )
  {
    return nullptr;
  }
  return ForContext( pStateCacheContext );
}

} // namespace HarrowGraphics

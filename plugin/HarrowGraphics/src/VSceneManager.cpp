#include <HarrowGraphics/VSceneManager.h>

#include <HarrowGraphics/VCameraModelStateCacheDataSource.h>
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

VContextScene
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
  VContextScene Scene;
  Scene.pScene = ZEK::MakeShared< VHarrowScene >( std::move( Arguments ) );
  Scene.pCameraData = ZEK::MakeShared< VCameraModelStateCacheDataSource >(
      i_rpContext->Cache(), m_rApplication.PostalService(), m_rApplication.CameraDataSourceContext() );
  m_Scenes.emplace( Name, Scene );
  return Scene;
}

VContextScene VSceneManager::ForContextName( const std::string& i_rName )
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "SceneManager" );
  ZEK::Log( rCategory, ZEK::ELogDetail, "Create scene for context %1%", i_rName );
  const auto pStateCacheContext = m_rApplication.ContextRegistry()->Find( i_rName );
  if ( !DebugServices::Check( pStateCacheContext != nullptr, "pStateCacheContext", __FILE__, __LINE__ ) )
  {
    return {};
  }
  return ForContext( pStateCacheContext );
}

} // namespace HarrowGraphics

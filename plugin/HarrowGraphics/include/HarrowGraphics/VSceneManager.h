#pragma once

#include <HarrowPluginInterface/IHarrowApplication.h>
#include <HarrowPluginInterface/IHarrowWorkspace.h>

#include <map>
#include <memory>
#include <string>

namespace HarrowGraphics
{

class VCameraModelStateCacheDataSource;
class VHarrowScene;

/// What the windows of one context share. Both are null for a context that the host does not know.
struct VContextScene
{
  std::shared_ptr< VHarrowScene > pScene;
  std::shared_ptr< VCameraModelStateCacheDataSource > pCameraData;
};

/// Owns one scene for each context, shared by the context's windows. A scene stays when its windows close, so that
/// a window that is opened again shows what the others show.
///
/// Thread: GUI. The application and the workspace outlive it.
class VSceneManager
{
public:
  VSceneManager( HarrowPluginInterface::IHarrowApplication& io_rApplication,
                 HarrowPluginInterface::IHarrowWorkspace& io_rWorkspace );
  ~VSceneManager();

  /// The scene of that context, made on first use.
  VContextScene ForContext( const std::shared_ptr< HarrowPluginInterface::IStateCacheContext >& i_rpContext );
  /// The same for a context's name. A name that the host does not know is misuse and gives null.
  VContextScene ForContextName( const std::string& i_rName );

private:
  HarrowPluginInterface::IHarrowApplication& m_rApplication;
  std::shared_ptr< HarrowPluginInterface::IRenderResources > m_pRenderResources;
  std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > m_pMeshCache;
  std::map< std::string, VContextScene > m_Scenes;
};

} // namespace HarrowGraphics

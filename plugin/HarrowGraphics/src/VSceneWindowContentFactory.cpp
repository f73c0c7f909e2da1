#include <HarrowGraphics/VSceneWindowContentFactory.h>

#include <HarrowGraphics/VCameraModelStateCacheDataSource.h>
#include <HarrowGraphics/VHarrowScene.h>
#include <HarrowGraphics/VHarrowSubjectScene.h>
#include <HarrowGraphics/VSceneManager.h>
#include <HarrowGraphics/VSceneWindowContent.h>

#include <Flow2Graphics/VContributionTileData.h>

namespace HarrowGraphics
{

VSceneWindowContentFactory::VSceneWindowContentFactory( HarrowPluginInterface::IHarrowApplication& io_rApplication,
                                                        HarrowPluginInterface::IHarrowWorkspace& io_rWorkspace,
                                                        std::string i_Name,
                                                        std::shared_ptr< VSceneManager > i_pSceneManager,
                                                        EWindowKind i_Kind )
  : m_rApplication( io_rApplication )
  , m_rWorkspace( io_rWorkspace )
  , m_Name( std::move( i_Name ) )
  , m_pSceneManager( std::move( i_pSceneManager ) )
  , m_Kind( i_Kind )
{
}

void VSceneWindowContentFactory::MakeSubjectScene(
    const std::shared_ptr< HarrowPluginInterface::IStateCacheContext >& i_rpContext,
    VSceneWidgetArguments& io_rArguments )
{
  VHarrowSubjectSceneArguments Scene;
  Scene.pRenderResources = m_rWorkspace.RenderResources();
  Scene.pContext = i_rpContext;
  Scene.pPostal = m_rApplication.PostalService();
  Scene.pSelection = m_rApplication.Selection();
  Scene.pMeshCache = m_rWorkspace.MeshCache();
  Scene.SubjectFlowContext = m_rApplication.SubjectFlowContext();
  Scene.bDeveloperMode = m_rApplication.DeveloperMode();
  io_rArguments.pScene = ZEK::MakeShared< VHarrowSubjectScene >( std::move( Scene ) );
}

void VSceneWindowContentFactory::Create(
    std::shared_ptr< HarrowPluginInterface::VWindowFrameContent >& o_rpContent,
    const std::shared_ptr< HarrowPluginInterface::IStateCacheContext >& i_rpContext,
    const QPointer< QWidget >& i_rpToolbar )
{
  VSceneWidgetArguments Arguments;
  if ( m_Kind == EWindowKindSubject )
  {
    MakeSubjectScene( i_rpContext, Arguments );
  }
  else
  {
    const VContextScene Scene = m_pSceneManager->ForContext( i_rpContext );
    Arguments.pScene = Scene.pScene;
    Arguments.pCameraData = Scene.pCameraData;
    if ( Scene.pScene && m_Kind == EWindowKindCameras )
    {
      Arguments.pCameraData =
          std::make_shared< Flow2Graphics::VContributionTileData >( Scene.pCameraData, Scene.pScene->Contributions() );
    }
  }
  Arguments.pQuickHost = m_rWorkspace.QuickHost();
  Arguments.pSelection = m_rApplication.Selection();
  Arguments.pPostal = m_rApplication.PostalService();
  Arguments.pWidgetService = m_rApplication.WidgetService();
  Arguments.pActivityMode = m_rApplication.ActivityMode();
  Arguments.pStore = m_rApplication.Store();
  Arguments.Kind = m_Kind;
  m_rApplication.FeatureFlagSource()->GetFlags( Arguments.FeatureFlags );
  Arguments.bVolumeManipulator = m_rApplication.VolumeManipulator() != nullptr;
  // The host may have put the content into a window that was deleted first; the guard keeps that harmless.
  QPointer< VSceneWindowContent > pContent = new VSceneWindowContent( m_Name, i_rpToolbar, std::move( Arguments ) );
  o_rpContent = std::shared_ptr< HarrowPluginInterface::VWindowFrameContent >(
      pContent.data(),
      [pContent]( HarrowPluginInterface::VWindowFrameContent* )
      {
        delete pContent.data();
      } );
}

} // namespace HarrowGraphics

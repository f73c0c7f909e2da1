#include "VHarrowPluginGraphics.h"

#include "VFolderPreferenceWatcher.h"

#include <CoreGraphics/VHarrowInteractionMapper.h>
#include <Flow2Graphics/TestPattern.h>
#include <Flow2Graphics/VStressTest.h>
#include <HarrowGraphics/VSceneManager.h>
#include <HarrowGraphics/VSceneWindowContentFactory.h>
#include <HarrowPluginInterface/IHarrowApplication.h>
#include <HarrowPluginInterface/IHarrowWorkspace.h>
#include <MoxelGraphics/VOverlayObjects.h>
#include <MoxelGraphics/VSceneFramebufferObject.h>
#include <ZEK/ResultQml.h>

#include <QtQml/QQmlEngine>

namespace HarrowPluginGraphics
{

bool VHarrowPluginGraphics::RegisterGraphicsTypes( HarrowPluginInterface::IHarrowApplication& io_rApplication )
{
  CoreGraphics::SetInteractionMapper( ZEK::MakeShared< CoreGraphics::VHarrowInteractionMapper >(
      io_rApplication.PostalService(), io_rApplication.Store() ) );
  // A QML type cannot be taken back, so a module that stays loaded registers it once.
  [[maybe_unused]] static const int Registered =
      qmlRegisterType< MoxelGraphics::VSceneFramebufferObject >( "Flow2Graphics", 1, 0, "SceneFramebufferObject" );
  [[maybe_unused]] static const int Lists[] = {
      qmlRegisterAnonymousType< MoxelGraphics::VCameraObject >( "Flow2Graphics", 1 ),
      qmlRegisterAnonymousType< MoxelGraphics::VSubjectObject >( "Flow2Graphics", 1 ) };
  ZEK::IO::RegisterResultQml();
  return true;
}

bool VHarrowPluginGraphics::CreateWorkspaceContent( HarrowPluginInterface::IHarrowApplication& io_rApplication,
                                                    HarrowPluginInterface::IHarrowWorkspace& io_rWorkspace )
{
  const auto pFactories = io_rWorkspace.ContentFactories();
  std::uint32_t Flags = 0;
  io_rApplication.FeatureFlagSource()->GetFlags( Flags );
  const auto pResources = io_rWorkspace.RenderResources();

  if ( const auto pMeshCache = io_rWorkspace.MeshCache() )
  {
    m_pFolderWatcher = WatchFolderPreferences( io_rApplication.Store(), io_rApplication.PostalService(),
                                               FindMeshBaseFolders( *io_rApplication.Paths(), Flags ), pMeshCache );
  }

  const auto pSceneManager = std::make_shared< HarrowGraphics::VSceneManager >( io_rApplication, io_rWorkspace );
  pFactories->AddFactory(
      "3D View", std::make_shared< HarrowGraphics::VSceneWindowContentFactory >(
                     io_rApplication, io_rWorkspace, "3D View", pSceneManager, HarrowGraphics::EWindowKind3D ) );
  pFactories->AddFactory(
      "Cameras", std::make_shared< HarrowGraphics::VSceneWindowContentFactory >(
                     io_rApplication, io_rWorkspace, "Cameras", pSceneManager, HarrowGraphics::EWindowKindCameras ) );
  const char* const pSubject = ( Flags & HarrowPluginInterface::EFeatureSubjects ) != 0 ? "Subject" : "Object";
  pFactories->AddFactory(
      pSubject, std::make_shared< HarrowGraphics::VSceneWindowContentFactory >(
                    io_rApplication, io_rWorkspace, pSubject, pSceneManager, HarrowGraphics::EWindowKindSubject ) );

  if ( const auto pManipulator = io_rApplication.ObjectManipulator();
       pManipulator &&
       ( Flags & ( HarrowPluginInterface::EFeatureObjects | HarrowPluginInterface::EFeatureProps ) ) != 0 )
  {
    io_rWorkspace.Commands()->KeyedCommands()->AddCommand(
        "Workspace3d", "Toggle Object Manipulator",
        [pWeak = std::weak_ptr( pManipulator )]
        {
          if ( const auto pLocked = pWeak.lock() )
          {
            pLocked->SetShown( !pLocked->IsShown() );
          }
        },
        "M" );
  }
  if ( io_rApplication.DeveloperMode() )
  {
    io_rWorkspace.Commands()->AddAction(
        { "&Developer", "Reload &Shaders" },
        [pResources]
        {
          pResources->Reload();
        },
        {}, "" );
    AddTestCaches( io_rApplication, *io_rWorkspace.Commands() );
  }
  return true;
}

void VHarrowPluginGraphics::AddTestCaches( HarrowPluginInterface::IHarrowApplication& io_rApplication,
                                           HarrowPluginInterface::ICommandRegistry& io_rCommands )
{
  m_pStressTest = std::make_shared< Flow2Graphics::VStressTest >(
      io_rApplication.StateCacheRegistry(), io_rApplication.TestPatternSink(), io_rApplication.SubjectFlowContext() );
  io_rCommands.AddAction(
      { "Plugin", "Graphics", "Create Test Pattern Cache" },
      [pWeak = std::weak_ptr( io_rApplication.StateCacheRegistry() ), Factory = io_rApplication.TestPatternSink(),
       Store = io_rApplication.SubjectFlowContext()]
      {
        if ( const auto pManager = pWeak.lock() )
        {
          (void)Flow2Graphics::CreateTestPattern( *pManager, *Factory, *Store );
        }
      },
      {}, "" );
  const auto AddSwitch = [&]( const char* i_pText, auto i_Switch )
  {
    io_rCommands.AddAction(
        { "Plugin", "Graphics", i_pText },
        [pWeak = std::weak_ptr( m_pStressTest ), i_Switch]
        {
          if ( const auto pStressTest = pWeak.lock() )
          {
            (void)( ( *pStressTest ).*i_Switch )();
          }
        },
        {}, "" );
  };
  AddSwitch( "Start Stress Test Cache", &Flow2Graphics::VStressTest::Start );
  AddSwitch( "Stop Stress Test Cache", &Flow2Graphics::VStressTest::Stop );
}

void VHarrowPluginGraphics::ReleaseGraphics()
{
  m_pFolderWatcher.reset();
  CoreGraphics::SetInteractionMapper( nullptr );
}

} // namespace HarrowPluginGraphics

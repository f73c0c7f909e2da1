#include "VHarrowPluginGraphics.h"

#include <Flow2Graphics/VStressTest.h>
#include <HostServices/VHost.h>

#include <QtCore/QCoreApplication>

#include <gtest/gtest.h>

namespace
{
std::vector< QString > Actions( HostServices::VHost& i_rHost )
{
  std::vector< QString > Names;
  for ( const HostServices::VMenuAction& rAction : i_rHost.Commands()->Actions() )
  {
    EXPECT_TRUE( rAction.Icons.empty() && rAction.ToolTip.isEmpty() ) << rAction.Name().toStdString();
    Names.push_back( rAction.Name() );
  }
  return Names;
}

std::int64_t LatestFrame( ZEK::IFlowStateCache& i_rCache )
{
  ZEK::VFlowStateRef State;
  return i_rCache.Fetch( State, 31, 2, 0 ) && State ? State->GetKey().Frame : -1;
}
} // namespace

TEST( DeveloperMenu, ItsEntriesMakeTheTestCachesAndDriveTheStressTest )
{
  HostServices::VHost Host( { .bDeveloperMode = true } );
  const auto pManager = Host.CacheManager();
  const std::vector< std::string > Before = pManager->Names();
  {
    HarrowPluginGraphics::VHarrowPluginGraphics Plugin;
    ASSERT_TRUE( Plugin.CreateWorkspaceContent( Host.Application(), Host.Workspace() ) );
    EXPECT_EQ( Actions( Host ),
               ( std::vector< QString >{ "Developer/Reload Shaders", "Plugin/Graphics/Create Test Pattern Cache",
                                         "Plugin/Graphics/Start Stress Test Cache",
                                         "Plugin/Graphics/Stop Stress Test Cache" } ) );
    EXPECT_EQ( pManager->Names(), Before ) << "nothing is made before somebody asks";

    EXPECT_TRUE( Host.Commands()->Execute( "Plugin/Graphics/Create Test Pattern Cache" ) );
    const auto pPattern = pManager->FindCache( "[DEV] Test Pattern" );
    ASSERT_TRUE( pPattern );
    EXPECT_EQ( LatestFrame( *pPattern ), 0 );

    EXPECT_TRUE( Host.Commands()->Execute( "Plugin/Graphics/Start Stress Test Cache" ) );
    const auto pStress = pManager->FindCache( "[DEV] Stress Test" );
    ASSERT_TRUE( pStress );
    while ( LatestFrame( *pStress ) < 3 * 2250000 )
    {
      QCoreApplication::processEvents( QEventLoop::WaitForMoreEvents );
    }
    Plugin.ReleaseGraphics(); // leaves the stress test running
    const std::int64_t Released = LatestFrame( *pStress );
    while ( LatestFrame( *pStress ) == Released )
    {
      QCoreApplication::processEvents( QEventLoop::WaitForMoreEvents );
    }
    EXPECT_TRUE( Host.Commands()->Execute( "Plugin/Graphics/Stop Stress Test Cache" ) );
    const std::int64_t Stopped = LatestFrame( *pStress );
    QCoreApplication::processEvents();
    EXPECT_EQ( LatestFrame( *pStress ), Stopped );
    EXPECT_TRUE( Host.Commands()->Execute( "Plugin/Graphics/Start Stress Test Cache" ) );
  }
  // The plug-in is gone, its timer with it, and an entry that outlived it does nothing.
  const std::int64_t Left = LatestFrame( *pManager->FindCache( "[DEV] Stress Test" ) );
  EXPECT_TRUE( Host.Commands()->Execute( "Plugin/Graphics/Start Stress Test Cache" ) );
  QCoreApplication::processEvents();
  EXPECT_EQ( LatestFrame( *pManager->FindCache( "[DEV] Stress Test" ) ), Left );
  Host.ReleasePluginContent();
}

TEST( DeveloperMenu, IsNotThereWithoutDeveloperMode )
{
  HostServices::VHost Host;
  HarrowPluginGraphics::VHarrowPluginGraphics Plugin;
  ASSERT_TRUE( Plugin.CreateWorkspaceContent( Host.Application(), Host.Workspace() ) );
  EXPECT_TRUE( Actions( Host ).empty() );
  Host.ReleasePluginContent();
}

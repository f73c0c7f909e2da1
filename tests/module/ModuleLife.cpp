// Lives through one story of the plug-in module: ModuleLife <module> <story> [count]. Exit code 0 when it ended well.

#include <HarrowPluginInterface/GraphicsSetUp.h>
#include <HostFlow/VFlowFramework.h>
#include <HostServices/VHost.h>
#include <HostServices/VPluginModule.h>
#include <HostSources/VSimulatedCapture.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtCore/QLibrary>
#include <QtCore/QPointer>
#include <QtQuickWidgets/QQuickWidget>
#include <QtWidgets/QApplication>
#include <QtWidgets/QVBoxLayout>

#include <cstdio>
#include <functional>
#include <map>
#include <string>

#include <malloc.h>

namespace
{
using HarrowPluginInterface::VWindowFrameContent;

struct VWindow
{
  QWidget Frame;
  QWidget Toolbar;
  std::shared_ptr< VWindowFrameContent > pContent;
};

std::unique_ptr< VWindow > Open( HostServices::VHost& io_rHost )
{
  auto pWindow = std::make_unique< VWindow >();
  pWindow->Toolbar.setLayout( new QVBoxLayout );
  const auto pFactory = io_rHost.Factories()->Find( "3D View" );
  if ( !pFactory )
  {
    return nullptr;
  }
  pFactory->Create( pWindow->pContent, io_rHost.Contexts()->Find( HostServices::LiveContextName ), &pWindow->Toolbar );
  auto* const pLayout = new QVBoxLayout( &pWindow->Frame );
  pLayout->addWidget( pWindow->pContent.get() );
  pWindow->Frame.resize( 320, 240 );
  pWindow->Frame.show();
  return pWindow;
}

void Close( std::unique_ptr< VWindow >& io_rpWindow )
{
  if ( io_rpWindow )
  {
    io_rpWindow->pContent->setParent( nullptr );
    io_rpWindow->pContent.reset();
    io_rpWindow.reset();
  }
}

void AddFrame( HostServices::VHost& io_rHost, HostSources::IFrameSource& io_rSource, std::int64_t i_Index )
{
  ZEK::VFlowStateRef State;
  if ( io_rSource.MakeState( i_Index, { io_rHost.StateFactory(), io_rHost.ItemStore(), 1 }, State ).IsOk() )
  {
    (void)io_rHost.Contexts()->LiveCache()->Add( State );
  }
}

void Spin( int i_Milliseconds )
{
  QElapsedTimer Timer;
  Timer.start();
  while ( Timer.elapsed() < i_Milliseconds )
  {
    QCoreApplication::processEvents( QEventLoop::AllEvents, 5 );
    QCoreApplication::sendPostedEvents( nullptr, QEvent::DeferredDelete );
  }
}

HostServices::VHostOptions Options()
{
  HostServices::VHostOptions Options;
  Options.bDeveloperMode = true;
  return Options;
}

bool Cycle( const std::string& i_rModule )
{
  HostServices::VHost Host( Options() );
  HostSources::VSimulatedCapture Source;
  HostServices::VPluginModule Module;
  if ( Module.Start( i_rModule, Host ).IsError() )
  {
    std::fprintf( stderr, "%s\n", Module.Error().c_str() );
    return false;
  }
  auto pWindow = Open( Host );
  AddFrame( Host, Source, 3 );
  Spin( 60 );
  const auto* const pView = pWindow->pContent->findChild< QQuickWidget* >();
  const bool bDrawn = pView && pView->rootObject() && !pView->grabFramebuffer().isNull();
  Close( pWindow );
  return bDrawn && Module.Release().IsOk() && Module.Destroy().IsOk();
}

int CycleStory( const std::string& i_rModule, int i_Count )
{
  constexpr int WarmUp = 10;
  // What a view of one frame keeps is hundreds of kilobytes; a fragment of that would show as growth.
  constexpr long MostGrowthPerCycle = 20'000;
  std::size_t After = 0;
  for ( int Index = 0; Index < i_Count; ++Index )
  {
    if ( !Cycle( i_rModule ) )
    {
      return 1;
    }
    if ( Index + 1 == WarmUp )
    {
      After = mallinfo2().uordblks;
    }
  }
  const long Growth = static_cast< long >( mallinfo2().uordblks ) - static_cast< long >( After );
  std::printf( "grew by %ld bytes in %d cycles\n", Growth, i_Count - WarmUp );
  return Growth > MostGrowthPerCycle * ( i_Count - WarmUp ) ? 1 : 0;
}

/// The exports, called without the order that VPluginModule keeps.
struct VRaw
{
  explicit VRaw( const std::string& i_rModule )
    : Library( QString::fromStdString( i_rModule ) )
    , Create( reinterpret_cast< HarrowPluginInterface::FCreatePlugin >( Library.resolve( "CreatePlugin" ) ) )
    , Destroy( reinterpret_cast< HarrowPluginInterface::FDestroyPlugin >( Library.resolve( "DestroyPlugin" ) ) )
  {
  }
  QLibrary Library;
  HarrowPluginInterface::FCreatePlugin Create;
  HarrowPluginInterface::FDestroyPlugin Destroy;
};

using FStory = std::function< void( VRaw&, HostServices::VHost& ) >;

const std::map< std::string, FStory > Stories{ { "destroy-null",
                                                 []( VRaw& r, HostServices::VHost& )
                                                 {
                                                   r.Destroy( nullptr );
                                                 } },
                                               { "release-first",
                                                 []( VRaw& r, HostServices::VHost& )
                                                 {
                                                   auto* const pPlugin = r.Create();
                                                   pPlugin->ReleaseGraphics();
                                                   r.Destroy( pPlugin );
                                                 } },
                                               { "release-twice",
                                                 []( VRaw& r, HostServices::VHost& h )
                                                 {
                                                   auto* const pPlugin = r.Create();
                                                   pPlugin->RegisterGraphicsTypes( h.Application() );
                                                   pPlugin->ReleaseGraphics();
                                                   pPlugin->ReleaseGraphics();
                                                   r.Destroy( pPlugin );
                                                 } },
                                               { "register-twice",
                                                 []( VRaw& r, HostServices::VHost& h )
                                                 {
                                                   auto* const pPlugin = r.Create();
                                                   pPlugin->RegisterGraphicsTypes( h.Application() );
                                                   pPlugin->RegisterGraphicsTypes( h.Application() );
                                                   pPlugin->CreateWorkspaceContent( h.Application(), h.Workspace() );
                                                   auto pWindow = Open( h );
                                                   Spin( 60 );
                                                   Close( pWindow );
                                                   h.ReleasePluginContent();
                                                   pPlugin->ReleaseGraphics();
                                                   r.Destroy( pPlugin );
                                                 } },
                                               { "content-twice",
                                                 []( VRaw& r, HostServices::VHost& h )
                                                 {
                                                   auto* const pPlugin = r.Create();
                                                   pPlugin->RegisterGraphicsTypes( h.Application() );
                                                   pPlugin->CreateWorkspaceContent( h.Application(), h.Workspace() );
                                                   auto pFirst = Open( h );
                                                   pPlugin->CreateWorkspaceContent( h.Application(), h.Workspace() );
                                                   auto pSecond = Open( h );
                                                   Spin( 60 );
                                                   Close( pFirst );
                                                   Close( pSecond );
                                                   h.ReleasePluginContent();
                                                   pPlugin->ReleaseGraphics();
                                                   r.Destroy( pPlugin );
                                                 } },
                                               { "content-without-register",
                                                 []( VRaw& r, HostServices::VHost& h )
                                                 {
                                                   auto* const pPlugin = r.Create();
                                                   pPlugin->CreateWorkspaceContent( h.Application(), h.Workspace() );
                                                   // The document cannot load its type: a window without a scene item,
                                                   // and log lines.
                                                   auto pWindow = Open( h );
                                                   Spin( 60 );
                                                   Close( pWindow );
                                                   h.ReleasePluginContent();
                                                   r.Destroy( pPlugin );
                                                 } },
                                               { "destroy-without-release",
                                                 []( VRaw& r, HostServices::VHost& h )
                                                 {
                                                   auto* const pPlugin = r.Create();
                                                   pPlugin->RegisterGraphicsTypes( h.Application() );
                                                   pPlugin->CreateWorkspaceContent( h.Application(), h.Workspace() );
                                                   h.ReleasePluginContent();
                                                   r.Destroy( pPlugin );
                                                 } },
                                               { "window-after-release",
                                                 []( VRaw& r, HostServices::VHost& h )
                                                 {
                                                   auto* const pPlugin = r.Create();
                                                   pPlugin->RegisterGraphicsTypes( h.Application() );
                                                   pPlugin->CreateWorkspaceContent( h.Application(), h.Workspace() );
                                                   auto pWindow = Open( h );
                                                   pPlugin->ReleaseGraphics();
                                                   Spin( 60 );
                                                   Close( pWindow );
                                                   h.ReleasePluginContent();
                                                   r.Destroy( pPlugin );
                                                 } },
                                               { "state-after-close",
                                                 []( VRaw& r, HostServices::VHost& h )
                                                 {
                                                   HostSources::VSimulatedCapture Source;
                                                   auto* const pPlugin = r.Create();
                                                   pPlugin->RegisterGraphicsTypes( h.Application() );
                                                   pPlugin->CreateWorkspaceContent( h.Application(), h.Workspace() );
                                                   auto pWindow = Open( h );
                                                   AddFrame( h, Source, 1 );
                                                   Close( pWindow );
                                                   AddFrame( h, Source, 2 );
                                                   h.ReleasePluginContent();
                                                   AddFrame( h, Source, 3 );
                                                   pPlugin->ReleaseGraphics();
                                                   r.Destroy( pPlugin );
                                                   Spin( 30 );
                                                 } },
                                               // No types were registered, so the code may really go.
                                               { "unload", []( VRaw& r, HostServices::VHost& )
                                                 {
                                                   r.Destroy( r.Create() );
                                                   r.Library.unload();
                                                 } } };
} // namespace

int main( int i_Count, char** i_ppArguments )
{
  if ( i_Count < 3 )
  {
    return 2;
  }
  HarrowPluginInterface::SetUpGraphics();
  QApplication Application( i_Count, i_ppArguments );
  const std::string Module = i_ppArguments[1];
  const std::string Story = i_ppArguments[2];
  if ( Story == "cycle" )
  {
    return CycleStory( Module, i_Count > 3 ? std::atoi( i_ppArguments[3] ) : 50 );
  }
  const auto It = Stories.find( Story );
  if ( It == Stories.end() )
  {
    return 2;
  }
  VRaw Raw( Module );
  if ( !Raw.Create || !Raw.Destroy )
  {
    std::fprintf( stderr, "%s\n", qPrintable( Raw.Library.errorString() ) );
    return 1;
  }
  {
    HostServices::VHost Host( Options() );
    It->second( Raw, Host );
    Spin( 10 );
  }
  std::printf( "%s ended well\n", Story.c_str() );
  return 0;
}

#include <HostServices/VPluginModule.h>

#include <HostServices/VHost.h>

#include <ZEK/Log.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QLibrary>

#include <cstdlib>
#include <exception>

namespace HostServices
{
namespace
{
ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "PluginModule" );
  return rCategory;
}

std::filesystem::path ToPath( const QString& i_rText )
{
  return std::filesystem::path( i_rText.toStdU16String() );
}
} // namespace

struct VPluginModule::VState
{
  ZEK::IResult Fail( ZEK::IResult i_Result, std::string i_Text )
  {
    Error = std::move( i_Text );
    return i_Result;
  }

  ZEK::IResult OutOfTurn( const char* i_pStep )
  {
    return Fail( ZEK::IResult::NotPermitted, std::string( "The plug-in's step " ) + i_pStep + " is out of its turn" );
  }

  /// A step of the plug-in; what it throws must not end the host.
  template < typename TStep >
  ZEK::IResult Run( const char* i_pStep, TStep&& i_Step )
  {
    const std::string Where = "The plug-in " + File.string() + " failed in " + i_pStep;
    try
    {
      return i_Step() ? ZEK::IResult( ZEK::IResult::Ok ) : Fail( ZEK::IResult::Failed, Where );
    }
    catch ( const std::exception& rError )
    {
      return Fail( ZEK::IResult::FailedWithException, Where + ": " + rError.what() );
    }
    catch ( ... )
    {
      return Fail( ZEK::IResult::FailedWithException, Where );
    }
  }

  template < typename TFunction >
  bool Resolve( const char* i_pName, TFunction& o_rpFunction )
  {
    o_rpFunction = reinterpret_cast< TFunction >( pLibrary->resolve( i_pName ) );
    if ( !o_rpFunction )
    {
      Error = "The plug-in module " + File.string() + " has no export " + i_pName;
    }
    return o_rpFunction != nullptr;
  }

  std::filesystem::path File;
  std::unique_ptr< QLibrary > pLibrary;
  HarrowPluginInterface::FCreatePlugin pCreate = nullptr;
  HarrowPluginInterface::FDestroyPlugin pDestroy = nullptr;
  HarrowPluginInterface::FPluginBuildRevision pRevision = nullptr;
  HarrowPluginInterface::IPlugin* pPlugin = nullptr;
  VHost* pHost = nullptr;
  EStage Stage = ENone;
  std::string Error;
};

VPluginModule::VPluginModule()
  : m_pState( std::make_unique< VState >() )
{
}

VPluginModule::~VPluginModule()
{
  if ( m_pState->Stage == ERegistered || m_pState->Stage == EContent )
  {
    (void)Release();
  }
  if ( m_pState->pPlugin )
  {
    (void)Destroy();
  }
}

std::vector< std::filesystem::path > VPluginModule::SearchPaths( const std::string& i_rFile )
{
  const char* pOverride = std::getenv( "HARROW_PLUGIN" );
  if ( pOverride && *pOverride )
  {
    std::error_code Ignored;
    return { std::filesystem::absolute( pOverride, Ignored ) };
  }
  const std::filesystem::path Program = ToPath( QCoreApplication::applicationDirPath() );
  return { ( Program / ".." / "lib" / "harrow" / i_rFile ).lexically_normal(),
           ( Program / ".." / HARROW_INSTALL_LIBDIR / "harrow" / i_rFile ).lexically_normal(),
           ( Program / ".." / "lib" / i_rFile ).lexically_normal() };
}

std::filesystem::path VPluginModule::DefaultPath()
{
  const auto Paths = SearchPaths();
  for ( const auto& rPath : Paths )
  {
    std::error_code Ignored;
    if ( std::filesystem::is_regular_file( rPath, Ignored ) )
    {
      return rPath;
    }
  }
  return Paths.front();
}

ZEK::IResult VPluginModule::Load( const std::filesystem::path& i_rPath )
{
  VState& rState = *m_pState;
  if ( rState.Stage != ENone )
  {
    return rState.OutOfTurn( "Load" );
  }
  std::error_code Ignored;
  rState.File = std::filesystem::absolute( i_rPath, Ignored );
  if ( !std::filesystem::is_regular_file( rState.File, Ignored ) )
  {
    return rState.Fail( ZEK::IResult::FileNotFound, "There is no plug-in module " + rState.File.string() );
  }
  // The suffix is not one of a library, so the question whether this is one gives a wrong answer; loading tells.
  rState.pLibrary = std::make_unique< QLibrary >( QString::fromStdU16String( rState.File.u16string() ) );
  rState.pLibrary->setLoadHints( QLibrary::ResolveAllSymbolsHint );
  if ( !rState.pLibrary->load() )
  {
    return rState.Fail( ZEK::IResult::InvalidFormat,
                        "The plug-in module " + rState.File.string() +
                            " cannot be loaded: " + rState.pLibrary->errorString().toStdString() );
  }
  if ( !rState.Resolve( "CreatePlugin", rState.pCreate ) || !rState.Resolve( "DestroyPlugin", rState.pDestroy ) ||
       !rState.Resolve( "PluginBuildRevision", rState.pRevision ) )
  {
    return ZEK::IResult::NotFound;
  }
  if ( Revision() != ExpectedPluginRevision )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "The plug-in module %1% has revision %2%, expected was %3%",
              rState.File.string(), Revision(), ExpectedPluginRevision );
  }
  const ZEK::IResult Created = rState.Run( "CreatePlugin",
                                           [&]
                                           {
                                             rState.pPlugin = rState.pCreate();
                                             return true;
                                           } );
  if ( Created.IsError() )
  {
    return Created;
  }
  if ( !rState.pPlugin )
  {
    return rState.Fail( ZEK::IResult::AllocationFailure,
                        "The plug-in module " + rState.File.string() + " made no plug-in" );
  }
  rState.Stage = ELoaded;
  rState.Error.clear();
  return ZEK::IResult::Ok;
}

ZEK::IResult VPluginModule::RegisterTypes( VHost& i_rHost )
{
  if ( m_pState->Stage != ELoaded )
  {
    return m_pState->OutOfTurn( "RegisterGraphicsTypes" );
  }
  m_pState->pHost = &i_rHost;
  // A plug-in that failed half-way may have published something: it is to be released like any other.
  m_pState->Stage = ERegistered;
  return m_pState->Run( "RegisterGraphicsTypes",
                        [&]
                        {
                          return m_pState->pPlugin->RegisterGraphicsTypes( i_rHost.Application() );
                        } );
}

ZEK::IResult VPluginModule::CreateContent( VHost& i_rHost )
{
  if ( m_pState->Stage != ERegistered )
  {
    return m_pState->OutOfTurn( "CreateWorkspaceContent" );
  }
  m_pState->pHost = &i_rHost;
  m_pState->Stage = EContent;
  return m_pState->Run( "CreateWorkspaceContent",
                        [&]
                        {
                          return m_pState->pPlugin->CreateWorkspaceContent( i_rHost.Application(),
                                                                            i_rHost.Workspace() );
                        } );
}

ZEK::IResult VPluginModule::Start( const std::filesystem::path& i_rPath, VHost& i_rHost )
{
  ZEK::IResult Result = Load( i_rPath );
  if ( Result.IsOk() )
  {
    Result = RegisterTypes( i_rHost );
  }
  return Result.IsOk() ? CreateContent( i_rHost ) : Result;
}

ZEK::IResult VPluginModule::Release()
{
  if ( m_pState->Stage != ERegistered && m_pState->Stage != EContent )
  {
    return m_pState->OutOfTurn( "ReleaseGraphics" );
  }
  m_pState->Stage = EReleased;
  const ZEK::IResult Result = m_pState->Run( "ReleaseGraphics",
                                             [&]
                                             {
                                               m_pState->pPlugin->ReleaseGraphics();
                                               return true;
                                             } );
  std::exchange( m_pState->pHost, nullptr )->ReleasePluginContent();
  return Result;
}

ZEK::IResult VPluginModule::Destroy()
{
  if ( m_pState->Stage != ELoaded && m_pState->Stage != EReleased )
  {
    return m_pState->OutOfTurn( "DestroyPlugin" );
  }
  m_pState->Stage = ENone;
  return m_pState->Run( "DestroyPlugin",
                        [&]
                        {
                          m_pState->pDestroy( std::exchange( m_pState->pPlugin, nullptr ) );
                          return true;
                        } );
}

ZEK::IResult VPluginModule::UnloadCode()
{
  if ( m_pState->Stage != ENone || !m_pState->pLibrary )
  {
    return m_pState->OutOfTurn( "unload" );
  }
  const bool bGone = m_pState->pLibrary->unload();
  m_pState->pLibrary.reset();
  m_pState->pRevision = nullptr;
  return bGone ? ZEK::IResult::Ok : ZEK::IResult::Failed;
}

VPluginModule::EStage VPluginModule::Stage() const
{
  return m_pState->Stage;
}

HarrowPluginInterface::IPlugin* VPluginModule::Plugin() const
{
  return m_pState->pPlugin;
}

std::uint64_t VPluginModule::Revision() const
{
  return m_pState->pRevision ? m_pState->pRevision() : 0;
}

std::string VPluginModule::DisplayName() const
{
  const char* pName = m_pState->pPlugin ? m_pState->pPlugin->DisplayName() : nullptr;
  return pName && *pName ? pName : m_pState->File.filename().string();
}

std::filesystem::path VPluginModule::Path() const
{
  return m_pState->File;
}

const std::string& VPluginModule::Error() const
{
  return m_pState->Error;
}

} // namespace HostServices

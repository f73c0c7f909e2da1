#include <HostMeshes/VMeshCache.h>

#include <HostMeshes/ReadMesh.h>

#include "BoneMesh.h"
#include "MeshLog.h"

#include <atomic>
#include <condition_variable>
#include <deque>
#include <exception>
#include <map>
#include <mutex>
#include <system_error>
#include <thread>

namespace HostMeshes
{
namespace
{
using HarrowPluginInterface::VMeshScene;

/// A name that stays below the folder that it is looked for in.
bool IsInside( const std::string& i_rName )
{
  if ( i_rName.empty() || i_rName.find_first_of( std::string_view( "\\\0", 2 ) ) != std::string::npos )
  {
    return false;
  }
  const std::filesystem::path Path( i_rName );
  return Path.is_relative() && std::none_of( Path.begin(), Path.end(),
                                             []( const std::filesystem::path& i_rPart )
                                             {
                                               return i_rPart == "..";
                                             } );
}
} // namespace

struct VMeshCache::VState
{
  struct VEntry
  {
    VMeshRef pMesh;
    bool bQueued = false;
  };
  struct VCategory
  {
    std::vector< std::filesystem::path > Folders;
    std::map< std::string, VEntry > Entries;
  };
  struct VJob
  {
    std::string Category, Name;
  };

  explicit VState( std::filesystem::path i_Reader )
    : Reader( std::move( i_Reader ) )
  {
  }
  ~VState()
  {
    {
      const std::lock_guard Lock( Guard );
      bStopping = true;
    }
    Wake.notify_all();
    Thread.join();
  }

  void Run();
  VMeshRef Find( const std::string& i_rName, const std::vector< std::filesystem::path >& i_rFolders );
  VMeshRef ReadFile( const std::filesystem::path& i_rPath );

  const std::filesystem::path Reader;
  mutable std::mutex Guard;
  mutable std::condition_variable Wake;
  const std::map< std::string, VMeshRef > StandIns{
      { BoneMeshName, MakeBoneMesh() } }; ///< for files that are not there
  std::map< std::string, VMeshRef > BuiltIns;
  std::map< std::string, VCategory > Categories;
  std::deque< VJob > Jobs;
  std::atomic< bool > bStopping = false;
  bool bBusy = false;
  std::uint64_t ReadCount = 0;
  bool bForgetFailures = false;
  ZEK::VMultiCallback< void() > Changed;

  std::map< std::filesystem::path, VMeshRef > Files; ///< null: it failed. Of the loader's thread
  std::thread Thread{ [this]
                      {
                        Run();
                      } };
};

void VMeshCache::VState::Run()
{
  std::unique_lock Lock( Guard );
  while ( true )
  {
    Wake.wait( Lock,
               [this]
               {
                 return bStopping || !Jobs.empty();
               } );
    if ( bStopping )
    {
      return;
    }
    const VJob Job = std::move( Jobs.front() );
    Jobs.pop_front();
    bBusy = true;
    ++ReadCount;
    const std::vector< std::filesystem::path > Folders = Categories[Job.Category].Folders;
    const bool bForget = std::exchange( bForgetFailures, false );
    Categories[Job.Category].Entries[Job.Name].bQueued = false;
    Lock.unlock();
    if ( bForget )
    {
      std::erase_if( Files,
                     []( const auto& i_rFile )
                     {
                       return !i_rFile.second || i_rFile.second.use_count() == 1;
                     } );
    }
    VMeshRef pMesh = Find( Job.Name, Folders );
    Lock.lock();
    VMeshRef& rpEntry = Categories[Job.Category].Entries[Job.Name].pMesh;
    const bool bChanged = rpEntry != pMesh;
    rpEntry.swap( pMesh );
    Lock.unlock();
    pMesh.reset(); // a mesh that nobody else holds goes now, with no lock held
    if ( bChanged )
    {
      Changed.Fire();
    }
    Lock.lock();
    bBusy = false;
    Wake.notify_all();
  }
}

VMeshCache::VMeshRef VMeshCache::VState::Find( const std::string& i_rName,
                                               const std::vector< std::filesystem::path >& i_rFolders )
{
  if ( !IsInside( i_rName ) )
  {
    ZEK::Log( MeshLog(), ZEK::ELogWarning, "\"%1%\" is no name of a mesh: it leads out of the folders", i_rName );
    return nullptr;
  }
  const auto ItStandIn = StandIns.find( i_rName );
  const VMeshRef pStandIn = ItStandIn != StandIns.end() ? ItStandIn->second : nullptr;
  for ( const std::filesystem::path& rFolder : i_rFolders )
  {
    std::error_code Error;
    const std::filesystem::path Path = rFolder / i_rName;
    if ( std::filesystem::is_regular_file( Path, Error ) )
    {
      const VMeshRef pMesh = ReadFile( Path );
      return pMesh ? pMesh : pStandIn;
    }
  }
  if ( pStandIn )
  {
    return pStandIn;
  }
  ZEK::Log( MeshLog(), ZEK::ELogWarning, "Mesh \"%1%\" is in none of its %2% folders", i_rName, i_rFolders.size() );
  return nullptr;
}

VMeshCache::VMeshRef VMeshCache::VState::ReadFile( const std::filesystem::path& i_rPath )
{
  const auto [It, bNew] = Files.try_emplace( i_rPath );
  if ( !bNew )
  {
    return It->second;
  }
  std::string Message;
  try
  {
    auto pMesh = std::make_shared< VMeshScene >();
    const ZEK::IResult Read = Reader.empty() ? ReadMesh( i_rPath, *pMesh, Message )
                                             : ReadMeshApart( Reader, i_rPath, *pMesh, Message, &bStopping );
    if ( Read.IsOk() )
    {
      if ( !Message.empty() )
      {
        ZEK::Log( MeshLog(), ZEK::ELogWarning, "Of mesh \"%1%\" was left out, being broken: %2%", i_rPath.string(),
                  Message );
      }
      return It->second = std::move( pMesh );
    }
  }
  catch ( const std::exception& rError )
  {
    Message = i_rPath.filename().string() + ": " + rError.what();
  }
  ZEK::Log( MeshLog(), ZEK::ELogFailure, "The mesh cannot be read: %1%", Message );
  return nullptr;
}

VMeshCache::VMeshCache( std::filesystem::path i_Reader )
  : m_pState( std::make_unique< VState >( std::move( i_Reader ) ) )
{
}

VMeshCache::~VMeshCache() = default;

void VMeshCache::AddBuiltIn( const std::string& i_rName, VMeshRef i_pMesh )
{
  {
    const std::lock_guard Lock( m_pState->Guard );
    if ( i_pMesh )
    {
      m_pState->BuiltIns[i_rName].swap( i_pMesh );
    }
    else
    {
      m_pState->BuiltIns.erase( i_rName );
    }
  }
  m_pState->Changed.Fire();
}

void VMeshCache::SetSearchFolders( const std::string& i_rCategory, std::vector< std::filesystem::path > i_Folders )
{
  {
    const std::lock_guard Lock( m_pState->Guard );
    VState::VCategory& rCategory = m_pState->Categories[i_rCategory];
    if ( rCategory.Folders == i_Folders )
    {
      return;
    }
    rCategory.Folders = std::move( i_Folders );
    m_pState->bForgetFailures = true;
    // What was found stays in use until the loader knows better.
    for ( auto& [rName, rEntry] : rCategory.Entries )
    {
      if ( !std::exchange( rEntry.bQueued, true ) )
      {
        m_pState->Jobs.push_back( { i_rCategory, rName } );
      }
    }
  }
  m_pState->Wake.notify_all();
}

ZEK::IMultiCallback< void() >& VMeshCache::Changed()
{
  return m_pState->Changed;
}

VMeshCache::VMeshRef VMeshCache::Request( const std::string& i_rCategory, const std::string& i_rName )
{
  if ( i_rName.empty() )
  {
    return nullptr;
  }
  VMeshRef pMesh;
  {
    const std::lock_guard Lock( m_pState->Guard );
    if ( const auto ItBuiltIn = m_pState->BuiltIns.find( i_rName ); ItBuiltIn != m_pState->BuiltIns.end() )
    {
      return ItBuiltIn->second;
    }
    VState::VCategory& rCategory = m_pState->Categories[i_rCategory];
    const auto ItEntry = rCategory.Entries.find( i_rName );
    if ( ItEntry != rCategory.Entries.end() )
    {
      return ItEntry->second.pMesh;
    }
    const auto ItStandIn = m_pState->StandIns.find( i_rName );
    pMesh = ItStandIn != m_pState->StandIns.end() ? ItStandIn->second : nullptr;
    rCategory.Entries[i_rName] = { pMesh, true };
    m_pState->Jobs.push_back( { i_rCategory, i_rName } );
  }
  m_pState->Wake.notify_all();
  return pMesh;
}

bool VMeshCache::CanRead( const std::filesystem::path& i_rPath ) const
{
  std::error_code Error;
  return IsMeshName( i_rPath ) && std::filesystem::is_regular_file( i_rPath, Error );
}

std::uint64_t VMeshCache::ReadCount() const
{
  const std::lock_guard Lock( m_pState->Guard );
  return m_pState->ReadCount + m_pState->Jobs.size();
}

bool VMeshCache::WaitUntilRead( std::chrono::milliseconds i_Longest ) const
{
  std::unique_lock Lock( m_pState->Guard );
  return m_pState->Wake.wait_for( Lock, i_Longest,
                                  [this]
                                  {
                                    return m_pState->Jobs.empty() && !m_pState->bBusy;
                                  } );
}

} // namespace HostMeshes

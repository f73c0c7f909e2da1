#include "VFolderPreferenceWatcher.h"

#include <HarrowPluginInterface/IHarrowApplication.h>
#include <ZEK/CoreUserPreferences.h>

#include <filesystem>
#include <stdexcept>
#include <utility>

namespace HarrowPluginGraphics
{
namespace
{
using HarrowPluginInterface::VMeshSceneCache;

std::wstring LastFolder( const HarrowPluginInterface::IHarrowPaths& i_rPaths, std::uint32_t i_Kind )
{
  std::vector< std::wstring > Folders;
  if ( i_rPaths.FoldersOfKind( Folders, i_Kind ).empty() )
  {
    throw std::runtime_error( std::string( "There is no content folder of kind " ).append( std::to_string( i_Kind ) ) );
  }
  return Folders.back();
}

std::filesystem::path ToPath( const std::wstring& i_rFolder )
{
  return ZEK::IO::WideToUtf8( i_rFolder );
}

/// A kind of mesh: its name in the cache, and the folder that an operator may add.
struct VMeshKind
{
  const char* m_pCategory;
  ZEK::ECoreFolder m_Folder;
};
constexpr VMeshKind Subject{ "Subject", ZEK::ECoreFolder::Skins };
constexpr VMeshKind Prop{ "Prop", ZEK::ECoreFolder::PropMeshes };
constexpr VMeshKind SceneMesh{ "SceneMesh", ZEK::ECoreFolder::SceneMeshes };

class VFolderPreferenceWatcher final : public ZEK::VShared
{
public:
  VFolderPreferenceWatcher( std::shared_ptr< ZEK::IStore > i_pStore, std::shared_ptr< ZEK::IPostalService > i_pPostal,
                            VMeshBaseFolders i_Bases, std::shared_ptr< VMeshSceneCache > i_pMeshCache )
    : m_Preferences( std::move( i_pStore ) )
    , m_pPostal( std::move( i_pPostal ) )
    , m_pMeshCache( std::move( i_pMeshCache ) )
    , m_Bases( std::move( i_Bases ) )
  {
  }

  void Start() override
  {
    if ( !m_Bases.m_Subjects.empty() )
    {
      Watch( Subject, m_Bases.m_Subjects );
    }
    if ( m_Bases.m_Prop )
    {
      Watch( Prop, { *m_Bases.m_Prop } );
    }
    if ( m_Bases.m_SceneMesh )
    {
      Watch( SceneMesh, { *m_Bases.m_SceneMesh } );
    }
  }

private:
  void Watch( const VMeshKind& i_rKind, std::vector< std::wstring > i_Bases )
  {
    const auto OnChange = [pWeak = Weak( this ), &i_rKind,
                           Bases = std::move( i_Bases )]( ZEK::IBitFlags< ZEK::EChangeFlags >, ZEK::ChangeId )
    {
      if ( const auto pSelf = pWeak.lock() )
      {
        pSelf->SetFolders( i_rKind, Bases );
      }
    };
    m_Connections.push_back( m_Preferences.Folder( i_rKind.m_Folder ).Connect( OnChange, m_pPostal ) );
    OnChange( {}, {} );
  }

  void SetFolders( const VMeshKind& i_rKind, const std::vector< std::wstring >& i_rBases )
  {
    const std::wstring Chosen = Read( i_rKind.m_Folder );
    std::vector< std::filesystem::path > Folders;
    for ( const std::wstring& rBase : i_rBases )
    {
      Folders.push_back( ToPath( rBase ) );
    }
    if ( !Chosen.empty() )
    {
      Folders.push_back( ToPath( Chosen ) );
    }
    m_pMeshCache->SetSearchFolders( i_rKind.m_pCategory, std::move( Folders ) );
  }

  std::wstring Read( ZEK::ECoreFolder i_Folder ) const
  {
    const ZEK::VPreference< std::wstring >& rFolder = m_Preferences.Folder( i_Folder );
    if ( !m_Preferences.Store() )
    {
      return rFolder.Default();
    }
    const ZEK::VStoreReadScope Scope( *m_Preferences.Store() );
    return rFolder.Get( *Scope );
  }

  ZEK::ICoreUserPreferencesLayout m_Preferences;
  std::shared_ptr< ZEK::IPostalService > m_pPostal;
  std::shared_ptr< VMeshSceneCache > m_pMeshCache;
  VMeshBaseFolders m_Bases;
  std::vector< ZEK::VConnection > m_Connections;
};
} // namespace

VMeshBaseFolders FindMeshBaseFolders( const HarrowPluginInterface::IHarrowPaths& i_rPaths, std::uint32_t i_Flags )
{
  using namespace HarrowPluginInterface;
  VMeshBaseFolders Bases;
  const std::filesystem::path Geometry = ToPath( i_rPaths.BaseFolder() ) / "Geometry";
  Bases.m_Subjects.push_back( ZEK::IO::Utf8ToWide( Geometry.string() ) );
  if ( ( i_Flags & EFeatureSubjects ) != 0 )
  {
    Bases.m_Subjects.push_back( LastFolder( i_rPaths, EFolderSubjects ) );
  }
  if ( ( i_Flags & EFeatureTrackingSubjects ) != 0 )
  {
    Bases.m_Subjects.push_back( LastFolder( i_rPaths, EFolderTrackingSubjects ) );
    Bases.m_Subjects.push_back( LastFolder( i_rPaths, EFolderRetargetSubjects ) );
  }
  if ( ( i_Flags & ( EFeatureObjects | EFeaturePropFolder | EFeatureProps ) ) != 0 )
  {
    Bases.m_Prop = LastFolder( i_rPaths, EFolderProps );
  }
  if ( ( i_Flags & EFeatureSceneMeshes ) != 0 )
  {
    Bases.m_SceneMesh = LastFolder( i_rPaths, EFolderSceneMeshes );
  }
  return Bases;
}

std::shared_ptr< ZEK::VShared > WatchFolderPreferences( std::shared_ptr< ZEK::IStore > i_pStore,
                                                        std::shared_ptr< ZEK::IPostalService > i_pPostal,
                                                        VMeshBaseFolders i_Bases,
                                                        std::shared_ptr< VMeshSceneCache > i_pMeshCache )
{
  return ZEK::MakeShared< VFolderPreferenceWatcher >( std::move( i_pStore ), std::move( i_pPostal ),
                                                      std::move( i_Bases ), std::move( i_pMeshCache ) );
}

} // namespace HarrowPluginGraphics

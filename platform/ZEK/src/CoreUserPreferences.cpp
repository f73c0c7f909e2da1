#include <ZEK/CoreUserPreferences.h>

#include <utility>

namespace ZEK
{
namespace
{
/// Where the declarations of a layout's members lie in the list.
enum EIndex : std::size_t
{
  EIndexAltToSelect,
  EIndexEnableAutoContextSwitch,
  EIndexAutoSaveEnabled,
  EIndexAutoSaveAskBeforeRecovery,
  EIndexAutoSaveIntervalSeconds,
  EIndexStartPlayingAutomatically,
  EIndexWarnFreeSpaceOptical,
  EIndexFolders,
  EIndexSubjectViewPresets = EIndexFolders + CoreFolderCount
};

constexpr const char* FolderNames[CoreFolderCount] = { "FolderSubjects",
                                                       "FolderSubjectCalTemplates",
                                                       "FolderSkins",
                                                       "FolderRetargets",
                                                       "FolderRemarkableActions",
                                                       "FolderProps",
                                                       "FolderClusters",
                                                       "FolderObjects",
                                                       "FolderSmartObjectTemplates",
                                                       "FolderPropMeshes",
                                                       "FolderCalibrationObjects",
                                                       "FolderSceneMeshes",
                                                       "FolderTensorEngines" };

std::vector< VPreferenceDeclaration > MakeDeclarations()
{
  const VEntryPath Core( "Preferences/Core" );
  std::vector< VPreferenceDeclaration > Declarations;
  const auto Add = [&Declarations]( const VEntryPath& i_rParent, const char* i_pName, const auto& i_rDefault )
  {
    VEntryPath Path;
    Path.AssignChild( i_rParent, i_pName );
    Declarations.push_back( { std::move( Path ), IO::MakeValue( i_rDefault ) } );
  };
  Add( Core, "AltToSelect", true );
  Add( Core, "EnableAutoContextSwitch", true );
  Add( Core, "AutoSaveEnabled", true );
  Add( Core, "AutoSaveAskBeforeRecovery", true );
  Add( Core, "AutoSaveIntervalSeconds", std::uint32_t( 300 ) );
  Add( Core, "StartPlayingAutomatically", false );
  Add( Core, "WarnFreeSpaceOptical", std::uint32_t( 10 ) );
  for ( const char* const pName : FolderNames )
  {
    Add( "Preferences/Core/Folders", pName, std::string() );
  }
  Add( "Preferences", "SubjectViewPresets", std::vector< VSubjectViewPreset >() );
  return Declarations;
}

template < std::size_t... Index >
std::array< VPreference< std::wstring >, CoreFolderCount > MakeFolders( IStore* i_pStore,
                                                                        std::index_sequence< Index... > )
{
  return { VPreference< std::wstring >( i_pStore, CoreUserPreferences()[EIndexFolders + Index] )... };
}
} // namespace

const std::vector< VPreferenceDeclaration >& CoreUserPreferences()
{
  static const std::vector< VPreferenceDeclaration > Declarations = MakeDeclarations();
  return Declarations;
}

IResult DeclareCoreUserPreferences( IStoreWriter& io_rWriter )
{
  IResult Result = IResult::Ok;
  for ( const VPreferenceDeclaration& rDeclaration : CoreUserPreferences() )
  {
    const IStoreReader::Entry pEntry = io_rWriter.GetStore()->GetEntry( rDeclaration.m_Path );
    // A value that follows a new default counts as set; here it is still no choice of the operator's.
    const std::uint32_t Using = io_rWriter.Flags( pEntry ) & EUsingDefault;
    const IResult Made = io_rWriter.SetDefaultValue( pEntry, rDeclaration.m_Default );
    if ( Made.IsError() )
    {
      Result = Result.IsError() ? Result : Made;
      continue;
    }
    io_rWriter.SetFlag( pEntry, EPersistent | Using );
  }
  return Result;
}

ICoreUserPreferencesLayout::ICoreUserPreferencesLayout( std::shared_ptr< IStore > i_pStore )
  : m_pStore( std::move( i_pStore ) )
  , m_AltToSelect( m_pStore.get(), CoreUserPreferences()[EIndexAltToSelect] )
  , m_EnableAutoContextSwitch( m_pStore.get(), CoreUserPreferences()[EIndexEnableAutoContextSwitch] )
  , m_AutoSaveEnabled( m_pStore.get(), CoreUserPreferences()[EIndexAutoSaveEnabled] )
  , m_AutoSaveAskBeforeRecovery( m_pStore.get(), CoreUserPreferences()[EIndexAutoSaveAskBeforeRecovery] )
  , m_AutoSaveIntervalSeconds( m_pStore.get(), CoreUserPreferences()[EIndexAutoSaveIntervalSeconds] )
  , m_StartPlayingAutomatically( m_pStore.get(), CoreUserPreferences()[EIndexStartPlayingAutomatically] )
  , m_WarnFreeSpaceOptical( m_pStore.get(), CoreUserPreferences()[EIndexWarnFreeSpaceOptical] )
  , m_Folders( MakeFolders( m_pStore.get(), std::make_index_sequence< CoreFolderCount >() ) )
  , m_SubjectViewPresets( m_pStore.get(), CoreUserPreferences()[EIndexSubjectViewPresets] )
{
}

} // namespace ZEK

#include <ZEK/CoreUserPreferences.h>

#include <Store/Store.h>
#include <TestSupport/LogGuard.h>
#include <ZEK/TypedValueText.h>

#include <gtest/gtest.h>

using namespace ZEK;

namespace
{
class Preferences : public testing::Test
{
protected:
  Preferences() { GlobalLog().Category( "Store" ).SetMaximumLevel( ELogDetail ); }

  template < typename TValue >
  void Set( const VEntryPath& i_rPath, const TValue& i_rValue )
  {
    VStoreWriteScope Scope( *pStore );
    EXPECT_TRUE( Scope->SetValue( pStore->GetEntry( i_rPath ), IO::MakeValue( i_rValue ) ).IsOk() );
  }
  IResult Declare()
  {
    VStoreWriteScope Scope( *pStore );
    return DeclareCoreUserPreferences( *Scope );
  }
  std::uint32_t Flags( const VEntryPath& i_rPath )
  {
    const VStoreReadScope Scope( *pStore );
    return Scope->Flags( pStore->GetEntry( i_rPath ) );
  }

  const std::shared_ptr< IStore > pStore = Store::CreateStore( nullptr, 64 );
  const ICoreUserPreferencesLayout Layout{ pStore };
  const VEntryPath AltPath = "Preferences/Core/AltToSelect";
};

/// The paths that the members of a layout read, in the order in which it tells of them.
std::vector< std::string > MemberPaths( const ICoreUserPreferencesLayout& i_rLayout )
{
  std::vector< std::string > Paths;
  const auto Add = [&Paths]( const auto&... i_rPreferences )
  {
    ( Paths.push_back( i_rPreferences.Path().Text() ), ... );
  };
  Add( i_rLayout.AltToSelect(), i_rLayout.EnableAutoContextSwitch(), i_rLayout.AutoSaveEnabled(),
       i_rLayout.AutoSaveAskBeforeRecovery(), i_rLayout.AutoSaveIntervalSeconds(),
       i_rLayout.StartPlayingAutomatically(), i_rLayout.WarnFreeSpaceOptical() );
  for ( std::size_t Folder = 0; Folder < CoreFolderCount; ++Folder )
  {
    Add( i_rLayout.Folder( ECoreFolder( Folder ) ) );
  }
  Add( i_rLayout.SubjectViewPresets() );
  return Paths;
}
} // namespace

TEST_F( Preferences, TheListNamesEveryEntryOnceAndTheLayoutFollowsIt )
{
  std::string Seen;
  std::vector< std::string > Paths;
  for ( const VPreferenceDeclaration& rDeclaration : CoreUserPreferences() )
  {
    std::string Text;
    EXPECT_TRUE( IO::ValueToText( rDeclaration.m_Default, Text ) );
    Paths.push_back( rDeclaration.m_Path.Text() );
    const bool bFolder = Text == "\"\"" && Paths.back().starts_with( "Preferences/Core/Folders/Folder" );
    Seen += bFolder ? rDeclaration.m_Path.Leaf() + " " : Paths.back() + "=" + Text + " ";
  }
  EXPECT_EQ( Seen, "Preferences/Core/AltToSelect=true Preferences/Core/EnableAutoContextSwitch=true "
                   "Preferences/Core/AutoSaveEnabled=true Preferences/Core/AutoSaveAskBeforeRecovery=true "
                   "Preferences/Core/AutoSaveIntervalSeconds=300 Preferences/Core/StartPlayingAutomatically=false "
                   "Preferences/Core/WarnFreeSpaceOptical=10 "
                   "FolderSubjects FolderSubjectCalTemplates FolderSkins FolderRetargets FolderRemarkableActions "
                   "FolderProps FolderClusters FolderObjects FolderSmartObjectTemplates FolderPropMeshes "
                   "FolderCalibrationObjects FolderSceneMeshes FolderTensorEngines "
                   "Preferences/SubjectViewPresets=[] " );
  EXPECT_EQ( MemberPaths( Layout ), Paths );
}

TEST_F( Preferences, DeclaringGivesValuesToThoseWithoutAndChangesNothingTwice )
{
  Set( "Preferences/Core/StartPlayingAutomatically", true );
  Set( "Preferences/Core/AutoSaveEnabled", std::string( "in the way" ) );
  {
    VStoreWriteScope Scope( *pStore );
    ASSERT_TRUE( Scope->SetDefaultValue( pStore->GetEntry( AltPath ), IO::MakeValue( false ) ).IsOk() );
  }
  TestSupport::ExpectFailureLine( "Failed to set 'Preferences/Core/AutoSaveEnabled' default value: the value type does "
                                  "not match the entry type." );
  EXPECT_EQ( Declare(), IResult::InvalidType );
  {
    const VStoreReadScope Scope( *pStore );
    for ( const VPreferenceDeclaration& rDeclaration : CoreUserPreferences() )
    {
      SCOPED_TRACE( rDeclaration.m_Path.Text() );
      const auto pEntry = pStore->FindEntry( rDeclaration.m_Path );
      ASSERT_NE( pEntry, nullptr );
      const std::string Name = rDeclaration.m_Path.Leaf();
      const bool bInTheWay = Name == "AutoSaveEnabled", bSet = Name == "StartPlayingAutomatically";
      EXPECT_EQ( Scope->DefaultValue( pEntry ) == rDeclaration.m_Default, !bInTheWay );
      EXPECT_EQ( Scope->VerifiedValue( pEntry ) == rDeclaration.m_Default, !bInTheWay && !bSet );
      EXPECT_EQ( Scope->Flags( pEntry ), bInTheWay ? 0u
                                         : bSet    ? std::uint32_t( EPersistent )
                                                   : std::uint32_t( EPersistent | EUsingDefault ) );
    }
  }
  std::uint64_t Heard = 0;
  const auto Connection = pStore->RegisterHandler( { { pStore->GetRootEntry() }, {} } )
                              ->CreateProxy( ChangeMask::All, IHandlerCallback::EveryDelivery )
                              .Connect(
                                  [&Heard]( IBitFlags< EChangeFlags > i_Flags, ChangeId )
                                  {
                                    Heard |= i_Flags.Bits();
                                  },
                                  nullptr );
  TestSupport::ExpectFailureLine( "Failed to set 'Preferences/Core/AutoSaveEnabled' default value: the value type does "
                                  "not match the entry type." );
  EXPECT_EQ( Declare(), IResult::InvalidType );
  EXPECT_EQ( Heard, 0u );
  Set( AltPath, false );
  EXPECT_EQ( Heard & EChangeVerified, EChangeVerified );
  EXPECT_EQ( Flags( AltPath ), EPersistent );
}

TEST_F( Preferences, TheDefaultStandsInForNoValueAndNotForAWrongOne )
{
  const auto& rAlt = Layout.AltToSelect();
  const auto& rSkins = Layout.Folder( ECoreFolder::Skins );
  EXPECT_EQ( pStore->FindEntry( AltPath ), nullptr ) << "a handle is made when it is wanted";
  bool bAlt = false;
  EXPECT_EQ( rAlt.Read( bAlt ), IResult::NotFound );
  EXPECT_TRUE( bAlt );
  {
    VStoreWriteScope Scope( *pStore );
    Scope->SetFlag( rAlt.Entry(), EPersistent );
  }
  bAlt = false;
  EXPECT_EQ( rAlt.Read( bAlt ), IResult::NotSet );
  EXPECT_TRUE( bAlt );
  EXPECT_EQ( TestSupport::LogTexts( "Store", 6 ),
             ( std::vector< std::string >{ "Store entry 'Preferences/Core/AltToSelect' does not exist.",
                                           "Store entry 'Preferences/Core/AltToSelect' has no value." } ) );
  Set( AltPath, false );
  EXPECT_EQ( rAlt.Read( bAlt ), IResult::Ok );
  EXPECT_FALSE( bAlt );
  Set( rSkins.Path(), 5 );
  std::wstring Folder = L"as it was";
  TestSupport::ExpectFailureLine( "Failed getting value for store entry 'Preferences/Core/Folders/FolderSkins': the "
                                  "requested value type does not match the store value type." );
  EXPECT_EQ( rSkins.Read( Folder ), IResult::InvalidType );
  EXPECT_EQ( Folder, L"as it was" );
  const VStoreReadScope Scope( *pStore );
  EXPECT_THROW( (void)Layout.Folder( ECoreFolder::Props ).Get( *Scope ), VStoreException );
  EXPECT_FALSE( rAlt.Get( *Scope ) );
}

TEST_F( Preferences, WithoutAStoreAllDefaultsHold )
{
  const ICoreUserPreferencesLayout Alone( nullptr );
  bool bAlt = false;
  EXPECT_EQ( Alone.AltToSelect().Read( bAlt ), IResult::NotFound );
  EXPECT_TRUE( bAlt );
  std::uint32_t Seconds = 0;
  EXPECT_EQ( Alone.AutoSaveIntervalSeconds().Read( Seconds ), IResult::NotFound );
  EXPECT_EQ( Seconds, 300u );
  EXPECT_EQ( Alone.AltToSelect().Entry(), nullptr );
  VConnection Connection = Alone.AltToSelect().Connect( {}, nullptr );
  Connection.Disconnect();
  EXPECT_TRUE( TestSupport::LogLines().empty() );
}

TEST_F( Preferences, NewValuesAreToldUntilTheConnectionEnds )
{
  int Values = 0, Removals = 0;
  const auto Count = []( int& io_rCount )
  {
    return [&io_rCount]( IBitFlags< EChangeFlags >, ChangeId )
    {
      ++io_rCount;
    };
  };
  const std::vector< VSubjectViewPreset > Presets{ { "Label", { "LabellingSubject-Bones", "" } }, { "", {} } };
  const auto& rPresets = Layout.SubjectViewPresets();
  VConnection ToValues = rPresets.Connect( Count( Values ), nullptr );
  const VConnection ToRemovals = rPresets.Connect( Count( Removals ), nullptr, ERemoved );
  Set( rPresets.Path(), Presets );
  Set( rPresets.Path(), Presets );
  Set( AltPath, true );
  EXPECT_EQ( Values, 1 );
  std::vector< VSubjectViewPreset > Read;
  EXPECT_EQ( rPresets.Read( Read ), IResult::Ok );
  EXPECT_EQ( Read, Presets );
  {
    VStoreWriteScope Scope( *pStore );
    EXPECT_TRUE( Scope->RemoveEntry( rPresets.Entry() ).IsOk() );
  }
  EXPECT_EQ( Values, 1 );
  EXPECT_EQ( Removals, 1 );
  Set( rPresets.Path(), Presets );
  EXPECT_EQ( Values, 2 );
  ToValues.Disconnect();
  Set( rPresets.Path(), std::vector< VSubjectViewPreset >() );
  EXPECT_EQ( Values, 2 );
}

#include <HostServices/PreferenceRules.h>
#include <HostServices/VPreferenceEditor.h>
#include <HostServices/VUserPreferences.h>

#include <Store/Store.h>
#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>
#include <ZEK/CoreUserPreferences.h>
#include <ZEK/StoreFlags.h>

#include <gmock/gmock.h>

#include <fstream>
#include <limits>

using namespace HostServices;
using ZEK::IO::MakeValue;

namespace
{
constexpr const char* pAlt = "Preferences/Core/AltToSelect";
constexpr const char* pInterval = "Preferences/Core/AutoSaveIntervalSeconds";
constexpr const char* pFreeSpace = "Preferences/Core/WarnFreeSpaceOptical";
constexpr const char* pSkins = "Preferences/Core/Folders/FolderSkins";

class Preferences : public testing::Test
{
protected:
  ZEK::IStoreReader::Entry At( const char* i_pPath ) { return m_pStore->GetEntry( i_pPath ); }
  template < typename T >
  void Put( const char* i_pPath, const T& i_rValue, bool i_bDefault = false )
  {
    const ZEK::VStoreWriteScope Scope( *m_pStore );
    EXPECT_TRUE( ( i_bDefault ? Scope->SetDefaultValue( At( i_pPath ), MakeValue( i_rValue ) )
                              : Scope->SetValue( At( i_pPath ), MakeValue( i_rValue ) ) )
                     .IsOk() );
  }
  ZEK::VTypedValue Get( const char* i_pPath )
  {
    const ZEK::VStoreReadScope Scope( *m_pStore );
    return Scope->VerifiedValue( At( i_pPath ) );
  }
  bool UsesDefault( const char* i_pPath )
  {
    const ZEK::VStoreReadScope Scope( *m_pStore );
    return ( Scope->Flags( At( i_pPath ) ) & ZEK::EUsingDefault ) != 0;
  }
  template < typename T >
  ZEK::IResult Set( const char* i_pPath, const T& i_rValue, const char* i_pKey = "" )
  {
    return m_Editor.Set( At( i_pPath ), MakeValue( i_rValue ), m_Why, QString::fromLatin1( i_pKey ) );
  }

  std::shared_ptr< ZEK::IStore > m_pStore = Store::CreateStore( nullptr, 64 );
  VUndoStack m_Undo;
  VPreferenceEditor m_Editor{ m_pStore, m_Undo };
  QString m_Why;
};
} // namespace

TEST_F( Preferences, EveryDeclaredEntryIsKeptAndOneThatIsShownSaysWhatItIs )
{
  ASSERT_EQ( DeclareUserPreferences( *m_pStore ), ZEK::IResult::Ok );
  const ZEK::VStoreReadScope Scope( *m_pStore );
  EXPECT_EQ( DeclareUserPreferences( *m_pStore ), ZEK::IResult::NotPermitted );
  std::set< std::string > Texts;
  for ( const ZEK::VPreferenceDeclaration& rDeclared : ZEK::CoreUserPreferences() )
  {
    const auto pEntry = m_pStore->FindEntry( rDeclared.m_Path );
    const std::string& rPath = rDeclared.m_Path.Text();
    EXPECT_EQ( Scope->VerifiedValue( pEntry ), rDeclared.m_Default ) << rPath;
    EXPECT_EQ( Scope->DefaultValue( pEntry ), rDeclared.m_Default ) << rPath;
    EXPECT_EQ( Scope->Flags( pEntry ), std::uint32_t( ZEK::EPersistent | ZEK::EUsingDefault ) ) << rPath;
    EXPECT_TRUE( WhyRefused( *Scope, pEntry, rDeclared.m_Default ).isEmpty() ) << rPath;
    if ( rDeclared.m_Path.Parent() != ZEK::VEntryPath( PreferencesRoot ) )
    {
      EXPECT_TRUE( Texts.insert( Scope->PresentationText( pEntry ) ).second ) << rPath;
      EXPECT_FALSE( Scope->OptionalText( pEntry ).value_or( "" ).empty() ) << rPath;
      EXPECT_GT( Scope->ExtraNumber1( pEntry ), 0u ) << rPath;
    }
  }
  EXPECT_FALSE( Texts.contains( "" ) );
  // No text describes an entry that nobody declares.
  EXPECT_EQ( Scope->FindEntries( "Preferences/Core/*" ).size() +
                 Scope->FindEntries( "Preferences/Core/Folders/*" ).size(),
             Texts.size() + 1 );
}

TEST_F( Preferences, DeclaringOverValuesThatWereKeptReplacesOnlyWhatCannotHold )
{
  Put( pAlt, std::string( "yes" ) );
  Put( pInterval, std::uint32_t( 5 ) );
  Put( pFreeSpace, std::uint32_t( 15 ) );
  Put( pSkins, std::string( "/skins" ) );
  Put( "Preferences/Core/StartPlayingAutomatically", true, true );
  Put( "Preferences/Core/Other", 7 );
  ASSERT_TRUE( DeclareUserPreferences( *m_pStore ).IsOk() );
  EXPECT_EQ( Get( pAlt ), MakeValue( true ) );
  EXPECT_EQ( Get( pInterval ), MakeValue( std::uint32_t( 300 ) ) );
  EXPECT_TRUE( UsesDefault( pAlt ) && UsesDefault( pInterval ) );
  EXPECT_THAT( TestSupport::LogTexts( "Preferences", ZEK::ELogWarning ),
               testing::ElementsAre( testing::HasSubstr( "AltToSelect is of type String instead of Bool" ),
                                     testing::HasSubstr( "AutoSaveIntervalSeconds: 5" ) ) );
  EXPECT_EQ( Get( pFreeSpace ), MakeValue( std::uint32_t( 15 ) ) ) << "choices are offers";
  EXPECT_EQ( Get( pSkins ), MakeValue( std::string( "/skins" ) ) );
  EXPECT_FALSE( UsesDefault( pSkins ) );
  EXPECT_EQ( Get( "Preferences/Core/StartPlayingAutomatically" ), MakeValue( false ) ) << "the default of today";
  EXPECT_TRUE( UsesDefault( "Preferences/Core/StartPlayingAutomatically" ) );
  EXPECT_EQ( Get( "Preferences/Core/Other" ), MakeValue( 7 ) );
}

TEST_F( Preferences, AChangeIsAStepThatBringsBackTheDefaultToo )
{
  ASSERT_TRUE( DeclareUserPreferences( *m_pStore ).IsOk() );
  ASSERT_EQ( Set( pAlt, false ), ZEK::IResult::Ok );
  EXPECT_EQ( Get( pAlt ), MakeValue( false ) );
  EXPECT_FALSE( UsesDefault( pAlt ) );
  EXPECT_EQ( Set( pAlt, false ), ZEK::IResult::OkButNoEffect );
  EXPECT_EQ( m_Undo.Stack().count(), 1 );
  EXPECT_EQ( m_Undo.Stack().undoText(), "Change Alt to select" );
  m_Undo.Undo();
  EXPECT_EQ( Get( pAlt ), MakeValue( true ) );
  EXPECT_TRUE( UsesDefault( pAlt ) );
  m_Undo.Redo();
  EXPECT_EQ( Get( pAlt ), MakeValue( false ) );
  EXPECT_EQ( m_Editor.Reset( At( pAlt ), m_Why ), ZEK::IResult::Ok );
  EXPECT_TRUE( UsesDefault( pAlt ) );
  m_Undo.Undo();
  EXPECT_FALSE( UsesDefault( pAlt ) );

  // One visit of a spin box is one step; another visit, or another setting between, is not.
  m_Undo.Stack().clear();
  for ( const auto& [Value, pKey] : { std::pair( 310u, "a" ), { 320u, "a" }, { 330u, "b" }, { 340u, "b" } } )
  {
    ASSERT_EQ( Set( pInterval, Value, pKey ), ZEK::IResult::Ok );
  }
  ASSERT_EQ( Set( pSkins, std::string( "/a" ) ), ZEK::IResult::Ok );
  ASSERT_EQ( Set( pInterval, 350u, "b" ), ZEK::IResult::Ok );
  EXPECT_EQ( m_Undo.Stack().undoText(), "Change Automatic saving interval" );
  ASSERT_EQ( m_Undo.Stack().count(), 4 );
  EXPECT_EQ( m_Undo.Stack().text( 2 ), "Change Skins folder" );
  for ( const std::uint32_t Value : { 340u, 340u, 320u, 300u } )
  {
    m_Undo.Undo();
    EXPECT_EQ( Get( pInterval ), MakeValue( Value ) );
  }
  m_Undo.Redo();
  EXPECT_EQ( Get( pInterval ), MakeValue( 320u ) );
}

TEST_F( Preferences, BadValuesAreRefusedWithAReasonAndLeaveNoStep )
{
  ASSERT_TRUE( DeclareUserPreferences( *m_pStore ).IsOk() );
  const TestSupport::VTemporaryDir Folder;
  const std::string File = ( Folder.Path() / "file" ).string();
  std::ofstream( File ) << "x";
  {
    const ZEK::VStoreWriteScope Scope( *m_pStore );
    (void)Scope->SetValue( At( "Preferences/Readout" ), MakeValue( 1 ) );
    Scope->SetFlag( At( "Preferences/Readout" ), ZEK::EReadout );
  }
  EXPECT_EQ( Set( pInterval, 9u ), ZEK::IResult::InvalidValue );
  EXPECT_EQ( m_Why, QString( "9%1s is not from 10 to 3600%1s." ).arg( QChar( QChar::Nbsp ) ) );
  EXPECT_EQ( Set( pInterval, 3601u ), ZEK::IResult::InvalidValue );
  EXPECT_EQ( Set( pInterval, 300 ), ZEK::IResult::InvalidType );
  EXPECT_TRUE( m_Why.contains( "UInt32" ) ) << m_Why.toStdString();
  EXPECT_EQ( Set( pFreeSpace, 15u ), ZEK::IResult::InvalidValue );
  EXPECT_EQ( Set( pSkins, std::string( "skins" ) ), ZEK::IResult::InvalidValue );
  EXPECT_EQ( Set( pSkins, File ), ZEK::IResult::InvalidValue );
  EXPECT_EQ( Set( "Preferences/Readout", 2 ), ZEK::IResult::InvalidValue );
  EXPECT_EQ( Set( "Preferences/Nothing", 2 ), ZEK::IResult::NotFound );
  EXPECT_EQ( m_Editor.Reset( At( "Preferences/Readout" ), m_Why ), ZEK::IResult::NotSet );
  EXPECT_EQ( m_Undo.Stack().count(), 0 );
  EXPECT_EQ( Get( pInterval ), MakeValue( 300u ) );
  EXPECT_EQ( Set( pSkins, Folder.Path().string() ), ZEK::IResult::Ok );
  EXPECT_EQ( Set( pSkins, std::string( "/not/mounted/now" ) ), ZEK::IResult::Ok );
  EXPECT_EQ( Set( pInterval, 10u ), ZEK::IResult::Ok );
  EXPECT_EQ( Set( pInterval, 3600u ), ZEK::IResult::Ok );
}

TEST_F( Preferences, AStepWhoseEntryIsGoneSaysSoAndAFailingWatcherLosesNothing )
{
  ASSERT_TRUE( DeclareUserPreferences( *m_pStore ).IsOk() );
  QStringList Failures;
  const auto Connection = m_Editor.Failed().Connect(
      [&]( const QString& i_rWhy )
      {
        Failures << i_rWhy;
      },
      nullptr );
  const auto pHandler = m_pStore->RegisterHandler( { { At( pAlt ) }, {} } );
  const auto pId = pHandler->AddImmediateCallback(
      []( auto, auto )
      {
        throw std::runtime_error( "watcher" );
      },
      ZEK::EChangeVerified );
  TestSupport::ExpectFailureLine(
      "A change of Preferences/Core/AltToSelect is made, but who was told of it failed: watcher" );
  EXPECT_EQ( Set( pAlt, false ), ZEK::IResult::OkButPartial );
  EXPECT_EQ( Get( pAlt ), MakeValue( false ) );
  EXPECT_TRUE( pHandler->RemoveCallback( pId ) );
  {
    const ZEK::VStoreWriteScope Scope( *m_pStore );
    EXPECT_TRUE( Scope->RemoveEntry( At( pAlt ) ).IsOk() );
  }
  m_Undo.Undo();
  ASSERT_EQ( Failures.size(), 1 );
  EXPECT_TRUE( Failures[0].startsWith( "“Change Alt to select”" ) ) << Failures[0].toStdString();
  EXPECT_TRUE( Get( pAlt ).IsEmpty() ) << "a step makes no entry";
}

TEST( PreferenceNumbers, StopAtTheEndsOfTheirRangeAndOfTheirType )
{
  const auto Add =
      []( auto i_Value, std::int64_t i_Amount, ZEK::VTypedValue i_Minimum = {}, ZEK::VTypedValue i_Maximum = {} )
  {
    ZEK::VTypedValue Number = MakeValue( i_Value );
    AddToNumber( Number, i_Amount, i_Minimum, i_Maximum );
    EXPECT_TRUE( ZEK::IO::ReadTyped( Number, i_Value ) );
    return i_Value;
  };
  using VLong = std::numeric_limits< std::int64_t >;
  EXPECT_EQ( Add( std::int8_t( -100 ), -100 ), -128 );
  EXPECT_EQ( Add( std::int8_t( -100 ), 200 ), 100 );
  EXPECT_EQ( Add( std::uint32_t( 5 ), -10 ), 0u );
  EXPECT_EQ( Add( std::uint64_t( 5 ), VLong::min() ), 0u );
  EXPECT_EQ( Add( ~std::uint64_t( 0 ) - 1, 7 ), ~std::uint64_t( 0 ) );
  EXPECT_EQ( Add( VLong::min(), VLong::max() ), -1 );
  EXPECT_EQ( Add( VLong::max(), VLong::min() ), -1 );
  EXPECT_EQ( Add( 1u, 1, MakeValue( 10u ), MakeValue( 20u ) ), 10u ) << "from below into the range";
  EXPECT_EQ( Add( 40u, -1, MakeValue( 10u ), MakeValue( 20u ) ), 20u );
  EXPECT_EQ( Add( 15u, 10, MakeValue( 10u ), MakeValue( 20u ) ), 20u );
  EXPECT_EQ( Add( 0.5, 1, {}, MakeValue( 1.25 ) ), 1.25 );
  int Order = 9;
  EXPECT_TRUE( CompareNumbers( MakeValue( -1 ), MakeValue( 1 ), Order ) && Order < 0 );
  EXPECT_FALSE( CompareNumbers( MakeValue( -1 ), MakeValue( 1u ), Order ) );
  EXPECT_FALSE( CompareNumbers( MakeValue( true ), MakeValue( true ), Order ) );
}

#include "StoreFixture.h"

#include <TestSupport/LogGuard.h>
#include <ZEK/StoreValue.h>

#include <gtest/gtest.h>

#include <limits>
#include <map>

using namespace ZEK;
using namespace Store;

namespace
{
using VTexts = std::vector< std::string >;

struct VWriter : testing::Test
{
  VTestStore m_Store;

  std::uint32_t Flags( const char* i_pPath ) const
  {
    return m_Store.Read(
        [&]( const IStoreReader& i_rReader )
        {
          return i_rReader.Flags( m_Store[i_pPath] );
        } );
  }
  std::vector< VTypedValue > Values( const char* i_pPath ) const
  {
    return m_Store.Read(
        [&]( const IStoreReader& i_rReader )
        {
          VStoreEntry* const pEntry = m_Store[i_pPath];
          return std::vector< VTypedValue >{ i_rReader.VerifiedValue( pEntry ), i_rReader.ProposedValue( pEntry ),
                                             i_rReader.DefaultValue( pEntry ) };
        } );
  }
};

using VSet = IResult ( IStoreWriter::* )( VStoreEntry*, VTypedValue );
struct VSetter
{
  const char* m_pMessage;
  VSet m_Set; ///< null for a choice and for the type alone

  IResult operator()( IStoreWriter& io_rWriter, VStoreEntry* i_pEntry, const VTypedValue& i_rValue ) const
  {
    if ( m_Set != nullptr )
    {
      return ( io_rWriter.*m_Set )( i_pEntry, i_rValue );
    }
    return IsChoice() ? io_rWriter.AddValueChoice( i_pEntry, i_rValue, "", "" )
                      : io_rWriter.SetSchema( i_pEntry, i_rValue.Schema() );
  }
  bool IsChoice() const { return std::string( m_pMessage ).find( "choice" ) != std::string::npos; }
};
const std::vector< VSetter > Setters{
    { "Failed to set 'p/e' verified value: the value type does not match the entry type.",
      &IStoreWriter::SetVerifiedValue },
    { "Failed to set 'p/e' proposed value: the value type does not match the entry type.",
      &IStoreWriter::SetProposedValue },
    { "Failed to set 'p/e' value: the value type does not match the entry type.", &IStoreWriter::SetValue },
    { "Failed to set 'p/e' default value: the value type does not match the entry type.",
      &IStoreWriter::SetDefaultValue },
    { "Failed to set 'p/e' minimum value: the value type does not match the entry type.", &IStoreWriter::SetMinimum },
    { "Failed to set 'p/e' maximum value: the value type does not match the entry type.", &IStoreWriter::SetMaximum },
    { "Failed to add 'p/e' value choice: the value type does not match the entry type.", nullptr },
    { "Failed to set 'p/e' value schema: the requested type does not match the entry type.", nullptr } };
} // namespace

TEST_F( VWriter, EachSetterFixesTheTypeAndRefusesOthersWithItsText )
{
  VLogCategory& rCategory = GlobalLog().Category( "Store" );
  VTexts Wanted;
  for ( const VSetter& rSetter : Setters )
  {
    const VTestStore Store;
    for ( const bool bCommitted : { false, true } )
    {
      Store.Write(
          [&]( IStoreWriter& io_rWriter )
          {
            VStoreEntry* const pEntry = Store["p/e"];
            const bool bSchema = &rSetter == &Setters.back();
            EXPECT_EQ( rSetter( io_rWriter, pEntry, Int( 1 ) ),
                       bSchema && bCommitted ? IResult::OkButNoEffect : IResult::Ok );
            EXPECT_EQ( io_rWriter.Schema( pEntry ), IO::GetUniquePodSchema( IO::EType::Int32 ) );
            TestSupport::ExpectFailureLine( rSetter.m_pMessage );
            EXPECT_EQ( rSetter( io_rWriter, pEntry, IO::MakeValue( 1.0 ) ), IResult::InvalidType );
            Wanted.push_back( rSetter.m_pMessage );
            rCategory.SetMaximumLevel( 1 );
            EXPECT_EQ( rSetter( io_rWriter, pEntry, IO::MakeValue( true ) ), IResult::InvalidType );
            rCategory.SetMaximumLevel( ELogWarning );
            EXPECT_TRUE( bSchema || rSetter( io_rWriter, pEntry, VTypedValue() ) == IResult::Ok );
            EXPECT_EQ( rSetter( io_rWriter, pEntry, Int( 2 ) ), bSchema ? IResult::OkButNoEffect : IResult::Ok );
          } );
    }
  }
  EXPECT_EQ( TestSupport::LogTexts( "Store", ELogFailure ), Wanted );
}

TEST_F( VWriter, WithoutEffectNothingIsMade )
{
  TestSupport::ExpectFailureLine( "Failed to remove 'e' value choice: the choice index provided was invalid." );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        VStoreEntry* const pEntry = m_Store["e"];
        EXPECT_EQ( io_rWriter.RemoveValueChoice( pEntry, 0 ), IResult::InvalidIndex );
        EXPECT_EQ( io_rWriter.ClearValueChoices( pEntry ), IResult::OkButNoEffect );
        EXPECT_EQ( io_rWriter.SetChoiceToolTip( pEntry, 0, "x" ), IResult::InvalidIndex );
        EXPECT_EQ( io_rWriter.SetSchema( pEntry, nullptr ), IResult::OkButNoEffect );
        EXPECT_EQ( io_rWriter.RemoveEntry( pEntry ), IResult::NotFound );
        EXPECT_EQ( m_Store.m_pStore->Pending().InUse(), 0u );
        io_rWriter.ClearFlag( pEntry, 1 );
        EXPECT_TRUE( io_rWriter.Exists( pEntry ) );
      } );
}

TEST_F( VWriter, UsingDefaultFollowsTheSetters )
{
  struct VCase
  {
    bool bVerify;
    int Setter; // 0 verified, 1 proposed, 2 value
    bool bStays;
  };
  for ( const VCase& rCase : { VCase{ false, 0, false },
                               { false, 1, false },
                               { false, 2, false },
                               { true, 0, true },
                               { true, 1, false },
                               { true, 2, false } } )
  {
    const std::string Path = std::string( rCase.bVerify ? "v" : "e" ) + std::to_string( rCase.Setter );
    VStoreEntry* const pEntry = m_Store[Path.c_str()];
    m_Store.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          io_rWriter.SetFlags( pEntry, EVerifyRequired, rCase.bVerify );
          EXPECT_EQ( io_rWriter.SetDefaultValue( pEntry, Int( 5 ) ), IResult::Ok );
        } );
    EXPECT_EQ( Flags( Path.c_str() ), EUsingDefault | ( rCase.bVerify ? EVerifyRequired : 0u ) );
    EXPECT_EQ( Values( Path.c_str() )[rCase.bVerify ? 1 : 0], Int( 5 ) );
    m_Store.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          EXPECT_EQ( Setters[static_cast< std::size_t >( rCase.Setter )]( io_rWriter, pEntry, Int( 6 ) ), IResult::Ok );
        } );
    EXPECT_EQ( ( Flags( Path.c_str() ) & EUsingDefault ) != 0, rCase.bStays ) << Path;
  }
  // Another default is taken over, and counts as set from then on.
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetDefaultValue( m_Store["f"], Int( 1 ) );
      } );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetDefaultValue( m_Store["f"], Int( 2 ) );
      } );
  EXPECT_EQ( Values( "f" ), ( std::vector< VTypedValue >{ Int( 2 ), VTypedValue(), Int( 2 ) } ) );
  EXPECT_EQ( Flags( "f" ), 0u );
  // A proposal without verification stays apart.
  m_Store.Set( "g", 1 );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetProposedValue( m_Store["g"], Int( 2 ) );
      } );
  EXPECT_EQ( Values( "g" ), ( std::vector< VTypedValue >{ Int( 1 ), Int( 2 ), VTypedValue() } ) );
}

TEST_F( VWriter, ReadoutEmptiesWhatIsOldAndExcludesVerification )
{
  VStoreEntry* const pEntry = m_Store["e"];
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetVerifiedValue( pEntry, Int( 1 ) );
        (void)io_rWriter.SetProposedValue( pEntry, Int( 2 ) );
        (void)io_rWriter.SetDefaultValue( pEntry, Int( 3 ) );
      } );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetProposedValue( pEntry, Int( 7 ) );
        (void)io_rWriter.SetDefaultValue( pEntry, Int( 8 ) );
        io_rWriter.SetFlag( pEntry, EReadout );
        (void)io_rWriter.SetDefaultValue( pEntry, Int( 9 ) );
      } );
  EXPECT_EQ( TestSupport::LogTexts( "Store", ELogWarning ),
             ( VTexts{ "Set a default value on a Readout e.", "Set a default value on a Readout e." } ) );
  EXPECT_EQ( Flags( "e" ), std::uint32_t( EReadout ) );
  EXPECT_EQ( Values( "e" ), ( std::vector< VTypedValue >{ Int( 8 ), Int( 7 ), Int( 9 ) } ) );
  // Both at once are refused by word only.
  m_Store.Set( "f", 1 );
  const char* const pText = "Setting both VerifyRequired and Readout is not supported f.";
  TestSupport::ExpectFailureLine( pText );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        io_rWriter.SetFlag( m_Store["f"], EReadout | EVerifyRequired );
      } );
  EXPECT_EQ( TestSupport::LogTexts( "Store", ELogFailure ), ( VTexts{ pText, pText } ) );
  EXPECT_EQ( Flags( "f" ), EReadout | EVerifyRequired );
  // On an entry that is new to the scope verification swaps nothing.
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetVerifiedValue( m_Store["g"], Int( 1 ) );
        io_rWriter.SetFlag( m_Store["g"], EVerifyRequired );
      } );
  EXPECT_EQ( Values( "g" )[0], Int( 1 ) );
}

TEST_F( VWriter, AttributesAreATextOfThoseThatHaveOne )
{
  using VAttributes = std::map< std::string, VTypedValue >;
  const std::vector< std::pair< VAttributes, std::string > > Cases{
      { {}, "{}" },
      { { { "b", IO::MakeValue( true ) }, { "a", Int( -1 ) } }, "{\"a\":-1,\"b\":true}" },
      { { { "q\"\\\t\n\r", IO::MakeValue( std::string( "x\"" ) ) } }, "{\"q\\\"\\\\\\t\\n\\r\":\"x\\\"\"}" },
      { { { "none", VTypedValue() },
          { "nan", IO::MakeValue( std::numeric_limits< double >::quiet_NaN() ) },
          { "z", Int( 3 ) } },
        "{\"z\":3}" } };
  for ( const auto& [rAttributes, rText] : Cases )
  {
    m_Store.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          io_rWriter.SetAttributes( m_Store["e"], rAttributes );
          EXPECT_EQ( io_rWriter.Attributes( m_Store["e"] ), rText );
        } );
  }
}

TEST_F( VWriter, FieldsMakePresentationExtrasAndCapabilities )
{
  const std::vector< std::function< void( IStoreWriter&, VStoreEntry* ) > > Sets{
      []( IStoreWriter& io_rWriter, VStoreEntry* i_pEntry )
      {
        (void)io_rWriter.SetMaximum( i_pEntry, Int( 0 ) );
      },
      []( IStoreWriter& io_rWriter, VStoreEntry* i_pEntry )
      {
        (void)io_rWriter.AddValueChoice( i_pEntry, Int( 0 ), "", "" );
      },
      []( IStoreWriter& io_rWriter, VStoreEntry* i_pEntry )
      {
        io_rWriter.SetPresentationText( i_pEntry, "x" );
      },
      []( IStoreWriter& io_rWriter, VStoreEntry* i_pEntry )
      {
        io_rWriter.SetOptionalText( i_pEntry, "" );
      },
      []( IStoreWriter& io_rWriter, VStoreEntry* i_pEntry )
      {
        io_rWriter.SetExtraNumber1( i_pEntry, 1 );
      },
      []( IStoreWriter& io_rWriter, VStoreEntry* i_pEntry )
      {
        io_rWriter.SetAttributesText( i_pEntry, "x" );
      },
      []( IStoreWriter& io_rWriter, VStoreEntry* i_pEntry )
      {
        io_rWriter.SetExtraNumber2( i_pEntry, 0 );
        io_rWriter.SetExtraText3( i_pEntry, "" );
      } };
  for ( std::size_t Case = 0; Case < Sets.size(); ++Case )
  {
    VStoreEntry* const pEntry = m_Store[std::to_string( Case ).c_str()];
    const auto Check = [&]( const IStoreReader& i_rReader )
    {
      EXPECT_EQ( i_rReader.HasPresentation( pEntry ), Case < 3 ) << Case;
      EXPECT_EQ( i_rReader.HasExtras( pEntry ), Case > 2 && Case < 6 ) << Case;
      EXPECT_EQ( i_rReader.Capabilities( pEntry ), Case == 1 ? 1u : 0u ) << Case;
      EXPECT_FALSE( i_rReader.HasValue( pEntry ) );
    };
    m_Store.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          Sets[Case]( io_rWriter, pEntry );
          Check( io_rWriter );
        } );
    m_Store.Read( Check );
  }
}

TEST_F( VWriter, ReferencesLastAsLongAsTheScope )
{
  m_Store.Set( "e", 1 );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        io_rWriter.SetExtraText1( m_Store["e"], "a text that is kept somewhere else" );
        const std::string& rText = io_rWriter.ExtraText1( m_Store["e"] );
        const VTypedValue& rOld = io_rWriter.VerifiedValue( m_Store["e"] );
        for ( int Number = 0; Number < 2000; ++Number )
        {
          (void)io_rWriter.SetValue( m_Store[( "e/" + std::to_string( Number ) ).c_str()], Int( Number ) );
        }
        (void)io_rWriter.SetProposedValue( m_Store["e"], rOld );
        EXPECT_EQ( rText, "a text that is kept somewhere else" );
        EXPECT_EQ( rOld, Int( 1 ) );
      } );
}

TEST_F( VWriter, TypedReadsTellWhyTheyFail )
{
  VLogCategory& rCategory = GlobalLog().Category( "Store" );
  rCategory.SetMaximumLevel( ELogDetail );
  VTypedValue Damaged = Int( 1 );
  Damaged.m_Data.Append( "x", 1 );
  m_Store.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        (void)io_rWriter.SetValue( m_Store["a"], Int( 4 ) );
        (void)io_rWriter.SetValue( m_Store["bad"], Damaged );
        io_rWriter.SetFlag( m_Store["proposed"], EVerifyRequired );
        (void)io_rWriter.SetValue( m_Store["proposed"], Int( 1 ) );
      } );
  const std::string Other = "Failed getting value for store entry 'a': the requested value type does not match the "
                            "store value type.";
  const std::string Bad = "Failed getting value for store entry 'bad': encountered an unknown error.";
  TestSupport::ExpectFailureLine( Other );
  TestSupport::ExpectFailureLine( Bad );
  const VStoreReadScope Read( *m_Store.m_pStore );
  std::int32_t Got = 0;
  double Double = 7;
  EXPECT_EQ( ReadValue( *Read, "a", Got ), IResult::Ok );
  EXPECT_EQ( Got, 4 );
  EXPECT_EQ( ReadValue( *Read, "nobody", Got ), IResult::NotFound );
  EXPECT_EQ( ReadValue( *Read, "*", Got ), IResult::InvalidArgument );
  EXPECT_EQ( ReadValue( *Read, "proposed", Got ), IResult::NotSet );
  EXPECT_EQ( ReadValue( *Read, "a", Double ), IResult::InvalidType );
  EXPECT_EQ( ReadValue( *Read, m_Store["bad"], Got ), IResult::Failed );
  EXPECT_TRUE( Got == 4 && Double == 7 );
  EXPECT_EQ( m_Store.m_pStore->FindEntry( "nobody" ), nullptr );
  EXPECT_EQ( TestSupport::LogTexts( "Store", ELogDetail ),
             ( VTexts{ "Store entry 'nobody' does not exist.", "Store entry 'proposed' has no value." } ) );
  EXPECT_EQ( TestSupport::LogTexts( "Store", ELogFailure ), ( VTexts{ Other, Bad } ) );
  EXPECT_EQ( GetValue< std::int32_t >( *Read, m_Store["a"] ), 4 );
  try
  {
    (void)GetValue< double >( *Read, m_Store["a"] );
    FAIL();
  }
  catch ( const VStoreException& rError )
  {
    EXPECT_EQ( rError.what(), Other );
    EXPECT_EQ( rError.m_Result, IResult::InvalidType );
  }
  rCategory.SetMaximumLevel( ELogWarning );
}

#include <HostSettings/SettingsCommand.h>
#include <HostSettings/SettingsLine.h>

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>
#include <UtilsFileSystem/ProtectedFileIO.h>

#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <sstream>

using namespace ZEK;

namespace HostSettings
{
namespace
{
class Settings : public testing::Test
{
protected:
  VSettingsOutcome Run( VSettingsCommand i_Command ) const
  {
    i_Command.m_Store = m_Store;
    return RunSettings( i_Command );
  }
  IResult Set( const std::string& i_rPath, const std::string& i_rValue, std::optional< std::string > i_Type = {} ) const
  {
    VSettingsCommand Command{ ESettingsAction::Set, {}, {}, i_rPath, i_rValue, std::move( i_Type ) };
    return Run( std::move( Command ) ).m_Result;
  }
  std::string Get( const std::string& i_rPath ) const
  {
    const VSettingsOutcome Outcome = Run( { ESettingsAction::Get, {}, {}, i_rPath, {}, {} } );
    return Outcome.m_Result.IsOk() ? Outcome.m_Output : Outcome.m_Errors.back();
  }
  VSettingsOutcome OnFile( ESettingsAction i_Action, const char* i_pFile, std::string i_Path = {} ) const
  {
    return Run( { i_Action, {}, m_Folder.Path() / i_pFile, std::move( i_Path ), {}, {} } );
  }
  std::string Slurp( const char* i_pName ) const
  {
    std::ifstream File( m_Folder.Path() / i_pName, std::ios::binary );
    return std::string( std::istreambuf_iterator< char >( File ), {} );
  }
  void Put( const char* i_pName, const std::string& i_rText ) const
  {
    std::ofstream( m_Folder.Path() / i_pName, std::ios::binary ) << i_rText;
  }
  static std::string Text( IResult i_Result ) { return i_Result.Text(); }

  TestSupport::VTemporaryDir m_Folder;
  std::string m_Store = m_Folder.Path() / "s.json";
};

TEST_F( Settings, WhatIsSetIsGotAndHasTheTypeOfItsForm )
{
  EXPECT_EQ( Get( "a" ), Text( IResult::FileNotFound ) );
  const char* const Rows[][3] = { { "bool", "true", "true" },           { "int", "-7", "-7" },
                                  { "wide", "3000000000", "3e+09" },    { "float", "2.5", "2.5" },
                                  { "text", "two words", "two words" }, { "empty", "", "" },
                                  { "quoted", "\"x\"\n", "\"x\"\n" },   { "near", " 7", " 7" } };
  for ( const auto& rRow : Rows )
  {
    EXPECT_EQ( Set( rRow[0], rRow[1] ), IResult::Ok ) << rRow[0];
    EXPECT_EQ( Get( rRow[0] ), std::string( rRow[2] ) + "\n" ) << rRow[0];
  }
  EXPECT_EQ( Run( {} ).m_Output, "bool\ttrue\nempty\t\"\"\nfloat\t2.5\nint\t-7\nnear\t\" 7\"\n"
                                 "quoted\t\"\\\"x\\\"\\n\"\ntext\t\"two words\"\nwide\t3e+09\n" );
  // The entry's own type holds, and another one is refused.
  EXPECT_EQ( Set( "float", "3" ), IResult::Ok );
  EXPECT_EQ( Set( "text", "7" ), IResult::Ok );
  EXPECT_EQ( Set( "int", "2.5" ), IResult::InvalidValue );
  TestSupport::ExpectFailureLine( "Failed to set 'int' value: the value type does not match the entry type." );
  EXPECT_EQ( Set( "int", "x", "String" ), IResult::InvalidType );
  EXPECT_EQ( Set( "int", "300", "UInt99" ), IResult::InvalidArgument );
  EXPECT_EQ( Set( "list/*", "[1,2]", R"({"Type":"List","SubSchemas":[{"Type":"Int8"}]})" ), IResult::Ok );
  EXPECT_EQ( Get( "list/*" ) + Get( "int" ) + Get( "text" ) + Get( "float" ), "[1,2]\n-7\n7\n3\n" );
  EXPECT_EQ( Get( "list" ), Text( IResult::NotSet ) );
  EXPECT_EQ( Get( "nothing" ), Text( IResult::NotFound ) );
  EXPECT_EQ( Set( "", "1" ), IResult::InvalidName );
  EXPECT_EQ( Set( "/a", "1" ), IResult::InvalidName );
  EXPECT_EQ( Run( { ESettingsAction::List, {}, {}, "list", {}, {} } ).m_Output, "list/*\t[1,2]\n" );
  EXPECT_EQ( Run( { ESettingsAction::List, {}, {}, "nothing", {}, {} } ).m_Result, IResult::NotFound );
}

TEST_F( Settings, DocumentsGoInAndOutUnchanged )
{
  const std::string Whole =
      "{\"Version\":\"3.0\",\"Children\":{\"*\":{\"Value\":1,\"Type\":\"Int8\"},"
      "\"p\":{\"Value-Proposed\":\"\\\"b\",\"Value\":\"a\",\"Type\":\"String\"},"
      "\"\xe6\xb8\xac\":{\"Children\":{\"e\":{\"Value\":\"red\",\"Type\":\"Enum8\",\"EnumValues\":{\"red\":1}}}}}}";
  EXPECT_EQ( OnFile( ESettingsAction::Export, "b.json" ).m_Result, IResult::FileNotFound );
  Put( "a.json", Whole );
  EXPECT_EQ( OnFile( ESettingsAction::Import, "a.json" ).m_Output, Text( IResult::Ok ) + "\n" );
  EXPECT_EQ( OnFile( ESettingsAction::Export, "b.json" ).m_Output, Text( IResult::Ok ) + "\n" );
  EXPECT_EQ( Slurp( "b.json" ), Whole );
  EXPECT_EQ( Get( "p" ), "a\n" );
  EXPECT_EQ( OnFile( ESettingsAction::Check, "b.json" ).m_Output, Text( IResult::Ok ) + "\n" );

  EXPECT_EQ( OnFile( ESettingsAction::Export, "b.json", "\xe6\xb8\xac/e" ).m_Result, IResult::Ok );
  EXPECT_EQ( Slurp( "b.json" ), "{\"Version\":\"3.0\",\"Children\":{\"\xe6\xb8\xac\":{\"Children\":{\"e\":{\"Value\":"
                                "\"red\",\"Type\":\"Enum8\",\"EnumValues\":{\"red\":1}}}}}}" );
  EXPECT_EQ( OnFile( ESettingsAction::Export, "b.json", "no" ).m_Result, IResult::NotFound );
  // What a document does not name stays.
  Put( "a.json", R"({"Version":"3.0","Children":{"*":{"Value":2,"Type":"Int8"}}})" );
  EXPECT_EQ( OnFile( ESettingsAction::Import, "a.json" ).m_Result, IResult::Ok );
  EXPECT_EQ( Get( "*" ) + Get( "\xe6\xb8\xac/e" ), "2\nred\n" );
}

TEST_F( Settings, AFailureLeavesTheFileAlone )
{
  EXPECT_EQ( Set( "a", "1" ), IResult::Ok );
  const std::string Before = Slurp( "s.json" );
  Put( "bad.json", R"({"Version":"3.0","Children":{"a":{"Value":2,"Type":"Int32"},"b":3}})" );
  const std::string Line = "Expected to encounter a json object as the value of member 'b' at path '', "
                           "(Element XPath=\"/Configuration\")";
  TestSupport::ExpectFailureLine( Line );
  EXPECT_EQ( OnFile( ESettingsAction::Import, "bad.json" ).m_Result, IResult::Failed );
  EXPECT_EQ( OnFile( ESettingsAction::Check, "bad.json" ).m_Errors,
             ( std::vector< std::string >{ Line, Text( IResult::Failed ) } ) );
  Put( "bad.json", "{\"Version\":" );
  EXPECT_EQ( OnFile( ESettingsAction::Import, "bad.json" ).m_Result, IResult::InvalidFormat );
  EXPECT_EQ( OnFile( ESettingsAction::Import, "none.json" ).m_Result, IResult::FileNotFound );
  {
    std::unique_ptr< UtilsFileSystem::VSaveLock > pLock;
    ASSERT_EQ( UtilsFileSystem::VSaveLock::Take( m_Store, pLock ), IResult::Ok );
    EXPECT_EQ( Set( "a", "2" ), IResult::NotPermitted );
    for ( const ZEK::VLogLine& rLine : TestSupport::LogLines() )
    {
      TestSupport::ExpectFailureLine( rLine.Text );
    }
  }
  EXPECT_EQ( Slurp( "s.json" ), Before );
  // A settings file that cannot be read whole is not written over.
  for ( const char* const pText : { "{\"Version\":\"2.0\",\"Children\":{}}", "[" } )
  {
    Put( "s.json", pText );
    TestSupport::ExpectFailureLine( "StoreFileReader cannot load IStore file with version 2.0, minimum supported "
                                    "version is 3.0" );
    EXPECT_TRUE( Set( "a", "2" ).IsError() );
    EXPECT_EQ( Slurp( "s.json" ), pText );
  }
}

TEST_F( Settings, LinesOfCommands )
{
  const std::string Ok = Text( IResult::Ok ) + "\n";
  struct VRow
  {
    std::vector< std::string > m_Arguments;
    int m_Exit;
    std::string m_Output;
    std::string m_Error;
  };
  const VRow Rows[] = {
      { { "set", "a", "-7" }, 0, Ok, "" },
      { { "get", "a" }, 0, "-7\n", "" },
      { { "set", "--type", "String", "b", "--set" }, 0, Ok, "" },
      { { "set", "b", "--x=y", "--type=String" }, 0, Ok, "" },
      { { "set", "set", "set" }, 0, Ok, "" },
      { { "list" }, 0, "a\t-7\nb\t\"--x=y\"\nset\t\"set\"\n", "" },
      { { "get", "c" }, 5, "", "harrow: " + Text( IResult::NotFound ) + "\n" },
      { { "get", "a", "--store", m_Folder.Path() / "none" },
        5,
        "",
        "harrow: " + ( m_Folder.Path() / "none" ).string() + ": " + Text( IResult::FileNotFound ) +
            "\nharrow: " + Text( IResult::FileNotFound ) + "\n" },
      { { "set", "a" }, 2, "", "harrow: value is required\n" },
      { {}, 2, "", "harrow: A subcommand is required\n" },
      { { "set", "a", "1", "--typ" }, 2, "", "harrow: The following argument was not expected: --typ\n" } };
  for ( const VRow& rRow : Rows )
  {
    std::ostringstream Output;
    std::ostringstream Errors;
    EXPECT_EQ( RunSettingsLine( rRow.m_Arguments, m_Store, Output, Errors ), rRow.m_Exit );
    EXPECT_EQ( Output.str(), rRow.m_Output );
    EXPECT_EQ( Errors.str(), rRow.m_Error );
  }
  std::ostringstream Output;
  std::ostringstream Errors;
  EXPECT_EQ( RunSettingsLine( { "set", "--help" }, m_Store, Output, Errors ), 0 );
  EXPECT_NE( Output.str().find( "--type" ), std::string::npos );
}
} // namespace
} // namespace HostSettings

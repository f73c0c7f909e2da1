#include "StoreIoFixture.h"

#include <StoreIO/CheckDocument.h>

#include <cstdint>
#include <limits>
#include <sstream>
#include <stdexcept>
#include <streambuf>
#include <utility>

using namespace ZEK;

namespace StoreIO
{
namespace
{
struct VRefused
{
  const char* m_pText;
  IResult m_Result;
  std::vector< std::string > m_Lines;
};

class RefusedDocument : public testing::TestWithParam< VRefused >
{
};

/// The checker says the same as the log of an import, and has a text even where an import has none.
TEST_P( RefusedDocument, GivesResultAndLinesAndWritesNothing )
{
  const VSettings Settings;
  EXPECT_EQ( Settings.Import( GetParam().m_pText ), GetParam().m_Result );
  ExpectLines( GetParam().m_Lines );
  EXPECT_EQ( Settings.Text(), Whole( "" ) );
  std::vector< std::string > Errors;
  EXPECT_EQ( CheckDocument( GetParam().m_pText, Errors ), GetParam().m_Result );
  ASSERT_FALSE( Errors.empty() );
  if ( !GetParam().m_Lines.empty() )
  {
    EXPECT_EQ( Errors.front(), GetParam().m_Lines.front() );
  }
}

const std::string NoVersion = "The file format version element \"Version\" is invalid.";
const std::string NoText = "The file format version element \"Version\" is not a string type json element";
std::string TooOld( const std::string& i_rVersion )
{
  return std::string( "StoreFileReader cannot load IStore file with version " )
      .append( i_rVersion )
      .append( ", minimum supported version is 3.0" );
}
std::string TooNew( const std::string& i_rVersion )
{
  return std::string( "Cannot load IStore file with version " )
      .append( i_rVersion )
      .append( ", maximum supported version is 3.0" );
}

INSTANTIATE_TEST_SUITE_P(
    Roots, RefusedDocument,
    testing::Values(
        VRefused{ "[]", IResult::InvalidFormat, {} }, VRefused{ "null", IResult::InvalidFormat, {} },
        VRefused{ "7", IResult::InvalidFormat, {} }, VRefused{ "{}", IResult::FileNotOpen, {} },
        VRefused{ "", IResult::InvalidFormat, {} }, VRefused{ "\xef\xbb\xbf", IResult::InvalidFormat, {} },
        VRefused{ R"({"Version":"3.0","Children":{}}x)", IResult::InvalidFormat, {} },
        VRefused{ R"({"Version":"3.0","Children":{}}{})", IResult::InvalidFormat, {} },
        VRefused{ R"({"Version":"3.0","Children":{},})", IResult::InvalidFormat, {} },
        VRefused{ R"({"Version":"3.0","Children":{"a":{"Value":01,"Type":"Int8"}}})", IResult::InvalidFormat, {} },
        VRefused{
            R"({"Version":"3.0","Children":{"a":{"Value":1e400,"Type":"Float64"}}})", IResult::InvalidFormat, {} },
        VRefused{ R"({"Version":"3.0","Children":{"a":{"Value":NaN,"Type":"Float64"}}})", IResult::InvalidFormat, {} },
        VRefused{ R"({"Version":"3.0"})", IResult::Failed, { "The file has no top-level \"data\" member to read" } },
        VRefused{ R"({"Version":"3.0","Children":[]})",
                  IResult::Failed,
                  { "The value stored under the member \"data\" is not an object" } } ) );

INSTANTIATE_TEST_SUITE_P(
    Versions, RefusedDocument,
    testing::Values( VRefused{ R"({"Children":{}})", IResult::InvalidVersion, { TooOld( "1.0" ) } },
                     VRefused{ R"({"Version":"2.9","Children":{}})", IResult::InvalidVersion, { TooOld( "2.9" ) } },
                     VRefused{ R"({"Version":"3.1","Children":{}})", IResult::InvalidVersion, { TooNew( "3.1" ) } },
                     VRefused{ R"({"Version":"4.0","Children":{}})", IResult::InvalidVersion, { TooNew( "4.0" ) } },
                     VRefused{ R"({"Version":"4294967296.0","Children":{}})", IResult::InvalidVersion, { NoVersion } },
                     VRefused{ R"({"Version":"3","Children":{}})", IResult::InvalidVersion, { NoVersion } },
                     VRefused{ R"({"Version":"3.0.1","Children":{}})", IResult::InvalidVersion, { NoVersion } },
                     VRefused{ R"({"Version":" 3.0","Children":{}})", IResult::InvalidVersion, { NoVersion } },
                     VRefused{ R"({"Version":"","Children":{}})", IResult::InvalidVersion, { NoVersion } },
                     VRefused{ R"({"Version":3.0,"Children":{}})", IResult::InvalidVersion, { NoText } },
                     VRefused{ R"({"Version":null,"Children":{}})", IResult::InvalidVersion, { NoText } } ) );

TEST( Import, FaultsAreToldOneByOneAndTheRestIsWritten )
{
  const VSettings Settings;
  const std::string Text =
      Whole( R"("good":{"Value":1,"Type":"Int32"},"a":{"Children":{)"
             R"("b":{"Value":"x","Type":"List","SubSchemas":[{"Type":"Bool"}]},)"
             R"("c":{"Value":1,"Value-Proposed":2,"Type":"Int33","Count":3},)"
             R"("d":{"Value":{},"Value-Proposed":7,"Type":"String"},)"
             R"("e":{"Value":true},"g":{"Value":1,"Type":"Ixxx2"},"f":{"Children":4},"%1%":{"Value":"","Type":"Void"},)"
             R"("wrong":[],"skipped":{"Value":1,"Type":"Int32"}}},"later":{"Value":2,"Type":"Int32"})" );
  const std::string In = "(Element XPath=\"/Configuration/Node[@name='a']";
  const std::vector< std::string > Lines{
      "Encountered 'b' with invalid 'Value', " + In + "/Node[@name='b']\")",
      R"(Encountered 'c', and unable to set value schema from '{"Type":"Int33","Count":3}'. )" + In +
          "/Node[@name='c']\")",
      "Encountered 'd' with invalid 'Value-Proposed', " + In + "/Node[@name='d']\")",
      "Encountered 'd' with invalid 'Value', " + In + "/Node[@name='d']\")",
      "Encountered 'e', and unable to set value schema from '{}'. " + In + "/Node[@name='e']\")",
      R"(Encountered 'g', and unable to set value schema from '{"Type":"Ixxx2"}'. )" + In + "/Node[@name='g']\")",
      "Expected to encounter a json object as the value of member 'Children' at path 'a/f', " + In +
          "/Node[@name='f']\")",
      "Encountered '%1%' with invalid 'Value', " + In + "/Node[@name='%1%']\")",
      "Expected to encounter a json object as the value of member 'wrong' at path 'a', " + In + "\")" };
  EXPECT_EQ( Settings.Import( Text ), IResult::Failed );
  ExpectLines( Lines );
  EXPECT_EQ( Settings.Text(), Whole( R"("good":{"Value":1,"Type":"Int32"},"later":{"Value":2,"Type":"Int32"})" ) );

  // The checker goes on behind the wrong member, and says why the schemas are none.
  std::vector< std::string > Errors;
  EXPECT_EQ( CheckDocument( Text, Errors ), IResult::Failed );
  ASSERT_EQ( Errors.size(), Lines.size() );
  for ( std::size_t Place = 0; Place < Lines.size(); ++Place )
  {
    EXPECT_TRUE( Errors[Place].starts_with( Lines[Place] ) ) << Errors[Place];
  }
  EXPECT_EQ( Errors[1], Lines[1] + ": unknown Type at position 8" );
}

TEST( Import, TheCheckerAlsoTellsWhatAnImportPassesOver )
{
  std::vector< std::string > Errors;
  EXPECT_EQ( CheckDocument( Whole( R"("a":{"Value":300,"Type":"UInt8","Typo":1},"b":{"Value":"true","Type":"Bool"},)"
                                   R"("a":{"Value":2.5,"Value-Proposed":null,"Type":"Int8"},)"
                                   R"("c":{"Value":1e39,"Type":"Float32"},"a":{},"d":{"Value":-1,"Type":"Int64"})" ),
                            Errors ),
             IResult::OkButPartial );
  const std::string A = "(Element XPath=\"/Configuration/Node[@name='a']\")";
  EXPECT_EQ( Errors, ( std::vector< std::string >{
                         "The member 'a' is given more than once, (Element XPath=\"/Configuration\")",
                         "Encountered the member 'Typo', which has no meaning, " + A,
                         "Encountered 'a' whose 'Value' does not fit its type, " + A,
                         "Encountered 'b' whose 'Value' is neither true nor false, (Element XPath=\"/Configuration/"
                         "Node[@name='b']\")",
                         "Encountered 'a' whose 'Value-Proposed' is not a number, " + A,
                         "Encountered 'a' whose 'Value' does not fit its type, " + A,
                         "Encountered 'c' whose 'Value' does not fit its type, (Element XPath=\"/Configuration/"
                         "Node[@name='c']\")" } ) );
  EXPECT_EQ( CheckDocument( Whole( R"("a":{"Value":255,"Type":"UInt8"},"b":{"Children":{}})" ), Errors ), IResult::Ok );
  EXPECT_TRUE( Errors.empty() );
  EXPECT_EQ( CheckDocument( "{\"Version\":\"3.0\",\n \"Children\" 1}", Errors ), IResult::InvalidFormat );
  EXPECT_EQ( Errors.front(), "Missing a colon after a name of object member. at line 2, column 13" );
  EXPECT_EQ( CheckDocumentFile( "/no/such/file", Errors ), IResult::FileNotFound );
  EXPECT_EQ( Errors.size(), 1u );
}

struct VNumber
{
  const char* m_pType;
  const char* m_pJson;
  VTypedValue m_Value;
};

class LeafOfAnyKind : public testing::TestWithParam< VNumber >
{
};

TEST_P( LeafOfAnyKind, IsTakenByValueAndCut )
{
  const VSettings Settings;
  const std::string Node = std::string( R"("a":{"Value":)" )
                               .append( GetParam().m_pJson )
                               .append( R"(,"Type":")" )
                               .append( GetParam().m_pType )
                               .append( "\"}" );
  EXPECT_EQ( Settings.Import( Whole( Node ) ), IResult::Ok );
  EXPECT_EQ( Settings.Verified( "a" ), GetParam().m_Value ) << Node;
}

using IO::MakeValue;
INSTANTIATE_TEST_SUITE_P(
    Kinds, LeafOfAnyKind,
    testing::Values( VNumber{ "Bool", "true", MakeValue( true ) }, VNumber{ "Bool", "\"true\"", MakeValue( false ) },
                     VNumber{ "Bool", "1", MakeValue( false ) }, VNumber{ "Int32", "true", MakeValue( 0 ) },
                     VNumber{ "Int32", "null", MakeValue( 0 ) }, VNumber{ "UInt64", "\"7\"", MakeValue( 0ull + 0 ) },
                     VNumber{ "Float64", "{\"a\":[1]}", MakeValue( 0.0 ) },
                     VNumber{ "Float32", "[3]", MakeValue( 0.0f ) } ) );

INSTANTIATE_TEST_SUITE_P(
    Numbers, LeafOfAnyKind,
    testing::Values(
        VNumber{ "UInt8", "300", MakeValue( std::uint8_t( 44 ) ) },
        VNumber{ "UInt16", "-1", MakeValue( std::uint16_t( 65535 ) ) }, VNumber{ "Int32", "2.9", MakeValue( 2 ) },
        VNumber{ "Int32", "-2.9", MakeValue( -2 ) }, VNumber{ "Int8", "128", MakeValue( std::int8_t( -128 ) ) },
        VNumber{ "Int64", "9223372036854775807", MakeValue( std::numeric_limits< std::int64_t >::max() ) },
        VNumber{ "Int64", "-9223372036854775808", MakeValue( std::numeric_limits< std::int64_t >::min() ) },
        VNumber{ "UInt64", "18446744073709551615", MakeValue( ~std::uint64_t( 0 ) ) },
        // 2^64 and 2^64 + 4096, which are beyond whole numbers; and 2^63 below zero.
        VNumber{ "UInt64", "18446744073709551616", MakeValue( std::uint64_t( 0 ) ) },
        VNumber{ "UInt64", "18446744073709555712", MakeValue( std::uint64_t( 4096 ) ) },
        VNumber{ "Int64", "-18446744073709555712", MakeValue( std::int64_t( -4096 ) ) },
        VNumber{ "UInt64", "-9223372036854775808.0", MakeValue( std::uint64_t( 1 ) << 63 ) },
        VNumber{ "UInt32", "1e300", MakeValue( std::uint32_t( 0 ) ) }, VNumber{ "Int32", "-0", MakeValue( 0 ) },
        VNumber{ "Float64", "-0.0", MakeValue( 0.0 ) }, VNumber{ "Float64", "-0", MakeValue( 0.0 ) },
        VNumber{ "Float64", "18446744073709551615", MakeValue( 18446744073709551616.0 ) },
        VNumber{ "Float64", "-3", MakeValue( -3.0 ) }, VNumber{ "Float64", "5e-324", MakeValue( 5e-324 ) },
        VNumber{ "Float64", "1.2345678901234567e-340", MakeValue( 0.0 ) },
        VNumber{ "Float64", "0.1e-99999999999999", MakeValue( 0.0 ) },
        VNumber{ "Float64", "1.7976931348623157e308", MakeValue( 1.7976931348623157e308 ) },
        // One digit more or less makes another double of these.
        VNumber{ "Float64", "9007199254740993.00000000000000001", MakeValue( 9007199254740994.0 ) },
        VNumber{ "Float64", "0.30000000000000004", MakeValue( 0.1 + 0.2 ) },
        VNumber{ "Float32", "0.1", MakeValue( 0.1f ) },
        VNumber{ "Float32", "1e39", MakeValue( std::numeric_limits< float >::max() ) },
        VNumber{ "Float32", "-1e300", MakeValue( -std::numeric_limits< float >::max() ) },
        VNumber{ "String", R"("\u0000\ud83d\ude00\n")", MakeValue( std::string( "\0\xf0\x9f\x98\x80\n", 6 ) ) } ) );

TEST( Import, AProposedValueNeedsVerificationAndOtherTypesAreLeftAlone )
{
  const VSettings Settings;
  Settings.Set( "taken", std::string( "text" ) );
  EXPECT_EQ( Settings.Import( Whole( R"("p":{"Value-Proposed":2,"Value":1,"Type":"Int32"},)"
                                     R"("taken":{"Value":1,"Type":"Int32"})" ) ),
             IResult::OkButPartial );
  ExpectLines( { "Failed to set 'taken' verified value: the value type does not match the entry type." }, "Store" );
  Settings.Read(
      [&]( IStoreReader& i_rReader )
      {
        EXPECT_EQ( i_rReader.Flags( Settings["p"] ), EVerifyRequired );
        EXPECT_EQ( i_rReader.VerifiedValue( Settings["p"] ), MakeValue( 1 ) );
        EXPECT_EQ( i_rReader.ProposedValue( Settings["p"] ), MakeValue( 2 ) );
        EXPECT_EQ( i_rReader.VerifiedValue( Settings["taken"] ), MakeValue( std::string( "text" ) ) );
      } );
}

TEST( Import, NamesOfAnyBytesFindTheirPlaces )
{
  const std::string Nul( "a\0b", 3 );
  const VSettings Settings;
  EXPECT_EQ( Settings.Import( Whole( R"("x":{"Children":{"y/z":{"Value":1,"Type":"Int32"},)"
                                     R"("after":{"Value":2,"Type":"Int32"},"":{"Value":3,"Type":"Int32"},)"
                                     R"("*":{"Value":4,"Type":"Int32","Children":{"w":{"Value":5,"Type":"Int32"}}}}},)"
                                     R"("":{"Value":6,"Type":"Int32"},"a\u0000b":{"Value":7,"Type":"Int32"},)"
                                     R"("\"quoted\\\u00e9":{"Value":8,"Type":"Int32"},"bare":{"Type":"Int32"})" ) ),
             IResult::Ok );
  int Next = 0;
  for ( const std::string& rPath :
        { std::string( "x/y/z" ), std::string( "x/after" ), std::string( "x/" ), std::string( "x/*" ),
          std::string( "x/*/w" ), std::string(), Nul, std::string( "\"quoted\\\xc3\xa9" ) } )
  {
    EXPECT_EQ( Settings.Verified( rPath ), MakeValue( ++Next ) ) << rPath;
  }
  EXPECT_FALSE( Settings.Exists( "bare" ) );
  // Over entries that are there, in their order, out of it, with gaps, and beside a path that begins with a '/'.
  Settings.Set( "/x", 1 );
  Settings.Set( "/x/after", 1 );
  EXPECT_EQ( Settings.Import( Whole( R"("x":{"Children":{"after":{"Value":20,"Type":"Int32"},)"
                                     R"("*":{"Value":40,"Type":"Int32","Children":{"w":{"Value":50,"Type":"Int32"}}},)"
                                     R"("new":{"Value":60,"Type":"Int32"},"y":{"Children":{)"
                                     R"("z":{"Value":10,"Type":"Int32"}}}}})" ) ),
             IResult::Ok );
  const char* const Paths[] = { "x/after", "x/*", "x/*/w", "x/new", "x/y/z", "/x", "/x/after", "x/" };
  const int Values[] = { 20, 40, 50, 60, 10, 1, 1, 3 };
  for ( std::size_t Place = 0; Place < std::size( Paths ); ++Place )
  {
    EXPECT_EQ( Settings.Verified( Paths[Place] ), MakeValue( Values[Place] ) ) << Paths[Place];
  }
}

/// Breaks where its text ends.
class VBrokenBuffer : public std::streambuf
{
public:
  explicit VBrokenBuffer( std::string i_Text )
    : m_Text( std::move( i_Text ) )
  {
    setg( m_Text.data(), m_Text.data(), m_Text.data() + m_Text.size() );
  }

protected:
  int_type underflow() override { throw std::runtime_error( "broken" ); }

private:
  std::string m_Text;
};

TEST( Import, OneDocumentManyTimesAndOfTwoMembersTheFirst )
{
  std::istringstream Stream( "\xef\xbb\xbf \n" + Whole( R"("a":{"Value":1,"Value":2,"Type":"Int32"})" ) + "\r\n\t " );
  VStoreImporterJson Importer;
  EXPECT_EQ( Importer.ReadStream( Stream ), IResult::Ok );
  for ( int Turn = 0; Turn < 2; ++Turn )
  {
    const VSettings Settings;
    Settings.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          EXPECT_EQ( Importer.Import( io_rWriter ), IResult::Ok );
        } );
    EXPECT_EQ( Settings.Verified( "a" ), MakeValue( 1 ) );
  }
  Stream.setstate( std::ios::badbit );
  EXPECT_EQ( Importer.ReadStream( Stream ), IResult::FileIOFailure );
  VBrokenBuffer Buffer( Whole( "" ) );
  std::istream Broken( &Buffer );
  EXPECT_EQ( Importer.ReadStream( Broken ), IResult::FileIOFailure );
  // A zero byte is no end.
  EXPECT_EQ( Importer.ReadText( Whole( "" ) + std::string( "\0", 1 ) ), IResult::InvalidFormat );
  EXPECT_EQ( Importer.ReadError(), "A zero byte stands behind the document. at line 1, column 32" );
  const VSettings Settings;
  Settings.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        EXPECT_EQ( Importer.Import( io_rWriter ), IResult::InvalidFormat );
      } );
}
} // namespace
} // namespace StoreIO

#include "StoreIoFixture.h"

#include <TestSupport/Paths.h>
#include <ZEK/TypedValueText.h>

#include <rapidjson/document.h>

#include <cmath>
#include <filesystem>
#include <fstream>
#include <sstream>
#include <tuple>

using namespace ZEK;

namespace StoreIO
{
namespace
{
using IO::EType;
using IO::MakeValue;

const IO::ISchema* Made( IO::ISchema i_Schema )
{
  return IO::GetUniqueSchema( i_Schema );
}

IO::ISchema Containing( EType i_Type, std::vector< std::pair< std::string, const IO::ISchema* > > i_Subs )
{
  IO::ISchema Schema;
  Schema.m_Type = i_Type;
  Schema.m_SubSchemas = std::move( i_Subs );
  return Schema;
}

std::string Slurp( const std::filesystem::path& i_rPath )
{
  std::ifstream File( i_rPath, std::ios::binary );
  return std::string( std::istreambuf_iterator< char >( File ), {} );
}

TEST( Export, OneEntryOfEachTypeByteForByte )
{
  const VSettings Settings;
  Settings.Set( "01", true );
  Settings.Set( "02", std::int8_t( -8 ) );
  Settings.Set( "03", std::int16_t( -16 ) );
  Settings.Set( "04", std::int32_t( -32 ) );
  Settings.Set( "05", std::numeric_limits< std::int64_t >::min() );
  Settings.Set( "06", std::uint8_t( 8 ) );
  Settings.Set( "07", std::uint16_t( 16 ) );
  Settings.Set( "08", std::uint32_t( 4294967295u ) );
  Settings.Set( "09", ~std::uint64_t( 0 ) );
  Settings.Set( "10", 0.5f );
  Settings.Set( "11", 1e300 );
  Settings.Set( "12", std::string( "q\"\\/\n\x01\x7f\xc3\xa9\xff longer than a word" ) );
  Settings.Set( "13", std::array< std::int32_t, 2 >{ 1, 2 } );
  Settings.Set( "14", std::vector< std::string >{ "a", "b\"" } );
  Settings.Set( "15", std::tuple< bool, double >( true, 2.5 ) );
  Settings.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        const auto Put = [&]( const char* i_pPath, const IO::ISchema* i_pSchema, const char* i_pText )
        {
          VTypedValue Value;
          EXPECT_TRUE( IO::ValueFromText( i_pSchema, i_pText, Value ) );
          EXPECT_EQ( io_rWriter.SetVerifiedValue( Settings[i_pPath], Value ), IResult::Ok );
        };
        IO::ISchema Enum;
        Enum.m_Type = EType::Enum16;
        Enum.m_TypeName = "Colour";
        Enum.m_EnumValues = { { "red", -1 }, { "blue", 2 } };
        Put( "16", Made( Enum ), "blue" );
        Put( "17", Made( Containing( EType::NamedTuple, { { "n", Made( Enum ) } } ) ), R"({"n":"red"})" );
        IO::ISchema Result;
        Result.m_Type = EType::Int32;
        Result.m_Role = IO::ERole::Result;
        Put( "18", Made( Result ), "4" );
        io_rWriter.SetFlag( Settings["19"], EVerifyRequired );
        EXPECT_EQ( io_rWriter.SetProposedValue( Settings["19"], MakeValue( 2 ) ), IResult::Ok );
        EXPECT_EQ( io_rWriter.SetVerifiedValue( Settings["19"], MakeValue( 1 ) ), IResult::Ok );
        EXPECT_EQ( io_rWriter.SetValue( Settings["20/deep/er"], MakeValue( 3 ) ), IResult::Ok );
        EXPECT_EQ( io_rWriter.SetValue( Settings["20"], MakeValue( 4 ) ), IResult::Ok );
        io_rWriter.Touch( Settings["21"] );
        io_rWriter.Touch( Settings["Versions/x"] );
      } );
  const std::string Colour = R"({"Type":"Enum16","TypeName":"Colour","EnumValues":{"red":-1,"blue":2}})";
  const std::string Golden = Whole(
      R"("Versions":{"Children":{"x":{}}},)"
      R"("01":{"Value":true,"Type":"Bool"},"02":{"Value":-8,"Type":"Int8"},"03":{"Value":-16,"Type":"Int16"},)"
      R"("04":{"Value":-32,"Type":"Int32"},"05":{"Value":-9223372036854775808,"Type":"Int64"},)"
      R"("06":{"Value":8,"Type":"UInt8"},"07":{"Value":16,"Type":"UInt16"},"08":{"Value":4294967295,"Type":"UInt32"},)"
      R"("09":{"Value":18446744073709551615,"Type":"UInt64"},"10":{"Value":0.5,"Type":"Float32"},)"
      R"("11":{"Value":1e300,"Type":"Float64"},)"
      "\"12\":{\"Value\":\"q\\\"\\\\/\\n\\u0001\x7f\xc3\xa9\xff longer than a word\",\"Type\":\"String\"},"
      R"("13":{"Value":"[1,2]","Type":"Array","Count":2,"SubSchemas":[{"Type":"Int32"}]},)"
      R"("14":{"Value":"[\"a\",\"b\\\"\"]","Type":"List","SubSchemas":[{"Type":"String"}]},)"
      R"("15":{"Value":"[true,2.5]","Type":"Tuple","SubSchemas":[{"Type":"Bool"},{"Type":"Float64"}]},)"
      R"("16":{"Value":"blue","Type":"Enum16","TypeName":"Colour","EnumValues":{"red":-1,"blue":2}},)"
      R"("17":{"Value":"{\"n\":\"red\"}","Type":"NamedTuple","SubSchemas":{"n":)" +
      Colour +
      R"(}},"18":{"Value":4,"Type":"Int32","Role":"Result"},)"
      R"("19":{"Value-Proposed":2,"Value":1,"Type":"Int32"},)"
      R"("20":{"Value":4,"Type":"Int32","Children":{"deep":{"Children":{"er":{"Value":3,"Type":"Int32"}}}}},"21":{})" );
  EXPECT_EQ( Settings.Text(), Golden );
  const VSettings Back;
  EXPECT_EQ( Back.Import( Golden ), IResult::Ok );
  Back.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        // Empty nodes leave no trace.
        io_rWriter.Touch( Back["21"] );
        io_rWriter.Touch( Back["Versions/x"] );
      } );
  EXPECT_EQ( Back.Text(), Golden );
}

TEST( Export, WhatCannotBeWrittenIsToldAndTheDocumentStays )
{
  const VSettings Settings;
  Settings.Set( "a", 1 );
  VStoreExporterJson Exporter;
  Exporter.Document().SetObject();
  Exporter.Document().AddMember( "Children", 4, Exporter.Document().GetAllocator() );
  Exporter.Document().AddMember( "Mine", "text of my own that is long", Exporter.Document().GetAllocator() );
  for ( int Turn = 0; Turn < 2; ++Turn )
  {
    EXPECT_EQ( Settings.Export( Exporter ), IResult::Ok );
  }
  std::string Before;
  EXPECT_EQ( Exporter.WriteText( Before ), IResult::Ok );
  EXPECT_EQ( Before, R"({"Children":{"a":{"Value":1,"Type":"Int32"}},"Mine":"text of my own that is long",)"
                     R"("Version":"3.0"})" );

  Settings.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        EXPECT_EQ( io_rWriter.SetProposedValue( Settings["a/only"], MakeValue( 1 ) ), IResult::Ok );
        EXPECT_EQ( io_rWriter.SetVerifiedValue( Settings["b"], MakeValue( std::vector< float >{ NAN } ) ),
                   IResult::Ok );
        EXPECT_EQ( io_rWriter.SetVerifiedValue( Settings["c"], VTypedValue( IO::GetUniquePodSchema( EType::Int32 ),
                                                                            IO::VValueBytes( "x", 1 ) ) ),
                   IResult::Ok );
        EXPECT_EQ( io_rWriter.SetVerifiedValue( Settings["d"], VTypedValue( IO::GetUniquePodSchema( EType::String ),
                                                                            IO::VValueBytes( "\0\0\0\0x", 5 ) ) ),
                   IResult::Ok );
      } );
  EXPECT_EQ( Settings.Export( Exporter ), IResult::Failed );
  std::string After;
  EXPECT_EQ( Exporter.WriteText( After ), IResult::Ok );
  EXPECT_EQ( After, Before );
  Exporter.Document().SetArray();
  EXPECT_EQ( Settings.Export( Exporter ), IResult::InvalidArgument );
  EXPECT_TRUE( Exporter.Document().IsArray() );
  ExpectLines( { "Failed trying to write values for entry path 'a/only', entry has no values set.",
                 "Failed trying to write a value for entry path 'b', it has no text.",
                 "Failed trying to write a value for entry path 'c', it has no text.",
                 "Failed trying to write a value for entry path 'd', it has no text.",
                 "The Json document is not of type Object or Null" } );
}

TEST( Export, PartsOfAStoreAndTheDocumentOutlivesIt )
{
  VStoreExporterJson Exporter;
  std::string Sub;
  std::string Branch;
  {
    const VSettings Other;
    Other.Set( "a/a name of another store", 7 );
    EXPECT_EQ( Other.Read(
                   [&]( IStoreReader& i_rReader )
                   {
                     return Exporter.ExportSubTree( i_rReader, Other["a"] );
                   } ),
               IResult::Ok );
  }
  {
    const VSettings Settings;
    EXPECT_EQ( Settings.Export( Exporter ), IResult::Ok );
    EXPECT_EQ( Exporter.WriteText( Sub ), IResult::Ok );
    EXPECT_EQ( Sub, R"({"a name of another store":{"Value":7,"Type":"Int32"},"Version":"3.0","Children":{}})" );
    Sub.clear();
    Exporter = VStoreExporterJson();
    Settings.Set( "a/Versions of a long name", 1 );
    Settings.Set( "a/b/c", std::string( "a text that is longer than a few letters" ) );
    Settings.Set( "a/b", 2 );
    Settings.Set( "d", 3 );
    const auto Take = [&]( auto i_pTake, const char* i_pPath )
    {
      return Settings.Read(
          [&]( IStoreReader& i_rReader )
          {
            return ( Exporter.*i_pTake )( i_rReader, Settings[i_pPath] );
          } );
    };
    EXPECT_EQ( Take( &VStoreExporterJson::ExportSubTree, "a" ), IResult::Ok );
    EXPECT_EQ( Exporter.WriteText( Sub ), IResult::Ok );
    Exporter = VStoreExporterJson();
    EXPECT_EQ( Take( &VStoreExporterJson::ExportBranch, "nothing" ), IResult::NotFound );
    EXPECT_EQ( Take( &VStoreExporterJson::ExportBranch, "" ), IResult::Ok );
    EXPECT_EQ( Exporter.WriteText( Branch ), IResult::Ok );
    EXPECT_EQ( Branch, Settings.Text() );
    EXPECT_EQ( Take( &VStoreExporterJson::ExportBranch, "a/b" ), IResult::Ok );
  }
  const std::string B = R"("b":{"Value":2,"Type":"Int32","Children":{"c":{"Value":"a text that is longer than a few )"
                        R"(letters","Type":"String"}}})";
  EXPECT_EQ( Sub, "{\"Versions of a long name\":{\"Value\":1,\"Type\":\"Int32\"}," + B + "}" );
  Branch.clear();
  EXPECT_EQ( Exporter.WriteText( Branch ), IResult::Ok );
  EXPECT_EQ( Branch, Whole( R"("a":{"Children":{)" + B + "}}" ) );
}

TEST( Export, FilesAreWholeOrNotThere )
{
  const TestSupport::VTemporaryDir Folder;
  const std::string Path = Folder.Path() / "settings.json";
  const VSettings Settings;
  Settings.Set( "a", 1.5 );
  VStoreExporterJson Exporter;
  EXPECT_EQ( Settings.Export( Exporter ), IResult::Ok );
  EXPECT_EQ( Exporter.WriteFile( Path, false ), IResult::Ok );
  EXPECT_EQ( Slurp( Path ), Settings.Text() );

  Settings.Set( "a", 2.5 );
  EXPECT_EQ( Settings.Export( Exporter ), IResult::Ok );
  EXPECT_EQ( Exporter.WriteFile( Path, false ), IResult::AlreadyPresent );
  EXPECT_TRUE( TestSupport::LogTexts( "StoreIO", ELogFailure ).empty() );
  EXPECT_EQ( Exporter.WriteFile( Path, true ), IResult::Ok );
  const std::string Good = Slurp( Path );
  EXPECT_EQ( Good, Settings.Text() );

  // A number without text: the file that is there stays, and no other appears.
  Settings.Set( "a", double( INFINITY ) );
  EXPECT_EQ( Settings.Export( Exporter ), IResult::Ok );
  const std::string New = Folder.Path() / "new.json";
  EXPECT_EQ( Exporter.WriteFile( Path, true ), IResult::SerialisationFailure );
  EXPECT_EQ( Exporter.WriteFile( New, false ), IResult::SerialisationFailure );
  EXPECT_EQ( Slurp( Path ), Good );
  EXPECT_EQ( std::distance( std::filesystem::directory_iterator( Folder.Path() ), {} ), 1 );
  const std::string Why = IResult( IResult::SerialisationFailure ).Text();
  ExpectLines( { "Error streaming document : " + Why, "Error writing document " + Path + ": " + Why,
                 "Error streaming document : " + Why, "Error writing document " + New + ": " + Why } );

  VStoreImporterJson Importer;
  EXPECT_EQ( Importer.ReadFile( Path ), IResult::Ok );
  EXPECT_EQ( Importer.ReadFile( New ), IResult::FileNotFound );
  EXPECT_FALSE( Importer.ReadError().empty() );
  const VSettings Back;
  EXPECT_EQ( Back.Write(
                 [&]( IStoreWriter& io_rWriter )
                 {
                   return Importer.Import( io_rWriter );
                 } ),
             IResult::InvalidFormat );
}

TEST( Export, AStreamThatGoesBadIsAFailure )
{
  const VSettings Settings;
  Settings.Set( "a", std::string( 100000, 'x' ) );
  VStoreExporterJson Exporter;
  EXPECT_EQ( Settings.Export( Exporter ), IResult::Ok );
  std::ostringstream Good;
  EXPECT_EQ( Exporter.WriteStream( Good ), IResult::Ok );
  EXPECT_EQ( Good.str(), Settings.Text() );
  std::ostringstream Bad;
  Bad.setstate( std::ios::badbit );
  EXPECT_EQ( Exporter.WriteStream( Bad ), IResult::FileIOFailure );
  ExpectLines( { "Error streaming document : " + IResult( IResult::FileIOFailure ).Text() } );
}
} // namespace
} // namespace StoreIO

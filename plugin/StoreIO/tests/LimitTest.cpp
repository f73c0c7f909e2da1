#include "StoreIoFixture.h"

#include <StoreIO/CheckDocument.h>

#include <pthread.h>
#include <rapidjson/document.h>

#include <functional>

using namespace ZEK;

namespace StoreIO
{
namespace
{
std::string Repeat( const std::string& i_rText, std::size_t i_Count )
{
  std::string Made;
  while ( i_Count-- > 0 )
  {
    Made += i_rText;
  }
  return Made;
}

std::string PathOf( std::size_t i_Components )
{
  std::string Path = Repeat( "n/", i_Components );
  Path.pop_back();
  return Path;
}

/// A document of one entry, so deep.
std::string Deep( std::size_t i_Components, const std::string& i_rNode )
{
  return Whole( Repeat( R"("n":{"Children":{)", i_Components - 1 ) + "\"n\":" + i_rNode +
                Repeat( "}}", i_Components - 1 ) );
}

/// A node of lists of lists, so many, of an Enum.
std::string Lists( std::size_t i_Count )
{
  const std::string Enum = R"("Type":"Enum8","EnumValues":{"e":1})";
  const std::string List = R"("Type":"List","SubSchemas":[{)";
  return R"({"Value":")" + Repeat( "[", i_Count ) + Repeat( "]", i_Count ) + "\"," + Repeat( List, i_Count ) + Enum +
         Repeat( "}]", i_Count ) + "}";
}

/// Runs on a thread with a stack of 512 KiB.
void OnSmallStack( std::function< void() > i_Work )
{
  pthread_attr_t Attributes;
  ASSERT_EQ( pthread_attr_init( &Attributes ), 0 );
  ASSERT_EQ( pthread_attr_setstacksize( &Attributes, 512 * 1024 ), 0 );
  pthread_t Thread{};
  const auto Run = []( void* i_pWork ) -> void*
  {
    ( *static_cast< std::function< void() >* >( i_pWork ) )();
    return nullptr;
  };
  ASSERT_EQ( pthread_create( &Thread, &Attributes, Run, &i_Work ), 0 );
  pthread_join( Thread, nullptr );
  pthread_attr_destroy( &Attributes );
}

TEST( Limits, DeepTextIsRefusedOnASmallStack )
{
  OnSmallStack(
      []
      {
        const VSettings Settings;
        for ( const std::string& rText :
              { Repeat( "[", 1000000 ), Repeat( "{\"a\":", 1000000 ), Repeat( "[", 1000000 ) + Repeat( "]", 1000000 ),
                Whole( "\"a\":{\"Value\":" + Repeat( "[", 1200 ) + Repeat( "]", 1200 ) + "}" ), Deep( 600, "{}" ) } )
        {
          EXPECT_EQ( Settings.Import( rText ), IResult::InvalidFormat );
          std::vector< std::string > Errors;
          EXPECT_EQ( CheckDocument( rText, Errors ), IResult::InvalidFormat );
          EXPECT_NE( Errors.front().find( "Nested too deep. at line 1, column" ), std::string::npos );
        }
      } );
}

TEST( Limits, WhatIsAtTheLimitsGoesBothWaysOnASmallStack )
{
  OnSmallStack(
      []
      {
        const VSettings Settings;
        const std::string Text = Deep( MaximumComponents, Lists( 64 ) );
        EXPECT_EQ( Settings.Import( Text ), IResult::Ok );
        EXPECT_EQ( Settings.Verified( PathOf( MaximumComponents ) ).Schema()->m_Type, IO::EType::List );
        EXPECT_EQ( Settings.Text(), Text );
        // What is not looked at may be as deep as text may be.
        const std::string Ignored = Repeat( "[", 1000 ) + Repeat( "]", 1000 );
        EXPECT_EQ( VSettings().Import( Whole( R"("a":{"Ignored":)" + Ignored + "}" ) ), IResult::Ok );
        EXPECT_EQ( VSettings().Import( Whole( R"("a":{"Type":"Int32","Value":)" + Ignored + "}" ) ), IResult::Ok );
        EXPECT_EQ( VSettings().Import( Whole( R"("a":{"Type":"Int32","Value":1,"Ignored":)" + Ignored + "}" ) ),
                   IResult::Ok );
      } );
}

TEST( Limits, OneMoreIsRefusedByImportAndExport )
{
  const VSettings Settings;
  const std::string Path = PathOf( MaximumComponents + 1 );
  const std::string ImportLine = std::string( "The path '" ).append( Path ).append( "' has more than 512 components" );
  // By nesting, and by the names alone.
  EXPECT_EQ( Settings.Import( Deep( MaximumComponents + 1, R"({"Value":1,"Type":"Int32"})" ) ),
             IResult::InvalidFormat );
  EXPECT_EQ( Settings.Import( Whole( std::string( "\"" ).append( PathOf( 500 ) ) + R"(":{"Children":{")" +
                                     PathOf( 13 ) + R"(":{"Value":1,"Type":"Int32"}}})" ) ),
             IResult::InvalidFormat );
  EXPECT_EQ( Settings.Import( Whole( R"("l":)" + Lists( 65 ) ) ), IResult::InvalidFormat );
  EXPECT_EQ( Settings.Text(), Whole( "" ) );
  Settings.Set( Path, 1 );
  VStoreExporterJson Exporter;
  EXPECT_EQ( Settings.Export( Exporter ), IResult::Failed );
  EXPECT_TRUE( Exporter.Document().IsNull() );
  std::string Schema = Lists( 65 );
  Schema.erase( 1, Schema.find( "\"Type\"" ) - 1 );
  ExpectLines( { ImportLine, ImportLine,
                 "Encountered 'l', and unable to set value schema from '" + Schema +
                     "'. (Element XPath=\"/Configuration/Node[@name='l']\")",
                 "Failed trying to write entry path '" + Path + "', it has too many components." } );
}

TEST( Limits, MembersWithoutNamesStayAtTheRoot )
{
  std::string Text = "{}";
  for ( int Level = 0; Level < 560; ++Level )
  {
    Text = R"({"Children":{"":)" + Text + "}}";
  }
  const VSettings Settings;
  EXPECT_EQ( Settings.Import( R"({"Version":"3.0",)" + Text.substr( 1 ) ), IResult::InvalidFormat );
  ExpectLines( { "The path '' has more than 512 components" } );
}
} // namespace
} // namespace StoreIO

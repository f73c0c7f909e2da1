#include "RandomValues.h"
#include "SchemaModule.h"

#include <TestSupport/Paths.h>
#include <ZEK/Serialiser.h>

#include <gtest/gtest.h>

#include <barrier>
#include <cstring>
#include <functional>
#include <set>
#include <thread>

#include <dlfcn.h>

using namespace ZEK::IO;

namespace
{
const ISchema* Int32()
{
  return GetUniquePodSchema( EType::Int32 );
}

ISchema Described( EType i_Type, std::vector< std::pair< std::string, const ISchema* > > i_Subs = {},
                   std::uint32_t i_Count = 0 )
{
  ISchema Description;
  Description.m_Type = i_Type;
  Description.m_Count = i_Count;
  Description.m_SubSchemas = std::move( i_Subs );
  return Description;
}

ISchema Enumerated( EType i_Type, std::vector< std::pair< std::string, std::int64_t > > i_Values )
{
  ISchema Description;
  Description.m_Type = i_Type;
  Description.m_EnumValues = std::move( i_Values );
  return Description;
}

const ISchema* Nested( std::uint32_t i_Levels )
{
  const ISchema* pSchema = Int32();
  for ( ; i_Levels > 0 && pSchema != nullptr; --i_Levels )
  {
    pSchema = GetUniqueSchema( Described( EType::List, { { "", pSchema } } ) );
  }
  return pSchema;
}
} // namespace

TEST( Schema, NamesCodesAndPodsGoTogether )
{
  const char* const Names[] = { "Void",   "Bool",   "Int8",       "Int16",   "Int32",   "Int64",  "UInt8",
                                "UInt16", "UInt32", "UInt64",     "Float32", "Float64", "String", "Array",
                                "List",   "Tuple",  "NamedTuple", "Enum8",   "Enum16",  "Enum32" };
  for ( std::uint8_t Code = 0; Code < std::size( Names ); ++Code )
  {
    const auto Type = static_cast< EType >( Code );
    EXPECT_STREQ( TypeName( Type ), Names[Code] );
    EType Read = EType::Void;
    EXPECT_TRUE( TypeFromName( Names[Code], Read ) && Read == Type );
    const ISchema* const pPod = GetUniquePodSchema( Type );
    ASSERT_EQ( pPod != nullptr, Code <= 12 );
    if ( pPod != nullptr )
    {
      EXPECT_EQ( *reinterpret_cast< const std::uint8_t* >( pPod ), Code );
      EXPECT_EQ( GetUniqueSchema( Described( Type ) ), pPod );
    }
  }
  EType Type = EType::Void;
  EXPECT_FALSE( TypeFromName( "int32", Type ) || TypeFromName( "", Type ) );
  EXPECT_EQ( GetUniquePodSchema( static_cast< EType >( 200 ) ), nullptr );
}

TEST( Schema, IdentityIsWhatValuesDependOn )
{
  ISchema Plain = Described( EType::NamedTuple, { { "a", Int32() }, { "b", Int32() } } );
  const ISchema* const pKept = GetUniqueSchema( Plain );
  ASSERT_NE( pKept, nullptr );
  Plain.m_TypeName = "Other";
  Plain.m_Docs = Plain.m_History = Plain.m_Detail = "text";
  EXPECT_EQ( GetUniqueSchema( Plain ), pKept );
  EXPECT_EQ( pKept->m_TypeName, "" ); // the first of equal ones stays

  const auto Other = []( EType i_Type, const char* i_pName, ERole i_Role )
  {
    ISchema Description = Described( i_Type, { { "a", Int32() }, { i_pName, Int32() } } );
    Description.m_Role = i_Role;
    return GetUniqueSchema( Description );
  };
  const std::set< const ISchema* > Different{
      pKept,
      Other( EType::NamedTuple, "c", ERole::Value ),
      Other( EType::NamedTuple, "b", ERole::Input ),
      Other( EType::Tuple, "b", ERole::Value ),
      GetUniqueSchema( Described( EType::NamedTuple, { { "b", Int32() }, { "a", Int32() } } ) ),
      GetUniqueSchema( Described( EType::Array, { { "", Int32() } }, 1 ) ),
      GetUniqueSchema( Described( EType::Array, { { "", Int32() } }, 2 ) ),
      GetUniqueSchema( Enumerated( EType::Enum8, { { "a", 0 } } ) ),
      GetUniqueSchema( Enumerated( EType::Enum16, { { "a", 0 } } ) ),
      GetUniqueSchema( Enumerated( EType::Enum8, { { "a", 1 } } ) ) };
  EXPECT_EQ( Different.size(), 10u );
  EXPECT_EQ( Different.count( nullptr ), 0u );
  // Names of members count in a NamedTuple only.
  EXPECT_EQ( Other( EType::Tuple, "c", ERole::Value ), Other( EType::Tuple, "b", ERole::Value ) );
}

TEST( Schema, WhatIsNotWellFormedIsNotKept )
{
  const ISchema Stray = Described( EType::Int32 );
  const std::pair< std::string, const ISchema* > One{ "", Int32() }, Nothing{ "", GetUniquePodSchema( EType::Void ) };
  const ISchema Refused[] = { Described( EType::Array, { One }, 0 ),
                              Described( EType::Array, {}, 1 ),
                              Described( EType::Array, { One, One }, 1 ),
                              Described( EType::List ),
                              Described( EType::List, { One, One } ),
                              Described( EType::List, { One }, 1 ),
                              Described( EType::List, { Nothing } ),
                              Described( EType::List, { { "", nullptr } } ),
                              Described( EType::List, { { "", &Stray } } ),
                              Described( EType::Tuple ),
                              Described( EType::Tuple, { One, Nothing } ),
                              Described( EType::NamedTuple ),
                              Described( EType::NamedTuple, { { "a", Int32() }, { "b", Int32() }, { "a", Int32() } } ),
                              Described( EType::Int32, { One } ),
                              Described( EType::Int32, {}, 1 ),
                              Described( static_cast< EType >( 20 ) ),
                              Enumerated( EType::Int32, { { "a", 1 } } ),
                              Enumerated( EType::Enum8, {} ),
                              Enumerated( EType::Enum8, { { "a", 128 } } ),
                              Enumerated( EType::Enum8, { { "a", -129 } } ),
                              Enumerated( EType::Enum16, { { "a", 32768 } } ),
                              Enumerated( EType::Enum32, { { "a", 2147483648 } } ),
                              Enumerated( EType::Enum32, { { "a", 1 }, { "a", 2 } } ),
                              Enumerated( EType::Enum32, { { "", 1 } } ),
                              Enumerated( EType::Enum32, { { "-x", 1 } } ),
                              Enumerated( EType::Enum32, { { "1", 2 } } ) };
  for ( const ISchema& rDescription : Refused )
  {
    EXPECT_EQ( GetUniqueSchema( rDescription ), nullptr ) << &rDescription - Refused;
  }
  EXPECT_NE( GetUniqueSchema( Enumerated( EType::Enum8, { { "a", 127 }, { "b", -128 }, { "c", 127 } } ) ), nullptr );
  EXPECT_NE( Nested( 64 ), nullptr );
  EXPECT_EQ( Nested( 65 ), nullptr );
}

TEST( Schema, OneInstanceForAllThreadsAndModules )
{
  constexpr int Threads = 4, Rounds = 2000;
  std::vector< std::vector< const ISchema* > > Made( Threads );
  std::barrier Start( Threads );
  {
    std::vector< std::jthread > Workers;
    for ( auto& rMade : Made )
    {
      Workers.emplace_back(
          [&rMade, &Start]
          {
            Start.arrive_and_wait();
            for ( int Round = 0; Round < Rounds; ++Round )
            {
              rMade.push_back( VRandomValues( 7000 + static_cast< unsigned >( Round ) ).Schema( 4 ) );
            }
          } );
    }
  }
  for ( const auto& rMade : Made )
  {
    EXPECT_EQ( rMade, Made[0] );
  }

  const std::string Library = ( TestSupport::BinaryDir() / "lib" / "libZEKSchemaModule.so" ).string();
  void* const pModule = dlopen( Library.c_str(), RTLD_NOW | RTLD_LOCAL );
  ASSERT_NE( pModule, nullptr ) << dlerror();
  const auto pSchemaOfModule = reinterpret_cast< decltype( &SchemaOfModule ) >( dlsym( pModule, "SchemaOfModule" ) );
  ASSERT_NE( pSchemaOfModule, nullptr );
  EXPECT_EQ( pSchemaOfModule( true ), VSerialiser< float >::Schema() );
  EXPECT_EQ( pSchemaOfModule( false ), ( VSerialiser< std::vector< std::pair< int, std::string > > >::Schema() ) );
  EXPECT_EQ( dlclose( pModule ), 0 );
}

TEST( Schema, JsonHasItsMembersInOrderAndLeavesDefaultsOut )
{
  ISchema Full = Enumerated( EType::Enum8, { { "z", 3 }, { "a\"", -1 } } );
  Full.m_Role = ERole::InputOutput;
  Full.m_Detail = "d";
  Full.m_TypeName = "N::E";
  Full.m_Docs = "line\n";
  Full.m_History = "h";
  const ISchema* const pName = GetUniquePodSchema( EType::String );
  const ISchema* const pNames = GetUniqueSchema( Described( EType::List, { { "", pName } } ) );
  const ISchema* const pRecord =
      GetUniqueSchema( Described( EType::NamedTuple, { { "Name", pName }, { "EnabledSettings", pNames } } ) );
  const std::pair< const ISchema*, const char* > Rows[] = {
      { nullptr, R"({"Type":"Void"})" },
      { Int32(), R"({"Type":"Int32"})" },
      { GetUniqueSchema( Described( EType::Array, { { "", Int32() } }, 3 ) ),
        R"({"Type":"Array","Count":3,"SubSchemas":[{"Type":"Int32"}]})" },
      { GetUniqueSchema( Full ), R"({"Type":"Enum8","Role":"InputOutput","Detail":"d","TypeName":"N::E",)"
                                 R"("EnumValues":{"z":3,"a\"":-1},"Docs":"line\n","History":"h"})" },
      { GetUniqueSchema( Described( EType::List, { { "", pRecord } } ) ),
        R"({"Type":"List","SubSchemas":[{"Type":"NamedTuple","SubSchemas":{"Name":{"Type":"String"},)"
        R"("EnabledSettings":{"Type":"List","SubSchemas":[{"Type":"String"}]}}}]})" } };
  for ( const auto& [pSchema, pJson] : Rows )
  {
    EXPECT_EQ( SchemaToJson( pSchema ), pJson );
    const ISchema* pRead = nullptr;
    EXPECT_TRUE( SchemaFromJson( pJson, pRead ).IsOk() );
    EXPECT_EQ( pRead, pSchema != nullptr ? pSchema : GetUniquePodSchema( EType::Void ) );
  }
}

TEST( Schema, JsonIsReadInAnyOrderAndRefusedWithItsPlace )
{
  const ISchema* pRead = nullptr;
  EXPECT_TRUE( SchemaFromJson( R"( { "SubSchemas" : [ { "Type" : "Int32" } ] , "X" : [ { "y": [] }, {}, "z", -1.5e3 ],
    "Count" : 2 , "Docs" : "d", "Type" : "Array", "EnumValues" : {} } )",
                               pRead )
                   .IsOk() );
  EXPECT_EQ( pRead, GetUniqueSchema( Described( EType::Array, { { "", Int32() } }, 2 ) ) );

  struct VRow
  {
    const char* pJson;
    const char* pError;
    ZEK::IResult::ECode Code = ZEK::IResult::InvalidFormat;
  };
  constexpr auto IllFormed = ZEK::IResult::InvalidType;
  const VRow Rows[] = {
      { "", "expected '{' at position 0" },
      { "[]", "expected '{' at position 0" },
      { "{}", "a schema needs a Type at position 0" },
      { R"({"type":"Int32"})", "a schema needs a Type at position 0" },
      { R"({"Type":"Int33"})", "unknown Type at position 8" },
      { R"({"Type":3})", "expected a string at position 8" },
      { R"({"Type":"Int32","Role":"value"})", "unknown Role at position 23" },
      { R"({"Type":"Int32","Type":"Int8"})", "member given twice at position 16" },
      { R"({"Type":"Int32"} x)", "unexpected text after the end at position 17" },
      { R"({"Type":"Int32",})", "expected a string at position 16" },
      { R"({"Type":"Int32")", "expected ',' or '}' at position 15" },
      { R"({"Type":"Int32)", "the string does not end at position 8" },
      { R"({"Type" "Int32"})", "expected ':' at position 8" },
      { R"({"Type":"Array","Count":-1})", "number out of range at position 24" },
      { R"({"Type":"Array","Count":4294967296})", "number out of range at position 24" },
      { R"({"Type":"Array","Count":1.0})", "expected a whole number at position 24" },
      { R"({"Type":"Enum8","EnumValues":["a"]})", "expected '{' at position 29" },
      { R"({"Type":"List","SubSchemas":{"a":{"Type":"Bool"}}})",
        "SubSchemas are an object for a NamedTuple, else an array at position 0" },
      { R"({"Type":"NamedTuple","SubSchemas":[{"Type":"Bool"}]})",
        "SubSchemas are an object for a NamedTuple, else an array at position 0" },
      { R"({"X":{"a":1,2},"Type":"Bool"})", "expected a string at position 12" },
      { R"({"X":nul,"Type":"Bool"})", "expected a number at position 5" },
      { R"({"Type":"Enum8","EnumValues":{"a":200}})", "an Enum value is outside its width at position 0", IllFormed },
      { R"({"Type":"List","SubSchemas":[{"Type":"List"}]})", "an Array or List needs one sub-schema at position 29",
        IllFormed },
      { R"({"Type":"List","SubSchemas":[{"Type":"Void"}]})", "Void stands inside another type at position 0",
        IllFormed } };
  for ( const VRow& rRow : Rows )
  {
    VTextError Error;
    pRead = Int32();
    EXPECT_EQ( SchemaFromJson( rRow.pJson, pRead, &Error ), rRow.Code ) << rRow.pJson;
    EXPECT_EQ( Error.Text(), rRow.pError ) << rRow.pJson;
    EXPECT_EQ( pRead, nullptr ) << rRow.pJson;
  }

  for ( const std::size_t Levels : { 64u, 65u, 100000u } )
  {
    std::string Deep, Ends, Unknown = R"({"Type":"Bool","X":)";
    for ( std::size_t Level = 0; Level < Levels; ++Level )
    {
      Deep += R"({"Type":"List","SubSchemas":[)";
      Ends += "]}";
    }
    const auto Result = SchemaFromJson( Deep + R"({"Type":"Bool"})" + Ends, pRead );
    EXPECT_EQ( Result, Levels <= 64 ? ZEK::IResult::Ok : ZEK::IResult::InvalidType );
    Unknown += std::string( Levels, '[' ) + std::string( Levels, ']' ) + '}';
    EXPECT_TRUE( SchemaFromJson( Unknown, pRead ).IsOk() );
  }
}

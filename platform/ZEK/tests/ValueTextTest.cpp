#include "RandomValues.h"

#include <ZEK/Serialiser.h>
#include <ZEK/TypedValueText.h>

#include <gtest/gtest.h>

#include <limits>

using namespace ZEK::IO;

namespace
{
/// The schema of a JSON text that is right.
const ISchema* Schema( const std::string& i_rJson )
{
  const ISchema* pSchema = nullptr;
  VTextError Error;
  EXPECT_TRUE( SchemaFromJson( i_rJson, pSchema, &Error ).IsOk() ) << Error.Text();
  return pSchema;
}

const ISchema* Colour()
{
  return Schema( R"({"Type":"Enum8","EnumValues":{"Red":1,"Rouge":1," b c ":2,"\"Red\"":3}})" );
}

const ISchema* Record()
{
  return Schema( R"({"Type":"NamedTuple","SubSchemas":{"Name":{"Type":"String"},"Count":{"Type":"UInt8"},
    "C":{"Type":"Enum8","EnumValues":{"Red":1}}}})" );
}

ZEK::VTypedValue EnumValue( std::int8_t i_Number )
{
  return { Colour(), VValueBytes( &i_Number, 1 ) };
}

bool HoldsFloat( const ISchema& i_rSchema )
{
  const auto InSub = []( const auto& i_rSub )
  {
    return HoldsFloat( *i_rSub.second );
  };
  return i_rSchema.m_Type == EType::Float32 || i_rSchema.m_Type == EType::Float64 ||
         std::any_of( i_rSchema.m_SubSchemas.begin(), i_rSchema.m_SubSchemas.end(), InSub );
}

/// One random change of a text or of bytes.
std::string Damaged( std::string i_Text, VRandomValues& io_rRandom )
{
  static const std::string Bytes( "{}[]\",:-+.eE0129 \\utrflsn\xff\0", 27 );
  const std::size_t At = io_rRandom.Below( i_Text.size() + 1 );
  switch ( io_rRandom.Below( 4 ) )
  {
  case 0:
    return i_Text.substr( 0, At );
  case 1:
    return i_Text.erase( At, 1 + io_rRandom.Below( 3 ) );
  case 2:
    return i_Text.replace( At, 1, 1, Bytes[io_rRandom.Below( Bytes.size() )] );
  default:
    return i_Text.insert( At, 1, Bytes[io_rRandom.Below( Bytes.size() )] );
  }
}
} // namespace

TEST( ValueText, EveryKindHasItsText )
{
  const std::vector< std::pair< ZEK::VTypedValue, std::string > > Rows{
      { MakeValue( true ), "true" },
      { MakeValue( std::int8_t{ -128 } ), "-128" },
      { MakeValue( std::numeric_limits< std::int64_t >::min() ), "-9223372036854775808" },
      { MakeValue( std::numeric_limits< std::uint64_t >::max() ), "18446744073709551615" },
      { MakeValue( 0.1f ), "0.1" },
      { MakeValue( 0.1 ), "0.1" },
      { MakeValue( 1e300 ), "1e+300" },
      { MakeValue( -0.0 ), "0" },
      { MakeValue( 5e-324 ), "5e-324" },
      { MakeValue( "" ), R"("")" },
      { MakeValue( "a\"\\/\n\t\x01\x10\x1f\xc3\xa9\xff" ), "\"a\\\"\\\\/\\n\\t\\u0001\\u0010\\u001f\xc3\xa9\xff\"" },
      { MakeValue( std::vector< int >{} ), "[]" },
      { MakeValue( std::vector< int >{ 1, -2 } ), "[1,-2]" },
      { MakeValue( std::array< bool, 2 >{ true, false } ), "[true,false]" },
      { MakeValue( std::tuple< int, std::string, std::vector< float > >( 1, "x", { 1.5f } ) ), R"([1,"x",[1.5]])" },
      { EnumValue( 1 ), "Red" },
      { EnumValue( 2 ), " b c " },
      { EnumValue( 3 ), "\"Red\"" },
      { EnumValue( -7 ), "-7" } };
  for ( const auto& [rValue, rText] : Rows )
  {
    std::string Text;
    EXPECT_TRUE( ValueToText( rValue, Text ) ) << rText;
    EXPECT_EQ( Text, rText );
    ZEK::VTypedValue Read;
    VTextError Error;
    EXPECT_TRUE( ValueFromText( rValue.m_pSchema, rText, Read, &Error ) ) << rText << ' ' << Error.Text();
    EXPECT_EQ( Read, rValue ) << rText;
  }
  ZEK::VTypedValue Red;
  EXPECT_TRUE( ValueFromText( Record(), "{\"C\" : 1,\n\t\"Name\":\"\\u00e9\\ud83d\\ude00\\/\", \"Count\":2 } ", Red ) );
  std::string Text;
  EXPECT_TRUE( ValueToText( Red, Text ) );
  EXPECT_EQ( Text, "{\"Name\":\"\xc3\xa9\xf0\x9f\x98\x80/\",\"Count\":2,\"C\":\"Red\"}" );
  for ( const char* pText : { "Red", " Red\n", "Rouge", "1" } )
  {
    EXPECT_TRUE( ValueFromText( Colour(), pText, Red ) && Red == EnumValue( 1 ) ) << pText;
  }
}

TEST( ValueText, WhatHasNoTextHasNone )
{
  const double Infinite = std::numeric_limits< double >::infinity();
  for ( const ZEK::VTypedValue& rValue :
        { MakeValue( Infinite ), MakeValue( std::vector< float >{ 1, -HUGE_VALF } ), MakeValue( std::nan( "" ) ),
          ZEK::VTypedValue(), ZEK::VTypedValue( GetUniquePodSchema( EType::Int32 ), {} ),
          ZEK::VTypedValue( GetUniquePodSchema( EType::Bool ), VValueBytes( "\2", 1 ) ),
          ZEK::VTypedValue( GetUniquePodSchema( EType::Int8 ), VValueBytes( "\2\2", 2 ) ) } )
  {
    std::string Text = "old";
    EXPECT_FALSE( ValueToText( rValue, Text ) );
    EXPECT_EQ( Text, "" );
  }
}

TEST( ValueText, BadTextsAreRefusedWithTheirPlace )
{
  struct VRow
  {
    const ISchema* pSchema;
    const char* pText;
    const char* pError;
  };
  const ISchema* const pBool = GetUniquePodSchema( EType::Bool );
  const ISchema* const pInt8 = GetUniquePodSchema( EType::Int8 );
  const ISchema* const pUInt64 = GetUniquePodSchema( EType::UInt64 );
  const ISchema* const pFloat = GetUniquePodSchema( EType::Float32 );
  const ISchema* const pString = GetUniquePodSchema( EType::String );
  const ISchema* const pList = VSerialiser< std::vector< std::int8_t > >::Schema();
  const ISchema* const pArray = VSerialiser< std::array< bool, 2 > >::Schema();
  const ISchema* const pTuple = VSerialiser< std::pair< bool, std::string > >::Schema();
  const VRow Rows[] = { { nullptr, "1", "Void has no text at position 0" },
                        { pBool, "", "expected true or false at position 0" },
                        { pBool, " True", "expected true or false at position 1" },
                        { pBool, "truex", "unexpected text after the end at position 4" },
                        { pInt8, "128", "number out of range at position 0" },
                        { pInt8, " -129", "number out of range at position 1" },
                        { pInt8, "1.0", "expected a whole number at position 0" },
                        { pInt8, "1e1", "expected a whole number at position 0" },
                        { pInt8, "+1", "expected a number at position 0" },
                        { pInt8, "01", "unexpected text after the end at position 1" },
                        { pInt8, "\"1\"", "expected a number at position 0" },
                        { pUInt64, "-1", "number out of range at position 0" },
                        { pUInt64, "18446744073709551616", "number out of range at position 0" },
                        { pFloat, "1e39", "number out of range at position 0" },
                        { pFloat, "nan", "expected a number at position 0" },
                        { pFloat, "1.", "expected a number at position 0" },
                        { pFloat, "1e", "expected a number at position 0" },
                        { pFloat, ".5", "expected a number at position 0" },
                        { pString, "a", "expected a string at position 0" },
                        { pString, "\"a", "the string does not end at position 0" },
                        { pString, "\"a\n\"", "control character in a string at position 2" },
                        { pString, "\"a\\x\"", "unknown escape at position 2" },
                        { pString, "\"\\u12g4\"", "expected four hexadecimal digits at position 3" },
                        { pString, "\"\\u12", "expected four hexadecimal digits at position 3" },
                        { pString, "\"\\ud800\"", "half a surrogate pair at position 1" },
                        { pString, "\"\\ud800\\u0041\"", "half a surrogate pair at position 1" },
                        { pString, "\"\\udc00\"", "half a surrogate pair at position 1" },
                        { pString, "\"\\", "unknown escape at position 1" },
                        { pList, "[1,2", "expected ',' or ']' at position 4" },
                        { pList, "[1,]", "expected a number at position 3" },
                        { pList, "[1 2]", "expected ',' or ']' at position 3" },
                        { pList, "[1,[2]]", "expected a number at position 3" },
                        { pList, "{}", "expected '[' at position 0" },
                        { pArray, "[true]", "fewer elements than 2 at position 0" },
                        { pArray, "[]", "fewer elements than 2 at position 0" },
                        { pArray, "[true,true,true]", "more elements than 2 at position 11" },
                        { pTuple, "[\"a\",true]", "expected true or false at position 1" },
                        { pTuple, "[true]", "fewer elements than 2 at position 0" },
                        { Record(), "{\"Name\":\"\",\"Count\":1}", "the member \"C\" is missing at position 0" },
                        { Record(), "{\"Name\":\"\",\"Name\":\"\"}", "member given twice at position 11" },
                        { Record(), "{\"Name\":\"\",\"X\":1}", "no such member in the NamedTuple at position 11" },
                        { Record(), "{\"C\":\"Blue\"}", "no such name in the Enum at position 5" },
                        { Record(), "{\"C\":Red}", "expected a number at position 5" },
                        { Record(), "{\"Count\":256}", "number out of range at position 9" },
                        { Record(), "[]", "expected '{' at position 0" },
                        { Colour(), "Blue", "expected a number at position 0" },
                        { Colour(), "200", "number out of range at position 0" },
                        { Colour(), "", "expected a number at position 0" } };
  for ( const VRow& rRow : Rows )
  {
    ZEK::VTypedValue Value = MakeValue( 1 );
    VTextError Error;
    EXPECT_FALSE( ValueFromText( rRow.pSchema, rRow.pText, Value, &Error ) ) << rRow.pText;
    EXPECT_EQ( Error.Text(), rRow.pError ) << rRow.pText;
    EXPECT_TRUE( Value.IsEmpty() && Value.m_pSchema == rRow.pSchema ) << rRow.pText;
  }
}

TEST( ValueText, RandomValuesComeBack )
{
  for ( std::uint64_t Seed = 1; Seed <= 1500; ++Seed )
  {
    SCOPED_TRACE( Seed );
    VRandomValues Random( Seed );
    const ISchema* const pSchema = Random.Schema( 4 );
    ASSERT_NE( pSchema, nullptr );
    const ISchema* pRead = nullptr;
    ASSERT_TRUE( SchemaFromJson( SchemaToJson( pSchema ), pRead ).IsOk() );
    ASSERT_EQ( pRead, pSchema );

    const ZEK::VTypedValue Value = Random.Value( pSchema );
    ASSERT_TRUE( IsWellFormed( Value ) );
    std::string Text;
    ASSERT_TRUE( ValueToText( Value, Text ) );
    ZEK::VTypedValue Read;
    VTextError Error;
    ASSERT_TRUE( ValueFromText( pSchema, Text, Read, &Error ) ) << Text << '\n' << Error.Text();
    ASSERT_EQ( Read, Value ) << Text;
    for ( std::size_t Size = 0; Size < Value.m_Data.Size(); ++Size )
    {
      const ZEK::VTypedValue Cut( pSchema, VValueBytes( Value.m_Data.Data(), Size ) );
      ASSERT_FALSE( IsWellFormed( Cut ) || ValueToText( Cut, Text ) ) << Size;
    }
  }
}

TEST( ValueText, RandomBytesAreAValueOrRefused )
{
  using VMixed = std::vector< std::tuple< bool, std::string, std::optional< std::int16_t >, std::wstring > >;
  const ISchema* const pMixed = VSerialiser< VMixed >::Schema();
  std::size_t Good = 0;
  for ( std::uint64_t Seed = 1; Seed <= 3000; ++Seed )
  {
    SCOPED_TRACE( Seed );
    VRandomValues Random( Seed );
    const ISchema* const pSchema = Seed % 2 != 0 ? pMixed : Random.Schema( 3 );
    const ZEK::VTypedValue Whole = Random.Value( pSchema );
    std::string Bytes( Whole.m_Data.begin(), Whole.m_Data.end() );
    for ( std::uint64_t Changes = Random.Below( 4 ); Changes > 0 && !Bytes.empty(); --Changes )
    {
      Bytes = Seed % 3 != 0 ? Damaged( Bytes, Random ) : std::string( Random.Text( 24 ) );
    }
    const ZEK::VTypedValue Value( pSchema, VValueBytes( Bytes.data(), Bytes.size() ) );
    const bool bGood = IsWellFormed( Value );
    Good += bGood ? 1 : 0;
    std::string Text;
    const bool bText = ValueToText( Value, Text );
    EXPECT_TRUE( bText == bGood || ( bGood && HoldsFloat( *pSchema ) ) );
    ZEK::VTypedValue Again;
    EXPECT_EQ( ValueFromText( pSchema, Text, Again ), bText );
    EXPECT_TRUE( !bText || HoldsFloat( *pSchema ) || Again == Value );
    VMixed Mixed;
    if ( ReadTyped( Value, Mixed ) )
    {
      EXPECT_TRUE( bGood );
      EXPECT_EQ( MakeValue( Mixed ).Schema(), pSchema );
    }
  }
  EXPECT_GT( Good, 500u );
  EXPECT_LT( Good, 2500u );
}

TEST( ValueText, DamagedTextsAreReadOrRefusedWithAPlace )
{
  std::size_t Read = 0;
  for ( std::uint64_t Seed = 1; Seed <= 3000; ++Seed )
  {
    SCOPED_TRACE( Seed );
    VRandomValues Random( Seed );
    const ISchema* const pSchema = Random.Schema( 3 );
    std::string Text, Json = SchemaToJson( pSchema );
    ASSERT_TRUE( ValueToText( Random.Value( pSchema ), Text ) );
    for ( std::uint64_t Changes = 0; Changes <= Random.Below( 3 ); ++Changes )
    {
      Text = Damaged( Text, Random );
      Json = Damaged( Json, Random );
    }
    VTextError Error;
    ZEK::VTypedValue Value;
    if ( ValueFromText( pSchema, Text, Value, &Error ) )
    {
      ++Read;
      EXPECT_TRUE( IsWellFormed( Value ) );
      std::string Again;
      ASSERT_TRUE( ValueToText( Value, Again ) );
      ZEK::VTypedValue Same;
      EXPECT_TRUE( ValueFromText( pSchema, Again, Same ) && Same == Value );
    }
    else
    {
      EXPECT_TRUE( Value.IsEmpty() && !Error.m_Message.empty() && Error.m_Position <= Text.size() ) << Text;
    }
    VTextError JsonError;
    const ISchema* pOther = nullptr;
    if ( SchemaFromJson( Json, pOther, &JsonError ).IsOk() )
    {
      const ISchema* pSame = nullptr;
      EXPECT_TRUE( SchemaFromJson( SchemaToJson( pOther ), pSame ).IsOk() && pSame == pOther );
    }
    else
    {
      EXPECT_TRUE( pOther == nullptr && !JsonError.m_Message.empty() && JsonError.m_Position <= Json.size() ) << Json;
    }
  }
  EXPECT_GT( Read, 100u );
}

TEST( ValueText, Versions )
{
  const std::pair< const char*, bool > Rows[] = { { "3.0", true },   { "12.345", true }, { "3", false },
                                                  { "3.", false },   { ".0", false },    { "3.0.1", false },
                                                  { "", false },     { "-3.0", false },  { " 3.0", false },
                                                  { "3.0 ", false }, { "3.x", false },   { "99999999999.0", false } };
  for ( const auto& [pText, bGood] : Rows )
  {
    VVersion Version{ 7, 7 };
    EXPECT_EQ( VersionFromText( pText, Version ), bGood ) << pText;
    EXPECT_EQ( VersionToText( Version ), bGood ? pText : "7.7" );
  }
  EXPECT_LT( ( VVersion{ 2, 9 } ), ( VVersion{ 3, 0 } ) );
  EXPECT_LT( ( VVersion{ 3, 0 } ), ( VVersion{ 3, 1 } ) );
}

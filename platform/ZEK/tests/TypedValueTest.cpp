#include "RandomValues.h"

#include <ZEK/Serialiser.h>

#include <gtest/gtest.h>

#include <limits>

using namespace ZEK::IO;

namespace
{
enum class EShade : std::uint8_t
{
  Dark = 1,
  Light = 200
};

struct VPreset
{
  std::string m_Name;
  std::vector< EShade > m_Shades;
  std::optional< double > m_Width;
  bool operator==( const VPreset& ) const = default;
};

std::string Hex( const VValueBytes& i_rBytes )
{
  std::string Text;
  for ( const std::uint8_t Byte : i_rBytes )
  {
    Text += "0123456789abcdef"[Byte >> 4];
    Text += "0123456789abcdef"[Byte & 15];
  }
  return Text;
}

template < typename T >
void ThereAndBack( const T& i_rValue, EType i_Type, const std::string& i_rHex )
{
  SCOPED_TRACE( i_rHex );
  const ZEK::VTypedValue Value = MakeValue( i_rValue );
  ASSERT_EQ( Value.Schema()->m_Type, i_Type );
  EXPECT_EQ( Hex( Value.m_Data ), i_rHex );
  EXPECT_TRUE( IsWellFormed( Value ) );
  EXPECT_EQ( Value.m_Data.HeapBytes() != 0, Value.m_Data.Size() > 16 );
  T Read{};
  EXPECT_TRUE( ReadTyped( Value, Read ) );
  EXPECT_EQ( Read, i_rValue );

  // Neither fewer bytes nor more are a value, and a failure changes nothing.
  ZEK::VTypedValue Longer = Value;
  Longer.m_Data.Append( "", 1 );
  EXPECT_FALSE( ReadTyped( Longer, Read ) || IsWellFormed( Longer ) );
  for ( std::size_t Size = 0; Size < Value.m_Data.Size(); ++Size )
  {
    const ZEK::VTypedValue Shorter( Value.m_pSchema, VValueBytes( Value.m_Data.Data(), Size ) );
    EXPECT_FALSE( ReadTyped( Shorter, Read ) || IsWellFormed( Shorter ) ) << Size;
  }
  EXPECT_EQ( Read, i_rValue );
  std::tuple< T, bool > Other;
  EXPECT_FALSE( ReadTyped( Value, Other ) );
}
} // namespace

template <>
struct ZEK::IO::VSerialiser< EShade > : VEnumSerialiser< EShade >
{
  static constexpr const char* TypeName = "EShade";
  static constexpr VEnumerator< EShade > Values[]{ { "Dark", EShade::Dark }, { "Light", EShade::Light } };
};
template <>
struct ZEK::IO::VSerialiser< VPreset > : VRecordSerialiser< VPreset >
{
  static constexpr const char* TypeName = "VPreset";
  static constexpr std::tuple Members{ Member( "Name", &VPreset::m_Name ), Member( "Shades", &VPreset::m_Shades ),
                                       Member( "Width", &VPreset::m_Width ) };
};

TEST( TypedValue, EveryTypeHasItsBytes )
{
  ThereAndBack( true, EType::Bool, "01" );
  ThereAndBack( std::int8_t{ -2 }, EType::Int8, "fe" );
  ThereAndBack( std::int16_t{ -2 }, EType::Int16, "feff" );
  ThereAndBack( std::int32_t{ 0x01020304 }, EType::Int32, "04030201" );
  ThereAndBack( std::int64_t{ -2 }, EType::Int64, "feffffffffffffff" );
  ThereAndBack( std::uint8_t{ 255 }, EType::UInt8, "ff" );
  ThereAndBack( std::uint16_t{ 0x102 }, EType::UInt16, "0201" );
  ThereAndBack( std::uint32_t{ 300 }, EType::UInt32, "2c010000" );
  ThereAndBack( std::uint64_t{ 1 }, EType::UInt64, "0100000000000000" );
  ThereAndBack( 1ll, EType::Int64, "0100000000000000" );
  ThereAndBack( 1.5f, EType::Float32, "0000c03f" );
  ThereAndBack( -2.0, EType::Float64, "00000000000000c0" );
  ThereAndBack( std::string(), EType::String, "00000000" );
  ThereAndBack( std::string( "a\0\xff", 3 ), EType::String, "030000006100ff" );
  ThereAndBack( std::wstring( L"\u00e9\U0001f600" ), EType::String, "06000000c3a9f09f9880" );
  ThereAndBack( std::vector< std::int16_t >{}, EType::List, "00000000" );
  ThereAndBack( std::vector< std::int16_t >{ 1, -1 }, EType::List, "020000000100ffff" );
  ThereAndBack( std::vector< bool >{ true, false }, EType::List, "020000000100" );
  ThereAndBack( std::vector< std::string >{ "a", "" }, EType::List, "02000000010000006100000000" );
  ThereAndBack( std::array< float, 2 >{ 1, 2 }, EType::Array, "0000803f00000040" );
  ThereAndBack( std::pair< std::int8_t, std::string >( 1, "b" ), EType::Tuple, "010100000062" );
  ThereAndBack(
      std::tuple< bool, std::array< std::uint8_t, 2 >, std::vector< std::uint64_t > >( true, { 7, 8 }, { 9 } ),
      EType::Tuple, "010708010000000900000000000000" );
  ThereAndBack( std::optional< std::int16_t >(), EType::List, "00000000" );
  ThereAndBack( std::optional< std::int16_t >( 5 ), EType::List, "010000000500" );
  ThereAndBack( EShade::Light, EType::Enum8, "c8" );
  ThereAndBack( VPreset{ "x", { EShade::Dark, static_cast< EShade >( 3 ) }, 1.0 }, EType::NamedTuple,
                "010000007802000000010301000000000000000000f03f" );
  EXPECT_EQ( VSerialiser< VPreset >::Schema()->m_SubSchemas[1].first, "Shades" );
  EXPECT_EQ( VSerialiser< EShade >::Schema()->m_EnumValues[1].second, -56 );
  EXPECT_EQ( MakeValue( "text" ), MakeValue( std::string( "text" ) ) );
}

TEST( TypedValue, EqualNumbersHaveEqualBytes )
{
  const auto NaN = []( std::uint64_t i_Payload )
  {
    return std::bit_cast< double >( 0xfff0000000000000 | i_Payload );
  };
  EXPECT_EQ( Hex( MakeValue( NaN( 1 ) ).m_Data ), "000000000000f87f" );
  EXPECT_EQ( MakeValue( NaN( 1 ) ), MakeValue( NaN( 0x8000000000001 ) ) );
  EXPECT_EQ( Hex( MakeValue( -std::numeric_limits< float >::quiet_NaN() ).m_Data ), "0000c07f" );
  EXPECT_EQ( Hex( MakeValue( -0.0f ).m_Data ), "00000000" );
  EXPECT_EQ( MakeValue( std::vector< double >{ -0.0, NaN( 5 ) } ),
             MakeValue( std::vector< double >{ 0.0, NaN( 6 ) } ) );
  EXPECT_EQ( MakeValue( std::optional( -0.0 ) ), MakeValue( std::optional( 0.0 ) ) );
}

TEST( TypedValue, EqualityTakesNoSchemaForVoid )
{
  const ZEK::VTypedValue None, Void( GetUniquePodSchema( EType::Void ), {} );
  const ZEK::VTypedValue EmptyInt( GetUniquePodSchema( EType::Int32 ), {} );
  EXPECT_TRUE( None == Void && Void == None && None.IsEmpty() && IsWellFormed( None ) );
  EXPECT_FALSE( None == EmptyInt || EmptyInt == Void || IsWellFormed( EmptyInt ) );
  EXPECT_FALSE( MakeValue( 1 ) == MakeValue( 1u ) || MakeValue( 1 ) == MakeValue( 2 ) );
  std::int32_t Kept = 7;
  EXPECT_FALSE( ReadTyped( None, Kept ) || ReadTyped( EmptyInt, Kept ) || ReadTyped( MakeValue( 1u ), Kept ) );
  EXPECT_EQ( Kept, 7 );
}

TEST( TypedValue, BadBytesAreRefused )
{
  bool bRead = false;
  std::vector< bool > Bools;
  std::vector< VPreset > Presets;
  std::optional< bool > Maybe;
  const auto Damaged = []( auto i_Value, std::size_t i_At, std::uint8_t i_Byte )
  {
    ZEK::VTypedValue Value = MakeValue( i_Value );
    Value.m_Data.Data()[i_At] = i_Byte;
    return Value;
  };
  const ZEK::VTypedValue BadBool = Damaged( true, 0, 2 );
  EXPECT_FALSE( ReadTyped( BadBool, bRead ) || IsWellFormed( BadBool ) );
  const ZEK::VTypedValue BadBools = Damaged( std::vector< bool >{ true }, 4, 0xff );
  EXPECT_FALSE( ReadTyped( BadBools, Bools ) || IsWellFormed( BadBools ) );
  // A count or a length that is a lie costs no memory.
  const ZEK::VTypedValue BadCount = Damaged( std::vector< VPreset >( 1 ), 3, 0xff );
  EXPECT_FALSE( ReadTyped( BadCount, Presets ) || IsWellFormed( BadCount ) );
  const ZEK::VTypedValue BadLength = Damaged( std::vector< VPreset >( 1 ), 7, 0xff );
  EXPECT_FALSE( ReadTyped( BadLength, Presets ) || IsWellFormed( BadLength ) );
  // Two elements are a List, but no optional, whatever follows.
  std::pair< std::optional< bool >, bool > Pair;
  EXPECT_FALSE( ReadTyped( Damaged( std::pair( std::vector< bool >{ true }, true ), 0, 2 ), Pair ) );
  EXPECT_FALSE( ReadTyped( MakeValue( std::vector< bool >{ true, true } ), Maybe ) );
}

TEST( TypedValue, WideTextsReplaceWhatHasNoForm )
{
  const std::pair< const char*, std::wstring > Rows[] = {
      { "\xc3\xa9z", L"\u00e9z" },
      { "\xff", L"\ufffd" },
      { "\xc3", L"\ufffd" },
      { "\xc0\x80", L"\ufffd\ufffd" },                     // a long form of NUL
      { "\xed\xa0\x80", L"\ufffd\ufffd\ufffd" },           // a surrogate
      { "\xf4\x90\x80\x80", L"\ufffd\ufffd\ufffd\ufffd" }, // beyond the last character
      { "\xe2\x82"
        "a",
        L"\ufffd\ufffd"
        L"a" },
      { "\xf0\x90\x80\x80", L"\U00010000" },
      { "\xe0\x9f\xbf", L"\ufffd\ufffd\ufffd" } };
  for ( const auto& [pBytes, rWide] : Rows )
  {
    EXPECT_EQ( Utf8ToWide( pBytes ), rWide ) << pBytes;
  }
  EXPECT_EQ( Utf8ToWide( std::string_view( "\xc3\xa9", 1 ) ), L"\ufffd" );
  EXPECT_EQ( WideToUtf8( std::wstring{ static_cast< wchar_t >( 0xd800 ), L'a' } ), "\xef\xbf\xbd"
                                                                                   "a" );
  for ( std::uint32_t Character = 1; Character <= 0x10ffff; Character += 97 )
  {
    const std::wstring Wide( 1, static_cast< wchar_t >( Character ) );
    EXPECT_EQ( Utf8ToWide( WideToUtf8( Wide ) ), Character >> 11 == 27 ? L"\ufffd" : Wide ) << Character;
  }
}

TEST( TypedValue, BytesAreCopiedMovedAndGrownWhole )
{
  VRandomValues Random( 11 );
  std::vector< VValueBytes > Slots( 4 );
  std::vector< std::string > Model( 4 );
  for ( int Step = 0; Step < 4000; ++Step )
  {
    const std::size_t A = Random.Below( 4 ), B = Random.Below( 4 );
    switch ( Random.Below( 5 ) )
    {
    case 0:
      Slots[A] = Slots[B];
      Model[A] = Model[B];
      break;
    case 1:
      Slots[A] = std::move( Slots[B] );
      Model[A] = std::exchange( Model[B], A == B ? Model[B] : "" );
      break;
    case 2:
      Slots[A].Clear();
      Model[A].clear();
      break;
    default:
      const std::string More = Random.Text( 20 );
      Slots[A].Append( More.data(), More.size() );
      Model[A] += More;
    }
    for ( std::size_t Slot = 0; Slot < 4; ++Slot )
    {
      ASSERT_EQ( std::string( Slots[Slot].begin(), Slots[Slot].end() ), Model[Slot] ) << Step;
      ASSERT_EQ( Slots[A] == Slots[Slot], Model[A] == Model[Slot] ) << Step;
    }
  }
  EXPECT_THROW( Slots[0].Append( Slots[1].begin(), std::size_t{ 1 } << 32 ), std::length_error );
}

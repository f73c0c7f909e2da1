#pragma once

#include <ZEK/TypedValue.h>

#include <array>
#include <bit>
#include <cmath>
#include <cstring>
#include <random>
#include <string>
#include <vector>

/// Makes schemas and values of every kind from a seed. The bytes are put together here by hand, so that they also
/// check the rules of the program.
class VRandomValues
{
public:
  explicit VRandomValues( std::uint64_t i_Seed )
    : m_Engine( i_Seed )
  {
  }

  std::uint64_t Below( std::uint64_t i_Limit ) { return m_Engine() % i_Limit; }

  std::string Text( std::size_t i_Most, bool i_bPlain = false )
  {
    static const std::string Letters = "abcXYZ _019.*/{}[]\",:\\\t\n\r\b\f\x01\x1f\x7f\xc3\xa9\xff\x80";
    std::string Made;
    for ( std::uint64_t Left = Below( i_Most + 1 ); Left > 0; --Left )
    {
      const char Letter = Letters[Below( i_bPlain ? 6 : Letters.size() )];
      Made += i_bPlain || Below( 40 ) != 0 ? Letter : '\0';
    }
    return Made;
  }

  const ZEK::IO::ISchema* Schema( int i_Depth )
  {
    using ZEK::IO::EType;
    ZEK::IO::ISchema Description;
    const std::uint64_t Kind = Below( i_Depth > 0 ? 19 : 15 );
    Description.m_Type = static_cast< EType >( Kind < 12 ? Kind + 1 : Kind < 15 ? Kind + 5 : Kind - 2 );
    if ( Kind >= 12 && Kind < 15 )
    {
      for ( std::uint64_t Index = 0; Index <= Below( 4 ); ++Index )
      {
        const auto Value = static_cast< std::int8_t >( Below( 256 ) );
        Description.m_EnumValues.emplace_back( std::string( "E" ).append( Text( 5 ) ).append( std::to_string( Index ) ),
                                               Value );
      }
    }
    else if ( Kind >= 15 )
    {
      const bool bTuple = Description.m_Type == EType::Tuple || Description.m_Type == EType::NamedTuple;
      Description.m_Count = Description.m_Type == EType::Array ? 1 + static_cast< std::uint32_t >( Below( 3 ) ) : 0;
      for ( std::uint64_t Index = 0; Index <= ( bTuple ? Below( 4 ) : 0 ); ++Index )
      {
        Description.m_SubSchemas.emplace_back( Text( 5 ) + std::to_string( Index ), Schema( i_Depth - 1 ) );
      }
    }
    return ZEK::IO::GetUniqueSchema( Description );
  }

  ZEK::VTypedValue Value( const ZEK::IO::ISchema* i_pSchema )
  {
    ZEK::VTypedValue Made( i_pSchema, {} );
    Put( *i_pSchema, Made.m_Data );
    return Made;
  }

private:
  template < typename T >
  static void Append( T i_Value, ZEK::IO::VValueBytes& io_rBytes )
  {
    io_rBytes.Append( &i_Value, sizeof( T ) );
  }
  template < typename T >
  T Number()
  {
    T Value;
    do
    {
      const std::uint64_t Bits = m_Engine();
      std::memcpy( &Value, &Bits, sizeof( T ) );
    } while ( !std::isfinite( Value ) );
    return Below( 3 ) == 0 ? T( static_cast< int >( Below( 2000 ) ) - 1000 ) / 8 : Value;
  }

  void Put( const ZEK::IO::ISchema& i_rSchema, ZEK::IO::VValueBytes& io_rBytes )
  {
    using ZEK::IO::EType;
    // The width of a plain type by its code; 0 for those with a rule of their own.
    constexpr std::array< std::uint8_t, 20 > Widths{ 0, 0, 1, 2, 4, 8, 1, 2, 4, 8, 0, 0, 0, 0, 0, 0, 0, 1, 2, 4 };
    std::uint64_t Bits = m_Engine();
    std::uint32_t Count = i_rSchema.m_Count;
    switch ( i_rSchema.m_Type )
    {
    case EType::Bool:
      return Append( static_cast< std::uint8_t >( Bits & 1 ), io_rBytes );
    case EType::Float32:
      return Append( Number< float >(), io_rBytes );
    case EType::Float64:
      return Append( Number< double >(), io_rBytes );
    case EType::String:
    {
      const std::string Made = Text( 30 );
      Append( static_cast< std::uint32_t >( Made.size() ), io_rBytes );
      return io_rBytes.Append( Made.data(), Made.size() );
    }
    case EType::List:
      Count = static_cast< std::uint32_t >( Below( 4 ) );
      Append( Count, io_rBytes );
      [[fallthrough]];
    case EType::Array:
      for ( ; Count > 0; --Count )
      {
        Put( *i_rSchema.m_SubSchemas[0].second, io_rBytes );
      }
      return;
    case EType::Tuple:
    case EType::NamedTuple:
      for ( const auto& rSub : i_rSchema.m_SubSchemas )
      {
        Put( *rSub.second, io_rBytes );
      }
      return;
    default:
      if ( !i_rSchema.m_EnumValues.empty() && Below( 4 ) != 0 )
      {
        Bits = static_cast< std::uint64_t >( i_rSchema.m_EnumValues[Below( i_rSchema.m_EnumValues.size() )].second );
      }
      io_rBytes.Append( &Bits, Widths[static_cast< std::size_t >( i_rSchema.m_Type )] );
    }
  }

  std::mt19937_64 m_Engine;
};

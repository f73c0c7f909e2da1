#pragma once

#include <ZEK/SerialiserScalar.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <optional>
#include <tuple>
#include <utility>
#include <vector>

namespace ZEK::IO
{

/// The schema of a container of one type; a count makes it an Array.
template < typename T >
const ISchema* ContainerSchema( EType i_Type, std::size_t i_Count = 0 )
{
  ISchema Description;
  Description.m_Type = i_Type;
  Description.m_Count = static_cast< std::uint32_t >( i_Count );
  Description.m_SubSchemas.emplace_back( "", VSerialiser< T >::Schema() );
  return GetUniqueSchema( Description );
}

/// A List.
template < typename T >
struct VSerialiser< std::vector< T > >
{
  static const ISchema* Schema()
  {
    static const ISchema* const pSchema = ContainerSchema< T >( EType::List );
    return pSchema;
  }
  static void Write( const std::vector< T >& i_rValue, VByteWriter& io_rWriter )
  {
    io_rWriter.PutCount( i_rValue.size() );
    if constexpr ( bAsTheyLie )
    {
      io_rWriter.PutRaw( i_rValue.data(), i_rValue.size() * sizeof( T ) );
    }
    else
    {
      for ( const auto& rElement : i_rValue )
      {
        VSerialiser< T >::Write( rElement, io_rWriter );
      }
    }
  }
  static bool Read( VByteReader& io_rReader, std::vector< T >& o_rValue )
  {
    o_rValue.clear();
    std::uint32_t Count = 0;
    // Every element has a byte at least: a count that is a lie costs no memory.
    if ( !io_rReader.Get( Count ) || Count > io_rReader.Left() )
    {
      return false;
    }
    if constexpr ( bAsTheyLie )
    {
      const std::uint8_t* const pBytes = io_rReader.Take( std::size_t{ Count } * sizeof( T ) );
      if ( pBytes != nullptr && Count != 0 )
      {
        o_rValue.resize( Count );
        std::memcpy( o_rValue.data(), pBytes, Count * sizeof( T ) );
      }
      return pBytes != nullptr;
    }
    else
    {
      for ( std::uint32_t Index = 0; Index < Count; ++Index )
      {
        T Element{};
        if ( !VSerialiser< T >::Read( io_rReader, Element ) )
        {
          return false;
        }
        o_rValue.push_back( std::move( Element ) );
      }
      return true;
    }
  }

private:
  // Floating numbers are canonical one by one.
  static constexpr bool bAsTheyLie = IStoredInteger< T > && std::endian::native == std::endian::little;
};

/// An Array.
template < typename T, std::size_t N >
struct VSerialiser< std::array< T, N > >
{
  static_assert( N >= 1 && N <= 0xffffffffu );
  static const ISchema* Schema()
  {
    static const ISchema* const pSchema = ContainerSchema< T >( EType::Array, N );
    return pSchema;
  }
  static void Write( const std::array< T, N >& i_rValue, VByteWriter& io_rWriter )
  {
    for ( const T& rElement : i_rValue )
    {
      VSerialiser< T >::Write( rElement, io_rWriter );
    }
  }
  static bool Read( VByteReader& io_rReader, std::array< T, N >& o_rValue )
  {
    for ( T& rElement : o_rValue )
    {
      if ( !VSerialiser< T >::Read( io_rReader, rElement ) )
      {
        return false;
      }
    }
    return true;
  }
};

/// A List of no or one element; of more it does not read.
template < typename T >
struct VSerialiser< std::optional< T > >
{
  static const ISchema* Schema() { return VSerialiser< std::vector< T > >::Schema(); }
  static void Write( const std::optional< T >& i_rValue, VByteWriter& io_rWriter )
  {
    io_rWriter.PutCount( i_rValue ? 1 : 0 );
    if ( i_rValue )
    {
      VSerialiser< T >::Write( *i_rValue, io_rWriter );
    }
  }
  static bool Read( VByteReader& io_rReader, std::optional< T >& o_rValue )
  {
    o_rValue.reset();
    std::uint32_t Count = 0;
    if ( !io_rReader.Get( Count ) || Count > 1 )
    {
      return false;
    }
    return Count == 0 || VSerialiser< T >::Read( io_rReader, o_rValue.emplace() );
  }
};

/// A Tuple, for anything that `std::apply` takes apart.
template < typename TTuple, typename... T >
struct VTupleSerialiser
{
  static const ISchema* Schema()
  {
    static const ISchema* const pSchema = []
    {
      ISchema Description;
      Description.m_Type = EType::Tuple;
      ( Description.m_SubSchemas.emplace_back( "", VSerialiser< T >::Schema() ), ... );
      return GetUniqueSchema( Description );
    }();
    return pSchema;
  }
  static void Write( const TTuple& i_rValue, VByteWriter& io_rWriter )
  {
    std::apply(
        [&io_rWriter]( const T&... i_rMembers )
        {
          ( VSerialiser< T >::Write( i_rMembers, io_rWriter ), ... );
        },
        i_rValue );
  }
  static bool Read( VByteReader& io_rReader, TTuple& o_rValue )
  {
    return std::apply(
        [&io_rReader]( T&... o_rMembers )
        {
          return ( VSerialiser< T >::Read( io_rReader, o_rMembers ) && ... );
        },
        o_rValue );
  }
};

template < typename TFirst, typename TSecond >
struct VSerialiser< std::pair< TFirst, TSecond > > : VTupleSerialiser< std::pair< TFirst, TSecond >, TFirst, TSecond >
{
};

template < typename TFirst, typename... TRest >
struct VSerialiser< std::tuple< TFirst, TRest... > >
  : VTupleSerialiser< std::tuple< TFirst, TRest... >, TFirst, TRest... >
{
};

} // namespace ZEK::IO

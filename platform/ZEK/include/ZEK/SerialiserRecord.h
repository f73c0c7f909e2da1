#pragma once

#include <ZEK/DebugServices.h>
#include <ZEK/SerialiserScalar.h>

#include <cstddef>
#include <cstdint>
#include <tuple>
#include <type_traits>

namespace ZEK::IO
{

/// A member of a struct with the name it is stored under.
template < typename TStruct, typename TMember >
struct VRecordMember
{
  using VType = TMember;
  const char* m_pName;
  TMember TStruct::*m_pMember;
};

template < typename TStruct, typename TMember >
constexpr VRecordMember< TStruct, TMember > Member( const char* i_pName, TMember TStruct::*i_pMember )
{
  return { i_pName, i_pMember };
}

/// A struct as a NamedTuple. To be derived from:
///
///     template <>
///     struct VSerialiser< VPreset > : VRecordSerialiser< VPreset >
///     {
///       static constexpr const char* TypeName = "VPreset";
///       static constexpr std::tuple Members{ Member( "Name", &VPreset::m_Name ),
///                                            Member( "Count", &VPreset::m_Count ) };
///     };
template < typename T >
struct VRecordSerialiser
{
  static const ISchema* Schema()
  {
    static const ISchema* const pSchema = []
    {
      ISchema Description;
      Description.m_Type = EType::NamedTuple;
      Description.m_TypeName = VSerialiser< T >::TypeName;
      std::apply(
          [&Description]< typename... M >( const M&... i_rMembers )
          {
            ( Description.m_SubSchemas.emplace_back( i_rMembers.m_pName, VSerialiser< typename M::VType >::Schema() ),
              ... );
          },
          VSerialiser< T >::Members );
      const ISchema* const pKept = GetUniqueSchema( Description );
      DebugServices::Check( pKept != nullptr, "members of a record have different names", __FILE__, __LINE__ );
      return pKept;
    }();
    return pSchema;
  }
  static void Write( const T& i_rValue, VByteWriter& io_rWriter )
  {
    std::apply(
        [&]< typename... M >( const M&... i_rMembers )
        {
          ( VSerialiser< typename M::VType >::Write( i_rValue.*( i_rMembers.m_pMember ), io_rWriter ), ... );
        },
        VSerialiser< T >::Members );
  }
  static bool Read( VByteReader& io_rReader, T& o_rValue )
  {
    return std::apply(
        [&]< typename... M >( const M&... i_rMembers )
        {
          return ( VSerialiser< typename M::VType >::Read( io_rReader, o_rValue.*( i_rMembers.m_pMember ) ) && ... );
        },
        VSerialiser< T >::Members );
  }
};

/// A value of an enum with the name it is stored under.
template < typename T >
struct VEnumerator
{
  const char* m_pName;
  T m_Value;
};

/// An enum of one, two or four bytes as Enum8, Enum16 or Enum32. A number that no name has is a value too. To be
/// derived from, as `VRecordSerialiser`, with `TypeName` and an array `Values` of `VEnumerator`.
template < typename T >
struct VEnumSerialiser
{
  static_assert( std::is_enum_v< T > && sizeof( T ) <= 4 );
  using VStored = std::make_signed_t< std::underlying_type_t< T > >;

  static const ISchema* Schema()
  {
    static const ISchema* const pSchema = []
    {
      ISchema Description;
      Description.m_Type = sizeof( T ) == 1 ? EType::Enum8 : sizeof( T ) == 2 ? EType::Enum16 : EType::Enum32;
      Description.m_TypeName = VSerialiser< T >::TypeName;
      for ( const VEnumerator< T >& rValue : VSerialiser< T >::Values )
      {
        Description.m_EnumValues.emplace_back( rValue.m_pName, static_cast< VStored >( rValue.m_Value ) );
      }
      const ISchema* const pKept = GetUniqueSchema( Description );
      DebugServices::Check( pKept != nullptr, "values of an enum have different names", __FILE__, __LINE__ );
      return pKept;
    }();
    return pSchema;
  }
  static void Write( T i_Value, VByteWriter& io_rWriter ) { io_rWriter.Put( static_cast< VStored >( i_Value ) ); }
  static bool Read( VByteReader& io_rReader, T& o_rValue )
  {
    VStored Stored = 0;
    const bool bRead = io_rReader.Get( Stored );
    o_rValue = static_cast< T >( Stored );
    return bRead;
  }
};

} // namespace ZEK::IO

#pragma once

#include <ZEK/SerialiserContainer.h>
#include <ZEK/SerialiserRecord.h>
#include <ZEK/SerialiserScalar.h>
#include <ZEK/TypedValue.h>

#include <string>
#include <utility>

namespace ZEK::IO
{

/// The value of a C++ object. Small ones cost no allocation.
template < typename T >
VTypedValue MakeValue( const T& i_rValue )
{
  VTypedValue Value;
  Value.m_pSchema = VSerialiser< T >::Schema();
  VByteWriter Writer( Value.m_Data );
  VSerialiser< T >::Write( i_rValue, Writer );
  return Value;
}

inline VTypedValue MakeValue( const char* i_pText )
{
  return MakeValue( std::string( i_pText ) );
}

/// False, with `o_rValue` as it was, unless the value is of exactly that type and its bytes are used up exactly.
template < typename T >
bool ReadTyped( const VTypedValue& i_rValue, T& o_rValue )
{
  if ( i_rValue.m_pSchema == nullptr || i_rValue.m_pSchema != VSerialiser< T >::Schema() )
  {
    return false;
  }
  VByteReader Reader( i_rValue.m_Data );
  T Value{};
  if ( !VSerialiser< T >::Read( Reader, Value ) || Reader.Left() != 0 )
  {
    return false;
  }
  o_rValue = std::move( Value );
  return true;
}

} // namespace ZEK::IO

#pragma once

#include <ZEK/Export.h>
#include <ZEK/Schema.h>
#include <ZEK/ValueBytes.h>

#include <utility>

namespace ZEK
{
namespace IO
{

/// A value of any type: its schema, and its bytes in a form in which equal values have equal bytes. Without bytes
/// it is no value. `MakeValue` and `ReadTyped` convert from and to C++ types.
///
/// The bytes are little-endian and packed. Bool is 0 or 1; Float32 and Float64 have one NaN and no negative zero; a
/// String is its length as u32 and its text; a List is its count as u32 and its elements; Array, Tuple and
/// NamedTuple are their members; an Enum is a signed integer of its width.
struct VTypedValue
{
  VTypedValue() = default;
  VTypedValue( const ISchema* i_pSchema, VValueBytes i_Data )
    : m_pSchema( i_pSchema )
    , m_Data( std::move( i_Data ) )
  {
  }

  bool IsEmpty() const { return m_Data.IsEmpty(); }
  /// The schema, Void for null.
  const ISchema* Schema() const { return m_pSchema != nullptr ? m_pSchema : GetUniquePodSchema( EType::Void ); }

  /// A null schema equals Void; an empty value of another type does not.
  friend bool operator==( const VTypedValue& i_rA, const VTypedValue& i_rB )
  {
    return ( i_rA.m_pSchema == i_rB.m_pSchema || i_rA.Schema() == i_rB.Schema() ) && i_rA.m_Data == i_rB.m_Data;
  }

  const ISchema* m_pSchema = nullptr; ///< a kept instance, see `GetUniqueSchema`
  VValueBytes m_Data;
};

/// True when the bytes are exactly a value of the schema; for Void that is no bytes. Costs a walk over the bytes.
ZEK_API bool IsWellFormed( const VTypedValue& i_rValue );

} // namespace IO

using IO::VTypedValue;

} // namespace ZEK

#pragma once

#include <ZEK/Export.h>
#include <ZEK/Result.h>
#include <ZEK/TextError.h>

#include <cstdint>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace ZEK::IO
{

enum class EType : std::uint8_t
{
  Void,
  Bool,
  Int8,
  Int16,
  Int32,
  Int64,
  UInt8,
  UInt16,
  UInt32,
  UInt64,
  Float32,
  Float64,
  String,
  Array,      ///< `m_Count` elements of one type
  List,       ///< any number of elements of one type
  Tuple,      ///< members of different types
  NamedTuple, ///< members with names
  Enum8,
  Enum16,
  Enum32
};

enum class ERole : std::uint8_t
{
  Value,
  Function,
  Callback,
  Input,
  InputOutput,
  Output,
  Return,
  Result
};

/// The greatest number of containers inside one another.
inline constexpr std::uint32_t MaximumNesting = 64;

/// The type of a value. Built freely as a description; what values refer to is the one instance that
/// `GetUniqueSchema` keeps of equal descriptions, so that two types are equal exactly when the pointers are.
///
/// No virtual functions: the first byte of the object is the type code.
class ISchema
{
public:
  EType m_Type = EType::Void;
  ERole m_Role = ERole::Value;
  std::uint32_t m_Count = 0; ///< of an Array
  // These four have no part in equality.
  std::string m_Detail;
  std::string m_TypeName;
  std::string m_Docs;
  std::string m_History;
  std::vector< std::pair< std::string, std::int64_t > > m_EnumValues;
  /// The name is that of a member of a NamedTuple, and empty elsewhere.
  std::vector< std::pair< std::string, const ISchema* > > m_SubSchemas;
};

/// The schema of a type from Void to String with the role Value; null for other types. Thread: any.
ZEK_API const ISchema* GetUniquePodSchema( EType i_Type );

/// The kept instance that is equal to the description; a first description is copied and kept for the life of the
/// process. Sub-schemas must be kept instances themselves. Thread: any; pointers are the same in every module.
///
/// Null when it is not well formed: an Array without a count; an Array or List without exactly one sub-schema; a
/// Tuple or NamedTuple without members, or with equal names; an Enum without values, with a value outside its
/// width, or with names that are empty, equal, or begin like a number; Void inside anything; parts that the type
/// has no use for; more than `MaximumNesting` levels.
ZEK_API const ISchema* GetUniqueSchema( const ISchema& i_rDescription );

/// Compact JSON, members that have their default left out.
ZEK_API std::string SchemaToJson( const ISchema* i_pSchema );

/// `InvalidFormat` for text that is not JSON or says something else than a schema, `InvalidType` for a schema that
/// is not well formed; the schema is then null and the error tells the place. Unknown members are passed over.
ZEK_API IResult SchemaFromJson( std::string_view i_Json, const ISchema*& o_rpSchema, VTextError* o_pError = nullptr );

/// "Int32" for EType::Int32.
ZEK_API const char* TypeName( EType i_Type );
ZEK_API bool TypeFromName( std::string_view i_Name, EType& o_rType );
ZEK_API const char* RoleName( ERole i_Role );
ZEK_API bool RoleFromName( std::string_view i_Name, ERole& o_rRole );

} // namespace ZEK::IO

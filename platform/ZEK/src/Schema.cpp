#include "SchemaRegistry.h"

#include <algorithm>
#include <array>
#include <deque>
#include <functional>
#include <mutex>
#include <string_view>
#include <unordered_map>

namespace ZEK::IO
{
namespace
{
constexpr std::array TypeNames{ "Void",   "Bool",   "Int8",       "Int16",   "Int32",   "Int64",  "UInt8",
                                "UInt16", "UInt32", "UInt64",     "Float32", "Float64", "String", "Array",
                                "List",   "Tuple",  "NamedTuple", "Enum8",   "Enum16",  "Enum32" };
constexpr std::array RoleNames{ "Value", "Function", "Callback", "Input", "InputOutput", "Output", "Return", "Result" };
constexpr std::size_t PodCount = static_cast< std::size_t >( EType::String ) + 1;

template < typename E, std::size_t N >
bool FromName( const std::array< const char*, N >& i_rNames, std::string_view i_Name, E& o_rValue )
{
  const auto Found = std::find( i_rNames.begin(), i_rNames.end(), i_Name );
  if ( Found != i_rNames.end() )
  {
    o_rValue = static_cast< E >( Found - i_rNames.begin() );
  }
  return Found != i_rNames.end();
}

template < typename TPairs >
bool HasEqualNames( const TPairs& i_rPairs )
{
  std::vector< std::string_view > Names;
  for ( const auto& rPair : i_rPairs )
  {
    Names.push_back( rPair.first );
  }
  std::sort( Names.begin(), Names.end() );
  return std::adjacent_find( Names.begin(), Names.end() ) != Names.end();
}

/// Null when the values fit the width and every name can stand alone in a text.
const char* EnumComplaint( const ISchema& i_rSchema )
{
  const int Bits = 8 << ( static_cast< int >( i_rSchema.m_Type ) - static_cast< int >( EType::Enum8 ) );
  const std::int64_t Limit = std::int64_t{ 1 } << ( Bits - 1 );
  if ( i_rSchema.m_EnumValues.empty() )
  {
    return "an Enum needs EnumValues";
  }
  for ( const auto& [rName, Value] : i_rSchema.m_EnumValues )
  {
    if ( Value < -Limit || Value >= Limit )
    {
      return "an Enum value is outside its width";
    }
    if ( rName.empty() || rName[0] == '-' || ( rName[0] >= '0' && rName[0] <= '9' ) )
    {
      return "an Enum name is empty or begins like a number";
    }
  }
  return HasEqualNames( i_rSchema.m_EnumValues ) ? "an Enum has equal names" : nullptr;
}

/// What can be told without looking at the sub-schemas.
const char* ShapeComplaint( const ISchema& i_rSchema )
{
  const EType Type = i_rSchema.m_Type;
  const std::size_t Subs = i_rSchema.m_SubSchemas.size();
  if ( Type > EType::Enum32 || i_rSchema.m_Role > ERole::Result )
  {
    return "unknown Type or Role";
  }
  if ( ( Type == EType::Array ) != ( i_rSchema.m_Count != 0 ) )
  {
    return Type == EType::Array ? "an Array needs a Count" : "only an Array has a Count";
  }
  if ( !IsEnum( Type ) && !i_rSchema.m_EnumValues.empty() )
  {
    return "only an Enum has EnumValues";
  }
  switch ( Type )
  {
  case EType::Array:
  case EType::List:
    return Subs == 1 ? nullptr : "an Array or List needs one sub-schema";
  case EType::NamedTuple:
    if ( HasEqualNames( i_rSchema.m_SubSchemas ) )
    {
      return "a NamedTuple has equal names";
    }
    [[fallthrough]];
  case EType::Tuple:
    return Subs != 0 ? nullptr : "a Tuple or NamedTuple needs members";
  default:
    return Subs != 0 ? "this Type has no sub-schemas" : IsEnum( Type ) ? EnumComplaint( i_rSchema ) : nullptr;
  }
}

bool IsPlainPod( const ISchema& i_rSchema )
{
  return i_rSchema.m_Type <= EType::String && i_rSchema.m_Role == ERole::Value;
}

std::size_t IdentityHash( const ISchema& i_rSchema )
{
  std::size_t Hash =
      static_cast< std::size_t >( i_rSchema.m_Type ) * 16 + static_cast< std::size_t >( i_rSchema.m_Role );
  const auto Mix = [&Hash]( std::size_t i_Value )
  {
    Hash = ( Hash ^ i_Value ) * 0x9e3779b97f4a7c15u;
    Hash ^= Hash >> 29;
  };
  Mix( i_rSchema.m_Count );
  for ( const auto& [rName, Value] : i_rSchema.m_EnumValues )
  {
    Mix( std::hash< std::string >()( rName ) );
    Mix( static_cast< std::size_t >( Value ) );
  }
  for ( const auto& [rName, pSub] : i_rSchema.m_SubSchemas )
  {
    Mix( i_rSchema.m_Type == EType::NamedTuple ? std::hash< std::string >()( rName ) : 0 );
    Mix( reinterpret_cast< std::size_t >( pSub ) );
  }
  return Hash;
}

bool IsEqual( const ISchema& i_rA, const ISchema& i_rB )
{
  const auto SameSub = [&i_rA]( const auto& i_rSubA, const auto& i_rSubB )
  {
    return i_rSubA.second == i_rSubB.second && ( i_rA.m_Type != EType::NamedTuple || i_rSubA.first == i_rSubB.first );
  };
  return i_rA.m_Type == i_rB.m_Type && i_rA.m_Role == i_rB.m_Role && i_rA.m_Count == i_rB.m_Count &&
         i_rA.m_EnumValues == i_rB.m_EnumValues &&
         std::equal( i_rA.m_SubSchemas.begin(), i_rA.m_SubSchemas.end(), i_rB.m_SubSchemas.begin(),
                     i_rB.m_SubSchemas.end(), SameSub );
}

using VPods = std::array< ISchema, PodCount >;

/// Never destroyed: values outlive static objects of other modules.
const VPods& Pods()
{
  static const VPods* const pPods = []
  {
    auto* const pMade = new VPods;
    for ( std::size_t Index = 0; Index < PodCount; ++Index )
    {
      ( *pMade )[Index].m_Type = static_cast< EType >( Index );
    }
    return pMade;
  }();
  return *pPods;
}

/// The kept instances. Thread: any.
class VSchemaRegistry
{
public:
  VSchemaRegistry()
  {
    for ( const ISchema& rPod : Pods() )
    {
      m_Nesting.emplace( &rPod, 0 );
    }
  }

  const ISchema* Intern( const ISchema& i_rDescription, const char*& o_rpComplaint )
  {
    const std::lock_guard Lock( m_Guard );
    std::uint32_t Nesting = 0;
    o_rpComplaint = SubsComplaint( i_rDescription, Nesting );
    if ( o_rpComplaint != nullptr )
    {
      return nullptr;
    }
    const std::size_t Hash = IdentityHash( i_rDescription );
    const auto [First, Last] = m_ByHash.equal_range( Hash );
    for ( auto It = First; It != Last; ++It )
    {
      if ( IsEqual( *It->second, i_rDescription ) )
      {
        return It->second;
      }
    }
    ISchema& rKept = m_Kept.emplace_back( i_rDescription );
    if ( rKept.m_Type != EType::NamedTuple )
    {
      for ( auto& rSub : rKept.m_SubSchemas )
      {
        rSub.first.clear();
      }
    }
    m_ByHash.emplace( Hash, &rKept );
    m_Nesting.emplace( &rKept, Nesting );
    return &rKept;
  }

private:
  /// The pointers are looked up before they are followed.
  const char* SubsComplaint( const ISchema& i_rDescription, std::uint32_t& o_rNesting ) const
  {
    for ( const auto& rSub : i_rDescription.m_SubSchemas )
    {
      const auto Found = m_Nesting.find( rSub.second );
      if ( Found == m_Nesting.end() )
      {
        return "a sub-schema is not a kept one";
      }
      if ( Found->first->m_Type == EType::Void )
      {
        return "Void stands inside another type";
      }
      o_rNesting = std::max( o_rNesting, Found->second + 1 );
    }
    return o_rNesting > MaximumNesting ? "nested too deep" : nullptr;
  }

  std::mutex m_Guard;
  std::deque< ISchema > m_Kept;
  std::unordered_multimap< std::size_t, const ISchema* > m_ByHash;
  std::unordered_map< const ISchema*, std::uint32_t > m_Nesting;
};
} // namespace

const ISchema* GetUniquePodSchema( EType i_Type )
{
  return i_Type <= EType::String ? &Pods()[static_cast< std::size_t >( i_Type )] : nullptr;
}

const ISchema* InternSchema( const ISchema& i_rDescription, const char*& o_rpComplaint )
{
  o_rpComplaint = ShapeComplaint( i_rDescription );
  if ( o_rpComplaint != nullptr )
  {
    return nullptr;
  }
  if ( IsPlainPod( i_rDescription ) )
  {
    return GetUniquePodSchema( i_rDescription.m_Type );
  }
  static auto* const pRegistry = new VSchemaRegistry;
  return pRegistry->Intern( i_rDescription, o_rpComplaint );
}

const ISchema* GetUniqueSchema( const ISchema& i_rDescription )
{
  const char* pComplaint = nullptr;
  return InternSchema( i_rDescription, pComplaint );
}

const char* TypeName( EType i_Type )
{
  return i_Type <= EType::Enum32 ? TypeNames[static_cast< std::size_t >( i_Type )] : "";
}

bool TypeFromName( std::string_view i_Name, EType& o_rType )
{
  return FromName( TypeNames, i_Name, o_rType );
}

const char* RoleName( ERole i_Role )
{
  return i_Role <= ERole::Result ? RoleNames[static_cast< std::size_t >( i_Role )] : "";
}

bool RoleFromName( std::string_view i_Name, ERole& o_rRole )
{
  return FromName( RoleNames, i_Name, o_rRole );
}

} // namespace ZEK::IO

#include "JsonCursor.h"
#include "SchemaRegistry.h"

#include <algorithm>
#include <bitset>
#include <cstddef>
#include <iterator>
#include <utility>

namespace ZEK::IO
{
namespace
{
constexpr std::string_view MemberNames[] = { "Type",       "Role",       "Detail", "Count",  "TypeName",
                                             "EnumValues", "SubSchemas", "Docs",   "History" };
constexpr std::size_t MemberCount = std::size( MemberNames );

enum EMember : std::size_t
{
  EMemberType,
  EMemberRole,
  EMemberDetail,
  EMemberCount,
  EMemberTypeName,
  EMemberEnumValues,
  EMemberSubSchemas,
  EMemberDocs,
  EMemberHistory
};

class VSchemaJsonWriter
{
public:
  explicit VSchemaJsonWriter( std::string& io_rJson )
    : m_rJson( io_rJson )
  {
  }

  void Write( const ISchema& i_rSchema )
  {
    m_rJson += "{\"Type\":\"";
    m_rJson += TypeName( i_rSchema.m_Type );
    m_rJson += '"';
    if ( i_rSchema.m_Role != ERole::Value )
    {
      Text( EMemberRole, RoleName( i_rSchema.m_Role ) );
    }
    Text( EMemberDetail, i_rSchema.m_Detail );
    if ( i_rSchema.m_Count != 0 )
    {
      Key( EMemberCount );
      m_rJson += std::to_string( i_rSchema.m_Count );
    }
    Text( EMemberTypeName, i_rSchema.m_TypeName );
    EnumValues( i_rSchema );
    SubSchemas( i_rSchema );
    Text( EMemberDocs, i_rSchema.m_Docs );
    Text( EMemberHistory, i_rSchema.m_History );
    m_rJson += '}';
  }

private:
  void Key( EMember i_Member )
  {
    m_rJson += ",\"";
    m_rJson += MemberNames[i_Member];
    m_rJson += "\":";
  }
  void Text( EMember i_Member, std::string_view i_Text )
  {
    if ( !i_Text.empty() )
    {
      Key( i_Member );
      AppendJsonString( i_Text, m_rJson );
    }
  }
  void EnumValues( const ISchema& i_rSchema )
  {
    if ( i_rSchema.m_EnumValues.empty() )
    {
      return;
    }
    Key( EMemberEnumValues );
    char Separator = '{';
    for ( const auto& [rName, Value] : i_rSchema.m_EnumValues )
    {
      m_rJson += std::exchange( Separator, ',' );
      AppendJsonString( rName, m_rJson );
      m_rJson += ':';
      m_rJson += std::to_string( Value );
    }
    m_rJson += '}';
  }
  void SubSchemas( const ISchema& i_rSchema )
  {
    if ( i_rSchema.m_SubSchemas.empty() )
    {
      return;
    }
    Key( EMemberSubSchemas );
    const bool bNamed = i_rSchema.m_Type == EType::NamedTuple;
    char Separator = bNamed ? '{' : '[';
    for ( const auto& [rName, pSub] : i_rSchema.m_SubSchemas )
    {
      m_rJson += std::exchange( Separator, ',' );
      if ( bNamed )
      {
        AppendJsonString( rName, m_rJson );
        m_rJson += ':';
      }
      Write( *pSub );
    }
    m_rJson += bNamed ? '}' : ']';
  }

  std::string& m_rJson;
};

class VSchemaJsonReader
{
public:
  explicit VSchemaJsonReader( std::string_view i_Json )
    : m_Cursor( i_Json )
  {
  }

  IResult Read( const ISchema*& o_rpSchema, VTextError* o_pError )
  {
    const bool bRead = Schema( o_rpSchema, 0 ) && m_Cursor.End();
    if ( !bRead )
    {
      o_rpSchema = nullptr;
      if ( o_pError != nullptr )
      {
        *o_pError = m_Cursor.Error();
      }
    }
    return bRead ? IResult::Ok : m_bIllFormed ? IResult::InvalidType : IResult::InvalidFormat;
  }

private:
  struct VDraft
  {
    ISchema Description;
    std::bitset< MemberCount > Seen;
    bool bNamedSubs = false;
  };

  bool IllFormed( std::size_t i_Position, const char* i_pComplaint )
  {
    m_bIllFormed = true;
    return m_Cursor.FailAt( i_Position, i_pComplaint );
  }

  bool Schema( const ISchema*& o_rpSchema, std::uint32_t i_Nesting )
  {
    o_rpSchema = nullptr;
    const std::size_t Start = m_Cursor.Position();
    if ( i_Nesting > MaximumNesting )
    {
      return IllFormed( Start, "nested too deep" );
    }
    VDraft Draft;
    if ( !m_Cursor.Object(
             [&]( const std::string& i_rName, std::size_t i_Position )
             {
               return AnyMember( Draft, i_rName, i_Position, i_Nesting );
             } ) )
    {
      return false;
    }
    if ( !Draft.Seen[EMemberType] )
    {
      return m_Cursor.FailAt( Start, "a schema needs a Type" );
    }
    const ISchema& rDescription = Draft.Description;
    if ( !rDescription.m_SubSchemas.empty() && Draft.bNamedSubs != ( rDescription.m_Type == EType::NamedTuple ) )
    {
      return m_Cursor.FailAt( Start, "SubSchemas are an object for a NamedTuple, else an array" );
    }
    const char* pComplaint = nullptr;
    o_rpSchema = InternSchema( rDescription, pComplaint );
    return o_rpSchema != nullptr || IllFormed( Start, pComplaint );
  }

  bool AnyMember( VDraft& io_rDraft, const std::string& i_rName, std::size_t i_Position, std::uint32_t i_Nesting )
  {
    const auto* const pName = std::find( std::begin( MemberNames ), std::end( MemberNames ), i_rName );
    if ( pName == std::end( MemberNames ) )
    {
      return m_Cursor.SkipValue();
    }
    const auto Member = static_cast< EMember >( pName - MemberNames );
    if ( io_rDraft.Seen[Member] )
    {
      return m_Cursor.FailAt( i_Position, "member given twice" );
    }
    io_rDraft.Seen.set( Member );
    ISchema& rDescription = io_rDraft.Description;
    switch ( Member )
    {
    case EMemberType:
      return Named( rDescription.m_Type, TypeFromName, "unknown Type" );
    case EMemberRole:
      return Named( rDescription.m_Role, RoleFromName, "unknown Role" );
    case EMemberDetail:
      return m_Cursor.String( rDescription.m_Detail );
    case EMemberCount:
      return m_Cursor.Integer( rDescription.m_Count );
    case EMemberTypeName:
      return m_Cursor.String( rDescription.m_TypeName );
    case EMemberEnumValues:
      return m_Cursor.Object(
          [&]( const std::string& i_rValueName, std::size_t )
          {
            return m_Cursor.Integer( rDescription.m_EnumValues.emplace_back( i_rValueName, 0 ).second );
          } );
    case EMemberSubSchemas:
      return SubSchemas( io_rDraft, i_Nesting + 1 );
    case EMemberDocs:
      return m_Cursor.String( rDescription.m_Docs );
    default:
      return m_Cursor.String( rDescription.m_History );
    }
  }

  template < typename E >
  bool Named( E& o_rValue, bool ( *i_pFromName )( std::string_view, E& ), const char* i_pMessage )
  {
    const std::size_t Start = m_Cursor.Position();
    std::string Name;
    return m_Cursor.String( Name ) && ( i_pFromName( Name, o_rValue ) || m_Cursor.FailAt( Start, i_pMessage ) );
  }

  bool SubSchemas( VDraft& io_rDraft, std::uint32_t i_Nesting )
  {
    const auto One = [&]( const std::string& i_rName )
    {
      const ISchema* pSub = nullptr;
      const bool bRead = Schema( pSub, i_Nesting );
      io_rDraft.Description.m_SubSchemas.emplace_back( i_rName, pSub );
      return bRead;
    };
    io_rDraft.bNamedSubs = m_Cursor.Peek( '{' );
    if ( io_rDraft.bNamedSubs )
    {
      return m_Cursor.Object(
          [&]( const std::string& i_rName, std::size_t )
          {
            return One( i_rName );
          } );
    }
    return m_Cursor.Array(
        [&]
        {
          return One( "" );
        } );
  }

  VJsonCursor m_Cursor;
  bool m_bIllFormed = false;
};
} // namespace

std::string SchemaToJson( const ISchema* i_pSchema )
{
  std::string Json;
  VSchemaJsonWriter( Json ).Write( i_pSchema != nullptr ? *i_pSchema : *GetUniquePodSchema( EType::Void ) );
  return Json;
}

IResult SchemaFromJson( std::string_view i_Json, const ISchema*& o_rpSchema, VTextError* o_pError )
{
  return VSchemaJsonReader( i_Json ).Read( o_rpSchema, o_pError );
}

} // namespace ZEK::IO

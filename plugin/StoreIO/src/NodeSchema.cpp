#include "NodeSchema.h"

#include "DocumentKeys.h"
#include "JsonText.h"
#include "JsonWriter.h"

#include <cstring>
#include <string_view>

namespace StoreIO
{

using namespace ZEK;

VNodeMembers::VNodeMembers( const rapidjson::Value& i_rNode )
{
  for ( const auto& rMember : i_rNode.GetObject() )
  {
    const std::string_view Name = TextOf( rMember.name );
    const rapidjson::Value** const ppPlace = Name == KeyValue           ? &m_pValue
                                             : Name == KeyChildren      ? &m_pChildren
                                             : Name == KeyValueProposed ? &m_pProposed
                                                                        : nullptr;
    if ( ppPlace == nullptr )
    {
      m_pOther = m_Others++ == 0 ? &rMember : m_pOther;
    }
    else if ( *ppPlace == nullptr )
    {
      *ppPlace = &rMember.value;
    }
  }
}

const IO::ISchema* VNodeSchemas::Find( const rapidjson::Value& i_rNode, const VNodeMembers& i_rMembers )
{
  if ( i_rMembers.m_Others == 1 )
  {
    if ( const IO::ISchema* const pPlain = FindPlain( *i_rMembers.m_pOther ) )
    {
      return pPlain;
    }
  }
  std::size_t Brackets = 0;
  WriteSchemaMembers( i_rNode, m_Json, Brackets );
  m_bTooDeep = Brackets > SchemaBrackets;
  m_Complaint.clear();
  if ( const auto Found = m_ByJson.find( m_Json ); Found != m_ByJson.end() )
  {
    return Found->second;
  }
  const IO::ISchema* pSchema = nullptr;
  IO::VTextError Error;
  if ( IO::SchemaFromJson( m_Json, pSchema, &Error ).IsError() )
  {
    m_Complaint = Error.Text();
    return nullptr;
  }
  m_ByJson.emplace( m_Json, pSchema );
  return pSchema;
}

/// For a schema that is a plain type and nothing else.
const IO::ISchema* VNodeSchemas::FindPlain( const rapidjson::Value::Member& i_rOnly )
{
  if ( TextOf( i_rOnly.name ) != KeyType || !i_rOnly.value.IsString() )
  {
    return nullptr;
  }
  const std::string_view Name = TextOf( i_rOnly.value );
  if ( Name.empty() || Name.size() > VPlain().m_Name.size() )
  {
    return nullptr;
  }
  VPlain& rPlain = m_Plain[( Name.size() * 11 + static_cast< unsigned char >( Name.front() ) * 3 +
                             static_cast< unsigned char >( Name.back() ) ) %
                           m_Plain.size()];
  if ( rPlain.m_Size != Name.size() || std::memcmp( rPlain.m_Name.data(), Name.data(), Name.size() ) != 0 )
  {
    IO::EType Type = IO::EType::Void;
    const IO::ISchema* const pSchema = IO::TypeFromName( Name, Type ) ? IO::GetUniquePodSchema( Type ) : nullptr;
    if ( pSchema == nullptr )
    {
      return nullptr;
    }
    rPlain.m_pSchema = pSchema;
    rPlain.m_Size = Name.size();
    std::memcpy( rPlain.m_Name.data(), Name.data(), Name.size() );
  }
  return rPlain.m_pSchema;
}

} // namespace StoreIO

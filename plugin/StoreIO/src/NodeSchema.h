#pragma once

#include <ZEK/Schema.h>
#include <ZEK/TextError.h>

#include <rapidjson/document.h>

#include <array>
#include <cstddef>
#include <string>
#include <unordered_map>

namespace StoreIO
{

/// The members of a node, each found once; of two with one name the first counts.
struct VNodeMembers
{
  explicit VNodeMembers( const rapidjson::Value& i_rNode );

  const rapidjson::Value* m_pProposed = nullptr;
  const rapidjson::Value* m_pValue = nullptr;
  const rapidjson::Value* m_pChildren = nullptr;
  const rapidjson::Value::Member* m_pOther = nullptr; ///< the first that belongs to the schema
  std::size_t m_Others = 0;
};

/// Finds the schemas of nodes. A text is read once: most nodes of a document have one of few.
class VNodeSchemas
{
public:
  /// Null when the members are not a schema; what follows tells about the last such node.
  const ZEK::IO::ISchema* Find( const rapidjson::Value& i_rNode, const VNodeMembers& i_rMembers );

  const std::string& Json() const { return m_Json; }
  bool IsTooDeep() const { return m_bTooDeep; }
  const std::string& Complaint() const { return m_Complaint; }

private:
  struct VPlain
  {
    std::array< char, 8 > m_Name{};
    std::size_t m_Size = 0;
    const ZEK::IO::ISchema* m_pSchema = nullptr;
  };

  const ZEK::IO::ISchema* FindPlain( const rapidjson::Value::Member& i_rOnly );

  std::array< VPlain, 64 > m_Plain; ///< by a hash of the name
  std::unordered_map< std::string, const ZEK::IO::ISchema* > m_ByJson;
  std::string m_Json;
  bool m_bTooDeep = false;
  std::string m_Complaint;
};

} // namespace StoreIO

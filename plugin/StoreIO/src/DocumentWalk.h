#pragma once

#include "NodeSchema.h"

#include <ZEK/EntryPath.h>
#include <ZEK/Result.h>
#include <ZEK/StoreWriter.h>

#include <rapidjson/document.h>

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace StoreIO
{

/// Goes through a document, in its order and with a stack of its own, and writes to a store what it says. Without a
/// writer it only collects complaints, and then those that an import would not make, too.
class VDocumentWalk
{
public:
  explicit VDocumentWalk( ZEK::IStoreWriter* io_pWriter );

  ZEK::IResult Run( const rapidjson::Value& i_rRoot );
  /// In the order of the document.
  const std::vector< std::string >& Errors() const { return m_Errors; }

private:
  /// A "Children" object, and what the store has at its place before.
  struct VOpen
  {
    rapidjson::Value::ConstMemberIterator m_Next;
    rapidjson::Value::ConstMemberIterator m_End;
    std::vector< ZEK::IStoreReader::Entry > m_Known;
    std::size_t m_NextKnown = 0;
  };
  /// A node that is being looked at, or one that it lies in.
  struct VLevel
  {
    std::string_view m_Name;
    std::size_t m_PathSize = 0;
    ZEK::VEntryPath m_Path; ///< made when somebody asks for it
  };

  ZEK::IResult Head( const rapidjson::Value& i_rRoot );
  ZEK::IResult Version( const rapidjson::Value& i_rRoot );
  void Walk( const rapidjson::Value& i_rChildren );
  void Open( const rapidjson::Value& i_rChildren, ZEK::IStoreReader::Entry i_pEntry );
  void Enter( std::string_view i_Name );
  ZEK::IStoreReader::Entry FindKnown( VOpen& io_rOpen ) const;
  void Node( const rapidjson::Value& i_rNode );
  void Values( const rapidjson::Value& i_rNode, const VNodeMembers& i_rMembers );
  void Proposed( const ZEK::IO::ISchema* i_pSchema, const rapidjson::Value& i_rLeaf );
  void Verified( const ZEK::IO::ISchema* i_pSchema, const rapidjson::Value& i_rLeaf );
  bool IsEmpty( const ZEK::VTypedValue& i_rValue, std::string_view i_Key );
  void NotAnObject( std::string_view i_Name, const ZEK::VEntryPath& i_rPath );
  void Remark( std::string i_Text );
  void RemarkLeaf( const ZEK::IO::ISchema* i_pSchema, const rapidjson::Value& i_rLeaf, std::string_view i_Key );
  void RemarkMembers( const rapidjson::Value& i_rObject, const ZEK::VEntryPath& i_rPath, bool i_bNode );
  const ZEK::VEntryPath& Path() { return PathAt( m_Open.size() ); }
  const ZEK::VEntryPath& PathAt( std::size_t i_Level );

  ZEK::IStoreWriter* const m_pWriter;
  std::vector< VOpen > m_Open;
  std::vector< VLevel > m_Levels;              ///< the root, and a node for each object that is open
  std::size_t m_PathsMade = 0;                 ///< the last level whose path is made
  ZEK::IStoreReader::Entry m_pEntry = nullptr; ///< of the current node; null while it is not known
  VNodeSchemas m_Schemas;
  std::vector< std::string > m_Errors;
  std::size_t m_Remarks = 0; ///< so many of the errors are none for an import
  std::size_t m_Refusals = 0;
  bool m_bTooDeep = false;
};

} // namespace StoreIO

#pragma once

#include <ZEK/Schema.h>
#include <ZEK/Store.h>
#include <ZEK/StoreReader.h>

#include <rapidjson/document.h>

#include <cstddef>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace StoreIO
{

/// Fills JSON with entries of a store, with a stack of its own. Names are referred to where they lie in the store,
/// all other text lies in the pool.
class VStoreFill
{
public:
  using Entry = ZEK::IStoreReader::Entry;

  VStoreFill( ZEK::IStoreReader& i_rReader, rapidjson::Document::AllocatorType& io_rPool );

  /// An object with a node for each child of the entry. Of the children of the root, "Versions" is first.
  rapidjson::Value Children( Entry i_pEntry );
  /// An object with the one child of the root that the entry lies below, and the same within it down to the entry.
  rapidjson::Value Branch( Entry i_pEntry );
  /// In the order of the entries.
  const std::vector< std::string >& Errors() const { return m_Errors; }

private:
  struct VOpen
  {
    std::vector< Entry > m_Children;
    std::size_t m_Next = 0;
    rapidjson::SizeType m_Members = 0; ///< of the node that the children stand in, without them
    bool m_bInNode = false;
  };

  template < typename TFill >
  rapidjson::Value Filled( const TFill& i_rFill );
  void BeginNode( Entry i_pEntry, std::string_view i_Name );
  void FillOpen();
  void Prefetch( const VOpen& i_rOpen ) const;
  rapidjson::SizeType Values( Entry i_pEntry );
  rapidjson::SizeType Leaf( Entry i_pEntry, const ZEK::VTypedValue& i_rValue, std::string_view i_Key );
  rapidjson::SizeType Schema( const ZEK::IO::ISchema* i_pSchema );
  rapidjson::Value ParseSchema( const ZEK::IO::ISchema* i_pSchema );
  void Fail( const char* i_pTemplate, Entry i_pEntry );
  void Key( std::string_view i_Name );
  std::string_view Name( Entry i_pEntry ) const { return m_rStore.EntryPath( i_pEntry ).LeafView(); }

  ZEK::IStoreReader& m_rReader;
  ZEK::IStore& m_rStore;
  rapidjson::Document m_Filled;
  std::size_t m_Above = 0; ///< components above those that the open children stand for
  std::vector< VOpen > m_Open;
  std::unordered_map< const ZEK::IO::ISchema*, rapidjson::Value > m_Schemas;
  std::vector< std::string > m_Errors;
  std::string m_Text;
};

} // namespace StoreIO

#pragma once

#include "VFreeList.h"
#include "VNameBook.h"

#include <ZEK/FlowState.h>

#include <array>
#include <cstdint>
#include <memory>
#include <mutex>
#include <typeinfo>
#include <vector>

namespace HostFlow
{

class VItemPool;

/// What one name adds to the hash of a value's names; nothing for an empty one.
inline std::uint64_t NameHashPart( std::uint32_t i_Selector, std::uint64_t i_Hash )
{
  return i_Selector * 0x9e3779b97f4a7c15u * ( i_Hash | 1u );
}

/// An item and its value in one object; the payload is the derived class's. Its first line of the memory cache is the
/// item's interface.
class alignas( 64 ) VPooledItem : public ZEK::IFlowItem, public ZEK::IFlowValue
{
public:
  explicit VPooledItem( VItemPool& i_rPool );
  ~VPooledItem() override = default;

  bool GetName( std::uint32_t i_Selector, std::string_view& o_rName ) const final;
  void SetName( std::uint32_t i_Selector, std::string_view i_Name ) final;

  /// Equal for values of equal names.
  std::uint64_t NameHash() const;
  void Renew( std::uint32_t i_Salt, std::uint32_t i_Tag, std::int64_t i_Number );

  VPooledItem* pNextFree = nullptr;

protected:
  void Destroy() final;
  virtual void ResetPayload() = 0;

private:
  VItemPool& m_rPool;
  std::array< VName*, ZEK::EFlowNameCount - 1 > m_Names{}; ///< null: no such name
};

/// The items of one tag. Lives as long as the process, as an item may outlive every handle.
class VItemPool
{
public:
  using VMake = VPooledItem* (*)( VItemPool& );

  VItemPool( std::uint32_t i_Tag, std::uint32_t i_Salt, VMake i_pMake, const std::type_info& i_rItemType )
    : m_Tag( i_Tag )
    , m_Salt( i_Salt )
    , m_pMake( i_pMake )
    , m_rItemType( i_rItemType )
  {
  }

  std::uint32_t Tag() const { return m_Tag; }
  /// An empty item with an id that no value had.
  VPooledItem& Take();
  void GiveBack( VPooledItem& i_rItem ) { m_Free.GiveBack( i_rItem ); }
  void Trim();
  /// The items there are, in use or not.
  std::size_t Count();
  /// The item as this pool's own, or null for one that somebody else implements.
  const VPooledItem* Own( const ZEK::IFlowItem& i_rItem ) const
  {
    return typeid( i_rItem ) == m_rItemType ? static_cast< const VPooledItem* >( &i_rItem ) : nullptr;
  }

private:
  std::mutex m_Guard;
  const std::uint32_t m_Tag;
  const std::uint32_t m_Salt;
  std::int64_t m_Number = 0;
  std::size_t m_Made = 0; ///< and not ended
  const VMake m_pMake;
  const std::type_info& m_rItemType;
  VFreeList< VPooledItem > m_Free;
};

/// The pools of all registered tags.
class VItemPools
{
public:
  static VItemPools& Instance();

  /// Null for a tag that nobody registered.
  VItemPool* Find( std::uint32_t i_Tag ) const;
  void Trim();
  std::size_t Count() const;

private:
  VItemPools();

  std::vector< std::unique_ptr< VItemPool > > m_Pools;
  std::array< VItemPool*, 256 > m_Table{}; // open addressing, never more than half full
};

} // namespace HostFlow

#include "VItemPool.h"

#include "VTypedItem.h"

#include <ZEK/DebugServices.h>

#include <random>
#include <utility>

namespace HostFlow
{
namespace
{

/// Not zero, and another one for each process, so that ids of two processes do not meet.
std::uint32_t ProcessSalt()
{
  return std::random_device()() | 1u;
}

std::size_t TableSlot( std::uint32_t i_Tag )
{
  return ( i_Tag ^ ( i_Tag >> 8 ) ) & 0xff;
}

} // namespace

VPooledItem::VPooledItem( VItemPool& i_rPool )
  : m_rPool( i_rPool )
{
}

bool VPooledItem::GetName( std::uint32_t i_Selector, std::string_view& o_rName ) const
{
  if ( i_Selector == 0 || i_Selector >= ZEK::EFlowNameCount || !m_Names[i_Selector - 1] )
  {
    return false;
  }
  o_rName = m_Names[i_Selector - 1]->Text;
  return true;
}

void VPooledItem::SetName( std::uint32_t i_Selector, std::string_view i_Name )
{
  const bool bKnown = i_Selector > 0 && i_Selector < ZEK::EFlowNameCount;
  if ( !DebugServices::Check( bKnown, "i_Selector > 0 && i_Selector < EFlowNameCount", __FILE__, __LINE__ ) )
  {
    return;
  }
  VName* const pFormer = m_Names[i_Selector - 1];
  VName* const pName = i_Name.empty() ? nullptr : &VNameBook::Instance().Take( i_Name );
  m_Names[i_Selector - 1] = pName;
  m_NameNumbers[i_Selector - 1] = pName ? pName->Number : 0;
  if ( pFormer )
  {
    VNameBook::GiveBack( *pFormer );
  }
}

std::uint64_t VPooledItem::NameHash() const
{
  std::uint64_t Hash = 0;
  for ( std::uint32_t Name = 0; Name < m_Names.size(); ++Name )
  {
    Hash += m_Names[Name] ? NameHashPart( Name + 1, m_Names[Name]->Hash ) : 0;
  }
  return Hash;
}

void VPooledItem::Renew( std::uint32_t i_Salt, std::uint32_t i_Tag, std::int64_t i_Number )
{
  m_Id = { i_Salt, i_Tag, i_Number };
}

void VPooledItem::Destroy()
{
  ResetPayload();
  for ( std::size_t Name = 0; Name < m_Names.size(); ++Name )
  {
    if ( VName* const pName = std::exchange( m_Names[Name], nullptr ) )
    {
      VNameBook::GiveBack( *pName );
      m_NameNumbers[Name] = 0;
    }
  }
  m_rPool.GiveBack( *this );
}

VPooledItem& VItemPool::Take()
{
  const std::lock_guard Lock( m_Guard );
  VPooledItem* pItem = m_Free.Take();
  if ( !pItem )
  {
    pItem = m_pMake( *this );
    ++m_Made;
  }
  pItem->Renew( m_Salt, m_Tag, ++m_Number );
  return *pItem;
}

void VItemPool::Trim()
{
  const std::lock_guard Lock( m_Guard );
  while ( VPooledItem* pItem = m_Free.Take() )
  {
    delete pItem;
    --m_Made;
  }
}

std::size_t VItemPool::Count()
{
  const std::lock_guard Lock( m_Guard );
  return m_Made;
}

VItemPools& VItemPools::Instance()
{
  // Never destroyed: an item in a static of somebody else comes back after the statics of this library went.
  static VItemPools& rPools = *new VItemPools;
  return rPools;
}

VItemPools::VItemPools()
{
  const std::uint32_t Salt = ProcessSalt();
  const auto Add = [&]< typename TFlow >( TFlow* )
  {
    using VItem = VTypedItem< typename ZEK::FlowValueType< TFlow >::type >;
    constexpr std::uint32_t Tag = ZEK::FlowValueType< TFlow >::Descriptor.Tag;
    m_Pools.push_back( std::make_unique< VItemPool >(
        Tag, Salt,
        []( VItemPool& i_rPool ) -> VPooledItem*
        {
          return new VItem( i_rPool );
        },
        typeid( VItem ) ) );
    std::size_t Slot = TableSlot( Tag );
    while ( m_Table[Slot] )
    {
      Slot = ( Slot + 1 ) % m_Table.size();
    }
    m_Table[Slot] = m_Pools.back().get();
  };
  static_assert( std::tuple_size_v< CoreMoxelTypes::VAllFlowTypes > <= std::tuple_size_v< decltype( m_Table ) > / 2 );
  [&]< typename... TFlow >( std::tuple< TFlow*... >* )
  {
    ( Add( static_cast< TFlow* >( nullptr ) ), ... );
  }( static_cast< CoreMoxelTypes::VAllFlowTypes* >( nullptr ) );
}

VItemPool* VItemPools::Find( std::uint32_t i_Tag ) const
{
  for ( std::size_t Slot = TableSlot( i_Tag ); m_Table[Slot]; Slot = ( Slot + 1 ) % m_Table.size() )
  {
    if ( m_Table[Slot]->Tag() == i_Tag )
    {
      return m_Table[Slot];
    }
  }
  return nullptr;
}

void VItemPools::Trim()
{
  for ( const auto& rpPool : m_Pools )
  {
    rpPool->Trim();
  }
  VNameBook::Instance().Trim();
}

std::size_t VItemPools::Count() const
{
  std::size_t Count = 0;
  for ( const auto& rpPool : m_Pools )
  {
    Count += rpPool->Count();
  }
  return Count;
}

} // namespace HostFlow

#include "VStateBuilder.h"

#include <algorithm>
#include <bit>
#include <compare>
#include <mutex>
#include <span>

namespace HostFlow
{
namespace
{

constexpr std::size_t KeptBuilders = 8;

struct VKept
{
  std::mutex Guard;
  std::vector< std::unique_ptr< VStateBuilder > > Builders;
};

VKept& Kept()
{
  static VKept& rKept = *new VKept;
  return rKept;
}

std::uint64_t NameHash( const VItemPool* i_pPool, const ZEK::IFlowItem& i_rItem )
{
  if ( const VPooledItem* pOwn = i_pPool ? i_pPool->Own( i_rItem ) : nullptr )
  {
    return pOwn->NameHash();
  }
  std::uint64_t Hash = 0; // an item of another make
  for ( std::uint32_t Selector = 1; Selector < ZEK::EFlowNameCount; ++Selector )
  {
    std::string_view Name;
    Hash += i_rItem.Value().GetName( Selector, Name ) ? NameHashPart( Selector, HashOfName( Name ) ) : 0;
  }
  return Hash;
}

bool SameNames( const ZEK::IFlowItem& i_rA, const ZEK::IFlowItem& i_rB )
{
  for ( std::uint32_t Selector = 1; Selector < ZEK::EFlowNameCount; ++Selector )
  {
    const std::uint32_t Number = i_rA.NameNumber( Selector );
    if ( Number != 0 && Number == i_rB.NameNumber( Selector ) )
    {
      continue;
    }
    std::string_view NameA, NameB;
    const bool bA = i_rA.Value().GetName( Selector, NameA );
    const bool bB = i_rB.Value().GetName( Selector, NameB );
    if ( bA != bB || ( bA && NameA != NameB ) )
    {
      return false;
    }
  }
  return true;
}

std::uint32_t EntryHash( const ZEK::VFlowEntry& i_rEntry, std::uint64_t i_NameHash )
{
  std::uint64_t Hash = i_NameHash + static_cast< std::uint64_t >( i_rEntry.Key.Frame ) * 0xff51afd7ed558ccdu;
  Hash += ( ( static_cast< std::uint64_t >( i_rEntry.Key.Clock ) << 32 ) | i_rEntry.Tag ) * 0xc4ceb9fe1a85ec53u;
  Hash ^= Hash >> 32;
  Hash *= 0x9e3779b97f4a7c15u;
  return static_cast< std::uint32_t >( Hash >> 32 );
}

/// A digest of 128 bits over who the items are and in what order. An item is another one where it lies elsewhere or has
/// another id: memory that was given back holds a new id.
ZEK::VFlowItemsId ItemsId( const ZEK::VFlowTimeKey& i_rKey, std::span< const ZEK::VFlowEntry > i_Entries )
{
  ZEK::VFlowItemsId Id{ 0x9e3779b97f4a7c15u, i_Entries.size() + 1 };
  for ( const ZEK::VFlowEntry& rEntry : i_Entries )
  {
    if ( rEntry.Key != i_rKey )
    {
      return {};
    }
    const ZEK::VFlowValueId& rValue = rEntry.pItem->Id();
    const auto Place = reinterpret_cast< std::uintptr_t >( rEntry.pItem );
    const std::uint64_t Number =
        static_cast< std::uint64_t >( rValue.Number ) + ( static_cast< std::uint64_t >( rValue.Salt ) << 32 );
    Id.A = ( std::rotl( Id.A, 29 ) ^ Place ) * 0xff51afd7ed558ccdu;
    Id.A = ( std::rotl( Id.A, 31 ) ^ Number ) * 0xc4ceb9fe1a85ec53u;
    Id.B = ( std::rotl( Id.B, 23 ) ^ Number ) * 0x9e3779b97f4a7c15u;
    Id.B = ( std::rotl( Id.B, 37 ) ^ Place ) * 0xd6e8feb86659fd93u;
  }
  return { Id.A | 1, Id.B };
}

} // namespace

std::unique_ptr< VStateBuilder > VStateBuilder::Take()
{
  VKept& rKept = Kept();
  {
    const std::lock_guard Lock( rKept.Guard );
    if ( !rKept.Builders.empty() )
    {
      auto pBuilder = std::move( rKept.Builders.back() );
      rKept.Builders.pop_back();
      return pBuilder;
    }
  }
  return std::make_unique< VStateBuilder >();
}

void VStateBuilder::GiveBack( std::unique_ptr< VStateBuilder > i_pBuilder )
{
  i_pBuilder->Clear();
  VKept& rKept = Kept();
  const std::lock_guard Lock( rKept.Guard );
  if ( rKept.Builders.size() < KeptBuilders )
  {
    rKept.Builders.push_back( std::move( i_pBuilder ) );
  }
}

void VStateBuilder::Trim()
{
  std::vector< std::unique_ptr< VStateBuilder > > Builders;
  const std::lock_guard Lock( Kept().Guard );
  Builders.swap( Kept().Builders );
}

void VStateBuilder::Clear()
{
  for ( const ZEK::VFlowEntry& rEntry : m_Entries )
  {
    rEntry.pItem->Release();
  }
  Forget();
}

void VStateBuilder::Forget()
{
  if ( !m_Entries.empty() )
  {
    std::fill( m_Table.begin(), m_Table.end(), VSlot() );
  }
  m_Entries.clear();
  m_TagOf.clear();
  m_Tags.clear();
  m_LastTag = 0;
}

std::uint32_t VStateBuilder::TagIndex( std::uint32_t i_Tag )
{
  if ( m_LastTag < m_Tags.size() && m_Tags[m_LastTag].Tag == i_Tag )
  {
    return m_LastTag;
  }
  const auto Found = std::find_if( m_Tags.begin(), m_Tags.end(),
                                   [&]( const VTag& i_rTag )
                                   {
                                     return i_rTag.Tag == i_Tag;
                                   } );
  m_LastTag = static_cast< std::uint32_t >( Found - m_Tags.begin() );
  if ( Found == m_Tags.end() )
  {
    m_Tags.push_back( { i_Tag, 0, 0, VItemPools::Instance().Find( i_Tag ) } );
  }
  return m_LastTag;
}

VStateBuilder::VSlot& VStateBuilder::FindSlot( std::uint32_t i_Hash, const ZEK::VFlowEntry& i_rEntry )
{
  const std::size_t Mask = m_Table.size() - 1;
  for ( std::size_t Place = i_Hash & Mask;; Place = ( Place + 1 ) & Mask )
  {
    VSlot& rSlot = m_Table[Place];
    if ( rSlot.Entry == 0 )
    {
      return rSlot;
    }
    if ( rSlot.Hash == i_Hash )
    {
      const ZEK::VFlowEntry& rOther = m_Entries[rSlot.Entry - 1];
      if ( rOther.Tag == i_rEntry.Tag && rOther.Key == i_rEntry.Key && SameNames( *rOther.pItem, *i_rEntry.pItem ) )
      {
        return rSlot;
      }
    }
  }
}

void VStateBuilder::Grow()
{
  std::vector< VSlot > Old( std::max< std::size_t >( m_Table.size() * 2, 256 ) );
  // Never more than half full, so that adding itself cannot fail between the two lists.
  m_Entries.reserve( Old.size() / 2 );
  m_TagOf.reserve( Old.size() / 2 );
  Old.swap( m_Table );
  const std::size_t Mask = m_Table.size() - 1;
  for ( const VSlot& rSlot : Old )
  {
    if ( rSlot.Entry != 0 )
    {
      std::size_t Place = rSlot.Hash & Mask;
      while ( m_Table[Place].Entry != 0 )
      {
        Place = ( Place + 1 ) & Mask;
      }
      m_Table[Place] = rSlot;
    }
  }
}

void VStateBuilder::Add( const ZEK::VFlowTimeKey& i_rKey, ZEK::IFlowItem& i_rItem )
{
  i_rItem.AddRef();
  Append( { i_rKey, i_rItem.Id().Type, &i_rItem } );
}

void VStateBuilder::Append( const ZEK::VFlowEntry& i_rEntry )
{
  if ( ( m_Entries.size() + 1 ) * 2 > m_Table.size() )
  {
    Grow();
  }
  const std::uint32_t Tag = TagIndex( i_rEntry.Tag );
  const std::uint32_t Hash = EntryHash( i_rEntry, NameHash( m_Tags[Tag].pPool, *i_rEntry.pItem ) );
  VSlot& rSlot = FindSlot( Hash, i_rEntry );
  if ( rSlot.Entry != 0 )
  {
    ZEK::VFlowEntry& rOld = m_Entries[rSlot.Entry - 1];
    ZEK::IFlowItem* pOld = rOld.pItem;
    rOld = i_rEntry;
    pOld->Release();
    return;
  }
  m_Entries.push_back( i_rEntry );
  m_TagOf.push_back( Tag );
  ++m_Tags[Tag].Count;
  rSlot = { Hash, static_cast< std::uint32_t >( m_Entries.size() ) };
}

void VStateBuilder::Load( std::vector< ZEK::VFlowEntry >& io_rEntries )
{
  // Within a tag and a key, a settled state keeps the order of insertion, so loading it in order loses nothing.
  for ( const ZEK::VFlowEntry& rEntry : io_rEntries )
  {
    Append( rEntry );
  }
  io_rEntries.clear();
}

void VStateBuilder::Settle( const ZEK::VFlowTimeKey& i_rKey, std::vector< ZEK::VFlowEntry >& o_rEntries,
                            std::vector< VTagRange >& o_rTags )
{
  o_rTags.clear();
  for ( std::uint32_t Tag = 0; Tag < m_Tags.size(); ++Tag )
  {
    o_rTags.push_back( { m_Tags[Tag].Tag, Tag, m_Tags[Tag].Count, {} } );
  }
  std::sort( o_rTags.begin(), o_rTags.end(),
             []( const VTagRange& i_rA, const VTagRange& i_rB )
             {
               return i_rA.Tag < i_rB.Tag;
             } );
  std::uint32_t First = 0;
  for ( VTagRange& rRange : o_rTags )
  {
    m_Tags[rRange.First].Next = First;
    rRange.First = First;
    First = rRange.Last += First;
  }
  o_rEntries.resize( m_Entries.size() );
  for ( std::size_t Entry = 0; Entry < m_Entries.size(); ++Entry )
  {
    o_rEntries[m_Tags[m_TagOf[Entry]].Next++] = m_Entries[Entry];
  }
  for ( VTagRange& rRange : o_rTags )
  {
    SortByKey( o_rEntries.data() + rRange.First, o_rEntries.data() + rRange.Last );
    rRange.Id = ItemsId( i_rKey, std::span( o_rEntries ).subspan( rRange.First, rRange.Last - rRange.First ) );
  }
  Forget();
}

void VStateBuilder::SortByKey( ZEK::VFlowEntry* i_pFirst, ZEK::VFlowEntry* i_pLast )
{
  const auto Earlier = []( const ZEK::VFlowEntry& i_rA, const ZEK::VFlowEntry& i_rB )
  {
    return i_rA.Key < i_rB.Key;
  };
  if ( std::is_sorted( i_pFirst, i_pLast, Earlier ) )
  {
    return;
  }
  // A stable sort of the library would allocate.
  m_Scratch.clear();
  for ( const ZEK::VFlowEntry* pEntry = i_pFirst; pEntry != i_pLast; ++pEntry )
  {
    m_Scratch.push_back( { *pEntry, static_cast< std::uint32_t >( pEntry - i_pFirst ) } );
  }
  std::sort( m_Scratch.begin(), m_Scratch.end(),
             []( const VOrdered& i_rA, const VOrdered& i_rB )
             {
               const auto Order = i_rA.Entry.Key <=> i_rB.Entry.Key;
               return std::is_lt( Order ) || ( std::is_eq( Order ) && i_rA.Order < i_rB.Order );
             } );
  std::transform( m_Scratch.begin(), m_Scratch.end(), i_pFirst,
                  []( const VOrdered& i_rOrdered )
                  {
                    return i_rOrdered.Entry;
                  } );
}

} // namespace HostFlow

#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>

#include "NameTable.h"

#include <algorithm>

namespace Flow2TypesUtils
{
namespace
{
template < typename TMap >
auto LowerBound( TMap& io_rMap, std::uint32_t i_Tag )
{
  return std::lower_bound( io_rMap.begin(), io_rMap.end(), i_Tag,
                           []( const auto& i_rEntry, std::uint32_t i_Sought )
                           {
                             return i_rEntry.first < i_Sought;
                           } );
}
} // namespace

VTaggedCoreTypeExtractor::VTaggedCoreTypeExtractor()
  : m_pTable( std::make_unique< VNameTable >() )
{
}

VTaggedCoreTypeExtractor::~VTaggedCoreTypeExtractor() = default;

void VTaggedCoreTypeExtractor::Insert( std::uint32_t i_Tag, std::unique_ptr< VItemCache > i_pCache )
{
  const auto It = LowerBound( m_ItemCacheMap, i_Tag );
  if ( It == m_ItemCacheMap.end() || It->first != i_Tag )
  {
    m_ItemCacheMap.emplace( It, i_Tag, std::move( i_pCache ) );
    m_bJoined = false;
  }
}

const VItemCache* VTaggedCoreTypeExtractor::Find( std::uint32_t i_Tag ) const
{
  const auto It = LowerBound( m_ItemCacheMap, i_Tag );
  const bool bFound = It != m_ItemCacheMap.end() && It->first == i_Tag;
  DebugServices::Check( bFound, "It != m_ItemCacheMap.end()", __FILE__, __LINE__ );
  return bFound ? It->second.get() : nullptr;
}

bool VTaggedCoreTypeExtractor::Update( const ZEK::IFlowState& i_rState, std::uint32_t i_NameSelector,
                                       ZEK::EFlowTimeMatch i_Match, const ZEK::VFlowTimeKey& i_rKey )
{
  const VJoinQuery Query{ i_rState, i_NameSelector, i_Match, i_rKey };
  for ( auto& rEntry : m_ItemCacheMap )
  {
    rEntry.second->Begin();
  }
  i_rState.EndCursor( m_EndEntry );
  const bool bKept = m_bJoined && m_NameSelector == i_NameSelector && KeepJoin( Query );
  m_NameSelector = i_NameSelector;
  if ( bKept )
  {
    m_bNamesChanged = false;
    return !m_Names.empty();
  }
  m_bJoined = JoinAnew( Query );
  m_bNamesChanged = m_Names != m_PreviousNames;
  return !m_Names.empty();
}

bool VTaggedCoreTypeExtractor::KeepJoin( const VJoinQuery& i_rQuery )
{
  for ( auto& rEntry : m_ItemCacheMap )
  {
    if ( !rEntry.second->Keep( i_rQuery, m_EndEntry, *m_pTable ) )
    {
      return false;
    }
  }
  return true;
}

bool VTaggedCoreTypeExtractor::JoinAnew( const VJoinQuery& i_rQuery )
{
  m_Names.swap( m_PreviousNames );
  m_pTable->Clear();
  for ( auto& rEntry : m_ItemCacheMap )
  {
    rEntry.second->Clear( true );
  }
  auto Needed = static_cast< std::uint32_t >( m_ItemCacheMap.size() );
  std::uint32_t Number = 0;
  for ( auto& rEntry : m_ItemCacheMap )
  {
    bool bRequired = true;
    if ( !rEntry.second->Collect( i_rQuery, Number++, *m_pTable, bRequired ) )
    {
      Abort();
      return false;
    }
    Needed -= bRequired ? 0 : 1;
  }
  m_pTable->Number( Needed, m_Names );
  for ( auto& rEntry : m_ItemCacheMap )
  {
    rEntry.second->Resize( m_Names.size(), m_EndEntry, *m_pTable );
  }
  return true;
}

void VTaggedCoreTypeExtractor::Abort()
{
  m_Names.clear();
  m_pTable->Clear();
  for ( auto& rEntry : m_ItemCacheMap )
  {
    rEntry.second->Clear( false );
  }
}

bool VTaggedCoreTypeExtractor::IndexOf( std::string_view i_Name, std::uint64_t& o_rIndex ) const
{
  const auto It = std::lower_bound( m_Names.begin(), m_Names.end(), i_Name );
  const bool bFound = It != m_Names.end() && *It == i_Name;
  o_rIndex = bFound ? static_cast< std::uint64_t >( It - m_Names.begin() ) : NoIndex;
  return bFound;
}

void VTaggedCoreTypeExtractor::Items( std::uint32_t i_Tag, std::vector< ZEK::VFlowItemRef >& o_rItems ) const
{
  o_rItems.clear();
  for ( const ZEK::VFlowCursor& rEntry : Entries( i_Tag ) )
  {
    o_rItems.push_back( rEntry == m_EndEntry ? ZEK::VFlowItemRef() : ZEK::VFlowItemRef( rEntry->pItem ) );
  }
}

const std::vector< ZEK::VFlowCursor >& VTaggedCoreTypeExtractor::Entries( std::uint32_t i_Tag ) const
{
  static const std::vector< ZEK::VFlowCursor > None;
  const VItemCache* pCache = Find( i_Tag );
  return pCache ? pCache->Entries() : None;
}

bool VTaggedCoreTypeExtractor::Changed( std::uint32_t i_Tag ) const
{
  const VItemCache* pCache = Find( i_Tag );
  return pCache && pCache->Changed();
}

bool VTaggedCoreTypeExtractor::Changed() const
{
  return m_bNamesChanged || std::any_of( m_ItemCacheMap.begin(), m_ItemCacheMap.end(),
                                         []( const auto& i_rEntry )
                                         {
                                           return i_rEntry.second->Changed();
                                         } );
}

bool VTaggedCoreTypeExtractor::Occurs( std::uint32_t i_Tag ) const
{
  const VItemCache* pCache = Find( i_Tag );
  return pCache && pCache->Occurs();
}

void VTaggedCoreTypeExtractor::ChangedBits( std::uint32_t i_Tag, std::vector< bool >& o_rBits ) const
{
  o_rBits.clear();
  if ( const VItemCache* pCache = Find( i_Tag ) )
  {
    pCache->ChangedBits( o_rBits );
  }
}

} // namespace Flow2TypesUtils

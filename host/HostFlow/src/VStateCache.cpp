#include "VStateCache.h"

#include "VFlowState.h"

#include <algorithm>
#include <atomic>

using namespace ZEK;

namespace HostFlow
{
namespace
{

std::uint32_t NextId()
{
  static std::atomic< std::uint32_t > Last{ 0 };
  return ++Last;
}

enum EMode : std::uint32_t
{
  EModeOldest = 0,
  EModeAtKey = 1,
  EModeNewest = 2
};

} // namespace

VStateCache::VStateCache( std::size_t i_Ring )
  : m_Id( NextId() )
  , m_Ring( std::max< std::size_t >( i_Ring, 1 ) )
{
}

VStateCache::~VStateCache()
{
  m_Ring.clear();
  m_StaticItems.clear();
  TrimPools();
}

std::uint32_t VStateCache::GetStatus() const
{
  const std::lock_guard Lock( m_Guard );
  return m_Status;
}

bool VStateCache::Query( const VFlowTimeKey&, std::uint32_t, bool ) const
{
  return false;
}

bool VStateCache::QueryRange( VFlowTimeRange& ) const
{
  return false;
}

bool VStateCache::QueryKey( const VFlowTimeKey&, VFlowTimeKey&, const VFlowValueId&, std::uint32_t ) const
{
  return false;
}

bool VStateCache::QueryItems( const VFlowTimeKey&, std::span< const std::uint32_t >,
                              std::vector< VFlowItemRef >& o_rItems ) const
{
  o_rItems.clear();
  return false;
}

const VStateCache::VPlace* VStateCache::Find( const VFlowTimeKey& i_rKey, bool i_bOldest ) const
{
  const VPlace* pCovering = nullptr;
  const VFlowTimeKey Moment{ i_rKey.Frame, 1, i_rKey.Clock };
  for ( std::size_t Step = 0; Step < m_Count; ++Step )
  {
    const VPlace& rPlace = At( i_bOldest ? Step : m_Count - 1 - Step );
    if ( rPlace.Key == i_rKey )
    {
      return &rPlace;
    }
    if ( !pCovering && FlowTimeMatches( EFlowTimeMatch::Overlap, rPlace.Key, Moment ) )
    {
      pCovering = &rPlace;
    }
  }
  return pCovering;
}

bool VStateCache::Contains( const VFlowTimeKey& i_rKey, std::uint32_t ) const
{
  const std::lock_guard Lock( m_Guard );
  return Find( i_rKey, false ) != nullptr;
}

bool VStateCache::FetchWhere( const VFlowTimeKey& i_rKey, VFlowStateRef& o_rState, std::uint32_t i_Mask,
                              std::uint32_t i_Mode, std::uint32_t )
{
  o_rState.Reset(); // it may be the last reference: never under the lock
  if ( i_Mask == 0 || i_Mode > EModeNewest )
  {
    return false;
  }
  const std::lock_guard Lock( m_Guard );
  const VPlace* pPlace = Find( i_rKey, i_Mode == EModeOldest );
  if ( !pPlace )
  {
    return false;
  }
  o_rState = pPlace->State;
  return true;
}

bool VStateCache::Fetch( VFlowStateRef& o_rState, std::uint32_t i_Mask, std::uint32_t i_Mode, std::uint32_t )
{
  o_rState.Reset();
  if ( i_Mask == 0 || ( i_Mode != EModeOldest && i_Mode != EModeNewest ) )
  {
    return false;
  }
  const std::lock_guard Lock( m_Guard );
  if ( m_Count > 0 )
  {
    o_rState = At( i_Mode == EModeOldest ? 0 : m_Count - 1 ).State;
  }
  return true;
}

bool VStateCache::FetchMany( const VFlowTimeRange& i_rRange, std::vector< VFlowStateRef >& o_rStates, std::uint32_t )
{
  o_rStates.clear();
  const std::lock_guard Lock( m_Guard );
  for ( std::size_t Age = 0; Age < m_Count; ++Age )
  {
    const VPlace& rPlace = At( Age );
    if ( rPlace.Key >= i_rRange.First && rPlace.Key <= i_rRange.Last )
    {
      o_rStates.push_back( rPlace.State );
    }
  }
  for ( const VFlowStateRef& rState : m_Around )
  {
    const VFlowTimeKey Key = rState->GetKey();
    if ( Key >= i_rRange.First && Key <= i_rRange.Last )
    {
      o_rStates.push_back( rState );
    }
  }
  return true;
}

/// Leaves in the argument the state that had to go. True when it was the one with the same key.
bool VStateCache::Put( VFlowStateRef& io_rState )
{
  const VFlowTimeKey Key = io_rState->GetKey();
  const std::lock_guard Lock( m_Guard );
  const bool bReplaces = m_Count > 0 && At( m_Count - 1 ).Key == Key;
  if ( !bReplaces )
  {
    if ( m_Count == m_Ring.size() )
    {
      m_First = ( m_First + 1 ) % m_Ring.size();
    }
    else
    {
      ++m_Count;
    }
  }
  VPlace& rPlace = At( m_Count - 1 );
  rPlace.Key = Key;
  std::swap( rPlace.State, io_rState );
  return bReplaces;
}

IResult VStateCache::Add( const VFlowStateRef& i_rState )
{
  if ( !i_rState )
  {
    return IResult::InvalidPointer;
  }
  if ( const auto* pState = dynamic_cast< const VFlowState* >( i_rState.Get() ) )
  {
    pState->Freeze();
  }
  VFlowStateRef Gone = i_rState;
  const bool bReplaces = Put( Gone );
  Gone.Reset(); // thousands of items may go with it, so not under the lock
  if ( bReplaces )
  {
    m_Notifier2.Fire();
  }
  m_StatesChanged.Fire();
  return IResult::Ok;
}

void VStateCache::Clear()
{
  std::vector< VPlace > Gone;
  std::vector< VFlowStateRef > GoneAround;
  {
    const std::lock_guard Lock( m_Guard );
    Gone.resize( m_Ring.size() );
    Gone.swap( m_Ring );
    GoneAround.swap( m_Around );
    m_First = 0;
    m_Count = 0;
  }
  Gone.clear();
  GoneAround.clear();
  m_Notifier6.Fire();
}

void VStateCache::SetAround( std::vector< VFlowStateRef >& io_rStates, bool i_bTell )
{
  for ( const VFlowStateRef& rState : io_rStates )
  {
    if ( const auto* pState = dynamic_cast< const VFlowState* >( rState.Get() ) )
    {
      pState->Freeze();
    }
  }
  {
    const std::lock_guard Lock( m_Guard );
    m_Around.swap( io_rStates );
  }
  if ( i_bTell )
  {
    m_StatesChanged.Fire();
  }
}

void VStateCache::SetStaticItems( std::vector< VFlowItemRef > i_Items )
{
  {
    const std::lock_guard Lock( m_Guard );
    m_StaticItems.swap( i_Items );
  }
  m_Notifier4.Fire();
}

void VStateCache::GetStaticItems( IResult& o_rStatus, std::vector< VFlowItemRef >& o_rItems ) const
{
  o_rItems.clear();
  const std::lock_guard Lock( m_Guard );
  o_rItems = m_StaticItems;
  o_rStatus = IResult::Ok;
}

void VStateCache::SetStatus( std::uint32_t i_Status )
{
  {
    const std::lock_guard Lock( m_Guard );
    if ( std::exchange( m_Status, i_Status ) == i_Status )
    {
      return;
    }
  }
  m_Notifier3.Fire();
}

} // namespace HostFlow

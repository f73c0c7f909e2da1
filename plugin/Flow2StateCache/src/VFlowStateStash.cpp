#include <Flow2StateCache/VFlowStateStash.h>

#include <ZEK/DebugServices.h>

#include <algorithm>
#include <utility>

namespace Flow2StateCache
{

ZEK::VFlowStateRef CloneState( const ZEK::IFlowState& i_rState )
{
  ZEK::VFlowStateRef Clone;
  const ZEK::VFlowStateFactoryRef Factory = i_rState.GetFactory();
  if ( !Factory ||
       Factory->CreateState( Clone, i_rState.GetKey(), i_rState.GetInfoA(), i_rState.GetInfoB() ).IsError() )
  {
    return nullptr;
  }
  Clone->Merge( i_rState );
  return Clone;
}

VFlowStateStash::VFlowStateStash( std::size_t i_Capacity )
  : m_Nodes( std::max< std::size_t >( i_Capacity, 1 ) )
{
  for ( VNode& rNode : m_Nodes )
  {
    m_Free.push_back( rNode );
  }
}

VFlowStateStash::~VFlowStateStash()
{
  Clear();
  m_Free.clear();
}

void VFlowStateStash::Use( VNode& i_rNode )
{
  m_Recent.splice( m_Recent.end(), m_Recent, m_Recent.iterator_to( i_rNode ) );
}

ZEK::VFlowStateRef VFlowStateStash::Find( const ZEK::VFlowTimeKey& i_rKey )
{
  const auto Found = m_Tree.find( i_rKey );
  if ( Found == m_Tree.end() )
  {
    return nullptr;
  }
  Use( *Found );
  return Found->State;
}

std::uint32_t VFlowStateStash::MaskOf( const ZEK::VFlowTimeKey& i_rKey ) const
{
  const auto Found = m_Tree.find( i_rKey );
  return Found == m_Tree.end() ? 0 : Found->Mask;
}

VFlowStateStash::VNode& VFlowStateStash::TakeNode()
{
  if ( m_Free.empty() )
  {
    VNode& rOldest = m_Recent.front();
    m_Tree.erase( m_Tree.iterator_to( rOldest ) );
    return rOldest;
  }
  VNode& rNode = m_Free.front();
  m_Free.pop_front();
  m_Recent.push_back( rNode );
  return rNode;
}

void VFlowStateStash::Add( const ZEK::VFlowStateRef& i_rState, std::uint32_t i_Mask )
{
  if ( !DebugServices::Check( i_rState.Get() != nullptr, "i_State", __FILE__, __LINE__ ) )
  {
    return;
  }
  const auto Found = m_Tree.find( i_rState->GetKey() );
  if ( Found == m_Tree.end() )
  {
    VNode& rNode = TakeNode();
    rNode.Mask = i_Mask;
    rNode.State = i_rState;
    Use( rNode );
    m_Tree.insert( rNode );
    return;
  }
  ZEK::VFlowStateRef Clone = ( Found->Mask & ~i_Mask ) != 0 ? CloneState( *Found->State ) : nullptr;
  if ( Clone )
  {
    Clone->Merge( *i_rState );
  }
  // Without memory for a clone the new state stands for what it has itself.
  const bool bUnited = Clone || ( Found->Mask & ~i_Mask ) == 0;
  Found->Mask = bUnited ? Found->Mask | i_Mask : i_Mask;
  Found->State = Clone ? std::move( Clone ) : i_rState; // of an equal key, so its place in the tree is the same
  Use( *Found );
}

void VFlowStateStash::Clear()
{
  m_Tree.clear();
  for ( VNode& rNode : m_Recent )
  {
    rNode.State.Reset();
    rNode.Mask = 0;
  }
  m_Free.splice( m_Free.end(), m_Recent );
}

} // namespace Flow2StateCache

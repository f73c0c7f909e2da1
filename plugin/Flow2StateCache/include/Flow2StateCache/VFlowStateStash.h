#pragma once

#include <ZEK/FlowState.h>

#include <boost/intrusive/list.hpp>
#include <boost/intrusive/set.hpp>

#include <cstddef>
#include <cstdint>
#include <vector>

namespace Flow2StateCache
{

/// Makes a state of its own with the key, the infos and the items of another, which may then take more. Null when
/// there is no memory for it.
ZEK::VFlowStateRef CloneState( const ZEK::IFlowState& i_rState );

/// A small cache of states, ordered by key and bounded: the state used longest ago makes room for a new key. Its nodes
/// are made at construction, so that nothing allocates afterwards. Thread: one at a time.
class VFlowStateStash
{
public:
  /// A capacity of 0 counts as 1.
  explicit VFlowStateStash( std::size_t i_Capacity );
  ~VFlowStateStash();
  VFlowStateStash( const VFlowStateStash& ) = delete;
  VFlowStateStash& operator=( const VFlowStateStash& ) = delete;

  /// The state of that key, which counts as used now; null when there is none. A hit leaves the order of the rest.
  ZEK::VFlowStateRef Find( const ZEK::VFlowTimeKey& i_rKey );
  /// Puts a state under its key. Where a state is there whose mask has bits that `i_Mask` lacks, a clone of it takes
  /// the items of the new one; else the new one replaces it. The masks unite.
  void Add( const ZEK::VFlowStateRef& i_rState, std::uint32_t i_Mask );
  void Clear();

  std::size_t Capacity() const { return m_Nodes.size(); }
  std::size_t Size() const { return m_Recent.size(); }
  /// The mask under that key, 0 when there is none. Does not count as use.
  std::uint32_t MaskOf( const ZEK::VFlowTimeKey& i_rKey ) const;

private:
  struct VNode
  {
    boost::intrusive::set_member_hook<> Tree;
    boost::intrusive::list_member_hook<> Recency;
    std::uint32_t Mask = 0;
    ZEK::VFlowStateRef State;
  };
  struct VKeyOf
  {
    using type = ZEK::VFlowTimeKey;
    const type& operator()( const VNode& i_rNode ) const { return i_rNode.State->GetKey(); }
  };
  using VTree =
      boost::intrusive::set< VNode,
                             boost::intrusive::member_hook< VNode, boost::intrusive::set_member_hook<>, &VNode::Tree >,
                             boost::intrusive::key_of_value< VKeyOf > >;
  using VList = boost::intrusive::list<
      VNode, boost::intrusive::member_hook< VNode, boost::intrusive::list_member_hook<>, &VNode::Recency > >;

  void Use( VNode& i_rNode );
  VNode& TakeNode();

  std::vector< VNode > m_Nodes;
  VTree m_Tree;
  VList m_Recent; ///< the oldest in front
  VList m_Free;
};

} // namespace Flow2StateCache

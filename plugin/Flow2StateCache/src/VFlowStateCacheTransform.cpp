#include <Flow2StateCache/VFlowStateCacheTransform.h>

#include <ZEK/DebugServices.h>

#include <atomic>
#include <utility>

namespace Flow2StateCache
{
namespace
{
constexpr std::uint32_t AllGroups = 31;
constexpr std::uint32_t StatusWithoutSource = 2;
#ifdef NDEBUG
constexpr bool bAssertTransform = false;
#else
constexpr bool bAssertTransform = true;
#endif
} // namespace

struct VFlowStateCacheTransform::VNotifiers
{
  ZEK::VMultiCallback< void() > StatesChanged;
  ZEK::VMultiCallback< void() > Notifier2;
  ZEK::VMultiCallback< void() > Notifier3;
  ZEK::VMultiCallback< void() > Notifier4;
  ZEK::VMultiCallback< void() > Notifier5;
  ZEK::VMultiCallback< void() > Notifier6;
  std::atomic< bool > bStaticItemsOld{ false };
};

VFlowStateCacheTransform::VFlowStateCacheTransform()
  : m_pNotifiers( std::make_shared< VNotifiers >() )
{
}

VFlowStateCacheTransform::~VFlowStateCacheTransform()
{
  const std::lock_guard Lock( m_Guard );
  m_Connections.clear();
}

void VFlowStateCacheTransform::SetSource( std::shared_ptr< ZEK::IFlowStateCache > i_pSource )
{
  {
    const std::lock_guard Lock( m_Guard );
    m_Connections.clear();
    ClearStashes();
    // The former source goes with the argument, outside the lock.
    m_pSource.swap( i_pSource );
    m_pNotifiers->bStaticItemsOld = false;
    ConnectSource();
    CopyStaticItems();
  }
  m_pNotifiers->Notifier6.Fire();
  m_pNotifiers->Notifier4.Fire();
  m_pNotifiers->Notifier3.Fire();
  FireFrame();
}

void VFlowStateCacheTransform::ConnectSource()
{
  if ( !m_pSource )
  {
    return;
  }
  const auto Forward = [this]( ZEK::IMultiCallbackPostal< void() >& io_rFrom,
                               ZEK::VMultiCallback< void() > VNotifiers::*i_pTo, bool i_bStaticItems = false )
  {
    m_Connections.push_back( io_rFrom.Connect(
        [pWeak = std::weak_ptr( m_pNotifiers ), i_pTo, i_bStaticItems]
        {
          if ( const auto pNotifiers = pWeak.lock() )
          {
            if ( i_bStaticItems )
            {
              pNotifiers->bStaticItemsOld = true;
            }
            ( ( *pNotifiers ).*i_pTo ).Fire();
          }
        },
        nullptr ) );
  };
  Forward( m_pSource->Notifier6(), &VNotifiers::Notifier6 );
  Forward( m_pSource->Notifier4(), &VNotifiers::Notifier4, true );
  Forward( m_pSource->Notifier3(), &VNotifiers::Notifier3 );
  Forward( m_pSource->Notifier5(), &VNotifiers::Notifier6 ); // other names are as good as another cache to a view
  Forward( m_pSource->StatesChanged(), &VNotifiers::StatesChanged );
  Forward( m_pSource->Notifier2(), &VNotifiers::Notifier2 );
}

void VFlowStateCacheTransform::CopyStaticItems() const
{
  m_StaticItems.clear();
  if ( const auto* pProvider = dynamic_cast< const IFlowStaticItemProvider* >( m_pSource.get() ) )
  {
    ZEK::IResult Status;
    pProvider->GetStaticItems( Status, m_StaticItems );
  }
}

void VFlowStateCacheTransform::SetTransform( std::shared_ptr< ZEK::IFlowStateTransform > i_pTransform )
{
  {
    const std::lock_guard Lock( m_Guard );
    ClearStashes();
    m_pTransform.swap( i_pTransform );
  }
  FireFrame();
}

void VFlowStateCacheTransform::SetParameters( const ZEK::VFlowParameterMap& i_rParameters )
{
  {
    const std::lock_guard Lock( m_Guard );
    ClearStashes();
    m_Parameters = i_rParameters;
  }
  FireFrame();
}

void VFlowStateCacheTransform::ClearStashes()
{
  m_InputStash.Clear();
  m_OutputStash.Clear();
}

void VFlowStateCacheTransform::FireFrame()
{
  m_pNotifiers->StatesChanged.Fire();
  m_pNotifiers->Notifier2.Fire();
}

void VFlowStateCacheTransform::GetId( std::uint32_t& o_rId ) const
{
  const std::lock_guard Lock( m_Guard );
  o_rId = 0;
  if ( m_pSource )
  {
    m_pSource->GetId( o_rId );
  }
}

std::uint32_t VFlowStateCacheTransform::GetStatus() const
{
  const std::lock_guard Lock( m_Guard );
  return m_pSource ? m_pSource->GetStatus() : StatusWithoutSource;
}

bool VFlowStateCacheTransform::GetFlag() const
{
  const std::lock_guard Lock( m_Guard );
  return !m_pSource || m_pSource->GetFlag();
}

bool VFlowStateCacheTransform::Query( const ZEK::VFlowTimeKey& i_rKey, std::uint32_t i_Mask, bool i_bFlag ) const
{
  const std::lock_guard Lock( m_Guard );
  return m_pSource && m_pSource->Query( i_rKey, i_Mask, i_bFlag );
}

bool VFlowStateCacheTransform::QueryRange( ZEK::VFlowTimeRange& io_rRange ) const
{
  const std::lock_guard Lock( m_Guard );
  return m_pSource && m_pSource->QueryRange( io_rRange );
}

bool VFlowStateCacheTransform::Contains( const ZEK::VFlowTimeKey& i_rKey, std::uint32_t i_Flags ) const
{
  const std::lock_guard Lock( m_Guard );
  return m_pSource && m_pSource->Contains( i_rKey, i_Flags );
}

bool VFlowStateCacheTransform::QueryKey( const ZEK::VFlowTimeKey& i_rKey, ZEK::VFlowTimeKey& o_rKey,
                                         const ZEK::VFlowValueId& i_rValue, std::uint32_t i_Flags ) const
{
  const std::lock_guard Lock( m_Guard );
  return m_pSource && m_pSource->QueryKey( i_rKey, o_rKey, i_rValue, i_Flags );
}

bool VFlowStateCacheTransform::QueryItems( const ZEK::VFlowTimeKey& i_rKey, std::span< const std::uint32_t > i_Tags,
                                           std::vector< ZEK::VFlowItemRef >& o_rItems ) const
{
  const std::lock_guard Lock( m_Guard );
  return m_pSource && m_pSource->QueryItems( i_rKey, i_Tags, o_rItems );
}

ZEK::VFlowStateRef VFlowStateCacheTransform::Transformed( const ZEK::VFlowStateRef& i_rInput )
{
  ZEK::VFlowStateRef Output;
  m_pTransform->Transform( Output, i_rInput, m_Parameters );
  if ( Output ) // else an output of the key's former input would be taken for that of this one
  {
    m_InputStash.Add( i_rInput, AllGroups );
    m_OutputStash.Add( Output, AllGroups );
  }
  return Output;
}

ZEK::VFlowStateRef VFlowStateCacheTransform::FromStash( const ZEK::VFlowStateRef& i_rInput )
{
  if ( !i_rInput )
  {
    return nullptr;
  }
  const bool bTransform = m_pTransform != nullptr;
  if ( !bTransform )
  {
    DebugServices::Check( !bAssertTransform, "m_pTransform", __FILE__, __LINE__ );
    return nullptr;
  }
  ZEK::VFlowStateRef State;
  // By object, not by key: a state that the source replaced under its key is another state.
  if ( m_InputStash.Find( i_rInput->GetKey() ) == i_rInput )
  {
    State = m_OutputStash.Find( i_rInput->GetKey() );
  }
  return State ? State : Transformed( i_rInput );
}

bool VFlowStateCacheTransform::Fetch( ZEK::VFlowStateRef& o_rState, std::uint32_t i_Mask, std::uint32_t i_Mode,
                                      std::uint32_t i_Flags )
{
  o_rState.Reset();
  ZEK::VFlowStateRef Input; // goes after the lock: it may be the last reference
  const std::lock_guard Lock( m_Guard );
  if ( !m_pSource || !m_pSource->Fetch( Input, i_Mask, i_Mode, i_Flags ) )
  {
    return false;
  }
  o_rState = FromStash( Input );
  return true;
}

bool VFlowStateCacheTransform::FetchWhere( const ZEK::VFlowTimeKey& i_rKey, ZEK::VFlowStateRef& o_rState,
                                           std::uint32_t i_Mask, std::uint32_t i_Mode, std::uint32_t i_Flags )
{
  o_rState.Reset();
  ZEK::VFlowStateRef Input; // goes after the lock: it may be the last reference
  const std::lock_guard Lock( m_Guard );
  if ( !m_pSource || !m_pSource->Contains( i_rKey, i_Flags ) ||
       !m_pSource->FetchWhere( i_rKey, Input, i_Mask, i_Mode, i_Flags ) )
  {
    return false;
  }
  o_rState = FromStash( Input );
  return true;
}

bool VFlowStateCacheTransform::FetchMany( const ZEK::VFlowTimeRange& i_rRange,
                                          std::vector< ZEK::VFlowStateRef >& o_rStates, std::uint32_t i_Flags )
{
  o_rStates.clear();
  std::vector< ZEK::VFlowStateRef > Inputs;
  const std::lock_guard Lock( m_Guard );
  if ( !m_pSource || !m_pTransform || !m_pSource->FetchMany( i_rRange, Inputs, i_Flags ) )
  {
    return false;
  }
  o_rStates.resize( Inputs.size() );
  for ( std::size_t Index = 0; Index < Inputs.size(); ++Index )
  {
    o_rStates[Index] = Inputs[Index] ? Transformed( Inputs[Index] ) : nullptr;
  }
  return true;
}

ZEK::IMultiCallbackPostal< void() >& VFlowStateCacheTransform::StatesChanged()
{
  return m_pNotifiers->StatesChanged;
}

ZEK::IMultiCallbackPostal< void() >& VFlowStateCacheTransform::Notifier2()
{
  return m_pNotifiers->Notifier2;
}

ZEK::IMultiCallbackPostal< void() >& VFlowStateCacheTransform::Notifier3()
{
  return m_pNotifiers->Notifier3;
}

ZEK::IMultiCallbackPostal< void() >& VFlowStateCacheTransform::Notifier4()
{
  return m_pNotifiers->Notifier4;
}

ZEK::IMultiCallbackPostal< void() >& VFlowStateCacheTransform::Notifier5()
{
  return m_pNotifiers->Notifier5;
}

ZEK::IMultiCallbackPostal< void() >& VFlowStateCacheTransform::Notifier6()
{
  return m_pNotifiers->Notifier6;
}

void VFlowStateCacheTransform::GetStaticItems( ZEK::IResult& o_rStatus,
                                               std::vector< ZEK::VFlowItemRef >& o_rItems ) const
{
  o_rItems.clear();
  const std::lock_guard Lock( m_Guard );
  if ( m_pNotifiers->bStaticItemsOld.exchange( false ) )
  {
    CopyStaticItems();
  }
  o_rItems = m_StaticItems;
  o_rStatus = ZEK::IResult::Ok;
}

} // namespace Flow2StateCache

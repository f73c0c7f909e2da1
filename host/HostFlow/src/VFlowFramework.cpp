#include <HostFlow/VFlowFramework.h>

#include "VFlowState.h"
#include "VItemPool.h"
#include "VStateCache.h"

#include <ZEK/FlowCacheFlags.h>

#include <algorithm>
#include <atomic>
#include <map>
#include <mutex>
#include <new>

using namespace ZEK;

namespace HostFlow
{
namespace
{

/// A handle counts its own copies; what it gives access to belongs to the process.
template < typename TInterface >
class VHandle : public TInterface
{
public:
  virtual ~VHandle() = default;
  void AddRef() const override { m_Uses.fetch_add( 1, std::memory_order_relaxed ); }
  void Release() const override
  {
    if ( m_Uses.fetch_sub( 1, std::memory_order_acq_rel ) == 1 )
    {
      delete this;
    }
  }

private:
  mutable std::atomic< std::int32_t > m_Uses{ 0 };
};

class VStateFactory final : public VHandle< IFlowStateFactoryHandle >
{
public:
  IResult CreateState( VFlowStateRef& o_rState, const VFlowTimeKey& i_rKey, const VFlowInfoA& i_rInfoA,
                       const VFlowInfoB& i_rInfoB ) override
  {
    o_rState.Reset();
    try
    {
      o_rState = VFlowState::Make( i_rKey, i_rInfoA, i_rInfoB );
    }
    catch ( const std::bad_alloc& )
    {
      return IResult::AllocationFailure;
    }
    return IResult::Ok;
  }
};

class VItemStore final : public VHandle< IFlowStoreHandle >
{
public:
  void CreateItem( IResult& o_rStatus, const VFlowItemType& i_rType, VFlowItemRef& o_rItem ) override
  {
    o_rItem.Reset();
    VItemPool* pPool = m_rPools.Find( i_rType.Tag );
    if ( !pPool )
    {
      o_rStatus = IResult::InvalidType;
      return;
    }
    try
    {
      o_rItem = VFlowItemRef( &pPool->Take() );
      o_rStatus = IResult::Ok;
    }
    catch ( const std::bad_alloc& )
    {
      o_rStatus = IResult::AllocationFailure;
    }
  }

private:
  VItemPools& m_rPools = VItemPools::Instance();
};

class VCacheManager final : public IFlowStateCacheManager
{
public:
  explicit VCacheManager( std::size_t i_Ring )
    : m_Ring( i_Ring )
  {
  }

  IResult CreateCache( std::shared_ptr< IFlowWritableStateCache >& o_rpCache, const std::string& i_rName,
                       std::uint32_t i_Flags ) override
  {
    o_rpCache.reset();
    if ( i_rName.empty() )
    {
      return IResult::InvalidName;
    }
    const std::lock_guard Lock( m_Guard );
    auto& rpCache = m_Caches[i_rName];
    const bool bPresent = rpCache != nullptr;
    if ( !bPresent )
    {
      const bool bLive = ( i_Flags & EFlowCacheWatchedLive ) != 0;
      rpCache = MakeCache( bLive ? std::min( m_Ring, LiveRing ) : m_Ring );
      m_Names.push_back( i_rName );
    }
    o_rpCache = rpCache;
    return bPresent ? IResult::AlreadyPresent : IResult::Ok;
  }

  std::shared_ptr< IFlowWritableStateCache > FindCache( const std::string& i_rName ) const override
  {
    const std::lock_guard Lock( m_Guard );
    const auto It = m_Caches.find( i_rName );
    return It != m_Caches.end() ? It->second : nullptr;
  }

  std::vector< std::string > Names() const override
  {
    const std::lock_guard Lock( m_Guard );
    return m_Names;
  }

private:
  const std::size_t m_Ring;
  mutable std::mutex m_Guard;
  std::map< std::string, std::shared_ptr< IFlowWritableStateCache > > m_Caches;
  std::vector< std::string > m_Names; // in the order they were made
};

} // namespace

VFlowStateFactoryRef MakeStateFactory()
{
  return VFlowStateFactoryRef( new VStateFactory );
}

VFlowStoreRef MakeItemStore()
{
  return VFlowStoreRef( new VItemStore );
}

std::shared_ptr< IHostStateCache > MakeCache( std::size_t i_Ring )
{
  return std::make_shared< VStateCache >( i_Ring );
}

std::shared_ptr< IFlowStateCacheManager > MakeCacheManager( std::size_t i_Ring )
{
  return std::make_shared< VCacheManager >( i_Ring );
}

VPoolFigures CountPools()
{
  return { VItemPools::Instance().Count(), VFlowState::Count(), VNameBook::Instance().Count() };
}

void TrimPools()
{
  VFlowState::TrimPool();
  VStateBuilder::Trim();
  VItemPools::Instance().Trim();
}

} // namespace HostFlow

#include "VStore.h"

#include "HandlerCallback.h"

#include <Store/Store.h>
#include <ZEK/DebugServices.h>

#include <utility>

namespace Store
{

using namespace ZEK;

/// Takes a handler without references off the store that it was made by.
struct VStore::VHandlerDeleter
{
  std::weak_ptr< VStore > m_pStore;

  void operator()( VHandlerCallback* i_pHandler ) const
  {
    {
      // The store before its lock: should this be the last reference, no locked mutex is destroyed.
      const std::shared_ptr< VStore > pStore = m_pStore.lock();
      if ( pStore )
      {
        const std::unique_lock Lock = LockOrDie( pStore->m_Lock.Mutex() );
        pStore->m_Registry.Forget( *i_pHandler );
      }
    }
    delete i_pHandler;
  }
};

std::shared_ptr< IStore > CreateStore( std::shared_ptr< IPostalService > i_pService, std::size_t i_BucketCount )
{
  return MakeShared< VStore >( std::move( i_pService ), i_BucketCount );
}

VStore::VStore( std::shared_ptr< IPostalService > i_pService, std::size_t i_BucketCount )
  : m_pService( std::move( i_pService ) )
  , m_Table( i_BucketCount )
  , m_Registry( m_Table )
  , m_Reader( *this )
  , m_Writer( *this )
{
}

VStore::~VStore()
{
  for ( const std::shared_ptr< VHandlerCallback >& rpHandler : m_Registry.Living() )
  {
    rpHandler->RemoveAllCallbacks();
  }
}

std::shared_ptr< VStore > VStore::Self() const
{
  return std::static_pointer_cast< VStore >( const_cast< VStore* >( this )->VShared::weak_from_this().lock() );
}

const VEntryPath& VStore::GetEntryPath( const VEntryPath& i_rPath )
{
  return GetEntry( i_rPath )->m_Path;
}

VStoreEntry* VStore::GetEntry( const VEntryPath& i_rPath )
{
  if ( VStoreEntry* const pEntry = m_Table.Find( i_rPath ) )
  {
    return pEntry;
  }
  const std::unique_lock Lock = LockOrDie( m_Lock.Mutex() );
  return &m_Table.FindOrMake( i_rPath );
}

const VEntryPath& VStore::EntryPath( const VStoreEntry* i_pEntry ) const
{
  return i_pEntry != nullptr ? i_pEntry->m_Path : m_Table.Root().m_Path;
}

IResult VStore::Shutdown()
{
  if ( BeginWrite() == nullptr )
  {
    return IResult::NotPermitted;
  }
  {
    const std::unique_lock Lock = LockOrDie( m_Lock.Mutex() );
    m_bClosing = true;
  }
  EndWrite();
  return IResult::Ok;
}

IStoreReader* VStore::BeginRead()
{
  VThreadState& rThread = Thread();
  if ( rThread.m_Depth++ != 0 )
  {
    return rThread.m_bWriter ? static_cast< IStoreReader* >( &m_Writer ) : &m_Reader;
  }
  rThread.m_bWriter = false;
  m_Lock.BeginRead( *rThread.m_pLine );
  return &m_Reader;
}

void VStore::EndRead()
{
  VThreadState& rThread = Thread();
  if ( rThread.m_Depth > 1 )
  {
    --rThread.m_Depth;
    return;
  }
  if ( !DebugServices::Check( rThread.m_Depth == 1 && !rThread.m_bWriter, "inside a read scope", __FILE__, __LINE__ ) )
  {
    return;
  }
  rThread.m_Depth = 0;
  if ( rThread.m_Deferred.empty() )
  {
    m_Lock.EndRead( *rThread.m_pLine );
    return;
  }
  // A deferred function may release the store.
  const std::shared_ptr< VStore > pSelf = Self();
  m_Lock.EndRead( *rThread.m_pLine );
  VFirstFailure Failure;
  RunDeferred( rThread, Failure );
  Failure.Rethrow();
}

IStoreWriter* VStore::BeginWrite()
{
  VThreadState& rThread = Thread();
  if ( rThread.m_Depth != 0 )
  {
    if ( !rThread.m_bWriter )
    {
      return nullptr;
    }
    ++rThread.m_Depth;
    return &m_Writer;
  }
  rThread.m_bWriter = true;
  rThread.m_Depth = 1;
  m_Lock.BeginWrite();
  return &m_Writer;
}

void VStore::EndWrite()
{
  VThreadState& rThread = Thread();
  if ( !DebugServices::Check( rThread.m_Depth != 0 && rThread.m_bWriter, "inside a write scope", __FILE__, __LINE__ ) )
  {
    return;
  }
  if ( --rThread.m_Depth != 0 )
  {
    return;
  }
  if ( rThread.m_bSpareTaken )
  {
    // Within a callback of another commit.
    VDelivery Inner;
    EndOutermost( rThread, Inner );
    return;
  }
  struct VTaken
  {
    ~VTaken() { m_rbTaken = false; }
    bool& m_rbTaken;
  };
  rThread.m_bSpareTaken = true;
  const VTaken Taken{ rThread.m_bSpareTaken };
  EndOutermost( rThread, rThread.m_Spare );
}

void VStore::EndOutermost( VThreadState& io_rThread, VDelivery& io_rDelivery )
{
  const ChangeId Id = Commit( io_rDelivery );
  if ( io_rDelivery.m_Touched.empty() && io_rThread.m_Deferred.empty() )
  {
    m_Lock.Advance();
    return;
  }
  // Callbacks and deferred functions may release the store.
  const std::shared_ptr< VStore > pSelf = Self();
  m_Lock.Advance();
  VFirstFailure Failure;
  Deliver( io_rThread, io_rDelivery, Id, Failure );
  io_rDelivery.Clear();
  RunDeferred( io_rThread, Failure );
  Failure.Rethrow();
}

ChangeId VStore::Commit( VDelivery& io_rDelivery )
{
  const std::unique_lock Lock = m_Lock.BeginCommit();
  const ChangeId Id( m_Lock.Commit() );
  VMerge Merge( m_Registry, m_Pending, io_rDelivery, Id );
  if ( m_Table.Root().m_pChange != nullptr )
  {
    Merge.MergeFrom( m_Table.Root() );
  }
  if ( !m_Requests.empty() )
  {
    for ( const VQueuedRequest& rRequest : m_Requests )
    {
      Merge.Expand( m_Table, rRequest );
    }
    m_Requests.clear();
  }
  for ( const std::shared_ptr< VHandlerCallback >& rpHandler : io_rDelivery.m_Touched )
  {
    if ( m_bClosing )
    {
      rpHandler->Forget();
    }
    else
    {
      rpHandler->Collect( Id, io_rDelivery );
    }
  }
  m_Lock.EndCommit();
  return Id;
}

void VStore::Deliver( VThreadState& io_rThread, VDelivery& io_rDelivery, ChangeId i_Id, VFirstFailure& io_rFailure )
{
  // Nothing of what follows throws: every call is tried.
  ++io_rThread.m_Dispatch;
  for ( const VDelivery::VImmediate& rImmediate : io_rDelivery.m_Immediate )
  {
    rImmediate.m_pList->RunNow( rImmediate.m_Flags, i_Id, io_rFailure );
  }
  for ( std::size_t Place = 0; io_rDelivery.m_bPosts && Place < io_rDelivery.m_Touched.size(); ++Place )
  {
    io_rDelivery.m_Touched[Place]->GatherPosts( i_Id, io_rThread.m_Outbox );
  }
  if ( --io_rThread.m_Dispatch == 0 && !io_rThread.m_Outbox.IsEmpty() )
  {
    io_rThread.m_Outbox.Send( io_rFailure );
  }
}

void VStore::Defer( std::function< void() > i_Function )
{
  Thread().m_Deferred.push_back( std::move( i_Function ) );
}

void VStore::RunDeferred( VThreadState& io_rThread, VFirstFailure& io_rFailure )
{
  // A scope inside a deferred function leaves the rest to the loop that runs it.
  if ( io_rThread.m_bDraining )
  {
    return;
  }
  io_rThread.m_bDraining = true;
  while ( !io_rThread.m_Deferred.empty() )
  {
    const std::function< void() > Function = std::move( io_rThread.m_Deferred.front() );
    io_rThread.m_Deferred.pop_front();
    io_rFailure.Try( Function );
  }
  io_rThread.m_bDraining = false;
}

std::shared_ptr< VHandlerCallback > VStore::MakeHandler( const VEntryPatternSet& i_rSet )
{
  return std::shared_ptr< VHandlerCallback >( new VHandlerCallback( i_rSet, m_pService ), VHandlerDeleter{ Self() } );
}

std::shared_ptr< IHandlerCallback > VStore::RegisterHandler( const VEntryPatternSet& i_rSet )
{
  const std::unique_lock Lock = LockOrDie( m_Lock.Mutex() );
  return m_Registry.FindOrMake( i_rSet,
                                [&]
                                {
                                  return MakeHandler( i_rSet );
                                } );
}

std::size_t VStore::HandlerCount() const
{
  const std::unique_lock Lock = LockOrDie( m_Lock.Mutex() );
  return m_Registry.Count();
}

} // namespace Store

#include "CallbackList.h"

#include "GenerationLock.h"

#include <algorithm>
#include <utility>

namespace Store
{

using namespace ZEK;

namespace
{
void Call( const VCallbackRecord& i_rRecord, std::uint64_t i_Flags, ChangeId i_Id,
           std::vector< CallbackId >& io_rLeaving, VFirstFailure& io_rFailure )
{
  try
  {
    ( *i_rRecord.m_pFunction )( i_Flags, i_Id );
  }
  catch ( const VDeregisterWeakCallbackException& )
  {
    io_rLeaving.push_back( i_rRecord.m_pFunction.get() );
  }
  catch ( ... )
  {
    io_rFailure.Keep();
  }
}
} // namespace

CallbackId VCallbackList::Add( VCallbackRecord i_Record )
{
  const CallbackId Id = i_Record.m_pFunction.get();
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  auto pNew = std::make_shared< VRecordArray >();
  pNew->reserve( m_pRecords->size() + 1 );
  *pNew = *m_pRecords;
  pNew->push_back( std::move( i_Record ) );
  // All records of the old array are in the new one, so that no handler ends here.
  Replace( std::move( pNew ) );
  return Id;
}

std::size_t VCallbackList::RemoveIf( const std::function< bool( const VCallbackRecord& ) >& i_rWanted,
                                     VOldArrays& io_rOld )
{
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  if ( std::none_of( m_pRecords->begin(), m_pRecords->end(), i_rWanted ) )
  {
    return 0;
  }
  auto pNew = std::make_shared< VRecordArray >();
  for ( const VCallbackRecord& rRecord : *m_pRecords )
  {
    if ( !i_rWanted( rRecord ) )
    {
      pNew->push_back( rRecord );
    }
  }
  const std::size_t Removed = m_pRecords->size() - pNew->size();
  io_rOld.push_back( m_pRecords );
  Replace( std::move( pNew ) );
  return Removed;
}

void VCallbackList::Replace( std::shared_ptr< VRecordArray > i_pNew )
{
  std::uint64_t Masks = 0;
  for ( const VCallbackRecord& rRecord : *i_pNew )
  {
    Masks |= rRecord.m_Mask;
  }
  m_Masks.store( Masks, std::memory_order_release );
  m_pRecords = std::move( i_pNew );
}

std::size_t VCallbackList::Count() const
{
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  return m_pRecords->size();
}

std::size_t VCallbackList::CountWithMask( std::uint64_t i_Mask ) const
{
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  return static_cast< std::size_t >( std::count_if( m_pRecords->begin(), m_pRecords->end(),
                                                    [i_Mask]( const VCallbackRecord& i_rRecord )
                                                    {
                                                      return i_rRecord.m_Mask == i_Mask;
                                                    } ) );
}

void VCallbackList::Accumulate( std::uint64_t i_Flags, ChangeId i_Id )
{
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  m_Newest = i_Id;
  for ( VCallbackRecord& rRecord : *m_pRecords )
  {
    rRecord.m_Pending |= i_Flags;
    m_bHasWork |= ( rRecord.m_Mask & rRecord.m_Pending ) != 0;
  }
}

bool VCallbackList::HasWork() const
{
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  return m_bHasWork;
}

void VCallbackList::RunNow( std::uint64_t i_Flags, ChangeId i_Id, VFirstFailure& io_rFailure )
{
  std::shared_ptr< VRecordArray > pRecords;
  {
    const std::unique_lock Lock = LockOrDie( m_Mutex );
    pRecords = m_pRecords;
  }
  std::vector< CallbackId > Leaving;
  for ( const VCallbackRecord& rRecord : *pRecords )
  {
    if ( ( rRecord.m_Mask & i_Flags ) != 0 )
    {
      Call( rRecord, i_Flags, i_Id, Leaving, io_rFailure );
    }
  }
  RemoveAll( Leaving );
}

void VCallbackList::RunPosted( ChangeId i_Id, VFirstFailure& io_rFailure )
{
  std::vector< VCall > Calls;
  ChangeId Newest;
  const std::shared_ptr< VRecordArray > pRecords = TakeCalls( i_Id, Newest, Calls );
  std::vector< CallbackId > Leaving;
  for ( const VCall& rCall : Calls )
  {
    Call( *rCall.m_pRecord, rCall.m_Flags, Newest, Leaving, io_rFailure );
  }
  RemoveAll( Leaving );
}

std::shared_ptr< VRecordArray > VCallbackList::TakeCalls( ChangeId i_Id, ChangeId& o_rNewest,
                                                          std::vector< VCall >& o_rCalls )
{
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  o_rNewest = m_Newest;
  m_bHasWork = false;
  for ( VCallbackRecord& rRecord : *m_pRecords )
  {
    if ( ( rRecord.m_Pending & rRecord.m_Mask ) == 0 )
    {
      continue;
    }
    // One that wants the latest only waits for the newest commit's delivery, which is on its way.
    if ( i_Id == m_Newest || rRecord.m_Mode != IHandlerCallback::LatestOnly )
    {
      o_rCalls.push_back( { &rRecord, std::exchange( rRecord.m_Pending, 0 ) } );
    }
    else
    {
      m_bHasWork = true;
    }
  }
  return m_pRecords;
}

void VCallbackList::RemoveAll( const std::vector< CallbackId >& i_rIds )
{
  if ( !i_rIds.empty() )
  {
    VOldArrays Old;
    RemoveIf(
        [&i_rIds]( const VCallbackRecord& i_rRecord )
        {
          return std::find( i_rIds.begin(), i_rIds.end(), i_rRecord.m_pFunction.get() ) != i_rIds.end();
        },
        Old );
  }
}

} // namespace Store

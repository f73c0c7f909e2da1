#include "HandlerCallback.h"

#include "GenerationLock.h"

#include <ZEK/DebugServices.h>

#include <utility>
#include <vector>

namespace Store
{

using namespace ZEK;

VHandlerCallback::VHandlerCallback( VEntryPatternSet i_Set, std::shared_ptr< IPostalService > i_pService )
  : m_Set( std::move( i_Set ) )
  , m_pService( std::move( i_pService ) )
{
}

IHandlerCallbackProxy VHandlerCallback::CreateProxy( std::uint64_t i_Mask, std::uint32_t i_Mode )
{
  return IHandlerCallbackProxy( shared_from_this(), i_Mask, i_Mode );
}

VCallbackRecord VHandlerCallback::MakeRecord( ChangeFunction i_Function, std::uint64_t i_Mask, std::uint32_t i_Mode )
{
  return { std::make_shared< const ChangeFunction >( std::move( i_Function ) ), i_Mask, i_Mode, 0, shared_from_this() };
}

CallbackId VHandlerCallback::AddCallback( ChangeFunction i_Function, std::uint64_t i_Mask, std::uint32_t i_Mode )
{
  return AddCallbackOn( m_pService, std::move( i_Function ), i_Mask, i_Mode );
}

CallbackId VHandlerCallback::AddCallbackOn( const std::shared_ptr< IPostalService >& i_rpService,
                                            ChangeFunction i_Function, std::uint64_t i_Mask, std::uint32_t i_Mode )
{
  if ( !DebugServices::Check( i_rpService != nullptr, "i_rpService", __FILE__, __LINE__ ) )
  {
    return nullptr;
  }
  VCallbackRecord Record = MakeRecord( std::move( i_Function ), i_Mask, i_Mode );
  // In one go: a commit drops lists that are empty.
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  std::shared_ptr< VCallbackList >& rpList = m_Posted[i_rpService];
  if ( !rpList )
  {
    rpList = std::make_shared< VCallbackList >();
  }
  return rpList->Add( std::move( Record ) );
}

CallbackId VHandlerCallback::AddImmediateCallback( ChangeFunction i_Function, std::uint64_t i_Mask )
{
  VCallbackRecord Record = MakeRecord( std::move( i_Function ), i_Mask, EveryDelivery );
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  if ( !m_pImmediate )
  {
    m_pImmediate = std::make_shared< VCallbackList >();
  }
  return m_pImmediate->Add( std::move( Record ) );
}

std::size_t VHandlerCallback::RemoveIf( const std::function< bool( const VCallbackRecord& ) >& i_rWanted )
{
  // What is declared before the lock goes after it: records, services, and this with its last record.
  const std::shared_ptr< VHandlerCallback > pSelf = shared_from_this();
  VOldArrays Old;
  std::vector< VPostedLists::node_type > Emptied;
  std::size_t Removed = 0;
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  if ( m_pImmediate )
  {
    Removed += m_pImmediate->RemoveIf( i_rWanted, Old );
    if ( m_pImmediate->IsEmpty() )
    {
      m_pImmediate.reset();
    }
  }
  for ( auto It = m_Posted.begin(); It != m_Posted.end(); )
  {
    const auto Here = It++;
    Removed += Here->second->RemoveIf( i_rWanted, Old );
    if ( Here->second->IsEmpty() )
    {
      Emptied.push_back( m_Posted.extract( Here ) );
    }
  }
  return Removed;
}

std::size_t VHandlerCallback::RemoveCallbacksWithMask( std::uint64_t i_Mask )
{
  return RemoveIf(
      [i_Mask]( const VCallbackRecord& i_rRecord )
      {
        return i_rRecord.m_Mask == i_Mask;
      } );
}

bool VHandlerCallback::RemoveCallback( CallbackId i_Id )
{
  return RemoveIf(
             [i_Id]( const VCallbackRecord& i_rRecord )
             {
               return i_rRecord.m_pFunction.get() == i_Id;
             } ) != 0;
}

void VHandlerCallback::RemoveAllCallbacks()
{
  RemoveIf(
      []( const VCallbackRecord& )
      {
        return true;
      } );
}

template < typename TVisit >
void VHandlerCallback::ForEachList( const TVisit& i_rVisit ) const
{
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  if ( m_pImmediate )
  {
    i_rVisit( *m_pImmediate );
  }
  for ( const auto& [rpService, rpList] : m_Posted )
  {
    i_rVisit( *rpList );
  }
}

std::size_t VHandlerCallback::CountCallbacksWithMask( std::uint64_t i_Mask ) const
{
  std::size_t Count = 0;
  ForEachList(
      [&Count, i_Mask]( const VCallbackList& i_rList )
      {
        Count += i_rList.CountWithMask( i_Mask );
      } );
  return Count;
}

std::size_t VHandlerCallback::CountCallbacks() const
{
  std::size_t Count = 0;
  ForEachList(
      [&Count]( const VCallbackList& i_rList )
      {
        Count += i_rList.Count();
      } );
  return Count;
}

void VHandlerCallback::Join( VDelivery& io_rDelivery )
{
  if ( std::shared_ptr< VHandlerCallback > pSelf = weak_from_this().lock() )
  {
    io_rDelivery.m_Touched.push_back( std::move( pSelf ) );
  }
}

void VHandlerCallback::Collect( ChangeId i_Id, VDelivery& io_rDelivery )
{
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  const std::uint64_t Flags = std::exchange( m_Accumulated, 0 );
  if ( m_pImmediate )
  {
    if ( m_pImmediate->Wants( Flags ) )
    {
      io_rDelivery.m_Immediate.push_back( { m_pImmediate, Flags } );
    }
    else if ( m_pImmediate->IsEmpty() )
    {
      m_pImmediate.reset();
    }
  }
  for ( const auto& [rpService, rpList] : m_Posted )
  {
    rpList->Accumulate( Flags, i_Id );
    io_rDelivery.m_bPosts = true;
  }
}

void VHandlerCallback::GatherPosts( ChangeId i_Id, VOutbox& io_rOutbox )
{
  // A service may end with the last list that names it, which is no matter for a lock.
  std::vector< VPostedLists::node_type > Emptied;
  const std::unique_lock Lock = LockOrDie( m_Mutex );
  for ( auto It = m_Posted.begin(); It != m_Posted.end(); )
  {
    const auto Here = It++;
    if ( Here->second->HasWork() )
    {
      io_rOutbox.Add( Here->first, i_Id, Here->second );
    }
    else if ( Here->second->IsEmpty() )
    {
      Emptied.push_back( m_Posted.extract( Here ) );
    }
  }
}

} // namespace Store

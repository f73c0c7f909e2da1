#include <HostSources/VSourcePump.h>

#include "FramesAround.h"

#include <ZEK/Log.h>

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <new>
#include <thread>
#include <utility>

using namespace ZEK;

namespace HostSources
{
namespace
{

using VClock = std::chrono::steady_clock;

/// After so long without another frame whoever looks on is told of those around.
constexpr std::chrono::milliseconds QuietTime( 50 );
/// A source that takes so long for a frame is not asked for those around until later.
constexpr std::chrono::milliseconds SlowFrame( 5 );

const VLogCategory& Category()
{
  static const VLogCategory& rCategory = GlobalLog().Category( "Source" );
  return rCategory;
}

} // namespace

/// Two locks: one on the source, held while a frame is made, and one on what is asked and shown, never held then.
/// Where both are taken, the source's comes first.
struct VSourcePump::VImpl
{
  void Start( bool i_bLive, std::int64_t i_First );
  void Stop();
  void Follow( bool i_bOn );
  void RunLive();
  void RunFollow();
  IResult TryMake( std::int64_t i_Index, VFlowStateRef& o_rState );
  IResult TryMakeAndAdd( std::int64_t i_Index, bool i_bClear, bool i_bKnown );
  bool MakeAndAdd( std::int64_t i_Index, bool i_bClear, bool i_bKnown = false );
  void HandOverAround( bool i_bTell );
  bool WaitOrLookAround( std::unique_lock< std::mutex >& io_rLock );

  std::shared_ptr< IFrameSource > pSource;
  std::shared_ptr< IFlowWritableStateCache > pCache;
  VStateMaker Maker;
  std::mutex SourceGuard;
  std::mutex ControlGuard; // start and stop
  std::thread Thread;

  mutable std::mutex Guard;
  std::condition_variable Wake; // the pump waits
  std::condition_variable Idle; // others wait for the pump
  bool bRunning = false;
  bool bLive = false;
  bool bStop = false;
  bool bFailing = false;
  std::int64_t First = 0;
  bool bAsked = false;
  bool bAgain = false; // what the frame that is shown lacked has come
  bool bBusy = false;
  bool bSeek = false;
  bool bForget = false; // the source makes other states than before
  VFramesAround Around; // of the pump's thread while it runs
  std::int64_t Asked = 0;
  std::int64_t Shown = -1;
  std::uint64_t Added = 0;
  std::uint64_t Skipped = 0;
  IResult Last;
};

VSourcePump::VSourcePump( std::shared_ptr< IFrameSource > i_pSource,
                          std::shared_ptr< IFlowWritableStateCache > i_pCache, const VStateMaker& i_rMaker )
  : m_pImpl( std::make_unique< VImpl >() )
{
  m_pImpl->pSource = std::move( i_pSource );
  m_pImpl->pCache = std::move( i_pCache );
  m_pImpl->Maker = i_rMaker;
}

VSourcePump::~VSourcePump()
{
  Stop();
}

/// What a source or a listener of the cache throws, a lack of memory above all, must not end the process.
IResult VSourcePump::VImpl::TryMake( std::int64_t i_Index, VFlowStateRef& o_rState )
{
  try
  {
    const std::lock_guard Lock( SourceGuard );
    return pSource->MakeState( i_Index, Maker, o_rState );
  }
  catch ( const std::bad_alloc& )
  {
    return IResult::AllocationFailure;
  }
  catch ( ... )
  {
    return IResult::FailedWithException;
  }
}

IResult VSourcePump::VImpl::TryMakeAndAdd( std::int64_t i_Index, bool i_bClear, bool i_bKnown )
{
  VFlowStateRef State = i_bKnown ? Around.Find( i_Index ) : VFlowStateRef();
  const IResult Result = State ? IResult( IResult::Ok ) : TryMake( i_Index, State );
  if ( Result.IsError() )
  {
    return Result;
  }
  try
  {
    if ( i_bClear )
    {
      pCache->Clear();
    }
    const IResult Put = pCache->Add( State );
    if ( Put.IsOk() )
    {
      Around.Shown( i_Index, State );
    }
    return Put;
  }
  catch ( const std::bad_alloc& )
  {
    return IResult::AllocationFailure;
  }
  catch ( ... )
  {
    return IResult::FailedWithException;
  }
}

bool VSourcePump::VImpl::MakeAndAdd( std::int64_t i_Index, bool i_bClear, bool i_bKnown )
{
  const IResult Result = TryMakeAndAdd( i_Index, i_bClear, i_bKnown );
  bool bFirstFailure = false;
  {
    const std::lock_guard Lock( Guard );
    bFirstFailure = Result.IsError() && !bFailing;
    bFailing = Result.IsError();
    Last = Result;
    if ( Result.IsOk() )
    {
      Shown = i_Index;
      ++Added;
    }
  }
  if ( bFirstFailure )
  {
    Log( Category(), ELogWarning, "Frame %1% of \"%2%\" could not be shown: %3%", i_Index, pSource->Name(),
         Result.Text() );
  }
  return Result.IsOk();
}

void VSourcePump::VImpl::RunLive()
{
  const double Rate = pSource->RateHz();
  const std::int64_t Count = pSource->FrameCount();
  const VClock::time_point Begin = VClock::now();
  std::unique_lock Lock( Guard );
  const std::int64_t Begun = First;
  std::int64_t Next = Begun;
  while ( !bStop && ( Count < 0 || Next < Count ) )
  {
    const auto Due = Begin + std::chrono::duration_cast< VClock::duration >(
                                 std::chrono::duration< double >( static_cast< double >( Next - Begun ) / Rate ) );
    if ( Wake.wait_until( Lock, Due,
                          [this]
                          {
                            return bStop;
                          } ) )
    {
      break;
    }
    // The newest frame whose time has come; whatever lies between is left out, but never the first.
    const double Elapsed = std::chrono::duration< double >( VClock::now() - Begin ).count();
    const std::int64_t Late = Next > Begun ? static_cast< std::int64_t >( Elapsed * Rate ) : 0;
    std::int64_t Index = std::max( Next, Begun + Late );
    Index = Count < 0 ? Index : std::min( Index, Count - 1 );
    Skipped += static_cast< std::uint64_t >( Index - Next );
    Lock.unlock();
    MakeAndAdd( Index, false );
    Lock.lock();
    Next = Index + 1;
  }
  // A source that ended keeps its last frame until it is stopped.
  while ( !bStop )
  {
    Wake.wait( Lock,
               [this]
               {
                 return bStop || bAgain;
               } );
    if ( !bStop && std::exchange( bAgain, false ) && Shown >= 0 )
    {
      const std::int64_t Index = Shown;
      Lock.unlock();
      MakeAndAdd( Index, false );
      Lock.lock();
    }
  }
}

void VSourcePump::VImpl::HandOverAround( bool i_bTell )
{
  try
  {
    Around.HandOver( Shown, i_bTell ); // only the pump's thread writes it
  }
  catch ( ... )
  {
    Log( Category(), ELogWarning, "What lies around frame %1% of \"%2%\" could not be shown", Shown, pSource->Name() );
  }
}

/// True when there is something to do; false after it did a bit of what can wait.
bool VSourcePump::VImpl::WaitOrLookAround( std::unique_lock< std::mutex >& io_rLock )
{
  const auto IsDue = [this]
  {
    return bStop || bAsked || bAgain;
  };
  if ( std::exchange( bForget, false ) )
  {
    Around.Forget();
  }
  const std::int64_t Next = Shown < 0 ? -1 : Around.Next( Shown, pSource->FrameCount() );
  const bool bResting = Shown >= 0 && Around.IsResting();
  if ( Next < 0 && !bResting && !Around.HasUntold() )
  {
    Wake.wait( io_rLock, IsDue );
    return true;
  }
  const bool bDue = Next >= 0 ? IsDue() : Wake.wait_for( io_rLock, QuietTime, IsDue );
  io_rLock.unlock();
  if ( !bDue && Next >= 0 )
  {
    VFlowStateRef State;
    const auto Begin = VClock::now();
    const IResult Result = TryMake( Next, State );
    Around.Made( Next, Result.IsOk() ? State : VFlowStateRef(), VClock::now() - Begin > SlowFrame );
  }
  else if ( !bDue && bResting )
  {
    Around.EndRest();
  }
  else
  {
    HandOverAround( !bDue );
  }
  io_rLock.lock();
  return bDue;
}

void VSourcePump::VImpl::RunFollow()
{
  std::unique_lock Lock( Guard );
  while ( true )
  {
    if ( !WaitOrLookAround( Lock ) )
    {
      continue;
    }
    if ( bStop )
    {
      return;
    }
    const bool bKnown = !std::exchange( bAgain, false ) && !std::exchange( bForget, false );
    if ( !bAsked && Shown < 0 )
    {
      continue;
    }
    const std::int64_t Index = bAsked ? Asked : Shown;
    const bool bClear = bAsked && ( bSeek || Index < Shown );
    bSeek = bSeek && !bAsked;
    bAsked = false;
    bBusy = true;
    Lock.unlock();
    if ( !bKnown )
    {
      Around.Forget();
    }
    const bool bAdded = MakeAndAdd( Index, bClear, bKnown );
    Lock.lock();
    bBusy = false;
    bSeek = bSeek || ( bClear && !bAdded ); // the frame that comes instead stands before the others as well
    Idle.notify_all();
  }
}

/// While the pump runs, the source must not keep it waiting.
void VSourcePump::VImpl::Follow( bool i_bOn )
{
  const auto Again = [this]
  {
    {
      const std::lock_guard Lock( Guard );
      bAgain = true;
    }
    Wake.notify_all();
  };
  const std::lock_guard Lock( SourceGuard );
  pSource->SetOnReady( i_bOn ? std::function< void() >( Again ) : std::function< void() >() );
}

void VSourcePump::VImpl::Start( bool i_bLive, std::int64_t i_First )
{
  const std::lock_guard Control( ControlGuard );
  Stop();
  Follow( true );
  try
  {
    const std::lock_guard Lock( Guard );
    First = std::max< std::int64_t >( i_First, 0 );
    bStop = false;
    bLive = i_bLive;
    bFailing = false;
    bAgain = false;
    Shown = -1;
    bForget = true;
    Thread = std::thread( i_bLive ? &VImpl::RunLive : &VImpl::RunFollow, this );
    bRunning = true; // only now: nobody may wait for a thread that could not be made
  }
  catch ( ... )
  {
    Follow( false );
    throw;
  }
}

void VSourcePump::VImpl::Stop()
{
  if ( !Thread.joinable() )
  {
    return;
  }
  {
    const std::lock_guard Lock( Guard );
    bStop = true;
  }
  Wake.notify_all();
  Thread.join();
  Follow( false );
  {
    const std::lock_guard Lock( Guard );
    bRunning = false;
    bAsked = false;
    bSeek = false;
  }
  Idle.notify_all();
}

void VSourcePump::StartLive( std::int64_t i_First )
{
  m_pImpl->Start( true, i_First );
}

void VSourcePump::StartFollow()
{
  m_pImpl->Start( false, 0 );
}

void VSourcePump::Stop()
{
  const std::lock_guard Control( m_pImpl->ControlGuard );
  m_pImpl->Stop();
}

bool VSourcePump::IsRunning() const
{
  const std::lock_guard Lock( m_pImpl->Guard );
  return m_pImpl->bRunning;
}

void VSourcePump::Show( std::int64_t i_Index, bool i_bSeek )
{
  {
    const std::lock_guard Lock( m_pImpl->Guard );
    m_pImpl->Asked = i_Index;
    m_pImpl->bAsked = true;
    m_pImpl->bSeek = m_pImpl->bSeek || i_bSeek;
  }
  m_pImpl->Wake.notify_all();
}

void VSourcePump::WaitShown()
{
  std::unique_lock Lock( m_pImpl->Guard );
  m_pImpl->Idle.wait( Lock,
                      [this]
                      {
                        return !m_pImpl->bRunning || m_pImpl->bLive || ( !m_pImpl->bAsked && !m_pImpl->bBusy );
                      } );
}

void VSourcePump::WithSource( const std::function< void( IFrameSource& ) >& i_rFunction )
{
  const std::lock_guard Lock( m_pImpl->SourceGuard );
  i_rFunction( *m_pImpl->pSource );
  const std::lock_guard Forget( m_pImpl->Guard );
  m_pImpl->bForget = true;
}

void VSourcePump::KeepAround( std::int64_t i_Frames, VTakeAround i_Take )
{
  m_pImpl->Around = VFramesAround( i_Frames, std::move( i_Take ) );
}

std::int64_t VSourcePump::ShownIndex() const
{
  const std::lock_guard Lock( m_pImpl->Guard );
  return m_pImpl->Shown;
}

std::uint64_t VSourcePump::AddedCount() const
{
  const std::lock_guard Lock( m_pImpl->Guard );
  return m_pImpl->Added;
}

std::uint64_t VSourcePump::SkippedCount() const
{
  const std::lock_guard Lock( m_pImpl->Guard );
  return m_pImpl->Skipped;
}

IResult VSourcePump::LastResult() const
{
  const std::lock_guard Lock( m_pImpl->Guard );
  return m_pImpl->Last;
}

} // namespace HostSources

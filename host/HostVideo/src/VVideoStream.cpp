#include <HostVideo/VVideoStream.h>

#include "VVideoConverter.h"
#include "VVideoDecoder.h"

#include <ZEK/Log.h>

#include <algorithm>
#include <chrono>
#include <condition_variable>
#include <mutex>
#include <new>
#include <thread>
#include <utility>

namespace HostVideo
{
namespace
{

using VClock = std::chrono::steady_clock;
using CoreMoxelTypes::VVideoFrame;

constexpr std::size_t LeastRing = 2, MostRing = 12, MostPixelBytes = 2, SpareBuffers = 3;
/// While frames are behind, one is shown so often.
constexpr auto LatePause = std::chrono::milliseconds( 40 );

const ZEK::VLogCategory& Category()
{
  static const ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Video" );
  return rCategory;
}

std::size_t RingFor( const VVideoClip& i_rClip, std::size_t i_MostBytes )
{
  const std::size_t Bytes =
      std::max< std::size_t >( std::size_t{ i_rClip.Width } * i_rClip.Height * MostPixelBytes, 1 );
  return std::clamp( i_MostBytes / Bytes, LeastRing, MostRing );
}

} // namespace

struct VVideoStream::VImpl
{
  struct VHeld
  {
    std::int64_t Index = -1;
    VVideoFrame Frame;
  };

  VImpl( std::shared_ptr< const VVideoClip > i_pClip, const VVideoStreamOptions& i_rOptions )
    : pClip( std::move( i_pClip ) )
    , Options( i_rOptions )
    , Capacity( RingFor( *pClip, i_rOptions.MostBytes ) )
    , Behind( static_cast< std::int64_t >( Capacity / 4 ) )
    , Ahead( static_cast< std::int64_t >( Capacity ) - 1 - Behind )
    , Decoder( pClip )
    , Converter( SpareBuffers )
    , Missing( pClip->Times.size(), false )
  {
    Ring.reserve( Capacity + 1 );
  }

  std::int64_t Clamped( std::int64_t i_Index ) const;
  std::int64_t Resolved( std::int64_t i_Index ) const;
  const VHeld* Find( std::int64_t i_Index ) const;
  std::int64_t FirstNeeded() const;
  bool IsWanted( std::int64_t i_Index, VClock::time_point i_Now ) const;
  void Trim();
  void Keep( std::int64_t i_Index, VVideoFrame i_Frame );
  void Run();
  void Decode( std::int64_t i_Need );
  bool Position( std::int64_t i_Need );
  void MarkMissing( std::int64_t i_From, std::int64_t i_To );
  void TellReady( std::unique_lock< std::mutex >& io_rLock );
  VVideoPicture Given( std::int64_t i_Index );

  const std::shared_ptr< const VVideoClip > pClip;
  const VVideoStreamOptions Options;
  const std::size_t Capacity;
  const std::int64_t Behind, Ahead; ///< frames kept before and after the one that is wanted

  // Of the stream's thread alone.
  VVideoDecoder Decoder;
  VVideoConverter Converter;
  bool bOpen = false;
  VClock::time_point LastLate;

  mutable std::mutex Guard;
  std::condition_variable Wake, Ready, Told;
  std::thread Thread;
  std::function< void() > OnReady;
  bool bStop = false, bFailed = false;
  bool bTelling = false;     ///< `OnReady` runs
  bool bOwed = false;        ///< the wanted frame could not be given when it was asked for
  std::int64_t Wanted = -1;  ///< -1: nothing was asked for yet
  std::vector< VHeld > Ring; ///< in no order
  std::vector< bool > Missing;
  VHeld Last; ///< that was given
  VVideoStreamCounts Counts;
};

std::int64_t VVideoStream::VImpl::Clamped( std::int64_t i_Index ) const
{
  return std::clamp< std::int64_t >( i_Index, 0, std::max< std::int64_t >( pClip->FrameCount() - 1, 0 ) );
}

/// The frame that stands for one that may be missing; -1 where none does.
std::int64_t VVideoStream::VImpl::Resolved( std::int64_t i_Index ) const
{
  while ( i_Index >= 0 && Missing[static_cast< std::size_t >( i_Index )] )
  {
    --i_Index;
  }
  return i_Index;
}

const VVideoStream::VImpl::VHeld* VVideoStream::VImpl::Find( std::int64_t i_Index ) const
{
  const auto It = std::find_if( Ring.begin(), Ring.end(),
                                [i_Index]( const VHeld& i_rHeld )
                                {
                                  return i_rHeld.Index == i_Index;
                                } );
  return It == Ring.end() ? nullptr : &*It;
}

/// The first frame from the wanted one on that is not there; -1 when all are.
std::int64_t VVideoStream::VImpl::FirstNeeded() const
{
  if ( Wanted < 0 || bFailed || Missing.empty() )
  {
    return -1;
  }
  // Of a frame that is missing its stand-in is needed, which may have left the ring long ago.
  const std::int64_t First = Resolved( Wanted );
  if ( First >= 0 && !Find( First ) )
  {
    return First;
  }
  const std::int64_t End = std::min( Wanted + Ahead, pClip->FrameCount() - 1 );
  for ( std::int64_t Index = Wanted + 1; Index <= End; ++Index )
  {
    if ( !Missing[static_cast< std::size_t >( Index )] && !Find( Index ) )
    {
      return Index;
    }
  }
  return -1;
}

/// Frames just before the wanted one are kept for steps back, and now and then one that is late is shown.
bool VVideoStream::VImpl::IsWanted( std::int64_t i_Index, VClock::time_point i_Now ) const
{
  const std::int64_t First = std::min( Wanted - Behind, Resolved( Wanted ) );
  return ( i_Index >= First && i_Index <= Wanted + Ahead ) || ( i_Index < First && i_Now - LastLate >= LatePause );
}

/// Lets go of the frames farthest from the wanted one.
void VVideoStream::VImpl::Trim()
{
  const std::int64_t Shown = Resolved( Wanted );
  const auto Farther = [&]( const VHeld& i_rA, const VHeld& i_rB )
  {
    const auto Cost = [&]( std::int64_t i_Index )
    {
      return i_Index == Shown ? 0 : i_Index >= Wanted ? i_Index - Wanted : ( Wanted - i_Index ) * Ahead;
    };
    return Cost( i_rA.Index ) < Cost( i_rB.Index );
  };
  std::erase_if( Ring,
                 [&]( const VHeld& i_rHeld )
                 {
                   return i_rHeld.Index > Wanted + Ahead;
                 } );
  while ( Ring.size() > Capacity )
  {
    Ring.erase( std::max_element( Ring.begin(), Ring.end(), Farther ) );
  }
}

void VVideoStream::VImpl::Keep( std::int64_t i_Index, VVideoFrame i_Frame )
{
  if ( !Find( i_Index ) )
  {
    Ring.push_back( { i_Index, std::move( i_Frame ) } );
    Trim();
  }
  Counts.HeldBytes = 0;
  for ( const VHeld& rHeld : Ring )
  {
    Counts.HeldBytes += rHeld.Frame.Data->size();
  }
  Counts.HeldFrames = Ring.size();
  Counts.MostHeldBytes = std::max( Counts.MostHeldBytes, Counts.HeldBytes );
  Counts.MostHeldFrames = std::max( Counts.MostHeldFrames, Counts.HeldFrames );
}

void VVideoStream::VImpl::MarkMissing( std::int64_t i_From, std::int64_t i_To )
{
  for ( std::int64_t Index = i_From; Index < i_To; ++Index )
  {
    if ( !Find( Index ) )
    {
      Counts.Missing += !Missing[static_cast< std::size_t >( Index )];
      Missing[static_cast< std::size_t >( Index )] = true;
    }
  }
}

/// Tells those who wait when the wanted frame, or what stands for it, is there.
void VVideoStream::VImpl::TellReady( std::unique_lock< std::mutex >& io_rLock )
{
  const std::int64_t Shown = Resolved( Wanted );
  if ( !bFailed && Shown >= 0 && !Find( Shown ) )
  {
    return;
  }
  Ready.notify_all();
  if ( std::exchange( bOwed, false ) && OnReady )
  {
    bTelling = true;
    io_rLock.unlock();
    OnReady();
    io_rLock.lock();
    bTelling = false;
    Told.notify_all();
  }
}

/// Outside of the lock. False when the file can no longer be read.
bool VVideoStream::VImpl::Position( std::int64_t i_Need )
{
  std::string Message;
  if ( !bOpen )
  {
    bOpen = Decoder.Open( Options.DecoderThreads, Message );
    if ( !bOpen )
    {
      ZEK::Log( Category(), ZEK::ELogWarning, "The video \"%1%\" can no longer be read: %2%", pClip->Path.string(),
                Message );
      return false;
    }
  }
  if ( Decoder.IsSeekShorter( i_Need ) )
  {
    {
      const std::lock_guard Lock( Guard );
      ++Counts.Seeks;
    }
    if ( !Decoder.Seek( i_Need ) )
    {
      ZEK::Log( Category(), ZEK::ELogWarning, "The video \"%1%\" can no longer be read", pClip->Path.string() );
      return false;
    }
  }
  return true;
}

/// One frame, on the way to the one that is needed.
void VVideoStream::VImpl::Decode( std::int64_t i_Need )
{
  if ( !Position( i_Need ) )
  {
    const std::lock_guard Lock( Guard );
    bFailed = true;
    return;
  }
  const std::int64_t Index = Decoder.Next();
  const auto Now = VClock::now();
  bool bCopy = false;
  {
    const std::lock_guard Lock( Guard );
    Counts.Decoded += Index >= 0;
    MarkMissing( i_Need, Index < 0 ? pClip->FrameCount() : std::max( Index, i_Need ) );
    bCopy = Index >= 0 && IsWanted( Index, Now ) && !Find( Index );
  }
  if ( !bCopy )
  {
    return;
  }
  VVideoFrame Frame;
  const bool bGood = Converter.Convert( Decoder.Picture(), pClip->QuarterTurns, Frame );
  Frame.PresentationTime = pClip->Times[static_cast< std::size_t >( Index )];
  LastLate = Index < i_Need ? Now : LastLate;
  const std::lock_guard Lock( Guard );
  if ( bGood )
  {
    ++Counts.Copied;
    Keep( Index, std::move( Frame ) );
  }
  else
  {
    MarkMissing( Index, Index + 1 );
  }
}

void VVideoStream::VImpl::Run()
{
  std::unique_lock Lock( Guard );
  while ( !bStop )
  {
    const std::int64_t Need = FirstNeeded();
    if ( Need < 0 )
    {
      TellReady( Lock );
      if ( !bStop && FirstNeeded() < 0 && !bOwed )
      {
        Wake.wait( Lock );
      }
      continue;
    }
    Lock.unlock();
    try
    {
      Decode( Need );
      Lock.lock();
    }
    catch ( const std::bad_alloc& )
    {
      ZEK::Log( Category(), ZEK::ELogWarning, "Too little memory for the video \"%1%\"", pClip->Path.string() );
      Lock.lock();
      bFailed = true;
    }
    TellReady( Lock );
  }
}

/// Under the lock.
VVideoPicture VVideoStream::VImpl::Given( std::int64_t i_Index )
{
  const std::int64_t Shown = Missing.empty() ? -1 : Resolved( i_Index );
  if ( const VHeld* const pHeld = Shown >= 0 ? Find( Shown ) : nullptr )
  {
    Last = *pHeld;
    return { Last.Index, Last.Frame, true };
  }
  if ( Shown < 0 || bFailed )
  {
    return { -1, {}, true };
  }
  for ( const VHeld& rHeld : Ring )
  {
    if ( rHeld.Index <= i_Index && ( rHeld.Index > Last.Index || Last.Index > i_Index ) )
    {
      Last = rHeld;
    }
  }
  return { Last.Index, Last.Frame, false };
}

VVideoStream::VVideoStream( std::shared_ptr< const VVideoClip > i_pClip, const VVideoStreamOptions& i_rOptions )
  : m_pClip( std::move( i_pClip ) )
  , m_pImpl( std::make_unique< VImpl >( m_pClip, i_rOptions ) )
{
}

VVideoStream::~VVideoStream()
{
  {
    const std::lock_guard Lock( m_pImpl->Guard );
    m_pImpl->bStop = true;
  }
  m_pImpl->Wake.notify_all();
  if ( m_pImpl->Thread.joinable() )
  {
    m_pImpl->Thread.join();
  }
}

void VVideoStream::SetOnReady( std::function< void() > i_OnReady )
{
  std::unique_lock Lock( m_pImpl->Guard );
  // Whoever takes his function away may go away himself.
  m_pImpl->Told.wait( Lock,
                      [this]
                      {
                        return !m_pImpl->bTelling;
                      } );
  m_pImpl->OnReady = std::move( i_OnReady );
}

void VVideoStream::Want( std::int64_t i_Index )
{
  VImpl& rI = *m_pImpl;
  const std::lock_guard Lock( rI.Guard );
  const std::int64_t Index = rI.Clamped( i_Index );
  if ( rI.Wanted == Index )
  {
    return;
  }
  rI.Wanted = Index;
  rI.bOwed = false;
  if ( !rI.Thread.joinable() )
  {
    rI.Thread = std::thread( &VImpl::Run, &rI );
  }
  rI.Wake.notify_all();
}

VVideoPicture VVideoStream::Get( std::int64_t i_Index )
{
  Want( i_Index );
  const std::lock_guard Lock( m_pImpl->Guard );
  VVideoPicture Picture = m_pImpl->Given( m_pImpl->Wanted );
  m_pImpl->bOwed = !Picture.bExact;
  return Picture;
}

VVideoPicture VVideoStream::GetExact( std::int64_t i_Index )
{
  Want( i_Index );
  VImpl& rI = *m_pImpl;
  std::unique_lock Lock( rI.Guard );
  VVideoPicture Picture;
  rI.Ready.wait( Lock,
                 [&]
                 {
                   Picture = rI.Given( rI.Wanted );
                   return Picture.bExact;
                 } );
  return Picture;
}

VVideoStreamCounts VVideoStream::Counts() const
{
  const std::lock_guard Lock( m_pImpl->Guard );
  return m_pImpl->Counts;
}

} // namespace HostVideo

#include <HostVideo/VVideoStream.h>

#include "VVideoConverter.h"
#include "VVideoDecoder.h"

#include <ZEK/Log.h>

#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <exception>
#include <mutex>
#include <new>
#include <string>
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

std::size_t RingFor( std::size_t i_FrameBytes, std::size_t i_MostBytes )
{
  return std::clamp( i_MostBytes / std::max< std::size_t >( i_FrameBytes, 1 ), LeastRing, MostRing );
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
    , Decoder( pClip, bQuit )
    , Converter( SpareBuffers )
    , Missing( pClip->Times.size(), false )
  {
    SetCapacity( RingFor( std::size_t{ pClip->Width } * pClip->Height * MostPixelBytes, Options.MostBytes ) );
    Ring.reserve( Capacity + 1 );
  }

  void SetCapacity( std::size_t i_Frames );
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
  bool Next( std::int64_t i_Need, VClock::time_point& o_rNow, std::int64_t& o_rIndex );
  bool MarkMissing( std::int64_t i_From, std::int64_t i_To );
  void TellMissing() const;
  void Fail( const std::string& i_rWhy );
  void TellReady( std::unique_lock< std::mutex >& io_rLock );
  VVideoPicture Given( std::int64_t i_Index );

  const std::shared_ptr< const VVideoClip > pClip;
  const VVideoStreamOptions Options;
  std::atomic< bool > bQuit = false; ///< what is done for the stream ends as soon as can be

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
  bool bTelling = false;              ///< `OnReady` runs
  bool bOwed = false;                 ///< the wanted frame could not be given when it was asked for
  std::int64_t Wanted = -1;           ///< -1: nothing was asked for yet
  std::size_t Capacity = LeastRing;   ///< in frames; less once they prove to be larger than was thought
  std::int64_t Behind = 0, Ahead = 1; ///< frames kept before and after the one that is wanted
  std::vector< VHeld > Ring;          ///< in no order
  std::vector< bool > Missing;
  VHeld Last; ///< that was given
  VVideoStreamCounts Counts;
};

void VVideoStream::VImpl::SetCapacity( std::size_t i_Frames )
{
  Capacity = i_Frames;
  Behind = static_cast< std::int64_t >( Capacity / 4 );
  Ahead = static_cast< std::int64_t >( Capacity ) - 1 - Behind;
}

std::int64_t VVideoStream::VImpl::Clamped( std::int64_t i_Index ) const
{
  return std::clamp< std::int64_t >( i_Index, 0, std::max< std::int64_t >( pClip->FrameCount() - 1, 0 ) );
}

/// The frame that stands for one that may be missing; -1 where none does.
std::int64_t VVideoStream::VImpl::Resolved( std::int64_t i_Index ) const
{
  if ( Missing.empty() )
  {
    return -1;
  }
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
    // Frames may be larger than the file says at its beginning.
    SetCapacity( std::min( Capacity, RingFor( i_Frame.Data->size(), Options.MostBytes ) ) );
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

/// True when these are the first that are missing.
bool VVideoStream::VImpl::MarkMissing( std::int64_t i_From, std::int64_t i_To )
{
  const std::size_t Before = Counts.Missing;
  for ( std::int64_t Index = i_From; Index < i_To; ++Index )
  {
    if ( !Find( Index ) )
    {
      Counts.Missing += !Missing[static_cast< std::size_t >( Index )];
      Missing[static_cast< std::size_t >( Index )] = true;
    }
  }
  return Before == 0 && Counts.Missing > 0;
}

void VVideoStream::VImpl::TellMissing() const
{
  ZEK::Log( Category(), ZEK::ELogWarning, "Frames of the video \"%1%\" cannot be decoded; the last good one is shown",
            pClip->Path.string() );
}

/// Outside of the lock. No frame comes any more; that somebody wanted it so is no failure.
void VVideoStream::VImpl::Fail( const std::string& i_rWhy )
{
  if ( !bQuit )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "The video \"%1%\" can no longer be read: %2%", pClip->Path.string(),
              i_rWhy );
  }
  const std::lock_guard Lock( Guard );
  bFailed = true;
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
  if ( std::exchange( bOwed, false ) && OnReady && !bQuit )
  {
    bTelling = true;
    io_rLock.unlock();
    OnReady();
    io_rLock.lock();
    bTelling = false;
    Told.notify_all();
  }
}

/// Outside of the lock. False when the file can no longer be read, which was told then.
bool VVideoStream::VImpl::Position( std::int64_t i_Need )
{
  std::string Message;
  if ( !bOpen )
  {
    bOpen = Decoder.Open( Options.DecoderThreads, Message );
    if ( !bOpen )
    {
      Fail( Message );
      return false;
    }
  }
  if ( Decoder.IsSeekShorter( i_Need ) )
  {
    {
      const std::lock_guard Lock( Guard );
      ++Counts.Seeks;
    }
    if ( !Decoder.Seek( i_Need, Message ) )
    {
      Fail( Message );
      return false;
    }
  }
  return true;
}

/// The next frame there is; false when nobody wants it.
bool VVideoStream::VImpl::Next( std::int64_t i_Need, VClock::time_point& o_rNow, std::int64_t& o_rIndex )
{
  o_rIndex = Decoder.Next();
  o_rNow = VClock::now();
  if ( o_rIndex < 0 && ( bQuit || Decoder.ReadError() != 0 ) )
  {
    Fail( FFmpegError( Decoder.ReadError() ) );
    return false;
  }
  bool bCopy = false, bFirstMissing = false;
  {
    const std::lock_guard Lock( Guard );
    Counts.Decoded += o_rIndex >= 0;
    bFirstMissing = MarkMissing( i_Need, o_rIndex < 0 ? pClip->FrameCount() : std::max( o_rIndex, i_Need ) );
    bCopy = o_rIndex >= 0 && IsWanted( o_rIndex, o_rNow ) && !Find( o_rIndex );
  }
  if ( bFirstMissing )
  {
    TellMissing();
  }
  return bCopy;
}

/// One frame, on the way to the one that is needed.
void VVideoStream::VImpl::Decode( std::int64_t i_Need )
{
  VClock::time_point Now;
  std::int64_t Index = -1;
  if ( !Position( i_Need ) || !Next( i_Need, Now, Index ) )
  {
    return;
  }
  VVideoFrame Frame;
  const bool bGood = Converter.Convert( Decoder.Picture(), pClip->QuarterTurns, Frame );
  Frame.PresentationTime = pClip->Times[static_cast< std::size_t >( Index )];
  LastLate = Index < i_Need ? Now : LastLate;
  std::unique_lock Lock( Guard );
  if ( bGood )
  {
    ++Counts.Copied;
    Keep( Index, std::move( Frame ) );
  }
  else if ( MarkMissing( Index, Index + 1 ) )
  {
    Lock.unlock();
    TellMissing();
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
    catch ( const std::exception& rException )
    {
      Fail( rException.what() );
      Lock.lock();
    }
    TellReady( Lock );
  }
}

/// Under the lock.
VVideoPicture VVideoStream::VImpl::Given( std::int64_t i_Index )
{
  const std::int64_t Shown = Resolved( i_Index );
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
  m_pImpl->bQuit = true;
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

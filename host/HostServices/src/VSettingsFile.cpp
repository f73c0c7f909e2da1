#include <HostServices/VSettingsFile.h>

#include "SettingsDocument.h"

#include <ZEK/Log.h>
#include <ZEK/StoreFlags.h>

#include <condition_variable>
#include <exception>
#include <thread>

namespace HostServices
{
namespace
{
using ZEK::IResult;
using VClock = std::chrono::steady_clock;

/// What a document tells of an entry, and whether it is there.
constexpr std::uint64_t SavedChanges = ZEK::EChangeVerified | ZEK::EChangeProposed | ZEK::EPersistent |
                                       ZEK::EVerifyRequired | ZEK::ChangeMask::Replaced | ZEK::ChangeMask::ChildStamp |
                                       ZEK::ChangeMask::DescendantStamp;

/// At the end another program may just save the same file.
constexpr int LastTries = 10;
constexpr auto BetweenLastTries = std::chrono::milliseconds( 50 );

ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Settings" );
  return rCategory;
}
} // namespace

struct VSettingsFile::VState
{
  VState( std::shared_ptr< ZEK::IStore > i_pStore, std::filesystem::path i_Path,
          const VSaveSchedule::VDelays& i_rDelays )
    : pStore( std::move( i_pStore ) )
    , Path( std::move( i_Path ) )
    , Schedule( i_rDelays )
  {
  }

  void OnChange()
  {
    const std::lock_guard Lock( Guard );
    const bool bFirst = !Schedule.IsPending();
    Schedule.Changed( VClock::now() );
    if ( bFirst )
    {
      // Later changes are found when the time of this one has come.
      Wake.notify_all();
    }
  }

  void Tell( const std::string& i_rText, bool i_bFailedSave )
  {
    {
      const std::lock_guard Lock( Guard );
      bFailedSave = i_bFailedSave;
      if ( i_rText == Message )
      {
        return;
      }
      Message = i_rText;
    }
    if ( !i_rText.empty() )
    {
      ZEK::Log( Category(), ZEK::ELogWarning, "%1%", i_rText );
    }
    MessageChanged.Fire();
  }

  IResult SaveNow( bool i_bAlways )
  {
    std::string Text;
    const IResult Made = SettingsText( *pStore, Text );
    if ( Made.IsError() || ( !i_bAlways && Text == SavedText ) )
    {
      return Made.IsError() ? Made : IResult::OkButNoEffect;
    }
    // A save that fails late may have put the new file in place.
    SavedText.reset();
    const IResult Saved = SaveSettingsText( Path.string(), Text );
    if ( Saved.IsOk() )
    {
      SavedText = std::move( Text );
    }
    return Saved;
  }

  IResult TrySave( bool i_bAlways )
  {
    try
    {
      return SaveNow( i_bAlways );
    }
    catch ( const std::exception& rError )
    {
      ZEK::Log( Category(), ZEK::ELogFailure, "Saving the settings failed: %1%", rError.what() );
    }
    catch ( ... )
    {
      ZEK::Log( Category(), ZEK::ELogFailure, "Saving the settings failed" );
    }
    return IResult::FailedWithException;
  }

  /// False when there is nothing left to do.
  bool WaitUntilDue( std::unique_lock< std::mutex >& io_rLock )
  {
    while ( !bStop )
    {
      const std::optional< VSaveSchedule::VTime > Due = Schedule.Due();
      if ( Due && *Due <= VClock::now() )
      {
        return true;
      }
      if ( Due )
      {
        Wake.wait_until( io_rLock, *Due );
      }
      else
      {
        Wake.wait( io_rLock );
      }
    }
    return Schedule.IsPending();
  }

  void Run()
  {
    int TriesLeft = LastTries;
    std::unique_lock Lock( Guard );
    while ( WaitUntilDue( Lock ) )
    {
      const bool bAll = std::exchange( bAlways, false );
      const bool bLast = bStop;
      Schedule.Begun();
      bSaving = true;
      Lock.unlock();
      const IResult Result = TrySave( bAll );
      Lock.lock();
      bSaving = false;
      bAlways |= bAll && Result.IsError();
      Schedule.Ended( Result.IsOk(), VClock::now() );
      LastResult = Result;
      const bool bAgain = bLast && Result == IResult::NotPermitted && --TriesLeft > 0;
      Lock.unlock();
      if ( bAgain )
      {
        std::this_thread::sleep_for( BetweenLastTries );
      }
      else
      {
        TellOf( Result, bLast );
      }
      Lock.lock();
      if ( bLast && Result.IsError() && !bAgain )
      {
        return;
      }
    }
  }

  void TellOf( IResult i_Result, bool i_bLast )
  {
    if ( i_Result.IsError() )
    {
      std::string Text = std::string( "The settings could not be saved to \"" ).append( Path.string() );
      Text.append( "\": " ).append( i_Result.Text() );
      Tell( Text.append( i_bLast ? ". What was changed since they were saved is lost."
                                 : ". They stay as they are in the program, and saving is tried again." ),
            true );
    }
    else if ( bFailedSave )
    {
      ZEK::Log( Category(), ZEK::ELogDetail, "The settings are saved again" );
      Tell( {}, false );
    }
  }

  /// Empty when there was nothing to keep.
  std::string Keep( IResult& o_rResult )
  {
    const bool bPartial = Loaded == IResult::OkButPartial;
    if ( Loaded == IResult::Ok || Loaded == IResult::FileNotFound )
    {
      return {};
    }
    std::string Kept;
    o_rResult = KeepAside( Path.string(), bPartial, Kept );
    std::string Text = std::string( "The settings in \"" ).append( Path.string() );
    Text.append( bPartial ? "\" could not all be used"
                          : std::string( "\" could not be read (" ).append( WhyNotLoaded ).append( ")" ) );
    if ( o_rResult.IsError() )
    {
      Text.append( ", and not be kept under another name (" ).append( o_rResult.Text() );
      return Text.append( "). Nothing is saved over them: what you change holds until the program ends." );
    }
    Text.append( bPartial ? ". The file as it was is kept as \"" : ". The defaults hold. The file is kept as \"" );
    return Text.append( Kept ).append( "\"." );
  }

  const std::shared_ptr< ZEK::IStore > pStore;
  const std::filesystem::path Path;
  IResult Loaded = IResult::NotAvailable;
  std::string WhyNotLoaded = "it was not loaded";
  std::optional< std::string > SavedText; ///< of the worker, once it runs
  ZEK::VConnection Changes;
  std::thread Worker;
  ZEK::VMultiCallback< void() > MessageChanged;

  mutable std::mutex Guard; ///< of all that follows
  std::condition_variable Wake;
  VSaveSchedule Schedule;
  bool bAlways = false; ///< the next save writes even what is saved
  bool bSaving = false;
  bool bStop = false;
  std::atomic< bool > bFailedSave = false; ///< the message is of a save
  std::string Message;
  IResult LastResult = IResult::OkButNoEffect;
};

VSettingsFile::VSettingsFile( std::shared_ptr< ZEK::IStore > i_pStore, std::filesystem::path i_Path,
                              const VSaveSchedule::VDelays& i_rDelays )
  : m_pState( std::make_shared< VState >( std::move( i_pStore ), std::move( i_Path ), i_rDelays ) )
{
}

VSettingsFile::~VSettingsFile()
{
  (void)Finish();
}

ZEK::IResult VSettingsFile::Load( const std::function< void() >& i_rDeclare )
{
  VState& rState = *m_pState;
  std::shared_ptr< ZEK::IStore > pRead;
  rState.Loaded = LoadSettings( rState.Path.string(), *rState.pStore, pRead, rState.WhyNotLoaded );
  if ( rState.Loaded.IsError() && rState.Loaded != IResult::FileNotFound )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "Cannot read settings %1%: %2%; the defaults hold", rState.Path.string(),
              rState.WhyNotLoaded );
  }
  i_rDeclare();
  if ( rState.Loaded == IResult::Ok && !HoldsAll( *pRead, *rState.pStore ) )
  {
    rState.Loaded = IResult::OkButPartial;
  }
  return rState.Loaded;
}

ZEK::IResult VSettingsFile::StartSaving()
{
  VState& rState = *m_pState;
  if ( rState.Worker.joinable() )
  {
    return IResult::OkButNoEffect;
  }
  IResult Result;
  const std::string Text = rState.Keep( Result );
  rState.Tell( Text, false );
  if ( Result.IsError() )
  {
    return IResult::NotPermitted;
  }
  rState.Changes = rState.pStore->RegisterHandler( { { rState.pStore->GetRootEntry() }, {} } )
                       ->CreateProxy( SavedChanges, ZEK::IHandlerCallback::EveryDelivery )
                       .Connect(
                           [pWeak = std::weak_ptr( m_pState )]( auto, auto )
                           {
                             if ( const auto pState = pWeak.lock() )
                             {
                               pState->OnChange();
                             }
                           },
                           nullptr );
  std::string Now;
  if ( SettingsText( *rState.pStore, Now ).IsOk() )
  {
    rState.SavedText = std::move( Now );
  }
  rState.Worker = std::thread( &VState::Run, m_pState.get() );
  return IResult::Ok;
}

void VSettingsFile::Request()
{
  if ( !m_pState->Worker.joinable() )
  {
    // Why not is what there is to say.
    m_pState->MessageChanged.Fire();
    return;
  }
  const std::lock_guard Lock( m_pState->Guard );
  m_pState->bAlways = true;
  m_pState->Schedule.Requested();
  m_pState->Wake.notify_all();
}

bool VSettingsFile::IsPending() const
{
  const std::lock_guard Lock( m_pState->Guard );
  return m_pState->bSaving || m_pState->Schedule.IsPending();
}

ZEK::IResult VSettingsFile::Finish()
{
  VState& rState = *m_pState;
  if ( !rState.Worker.joinable() )
  {
    return IResult::OkButNoEffect;
  }
  rState.Changes.Disconnect();
  {
    const std::lock_guard Lock( rState.Guard );
    rState.LastResult = IResult::OkButNoEffect;
    rState.bStop = true;
    rState.Wake.notify_all();
  }
  rState.Worker.join();
  return rState.LastResult;
}

std::string VSettingsFile::Message() const
{
  const std::lock_guard Lock( m_pState->Guard );
  return m_pState->Message;
}

ZEK::IMultiCallback< void() >& VSettingsFile::MessageChanged()
{
  return m_pState->MessageChanged;
}

const std::filesystem::path& VSettingsFile::Path() const
{
  return m_pState->Path;
}

} // namespace HostServices

#include <HostServices/VSettingsFile.h>
#include <HostServices/VUserPreferences.h>

#include <Store/Store.h>
#include <TestSupport/Calls.h>
#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>
#include <UtilsFileSystem/FileSystemCalls.h>
#include <UtilsFileSystem/ProtectedFileIO.h>
#include <ZEK/Log.h>
#include <ZEK/StoreFlags.h>
#include <ZEK/StoreValue.h>

#include <gmock/gmock.h>

#include <condition_variable>
#include <fcntl.h>
#include <fstream>
#include <future>
#include <thread>

using namespace HostServices;
using namespace std::chrono_literals;
using testing::HasSubstr;
using ZEK::IResult;
using ZEK::IO::MakeValue;
namespace fs = std::filesystem;

namespace
{
constexpr const char* pAlt = "Preferences/Core/AltToSelect";
constexpr const char* pInterval = "Preferences/Core/AutoSaveIntervalSeconds";
constexpr const char* pOld = "Layouts/Of an older program/Width";

/// Real calls that do not wait for a disk, and fail or hang where they are told to.
class VCalls final : public UtilsFileSystem::IFileSystemCalls
{
public:
  VCalls() { m_pFormer = UtilsFileSystem::SetFileSystemCalls( this ); }
  ~VCalls() override { UtilsFileSystem::SetFileSystemCalls( m_pFormer ); }

  int Open( const char* i_pPath, int i_Flags, mode_t i_Mode ) override
  {
    m_Saves += std::string_view( i_pPath ).ends_with( ".new" ) && ( i_Flags & O_CREAT ) != 0 ? 1 : 0;
    return ( i_Flags & O_CREAT ) == 0 && Fails( m_OpenError ) ? -1 : IFileSystemCalls::Open( i_pPath, i_Flags, i_Mode );
  }
  ssize_t Write( int i_File, const void* i_pBytes, std::size_t i_Size ) override
  {
    std::unique_lock Lock( m_Guard );
    m_bWriting = true;
    m_Wake.notify_all();
    m_Wake.wait( Lock,
                 [this]
                 {
                   return !m_bHang;
                 } );
    Lock.unlock();
    return Fails( m_WriteError ) ? -1 : IFileSystemCalls::Write( i_File, i_pBytes, i_Size );
  }
  int Sync( int ) override { return 0; }
  int Lock( int i_File, int i_Operation ) override
  {
    m_BeforeLock();
    return IFileSystemCalls::Lock( i_File, i_Operation );
  }
  int RenameNoReplace( const char* i_pFrom, const char* i_pTo ) override
  {
    return Fails( m_MoveError ) ? -1 : IFileSystemCalls::RenameNoReplace( i_pFrom, i_pTo );
  }

  void Hang( bool i_bHang )
  {
    const std::lock_guard Lock( m_Guard );
    m_bHang = i_bHang;
    m_bWriting = false;
    m_Wake.notify_all();
  }
  void WaitForWrite()
  {
    std::unique_lock Lock( m_Guard );
    m_Wake.wait( Lock,
                 [this]
                 {
                   return m_bWriting;
                 } );
  }

  std::atomic< int > m_Saves = 0;
  std::atomic< int > m_OpenError = 0;
  std::atomic< int > m_WriteError = 0;
  std::atomic< int > m_MoveError = 0;
  std::function< void() > m_BeforeLock = [] {};

private:
  static bool Fails( int i_Error )
  {
    errno = i_Error != 0 ? i_Error : errno;
    return i_Error != 0;
  }

  UtilsFileSystem::IFileSystemCalls* m_pFormer = nullptr;
  std::mutex m_Guard;
  std::condition_variable m_Wake;
  bool m_bHang = false;
  bool m_bWriting = false;
};

/// One run of a program. The delays are such that only requests and the end save, unless a test says otherwise.
class VRun
{
public:
  explicit VRun( const fs::path& i_rPath, const VSaveSchedule::VDelays& i_rDelays = { 1h, 1h, 1h, 1h } )
    : m_File( m_pStore, i_rPath, i_rDelays )
    , m_Told( m_File.MessageChanged() )
    , m_Loaded( m_File.Load(
          [this]
          {
            EXPECT_TRUE( DeclareUserPreferences( *m_pStore ).IsOk() );
          } ) )
  {
  }

  template < typename T >
  void Set( const char* i_pPath, const T& i_rValue, bool i_bPersistent = true )
  {
    const ZEK::VStoreWriteScope Scope( *m_pStore );
    EXPECT_TRUE( Scope->SetValue( m_pStore->GetEntry( i_pPath ), MakeValue( i_rValue ) ).IsOk() );
    Scope->SetFlags( m_pStore->GetEntry( i_pPath ), ZEK::EPersistent, i_bPersistent );
  }
  ZEK::VTypedValue Get( const char* i_pPath )
  {
    const ZEK::VStoreReadScope Scope( *m_pStore );
    return Scope->VerifiedValue( m_pStore->GetEntry( i_pPath ) );
  }
  std::uint32_t Flags( const char* i_pPath )
  {
    const ZEK::VStoreReadScope Scope( *m_pStore );
    return Scope->Flags( m_pStore->GetEntry( i_pPath ) );
  }
  void WaitUntilSaved()
  {
    while ( m_File.IsPending() )
    {
      std::this_thread::sleep_for( 1ms );
    }
  }
  void WaitForMessage()
  {
    while ( m_File.Message().empty() )
    {
      std::this_thread::sleep_for( 1ms );
    }
  }

  std::shared_ptr< ZEK::IStore > m_pStore = Store::CreateStore( nullptr, 64 );
  VSettingsFile m_File;
  TestSupport::VCalls m_Told;
  IResult m_Loaded;
};

class Settings : public testing::Test
{
protected:
  Settings() { Silence( 0 ); }
  ~Settings() override { Silence( ZEK::ELogDetail ); }

  std::string Text( const fs::path& i_rPath ) const
  {
    std::ifstream File( i_rPath, std::ios::binary );
    return { std::istreambuf_iterator< char >( File ), {} };
  }
  void Write( const std::string& i_rText ) const { std::ofstream( m_Path, std::ios::binary ) << i_rText; }
  /// All files but the settings file itself.
  std::vector< fs::path > Others() const
  {
    std::vector< fs::path > Paths;
    for ( const auto& rFile : fs::directory_iterator( m_Folder.Path() ) )
    {
      if ( rFile.path() != m_Path )
      {
        Paths.push_back( rFile.path() );
      }
    }
    return Paths;
  }

  TestSupport::VTemporaryDir m_Folder;
  fs::path m_Path = m_Folder.Path() / "settings.json";
  VCalls m_Calls;

private:
  /// What these modules say of failures is tested where they are.
  static void Silence( int i_Level )
  {
    for ( const char* pCategory : { "UtilsFileSystem", "StoreIO", "Store" } )
    {
      ZEK::GlobalLog().Category( pCategory ).SetMaximumLevel( i_Level );
    }
  }
};

struct VUnusable
{
  const char* m_pName;
  const char* m_pText;
  IResult m_Result;
  bool m_bMoved;
};
class UnusableSettings : public Settings, public testing::WithParamInterface< VUnusable >
{
};
} // namespace

TEST( SaveSchedule, ManyChangesAreOneSaveAndFailuresComeBackMoreSlowly )
{
  VSaveSchedule Schedule( { 2s, 20s, 5s, 12s } );
  const VSaveSchedule::VTime Start{ 1000s };
  const auto Due = [&]
  {
    return Schedule.Due() ? *Schedule.Due() - Start : -1s;
  };
  EXPECT_EQ( Due(), -1s );
  for ( int Tenth = 0; Tenth <= 30; ++Tenth )
  {
    Schedule.Changed( Start + Tenth * 100ms );
    EXPECT_EQ( Due(), Tenth * 100ms + 2s ) << "always after the last";
  }
  for ( int Second = 4; Second < 30; ++Second )
  {
    Schedule.Changed( Start + std::chrono::seconds( Second ) );
  }
  EXPECT_EQ( Due(), 20s ) << "changes without end do not put a save off for ever";
  Schedule.Begun();
  EXPECT_EQ( Due(), -1s );
  Schedule.Changed( Start + 21s );
  Schedule.Ended( true, Start + 22s );
  EXPECT_EQ( Due(), 23s ) << "a change during the save is saved by the next";
  for ( const auto Wait : { 5s, 10s, 12s, 12s } )
  {
    Schedule.Begun();
    Schedule.Ended( false, Start + 30s );
    EXPECT_EQ( Due(), 30s + Wait );
  }
  Schedule.Changed( Start + 31s );
  EXPECT_EQ( Due(), 33s ) << "a new change does not wait for the retry";
  Schedule.Requested();
  EXPECT_EQ( Schedule.Due(), VSaveSchedule::VTime::min() );
  Schedule.Begun();
  Schedule.Ended( true, Start + 32s );
  EXPECT_FALSE( Schedule.IsPending() );
  Schedule.Begun();
  Schedule.Ended( false, Start + 40s );
  EXPECT_EQ( Due(), 45s ) << "after a success the first delay holds again";
}

TEST_F( Settings, ComeBackAndCountAsSet )
{
  {
    VRun Run( m_Path );
    EXPECT_EQ( Run.m_Loaded, IResult::FileNotFound );
    ASSERT_EQ( Run.m_File.StartSaving(), IResult::Ok );
    EXPECT_TRUE( Run.m_File.Message().empty() );
    for ( int i = 0; i < 100; ++i )
    {
      Run.Set( pAlt, i % 2 == 0 );
    }
    Run.Set( pOld, 640 );
    Run.Set( "Live/Rate", 119.9, false );
    {
      const ZEK::VStoreWriteScope Scope( *Run.m_pStore );
      const auto pEntry = Run.m_pStore->GetEntry( "Layouts/Verified" );
      Scope->SetFlag( pEntry, ZEK::EPersistent | ZEK::EVerifyRequired );
      EXPECT_TRUE( Scope->SetProposedValue( pEntry, MakeValue( 2 ) ).IsOk() );
      EXPECT_TRUE( Scope->SetVerifiedValue( pEntry, MakeValue( 1 ) ).IsOk() );
    }
    EXPECT_EQ( m_Calls.m_Saves, 0 );
    EXPECT_EQ( Run.m_File.Finish(), IResult::Ok );
    EXPECT_EQ( m_Calls.m_Saves, 1 );
  }
  const std::string Saved = Text( m_Path );
  EXPECT_EQ( Saved.find( "Rate" ), std::string::npos ) << "only what is persistent";
  {
    VRun Run( m_Path );
    ASSERT_EQ( Run.m_Loaded, IResult::Ok );
    EXPECT_EQ( Run.Get( pAlt ), MakeValue( false ) );
    EXPECT_EQ( Run.Get( pOld ), MakeValue( 640 ) );
    EXPECT_EQ( Run.Get( "Layouts/Verified" ), MakeValue( 1 ) );
    EXPECT_EQ( Run.Flags( "Layouts/Verified" ), std::uint32_t( ZEK::EPersistent | ZEK::EVerifyRequired ) );
    EXPECT_EQ( Run.Flags( pOld ), std::uint32_t( ZEK::EPersistent ) );
    EXPECT_EQ( Run.Flags( pAlt ), std::uint32_t( ZEK::EPersistent ) );
    EXPECT_EQ( Run.Flags( pInterval ), std::uint32_t( ZEK::EPersistent ) ) << "a value of the file counts as set";
    ASSERT_EQ( Run.m_File.StartSaving(), IResult::Ok );
    // What no document tells of, and what is as it was saved, writes nothing.
    Run.Set( "Live/Rate", 120.1, false );
    Run.Set( pAlt, false );
    EXPECT_TRUE( Run.m_File.Finish().IsOk() );
    EXPECT_EQ( m_Calls.m_Saves, 1 );
  }
  {
    VRun Run( m_Path, { 1ms, 1ms, 1h, 1h } );
    ASSERT_EQ( Run.m_File.StartSaving(), IResult::Ok );
    Run.Set( pAlt, true );
    Run.WaitUntilSaved();
    EXPECT_EQ( m_Calls.m_Saves, 2 ) << "by itself";
    Run.m_File.Request();
    Run.WaitUntilSaved();
    EXPECT_EQ( m_Calls.m_Saves, 3 ) << "a request writes in any case";
    EXPECT_EQ( Run.m_File.Finish(), IResult::OkButNoEffect );
  }
  VRun Run( m_Path );
  EXPECT_EQ( Run.Get( pOld ), MakeValue( 640 ) ) << "what nobody declares is passed on";
  EXPECT_TRUE( Others().empty() );
  Run.Set( pAlt, false );
  EXPECT_EQ( Run.m_File.Finish(), IResult::OkButNoEffect );
  EXPECT_EQ( m_Calls.m_Saves, 3 ) << "a program that did not start saving writes nothing";
}

TEST_P( UnusableSettings, AreKeptAndToldOfBeforeTheFirstSave )
{
  const VUnusable& rCase = GetParam();
  for ( std::size_t Round = 1; Round <= 2; ++Round )
  {
    Write( rCase.m_pText );
    VRun Run( m_Path );
    EXPECT_EQ( Run.m_Loaded, rCase.m_Result ) << Run.m_Loaded.Text();
    EXPECT_EQ( Run.Get( pInterval ), MakeValue( 300u ) );
    EXPECT_EQ( Run.Get( "Good" ) == MakeValue( 5 ), !rCase.m_bMoved ) << "all, or nothing of a file that is no good";
    EXPECT_EQ( Others().size(), Round - 1 ) << "nothing is touched before saving starts";
    ASSERT_EQ( Run.m_File.StartSaving(), IResult::Ok );
    EXPECT_EQ( fs::exists( m_Path ), !rCase.m_bMoved );
    // Twice within a second: neither file may replace the other.
    ASSERT_EQ( Others().size(), Round );
    EXPECT_EQ( Run.m_Told.Count(), 1 );
    bool bNamed = false;
    for ( const fs::path& rKept : Others() )
    {
      EXPECT_EQ( Text( rKept ), rCase.m_pText );
      EXPECT_THAT( rKept.filename().string(), testing::MatchesRegex( "settings\\.kept-[0-9-]+\\.json" ) );
      bNamed = bNamed || Run.m_File.Message().find( rKept.string() ) != std::string::npos;
    }
    EXPECT_TRUE( bNamed ) << Run.m_File.Message();
    EXPECT_THAT( TestSupport::LogTexts( "Settings", ZEK::ELogWarning ), testing::Contains( Run.m_File.Message() ) );
    Run.Set( pAlt, false );
    EXPECT_EQ( Run.m_File.Finish(), IResult::Ok );
    VRun Next( m_Path );
    EXPECT_EQ( Next.m_Loaded, IResult::Ok );
    EXPECT_EQ( Next.Get( pAlt ), MakeValue( false ) );
  }
}

#define HARROW_DOCUMENT( Version, Entry )                                                                              \
  R"({"Version":")" Version R"(","Children":{"Good":{"Value":5,"Type":"Int32"},)" Entry "}}"
#define HARROW_INTERVAL( Value )                                                                                       \
  R"("Preferences":{"Children":{"Core":{"Children":{"AutoSaveIntervalSeconds":)" Value "}}}}"

INSTANTIATE_TEST_SUITE_P(
    Of, UnusableSettings,
    testing::Values( VUnusable{ "Nothing", "", IResult::InvalidFormat, true },
                     VUnusable{ "Torn", R"({"Version":"3.0","Children":{"Good":{"Val)", IResult::InvalidFormat, true },
                     VUnusable{ "NoMembers", "{}", IResult::FileNotOpen, true },
                     VUnusable{ "Later", HARROW_DOCUMENT( "3.1", R"("A":{})" ), IResult::InvalidVersion, true },
                     VUnusable{ "OneBadValue", HARROW_DOCUMENT( "3.0", R"("A":{"Value":"x","Type":"No type"})" ),
                                IResult::Failed, true },
                     VUnusable{ "TwoTypes", HARROW_DOCUMENT( "3.0", R"("Good":{"Value":"x","Type":"String"})" ),
                                IResult::OkButPartial, false },
                     VUnusable{ "TypeOfAnotherProgram",
                                HARROW_DOCUMENT( "3.0", HARROW_INTERVAL( R"({"Value":"long","Type":"String"})" ) ),
                                IResult::OkButPartial, false },
                     VUnusable{ "OutOfRange",
                                HARROW_DOCUMENT( "3.0", HARROW_INTERVAL( R"({"Value":5,"Type":"UInt32"})" ) ),
                                IResult::OkButPartial, false } ),
    []( const auto& i_rInfo )
    {
      return std::string( i_rInfo.param.m_pName );
    } );

TEST_F( Settings, AFileThatCannotBeReadIsMovedAndOneThatCannotBeMovedIsLeftAlone )
{
  const std::string Good = HARROW_DOCUMENT( "3.0", R"("A":{})" );
  Write( Good );
  m_Calls.m_OpenError = EACCES;
  {
    VRun Run( m_Path );
    EXPECT_EQ( Run.m_Loaded, IResult::NotPermitted );
    m_Calls.m_OpenError = 0;
    m_Calls.m_MoveError = EACCES;
    Run.Set( pAlt, false );
    EXPECT_EQ( Run.m_File.StartSaving(), IResult::NotPermitted );
    EXPECT_THAT( Run.m_File.Message(), HasSubstr( "Nothing is saved over them" ) );
    Run.Set( pAlt, false );
    Run.m_File.Request();
    EXPECT_EQ( Run.m_Told.Count(), 2 ) << "who asks is told again";
    EXPECT_EQ( Run.m_File.Finish(), IResult::OkButNoEffect );
    EXPECT_EQ( Text( m_Path ), Good );
    EXPECT_TRUE( Others().empty() );
  }
  m_Calls.m_OpenError = EACCES;
  m_Calls.m_MoveError = 0;
  {
    VRun Run( m_Path );
    m_Calls.m_OpenError = 0;
    EXPECT_EQ( Run.m_File.StartSaving(), IResult::Ok );
    ASSERT_EQ( Others().size(), 1u );
    EXPECT_EQ( Text( Others()[0] ), Good );
  }
  // A folder is nothing to move about.
  fs::create_directories( m_Path / "inside" );
  VRun Run( m_Path );
  EXPECT_EQ( Run.m_File.StartSaving(), IResult::NotPermitted );
  EXPECT_TRUE( fs::exists( m_Path / "inside" ) );
}

TEST_F( Settings, AFailedSaveIsToldKeptAndTriedAgain )
{
  Write( HARROW_DOCUMENT( "3.0", R"("A":{})" ) );
  const std::string Before = Text( m_Path );
  VRun Run( m_Path, { 1ms, 1ms, 1ms, 1ms } );
  ASSERT_EQ( Run.m_File.StartSaving(), IResult::Ok );
  m_Calls.m_WriteError = ENOSPC;
  Run.Set( pAlt, false );
  Run.WaitForMessage();
  EXPECT_THAT( Run.m_File.Message(), HasSubstr( IResult( IResult::DiskFull ).Text() ) );
  while ( m_Calls.m_Saves < 4 )
  {
    std::this_thread::sleep_for( 1ms );
  }
  EXPECT_TRUE( Run.m_File.IsPending() );
  EXPECT_EQ( Text( m_Path ), Before );
  m_Calls.m_WriteError = 0;
  Run.WaitUntilSaved();
  while ( !Run.m_File.Message().empty() )
  {
    std::this_thread::sleep_for( 1ms );
  }
  EXPECT_EQ( Run.m_Told.Count(), 2 ) << "once for the failure, however often it was tried, and once for its end";
  EXPECT_EQ( VRun( m_Path ).Get( pAlt ), MakeValue( false ) );

  // Another program saves the file.
  std::unique_ptr< UtilsFileSystem::VSaveLock > pOther;
  ASSERT_TRUE( UtilsFileSystem::VSaveLock::Take( m_Path.string(), pOther ).IsOk() );
  Run.Set( pAlt, true );
  Run.WaitForMessage();
  EXPECT_EQ( Run.Get( pAlt ), MakeValue( true ) );
  pOther.reset();
  Run.WaitUntilSaved();
  EXPECT_EQ( VRun( m_Path ).Get( pAlt ), MakeValue( true ) );

  m_Calls.m_WriteError = EIO;
  Run.Set( pAlt, false );
  EXPECT_EQ( Run.m_File.Finish(), IResult::FileIOFailure );
  EXPECT_THAT( Run.m_File.Message(), HasSubstr( "is lost" ) );
  EXPECT_EQ( VRun( m_Path ).Get( pAlt ), MakeValue( true ) );
  EXPECT_TRUE( Others().empty() );
}

TEST_F( Settings, NobodyWaitsForADiskAndTheEndSavesWhatCameMeanwhile )
{
  VRun Run( m_Path );
  ASSERT_EQ( Run.m_File.StartSaving(), IResult::Ok );
  m_Calls.Hang( true );
  Run.Set( pOld, 1 );
  Run.m_File.Request();
  m_Calls.WaitForWrite();
  Run.Set( pOld, 2 );
  EXPECT_EQ( Run.Get( pOld ), MakeValue( 2 ) );
  EXPECT_TRUE( Run.m_File.IsPending() );
  auto End = std::async( std::launch::async,
                         [&]
                         {
                           return Run.m_File.Finish();
                         } );
  EXPECT_EQ( End.wait_for( 20ms ), std::future_status::timeout );
  m_Calls.Hang( false );
  EXPECT_EQ( End.get(), IResult::Ok );
  EXPECT_EQ( m_Calls.m_Saves, 2 );
  EXPECT_EQ( VRun( m_Path ).Get( pOld ), MakeValue( 2 ) );
}

TEST_F( Settings, TheEndWaitsAMomentForAnotherProgramThatSaves )
{
  VRun Run( m_Path );
  ASSERT_EQ( Run.m_File.StartSaving(), IResult::Ok );
  std::unique_ptr< UtilsFileSystem::VSaveLock > pOther;
  ASSERT_TRUE( UtilsFileSystem::VSaveLock::Take( m_Path.string(), pOther ).IsOk() );
  Run.Set( pAlt, false );
  int Tries = 0;
  m_Calls.m_BeforeLock = [&]
  {
    if ( ++Tries == 3 )
    {
      pOther.reset();
    }
  };
  EXPECT_EQ( Run.m_File.Finish(), IResult::Ok );
  EXPECT_GE( Tries, 3 ) << "giving the lock up is a call, too";
  EXPECT_TRUE( Run.m_File.Message().empty() ) << Run.m_File.Message();
  EXPECT_EQ( VRun( m_Path ).Get( pAlt ), MakeValue( false ) );
}

#include "ProtectedFixture.h"
#include "TracedCalls.h"

#include <algorithm>
#include <atomic>
#include <cerrno>
#include <cstdlib>
#include <new>

#include <sched.h>
#include <sys/mman.h>
#include <sys/wait.h>
#include <unistd.h>

using namespace UtilsFileSystem;
using namespace UtilsFileSystemTests;
using namespace ZEK;

namespace
{
const std::string Denied = IResult( IResult::NotPermitted ).Text();
} // namespace

TEST_F( VProtected, ATakenTargetIsLeftAloneAndItsHolderIsNamed )
{
  Prepare( { { "", "t" } } );
  int Ready[2];
  int Go[2];
  ASSERT_EQ( ::pipe( Ready ) + ::pipe( Go ), 0 );
  const pid_t Child = ::fork();
  if ( Child == 0 )
  {
    const IResult Result = ProtectedSave(
        [&]( const std::string& i_rPath )
        {
          char Byte = 0;
          const IResult Written = Writer( "child" )( i_rPath );
          (void)!::write( Ready[1], &Byte, 1 );
          (void)!::read( Go[0], &Byte, 1 );
          return Written;
        },
        m_Folder.Target(), true );
    ::_exit( Result == IResult::Ok ? 0 : 1 );
  }
  char Byte = 0;
  ASSERT_EQ( ::read( Ready[0], &Byte, 1 ), 1 );
  const std::string Self = std::filesystem::read_symlink( "/proc/self/exe" );
  m_First = TestSupport::LogLines().size();
  EXPECT_EQ( Save( m_Folder.Target(), "parent" ), IResult::NotPermitted );
  ExpectLines( { { 2, "Failed to save file '*': file is locked by processes '" + Self + "'." } } );
  std::unique_ptr< VSaveLock > pLock;
  EXPECT_EQ( VSaveLock::Take( m_Folder.Target(), pLock ), IResult::NotPermitted );
  EXPECT_FALSE( pLock );
  EXPECT_EQ( Left(), ( Contents{ { "", "t" }, { ".new", "child" }, { ".lock", "" } } ) );
  {
    // A load waits while there is something that might have to be recovered.
    const VTracedCalls Calls;
    SetLockerLister(
        []( const std::string& )
        {
          return std::vector< std::string >{ "/bin/a", "/bin/b" };
        } );
    m_First = TestSupport::LogLines().size();
    EXPECT_EQ( Load( m_Folder.Target() ), "failed" );
    const std::vector< std::string > Steps = Calls.Steps( m_Folder.Target() );
    EXPECT_EQ( std::count( Steps.begin(), Steps.end(), "pause " ), 199 );
    ExpectLines( { { 2, "Failed to load file '*': file is locked by processes '/bin/a', '/bin/b'." } } );
  }
  (void)!::write( Go[1], &Byte, 1 );
  int Status = 0;
  ::waitpid( Child, &Status, 0 );
  EXPECT_EQ( Status, 0 );
  EXPECT_EQ( Left(), ( Contents{ { "", "child" } } ) );
  for ( const int File : { Ready[0], Ready[1], Go[0], Go[1] } )
  {
    ::close( File );
  }
}

TEST_F( VProtected, OneWhoHoldsTheLockLoadsAndSavesAndOthersWait )
{
  Prepare( { { ".old", "o" } } );
  std::unique_ptr< VSaveLock > pLock;
  ASSERT_EQ( VSaveLock::Take( m_Folder.Target(), pLock ), IResult::Ok );
  TestSupport::ExpectFailureLine( Expand( "Failed to save file '*': " + Denied, m_Folder.Target() ) );
  SetLockerLister(
      []( const std::string& )
      {
        return std::vector< std::string >{};
      } );
  EXPECT_EQ( Save( m_Folder.Target(), "other" ), IResult::NotPermitted );
  std::string Read;
  EXPECT_EQ( ProtectedLoad(
                 [&]( const std::string& i_rPath )
                 {
                   Read = m_Folder.Get( i_rPath.substr( m_Folder.Target().size() ) ).value_or( "nothing" );
                   return IResult::Ok;
                 },
                 m_Folder.Target(), *pLock ),
             IResult::Ok );
  EXPECT_EQ( Read, "o" );
  EXPECT_EQ( ProtectedSave( Writer( "mine" ), m_Folder.Target(), true, *pLock ), IResult::Ok );
  pLock.reset();
  EXPECT_EQ( Left(), ( Contents{ { "", "mine" } } ) );
  // Someone at work on a target that is not there yet: wait for it, and see it come.
  std::filesystem::remove( m_Folder.Target() );
  ASSERT_EQ( VSaveLock::Take( m_Folder.Target(), pLock ), IResult::Ok );
  const VTracedCalls Calls(
      [&]( const VCall& i_rCall, int )
      {
        if ( i_rCall.Name == "pause" && pLock )
        {
          EXPECT_EQ( ProtectedSave( Writer( "late" ), m_Folder.Target(), true, *pLock ), IResult::Ok );
          pLock.reset();
        }
        return 0;
      } );
  EXPECT_EQ( Load( m_Folder.Target() ), "late" );
}

TEST_F( VProtected, TheLockOfAFileWithoutANameIsWorthNothing )
{
  // The owner before removes its file between our opening and our locking.
  bool bFirst = true;
  const VTracedCalls Calls(
      [&]( const VCall& i_rCall, int )
      {
        if ( i_rCall.Name == "lock" && std::exchange( bFirst, false ) )
        {
          std::filesystem::remove( i_rCall.Path );
        }
        return 0;
      } );
  EXPECT_EQ( ProtectedSave(
                 [&]( const std::string& i_rPath )
                 {
                   EXPECT_TRUE( m_Folder.Get( ".lock" ) );
                   return Writer( "n" )( i_rPath );
                 },
                 m_Folder.Target(), true ),
             IResult::Ok );
  EXPECT_FALSE( bFirst );
}

TEST_F( VProtected, ABackupNeverComesBackBesideAFileThatIsNotWholeAndAFailingCloseIsAFailure )
{
  Prepare( { { "", "t" }, { ".old", "o" } } );
  const VQuiet Quiet;
  const VTracedCalls Calls(
      []( const VCall& i_rCall, int )
      {
        const bool bNew = i_rCall.Path.ends_with( ".new" );
        return bNew && ( i_rCall.Name == "unlink" || i_rCall.Name == "close" ) ? EIO : 0;
      } );
  EXPECT_EQ( Save( m_Folder.Target(), "n" ), IResult::FileIOFailure );
  EXPECT_EQ( Left(), ( Contents{ { "", "t" }, { ".new", "n" }, { ".old.stale", "o" } } ) );
}

TEST_F( VProtected, TwoProcessesSaveOneTargetAndEveryLoadIsWhole )
{
  const char* const pRounds = std::getenv( "HARROW_SAVE_ROUNDS" );
  const int Rounds = pRounds ? std::atoi( pRounds ) : 1000;
  const auto Document = []( int i_Process, int i_Round )
  {
    return std::string( 1 + static_cast< std::size_t >( i_Round % 7 ) * 20000,
                        static_cast< char >( 'a' + i_Process ) ) +
           "end";
  };
  ASSERT_EQ( Save( m_Folder.Target(), Document( 0, 0 ) ), IResult::Ok );
  void* const pShared =
      ::mmap( nullptr, sizeof( std::atomic< int > ), PROT_READ | PROT_WRITE, MAP_SHARED | MAP_ANONYMOUS, -1, 0 );
  ASSERT_NE( pShared, MAP_FAILED );
  auto* const pRefused = new ( pShared ) std::atomic< int >( 0 );
  std::vector< pid_t > Children;
  for ( int Process = 0; Process < 2; ++Process )
  {
    Children.push_back( ::fork() );
    if ( Children.back() == 0 )
    {
      const VQuiet Quiet;
      for ( int Round = 0; Round < Rounds; ++Round )
      {
        IResult Result = IResult::NotPermitted;
        while ( ( Result = Save( m_Folder.Target(), Document( Process, Round ) ) ) == IResult::NotPermitted )
        {
          ++*pRefused;
          ::sched_yield();
        }
        if ( Result != IResult::Ok )
        {
          ::_exit( 1 );
        }
      }
      ::_exit( 0 );
    }
  }
  int Loads = 0;
  for ( int Ended = 0; Ended < 2; )
  {
    const std::string Found = Load( m_Folder.Target() ).value_or( "nothing" );
    const bool bWhole = Found.ends_with( "end" ) && Found.find_first_not_of( Found[0] ) == Found.size() - 3 &&
                        ( Found.size() - 4 ) % 20000 == 0;
    ASSERT_TRUE( bWhole ) << Found.substr( 0, 20 ) << " of " << Found.size();
    ++Loads;
    int Status = 0;
    if ( ::waitpid( Children[static_cast< std::size_t >( Ended )], &Status, WNOHANG ) > 0 )
    {
      EXPECT_EQ( Status, 0 );
      ++Ended;
    }
  }
  EXPECT_GT( Loads, 10 );
  EXPECT_GT( pRefused->load(), 0 ) << "the two never met";
  ::munmap( pShared, sizeof( std::atomic< int > ) );
  EXPECT_EQ( m_Folder.Endings(), std::vector< std::string >{ "" } );
}

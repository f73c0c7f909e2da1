#include "SaveFolder.h"
#include "TracedCalls.h"

#include <UtilsFileSystem/FileIO.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <functional>
#include <set>

#include <sys/ptrace.h>
#include <sys/syscall.h>
#include <sys/wait.h>
#include <unistd.h>

using namespace UtilsFileSystem;
using namespace UtilsFileSystemTests;
using namespace ZEK;

namespace
{
constexpr int Stopped = 77;

// More than two buffers, one, and less than one: a save of each has another number of writes.
const std::string Old = "old " + std::string( 3000, 'o' ) + " end";
const std::string Middle = "middle " + std::string( 70000, 'm' ) + " end";
const std::string New = "new " + std::string( 150000, 'n' ) + " end";
const std::string Third = "third " + std::string( 1000, 't' ) + " end";

/// What lies in the folder before a save, and what a load may find once it has begun; nothing is a content, too.
struct VStart
{
  const char* Name;
  std::function< void( const VSaveFolder& ) > Prepare;
  std::set< std::optional< std::string > > Allowed;
  bool bOverwrite = true;
  /// Calls that this file system refuses, and how.
  std::map< std::string, int > Refused = {};
};

void PrintTo( const VStart& i_rStart, std::ostream* o_pStream )
{
  *o_pStream << i_rStart.Name;
}

VStart Files( const char* i_pName, std::map< std::string, std::string > i_Files,
              std::set< std::optional< std::string > > i_Allowed )
{
  return { i_pName,
           [i_Files]( const VSaveFolder& i_rFolder )
           {
             for ( const auto& [Ending, Content] : i_Files )
             {
               i_rFolder.Put( Ending, Content );
             }
           },
           std::move( i_Allowed ) };
}

std::vector< VStart > Starts()
{
  const std::string Torn = New.substr( 0, 999 );
  std::vector< VStart > All{
      Files( "Nothing", {}, { std::nullopt, New } ),
      Files( "Target", { { "", Old } }, { Old, New } ),
      Files( "StaleBackup", { { "", Old }, { ".old", Third } }, { Old, New } ),
      Files( "BackupAside", { { "", Old }, { ".old.stale", Third } }, { Old, New } ),
      Files( "OnlyBackup", { { ".old", Old } }, { Old, New } ),
      Files( "TornNew", { { "", Old }, { ".new", Torn } }, { Old, New } ),
      Files( "WholeNewAndBackup", { { "", Old }, { ".new", Middle }, { ".old", Old } }, { Old, Middle, New } ),
      Files( "WholeNewTargetAside", { { ".new", Middle }, { ".old", Old } }, { Middle, New } ),
      Files( "LinksRefused", { { "", Old }, { ".old", Third } }, { Old, New } ),
      Files( "MoveRefused", {}, { std::nullopt, New } ),
      Files( "NoOverwriting", {}, { std::nullopt, New } ),
      Files( "OneFileTwice", { { "", Old } }, { Old, New } ) };
  for ( VStart& rStart : All )
  {
    const std::string Name = rStart.Name;
    rStart.bOverwrite = Name != "NoOverwriting" && Name != "MoveRefused";
    if ( Name == "LinksRefused" )
    {
      rStart.Refused = { { "link", EPERM } };
    }
    if ( Name == "MoveRefused" )
    {
      rStart.Refused = { { "move", EINVAL } };
    }
    if ( Name == "OneFileTwice" )
    {
      // What a move by link and unlink leaves when it is stopped.
      rStart.Prepare = []( const VSaveFolder& i_rFolder )
      {
        i_rFolder.Put( "", Old );
        std::filesystem::create_hard_link( i_rFolder.Target(), i_rFolder.Target() + ".new" );
      };
    }
  }
  return All;
}

int Refusal( const VStart& i_rStart, const VCall& i_rCall )
{
  const auto It = i_rStart.Refused.find( i_rCall.Name );
  return It == i_rStart.Refused.end() ? 0 : It->second;
}

/// Does the work in a process of its own that ends at the n-th call, before it; gives the exit status.
template < typename TCalls, typename TWork, typename... TArguments >
int StopAt( int i_Number, const VStart& i_rStart, TWork i_Work, const TArguments&... i_rArguments )
{
  const pid_t Child = ::fork();
  if ( Child == 0 )
  {
    TCalls Calls( i_rArguments... );
    const auto End = [&]( int i_Status )
    {
      if constexpr ( std::is_same_v< TCalls, VPowerLossCalls > )
      {
        Calls.LosePower();
      }
      ::_exit( i_Status );
    };
    Calls.m_Before = [&]( const VCall& i_rCall, int i_At )
    {
      if ( i_At == i_Number )
      {
        End( Stopped );
      }
      return Refusal( i_rStart, i_rCall );
    };
    End( i_Work() ? 0 : 1 );
  }
  int Status = 0;
  ::waitpid( Child, &Status, 0 );
  return WIFEXITED( Status ) ? WEXITSTATUS( Status ) : -1;
}

class VCrash : public testing::TestWithParam< VStart >
{
protected:
  VCrash()
  {
    SetLockerLister(
        []( const std::string& )
        {
          return std::vector< std::string >{};
        } );
  }
  ~VCrash() override { SetLockerLister( {} ); }

  void Prepare()
  {
    m_Folder.Clear();
    GetParam().Prepare( m_Folder );
  }
  bool SaveNew() { return Save( m_Folder.Target(), New, GetParam().bOverwrite ).IsOk(); }
  /// The number of calls of the work, from a trace of the same work.
  template < typename TWork >
  int CountCalls( TWork i_Work )
  {
    Prepare();
    VTracedCalls Calls(
        []( const VCall& i_rCall, int )
        {
          return Refusal( GetParam(), i_rCall );
        } );
    i_Work();
    return static_cast< int >( Calls.Trace().size() );
  }
  void ExpectAllowed( const std::optional< std::string >& i_rFound, int i_Number ) const
  {
    EXPECT_TRUE( GetParam().Allowed.contains( i_rFound ) )
        << "stopped at call " << i_Number << " and found "
        << ( i_rFound ? i_rFound->substr( 0, 8 ) + " of " + std::to_string( i_rFound->size() ) : "nothing" );
  }

  VSaveFolder m_Folder;
  VQuiet m_Quiet;
  VTracedCalls m_Calls;
};

TEST_P( VCrash, AfterAStopAtAnyCallALoadFindsAWholeDocumentAndTheNextSaveClearsUp )
{
  const int Calls = CountCalls(
      [&]
      {
        EXPECT_TRUE( SaveNew() );
      } );
  ASSERT_GT( Calls, 20 );
  int Stops = 0;
  for ( int Number = 1; Number <= Calls + 1; ++Number )
  {
    Prepare();
    const int Status = StopAt< VTracedCalls >( Number, GetParam(),
                                               [&]
                                               {
                                                 return SaveNew();
                                               } );
    Stops += Status == Stopped;
    ASSERT_EQ( Status, Number <= Calls ? Stopped : 0 ) << Number;
    // With a load between the stop and the next save, and without.
    if ( Number % 2 == 0 )
    {
      ExpectAllowed( Load( m_Folder.Target() ), Number );
    }
    EXPECT_EQ( Save( m_Folder.Target(), Third ), IResult::Ok ) << Number;
    EXPECT_EQ( m_Folder.Endings(), std::vector< std::string >{ "" } ) << Number;
    EXPECT_EQ( Load( m_Folder.Target() ), Third ) << Number;
    Prepare();
    (void)StopAt< VTracedCalls >( Number, GetParam(),
                                  [&]
                                  {
                                    return SaveNew();
                                  } );
    ExpectAllowed( Load( m_Folder.Target() ), Number );
  }
  EXPECT_EQ( Stops, Calls );
}

TEST_P( VCrash, ALoadThatIsStoppedLeavesAWholeDocument )
{
  const auto LoadAllowed = [&]
  {
    return GetParam().Allowed.contains( Load( m_Folder.Target() ) );
  };
  const int Calls = CountCalls( LoadAllowed );
  for ( int Number = 1; Number <= Calls; ++Number )
  {
    Prepare();
    ASSERT_EQ( StopAt< VTracedCalls >( Number, GetParam(), LoadAllowed ), Stopped );
    ExpectAllowed( Load( m_Folder.Target() ), Number );
  }
}

TEST_P( VCrash, AfterALossOfPowerALoadFindsAWholeDocumentAndASavedOneForCertain )
{
  const int Calls = CountCalls(
      [&]
      {
        EXPECT_TRUE( SaveNew() );
      } );
  int States = 0;
  for ( int Number = 1; Number <= Calls + 1; ++Number )
  {
    Prepare();
    const int Status = StopAt< VPowerLossCalls >(
        Number, GetParam(),
        [&]
        {
          return SaveNew();
        },
        m_Folder.Folder(), m_Folder.Kept() );
    ASSERT_EQ( Status, Number <= Calls ? Stopped : 0 );
    int State = 0;
    for ( ; std::filesystem::exists( m_Folder.Kept() + "/" + std::to_string( State ) ); ++State )
    {
      const std::optional< std::string > Found = Load( m_Folder.Kept() + "/" + std::to_string( State ) + "/doc" );
      ExpectAllowed( Found, Number );
      EXPECT_TRUE( Number <= Calls || Found == New ) << "saved, but lost";
    }
    ASSERT_GT( State, 0 );
    States += State;
  }
  EXPECT_GT( States, Calls );
}

TEST_P( VCrash, WhenAnyCallFailsSuccessIsNeverClaimedWithoutTheNewBytes )
{
  const std::size_t Files = std::distance( std::filesystem::directory_iterator( "/proc/self/fd" ), {} );
  const int Calls = CountCalls(
      [&]
      {
        EXPECT_TRUE( SaveNew() );
      } );
  int Failures = 0;
  for ( const int Error : { ENOSPC, EIO, EACCES } )
  {
    for ( const bool bForGood : { false, true } )
    {
      for ( int Number = 1, Last = Calls; Number <= Last; ++Number )
      {
        Prepare();
        IResult Result = IResult::Ok;
        {
          VPowerLossCalls Failing( m_Folder.Folder(), m_Folder.Kept(),
                                   [&]( const VCall& i_rCall, int i_At )
                                   {
                                     const bool bNow = bForGood ? i_At >= Number : i_At == Number;
                                     return bNow ? Error : Refusal( GetParam(), i_rCall );
                                   } );
          Failing.m_MostBytesAWrite = 40000;
          Result = Save( m_Folder.Target(), New, GetParam().bOverwrite );
          Last = std::max( Last, static_cast< int >( Failing.Trace().size() ) );
          Failing.LosePower();
        }
        Failures += Result.IsError();
        // Once more after the power went, too: what was claimed to be saved was on the disk.
        for ( int State = 0;
              Result.IsOk() && std::filesystem::exists( m_Folder.Kept() + "/" + std::to_string( State ) ); ++State )
        {
          EXPECT_EQ( Load( m_Folder.Kept() + "/" + std::to_string( State ) + "/doc" ), New )
              << Error << " at call " << Number;
        }
        if ( Result.IsError() )
        {
          Prepare();
          VTracedCalls Failing(
              [&]( const VCall& i_rCall, int i_At )
              {
                const bool bNow = bForGood ? i_At >= Number : i_At == Number;
                return bNow ? Error : Refusal( GetParam(), i_rCall );
              } );
          (void)Save( m_Folder.Target(), New, GetParam().bOverwrite );
          Failing.m_Before = {};
          ExpectAllowed( Load( m_Folder.Target() ), Number );
        }
      }
    }
  }
  EXPECT_GT( Failures, 3 * Calls );
  EXPECT_EQ( std::distance( std::filesystem::directory_iterator( "/proc/self/fd" ), {} ), Files ) << "left open";
}

TEST_P( VCrash, ALoadWhoseCallsFailNeverSaysThatThereIsNothing )
{
  if ( GetParam().Allowed.contains( std::nullopt ) )
  {
    return;
  }
  // A new document whose flush fails is given up for the old one.
  std::set< std::optional< std::string > > Allowed = GetParam().Allowed;
  Allowed.insert( Old );
  const int Calls = CountCalls(
      [&]
      {
        (void)Load( m_Folder.Target() );
      } );
  for ( const bool bForGood : { false, true } )
  {
    for ( int Number = 1; Number <= Calls + 5; ++Number )
    {
      Prepare();
      VTracedCalls Failing(
          [&]( const VCall&, int i_At )
          {
            return ( bForGood ? i_At >= Number : i_At == Number ) ? EIO : 0;
          } );
      const std::optional< std::string > Found = Load( m_Folder.Target() );
      EXPECT_TRUE( Found == "failed" || Allowed.contains( Found ) ) << Number;
      Failing.m_Before = {};
      EXPECT_TRUE( Allowed.contains( Load( m_Folder.Target() ) ) ) << Number;
    }
  }
}

INSTANTIATE_TEST_SUITE_P( Starts, VCrash, testing::ValuesIn( Starts() ),
                          []( const testing::TestParamInfo< VStart >& i_rInfo )
                          {
                            return std::string( i_rInfo.param.Name );
                          } );

/// Calls of a traced process that have to do with files, from its first getppid to its second.
int CountKernelCalls( pid_t i_Child )
{
  const std::set< std::uint64_t > Memory{ SYS_brk,    SYS_mmap,         SYS_munmap,         SYS_mprotect,   SYS_mremap,
                                          SYS_futex,  SYS_madvise,      SYS_getrandom,      SYS_gettid,     SYS_getpid,
                                          SYS_tgkill, SYS_rt_sigaction, SYS_rt_sigprocmask, SYS_sched_yield };
  // Without this a stop does not say that it is at a call.
  ::ptrace( PTRACE_SETOPTIONS, i_Child, nullptr, PTRACE_O_TRACESYSGOOD );
  int Count = 0;
  int Markers = 0;
  for ( int Status = 0; ::ptrace( PTRACE_SYSCALL, i_Child, nullptr, nullptr ) == 0; )
  {
    ::waitpid( i_Child, &Status, 0 );
    __ptrace_syscall_info Info{};
    if ( WIFEXITED( Status ) || ::ptrace( PTRACE_GET_SYSCALL_INFO, i_Child, sizeof( Info ), &Info ) <= 0 )
    {
      break;
    }
    const bool bMarker = Info.op == 1 && Info.entry.nr == SYS_getppid;
    Markers += bMarker;
    Count += Info.op == 1 && !bMarker && Markers == 1 && !Memory.contains( Info.entry.nr );
  }
  return Markers == 2 ? Count : -1;
}
/// Gives the second folder the files of the first, two names of one file as such.
void LinkFiles( const std::filesystem::path& i_rFrom, const std::filesystem::path& i_rTo )
{
  std::filesystem::remove_all( i_rTo );
  std::filesystem::create_directory( i_rTo );
  for ( const std::filesystem::directory_entry& rEntry : std::filesystem::directory_iterator( i_rFrom ) )
  {
    std::filesystem::create_hard_link( rEntry.path(), i_rTo / rEntry.path().filename() );
  }
}
} // namespace

TEST( CrashSeam, TheKernelSeesNoCallThatTheTableOfCallsDoesNot )
{
  VSaveFolder Folder;
  VQuiet Quiet;
  const std::string Kilobyte( 1024, 'k' );
  for ( const std::string& rContent : { Kilobyte, New } )
  {
    Folder.Put( "", Old );
    ::fflush( nullptr );
    const pid_t Child = ::fork();
    if ( Child == 0 )
    {
      VTracedCalls Calls;
      Calls.m_bReallySync = true;
      if ( ::ptrace( PTRACE_TRACEME, 0, nullptr, nullptr ) != 0 )
      {
        ::_exit( 255 );
      }
      (void)::raise( SIGSTOP );
      (void)::getppid();
      const bool bSaved = Save( Folder.Target(), rContent ).IsOk();
      (void)::getppid();
      ::_exit( bSaved ? static_cast< int >( Calls.Trace().size() ) : 254 );
    }
    int Status = 0;
    ::waitpid( Child, &Status, 0 );
    if ( WIFEXITED( Status ) && WEXITSTATUS( Status ) == 255 )
    {
      GTEST_SKIP() << "no process can be traced here";
    }
    const int Seen = CountKernelCalls( Child );
    ::ptrace( PTRACE_CONT, Child, nullptr, nullptr );
    ::waitpid( Child, &Status, 0 );
    VTracedCalls Calls;
    ASSERT_EQ( Save( Folder.Target(), rContent ), IResult::Ok );
    EXPECT_EQ( Seen, static_cast< int >( Calls.Trace().size() ) );
    if ( rContent == Kilobyte )
    {
      EXPECT_LE( Calls.Trace().size(), 26u );
    }
  }
}

TEST( CrashTwice, TwoStopsWithoutALoadBetweenLeaveAWholeDocument )
{
  VSaveFolder Folder;
  VQuiet Quiet;
  VTracedCalls Calls;
  const VStart Start = Files( "Target", { { "", Old } }, { Old, Third, Middle } );
  const auto SaveFirst = [&]
  {
    return Save( Folder.Target(), Third ).IsOk();
  };
  const auto SaveSecond = [&]
  {
    return Save( Folder.Target(), Middle ).IsOk();
  };
  int Pairs = 0;
  for ( const bool bRefused : { false, true } )
  {
    VStart Used = Start;
    Used.Refused = bRefused ? std::map< std::string, int >{ { "link", EPERM } } : Used.Refused;
    for ( int First = 1, Before = Stopped; Before == Stopped; ++First )
    {
      Folder.Clear();
      Start.Prepare( Folder );
      Before = StopAt< VTracedCalls >( First, Used, SaveFirst );
      LinkFiles( Folder.Folder(), Folder.Kept() );
      for ( int Second = 1, After = Stopped; After == Stopped; Second += bRefused ? 3 : 1 )
      {
        LinkFiles( Folder.Kept(), Folder.Folder() );
        After = StopAt< VTracedCalls >( Second, Used, SaveSecond );
        const std::optional< std::string > Found = Load( Folder.Target() );
        EXPECT_TRUE( Start.Allowed.contains( Found ) ) << First << ", " << Second;
        EXPECT_TRUE( After == Stopped || Found == Middle ) << First << ", " << Second;
        ++Pairs;
      }
    }
  }
  EXPECT_GT( Pairs, 700 );
}

#include "SaveFolder.h"
#include "TracedCalls.h"

#include <TestSupport/LogGuard.h>
#include <UtilsFileSystem/FileIO.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <tuple>

#include <fcntl.h>
#include <sys/file.h>
#include <sys/wait.h>
#include <unistd.h>

using namespace UtilsFileSystem;
using namespace UtilsFileSystemTests;
using namespace ZEK;
namespace fs = std::filesystem;

namespace
{
using Texts = std::vector< std::string >;

class VFileIO : public testing::Test
{
protected:
  ~VFileIO() override { SetLockerLister( {} ); }

  static void Lockers( Texts i_Names )
  {
    SetLockerLister(
        [Names = std::move( i_Names )]( const std::string& )
        {
          return Names;
        } );
  }
  std::string Path( const std::string& i_rEnding ) const { return m_Folder.Target() + i_rEnding; }
  static Texts Logged( int i_Level ) { return TestSupport::LogTexts( "UtilsFileSystem", i_Level ); }

  VSaveFolder m_Folder;
};

VTracedCalls::Hook FailAll( const std::string& i_rName, int i_Error )
{
  return [=]( const VCall& i_rCall, int )
  {
    return i_rCall.Name == i_rName ? i_Error : 0;
  };
}
} // namespace

TEST_F( VFileIO, BothColumnsOfTheErrorTable )
{
  using Row = std::tuple< IResult, std::vector< int >, std::vector< std::uint32_t > >;
  const std::vector< Row > Rows{ { IResult::FileNotFound, { ENOENT, ENOTDIR }, { 2, 3, 53 } },
                                 { IResult::AlreadyPresent, { EEXIST, ENOTEMPTY }, { 80, 145, 183 } },
                                 { IResult::NotPermitted,
                                   { EACCES, EPERM, EROFS, EBUSY, ETXTBSY, EISDIR },
                                   { 5, 19, 32, 33, 170, 1175, 1176, 1177 } },
                                 { IResult::DiskFull, { ENOSPC, EDQUOT, EFBIG }, { 39, 112, 223 } },
                                 { IResult::InvalidName, { ENAMETOOLONG, ELOOP, EILSEQ }, { 123, 206 } },
                                 { IResult::InvalidArgument, { EINVAL }, { 87 } },
                                 { IResult::InvalidHandle, { EBADF }, { 6 } },
                                 { IResult::AllocationFailure, { ENOMEM }, { 8, 14 } },
                                 { IResult::NotAvailable, { EMFILE, ENFILE }, { 4 } },
                                 { IResult::FileIOFailure, { EIO, ENXIO, EOVERFLOW }, { 23, 29, 30, 1117 } },
                                 { IResult::NotSupported, { EXDEV, ENOSYS, EOPNOTSUPP }, { 17, 50 } },
                                 { IResult::WouldBlock, { EAGAIN }, {} },
                                 { IResult::TimedOut, { ETIMEDOUT }, { 121, 1460 } },
                                 { IResult::Canceled, { ECANCELED }, { 995, 1223 } },
                                 { IResult::Ok, { 0 }, { 0 } } };
  for ( const auto& [Result, Errnos, Codes] : Rows )
  {
    for ( const int Error : Errnos )
    {
      EXPECT_EQ( ResultFromErrno( Error ), Result ) << Error;
    }
    for ( const std::uint32_t Error : Codes )
    {
      EXPECT_EQ( ResultFromSystemError( Error ), Result ) << Error;
    }
  }
  TestSupport::ExpectFailureLine( "Std error code: 71" );
  TestSupport::ExpectFailureLine( "Std error code: 4294967295" );
  EXPECT_EQ( ResultFromErrno( EPROTO ), IResult::Failed );
  EXPECT_EQ( ResultFromSystemError( 4294967295u ), IResult::Failed );
  EXPECT_EQ( Logged( 2 ), ( Texts{ "Std error code: 71", "Std error code: 4294967295" } ) );
}

TEST_F( VFileIO, RemovingSaysWhatHappenedAndWhoIsInTheWay )
{
  m_Folder.Put( "", "x" );
  const std::string File = Path( "" );
  const std::string Denied = IResult( IResult::NotPermitted ).Text();
  Texts Failures;
  {
    const VTracedCalls Calls( FailAll( "unlink", EACCES ) );
    for ( const auto& [Names, Text] : std::vector< std::pair< Texts, std::string > >{
              { {}, "': " + Denied },
              { { "/bin/one" }, "': file is locked by processes '/bin/one'." },
              { { "/bin/one", "/bin/two" }, "': file is locked by processes '/bin/one', '/bin/two'." } } )
    {
      Lockers( Names );
      Failures.push_back( "Failed to remove file '" + File + Text );
      TestSupport::ExpectFailureLine( Failures.back() );
      EXPECT_EQ( RemoveFile( File ), IResult::NotPermitted );
    }
  }
  {
    // The holders are of interest after a refusal only.
    const VTracedCalls Calls( FailAll( "unlink", EIO ) );
    Failures.push_back( "Failed to remove file '" + File + "': " + IResult( IResult::FileIOFailure ).Text() );
    TestSupport::ExpectFailureLine( Failures.back() );
    EXPECT_EQ( RemoveFile( File ), IResult::FileIOFailure );
  }
  EXPECT_EQ( RemoveFile( File ), IResult::Ok );
  EXPECT_EQ( RemoveFile( File ), IResult::FileNotFound );
  EXPECT_EQ( Logged( 6 ),
             ( Texts{ "Removed file '" + File + "'.", "Nothing to remove: '" + File + "' did not exist." } ) );
  Lockers( {} );
  Failures.push_back( "Failed to remove file '" + m_Folder.Folder() + "': " + Denied );
  TestSupport::ExpectFailureLine( Failures.back() );
  EXPECT_EQ( RemoveFile( m_Folder.Folder() ), IResult::NotPermitted );
  EXPECT_EQ( Logged( 2 ), Failures );
}

TEST_F( VFileIO, CopyKeepsBytesAndPermissionsAndLeavesNoHalf )
{
  std::string Bytes( 300000, 'b' );
  Bytes[1000] = '\0';
  m_Folder.Put( "", Bytes );
  m_Folder.Put( ".copy", std::string( 400000, 'c' ) );
  fs::permissions( Path( "" ), fs::perms::owner_read | fs::perms::group_read );
  EXPECT_EQ( CopyFile( Path( "" ), Path( ".copy" ) ), IResult::Ok );
  EXPECT_EQ( m_Folder.Get( ".copy" ), Bytes );
  EXPECT_EQ( fs::status( Path( ".copy" ) ).permissions(), fs::perms::owner_read | fs::perms::group_read );
  {
    VTracedCalls Calls( FailAll( "copyrange", EXDEV ) );
    Calls.m_MostBytesAWrite = 7777;
    EXPECT_EQ( CopyFile( Path( "" ), Path( ".slow" ) ), IResult::Ok );
  }
  EXPECT_EQ( m_Folder.Get( ".slow" ), Bytes );
  {
    int Left = 3;
    VTracedCalls Calls(
        [&]( const VCall& i_rCall, int )
        {
          return i_rCall.Name == "copyrange" ? ENOSYS : i_rCall.Name == "write" && --Left == 0 ? ENOSPC : 0;
        } );
    EXPECT_EQ( CopyFile( Path( "" ), Path( ".half" ) ), IResult::DiskFull );
    Calls.m_Before = FailAll( "copyrange", EIO );
    EXPECT_EQ( CopyFile( Path( "" ), Path( ".half" ) ), IResult::FileIOFailure );
  }
  EXPECT_EQ( m_Folder.Get( ".half" ), std::nullopt );
  EXPECT_EQ( CopyFile( Path( "" ), Path( "" ) ), IResult::NotPermitted );
  EXPECT_EQ( m_Folder.Get( "" ), Bytes ) << "copied onto itself";
  EXPECT_EQ( CopyFile( Path( ".none" ), Path( ".half" ) ), IResult::FileNotFound );
  EXPECT_EQ( CopyFile( m_Folder.Folder(), Path( ".half" ) ), IResult::NotPermitted );
  // A file whose size says nothing.
  EXPECT_EQ( CopyFile( "/proc/self/status", Path( ".status" ) ), IResult::Ok );
  EXPECT_TRUE( m_Folder.Get( ".status" )->starts_with( "Name:" ) );
}

TEST_F( VFileIO, MoveNeverReplaces )
{
  for ( const auto& [Name, Error] : std::vector< std::pair< std::string, int > >{ { "", 0 }, { "move", EINVAL } } )
  {
    m_Folder.Clear();
    m_Folder.Put( "", "a" );
    m_Folder.Put( ".b", "b" );
    fs::create_symlink( "nowhere", Path( ".dangling" ) );
    const VTracedCalls Calls( FailAll( Name, Error ) );
    EXPECT_EQ( MoveFile( Path( "" ), Path( ".b" ) ), IResult::AlreadyPresent );
    EXPECT_EQ( MoveFile( Path( "" ), Path( ".dangling" ) ), IResult::AlreadyPresent );
    EXPECT_EQ( m_Folder.Get( ".b" ), "b" );
    EXPECT_EQ( MoveFile( Path( "" ), Path( ".c" ) ), IResult::Ok );
    EXPECT_EQ( MoveFile( Path( "" ), Path( ".d" ) ), IResult::FileNotFound );
    EXPECT_EQ( m_Folder.Endings(), ( Texts{ ".b", ".c", ".dangling" } ) );
  }
  VTracedCalls Calls( FailAll( "move", EXDEV ) );
  EXPECT_EQ( MoveFile( Path( ".c" ), Path( ".d" ) ), IResult::NotSupported );
  Calls.m_Before = []( const VCall& i_rCall, int )
  {
    return i_rCall.Name == "move" ? ENOSYS : i_rCall.Name == "unlink" && i_rCall.Path.ends_with( ".c" ) ? EIO : 0;
  };
  EXPECT_EQ( MoveFile( Path( ".c" ), Path( ".d" ) ), IResult::FileIOFailure );
  EXPECT_EQ( m_Folder.Endings(), ( Texts{ ".b", ".c", ".dangling" } ) ) << "half a move was not taken back";
}

TEST_F( VFileIO, ReplaceKeepsTheBackupAndTheMode )
{
  for ( const bool bByRenames : { false, true } )
  {
    m_Folder.Clear();
    m_Folder.Put( ".new", "new" );
    m_Folder.Put( "", "old" );
    m_Folder.Put( ".old", "stale" );
    fs::permissions( Path( "" ), fs::perms::owner_all );
    bool bAlwaysThere = true;
    const VTracedCalls Calls(
        [&]( const VCall&, int )
        {
          bAlwaysThere = bAlwaysThere && m_Folder.Get( "" );
          return 0;
        } );
    const auto Replace = bByRenames ? ReplaceFileByRenames : ReplaceFile;
    EXPECT_EQ( Replace( Path( ".new" ), Path( "" ), Path( ".old" ) ), IResult::Ok );
    EXPECT_EQ( bAlwaysThere, !bByRenames );
    EXPECT_EQ( m_Folder.Get( "" ), "new" );
    EXPECT_EQ( m_Folder.Get( ".old" ), "old" );
    EXPECT_EQ( m_Folder.Endings(), ( Texts{ "", ".old" } ) );
    EXPECT_EQ( fs::status( Path( "" ) ).permissions(), fs::perms::owner_all );
    EXPECT_EQ( Replace( Path( ".new" ), Path( "" ), Path( ".old" ) ), IResult::FileNotFound );
    // Without a file to replace, the backup is none of its business.
    fs::rename( Path( "" ), Path( ".new" ) );
    EXPECT_EQ( Replace( Path( ".new" ), Path( "" ), Path( ".old" ) ), IResult::Ok );
    EXPECT_EQ( m_Folder.Get( "" ), "new" );
    EXPECT_EQ( m_Folder.Get( ".old" ), "old" );
    // Two names of one file.
    fs::create_hard_link( Path( "" ), Path( ".new" ) );
    EXPECT_EQ( Replace( Path( ".new" ), Path( "" ), Path( ".old" ) ), IResult::Ok );
    EXPECT_EQ( m_Folder.Endings(), ( Texts{ "", ".old" } ) );
  }
}

TEST_F( VFileIO, LockersAreFoundByOpenFilesAndByLocks )
{
  m_Folder.Put( "", "x" );
  const std::string Self = fs::read_symlink( "/proc/self/exe" );
  EXPECT_EQ( ListLockingProcesses( Path( "" ) ), Texts{} );
  EXPECT_EQ( ListLockingProcesses( Path( ".none" ) ), Texts{} );
  const int File = ::open( Path( "" ).c_str(), O_RDONLY | O_CLOEXEC );
  // Another name of the same file finds it, too.
  fs::create_hard_link( Path( "" ), Path( ".again" ) );
  EXPECT_EQ( ListLockingProcesses( Path( ".again" ) ), Texts{ Self } );
  ASSERT_EQ( ::flock( File, LOCK_EX ), 0 );
  std::vector< pid_t > Children;
  int Block[2];
  ASSERT_EQ( ::pipe( Block ), 0 );
  for ( int Child = 0; Child < 12; ++Child )
  {
    Children.push_back( ::fork() );
    if ( Children.back() == 0 )
    {
      char Byte;
      ::close( Block[1] );
      ::_exit( ::read( Block[0], &Byte, 1 ) == 0 ? 0 : 1 );
    }
  }
  EXPECT_EQ( ListLockingProcesses( Path( "" ) ), Texts( 10, Self ) );
  {
    const VTracedCalls Calls( FailAll( "readlink", EACCES ) );
    EXPECT_EQ( ListLockingProcesses( Path( "" ) ), Texts( 10, "unknown process" ) );
  }
  {
    // Without a look into other processes the table of locks still names the owner.
    struct VBlind final : IFileSystemCalls
    {
      int ListFolder( const char* i_pPath, std::vector< std::string >& o_rNames ) override
      {
        return std::string( i_pPath ) == "/proc" ? IFileSystemCalls::ListFolder( i_pPath, o_rNames ) : -1;
      }
    } Blind;
    SetFileSystemCalls( &Blind );
    EXPECT_EQ( ListLockingProcesses( Path( "" ) ), Texts{ Self } );
    SetFileSystemCalls( nullptr );
  }
  ::close( Block[0] );
  ::close( Block[1] );
  for ( const pid_t Child : Children )
  {
    ::waitpid( Child, nullptr, 0 );
  }
  ::close( File );
}

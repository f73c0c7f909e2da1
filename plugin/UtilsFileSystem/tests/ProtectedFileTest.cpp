#include "ProtectedFixture.h"
#include "TracedCalls.h"

#include <cerrno>
#include <stdexcept>

#include <sys/stat.h>

using namespace UtilsFileSystem;
using namespace UtilsFileSystemTests;
using namespace ZEK;

namespace
{
const std::string Denied = IResult( IResult::NotPermitted ).Text();
const std::string Broken = IResult( IResult::FileIOFailure ).Text();
const std::string NoSpace = IResult( IResult::DiskFull ).Text();
const std::string Moved = "Protected save: new file [*.new] moved to [*].";
const std::string BackupGone = "Protected save: removed backup file [*.old].";
const std::string NotMoved = "Protected save: new file [*.new] could not be moved to [*]: ";
} // namespace

TEST_F( VProtected, EachRowOfTheLoadTable )
{
  struct VRow
  {
    Contents Before;
    Contents After;
    std::optional< std::string > Read;
    Lines Logged;
  };
  const std::string Completing =
      "Interrupted save detected for [*], attempting to complete save of new data [*.new]...";
  const std::string Ignoring = "Interrupted save detected for [*], ignoring potentially corrupt new data [*.new]";
  const std::vector< VRow > Rows{
      { { { "", "t" }, { ".new", "n" }, { ".old", "o" } },
        { { "", "n" } },
        "n",
        { { 3, Completing }, { 6, Moved }, { 6, BackupGone } } },
      { { { ".new", "n" }, { ".old", "o" } },
        { { "", "n" } },
        "n",
        { { 3, Completing }, { 6, Moved }, { 6, BackupGone } } },
      { { { "", "t" }, { ".new", "n" } }, { { "", "t" }, { ".new", "n" } }, "t", { { 3, Ignoring } } },
      { { { ".new", "n" } }, { { ".new", "n" } }, std::nullopt, { { 3, Ignoring } } },
      { { { "", "t" }, { ".old", "o" } }, { { "", "t" } }, "t", {} },
      { { { ".old", "o" } },
        { { "", "o" } },
        "o",
        { { 3, "File [*] not found but backup [*.old] is present, restoring backup..." } } },
      { { { "", "t" } }, { { "", "t" } }, "t", {} },
      { {}, {}, std::nullopt, {} },
      { { { "", "t" }, { ".old.stale", "s" }, { ".lock", "" } }, { { "", "t" } }, "t", {} } };
  for ( const VRow& rRow : Rows )
  {
    Prepare( rRow.Before );
    EXPECT_EQ( Load( m_Folder.Target() ), rRow.Read );
    EXPECT_EQ( Left(), rRow.After );
    ExpectLines( rRow.Logged );
  }
  // Through a symbolic link the neighbours are those of the file that it points to, also while that is aside.
  Prepare( { { ".old", "o" } } );
  std::filesystem::create_symlink( "doc", m_Folder.Folder() + "/link" );
  EXPECT_EQ( Load( m_Folder.Folder() + "/link" ), "o" );
  EXPECT_EQ( m_Folder.Get( "" ), "o" );
}

TEST_F( VProtected, EachStepOfTheSaveTable )
{
  struct VRow
  {
    const char* Name;
    Contents Before;
    std::map< std::string, int > Failing;
    bool bOverwrite;
    IResult Result;
    Contents After;
    Lines Logged;
  };
  const std::vector< VRow > Rows{
      { "replaces", { { "", "t" } }, {}, true, IResult::Ok, { { "", "n" } }, { { 6, Moved }, { 6, BackupGone } } },
      { "first", {}, {}, true, IResult::Ok, { { "", "n" } }, { { 6, Moved } } },
      { "first without overwriting", {}, {}, false, IResult::Ok, { { "", "n" } }, { { 6, Moved } } },
      { "moves without that call", {}, { { "move", ENOSYS } }, false, IResult::Ok, { { "", "n" } }, { { 6, Moved } } },
      { "moves without links",
        {},
        { { "move", EINVAL }, { "link", EPERM } },
        false,
        IResult::Ok,
        { { "", "n" } },
        { { 6, Moved } } },
      { "not over a file",
        { { "", "t" } },
        {},
        false,
        IResult::AlreadyPresent,
        { { "", "t" } },
        { { 6, NotMoved + IResult( IResult::AlreadyPresent ).Text() } } },
      { "not over a file without links",
        { { "", "t" } },
        { { "move", EINVAL }, { "link", EPERM } },
        false,
        IResult::AlreadyPresent,
        { { "", "t" } },
        { { 6, NotMoved + IResult( IResult::AlreadyPresent ).Text() } } },
      { "new stays without overwriting",
        { { "", "t" } },
        { { "unlink .new", EACCES } },
        false,
        IResult::AlreadyPresent,
        { { "", "t" }, { ".new", "n" } },
        { { 6, NotMoved + IResult( IResult::AlreadyPresent ).Text() },
          { 3, "Protected save: failed removing intermediate file [*.new]: " + Denied } } },
      { "flush fails",
        { { "", "t" } },
        { { "sync .new", ENOSPC } },
        true,
        IResult::DiskFull,
        { { "", "t" } },
        { { 2, NotMoved + NoSpace } } },
      { "nothing to flush",
        { { "", "t" } },
        { { "sync", EINVAL } },
        true,
        IResult::Ok,
        { { "", "n" } },
        { { 6, Moved }, { 6, BackupGone } } },
      { "folder flush fails",
        { { "", "t" } },
        { { "sync /", EIO } },
        true,
        IResult::FileIOFailure,
        { { "", "n" }, { ".old", "t" } },
        { { 2, "Protected save: the name of file [*] may not be on the disk: " + Broken } } },
      { "swap fails",
        { { "", "t" } },
        { { "rename", EACCES } },
        true,
        IResult::NotPermitted,
        { { "", "t" }, { ".new", "n" }, { ".old", "t" } },
        { { 2, NotMoved + Denied } } },
      { "swap by renames",
        { { "", "t" } },
        { { "link", EMLINK } },
        true,
        IResult::Ok,
        { { "", "n" } },
        { { 6, Moved }, { 6, BackupGone } } },
      { "swap by renames fails at its first",
        { { "", "t" } },
        { { "link", EPERM }, { "rename", EIO } },
        true,
        IResult::FileIOFailure,
        { { "", "t" }, { ".new", "n" } },
        { { 2, "Failed to create backup file *.old while replacing file: " + Broken + "." },
          { 2, NotMoved + Broken } } },
      { "swap by renames fails at its second",
        { { "", "t" } },
        { { "link", EPERM }, { "rename .new", EIO } },
        true,
        IResult::FileIOFailure,
        { { "", "t" }, { ".new", "n" } },
        { { 2, "Failed to replace file * with file *.new: " + Broken + "." }, { 2, NotMoved + Broken } } },
      { "backup stays",
        { { "", "t" } },
        { { "unlink .old", EACCES } },
        true,
        IResult::OkButPartial,
        { { "", "n" }, { ".old", "t" } },
        { { 6, Moved }, { 2, "Protected save: failed removing backup file [*.old]: " + Denied } } },
      { "a torn one of before cannot be removed",
        { { "", "t" }, { ".new", "x" } },
        { { "unlink .new", EACCES } },
        true,
        IResult::NotPermitted,
        { { "", "t" }, { ".new", "x" } },
        { { 2, "Failed to remove intermediate file [*.new]: " + Denied },
          { 2, "Failed to save file '*': " + Denied } } },
      { "the lock cannot be had",
        { { "", "t" } },
        { { "create .lock", EACCES } },
        true,
        IResult::NotPermitted,
        { { "", "t" } },
        { { 2, "Failed to save file '*': " + Denied } } },
      { "no locks here",
        { { "", "t" } },
        { { "lock", ENOLCK } },
        true,
        IResult::Ok,
        { { "", "n" }, { ".lock", "" } },
        { { 3, "File [*] cannot be locked here: another process may save it at the same time." },
          { 6, Moved },
          { 6, BackupGone } } } };
  for ( const VRow& rRow : Rows )
  {
    SCOPED_TRACE( rRow.Name );
    Prepare( rRow.Before );
    const VTracedCalls Calls(
        [&]( const VCall& i_rCall, int )
        {
          // "unlink .new" fails for that file alone; the first name of two counts.
          const std::string First = i_rCall.Path.substr( 0, i_rCall.Path.find( " > " ) );
          for ( const auto& [What, Error] : rRow.Failing )
          {
            const std::size_t Space = What.find( ' ' );
            if ( i_rCall.Name == What.substr( 0, Space ) &&
                 ( Space == std::string::npos || First.ends_with( What.substr( Space + 1 ) ) ) )
            {
              return Error;
            }
          }
          return 0;
        } );
    EXPECT_EQ( Save( m_Folder.Target(), "n", rRow.bOverwrite ), rRow.Result );
    EXPECT_EQ( Left(), rRow.After );
    ExpectLines( rRow.Logged );
  }
}

TEST_F( VProtected, ACallbackThatFailsOrDoesNothingLosesNothing )
{
  struct VRow
  {
    Contents Before;
    bool bWrites;
    IResult Said;
    IResult Result;
    Contents After;
    Lines Logged;
  };
  const std::string None = "Protected save: new file [*.new] doesn't exist so it wasn't moved to [*].";
  const std::vector< VRow > Rows{
      { { { "", "t" } }, true, IResult::InvalidValue, IResult::InvalidValue, { { "", "t" } }, {} },
      { { { "", "t" } }, false, IResult::InvalidValue, IResult::InvalidValue, { { "", "t" } }, {} },
      { { { "", "t" }, { ".old", "o" } },
        true,
        IResult::DiskFull,
        IResult::DiskFull,
        { { "", "t" }, { ".old", "o" } },
        {} },
      { { { "", "t" } }, false, IResult::Ok, IResult::Ok, { { "", "t" } }, { { 6, None }, { 6, Moved } } },
      { { { ".old", "o" } },
        false,
        IResult::Ok,
        IResult::Ok,
        { { "", "o" } },
        { { 3, "File [*] not found but backup [*.old] is present, restoring backup..." },
          { 6, None },
          { 6, Moved } } } };
  for ( const VRow& rRow : Rows )
  {
    Prepare( rRow.Before );
    EXPECT_EQ( ProtectedSave(
                   [&]( const std::string& i_rPath )
                   {
                     EXPECT_EQ( i_rPath, m_Folder.Target() + ".new" );
                     return rRow.bWrites && Writer( "half" )( i_rPath ).IsError() ? IResult::Failed : rRow.Said;
                   },
                   m_Folder.Target(), true ),
               rRow.Result );
    EXPECT_EQ( Left(), rRow.After );
    ExpectLines( rRow.Logged );
  }
  const PathFunction Throws = []( const std::string& ) -> IResult
  {
    throw std::runtime_error( "callback" );
  };
  EXPECT_EQ( ProtectedSave( Throws, m_Folder.Target(), true ), IResult::FailedWithException );
  EXPECT_EQ( ProtectedLoad( Throws, m_Folder.Target() ), IResult::FailedWithException );
  EXPECT_EQ( Left(), ( Contents{ { "", "o" } } ) );
}

TEST_F( VProtected, ASaveFlushesSwapsFlushesTheFolderAndThenRemovesTheBackup )
{
  Prepare( { { "", "t" } } );
  const VTracedCalls Calls;
  ASSERT_EQ( Save( m_Folder.Target(), "n" ), IResult::Ok );
  std::vector< std::string > Steps;
  for ( const std::string& rStep : Calls.Steps( m_Folder.Target() ) )
  {
    if ( rStep.starts_with( "write" ) || rStep.starts_with( "sync" ) || rStep.starts_with( "link" ) ||
         rStep.starts_with( "rename" ) || rStep.starts_with( "unlink" ) )
    {
      Steps.push_back( rStep );
    }
  }
  EXPECT_EQ( Steps, ( std::vector< std::string >{ "write *.new", "sync *.new", "link * > *.old", "rename *.new > *",
                                                  "sync " + m_Folder.Folder() + "/", "unlink *.old",
                                                  "unlink *.old.stale", "unlink *.lock" } ) );
}

TEST_F( VProtected, LinksFoldersDevicesLongNamesAndPermissions )
{
  namespace fs = std::filesystem;
  const std::string Link = m_Folder.Folder() + "/link";
  // A link, also one that points nowhere yet, is followed to overwrite and in the way otherwise.
  fs::create_symlink( "doc", Link );
  EXPECT_EQ( Save( Link, "first" ), IResult::Ok );
  EXPECT_EQ( Save( Link, "second" ), IResult::Ok );
  EXPECT_TRUE( fs::is_symlink( Link ) );
  EXPECT_EQ( Left()[""], "second" );
  fs::remove( m_Folder.Target() );
  EXPECT_EQ( Save( Link, "third", false ), IResult::AlreadyPresent );
  EXPECT_FALSE( fs::exists( Link + ".new" ) || fs::exists( m_Folder.Target() ) );

  fs::create_directories( m_Folder.Target() + "/inside" );
  TestSupport::ExpectFailureLine( "Failed to save file '" + m_Folder.Target() + "': " + Denied );
  EXPECT_EQ( Save( m_Folder.Target(), "n" ), IResult::NotPermitted );
  EXPECT_EQ( ReplaceFile( m_Folder.Target(), m_Folder.Folder() + "/x", m_Folder.Folder() + "/y" ),
             IResult::NotPermitted );
  EXPECT_TRUE( fs::is_directory( m_Folder.Target() + "/inside" ) );
  const std::string Pipe = m_Folder.Folder() + "/pipe";
  ASSERT_EQ( ::mkfifo( Pipe.c_str(), 0600 ), 0 );
  TestSupport::ExpectFailureLine( "Failed to save file '" + Pipe + "': " + Denied );
  EXPECT_EQ( Save( Pipe, "n" ), IResult::NotPermitted );
  EXPECT_TRUE( fs::is_fifo( Pipe ) );

  // 250 bytes: the longest of which all names but one fit; the stale backup gives way then.
  const std::string Long = m_Folder.Folder() + "/" + "ä b" + std::string( 246, 'l' );
  EXPECT_EQ( Save( Long, "1" ), IResult::Ok );
  fs::copy_file( Long, Long + ".old" );
  EXPECT_EQ( Save( Long, "2" ), IResult::Ok );
  EXPECT_EQ( Load( Long ), "2" );
  EXPECT_FALSE( fs::exists( Long + ".old" ) );

  // The permissions stay, and the bytes are open to nobody else even while they are being written.
  fs::permissions( Long, fs::perms::owner_read );
  EXPECT_EQ( ProtectedSave(
                 [&]( const std::string& i_rPath )
                 {
                   const IResult Result = Writer( "3" )( i_rPath );
                   EXPECT_EQ( fs::status( i_rPath ).permissions(), fs::perms::owner_read | fs::perms::owner_write );
                   return Result;
                 },
                 Long, true ),
             IResult::Ok );
  EXPECT_EQ( fs::status( Long ).permissions(), fs::perms::owner_read );
}

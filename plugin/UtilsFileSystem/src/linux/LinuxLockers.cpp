#include "LinuxCalls.h"

#include "Platform.h"

#include <algorithm>
#include <charconv>
#include <climits>
#include <cstdio>
#include <optional>

#include <fcntl.h>
#include <sys/sysmacros.h>
#include <time.h>
#include <unistd.h>

namespace UtilsFileSystem
{
using namespace Linux;

namespace
{
constexpr std::size_t MostLockers = 10;

struct VHolder
{
  long Process = 0;
  std::optional< unsigned long long > Started;
};

std::string ProcessPath( long i_Process, const char* i_pName )
{
  return std::string( "/proc/" ).append( std::to_string( i_Process ) ).append( "/" ).append( i_pName );
}

/// Empty when the file cannot be read.
std::string TextOf( const std::string& i_rPath )
{
  std::string Text;
  const int File = Open( i_rPath, O_RDONLY );
  if ( File == -1 )
  {
    return Text;
  }
  char Bytes[4096];
  for ( ssize_t Got = 0; ( Got = ReadSome( File, Bytes, sizeof( Bytes ) ) ) > 0; )
  {
    Text.append( Bytes, static_cast< std::size_t >( Got ) );
  }
  (void)Close( File );
  return Text;
}

/// Clock ticks from the start of the system to the start of the process.
std::optional< unsigned long long > StartOf( long i_Process )
{
  const std::string Text = TextOf( ProcessPath( i_Process, "stat" ) );
  // The second field, the name in brackets, may hold anything; the start is the twenty-second.
  std::size_t At = Text.rfind( ')' );
  for ( int Field = 2; Field < 22 && At != std::string::npos; ++Field )
  {
    At = Text.find( ' ', At + 1 );
  }
  unsigned long long Started = 0;
  if ( At == std::string::npos ||
       std::from_chars( Text.data() + At + 1, Text.data() + Text.size(), Started ).ec != std::errc() )
  {
    return {};
  }
  return Started;
}

unsigned long long Now()
{
  timespec Time{};
  ::clock_gettime( CLOCK_BOOTTIME, &Time );
  const long Ticks = ::sysconf( _SC_CLK_TCK );
  return static_cast< unsigned long long >( Time.tv_sec ) * static_cast< unsigned long long >( Ticks ) +
         static_cast< unsigned long long >( Time.tv_nsec / ( 1000000000L / Ticks ) );
}

bool HoldsOpen( long i_Process, const struct stat& i_rFile )
{
  const std::string Folder = ProcessPath( i_Process, "fd/" );
  std::vector< std::string > Names;
  (void)Calls().ListFolder( Folder.c_str(), Names );
  return std::any_of( Names.begin(), Names.end(),
                      [&]( const std::string& i_rName )
                      {
                        struct stat Stat;
                        return Calls().StatPath( ( Folder + i_rName ).c_str(), &Stat ) == 0 &&
                               Stat.st_dev == i_rFile.st_dev && Stat.st_ino == i_rFile.st_ino;
                      } );
}

/// The owners in the kernel's table: "1: FLOCK  ADVISORY  WRITE 4711 08:01:1234 0 EOF".
std::vector< long > LockOwners( const struct stat& i_rFile )
{
  std::vector< long > Owners;
  const std::string Text = TextOf( "/proc/locks" );
  for ( std::size_t Begin = 0; Begin < Text.size(); )
  {
    const std::size_t End = std::min( Text.find( '\n', Begin ), Text.size() );
    const std::string Line = Text.substr( Begin, End - Begin );
    Begin = End + 1;
    long Process = 0;
    unsigned Major = 0;
    unsigned Minor = 0;
    unsigned long long Id = 0;
    // A line with an arrow is of one who waits.
    if ( Line.find( "->" ) == std::string::npos &&
         std::sscanf( Line.c_str(), "%*s %*s %*s %*s %ld %x:%x:%llu", &Process, &Major, &Minor, &Id ) == 4 &&
         makedev( Major, Minor ) == i_rFile.st_dev && Id == i_rFile.st_ino && Process > 0 )
    {
      Owners.push_back( Process );
    }
  }
  return Owners;
}

void Add( std::vector< VHolder >& io_rHolders, long i_Process )
{
  const bool bKnown = std::any_of( io_rHolders.begin(), io_rHolders.end(),
                                   [&]( const VHolder& i_rHolder )
                                   {
                                     return i_rHolder.Process == i_Process;
                                   } );
  if ( !bKnown && io_rHolders.size() < MostLockers )
  {
    io_rHolders.push_back( { i_Process, StartOf( i_Process ) } );
  }
}

std::string NameOf( const VHolder& i_rHolder, unsigned long long i_Scan )
{
  char Text[PATH_MAX];
  const ssize_t Size = Calls().ReadLink( ProcessPath( i_rHolder.Process, "exe" ).c_str(), Text, sizeof( Text ) );
  // The number may belong to another process by now.
  const bool bSame =
      i_rHolder.Started && *i_rHolder.Started <= i_Scan && i_rHolder.Started == StartOf( i_rHolder.Process );
  return Size > 0 && bSame ? std::string( Text, static_cast< std::size_t >( Size ) ) : "unknown process";
}
} // namespace

std::vector< std::string > Platform::FindLockers( const std::string& i_rPath )
{
  struct stat File;
  std::vector< std::string > Entries;
  if ( Calls().StatPath( i_rPath.c_str(), &File ) == -1 || Calls().ListFolder( "/proc", Entries ) == -1 )
  {
    return {};
  }
  std::vector< VHolder > Holders;
  for ( const long Process : LockOwners( File ) )
  {
    Add( Holders, Process );
  }
  for ( const std::string& rEntry : Entries )
  {
    long Process = 0;
    const auto [pEnd, Error] = std::from_chars( rEntry.data(), rEntry.data() + rEntry.size(), Process );
    if ( Error == std::errc() && pEnd == rEntry.data() + rEntry.size() && HoldsOpen( Process, File ) )
    {
      Add( Holders, Process );
    }
  }
  const unsigned long long Scan = Now();
  std::vector< std::string > Names;
  for ( const VHolder& rHolder : Holders )
  {
    Names.push_back( NameOf( rHolder, Scan ) );
  }
  return Names;
}

} // namespace UtilsFileSystem

#include "LinuxCalls.h"

#include "Platform.h"

#include <UtilsFileSystem/FileIO.h>

#include <utility>
#include <vector>

#include <fcntl.h>

using namespace ZEK;

namespace UtilsFileSystem
{
using namespace Linux;

namespace
{
class VDescriptor
{
public:
  explicit VDescriptor( int i_File )
    : m_File( i_File )
  {
  }
  ~VDescriptor() { (void)Release(); }
  VDescriptor( const VDescriptor& ) = delete;
  VDescriptor& operator=( const VDescriptor& ) = delete;

  int File() const { return m_File; }
  int Release() { return m_File == -1 ? 0 : Close( std::exchange( m_File, -1 ) ); }

private:
  int m_File;
};

/// In the kernel as far as that goes; what is left, and files that have no size, through a buffer.
int CopyBytes( int i_From, int i_To )
{
  constexpr std::size_t Most = std::size_t( 1 ) << 30;
  ssize_t Copied = 0;
  do
  {
    Copied = Retry(
        [&]
        {
          return Calls().CopyRange( i_From, i_To, Most );
        } );
  } while ( Copied > 0 );
  if ( Copied == -1 && errno != EXDEV && errno != ENOSYS && errno != EINVAL && errno != EOPNOTSUPP )
  {
    return -1;
  }
  std::vector< char > Bytes( 65536 );
  for ( ;; )
  {
    const ssize_t Read = ReadSome( i_From, Bytes.data(), Bytes.size() );
    if ( Read <= 0 )
    {
      return static_cast< int >( Read );
    }
    if ( WriteAll( i_To, Bytes.data(), static_cast< std::size_t >( Read ) ) == -1 )
    {
      return -1;
    }
  }
}
} // namespace

IResult CopyFile( const std::string& i_rSource, const std::string& i_rDestination )
{
  VDescriptor From( Open( i_rSource, O_RDONLY ) );
  struct stat Source;
  if ( From.File() == -1 || Calls().StatFile( From.File(), &Source ) == -1 )
  {
    return ResultOf( -1 );
  }
  struct stat Present;
  const bool bPresent = Calls().StatPath( i_rDestination.c_str(), &Present ) == 0;
  if ( S_ISDIR( Source.st_mode ) || ( bPresent && Present.st_dev == Source.st_dev && Present.st_ino == Source.st_ino ) )
  {
    // Opening a file as its own destination would empty it.
    return IResult::NotPermitted;
  }
  VDescriptor To( Open( i_rDestination, O_WRONLY | O_CREAT | O_TRUNC, Source.st_mode & 0777 ) );
  if ( To.File() == -1 )
  {
    return ResultOf( -1 );
  }
  IResult Result = ResultOf( CopyBytes( From.File(), To.File() ) );
  (void)Calls().SetMode( To.File(), Source.st_mode & 0777 );
  const IResult Closed = ResultOf( To.Release() );
  Result = Result.IsError() ? Result : Closed;
  if ( Result.IsError() && ( !bPresent || S_ISREG( Present.st_mode ) ) )
  {
    (void)Platform::Remove( i_rDestination );
  }
  return Result;
}

} // namespace UtilsFileSystem

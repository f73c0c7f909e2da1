#include "LinuxCalls.h"
#include "LinuxHandle.h"

#include "Platform.h"

#include <cstdio>
#include <memory>

#include <fcntl.h>

using namespace ZEK;

namespace UtilsFileSystem
{
using namespace Linux;

namespace
{
/// What stands behind a C stream, so that its bytes pass through the table of calls like all others.
struct VCookie
{
  static constexpr std::size_t BufferSize = 65536;

  int File = -1;
  int FirstError = 0;
  char Buffer[BufferSize];
};

ssize_t ReadCookie( void* i_pCookie, char* o_pBytes, std::size_t i_Size )
{
  return ReadSome( static_cast< VCookie* >( i_pCookie )->File, o_pBytes, i_Size );
}

ssize_t WriteCookie( void* i_pCookie, const char* i_pBytes, std::size_t i_Size )
{
  VCookie& rCookie = *static_cast< VCookie* >( i_pCookie );
  // After an error nothing more is written: what followed would land in the wrong place.
  if ( rCookie.FirstError == 0 && WriteAll( rCookie.File, i_pBytes, i_Size ) == -1 )
  {
    rCookie.FirstError = errno;
  }
  errno = rCookie.FirstError;
  return rCookie.FirstError == 0 ? static_cast< ssize_t >( i_Size ) : 0;
}

int SeekCookie( void* i_pCookie, off64_t* io_pOffset, int i_From )
{
  const off_t Position = Calls().Seek( static_cast< VCookie* >( i_pCookie )->File, *io_pOffset, i_From );
  *io_pOffset = Position == -1 ? *io_pOffset : Position;
  return Position == -1 ? -1 : 0;
}

int CloseCookie( void* i_pCookie )
{
  const std::unique_ptr< VCookie > pCookie( static_cast< VCookie* >( i_pCookie ) );
  const int Returned = Close( pCookie->File );
  errno = pCookie->FirstError != 0 ? pCookie->FirstError : errno;
  return pCookie->FirstError != 0 ? -1 : Returned;
}

struct VMode
{
  const char* pText = nullptr;
  int Flags = 0;
};

/// Null text for what is no mode.
VMode ModeOf( std::string_view i_Mode, bool i_bExclusive )
{
  VMode Mode;
  if ( i_Mode.empty() || i_Mode.find_first_not_of( "+bxe", 1 ) != std::string_view::npos )
  {
    return Mode;
  }
  const bool bBoth = i_Mode.find( '+' ) != std::string_view::npos;
  const int Exclusive = i_bExclusive || i_Mode.find( 'x' ) != std::string_view::npos ? O_EXCL : 0;
  Mode.Flags = bBoth ? O_RDWR : i_Mode[0] == 'r' ? O_RDONLY : O_WRONLY;
  switch ( i_Mode[0] )
  {
  case 'r':
    Mode.pText = bBoth ? "r+" : "r";
    break;
  case 'w':
    Mode.pText = bBoth ? "w+" : "w";
    Mode.Flags |= O_CREAT | O_TRUNC | Exclusive;
    break;
  case 'a':
    Mode.pText = bBoth ? "a+" : "a";
    Mode.Flags |= O_CREAT | O_APPEND | Exclusive;
    break;
  default:
    break;
  }
  return Mode;
}
} // namespace

IResult Platform::OpenCFile( const std::string& i_rPath, std::string_view i_Mode, bool i_bExclusive,
                             std::FILE*& o_rpFile, bool& o_rbBuffered )
{
  o_rpFile = nullptr;
  const VMode Mode = ModeOf( i_Mode, i_bExclusive );
  if ( !Mode.pText )
  {
    return IResult::InvalidArgument;
  }
  auto pCookie = std::make_unique_for_overwrite< VCookie >();
  pCookie->File = OpenFile( i_rPath, Mode.Flags );
  if ( pCookie->File == -1 )
  {
    return ResultOf( -1 );
  }
  o_rpFile = ::fopencookie( pCookie.get(), Mode.pText, { ReadCookie, WriteCookie, SeekCookie, CloseCookie } );
  if ( !o_rpFile )
  {
    const IResult Result = ResultOf( -1 );
    (void)Close( pCookie->File );
    return Result;
  }
  o_rbBuffered = Calls().SetBuffer( o_rpFile, pCookie->Buffer, VCookie::BufferSize ) == 0;
  (void)pCookie.release();
  return IResult::Ok;
}

} // namespace UtilsFileSystem

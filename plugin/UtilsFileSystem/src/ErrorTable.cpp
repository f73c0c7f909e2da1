#include "FileLog.h"

#include <UtilsFileSystem/FileIO.h>

#include <algorithm>
#include <cerrno>
#include <initializer_list>

using namespace ZEK;

namespace UtilsFileSystem
{
namespace
{
struct VRow
{
  IResult::ECode Result;
  std::initializer_list< int > Errnos;
  std::initializer_list< std::uint32_t > SystemErrors;
};

template < typename TError >
IResult Find( TError i_Error, std::initializer_list< TError > VRow::*i_pColumn )
{
  // 1175 to 1177: a replace that stopped part of the way.
  static const std::initializer_list< VRow > Rows{
      { IResult::Ok, { 0 }, { 0 } },
      { IResult::FileNotFound, { ENOENT, ENOTDIR }, { 2, 3, 53 } },
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
      { IResult::Canceled, { ECANCELED }, { 995, 1223 } } };
  for ( const VRow& rRow : Rows )
  {
    if ( std::find( ( rRow.*i_pColumn ).begin(), ( rRow.*i_pColumn ).end(), i_Error ) != ( rRow.*i_pColumn ).end() )
    {
      return rRow.Result;
    }
  }
  Log( FileCategory(), ELogFailure, "Std error code: %1%", i_Error );
  return IResult::Failed;
}
} // namespace

IResult ResultFromErrno( int i_Error )
{
  return Find( i_Error, &VRow::Errnos );
}

IResult ResultFromSystemError( std::uint32_t i_Error )
{
  return Find( i_Error, &VRow::SystemErrors );
}

} // namespace UtilsFileSystem

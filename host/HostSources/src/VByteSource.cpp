#include <HostSources/VByteSource.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

namespace HostSources
{

std::span< const std::byte > VMemorySource::Read( std::uint64_t i_Offset, std::size_t i_Count )
{
  if ( i_Offset >= m_Bytes.size() )
  {
    return {};
  }
  const auto Offset = static_cast< std::size_t >( i_Offset );
  return m_Bytes.subspan( Offset, std::min( i_Count, m_Bytes.size() - Offset ) );
}

VFileSource::~VFileSource()
{
  Close();
}

void VFileSource::Close()
{
  if ( m_File >= 0 )
  {
    close( m_File );
  }
  m_File = -1;
  m_Size = 0;
}

ZEK::IResult VFileSource::Open( const std::filesystem::path& i_rPath, std::string& o_rMessage, const char* i_pExpected )
{
  Close();
  const std::string Name = i_rPath.string();
  const std::string Begin = std::string( Name ).append( ": expected " ).append( i_pExpected ).append( ", found " );
  // A pipe without a writer would make a plain open wait for ever.
  m_File = open( Name.c_str(), O_RDONLY | O_CLOEXEC | O_NONBLOCK );
  if ( m_File < 0 )
  {
    const int Error = errno;
    const bool bMissing = Error == ENOENT || Error == ENOTDIR;
    o_rMessage = Begin + ( bMissing ? "no such file" : std::strerror( Error ) );
    return bMissing ? ZEK::IResult::FileNotFound : ZEK::IResult::FileIOFailure;
  }
  struct stat Status = {};
  if ( fstat( m_File, &Status ) != 0 || !S_ISREG( Status.st_mode ) )
  {
    o_rMessage = Begin + ( S_ISDIR( Status.st_mode ) ? "a folder" : "something that is no plain file" );
    return ZEK::IResult::FileIOFailure;
  }
  m_Size = static_cast< std::uint64_t >( Status.st_size );
  posix_fadvise( m_File, 0, 0, POSIX_FADV_SEQUENTIAL );
  return ZEK::IResult::Ok;
}

std::span< const std::byte > VFileSource::Read( std::uint64_t i_Offset, std::size_t i_Count )
{
  if ( m_File < 0 || i_Offset >= m_Size )
  {
    return {};
  }
  const auto Count = static_cast< std::size_t >( std::min< std::uint64_t >( i_Count, m_Size - i_Offset ) );
  if ( m_Buffer.size() < Count )
  {
    m_Buffer.resize( Count );
  }
  std::size_t Done = 0;
  while ( Done < Count )
  {
    const ssize_t Got = pread( m_File, m_Buffer.data() + Done, Count - Done, static_cast< off_t >( i_Offset + Done ) );
    if ( Got < 0 && errno == EINTR )
    {
      continue;
    }
    if ( Got <= 0 )
    {
      break;
    }
    Done += static_cast< std::size_t >( Got );
  }
  return { m_Buffer.data(), Done };
}

} // namespace HostSources

#include "FileLog.h"
#include "Platform.h"

#include <UtilsFileSystem/FileStreams.h>

#include <streambuf>

using namespace ZEK;

namespace UtilsFileSystem
{
namespace
{
class VMappedBuffer final : public std::streambuf
{
public:
  VMappedBuffer( char* i_pBytes, std::size_t i_Size )
    : m_pBytes( i_pBytes )
    , m_Size( i_Size )
  {
    setg( m_pBytes, m_pBytes, m_pBytes + m_Size );
  }
  ~VMappedBuffer() override { Platform::UnmapFile( m_pBytes, m_Size ); }

private:
  pos_type seekoff( off_type i_Offset, std::ios_base::seekdir i_From, std::ios_base::openmode ) override
  {
    const off_type Base = i_From == std::ios_base::beg   ? 0
                          : i_From == std::ios_base::end ? static_cast< off_type >( m_Size )
                                                         : gptr() - eback();
    const off_type Size = static_cast< off_type >( m_Size );
    if ( i_Offset < -Base || i_Offset > Size - Base )
    {
      return pos_type( off_type( -1 ) );
    }
    setg( m_pBytes, m_pBytes + Base + i_Offset, m_pBytes + m_Size );
    return pos_type( Base + i_Offset );
  }
  pos_type seekpos( pos_type i_Position, std::ios_base::openmode i_Mode ) override
  {
    return seekoff( off_type( i_Position ), std::ios_base::beg, i_Mode );
  }

  char* m_pBytes;
  std::size_t m_Size;
};

class VMappedStream final : public std::istream
{
public:
  VMappedStream( char* i_pBytes, std::size_t i_Size )
    : std::istream( nullptr )
    , m_Buffer( i_pBytes, i_Size )
  {
    rdbuf( &m_Buffer );
  }

private:
  VMappedBuffer m_Buffer;
};
} // namespace

IResult OpenMappedInputFileStream( const std::string& i_rPath, std::unique_ptr< std::istream >& o_rpStream )
{
  o_rpStream.reset();
  char* pBytes = nullptr;
  std::size_t Size = 0;
  const IResult Mapped = Platform::MapFile( i_rPath, pBytes, Size );
  if ( Mapped.IsOk() )
  {
    o_rpStream = std::make_unique< VMappedStream >( pBytes, Size );
    return Mapped;
  }
  if ( Mapped == IResult::FileNotFound )
  {
    return Mapped;
  }
  Log( FileCategory(), ELogWarning,
       "Failed to open memory mapped input file stream %1% (%2%), falling back to a standard input file stream.",
       i_rPath, Mapped.Text() );
  std::unique_ptr< VFileInputStream > pStream;
  const IResult Result = OpenInputFileStream( i_rPath, pStream );
  o_rpStream = std::move( pStream );
  return Result;
}

} // namespace UtilsFileSystem

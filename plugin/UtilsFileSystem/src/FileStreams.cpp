#include "FileBuffer.h"
#include "FileLog.h"

#include <UtilsFileSystem/FileStreams.h>

#include <algorithm>
#include <cstring>

using namespace ZEK;

namespace UtilsFileSystem
{

IResult VFileBuffer::Open( const std::string& i_rPath, Platform::EOpenFor i_For )
{
  const IResult Result = m_File.Open( i_rPath, i_For );
  if ( Result.IsOk() )
  {
    m_Path = i_rPath;
    m_Bytes.resize( BufferSize );
    m_bWrites = i_For != Platform::EOpenToRead;
    if ( m_bWrites )
    {
      setp( m_Bytes.data(), m_Bytes.data() + m_Bytes.size() );
    }
  }
  return Result;
}

IResult VFileBuffer::Close()
{
  if ( m_File.IsOpen() )
  {
    Flush();
    Keep( m_File.Close() );
    setp( nullptr, nullptr );
    setg( nullptr, nullptr, nullptr );
  }
  return m_First;
}

bool VFileBuffer::Keep( IResult i_Result )
{
  if ( i_Result.IsError() && m_First.IsOk() )
  {
    m_First = i_Result;
  }
  return i_Result.IsOk();
}

bool VFileBuffer::Flush()
{
  const std::size_t Size = static_cast< std::size_t >( pptr() - pbase() );
  if ( m_First.IsOk() && Size > 0 )
  {
    Keep( m_File.Write( pbase(), Size ) );
  }
  if ( m_bWrites && m_File.IsOpen() )
  {
    setp( m_Bytes.data(), m_Bytes.data() + m_Bytes.size() );
  }
  // After an error nothing more is written: what followed would land in the wrong place.
  return m_First.IsOk();
}

int VFileBuffer::sync()
{
  return Flush() ? 0 : -1;
}

VFileBuffer::int_type VFileBuffer::overflow( int_type i_Character )
{
  if ( !m_bWrites || !m_File.IsOpen() || !Flush() )
  {
    return traits_type::eof();
  }
  if ( !traits_type::eq_int_type( i_Character, traits_type::eof() ) )
  {
    *pptr() = traits_type::to_char_type( i_Character );
    pbump( 1 );
  }
  return traits_type::not_eof( i_Character );
}

std::streamsize VFileBuffer::xsputn( const char* i_pBytes, std::streamsize i_Size )
{
  if ( !m_bWrites || !m_File.IsOpen() || m_First.IsError() )
  {
    return 0;
  }
  if ( i_Size <= epptr() - pptr() )
  {
    std::memcpy( pptr(), i_pBytes, static_cast< std::size_t >( i_Size ) );
    pbump( static_cast< int >( i_Size ) );
    return i_Size;
  }
  if ( !Flush() )
  {
    return 0;
  }
  if ( i_Size >= static_cast< std::streamsize >( BufferSize ) )
  {
    return Keep( m_File.Write( i_pBytes, static_cast< std::size_t >( i_Size ) ) ) ? i_Size : 0;
  }
  return xsputn( i_pBytes, i_Size );
}

VFileBuffer::int_type VFileBuffer::underflow()
{
  if ( gptr() < egptr() )
  {
    return traits_type::to_int_type( *gptr() );
  }
  std::size_t Got = 0;
  if ( m_bWrites || !m_File.IsOpen() || m_First.IsError() )
  {
    return traits_type::eof();
  }
  if ( !Keep( m_File.Read( m_Bytes.data(), m_Bytes.size(), Got ) ) )
  {
    // The end of the bytes is not the end of the file: the stream must tell them apart.
    m_rOwner.setstate( std::ios_base::badbit );
    return traits_type::eof();
  }
  setg( m_Bytes.data(), m_Bytes.data(), m_Bytes.data() + Got );
  return Got == 0 ? traits_type::eof() : traits_type::to_int_type( *gptr() );
}

VFileBuffer::pos_type VFileBuffer::seekoff( off_type i_Offset, std::ios_base::seekdir i_From, std::ios_base::openmode )
{
  if ( !m_File.IsOpen() || !Flush() )
  {
    return pos_type( off_type( -1 ) );
  }
  int From = i_From == std::ios_base::beg ? SEEK_SET : i_From == std::ios_base::end ? SEEK_END : SEEK_CUR;
  const off_type Unread = egptr() - gptr();
  std::int64_t Position = 0;
  if ( From == SEEK_CUR && i_Offset == 0 )
  {
    return m_File.Seek( 0, SEEK_CUR, Position ).IsOk() ? pos_type( Position - Unread ) : pos_type( off_type( -1 ) );
  }
  if ( m_File.Seek( From == SEEK_CUR ? i_Offset - Unread : i_Offset, From, Position ).IsError() )
  {
    return pos_type( off_type( -1 ) );
  }
  setg( nullptr, nullptr, nullptr );
  return pos_type( Position );
}

VFileBuffer::pos_type VFileBuffer::seekpos( pos_type i_Position, std::ios_base::openmode i_Mode )
{
  return seekoff( off_type( i_Position ), std::ios_base::beg, i_Mode );
}

VFileInputStream::VFileInputStream()
  : std::istream( nullptr )
  , m_pBuffer( std::make_unique< VFileBuffer >( *this ) )
{
  rdbuf( m_pBuffer.get() );
}

VFileInputStream::~VFileInputStream() = default;

IResult VFileInputStream::Result() const
{
  return m_pBuffer->First();
}

VFileOutputStream::VFileOutputStream()
  : std::ostream( nullptr )
  , m_pBuffer( std::make_unique< VFileBuffer >( *this ) )
{
  rdbuf( m_pBuffer.get() );
}

VFileOutputStream::~VFileOutputStream()
{
  if ( m_pBuffer->IsOpen() )
  {
    if ( const IResult Result = m_pBuffer->Close(); Result.IsError() )
    {
      Log( FileCategory(), ELogFailure, "Failed to write output file stream %1%: %2%", m_pBuffer->Path(),
           Result.Text() );
    }
  }
}

IResult VFileOutputStream::Close()
{
  const IResult Result = m_pBuffer->Close();
  if ( Result.IsError() )
  {
    setstate( std::ios_base::badbit );
  }
  return Result;
}

namespace
{
template < typename TStream >
IResult OpenStream( const std::string& i_rPath, Platform::EOpenFor i_For, const char* i_pLocked, const char* i_pPlain,
                    std::unique_ptr< VFileBuffer > TStream::*i_pBuffer, std::unique_ptr< TStream >& o_rpStream )
{
  o_rpStream.reset();
  auto pStream = std::make_unique< TStream >();
  const IResult Result = ( ( *pStream ).*i_pBuffer )->Open( i_rPath, i_For );
  if ( Result.IsOk() )
  {
    o_rpStream = std::move( pStream );
  }
  else if ( Result == IResult::NotPermitted )
  {
    LogFailure( i_rPath, Result, i_pLocked, i_pPlain );
  }
  return Result;
}
} // namespace

IResult OpenInputFileStream( const std::string& i_rPath, std::unique_ptr< VFileInputStream >& o_rpStream )
{
  return OpenStream( i_rPath, Platform::EOpenToRead, "Failed to open input file stream %1% locked by processes '%2%'.",
                     "Failed to open input file stream %1%: %2%", &VFileInputStream::m_pBuffer, o_rpStream );
}

IResult OpenOutputFileStreamChecked( const std::string& i_rPath, bool i_bOverwrite,
                                     std::unique_ptr< VFileOutputStream >& o_rpStream )
{
  return OpenStream( i_rPath, i_bOverwrite ? Platform::EOpenToWrite : Platform::EOpenToCreate,
                     "Failed to open output file stream %1% locked by processes '%2%'.",
                     "Failed to open output file stream %1%: %2%", &VFileOutputStream::m_pBuffer, o_rpStream );
}

IResult OpenOutputFileStream( const std::string& i_rPath, std::unique_ptr< VFileOutputStream >& o_rpStream )
{
  return OpenOutputFileStreamChecked( i_rPath, true, o_rpStream );
}

} // namespace UtilsFileSystem

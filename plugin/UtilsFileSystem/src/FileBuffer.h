#pragma once

#include "Platform.h"

#include <ios>
#include <streambuf>
#include <string>
#include <vector>

namespace UtilsFileSystem
{

/// The bytes between a stream object and its file: to read or to write, never both.
class VFileBuffer final : public std::streambuf
{
public:
  static constexpr std::size_t BufferSize = 65536;

  explicit VFileBuffer( std::ios& i_rOwner )
    : m_rOwner( i_rOwner )
  {
  }

  ZEK::IResult Open( const std::string& i_rPath, Platform::EOpenFor i_For );
  bool IsOpen() const { return m_File.IsOpen(); }
  const std::string& Path() const { return m_Path; }
  /// The first error since the file was opened.
  ZEK::IResult First() const { return m_First; }
  /// Gives the first error, that of closing included.
  ZEK::IResult Close();

private:
  int sync() override;
  int_type overflow( int_type i_Character ) override;
  std::streamsize xsputn( const char* i_pBytes, std::streamsize i_Size ) override;
  int_type underflow() override;
  pos_type seekoff( off_type i_Offset, std::ios_base::seekdir i_From, std::ios_base::openmode i_Mode ) override;
  pos_type seekpos( pos_type i_Position, std::ios_base::openmode i_Mode ) override;

  bool Keep( ZEK::IResult i_Result );
  bool Flush();

  std::ios& m_rOwner;
  Platform::VHandle m_File;
  std::string m_Path;
  std::vector< char > m_Bytes;
  ZEK::IResult m_First;
  bool m_bWrites = false;
};

} // namespace UtilsFileSystem

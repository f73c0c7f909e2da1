#pragma once

#include <ZEK/Result.h>

#include <istream>
#include <memory>
#include <ostream>
#include <string>

namespace UtilsFileSystem
{

class VFileBuffer;

/// A file to read, with a buffer of 64 KiB. Made by `OpenInputFileStream`; without a file it is at its end.
class VFileInputStream : public std::istream
{
public:
  VFileInputStream();
  ~VFileInputStream() override;

  /// The first error of reading. The stream itself is bad then, so that a cut is not taken for the end.
  ZEK::IResult Result() const;

private:
  friend ZEK::IResult OpenInputFileStream( const std::string&, std::unique_ptr< VFileInputStream >& );
  std::unique_ptr< VFileBuffer > m_pBuffer;
};

/// A file to write, with a buffer of 64 KiB. Made by `OpenOutputFileStream`.
class VFileOutputStream : public std::ostream
{
public:
  VFileOutputStream();
  /// Closes; an error that nobody has asked for is logged.
  ~VFileOutputStream() override;

  /// Writes what is left and closes. Gives the first error since the file was opened: only its `Ok` says that the
  /// file is whole. A second call gives the same result.
  ZEK::IResult Close();

private:
  friend ZEK::IResult OpenOutputFileStream( const std::string&, std::unique_ptr< VFileOutputStream >& );
  friend ZEK::IResult OpenOutputFileStreamChecked( const std::string&, bool, std::unique_ptr< VFileOutputStream >& );
  std::unique_ptr< VFileBuffer > m_pBuffer;
};

/// All of these leave the pointer empty on a failure.
ZEK::IResult OpenInputFileStream( const std::string& i_rPath, std::unique_ptr< VFileInputStream >& o_rpStream );
/// Reads a regular file of less than 2 GiB straight from its pages; anything else through a standard stream, after
/// a warning. For files that are replaced, not overwritten: one that shrinks while it is read ends the process.
ZEK::IResult OpenMappedInputFileStream( const std::string& i_rPath, std::unique_ptr< std::istream >& o_rpStream );
/// Truncates an existing file.
ZEK::IResult OpenOutputFileStream( const std::string& i_rPath, std::unique_ptr< VFileOutputStream >& o_rpStream );
/// Without `i_bOverwrite` an existing file gives `AlreadyPresent`.
ZEK::IResult OpenOutputFileStreamChecked( const std::string& i_rPath, bool i_bOverwrite,
                                          std::unique_ptr< VFileOutputStream >& o_rpStream );

} // namespace UtilsFileSystem

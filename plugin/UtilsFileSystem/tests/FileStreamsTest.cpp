#include "SaveFolder.h"
#include "TracedCalls.h"

#include <TestSupport/LogGuard.h>
#include <UtilsFileSystem/FileIO.h>
#include <UtilsFileSystem/FileStreams.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <cerrno>
#include <iterator>

using namespace UtilsFileSystem;
using namespace UtilsFileSystemTests;
using namespace ZEK;

namespace
{
using Texts = std::vector< std::string >;

class VFileStreams : public testing::Test
{
protected:
  ~VFileStreams() override { SetLockerLister( {} ); }

  std::string Path( const std::string& i_rEnding ) const { return m_Folder.Target() + i_rEnding; }

  VSaveFolder m_Folder;
};

std::string Numbers()
{
  std::string Text;
  for ( int Number = 0; Number < 40000; ++Number )
  {
    Text.append( std::to_string( Number ) ).append( Number % 9 == 0 ? "\n" : " " );
  }
  return Text;
}

std::string All( std::istream& io_rStream )
{
  return std::string( std::istreambuf_iterator< char >( io_rStream ), {} );
}

int Interrupt( const VCall& i_rCall, int i_Number )
{
  const Texts Calls{ "open", "create", "read", "write", "sync", "lock", "copyrange" };
  return i_Number % 2 == 1 && std::find( Calls.begin(), Calls.end(), i_rCall.Name ) != Calls.end() ? EINTR : 0;
}
} // namespace

TEST_F( VFileStreams, WhatIsWrittenIsReadInEveryForm )
{
  const std::string Text = Numbers();
  // Signals come in between, and writes are short.
  VTracedCalls Calls( Interrupt );
  Calls.m_MostBytesAWrite = 30000;
  for ( const std::size_t Piece : { std::size_t( 1 ), std::size_t( 1000 ), std::size_t( 65536 ), Text.size() } )
  {
    std::unique_ptr< VFileOutputStream > pOut;
    ASSERT_EQ( OpenOutputFileStream( Path( "" ), pOut ), IResult::Ok );
    for ( std::size_t At = 0; At < Text.size(); At += Piece )
    {
      pOut->write( Text.data() + At, static_cast< std::streamsize >( std::min( Piece, Text.size() - At ) ) );
    }
    EXPECT_EQ( pOut->tellp(), std::streampos( static_cast< std::streamoff >( Text.size() ) ) );
    EXPECT_EQ( pOut->Close(), IResult::Ok );
    EXPECT_FALSE( pOut->put( 'x' ) ) << "written after the end";
    EXPECT_EQ( m_Folder.Get( "" ), Text );
  }
  std::unique_ptr< VFileInputStream > pIn;
  std::unique_ptr< std::istream > pMapped;
  ASSERT_EQ( OpenInputFileStream( Path( "" ), pIn ), IResult::Ok );
  ASSERT_EQ( OpenMappedInputFileStream( Path( "" ), pMapped ), IResult::Ok );
  for ( std::istream* const pStream : { static_cast< std::istream* >( pIn.get() ), pMapped.get() } )
  {
    EXPECT_EQ( All( *pStream ), Text );
    pStream->clear();
    EXPECT_EQ( pStream->tellg(), std::streampos( static_cast< std::streamoff >( Text.size() ) ) );
    int Number = 0;
    std::string Word;
    // "0\n" is followed by "1 2 3 …".
    pStream->seekg( 2 );
    EXPECT_TRUE( *pStream >> Number && Number == 1 );
    pStream->seekg( 3, std::ios::cur );
    EXPECT_TRUE( *pStream >> Number && Number == 3 );
    EXPECT_EQ( pStream->tellg(), std::streampos( 7 ) );
    pStream->seekg( -6, std::ios::end );
    EXPECT_TRUE( *pStream >> Word && Word == Text.substr( Text.size() - 6, 5 ) );
    pStream->clear();
    EXPECT_FALSE( pStream->seekg( -1 ) );
  }
  EXPECT_EQ( pIn->Result(), IResult::Ok );
  std::FILE* pFile = nullptr;
  ASSERT_EQ( OpenOutputFile( Path( "" ), "r+b", pFile ), IResult::Ok );
  EXPECT_EQ( std::fseek( pFile, 2, SEEK_SET ), 0 );
  EXPECT_EQ( std::fputs( "x", pFile ), 1 );
  EXPECT_EQ( std::fclose( pFile ), 0 );
  ASSERT_EQ( OpenOutputFile( Path( "" ), "a", pFile ), IResult::Ok );
  EXPECT_GE( std::fputs( "end", pFile ), 0 );
  EXPECT_EQ( std::fclose( pFile ), 0 );
  ASSERT_EQ( OpenInputFile( Path( "" ), "rb", pFile ), IResult::Ok );
  std::string Read( Text.size() + 100, '?' );
  Read.resize( std::fread( Read.data(), 1, Read.size(), pFile ) );
  EXPECT_EQ( std::fclose( pFile ), 0 );
  std::string Expected = Text + "end";
  Expected[2] = 'x';
  EXPECT_EQ( Read, Expected );
}

TEST_F( VFileStreams, TheFirstErrorStays )
{
  const VTracedCalls Calls(
      [Left = 2]( const VCall& i_rCall, int ) mutable
      {
        return i_rCall.Name == "write" && --Left == 0 ? ENOSPC : 0;
      } );
  const std::string Text = Numbers();
  std::unique_ptr< VFileOutputStream > pOut;
  ASSERT_EQ( OpenOutputFileStream( Path( "" ), pOut ), IResult::Ok );
  for ( std::size_t At = 0; At + 1000 < Text.size(); At += 1000 )
  {
    pOut->write( Text.data() + At, 1000 );
  }
  EXPECT_FALSE( *pOut );
  EXPECT_EQ( pOut->Close(), IResult::DiskFull );
  EXPECT_EQ( pOut->Close(), IResult::DiskFull );
  EXPECT_EQ( m_Folder.Get( "" )->size(), 65000u ) << "went on behind a hole";
  // A device that is always full: the flush fails, and the closing after it must not hide that.
  std::FILE* pFile = nullptr;
  ASSERT_EQ( OpenOutputFile( "/dev/full", "w", pFile ), IResult::Ok );
  EXPECT_GE( std::fputs( "x", pFile ), 0 );
  EXPECT_NE( std::fflush( pFile ), 0 );
  EXPECT_NE( std::fclose( pFile ), 0 );
  TestSupport::ExpectFailureLine( "Failed to write output file stream /dev/full: " +
                                  IResult( IResult::DiskFull ).Text() );
  {
    ASSERT_EQ( OpenOutputFileStream( "/dev/full", pOut ), IResult::Ok );
    *pOut << "nobody asks";
    pOut.reset();
  }
  EXPECT_EQ( TestSupport::LogTexts( "UtilsFileSystem", 2 ).size(), 1u );
}

TEST_F( VFileStreams, AnErrorOfReadingIsNotTheEnd )
{
  m_Folder.Put( "", Numbers() );
  const VTracedCalls Calls(
      [Left = 3]( const VCall& i_rCall, int ) mutable
      {
        return i_rCall.Name == "read" && --Left <= 0 ? EIO : 0;
      } );
  std::unique_ptr< VFileInputStream > pIn;
  ASSERT_EQ( OpenInputFileStream( Path( "" ), pIn ), IResult::Ok );
  EXPECT_EQ( All( *pIn ).size(), 131072u );
  EXPECT_TRUE( pIn->bad() );
  EXPECT_EQ( pIn->Result(), IResult::FileIOFailure );
}

TEST_F( VFileStreams, EveryWayToFailAtOpening )
{
  std::FILE* pFile = nullptr;
  std::unique_ptr< VFileInputStream > pIn;
  std::unique_ptr< VFileOutputStream > pOut;
  std::unique_ptr< std::istream > pMapped;
  EXPECT_EQ( OpenInputFile( Path( "" ), "r", pFile ), IResult::FileNotFound );
  EXPECT_EQ( OpenInputFileStream( Path( "" ), pIn ), IResult::FileNotFound );
  EXPECT_EQ( OpenMappedInputFileStream( Path( "" ), pMapped ), IResult::FileNotFound );
  EXPECT_EQ( OpenOutputFileStream( Path( "" ) + "/in", pOut ), IResult::FileNotFound );
  for ( const char* const pMode : { "", "q", "w?", "br" } )
  {
    EXPECT_EQ( OpenOutputFile( Path( "" ), pMode, pFile ), IResult::InvalidArgument ) << pMode;
  }
  EXPECT_EQ( OpenOutputFile( Path( "" ), nullptr, pFile ), IResult::InvalidArgument );
  // Empty is not missing.
  ASSERT_EQ( OpenOutputFileChecked( Path( "" ), "w", false, pFile ), IResult::Ok );
  EXPECT_EQ( std::fclose( pFile ), 0 );
  EXPECT_EQ( OpenMappedInputFileStream( Path( "" ), pMapped ), IResult::Ok );
  EXPECT_EQ( All( *pMapped ), "" );
  EXPECT_EQ( TestSupport::LogTexts( "UtilsFileSystem", 3 ), Texts{} );
  EXPECT_EQ( OpenOutputFileChecked( Path( "" ), "w", false, pFile ), IResult::AlreadyPresent );
  EXPECT_EQ( OpenOutputFileStreamChecked( Path( "" ), false, pOut ), IResult::AlreadyPresent );
  EXPECT_FALSE( pFile || pOut );

  VTracedCalls Calls(
      []( const VCall& i_rCall, int )
      {
        return i_rCall.Name == "open" || i_rCall.Name == "create" ? EACCES : 0;
      } );
  const std::string Denied = IResult( IResult::NotPermitted ).Text();
  Texts Expected;
  for ( const bool bNames : { true, false } )
  {
    SetLockerLister(
        [=]( const std::string& )
        {
          return bNames ? Texts{ "/a", "/b" } : Texts{};
        } );
    for ( const char* const pKind : { "input file ", "output file ", "input file stream ", "output file stream " } )
    {
      Expected.push_back( std::string( "Failed to open " )
                              .append( pKind )
                              .append( Path( "" ) )
                              .append( bNames ? " locked by processes '/a', '/b'." : ": " + Denied ) );
      TestSupport::ExpectFailureLine( Expected.back() );
    }
    EXPECT_EQ( OpenInputFile( Path( "" ), "r", pFile ), IResult::NotPermitted );
    EXPECT_EQ( OpenOutputFile( Path( "" ), "w", pFile ), IResult::NotPermitted );
    EXPECT_EQ( OpenInputFileStream( Path( "" ), pIn ), IResult::NotPermitted );
    EXPECT_EQ( OpenOutputFileStream( Path( "" ), pOut ), IResult::NotPermitted );
  }
  EXPECT_EQ( TestSupport::LogTexts( "UtilsFileSystem", 2 ), Expected );
}

TEST_F( VFileStreams, RefusedBuffersAndMapsAreWarningsOnly )
{
  m_Folder.Put( "", "text" );
  VTracedCalls Calls;
  Calls.m_bRefuseBuffer = true;
  std::FILE* pFile = nullptr;
  ASSERT_EQ( OpenInputFile( Path( "" ), "r", pFile ), IResult::Ok );
  EXPECT_EQ( std::fgetc( pFile ), 't' );
  EXPECT_EQ( std::fclose( pFile ), 0 );
  Calls.m_Before = []( const VCall& i_rCall, int )
  {
    return i_rCall.Name == "mmap" ? ENOMEM : 0;
  };
  std::unique_ptr< std::istream > pMapped;
  ASSERT_EQ( OpenMappedInputFileStream( Path( "" ), pMapped ), IResult::Ok );
  EXPECT_EQ( All( *pMapped ), "text" );
  // What has no size to map: a device.
  ASSERT_EQ( OpenMappedInputFileStream( "/dev/null", pMapped ), IResult::Ok );
  EXPECT_EQ( All( *pMapped ), "" );
  const auto Warning = []( const std::string& i_rPath, IResult i_Result )
  {
    return "Failed to open memory mapped input file stream " + i_rPath + " (" + i_Result.Text() +
           "), falling back to a standard input file stream.";
  };
  EXPECT_EQ(
      TestSupport::LogTexts( "UtilsFileSystem", 3 ),
      ( Texts{ "Failed to enable full buffering for file stream " + Path( "" ) + ".",
               Warning( Path( "" ), IResult::AllocationFailure ), Warning( "/dev/null", IResult::NotSupported ) } ) );
}

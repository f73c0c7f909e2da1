// Opening a long recording: bytes of the file a second. The floor reads the same bytes into memory and does nothing
// with them. Both find the file in the system's cache, so that no disk is measured.

#include <C3dWriter.h>

#include <HostSources/ReadRecording.h>

#include <benchmark/benchmark.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <string>
#include <unistd.h>

namespace
{
using C3dWriter::EForm;

enum EKind : std::int64_t
{
  FloatIntel,
  FloatDec,
  FloatMips,
  IntegerIntel,
  KindCount
};

/// 60 points and 16 channels of ten samples, written once a kind; removed at the end.
class VFiles
{
public:
  VFiles()
  {
    std::string Name = ( std::filesystem::temp_directory_path() / "harrow-bench-XXXXXX" ).string();
    m_Folder = mkdtemp( Name.data() ) ? Name : std::string();
  }
  ~VFiles()
  {
    std::error_code Ignored;
    std::filesystem::remove_all( m_Folder, Ignored );
  }
  std::filesystem::path Path( std::int64_t i_Kind )
  {
    const auto Path = m_Folder / ( std::to_string( i_Kind ) + ".c3d" );
    if ( !std::filesystem::exists( Path ) )
    {
      Save( Path, i_Kind );
    }
    return Path;
  }

private:
  static void Save( const std::filesystem::path& i_rPath, std::int64_t i_Kind )
  {
    C3dWriter::VFile File;
    File.Form = i_Kind == FloatDec ? EForm::Dec : i_Kind == FloatMips ? EForm::Mips : EForm::Intel;
    File.bFloat = i_Kind != IntegerIntel;
    File.Points = 60;
    File.Channels = 16;
    File.PerFrame = 10;
    for ( int Point = 0; Point < 60; ++Point )
    {
      File.Labels.push_back( "MARKER" + std::to_string( Point ) );
    }
    std::vector< double > Frame( 4 * 60 + 160 );
    for ( std::size_t Word = 0; Word < Frame.size(); ++Word )
    {
      Frame[Word] = Word < 240 && Word % 4 == 3 ? 0x0702 : static_cast< double >( Word * 37 % 2000 ) - 500;
    }
    File.Frames.assign( 60000, Frame );
    const auto Bytes = C3dWriter::Write( File );
    std::ofstream( i_rPath, std::ios::binary )
        .write( reinterpret_cast< const char* >( Bytes.data() ), static_cast< std::streamsize >( Bytes.size() ) );
  }

  std::filesystem::path m_Folder;
};

VFiles& Files()
{
  static VFiles Instance;
  return Instance;
}

void SetBytes( benchmark::State& io_rState, const std::filesystem::path& i_rPath )
{
  io_rState.SetBytesProcessed( io_rState.iterations() *
                               static_cast< std::int64_t >( std::filesystem::file_size( i_rPath ) ) );
}

void Open( benchmark::State& io_rState )
{
  const auto Path = Files().Path( io_rState.range( 0 ) );
  for ( auto _ : io_rState )
  {
    HostSources::VRecording Recording;
    std::string Message;
    if ( HostSources::ReadRecording( Path, Recording, Message ) != ZEK::IResult( ZEK::IResult::Ok ) ||
         Recording.FrameCount != 60000 )
    {
      io_rState.SkipWithError( Message.c_str() );
      return;
    }
    benchmark::DoNotOptimize( Recording.Points.data() );
  }
  SetBytes( io_rState, Path );
}

void Read( benchmark::State& io_rState )
{
  const auto Path = Files().Path( io_rState.range( 0 ) );
  const auto Size = static_cast< std::size_t >( std::filesystem::file_size( Path ) );
  for ( auto _ : io_rState )
  {
    const std::unique_ptr< char[] > pBytes( new char[Size] );
    std::FILE* pFile = std::fopen( Path.c_str(), "rb" );
    const std::size_t Got = pFile ? std::fread( pBytes.get(), 1, Size, pFile ) : 0;
    if ( pFile )
    {
      std::fclose( pFile );
    }
    if ( Got != Size )
    {
      io_rState.SkipWithError( "the file could not be read" );
      return;
    }
    benchmark::DoNotOptimize( pBytes.get() );
  }
  SetBytes( io_rState, Path );
}
} // namespace

// 0 Intel float, 1 DEC float, 2 MIPS float, 3 Intel integer.
BENCHMARK( Open )->Name( "c3d/open" )->DenseRange( 0, KindCount - 1 )->Unit( benchmark::kMillisecond );
BENCHMARK( Read )->Name( "c3d/floor/read" )->Arg( FloatIntel )->Arg( IntegerIntel )->Unit( benchmark::kMillisecond );

// From the start of the program to its first picture of a recording, and the memory that took. The floor starts the
// same program on the same file and only describes it: start, libraries and reading, without a view.

#include <C3dWriter.h>

#include <benchmark/benchmark.h>

#include <cmath>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include <fcntl.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

namespace
{

/// A minute of 60 points at 100 Hz, written once; removed at the end.
class VRecordingFile
{
public:
  VRecordingFile()
  {
    std::string Name = ( std::filesystem::temp_directory_path() / "harrow-bench-XXXXXX" ).string();
    m_Folder = mkdtemp( Name.data() ) ? Name : std::string();
    C3dWriter::VFile File;
    File.Points = 60;
    for ( std::size_t Frame = 0; Frame < 6000; ++Frame )
    {
      std::vector< double >& rFrame = File.Frames.emplace_back();
      for ( std::size_t Point = 0; Point < File.Points; ++Point )
      {
        const double Angle = 0.01 * static_cast< double >( Frame ) + 0.1 * static_cast< double >( Point );
        rFrame.insert( rFrame.end(),
                       { 1500 * std::cos( Angle ), 1500 * std::sin( Angle ), 25.0 * double( Point ), 0 } );
      }
    }
    const std::vector< std::byte > Bytes = C3dWriter::Write( File );
    std::ofstream( Path(), std::ios::binary )
        .write( reinterpret_cast< const char* >( Bytes.data() ), static_cast< std::streamsize >( Bytes.size() ) );
  }
  ~VRecordingFile()
  {
    std::error_code Ignored;
    std::filesystem::remove_all( m_Folder, Ignored );
  }
  std::string Path() const { return ( m_Folder / "minute.c3d" ).string(); }
  std::string Picture() const { return ( m_Folder / "picture.png" ).string(); }

private:
  std::filesystem::path m_Folder;
};

VRecordingFile& File()
{
  static VRecordingFile The;
  return The;
}

/// Runs the program to its end; false when it failed. `o_rPeakMb` is its greatest resident size.
bool Execute( const std::vector< std::string >& i_rArguments, double& o_rPeakMb )
{
  const pid_t Child = fork();
  if ( Child == 0 )
  {
    const int Null = open( "/dev/null", O_WRONLY );
    dup2( Null, STDOUT_FILENO );
    std::vector< char* > Arguments{ const_cast< char* >( HARROW_PROGRAM ) };
    for ( const std::string& rArgument : i_rArguments )
    {
      Arguments.push_back( const_cast< char* >( rArgument.c_str() ) );
    }
    Arguments.push_back( nullptr );
    execv( HARROW_PROGRAM, Arguments.data() );
    _exit( 127 );
  }
  int Status = 0;
  rusage Usage{};
  wait4( Child, &Status, 0, &Usage );
  o_rPeakMb = static_cast< double >( Usage.ru_maxrss ) / 1024.0;
  return WIFEXITED( Status ) && WEXITSTATUS( Status ) == 0;
}

void Start( benchmark::State& io_rState, const std::vector< std::string >& i_rArguments )
{
  double Peak = 0;
  for ( auto _ : io_rState )
  {
    double PeakMb = 0;
    if ( !Execute( i_rArguments, PeakMb ) )
    {
      io_rState.SkipWithError( "the program failed" );
      break;
    }
    Peak = std::max( Peak, PeakMb );
  }
  io_rState.counters["peak_mb"] = Peak;
}

void FirstPicture( benchmark::State& io_rState )
{
  Start( io_rState, { "render", "--source", File().Path(), "--size", "640x360", "--output", File().Picture() } );
}

void DescribeOnly( benchmark::State& io_rState )
{
  Start( io_rState, { "info", File().Path() } );
}

} // namespace

BENCHMARK( FirstPicture )->Name( "start/first_picture" )->UseRealTime()->Unit( benchmark::kMillisecond );
BENCHMARK( DescribeOnly )->Name( "start/floor/info" )->UseRealTime()->Unit( benchmark::kMillisecond );

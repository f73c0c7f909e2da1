// A protected save of 1 MB over an existing file, and beside it the least that is safe: write, flush, rename, flush
// of the folder. Both wait for the disk under TMPDIR; a file system in memory makes the waiting free.

#include <UtilsFileSystem/FileIO.h>
#include <UtilsFileSystem/ProtectedFileIO.h>

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>
#include <vector>

#include <fcntl.h>
#include <unistd.h>

namespace
{

class VBenchFolder
{
public:
  VBenchFolder()
  {
    std::string Name = ( std::filesystem::temp_directory_path() / "harrow-bench-XXXXXX" ).string();
    m_Path = ::mkdtemp( Name.data() ) ? Name : "";
  }
  ~VBenchFolder()
  {
    std::error_code Ignored;
    std::filesystem::remove_all( m_Path, Ignored );
  }
  VBenchFolder( const VBenchFolder& ) = delete;
  VBenchFolder& operator=( const VBenchFolder& ) = delete;

  const std::string& Path() const { return m_Path; }
  std::string Target() const { return m_Path + "/target.bin"; }

private:
  std::string m_Path;
};

/// Never twice the same bytes.
class VDocument
{
public:
  VDocument()
    : m_Bytes( 1000000 )
  {
    for ( std::size_t Index = 0; Index < m_Bytes.size(); ++Index )
    {
      m_Bytes[Index] = static_cast< char >( static_cast< std::uint32_t >( Index ) * 2654435761u >> 11 );
    }
  }
  const std::vector< char >& Next()
  {
    m_Bytes[++m_Turn % m_Bytes.size()] ^= 1;
    return m_Bytes;
  }

private:
  std::vector< char > m_Bytes;
  std::size_t m_Turn = 0;
};

bool FloorSave( const VBenchFolder& i_rFolder, const std::vector< char >& i_rBytes )
{
  const std::string New = i_rFolder.Target() + ".new";
  const int File = ::open( New.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644 );
  bool bOk = File >= 0;
  for ( std::size_t At = 0; bOk && At < i_rBytes.size(); )
  {
    const ssize_t Written = ::write( File, i_rBytes.data() + At, i_rBytes.size() - At );
    bOk = Written > 0;
    At += static_cast< std::size_t >( Written );
  }
  bOk = bOk && ::fsync( File ) == 0;
  ::close( File );
  bOk = bOk && ::rename( New.c_str(), i_rFolder.Target().c_str() ) == 0;
  const int Folder = ::open( i_rFolder.Path().c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC );
  bOk = bOk && Folder >= 0 && ::fsync( Folder ) == 0;
  ::close( Folder );
  return bOk;
}

bool ProtectedSaveOf( const VBenchFolder& i_rFolder, const std::vector< char >& i_rBytes )
{
  const ZEK::IResult Result = UtilsFileSystem::ProtectedSave(
      [&]( const std::string& i_rPath ) -> ZEK::IResult
      {
        std::FILE* pFile = nullptr;
        const ZEK::IResult Opened = UtilsFileSystem::OpenOutputFile( i_rPath, "wb", pFile );
        if ( Opened.IsError() )
        {
          return Opened;
        }
        const std::size_t Written = std::fwrite( i_rBytes.data(), 1, i_rBytes.size(), pFile );
        return std::fclose( pFile ) == 0 && Written == i_rBytes.size() ? ZEK::IResult::Ok : ZEK::IResult::FileIOFailure;
      },
      i_rFolder.Target(), true );
  return Result == ZEK::IResult::Ok;
}

template < typename TSave >
void Run( benchmark::State& io_rState, TSave i_Save )
{
  const VBenchFolder Folder;
  VDocument Document;
  bool bOk = !Folder.Path().empty() && i_Save( Folder, Document.Next() );
  for ( auto _ : io_rState )
  {
    bOk = bOk && i_Save( Folder, Document.Next() );
  }
  if ( !bOk )
  {
    io_rState.SkipWithError( "a save failed" );
  }
}

void Save( benchmark::State& io_rState )
{
  Run( io_rState, ProtectedSaveOf );
}
BENCHMARK( Save )->Name( "files/save_1mb" )->UseRealTime()->Unit( benchmark::kMillisecond );

void Floor( benchmark::State& io_rState )
{
  Run( io_rState, FloorSave );
}
BENCHMARK( Floor )->Name( "files/floor_save_1mb" )->UseRealTime()->Unit( benchmark::kMillisecond );

} // namespace

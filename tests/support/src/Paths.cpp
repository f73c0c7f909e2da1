#include <TestSupport/Paths.h>

#include <cstdlib>
#include <stdexcept>

namespace TestSupport
{
namespace
{
std::filesystem::path FromEnvironment( const char* i_pName )
{
  const char* pValue = std::getenv( i_pName );
  return pValue ? std::filesystem::path( pValue ) : std::filesystem::path();
}
} // namespace

std::filesystem::path SourceDir()
{
  return FromEnvironment( "HARROW_SOURCE_DIR" );
}

std::filesystem::path BinaryDir()
{
  return FromEnvironment( "HARROW_BINARY_DIR" );
}

std::filesystem::path RecordingsDir()
{
  std::filesystem::path Folder = FromEnvironment( "HARROW_TEST_DATA" );
  if ( Folder.empty() )
  {
    Folder = SourceDir() / ".." / "shared" / "data";
  }
  return std::filesystem::is_directory( Folder ) ? std::filesystem::canonical( Folder ) : std::filesystem::path();
}

VTemporaryDir::VTemporaryDir()
{
  std::string Name = ( std::filesystem::temp_directory_path() / "harrow-test-XXXXXX" ).string();
  if ( !mkdtemp( Name.data() ) )
  {
    throw std::runtime_error( "cannot make a temporary folder" );
  }
  m_Path = Name;
}

VTemporaryDir::~VTemporaryDir()
{
  std::error_code Ignored;
  std::filesystem::remove_all( m_Path, Ignored );
}

} // namespace TestSupport

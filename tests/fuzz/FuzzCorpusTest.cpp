#include <TestSupport/Paths.h>
#include <ZEK/Log.h>

#include <gtest/gtest.h>

#include <cstdint>
#include <fstream>
#include <iterator>
#include <vector>

extern "C" int FuzzC3dOneInput( const std::uint8_t* i_pData, std::size_t i_Size );
extern "C" int FuzzTrcOneInput( const std::uint8_t* i_pData, std::size_t i_Size );
extern "C" int FuzzBvhOneInput( const std::uint8_t* i_pData, std::size_t i_Size );
extern "C" int FuzzMotionOneInput( const std::uint8_t* i_pData, std::size_t i_Size );
extern "C" int FuzzCamerasOneInput( const std::uint8_t* i_pData, std::size_t i_Size );
extern "C" int FuzzSettingsOneInput( const std::uint8_t* i_pData, std::size_t i_Size );
extern "C" int FuzzSchemaOneInput( const std::uint8_t* i_pData, std::size_t i_Size );
extern "C" int FuzzValueOneInput( const std::uint8_t* i_pData, std::size_t i_Size );
extern "C" int FuzzVersionOneInput( const std::uint8_t* i_pData, std::size_t i_Size );

namespace
{
using VEntryPoint = int ( * )( const std::uint8_t*, std::size_t );

/// Each file whole, and each file cut off after every fraction of it: the entry point ends the process on a fault.
std::size_t Replay( const char* i_pFolder, VEntryPoint i_pEntryPoint )
{
  std::size_t Files = 0;
  for ( const auto& rEntry :
        std::filesystem::directory_iterator( TestSupport::SourceDir() / "tests/fuzz/corpus" / i_pFolder ) )
  {
    SCOPED_TRACE( rEntry.path().string() );
    std::ifstream File( rEntry.path(), std::ios::binary );
    const std::vector< char > Text( std::istreambuf_iterator< char >( File ), {} );
    const std::vector< std::uint8_t > Bytes( Text.begin(), Text.end() );
    for ( std::size_t Part = 0; Part <= 16; ++Part )
    {
      // A copy of its own size, so that a read past the end is seen.
      const std::vector< std::uint8_t > Cut(
          Bytes.begin(), Bytes.begin() + static_cast< std::ptrdiff_t >( Bytes.size() * Part / 16 ) );
      EXPECT_EQ( i_pEntryPoint( Cut.data(), Cut.size() ), 0 );
    }
    ++Files;
  }
  return Files;
}
} // namespace

TEST( FuzzCorpus, C3d )
{
  EXPECT_GE( Replay( "c3d", FuzzC3dOneInput ), 10u );
}

TEST( FuzzCorpus, Trc )
{
  EXPECT_GE( Replay( "trc", FuzzTrcOneInput ), 8u );
}

TEST( FuzzCorpus, Bvh )
{
  EXPECT_GE( Replay( "bvh", FuzzBvhOneInput ), 8u );
}

TEST( FuzzCorpus, Motion )
{
  EXPECT_GE( Replay( "motion", FuzzMotionOneInput ), 13u );
}

TEST( FuzzCorpus, Cameras )
{
  EXPECT_GE( Replay( "cameras", FuzzCamerasOneInput ), 10u );
}

TEST( FuzzCorpus, SettingsAndTheTextsInThem )
{
  // Most of these are faulty on purpose.
  ZEK::GlobalLog().SetMaximumLevel( 0 );
  EXPECT_GE( Replay( "settings", FuzzSettingsOneInput ), 10u );
  EXPECT_GE( Replay( "schema", FuzzSchemaOneInput ), 8u );
  EXPECT_GE( Replay( "value", FuzzValueOneInput ), 8u );
  EXPECT_GE( Replay( "version", FuzzVersionOneInput ), 4u );
  ZEK::GlobalLog().SetMaximumLevel( ZEK::ELogDetail );
}

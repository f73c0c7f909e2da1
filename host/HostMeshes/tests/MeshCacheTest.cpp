#include <HostMeshes/ReadMesh.h>
#include <HostMeshes/VMeshCache.h>

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <gtest/gtest.h>

#include <atomic>
#include <fstream>
#include <thread>

namespace HostMeshes
{
namespace
{
using namespace std::chrono_literals;

class VMeshCacheTest : public testing::Test
{
protected:
  VMeshCacheTest()
    : m_Connection( m_pCache->Changed().Connect(
          [this]
          {
            ++m_Changes;
          },
          nullptr ) )
  {
    std::filesystem::create_directories( First / "sub" );
    std::filesystem::create_directories( Second );
  }
  static void Write( const std::filesystem::path& i_rPath, const std::string& i_rText )
  {
    std::ofstream( i_rPath, std::ios::binary ) << i_rText;
  }
  /// A triangle whose first corner tells which it is.
  static void WriteMesh( const std::filesystem::path& i_rPath, int i_Which )
  {
    Write( i_rPath, "v " + std::to_string( i_Which ) + " 0 0\nv 0 9 0\nv 0 0 9\nf 1 2 3\n" );
  }
  /// Which triangle is there; -1 for none.
  int Which( const std::string& i_rName, const char* i_pCategory = "Subject" )
  {
    (void)m_pCache->Request( i_pCategory, i_rName );
    EXPECT_TRUE( m_pCache->WaitUntilRead( 60s ) );
    const auto pMesh = m_pCache->Request( i_pCategory, i_rName );
    return pMesh ? static_cast< int >( pMesh->Surfaces[0].Positions[0][0] ) : -1;
  }
  std::size_t Said( const char* i_pText, int i_Level = ZEK::ELogWarning ) const
  {
    const auto Texts = TestSupport::LogTexts( "Meshes", i_Level );
    return static_cast< std::size_t >( std::count_if( Texts.begin(), Texts.end(),
                                                      [&]( const std::string& i_rText )
                                                      {
                                                        return i_rText.find( i_pText ) != std::string::npos;
                                                      } ) );
  }

  TestSupport::VTemporaryDir m_Folder;
  const std::filesystem::path First = m_Folder.Path() / "first", Second = m_Folder.Path() / "second";
  std::shared_ptr< VMeshCache > m_pCache = std::make_shared< VMeshCache >();
  std::atomic< int > m_Changes{ 0 };
  ZEK::VConnection m_Connection;
};
} // namespace

TEST_F( VMeshCacheTest, AMeshArrivesLateAndTheFirstFolderThatHasItWins )
{
  WriteMesh( Second / "a.obj", 2 );
  m_pCache->SetSearchFolders( "Subject", { First, Second } );
  EXPECT_EQ( m_pCache->Request( "Subject", "a.obj" ), nullptr );
  ASSERT_TRUE( m_pCache->WaitUntilRead( 60s ) );
  EXPECT_EQ( m_Changes, 1 );
  const auto pMesh = m_pCache->Request( "Subject", "a.obj" );
  ASSERT_TRUE( pMesh );
  EXPECT_EQ( pMesh->MillimetresPerUnit, 1 );
  EXPECT_EQ( Which( "a.obj" ), 2 );

  // The same folders change nothing; others do, and what was there stays until then.
  WriteMesh( First / "a.obj", 1 );
  m_pCache->SetSearchFolders( "Subject", { First, Second } );
  EXPECT_EQ( Which( "a.obj" ), 2 );
  m_pCache->SetSearchFolders( "Subject", { First } );
  EXPECT_TRUE( m_pCache->Request( "Subject", "a.obj" ) );
  EXPECT_EQ( Which( "a.obj" ), 1 );
  EXPECT_EQ( m_Changes, 2 );
  // A file is one mesh, in whatever category.
  m_pCache->SetSearchFolders( "Prop", { Second } );
  EXPECT_EQ( Which( "a.obj", "Prop" ), 2 );
  EXPECT_EQ( m_pCache->Request( "Prop", "a.obj" ), pMesh );
  m_pCache->SetSearchFolders( "Subject", {} );
  EXPECT_EQ( Which( "a.obj" ), -1 );
}

TEST_F( VMeshCacheTest, WhatFailedIsSaidOnceAndTriedAgainInOtherFolders )
{
  TestSupport::ExpectFailureLine( "The mesh cannot be read: bad.obj: it holds no triangle that can be drawn" );
  Write( First / "bad.obj", "v 0 0 0\nv 1 0 0\nv 0 1 0\n" );
  m_pCache->SetSearchFolders( "Subject", { First } );
  EXPECT_EQ( Which( "bad.obj" ), -1 );
  EXPECT_EQ( Which( "none.obj" ), -1 );
  WriteMesh( First / "bad.obj", 7 );
  EXPECT_EQ( Which( "bad.obj" ), -1 );
  EXPECT_EQ( Which( "none.obj" ), -1 );
  EXPECT_EQ( Said( "\"none.obj\" is in none of its 1 folders" ), 1u );
  EXPECT_EQ( TestSupport::LogTexts( "Meshes", ZEK::ELogFailure ).size(), 1u );
  EXPECT_EQ( m_Changes, 0 );
  m_pCache->SetSearchFolders( "Subject", { First, Second } );
  EXPECT_EQ( Which( "bad.obj" ), 7 );
  EXPECT_EQ( m_Changes, 1 );
}

TEST_F( VMeshCacheTest, NamesStayInTheirFolders )
{
  WriteMesh( m_Folder.Path() / "out.obj", 3 );
  WriteMesh( First / "sub" / "in.obj", 4 );
  m_pCache->SetSearchFolders( "Subject", { First } );
  EXPECT_EQ( Which( "sub/in.obj" ), 4 );
  for ( const std::string& rName :
        { std::string( "../out.obj" ), std::string( "sub/../../out.obj" ), ( m_Folder.Path() / "out.obj" ).string(),
          std::string( "sub\\..\\..\\out.obj" ), std::string( "sub/in.obj\0", 11 ), std::string( ".." ),
          std::string( "sub" ), std::string() } )
  {
    EXPECT_EQ( Which( rName ), -1 ) << rName;
  }
  EXPECT_TRUE( m_pCache->CanRead( First / "sub" / "in.obj" ) );
  EXPECT_FALSE( m_pCache->CanRead( First / "sub" / "none.obj" ) );
  EXPECT_FALSE( m_pCache->CanRead( First / "sub" ) );
  Write( First / "text.txt", "v 0 0 0" );
  EXPECT_FALSE( m_pCache->CanRead( First / "text.txt" ) );
}

TEST_F( VMeshCacheTest, ABuiltInMeshIsThereAtOnceAndBeforeFiles )
{
  WriteMesh( First / "own.obj", 1 );
  m_pCache->SetSearchFolders( "Subject", { First } );
  EXPECT_EQ( Which( "own.obj" ), 1 );
  const int Changes = m_Changes;
  HarrowPluginInterface::VMeshScene Mesh;
  Mesh.Surfaces.resize( 1 );
  Mesh.Surfaces[0].Positions = { { 5, 0, 0 } };
  m_pCache->AddBuiltIn( "own.obj", std::make_shared< HarrowPluginInterface::VMeshScene >( Mesh ) );
  EXPECT_EQ( Which( "own.obj" ), 5 );
  EXPECT_EQ( Which( "own.obj", "Prop" ), 5 );
  m_pCache->AddBuiltIn( "own.obj", nullptr );
  EXPECT_EQ( Which( "own.obj" ), 1 );
  EXPECT_EQ( m_Changes, Changes + 2 );
}

TEST_F( VMeshCacheTest, TheBoneIsThereFromTheBeginningAndAFileOfItsNameIsReadInItsPlace )
{
  const auto pBone = VMeshCache().Request( "Subject", "tetra_stripe.fbx" );
  ASSERT_TRUE( pBone && pBone->Surfaces.size() == 1 );
  const auto& rBone = pBone->Surfaces[0];
  double Volume = 0;
  for ( std::size_t Index = 0; Index + 2 < rBone.Triangles.size(); Index += 3 )
  {
    const auto &rA = rBone.Positions[rBone.Triangles[Index]], &rNormal = rBone.Normals[rBone.Triangles[Index]];
    const auto &rB = rBone.Positions[rBone.Triangles[Index + 1]], &rC = rBone.Positions[rBone.Triangles[Index + 2]];
    Volume += ( rA[0] * ( rB[1] * rC[2] - rB[2] * rC[1] ) + rA[1] * ( rB[2] * rC[0] - rB[0] * rC[2] ) +
                rA[2] * ( rB[0] * rC[1] - rB[1] * rC[0] ) ) /
              6;
    const double FromAxis = rA[1] * rNormal[1] + rA[2] * rNormal[2] + ( rA[0] - 0.15 ) * rNormal[0];
    EXPECT_GT( FromAxis, 0 ) << "face " << Index / 3;
  }
  EXPECT_NEAR( Volume, 0.14 * 0.14 / 3, 1e-6 ); // closed and a unit long

  const auto Bone = [&]
  {
    EXPECT_TRUE( m_pCache->WaitUntilRead( std::chrono::seconds( 60 ) ) );
    return m_pCache->Request( "Subject", "tetra_stripe.fbx" );
  };
  m_pCache->SetSearchFolders( "Subject", { First } );
  const auto pOwn = Bone();
  EXPECT_TRUE( pOwn && pOwn == Bone() );
  EXPECT_EQ( Said( "tetra_stripe.fbx" ), 0u );
  EXPECT_EQ( m_Changes, 0 );
  // A file is read in its place, and what cannot be read does not take it away.
  TestSupport::ExpectFailureLine( "The mesh cannot be read: tetra_stripe.fbx: FBX-Parser unexpected end of file" );
  Write( Second / "tetra_stripe.fbx", "nothing" );
  m_pCache->SetSearchFolders( "Subject", { Second } );
  EXPECT_EQ( Bone(), pOwn );
  EXPECT_EQ( TestSupport::LogTexts( "Meshes", ZEK::ELogFailure ).size(), 1u );
}

TEST_F( VMeshCacheTest, ManyThreadsAskWhileFoldersChangeAndTheCacheGoesInTheMiddleOfIt )
{
  for ( int Mesh = 0; Mesh < 40; ++Mesh )
  {
    WriteMesh( First / ( std::to_string( Mesh ) + ".obj" ), Mesh );
    WriteMesh( Second / ( std::to_string( Mesh ) + ".obj" ), 100 + Mesh );
  }
  m_pCache->SetSearchFolders( "Subject", { First } );
  std::vector< std::thread > Threads;
  std::atomic< int > Wrong{ 0 };
  for ( int Thread = 0; Thread < 3; ++Thread )
  {
    Threads.emplace_back(
        [&]
        {
          for ( int Turn = 0; Turn < 2000; ++Turn )
          {
            const auto pMesh = m_pCache->Request( "Subject", std::to_string( Turn % 40 ) + ".obj" );
            const int Found = pMesh ? static_cast< int >( pMesh->Surfaces[0].Positions[0][0] ) % 100 : Turn % 40;
            Wrong += Found == Turn % 40 ? 0 : 1;
          }
        } );
  }
  for ( int Turn = 0; Turn < 20; ++Turn )
  {
    m_pCache->SetSearchFolders( "Subject", { Turn % 2 == 0 ? Second : First } );
    std::this_thread::sleep_for( 1ms );
  }
  for ( std::thread& rThread : Threads )
  {
    rThread.join();
  }
  EXPECT_EQ( Wrong, 0 );
  EXPECT_EQ( Which( "39.obj" ), 39 );
  m_pCache->SetSearchFolders( "Subject", { Second } );
  m_pCache.reset();
}

} // namespace HostMeshes

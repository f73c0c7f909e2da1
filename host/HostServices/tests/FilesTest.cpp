#include <HostServices/VPaths.h>
#include <HostServices/VPreferencesFile.h>
#include <HostServices/VStateJson.h>

#include <TestSupport/LogGuard.h>
#include <TestSupport/Paths.h>

#include <gtest/gtest.h>

#include <QtCore/QJsonDocument>

#include <fstream>
#include <limits>

using HostServices::VPaths;
using HostServices::VPreferencesFile;

namespace
{
std::string Read( const std::filesystem::path& i_rPath )
{
  std::ifstream File( i_rPath, std::ios::binary );
  return { std::istreambuf_iterator< char >( File ), {} };
}

void Write( const std::filesystem::path& i_rPath, const std::string& i_rText )
{
  std::ofstream( i_rPath, std::ios::binary ) << i_rText;
}

std::vector< std::filesystem::path > FilesIn( const std::filesystem::path& i_rFolder )
{
  return { std::filesystem::directory_iterator( i_rFolder ), {} };
}
} // namespace

TEST( Preferences, ComeBackAsTheyWereWritten )
{
  const TestSupport::VTemporaryDir Folder;
  const auto Path = Folder.Path() / "deep" / "er" / "preferences.json";
  const QByteArray Geometry( "\x00\xff\x01raw", 6 );
  {
    VPreferencesFile File( Path );
    EXPECT_EQ( File.Save(), ZEK::IResult::OkButNoEffect );
    EXPECT_FALSE( std::filesystem::exists( Path ) );
    for ( int Number = 0; Number < 20; ++Number )
    {
      File.AddRecentFile( QStringLiteral( "/data/walk ü %1.c3d" ).arg( Number ) );
    }
    File.AddRecentFile( QStringLiteral( "/data/./walk ü 15.c3d" ) );
    File.SetGeometry( QStringLiteral( "Main" ), Geometry );
    File.SetLayout( QStringLiteral( "Two views" ), { { "Windows", 2 } } );
    File.SetLayout( QStringLiteral( "Gone" ), { { "Windows", 1 } } );
    File.SetLayout( QStringLiteral( "Gone" ), {} );
    File.SetValue( QStringLiteral( "Up" ), QStringLiteral( "z" ) );
    ASSERT_EQ( File.Save(), ZEK::IResult::Ok );
    EXPECT_EQ( File.Save(), ZEK::IResult::OkButNoEffect );
  }
  VPreferencesFile File( Path );
  const QStringList Recent = File.RecentFiles();
  ASSERT_EQ( Recent.size(), VPreferencesFile::MaximumRecentFiles );
  EXPECT_EQ( Recent[0], QStringLiteral( "/data/walk ü 15.c3d" ) );
  EXPECT_EQ( Recent[1], QStringLiteral( "/data/walk ü 19.c3d" ) );
  EXPECT_EQ( Recent.count( Recent[0] ), 1 );
  EXPECT_EQ( File.Geometry( QStringLiteral( "Main" ) ), Geometry );
  EXPECT_EQ( File.LayoutNames(), QStringList( "Two views" ) );
  EXPECT_EQ( File.Value( QStringLiteral( "Up" ) ).toString(), QStringLiteral( "z" ) );
  File.RemoveRecentFile( Recent[0] );
  EXPECT_EQ( File.RecentFiles().value( 0 ), Recent[1] );
  EXPECT_EQ( FilesIn( Path.parent_path() ).size(), 1u ) << "no temporary file is left";
}

TEST( Preferences, ADamagedFileIsSetAsideWhole )
{
  const std::string Damaged[] = { "{ \"RecentFiles\": [ \"/a\" ", "", "[ 1, 2 ]", std::string( "\0\0\0\0", 4 ) };
  for ( const std::string& rText : Damaged )
  {
    SCOPED_TRACE( rText );
    const TestSupport::VTemporaryDir Folder;
    const auto Path = Folder.Path() / "preferences.json";
    Write( Path, rText );
    const auto LinesBefore = TestSupport::LogTexts( "Preferences", ZEK::ELogWarning ).size();
    VPreferencesFile File( Path );
    EXPECT_EQ( TestSupport::LogTexts( "Preferences", ZEK::ELogWarning ).size(), LinesBefore + 1 );
    EXPECT_TRUE( File.RecentFiles().isEmpty() );
    const auto Files = FilesIn( Folder.Path() );
    ASSERT_EQ( Files.size(), 1u );
    EXPECT_EQ( Files[0].filename().string().rfind( "preferences.damaged-", 0 ), 0u ) << Files[0];
    EXPECT_EQ( Files[0].extension(), ".json" );
    EXPECT_EQ( Read( Files[0] ), rText );
    File.AddRecentFile( QStringLiteral( "/b" ) );
    EXPECT_EQ( File.Save(), ZEK::IResult::Ok );
    // Damaged once more within the same second: neither copy may replace the other.
    Write( Path, "broken" );
    const VPreferencesFile Again( Path );
    EXPECT_EQ( FilesIn( Folder.Path() ).size(), 2u );
  }
}

TEST( Preferences, EntriesOfAnotherTypeCountAsMissing )
{
  const TestSupport::VTemporaryDir Folder;
  const auto Path = Folder.Path() / "preferences.json";
  Write( Path, R"({ "RecentFiles": [ 1, "/a", "/a", "", null ], "Geometry": [], "Layouts": { "L": 7 }, "Later": 1 })" );
  VPreferencesFile File( Path );
  EXPECT_EQ( File.RecentFiles(), QStringList( "/a" ) );
  EXPECT_TRUE( File.Geometry( QStringLiteral( "Main" ) ).isEmpty() );
  EXPECT_TRUE( File.Layout( QStringLiteral( "L" ) ).isEmpty() );
  File.SetGeometry( QStringLiteral( "Main" ), "abc" );
  ASSERT_TRUE( File.Save().IsOk() );
  EXPECT_NE( Read( Path ).find( "\"Later\"" ), std::string::npos ) << "what this version does not know is kept";
}

TEST( Preferences, WhatCannotBeReadOrWrittenIsReportedAndLeftAlone )
{
  const TestSupport::VTemporaryDir Folder;
  // A folder stands in the file's place; unlike permissions this also stops an administrator.
  const auto Path = Folder.Path() / "preferences.json";
  std::filesystem::create_directories( Path / "inside" );
  VPreferencesFile File( Path );
  File.AddRecentFile( QStringLiteral( "/a" ) );
  EXPECT_EQ( File.Save(), ZEK::IResult::NotPermitted );
  EXPECT_TRUE( std::filesystem::is_directory( Path / "inside" ) );
  // A file stands in the folder's place.
  Write( Folder.Path() / "file", "x" );
  VPreferencesFile Below( Folder.Path() / "file" / "preferences.json" );
  Below.AddRecentFile( QStringLiteral( "/a" ) );
  EXPECT_EQ( Below.Save(), ZEK::IResult::FileIOFailure );
  EXPECT_EQ( TestSupport::LogTexts( "Preferences", ZEK::ELogWarning ).size(), 2u );
}

TEST( Paths, GeneralFoldersComeFirstAndAreMade )
{
  const TestSupport::VTemporaryDir Folder;
  const VPaths Paths( Folder.Path() / "content", Folder.Path() / "user" );
  std::vector< std::wstring > Folders{ L"stale" };
  EXPECT_EQ( &Paths.FoldersOfKind( Folders, HarrowPluginInterface::EFolderSubjects ), &Folders );
  ASSERT_EQ( Folders.size(), 2u );
  EXPECT_EQ( std::filesystem::path( Folders[0] ), Folder.Path() / "content" / "Subjects" );
  EXPECT_EQ( std::filesystem::path( Folders[1] ), Folder.Path() / "user" / "Subjects" );
  EXPECT_TRUE( std::filesystem::is_directory( Folders[0] ) && std::filesystem::is_directory( Folders[1] ) );
  EXPECT_EQ( Paths.BaseFolder(), ( Folder.Path() / "content" ).wstring() );
  EXPECT_TRUE( Paths.FoldersOfKind( Folders, 0x1 ).empty() );
  const VPaths Odd( Folder.Path() / "no\xFF\x20utf8", Folder.Path() );
  EXPECT_EQ( Odd.FoldersOfKind( Folders, HarrowPluginInterface::EFolderProps ).size(), 2u );
  const VPaths Same( Folder.Path(), Folder.Path() / "user" / ".." );
  EXPECT_EQ( Same.FoldersOfKind( Folders, HarrowPluginInterface::EFolderSceneMeshes ).size(), 1u );
}

TEST( Paths, AFolderThatCannotBeMadeIsStillListedAndReportedOnce )
{
  const TestSupport::VTemporaryDir Folder;
  Write( Folder.Path() / "Props", "a file in the place of a folder" );
  std::size_t Reports = 0;
  for ( const auto& rRoot : { Folder.Path(), Folder.Path() / "Props" / "content" } )
  {
    const VPaths Paths( rRoot, rRoot );
    std::vector< std::wstring > Folders;
    EXPECT_EQ( Paths.FoldersOfKind( Folders, HarrowPluginInterface::EFolderProps ).size(), 1u );
    EXPECT_EQ( Paths.FoldersOfKind( Folders, HarrowPluginInterface::EFolderProps ).size(), 1u );
    EXPECT_EQ( TestSupport::LogTexts( "Paths", ZEK::ELogWarning ).size(), ++Reports );
  }
}

TEST( WindowState, SurvivesTheFile )
{
  HostServices::VStateJsonWriter Writer;
  constexpr qint64 Large = std::numeric_limits< qint64 >::max() - 1;
  Writer.Write( QStringLiteral( "ShowViewSettings" ), true );
  Writer.BeginGroup( QStringLiteral( "Options" ) );
  Writer.Write( QStringLiteral( "Large" ), Large );
  Writer.Write( QStringLiteral( "Opacity" ), 0.25f );
  Writer.BeginGroup( QStringLiteral( "PropSubject" ) );
  Writer.Write( QStringLiteral( "Axes" ), false );
  Writer.EndGroup();
  Writer.Write( QStringLiteral( "Selected" ), QStringList{ "A", "ü/" } );
  Writer.EndGroup();
  Writer.BeginGroup( QStringLiteral( "Options" ) );
  Writer.Write( QStringLiteral( "Name" ), QStringLiteral( "x" ) );
  Writer.EndGroup();
  Writer.Write( QStringLiteral( "Bad" ), QPointF( 1, 2 ) );
  Writer.Write( QStringLiteral( "Infinite" ), std::numeric_limits< double >::infinity() );
  Writer.EndGroup();
  EXPECT_EQ( TestSupport::LogTexts( "WindowState", ZEK::ELogWarning ).size(), 3u );

  const QByteArray Bytes = QJsonDocument( Writer.Object() ).toJson();
  const HostServices::VStateJsonReader Reader( QJsonDocument::fromJson( Bytes ).object() );
  EXPECT_FALSE( Reader.Has( QStringLiteral( "Bad" ) ) || Reader.Has( QStringLiteral( "Infinite" ) ) );
  EXPECT_FALSE( Reader.Child( QStringLiteral( "ShowViewSettings" ) ) );
  const auto pOptions = Reader.Child( QStringLiteral( "Options" ) );
  ASSERT_TRUE( pOptions );
  QVariant Value;
  EXPECT_TRUE( pOptions->Read( QStringLiteral( "Large" ), QMetaType::fromType< qint64 >(), Value ).IsOk() );
  EXPECT_EQ( Value.toLongLong(), Large );
  EXPECT_TRUE( pOptions->Read( QStringLiteral( "Opacity" ), QMetaType::fromType< float >(), Value ).IsOk() );
  EXPECT_EQ( Value, QVariant( 0.25f ) );
  EXPECT_TRUE( pOptions->Read( QStringLiteral( "Selected" ), QMetaType::fromType< QStringList >(), Value ).IsOk() );
  EXPECT_EQ( Value.toStringList(), ( QStringList{ "A", "ü/" } ) );
  EXPECT_TRUE( pOptions->Has( QStringLiteral( "Name" ) ) && pOptions->Child( QStringLiteral( "PropSubject" ) ) );
}

TEST( WindowState, AnotherTypeIsRefusedAndLeavesTheValue )
{
  const auto Document = QJsonDocument::fromJson(
      R"({ "Real": 1.5, "Negative": -1, "Big": 5000000000, "Huge": 1e300, "Text": "1", "Mixed": [ "a", 1 ], "Null": null, "Three": 3.0 })" );
  const HostServices::VStateJsonReader Reader( Document.object() );
  const std::tuple< const char*, QMetaType::Type, ZEK::IResult > Cases[] = {
      { "Missing", QMetaType::Int, ZEK::IResult::NotFound },
      { "Real", QMetaType::Int, ZEK::IResult::InvalidType },
      { "Negative", QMetaType::UInt, ZEK::IResult::InvalidType },
      { "Negative", QMetaType::ULongLong, ZEK::IResult::InvalidType },
      { "Big", QMetaType::Int, ZEK::IResult::InvalidType },
      { "Huge", QMetaType::Float, ZEK::IResult::InvalidType },
      { "Text", QMetaType::Int, ZEK::IResult::InvalidType },
      { "Real", QMetaType::Bool, ZEK::IResult::InvalidType },
      { "Mixed", QMetaType::QStringList, ZEK::IResult::InvalidType },
      { "Null", QMetaType::Double, ZEK::IResult::InvalidType },
      { "Three", QMetaType::Int, ZEK::IResult::Ok } };
  QVariant Value( 17 );
  for ( const auto& [pName, Type, Result] : Cases )
  {
    EXPECT_EQ( Value, QVariant( 17 ) );
    EXPECT_EQ( Reader.Read( QString::fromLatin1( pName ), QMetaType( Type ), Value ), Result ) << pName;
  }
  EXPECT_EQ( Value, QVariant( 3 ) );
}

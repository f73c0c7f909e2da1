#include "Program.h"

#include <TestSupport/Paths.h>

#include <QtCore/QFile>
#include <QtGui/QImage>

#include <gmock/gmock.h>

#include <fstream>
#include <set>

using namespace ProgramTest;

namespace
{
QString Module( const char* i_pName )
{
  return QString::fromStdString( ( TestSupport::BinaryDir() / "lib" / i_pName ).string() );
}

QString In( const TestSupport::VTemporaryDir& i_rFolder, const char* i_pName )
{
  return QString::fromStdString( ( i_rFolder.Path() / i_pName ).string() );
}

QProcessEnvironment WithoutDisplay()
{
  QProcessEnvironment Bare = Environment();
  Bare.remove( "DISPLAY" );
  Bare.remove( "WAYLAND_DISPLAY" );
  return Bare;
}

/// One line of the program's own, and that one names what it is about.
void ExpectComplaint( const VRun& i_rRun, int i_Exit, const char* i_pNames )
{
  EXPECT_EQ( i_rRun.Exit, i_Exit ) << i_rRun.Error.toStdString();
  ASSERT_EQ( i_rRun.Complaints().size(), 1 ) << i_rRun.Error.toStdString();
  EXPECT_THAT( i_rRun.Complaints().front().toStdString(), testing::HasSubstr( i_pNames ) );
}

std::size_t CountColours( const QImage& i_rImage )
{
  std::set< QRgb > Colours;
  for ( int y = 0; y < i_rImage.height(); ++y )
  {
    for ( int x = 0; x < i_rImage.width(); ++x )
    {
      Colours.insert( i_rImage.pixel( x, y ) );
    }
  }
  return Colours.size();
}
} // namespace

TEST( Program, WrongUsageEndsWithTwoAndHelpWithNothing )
{
  ExpectComplaint( Harrow( { "render", "--click", "12" } ), 2, "expected X,Y" );
  ExpectComplaint( Harrow( { "--frobnicate" } ), 2, "--frobnicate" );
  const VRun Help = Harrow( { "--help" } );
  EXPECT_EQ( Help.Exit, 0 );
  EXPECT_TRUE( Help.Output.contains( "render" ) );
  EXPECT_EQ( Help.Error, "" );
}

TEST( Program, AModuleThatCannotBeUsedEndsWithThreeAndIsNamed )
{
  const TestSupport::VTemporaryDir Folder;
  ExpectComplaint( Harrow( { "render", "--plugin", In( Folder, "none.mpm" ) } ), 3, "none.mpm" );
  const QString NoLibrary = In( Folder, "text.mpm" );
  std::ofstream( NoLibrary.toStdString() ) << "this is no library\n";
  ExpectComplaint( Harrow( { "render", "--plugin", NoLibrary } ), 3, "text.mpm" );
  ExpectComplaint( Harrow( { "render", "--plugin", Module( "HarrowTestNoExports.mpm" ) } ), 3, "CreatePlugin" );
  ExpectComplaint( Harrow( { "render", "--plugin", Module( "HarrowTestOneMissing.mpm" ) } ), 3, "PluginBuildRevision" );
}

TEST( Program, NoDisplayAndNoServerNamesThePackage )
{
  QProcessEnvironment Bare = WithoutDisplay();
  Bare.insert( "PATH", "/nonexistent" );
  ExpectComplaint( Harrow( { "render", "--window", "3d" }, Bare ), 4, "\"xvfb\"" );
}

TEST( Program, UnknownWindowsViewsAndOptionsAreAnsweredWithThoseThatExist )
{
  HARROW_NEEDS_MODULE();
  ExpectComplaint( Harrow( { "render", "--window", "4d" } ), 2, "3d (\"3D View\")" );
  ExpectComplaint( Harrow( { "render", "--view", "Askew" } ), 2, "Perspective, Front" );
  ExpectComplaint( Harrow( { "render", "--set", "Reconstructionz=true" } ), 2, "Reconstructions" );
  ExpectComplaint( Harrow( { "render", "--size", "320x240", "--click", "500,10" } ), 2, "outside the view" );
}

TEST( Program, FilesThatCannotBeReadOrWrittenEndWithFiveAndAreNamed )
{
  HARROW_NEEDS_MODULE();
  const TestSupport::VTemporaryDir Folder;
  ExpectComplaint( Harrow( { "render", "--source", In( Folder, "missing.c3d" ) } ), 5, "missing.c3d" );
  ExpectComplaint( Harrow( { "render", "--output", In( Folder, "no/such/folder/a.png" ) } ), 5, "a.png" );
  ExpectComplaint( Harrow( { "render", "--report", In( Folder, "no/such/folder/a.json" ) } ), 5, "a.json" );
}

TEST( Program, WithoutADisplayItBringsItsOwnAndTheWindowBecomesPictures )
{
  HARROW_NEEDS_MODULE();
  const TestSupport::VTemporaryDir Folder;
  const QString Picture = In( Folder, "a.png" );
  VRun Run = Harrow( { "render", "--size", "640x360", "--output", Picture }, WithoutDisplay() );
  EXPECT_EQ( Run.Exit, 0 ) << Run.Error.toStdString();
  EXPECT_EQ( QImage( Picture ).size(), QSize( 640, 360 ) );
  Run = Harrow( { "render", "--all", "--size", "640x360", "--output-dir", In( Folder, "out" ) }, WithoutDisplay() );
  EXPECT_EQ( Run.Exit, 0 ) << Run.Error.toStdString();
  EXPECT_TRUE( Run.Output.contains( "3D View: " ) );
  EXPECT_GT( CountColours( QImage( In( Folder, "out/3d-view.png" ) ) ), 20u );
}

TEST( Program, PictureHasTheSizeTimesTheRatioAndTheSameEveryTime )
{
  HARROW_NEEDS_MODULE();
  const TestSupport::VTemporaryDir Folder;
  const auto Take = [&]( const char* i_pName, const char* i_pRatio )
  {
    const QString Path = In( Folder, i_pName );
    const VRun Run =
        Harrow( { "render", "--size", "320x200", "--ratio", i_pRatio, "--time", "1.5", "--output", Path } );
    EXPECT_EQ( Run.Exit, 0 ) << Run.Error.toStdString();
    return QImage( Path );
  };
  const QImage Once = Take( "a.png", "1" );
  EXPECT_EQ( Once.size(), QSize( 320, 200 ) );
  EXPECT_GT( CountColours( Once ), 20u );
  EXPECT_EQ( Take( "b.png", "1" ), Once );
  EXPECT_EQ( Take( "c.png", "2" ).size(), QSize( 640, 400 ) );
}

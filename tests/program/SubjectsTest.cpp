#include "Program.h"

#include <TestSupport/Paths.h>

#include <QtCore/QFile>
#include <QtCore/QJsonArray>
#include <QtGui/QImage>

#include <gtest/gtest.h>

using namespace ProgramTest;

namespace
{
/// One simulated performer, seen from where her arms are widest, and where she is in the picture.
struct VSeen
{
  QJsonObject Subjects; ///< of the report
  QRect Body;
};

QImage Picture( const QStringList& i_rArguments, QJsonObject& o_rReport )
{
  const TestSupport::VTemporaryDir Folder;
  const QString File = QString::fromStdString( ( Folder.Path() / "subjects.png" ).string() );
  o_rReport = Render( QStringList{ "--window", "subject", "--performers", "1", "--cameras", "0", "--size", "640x640",
                                   "--output", File, "--set", "SubjectNames=false", "--set",
                                   "PropSubject-Enabled=false", "--view", "Right" } +
                      i_rArguments );
  return QImage( File );
}

VSeen See( const QStringList& i_rArguments )
{
  QJsonObject Report;
  const QImage With = Picture( i_rArguments, Report );
  VSeen Seen{ Report["subjectScene"].toObject(), {} };
  const QImage Without = Picture( i_rArguments + QStringList{ "--set", "LabellingSubject-Enabled=false" }, Report );
  EXPECT_EQ( With.size(), Without.size() );
  for ( int Y = 0; Y < With.height(); ++Y )
  {
    for ( int X = 0; X < With.width(); ++X )
    {
      Seen.Body |= With.pixel( X, Y ) != Without.pixel( X, Y ) ? QRect( X, Y, 1, 1 ) : QRect();
    }
  }
  return Seen;
}

int PoseNamed( const QJsonObject& i_rSubjects, const char* i_pName )
{
  const QVariantList Poses = i_rSubjects["poses"].toArray().toVariantList();
  return static_cast< int >( Poses.indexOf( QVariant( i_pName ) ) );
}
} // namespace

TEST( Subjects, StandInThePoseThatIsAskedFor )
{
  HARROW_NEEDS_MODULE();
  const QJsonObject Any =
      Render( { "--window", "subject", "--performers", "1", "--size", "160x120" } )["subjectScene"].toObject();
  EXPECT_EQ( Any["pose"], 0 );
  EXPECT_TRUE( Any["subjects"].toArray().contains( "Ada" ) );
  for ( const QJsonValue& rTag : Any["tags"].toArray() )
  {
    static const QStringList Known{ "0x1011", "0x1012", "0x1013", "0x101a", "0x101b", "0x101c",
                                    "0x101d", "0x1027", "0x1029", "0x102c", "0x1031", "0x1044" };
    EXPECT_TRUE( Known.contains( rTag.toString() ) ) << rTag.toString().toStdString();
  }
  const int Wide = PoseNamed( Any, "T-pose" ), Low = PoseNamed( Any, "Crouch" );
  ASSERT_TRUE( Wide > 0 && Low > 0 );
  const VSeen T = See( { "--pose", QString::number( Wide ) } );
  const VSeen Crouch = See( { "--pose", QString::number( Wide ), "--labelling-pose", QString::number( Low ) } );
  EXPECT_EQ( Crouch.Subjects["labellingPose"], Low );
  EXPECT_EQ( Crouch.Subjects["solvingPose"], Wide );
  // A person with the arms stretched out is about as wide as tall.
  EXPECT_NEAR( T.Body.width(), T.Body.height(), 0.2 * T.Body.height() );
  EXPECT_LT( Crouch.Body.height(), 0.9 * T.Body.height() );
  EXPECT_LT( Crouch.Body.width(), 0.8 * T.Body.width() );
}

TEST( Subjects, ClicksOnABoneAMarkerAndAStickReportTheirKinds )
{
  HARROW_NEEDS_MODULE();
  const TestSupport::VTemporaryDir Folder;
  const QStringList View{ "--cameras", "0", "--time", "0.5", "--size", "640x360", "--set", "Reconstructions=false" };
  const auto Only = []( const char* pName )
  {
    QStringList Arguments;
    for ( const char* pOther : { "Bones", "Markers", "Sticks", "Skin", "Clusters", "Origins" } )
    {
      Arguments << "--set"
                << QString( "LabellingSubject-%1=%2" ).arg( pOther, pOther == QString( pName ) ? "true" : "false" );
    }
    return Arguments;
  };
  const char* const Names[] = { "Bones", "Markers", "Sticks" };
  const char* const Counts[] = { "bones", "markers", "sticks" };
  QImage Pictures[3];
  for ( int Kind = 0; Kind < 3; ++Kind )
  {
    const QString File = QString::fromStdString( ( Folder.Path() / "one.png" ).string() );
    const QJsonObject Report = Render( View + Only( Names[Kind] ) + QStringList{ "--output", File } );
    EXPECT_TRUE( Report["log"].toArray().isEmpty() );
    const QJsonObject Shown = Report["subjects"].toObject()["LabellingSubject"].toObject()["subjects"].toObject();
    EXPECT_EQ( Shown["names"].toArray().size(), 2 );
    for ( int Other = 0; Other < 3; ++Other )
    {
      EXPECT_EQ( Shown[Counts[Other]].toInt() > 20, Other == Kind ) << Names[Kind] << ", " << Counts[Other];
    }
    ASSERT_TRUE( Pictures[Kind].load( File ) );
  }
  QStringList Clicks;
  for ( int Kind = 0; Kind < 3; ++Kind )
  {
    // What one picture alone shows, where most of what is around it is shown by it alone too.
    const auto IsOwn = [&]( int i_X, int i_Y )
    {
      const QRgb Colour = Pictures[Kind].pixel( i_X, i_Y );
      return Colour != Pictures[( Kind + 1 ) % 3].pixel( i_X, i_Y ) &&
             Colour != Pictures[( Kind + 2 ) % 3].pixel( i_X, i_Y );
    };
    QPoint Best;
    int Most = 0;
    for ( int Pixel = 0; Pixel < 636 * 356; ++Pixel )
    {
      const QPoint At( 2 + Pixel % 636, 2 + Pixel / 636 );
      int Own = IsOwn( At.x(), At.y() ) ? 1 : -30;
      for ( int Near = 0; Near < 25; ++Near )
      {
        Own += IsOwn( At.x() - 2 + Near % 5, At.y() - 2 + Near / 5 ) ? 1 : 0;
      }
      Best = Own > Most ? At : Best;
      Most = std::max( Own, Most );
    }
    Clicks << Only( Names[Kind] ) << "--click" << Text( Best );
  }
  std::vector< int > Kinds;
  for ( const QJsonValue& rAction : Render( View + Clicks )["actions"].toArray() )
  {
    const QJsonArray Selection = rAction["selection"].toArray();
    if ( rAction["action"] == "click" )
    {
      Kinds.push_back( Selection.size() == 1 ? Selection[0]["kind"].toInt() : -1 );
    }
  }
  EXPECT_EQ( Kinds, ( std::vector< int >{ 8, 6, 7 } ) );
}

TEST( Subjects, PosesThatAreNoneAreToldAndOtherWindowsHaveNone )
{
  HARROW_NEEDS_MODULE();
  for ( const QStringList& rWrong : { QStringList{ "--window", "subject", "--pose", "-1" },
                                      { "--window", "subject", "--solving-pose", "x" },
                                      { "--window", "cameras", "--pose", "1" },
                                      { "--window", "subject", "--profile", "objects" } } )
  {
    const VRun Run = Harrow( QStringList{ "render" } + rWrong );
    EXPECT_EQ( Run.Exit, 2 ) << rWrong.join( ' ' ).toStdString();
    EXPECT_EQ( Run.Complaints().size(), 1 ) << Run.Error.toStdString();
  }
  const QJsonObject Object = Render( { "--window", "object", "--profile", "objects", "--size", "160x120" } );
  EXPECT_EQ( Object["window"], "Object" );
  EXPECT_TRUE( Object.contains( "subjectScene" ) );
}

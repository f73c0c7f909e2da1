#include "Program.h"

#include <TestSupport/Paths.h>

#include <QtCore/QFile>
#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>
#include <QtCore/QProcess>
#include <QtGui/QMatrix4x4>

#include <gtest/gtest.h>

namespace ProgramTest
{
namespace
{
constexpr int LimitMs = 240'000;

QString At( const std::filesystem::path& i_rPath )
{
  return QString::fromStdString( i_rPath.string() );
}

const TestSupport::VTemporaryDir& Home()
{
  static const TestSupport::VTemporaryDir Folder;
  return Folder;
}
} // namespace

QStringList VRun::Complaints() const
{
  return Error.split( '\n', Qt::SkipEmptyParts ).filter( QRegularExpression( "^harrow: " ) );
}

QProcessEnvironment Environment()
{
  QProcessEnvironment Environment = QProcessEnvironment::systemEnvironment();
  const QString Folder = At( Home().Path() );
  Environment.insert( "HOME", Folder );
  for ( const char* pName : { "XDG_CONFIG_HOME", "XDG_DATA_HOME", "XDG_CACHE_HOME" } )
  {
    Environment.insert( pName, Folder );
  }
  Environment.remove( "HARROW_PLUGIN" );
  return Environment;
}

VRun Harrow( const QStringList& i_rArguments, const QProcessEnvironment& i_rEnvironment )
{
  QProcess Process;
  Process.setProcessEnvironment( i_rEnvironment );
  Process.start( At( TestSupport::BinaryDir() / "bin" / "harrow" ), i_rArguments );
  VRun Run;
  if ( Process.waitForFinished( LimitMs ) && Process.exitStatus() == QProcess::NormalExit )
  {
    Run.Exit = Process.exitCode();
  }
  else
  {
    Process.kill();
    Process.waitForFinished();
  }
  Run.Output = QString::fromUtf8( Process.readAllStandardOutput() );
  Run.Error = QString::fromUtf8( Process.readAllStandardError() );
  return Run;
}

bool HasModule()
{
  return std::filesystem::exists( TestSupport::BinaryDir() / "lib" / "HarrowPluginGraphics.mpm" );
}

QString Recording( const char* i_pName )
{
  return At( TestSupport::RecordingsDir() / i_pName );
}

QJsonObject ReadJson( const std::filesystem::path& i_rPath )
{
  QFile File( At( i_rPath ) );
  return File.open( QIODevice::ReadOnly ) ? QJsonDocument::fromJson( File.readAll() ).object() : QJsonObject();
}

QJsonObject Render( const QStringList& i_rArguments )
{
  const TestSupport::VTemporaryDir Folder;
  const auto Report = Folder.Path() / "report.json";
  const VRun Run = Harrow( QStringList{ "render", "--report", At( Report ) } + i_rArguments );
  EXPECT_EQ( Run.Exit, 0 ) << Run.Error.toStdString();
  const QJsonObject Object = ReadJson( Report );
  EXPECT_FALSE( Object.isEmpty() );
  return Object;
}

QPointF Project( const QJsonObject& i_rReport, double i_X, double i_Y, double i_Z )
{
  const QJsonObject Camera = i_rReport["camera"].toObject();
  const auto Number = [&]( const char* i_pName )
  {
    return static_cast< float >( Camera[i_pName].toDouble() );
  };
  const QJsonObject Size = i_rReport["size"].toObject();
  const auto Width = static_cast< float >( Size["width"].toDouble() );
  const auto Height = static_cast< float >( Size["height"].toDouble() );
  const QJsonArray Centre = Camera["centre"].toArray();
  QMatrix4x4 Matrix;
  Matrix.perspective( Number( "fieldOfView" ), Width / Height, Number( "nearPlane" ), Number( "farPlane" ) );
  Matrix.translate( 0, 0, -Number( "distance" ) );
  Matrix.rotate( Number( "tilt" ), 1, 0, 0 );
  Matrix.rotate( Number( "azimuth" ), 0, 0, 1 );
  if ( Camera["yUp"].toBool() )
  {
    Matrix.rotate( 90, 1, 0, 0 );
  }
  const QVector3D Point( static_cast< float >( i_X - Centre[0].toDouble() ),
                         static_cast< float >( i_Y - Centre[1].toDouble() ),
                         static_cast< float >( i_Z - Centre[2].toDouble() ) );
  const QVector3D Clip = Matrix.map( Point );
  return { ( Clip.x() + 1.0 ) * 0.5 * Width, ( 1.0 - Clip.y() ) * 0.5 * Height };
}

QString Text( QPointF i_Point )
{
  return QString( "%1,%2" ).arg( i_Point.x(), 0, 'f', 2 ).arg( i_Point.y(), 0, 'f', 2 );
}

} // namespace ProgramTest

#pragma once

#include <QtCore/QJsonObject>
#include <QtCore/QPointF>
#include <QtCore/QProcessEnvironment>
#include <QtCore/QString>
#include <QtCore/QStringList>

#include <filesystem>

namespace ProgramTest
{

struct VRun
{
  int Exit = -1; ///< negative when the program crashed or hung
  QString Output;
  QString Error;

  /// The lines of stderr that the program itself wrote.
  QStringList Complaints() const;
};

/// Preferences and data of the tests' own, never those of the user.
QProcessEnvironment Environment();
VRun Harrow( const QStringList& i_rArguments, const QProcessEnvironment& i_rEnvironment = Environment() );

bool HasModule();
QString Recording( const char* i_pName );
QJsonObject ReadJson( const std::filesystem::path& i_rPath );

/// Renders with a report and gives it back; a failure of the program fails the test and gives an empty object.
QJsonObject Render( const QStringList& i_rArguments );

/// Where a world point (mm) lies in the view, worked out from the camera's fields in a report alone.
QPointF Project( const QJsonObject& i_rReport, double i_X, double i_Y, double i_Z );

/// "X,Y" for the command line.
QString Text( QPointF i_Point );

} // namespace ProgramTest

/// Leaves a test with a clear line while the module is not built.
#define HARROW_NEEDS_MODULE()                                                                                          \
  if ( !ProgramTest::HasModule() )                                                                                     \
  GTEST_SKIP() << "the module HarrowPluginGraphics.mpm is not built"

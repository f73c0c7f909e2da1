#include <HostWindow/Headless.h>

#include "Report.h"

#include <HostWindow/Session.h>
#include <HostWindow/ViewDriver.h>

#include <HarrowPluginInterface/IWorkspaceContent.h>
#include <HostSources/CameraCalibrations.h>
#include <HostSources/ReadRecording.h>
#include <HostSources/RecordingInfo.h>

#include <QtCore/QDir>
#include <QtCore/QFileInfo>
#include <QtCore/QJsonDocument>
#include <QtCore/QSaveFile>
#include <QtGui/QImage>
#include <QtGui/QImageWriter>
#include <QtWidgets/QHBoxLayout>

#include <iostream>

namespace HostWindow
{
namespace
{
using VContentRef = std::shared_ptr< HarrowPluginInterface::VWindowFrameContent >;

/// The frames in which resources are made, the state arrives and what is asked for late is drawn.
constexpr int FirstFrames = 4;
constexpr std::chrono::seconds LongestMesh( 60 );

VRunResult Fail( int i_Exit, std::string i_Message )
{
  return { i_Exit, std::move( i_Message ) };
}

VRunResult OpenSource( VSession& io_rSession, const std::string& i_rSource, double i_Seconds )
{
  io_rSession.SetSeen( false );
  if ( i_rSource == "simulated" )
  {
    io_rSession.GoLive();
  }
  else
  {
    const auto pRecording = std::make_shared< HostSources::VRecording >();
    std::string Message;
    const ZEK::IResult Read =
        HostSources::ReadRecording( i_rSource, *pRecording, Message, {}, io_rSession.Options().Reading );
    if ( Read.IsError() )
    {
      return Fail( EExitFile, Message.empty() ? i_rSource + ": " + Read.Text() : Message );
    }
    if ( !Message.empty() )
    {
      std::cerr << "harrow: " << Message << std::endl;
      pRecording->Notes.insert( pRecording->Notes.begin(), Message );
    }
    io_rSession.OpenRecording( pRecording );
  }
  std::int64_t Index = 0;
  const ZEK::IResult Shown = io_rSession.ShowStill( i_Seconds, Index );
  return Shown.IsError() ? Fail( EExitFile, i_rSource + ": " + Shown.Text() ) : VRunResult();
}

/// A view on its own, as large as was asked. The toolbar is made because a window always has one. Wherever the pointer
/// of the display happens to be, it does nothing to the view.
class VStandAloneView : public QObject
{
public:
  VStandAloneView( VSession& io_rSession, const std::string& i_rWindow, const VRenderOptions& i_rRender )
  {
    m_Toolbar.setLayout( new QHBoxLayout );
    const auto pFactory = io_rSession.Host().Factories()->Find( i_rWindow );
    pFactory->Create( m_pContent, io_rSession.Context(), QPointer< QWidget >( &m_Toolbar ) );
    if ( m_pContent )
    {
      m_pContent->resize( i_rRender.Width, i_rRender.Height );
      m_View = VSceneView( m_pContent.get() );
      m_View.SetReporting( true );
      const VPoseOptions& rPoses = i_rRender.Poses;
      m_View.SetPoses( rPoses.All.value_or( 0 ), rPoses.Labelling.value_or( -1 ), rPoses.Solving.value_or( -1 ) );
      m_pContent->show(); // draws the first frame
      if ( m_View.Widget() )
      {
        m_View.Widget()->installEventFilter( this );
      }
    }
  }
  const VSceneView& View() const { return m_View; }

protected:
  bool eventFilter( QObject*, QEvent* io_pEvent ) override
  {
    switch ( io_pEvent->type() )
    {
    case QEvent::Enter:
    case QEvent::Leave:
    case QEvent::HoverEnter:
    case QEvent::HoverMove:
    case QEvent::HoverLeave:
      return true;
    default:
      return io_pEvent->isPointerEvent() && io_pEvent->spontaneous();
    }
  }

private:
  QWidget m_Toolbar;
  VContentRef m_pContent;
  VSceneView m_View;
};

std::string WriteFile( const QString& i_rPath, const std::function< bool( QIODevice& ) >& i_rWrite )
{
  QSaveFile File( i_rPath );
  if ( !File.open( QIODevice::WriteOnly ) || !i_rWrite( File ) || !File.commit() )
  {
    return "cannot write \"" + i_rPath.toStdString() + "\": " + File.errorString().toStdString();
  }
  return {};
}

std::string WritePicture( const QString& i_rPath, const QImage& i_rPicture )
{
  return WriteFile( i_rPath,
                    [&]( QIODevice& io_rDevice )
                    {
                      QImageWriter Writer( &io_rDevice, "png" );
                      return Writer.write( i_rPicture );
                    } );
}

std::string WriteReport( const QString& i_rPath, const QJsonObject& i_rReport )
{
  const QByteArray Text = QJsonDocument( i_rReport ).toJson();
  if ( i_rPath.isEmpty() || i_rPath == "-" )
  {
    std::cout.write( Text.constData(), Text.size() ).flush();
    return std::cout.good() ? std::string() : "cannot write to stdout";
  }
  return WriteFile( i_rPath,
                    [&]( QIODevice& io_rDevice )
                    {
                      return io_rDevice.write( Text ) == Text.size();
                    } );
}

std::string KindsText( const HostServices::VContentFactories& i_rFactories )
{
  QStringList Kinds;
  for ( const std::string& rName : i_rFactories.Names() )
  {
    const QString Short = QString::fromStdString( rName ).section( ' ', 0, 0 ).toLower();
    Kinds << QString( "%1 (\"%2\")" ).arg( Short, QString::fromStdString( rName ) );
  }
  return Kinds.join( ", " ).toStdString();
}

VRunResult RenderOne( VSession& io_rSession, const VRenderOptions& i_rRender, const std::string& i_rWindow,
                      const QString& i_rOutput, const std::optional< QString >& i_rReport )
{
  VStandAloneView Window( io_rSession, i_rWindow, i_rRender );
  VViewDriver Driver( Window.View(), io_rSession.Host().Selection() );
  if ( !Driver.View().Item() )
  {
    return Fail( EExitPlugin,
                 "the window \"" + i_rWindow + "\" shows nothing: " + Driver.View().LoadErrors().toStdString() );
  }
  if ( !Driver.WaitFrames( FirstFrames ) )
  {
    return Fail( EExitDisplay, "the window \"" + i_rWindow + "\" draws no frame: this display has no OpenGL" );
  }
  if ( i_rRender.Poses.IsSet() && !i_rRender.bAll && !Driver.View().FrameReport().contains( "subjectScene" ) )
  {
    return Fail( EExitUsage, "the window \"" + i_rWindow + "\" poses no subjects; --window subject does" );
  }
  QJsonArray Actions;
  for ( const VViewAction& rAction : i_rRender.Actions )
  {
    const QString Wrong = Driver.Perform( rAction );
    if ( !Wrong.isEmpty() )
    {
      return Fail( EExitUsage, rAction.Option + " \"" + rAction.Text + "\": " + Wrong.toStdString() );
    }
    Actions.append( DescribeAction( rAction, io_rSession, Driver.View() ) );
  }
  // Meshes are read while frames are drawn; a picture shows those that were asked for.
  if ( io_rSession.Meshes().ReadCount() > 0 &&
       !( io_rSession.Meshes().WaitUntilRead( LongestMesh ) && Driver.WaitFrames( FirstFrames ) ) )
  {
    return Fail( EExitFile, "a mesh takes too long to be read" );
  }
  const QImage Picture = Driver.View().Widget()->grabFramebuffer();
  std::string Wrong = i_rOutput.isEmpty() ? std::string() : WritePicture( i_rOutput, Picture );
  if ( Wrong.empty() && i_rReport )
  {
    QJsonObject Report = DescribeView( io_rSession, i_rRender, i_rWindow, Driver.View(), Picture );
    Report["actions"] = Actions;
    Wrong = WriteReport( *i_rReport, Report );
  }
  return Wrong.empty() ? VRunResult() : Fail( EExitFile, Wrong );
}

VRunResult RenderAll( VSession& io_rSession, const VRenderOptions& i_rRender )
{
  const QString Folder = QString::fromStdString( i_rRender.OutputDir.string() );
  if ( !QDir().mkpath( Folder ) )
  {
    return Fail( EExitFile, "cannot make the folder \"" + Folder.toStdString() + "\"" );
  }
  for ( const std::string& rName : io_rSession.Host().Factories()->Names() )
  {
    const QString File = QString::fromStdString( rName ).toLower().replace( ' ', '-' ) + ".png";
    const QString Path = QDir( Folder ).absoluteFilePath( File );
    const VRunResult Result = RenderOne( io_rSession, i_rRender, rName, Path, std::nullopt );
    if ( Result.Exit != EExitOk )
    {
      return Result;
    }
    std::cout << rName << ": " << Path.toStdString() << std::endl;
  }
  return {};
}
/// Says what went wrong with a file, if anything did. False when there is nothing to show of it.
bool TellOfReading( const std::string& i_rFile, const ZEK::IResult& i_rRead, const std::string& i_rMessage,
                    VRunResult& io_rResult )
{
  if ( !i_rMessage.empty() || i_rRead.IsError() )
  {
    std::cerr << "harrow: " << ( i_rMessage.empty() ? i_rFile + ": " + i_rRead.Text() : i_rMessage ) << std::endl;
  }
  if ( i_rRead.IsError() )
  {
    io_rResult.Exit = EExitFile;
  }
  return !i_rRead.IsError();
}

/// One after the other, or as one JSON list.
VRunResult PrintTexts( const std::vector< std::string >& i_rTexts, bool i_bList, const VRunResult& i_rResult )
{
  std::cout << ( i_bList ? "[\n" : "" );
  for ( std::size_t i = 0; i < i_rTexts.size(); ++i )
  {
    std::cout << ( i == 0 ? "" : i_bList ? ",\n" : "\n" ) << i_rTexts[i];
  }
  std::cout << ( i_bList ? "]\n" : "" ) << std::flush;
  return std::cout.good() ? i_rResult : Fail( EExitFile, "cannot write to stdout" );
}
} // namespace

VRunResult RunRender( const VCommonOptions& i_rCommon, const VRenderOptions& i_rRender )
{
  VSession Session( i_rCommon );
  const std::string PluginError = Session.StartPlugin();
  if ( !PluginError.empty() )
  {
    return Fail( EExitPlugin, PluginError );
  }
  const std::string Window = Session.FindWindowKind( i_rRender.Window );
  if ( Window.empty() && !i_rRender.bAll )
  {
    return Fail( EExitUsage, "there is no window kind \"" + i_rRender.Window + "\"; those that exist are " +
                                 KindsText( *Session.Host().Factories() ) );
  }
  const VRunResult Opened = OpenSource( Session, i_rRender.Sources.front(), i_rRender.Time );
  if ( Opened.Exit != EExitOk )
  {
    return Opened;
  }
  if ( i_rRender.bAll )
  {
    return RenderAll( Session, i_rRender );
  }
  std::optional< QString > Report;
  if ( !i_rRender.Report.empty() || i_rRender.Output.empty() )
  {
    Report = QString::fromStdString( i_rRender.Report.string() );
  }
  return RenderOne( Session, i_rRender, Window, QString::fromStdString( i_rRender.Output.string() ), Report );
}

VRunResult RunInfo( const std::vector< std::string >& i_rFiles, bool i_bJson,
                    const HostSources::VReadOptions& i_rReading )
{
  VRunResult Result;
  std::vector< std::string > Texts;
  for ( const std::string& rFile : i_rFiles )
  {
    HostSources::VRecording Recording;
    std::string Message;
    const ZEK::IResult Read = HostSources::ReadRecording( rFile, Recording, Message, {}, i_rReading );
    if ( TellOfReading( rFile, Read, Message, Result ) )
    {
      const HostSources::VRecordingInfo Info = HostSources::DescribeRecording( Recording );
      Texts.push_back( i_bJson ? Info.Json() : Info.Text() );
    }
  }
  return PrintTexts( Texts, i_bJson && i_rFiles.size() > 1, Result );
}

VRunResult RunInspectCameras( const std::vector< std::string >& i_rFiles )
{
  VRunResult Result;
  std::vector< std::string > Texts;
  for ( const std::string& rFile : i_rFiles )
  {
    HostSources::VCameraCalibrations Calibrations;
    std::string Message;
    const ZEK::IResult Read =
        HostSources::ReadCameraCalibrations( std::filesystem::path( rFile ), Calibrations, Message );
    if ( TellOfReading( rFile, Read, Message, Result ) )
    {
      Texts.push_back( HostSources::CameraCalibrationsJson( Calibrations ) );
    }
  }
  return PrintTexts( Texts, i_rFiles.size() > 1, Result );
}

} // namespace HostWindow

#include <HostWindow/CommandLine.h>

#include <CLI/CLI.hpp>

#include <cmath>
#include <limits>
#include <sstream>

namespace HostWindow
{
namespace
{
constexpr const char* pFooter =
    "\"harrow settings --help\" tells how settings are read and changed without a window.\n"
    "Exit codes: 0 done, 2 wrong usage, 3 the plug-in cannot be loaded, 4 no display, 5 a file cannot be read or "
    "written.";

/// Wraps a reader whose text says what is wrong into an option that is read at its place in the line.
CLI::Option* AddOrdered( CLI::App& io_rApp, const std::string& i_rName, const std::string& i_rHelp,
                         const std::string& i_rType, std::function< std::string( const std::string& ) > i_Read )
{
  return io_rApp
      .add_option_function< std::string >(
          i_rName,
          [i_rName, Read = std::move( i_Read )]( const std::string& i_rText )
          {
            const std::string Wrong = Read( i_rText );
            if ( !Wrong.empty() )
            {
              throw CLI::ValidationError( i_rName, "\"" + i_rText + "\": " + Wrong );
            }
          },
          i_rHelp )
      ->type_name( i_rType )
      ->multi_option_policy( CLI::MultiOptionPolicy::TakeLast )
      ->trigger_on_parse();
}

std::string ReadSize( const std::string& i_rText, VRenderOptions& o_rRender )
{
  const QStringList Parts = QString::fromStdString( i_rText ).toLower().split( 'x' );
  bool bWidth = false;
  bool bHeight = false;
  const int Width = Parts.value( 0 ).toInt( &bWidth );
  const int Height = Parts.value( 1 ).toInt( &bHeight );
  if ( Parts.size() != 2 || !bWidth || !bHeight || Width < 16 || Height < 16 || Width > 8192 || Height > 8192 )
  {
    return "expected WIDTHxHEIGHT, each from 16 to 8192";
  }
  o_rRender.Width = Width;
  o_rRender.Height = Height;
  return {};
}

std::string ReadNumber( const std::string& i_rText, double i_Least, double i_Most, const char* i_pExpected,
                        double& o_rNumber )
{
  bool bOk = false;
  const double Number = QString::fromStdString( i_rText ).toDouble( &bOk );
  if ( !bOk || !( Number >= i_Least && Number <= i_Most ) )
  {
    return i_pExpected;
  }
  o_rNumber = Number;
  return {};
}

std::string ReadFlags( const std::string& i_rText, VCommonOptions& o_rCommon )
{
  bool bOk = false;
  const uint Flags = QString::fromStdString( i_rText ).toUInt( &bOk, 0 );
  if ( !bOk )
  {
    return "expected a 32-bit number such as 0x3500c";
  }
  o_rCommon.Flags = Flags;
  return {};
}

void AddCommon( CLI::App& io_rApp, VCommonOptions& o_rCommon )
{
  io_rApp.add_option( "--plugin", o_rCommon.Plugin, "The graphics module to load" )->type_name( "PATH" );
  io_rApp.add_option( "--content-root", o_rCommon.ContentRoot, "The folder of subjects, props and meshes" )
      ->type_name( "DIR" );
  AddOrdered( io_rApp, "--flags", "The word of feature flags; overrules --profile", "WORD",
              [&o_rCommon]( const std::string& i_rText )
              {
                return ReadFlags( i_rText, o_rCommon );
              } );
  io_rApp.add_option( "--profile", o_rCommon.Profile, "The set of features" )
      ->check( CLI::IsMember( std::vector< std::string >{ "subjects", "objects" } ) )
      ->capture_default_str();
  io_rApp.add_flag( "--developer", o_rCommon.bDeveloper, "Developer mode: command box, statistics, developer menu" );
  io_rApp.add_option( "--log", o_rCommon.LogLevel, "Log up to this level: 2 failures, 3 warnings, 6 details" )
      ->check( CLI::Range( 0, 9 ) )
      ->capture_default_str();
  io_rApp.add_option( "--cameras", o_rCommon.Simulated.Cameras, "Cameras of the simulated capture" )
      ->check( CLI::Range( 0, 256 ) )
      ->capture_default_str();
  io_rApp.add_option( "--performers", o_rCommon.Simulated.Performers, "Performers of the simulated capture" )
      ->check( CLI::Range( 0, 16 ) )
      ->capture_default_str();
  io_rApp.add_option( "--rate", o_rCommon.Simulated.RateHz, "Frames of the simulated capture in a second" )
      ->check( CLI::Range( 25.0, 1000.0 ) )
      ->capture_default_str();
  io_rApp.add_flag( "--solving", o_rCommon.Simulated.bSolving,
                    "A second, fuller skeleton of each simulated performer, as for solving" );
  io_rApp.add_flag( "--retargeting", o_rCommon.Simulated.bRetargeting,
                    "A character of other proportions that each simulated performer drives" );
  io_rApp
      .add_option( "--world-axes", o_rCommon.Reading.WorldAxes,
                   "How the axes of a folder's 3D points become those of its cameras, such as zxy or x-zy" )
      ->type_name( "AXES" );
  io_rApp
      .add_option( "--model", o_rCommon.Reading.Model,
                   "The model (.osim) whose joints a motion file (.mot) moves, in place of the one beside it" )
      ->type_name( "FILE" );
  AddOrdered( io_rApp, "--up", "The up axis, in place of the one found in the recording", "y|z",
              [&o_rCommon]( const std::string& i_rText ) -> std::string
              {
                if ( i_rText != "y" && i_rText != "z" )
                {
                  return "the up axis is y or z";
                }
                o_rCommon.Up = i_rText == "y" ? HostSources::EUpAxis::Y : HostSources::EUpAxis::Z;
                return {};
              } );
  AddOrdered( io_rApp, "--profile-gl", "The OpenGL profile to ask for", "core|compatibility",
              [&o_rCommon]( const std::string& i_rText ) -> std::string
              {
                if ( i_rText != "core" && i_rText != "compatibility" )
                {
                  return "the profile is core or compatibility";
                }
                o_rCommon.bCoreProfile = i_rText == "core";
                return {};
              } );
}

void AddActions( CLI::App& io_rApp, VRenderOptions& o_rRender )
{
  const auto pModifiers = std::make_shared< Qt::KeyboardModifiers >( Qt::NoModifier );
  struct VRow
  {
    const char* pName;
    const char* pHelp;
    const char* pType;
  };
  static constexpr VRow Rows[] = {
      { "--set", "Set an option of the scene to a bool, a number or a text", "KEY=VALUE" },
      { "--view", "Take a view type: Perspective, Front, Back, Left, Right, Top, Bottom", "NAME" },
      { "--click", "Click with the left button", "X,Y" },
      { "--double-click", "Click twice, as to show one camera or all", "X,Y" },
      { "--band", "Draw a band of selection", "X0,Y0,X1,Y1" },
      { "--hover", "Move the pointer there", "X,Y" },
      { "--drag", "Drag with buttons down: left orbits, right zooms, left+right pans", "X0,Y0,X1,Y1[,BUTTONS]" },
      { "--wheel", "Turn the wheel; one notch is 120", "X,Y,DELTA" },
      { "--key", "Press a key, such as Home", "NAME" },
      { "--select", "Select an item by its text in the report; nothing for an empty one", "ITEM" },
      { "--tracking", "Let the camera follow: none, selection, objects, or lock it to the selected object", "WHAT" },
      { "--command", "Run a command of the window, such as Workspace3d:FrameSelected", "TEXT" } };
  for ( const VRow& rRow : Rows )
  {
    const std::string Name = rRow.pName;
    AddOrdered( io_rApp, Name, rRow.pHelp, rRow.pType,
                [&o_rRender, pModifiers, Name]( const std::string& i_rText )
                {
                  VViewAction Action;
                  std::string Wrong = ParseViewAction( Name, i_rText, Action );
                  Action.Modifiers = *pModifiers;
                  o_rRender.Actions.push_back( std::move( Action ) );
                  return Wrong;
                } )
        ->group( "Done to the view, in the order given (points are pixels of the view from its top left)" );
  }
  AddOrdered( io_rApp, "--modifiers", "Keys held during all that follows", "shift,ctrl,alt|none",
              [pModifiers]( const std::string& i_rText )
              {
                return ParseModifiers( i_rText, *pModifiers );
              } )
      ->group( "Done to the view, in the order given (points are pixels of the view from its top left)" );
}

void AddPoses( CLI::App& io_rApp, VPoseOptions& o_rPoses )
{
  const auto Add = [&]( const char* i_pName, std::optional< int >& o_rPose, const char* i_pHelp )
  {
    io_rApp.add_option( i_pName, o_rPose, i_pHelp )
        ->check( CLI::Range( 0, std::numeric_limits< int >::max() ) )
        ->type_name( "N" );
  };
  Add( "--pose", o_rPoses.All, "The pose of each subject in a window of subjects, from 0; it is 0 unless given" );
  Add( "--labelling-pose", o_rPoses.Labelling, "The same for labelled subjects alone" );
  Add( "--solving-pose", o_rPoses.Solving, "The same for solved subjects alone" );
}

void AddRender( CLI::App& io_rApp, VRenderOptions& o_rRender )
{
  io_rApp.add_option( "--window", o_rRender.Window, "The kind of window, such as 3d, cameras or subject" )
      ->capture_default_str();
  AddPoses( io_rApp, o_rRender.Poses );
  io_rApp
      .add_option( "--source", o_rRender.Sources,
                   "\"simulated\" or a recording (C3D, TRC, BVH, MOT, a folder of cameras)" )
      ->expected( 1, -1 )
      ->capture_default_str()
      ->type_name( "simulated|FILE" );
  AddOrdered( io_rApp, "--time", "The time in seconds; the nearest frame is taken", "S",
              [&o_rRender]( const std::string& i_rText )
              {
                return ReadNumber( i_rText, 0, 1e9, "expected seconds from 0", o_rRender.Time );
              } );
  AddOrdered( io_rApp, "--size", "The size of the view in its own pixels", "WxH",
              [&o_rRender]( const std::string& i_rText )
              {
                return ReadSize( i_rText, o_rRender );
              } );
  AddOrdered( io_rApp, "--ratio", "Device pixels for each pixel of the view", "R",
              [&o_rRender]( const std::string& i_rText )
              {
                return ReadNumber( i_rText, 0.5, 4, "expected a number from 0.5 to 4", o_rRender.Ratio );
              } );
  io_rApp.add_option( "--output", o_rRender.Output, "Write the picture there" )->type_name( "FILE.png" );
  io_rApp.add_option( "--report", o_rRender.Report, "Write the report there; it goes to stdout when neither is given" )
      ->type_name( "FILE.json" );
  io_rApp.add_flag( "--all", o_rRender.bAll, "Render every kind of window into the folder of --output-dir" );
  io_rApp.add_option( "--output-dir", o_rRender.OutputDir, "The folder of --all" )
      ->type_name( "DIR" )
      ->capture_default_str();
  AddActions( io_rApp, o_rRender );
}

std::string OneLine( std::string i_Text )
{
  for ( char& rLetter : i_Text )
  {
    if ( rLetter == '\n' )
    {
      rLetter = ' ';
    }
  }
  return i_Text;
}

/// What the options alone cannot say.
std::string CheckTogether( const VCommandLine& i_rLine )
{
  if ( i_rLine.Mode != EProgramMode::Render )
  {
    return {};
  }
  if ( i_rLine.Render.Sources.size() > 1 )
  {
    return "render: one source at a time; run the program once for each recording";
  }
  if ( i_rLine.Render.bAll && !( i_rLine.Render.Output.empty() && i_rLine.Render.Report.empty() ) )
  {
    return "render: --all writes into --output-dir and takes no --output and no --report";
  }
  return {};
}
} // namespace

VParseResult ParseCommandLine( int i_Count, const char* const* i_ppArguments, VCommandLine& o_rLine )
{
  CLI::App App(
      "harrow shows motion-capture data: a simulated capture, or recordings (C3D, TRC, BVH, MOT, folders of what "
      "cameras saw).\n"
      "Without a subcommand it opens a window with a 3D view of the simulated capture.",
      "harrow" );
  App.set_version_flag( "--version", "harrow 1.0.0" );
  App.set_help_all_flag( "--help-all", "Print the help of every subcommand" );
  App.footer( pFooter );
  App.require_subcommand( 0, 1 );
  AddCommon( App, o_rLine.Common );

  CLI::App& rOpen = *App.add_subcommand( "open", "Open recordings in a window" );
  rOpen.add_option( "files", o_rLine.Files, "The recordings" )->required()->type_name( "FILE" );
  CLI::App& rRender = *App.add_subcommand( "render", "Draw one view into a PNG file, without a window" );
  AddRender( rRender, o_rLine.Render );
  CLI::App& rInfo = *App.add_subcommand( "info", "Print what recordings hold" );
  rInfo.add_option( "files", o_rLine.Files, "The recordings" )->required()->type_name( "FILE" );
  rInfo.add_flag( "--json", o_rLine.bJson, "As JSON" );
  CLI::App& rInspect = *App.add_subcommand( "inspect", "Print what the program makes of a file, as JSON" );
  rInspect.require_subcommand( 1 );
  CLI::App& rCameras = *rInspect.add_subcommand( "cameras", "Of calibrations: the model of each camera" );
  rCameras.add_option( "files", o_rLine.Files, "Camera calibrations (TOML, JSON)" )->required()->type_name( "FILE" );
  for ( CLI::App* pSub : { &rOpen, &rRender, &rInfo, &rInspect, &rCameras } )
  {
    pSub->fallthrough();
    pSub->footer( "The options of \"harrow --help\" hold here too." );
  }

  VParseResult Result;
  try
  {
    App.parse( i_Count, i_ppArguments );
  }
  catch ( const CLI::ParseError& rError )
  {
    std::ostringstream Output;
    std::ostringstream Error;
    const bool bGood = App.exit( rError, Output, Error ) == 0;
    Result.Exit = bGood ? EExitOk : EExitUsage;
    Result.Output = Output.str();
    Result.Error = bGood ? std::string() : OneLine( rError.what() );
    return Result;
  }
  o_rLine.Mode = rOpen.parsed()      ? EProgramMode::Open
                 : rRender.parsed()  ? EProgramMode::Render
                 : rInfo.parsed()    ? EProgramMode::Info
                 : rCameras.parsed() ? EProgramMode::InspectCameras
                                     : EProgramMode::Window;
  Result.Error = CheckTogether( o_rLine );
  if ( !Result.Error.empty() )
  {
    Result.Exit = EExitUsage;
  }
  return Result;
}

} // namespace HostWindow

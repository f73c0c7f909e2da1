#pragma once

#include <HostWindow/CommandLine.h>

#include <string>

namespace HostWindow
{

/// How a run without a window ended. The message is one line, for stderr.
struct VRunResult
{
  int Exit = EExitOk;
  std::string Message;
};

/// Draws one view, does to it what was asked, and writes the picture and the report. With --all, every window that
/// exists goes to PNG files in the folder, and their names to stdout. Needs the application object.
VRunResult RunRender( const VCommonOptions& i_rCommon, const VRenderOptions& i_rRender );

/// Prints what each recording holds to stdout. Needs no application object. All files are tried.
VRunResult RunInfo( const std::vector< std::string >& i_rFiles, bool i_bJson,
                    const HostSources::VReadOptions& i_rReading );

/// Prints the cameras of each calibration, with the models that views draw them with, to stdout as JSON. Needs no
/// application object. All files are tried.
VRunResult RunInspectCameras( const std::vector< std::string >& i_rFiles );

} // namespace HostWindow

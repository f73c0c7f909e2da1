#pragma once

#include <HostWindow/ViewAction.h>

#include <HostSources/IFrameSource.h>
#include <HostSources/VReadOptions.h>
#include <HostSources/VSimulatedCapture.h>

#include <cstdint>
#include <filesystem>
#include <optional>
#include <string>
#include <vector>

namespace HostWindow
{

/// What the program ends with.
enum EExit : int
{
  EExitOk = 0,
  EExitUsage = 2,
  EExitPlugin = 3,
  EExitDisplay = 4,
  EExitFile = 5
};

enum class EProgramMode
{
  Window,
  Open,
  Render,
  Info,
  InspectCameras
};

/// What holds for every mode.
struct VCommonOptions
{
  std::filesystem::path Plugin; ///< empty: the module that lies beside the program
  std::filesystem::path ContentRoot;
  std::string Profile = "subjects";
  std::optional< std::uint32_t > Flags; ///< overrules the profile
  bool bDeveloper = false;
  bool bCoreProfile = true;
  int LogLevel = 3;
  std::optional< HostSources::EUpAxis > Up;
  HostSources::VSimulatedCaptureOptions Simulated;
  HostSources::VReadOptions Reading; ///< how recordings are read
};

/// Which poses the subjects of a view of subjects stand in; those of one kind in place of those of all.
struct VPoseOptions
{
  std::optional< int > All, Labelling, Solving;

  bool IsSet() const { return All || Labelling || Solving; }
};

struct VRenderOptions
{
  std::string Window = "3d";
  std::vector< std::string > Sources{ "simulated" };
  double Time = 0; ///< s
  int Width = 1280;
  int Height = 720;
  double Ratio = 1;
  VPoseOptions Poses;
  std::vector< VViewAction > Actions; ///< in the order given
  std::filesystem::path Output;
  std::filesystem::path Report;
  bool bAll = false;
  std::filesystem::path OutputDir = "output";
};

struct VCommandLine
{
  EProgramMode Mode = EProgramMode::Window;
  VCommonOptions Common;
  VRenderOptions Render;
  std::vector< std::string > Files; ///< of `open`, `info` and `inspect`
  bool bJson = false;
};

/// How the reading of a command line ended.
struct VParseResult
{
  std::optional< int > Exit; ///< set when the program has nothing more to do
  std::string Output;        ///< for stdout
  std::string Error;         ///< for stderr, one line
};

VParseResult ParseCommandLine( int i_Count, const char* const* i_ppArguments, VCommandLine& o_rLine );

} // namespace HostWindow

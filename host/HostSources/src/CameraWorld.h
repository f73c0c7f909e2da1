#pragma once

#include <HostSources/VRecording.h>

#include <array>
#include <string>

namespace HostSources
{

/// A turn by quarters: world axis i is the points' axis `From[i]` times `Sign[i]`.
struct VAxisTurn
{
  std::array< int, 3 > From{ 0, 1, 2 };
  std::array< int, 3 > Sign{ 1, 1, 1 };

  /// Such as "zxy" or "x-zy".
  std::string Text() const;
  bool IsNone() const { return Text() == "xyz"; }
  /// False for a text that names no turn; a mirror is none.
  static bool Parse( const std::string& i_rText, VAxisTurn& o_rTurn );
};

/// The turn that brings the projected points nearest to the detections, and the mean distances of that turn and of the
/// second best, px. False without any detection of a known point in a calibrated camera.
bool FindAxisTurn( const VRecording& i_rRecording, VAxisTurn& o_rTurn, double& o_rDistance, double& o_rSecond );

/// Turns points and force plates; their bounds are found anew.
void TurnRecording( const VAxisTurn& i_rTurn, VRecording& io_rRecording );

/// Leaves the points of a frame to the one person nearest to their projections, in each camera. Without a calibration
/// they stay with a person that is alone.
void ChoosePersons( VRecording& io_rRecording );

/// Fills the distances of each camera, and the cameras that saw each point where they are few enough for the masks.
void MeasureDistances( VRecording& io_rRecording );

} // namespace HostSources

#pragma once

#include <QtCore/QObject>

namespace MoxelGraphics
{
Q_NAMESPACE

/// What the free camera of a view follows.
enum ETracking
{
  ETrackNone = 0,
  ETrackCurrent = 1,   ///< the objects that were selected when tracking began
  ETrackSelection = 2, ///< whatever is selected now
  ELockCurrent = 3     ///< rides on the pose of the object that was selected when tracking began
};
Q_ENUM_NS( ETracking )

/// How a view picks in a frame.
enum EPickMode
{
  EPickNone = 0,
  EPickHover = 1,   ///< preselect what lies under the pointer
  EPickBand = 2,    ///< preselect what lies in the band that is being drawn
  EPickClick = 3,   ///< commit what lies under the pointer
  EPickBandDone = 4 ///< commit what lies in the band
};
Q_ENUM_NS( EPickMode )

} // namespace MoxelGraphics

#pragma once

#include <MoxelGraphics/VSceneFrame.h>
#include <MoxelGraphics/VSceneFramebufferObject.h>

#include <CoreGraphics/VCameraController.h>

namespace MoxelGraphics
{

/// What the item took from the renderer when they last met.
struct VSceneFramebufferObject::VSynced
{
  CoreGraphics::VCameraFields Camera;
  VFrameFigures Figures;
  QVariantMap Gl;
  QString Notice;
  std::uint64_t Serial = 0; ///< of the last pick taken
  ZEK::VSelection Selection;
  std::vector< std::string > Labels;
  bool bPreselected = false; ///< the selection and labels above are those of a preselection that was posted
  int Unanswered = 0;        ///< meetings since a commit was asked for
  ETracking Tracking = ETrackNone;
};

} // namespace MoxelGraphics

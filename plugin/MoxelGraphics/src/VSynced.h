#pragma once

#include "VGestures.h"
#include "VOverlay.h"

#include <MoxelGraphics/VSceneFrame.h>
#include <MoxelGraphics/VSceneFramebufferObject.h>

#include <CoreGraphics/VCameraController.h>

namespace MoxelGraphics
{

/// What the item took from the renderer when they last met, and what it has for the next time.
struct VSceneFramebufferObject::VSynced
{
  std::vector< VGesture > Gestures; ///< since the last meeting, in their order
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
  bool bFitUnderWay = false; ///< a renderer was asked to frame the selection and may not have done so yet
  VOverlay Overlay;
  bool bOverlayPosted = false;
  static constexpr std::uint64_t NoGeneration = ~std::uint64_t( 0 );
  std::uint64_t CameraGeneration = NoGeneration; ///< of the definitions that the grid was given
  VCameraTilesRef Tiles;                         ///< of the last frame, and what it was drawn with
  int FrameHeight = 0;
  double PixelRatio = 1.0;
  std::vector< ZEK::VSelectionItem > SubjectKeys; ///< of the subject objects; GUI side
};

} // namespace MoxelGraphics

#pragma once

#include <QtCore/QEvent>

#include <memory>

namespace CoreGraphics
{
class VCameraController;
}

namespace MoxelGraphics
{

/// One thing that a hand did to a camera. Events are copied: what Qt delivers ends with its delivery.
struct VGesture
{
  enum EKind
  {
    EPress,
    EMove,
    ERelease,
    EWheel,
    EKey,
    EViewType
  };

  EKind Kind = EMove;
  int Value = 0;                    ///< the key, or the view type
  double Ratio = 1.0;               ///< device pixels for each item pixel
  std::unique_ptr< QEvent > pEvent; ///< of the mouse or its wheel
};

/// Does it to a camera. True when it meant something there.
bool Perform( const VGesture& i_rGesture, CoreGraphics::VCameraController& io_rCamera );

} // namespace MoxelGraphics

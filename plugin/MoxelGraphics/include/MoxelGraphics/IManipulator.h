#pragma once

#include <memory>

class QMouseEvent;

namespace CoreGraphics
{
class VCameraController;
}

namespace MoxelGraphics
{

/// Handles in the world that take the mouse before the camera does.
///
/// Thread: GUI. What it draws is drawn on the render thread, so an implementation guards what both sides touch.
class IManipulator
{
public:
  virtual ~IManipulator() = default;
  /// One that is not shown is asked nothing else.
  virtual bool IsShown() const = 0;
  /// True from a press that it took until the mouse is let go; hovering then selects nothing.
  virtual bool IsGrabbed() const = 0;
  /// Whether it wants that press. What is said yes to is followed by `Press`, once the handles under the pointer were
  /// made the selection of its kind. `i_rCamera` is the camera as the mouse last left it; the event is in item
  /// pixels, with `i_Ratio` device pixels for each of them.
  virtual bool TakesPress( const QMouseEvent& i_rEvent, const CoreGraphics::VCameraController& i_rCamera,
                           double i_Ratio ) = 0;
  virtual void Press( const QMouseEvent& i_rEvent, const CoreGraphics::VCameraController& i_rCamera,
                      double i_Ratio ) = 0;
  /// True when nobody else is to see the event; so with `Release`.
  virtual bool Move( const QMouseEvent& i_rEvent, const CoreGraphics::VCameraController& i_rCamera,
                     double i_Ratio ) = 0;
  virtual bool Release( const QMouseEvent& i_rEvent, const CoreGraphics::VCameraController& i_rCamera,
                        double i_Ratio ) = 0;
  /// The mouse was taken away in the middle of a gesture.
  virtual void LetGo() = 0;
};

/// The manipulators of a scene in the order in which they are asked; each may be null.
struct VManipulators
{
  std::shared_ptr< IManipulator > pObject;
  std::shared_ptr< IManipulator > pVolume;
  std::shared_ptr< IManipulator > pHotspot;
};

/// What a scene that has manipulators derives from. Thread: render thread; each view takes them over when it meets
/// its renderer.
class IManipulatorSource
{
public:
  virtual ~IManipulatorSource() = default;
  virtual VManipulators Manipulators() const = 0;
};

} // namespace MoxelGraphics

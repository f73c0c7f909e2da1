#include "VGestures.h"

#include <CoreGraphics/VCameraController.h>

#include <QtGui/QMouseEvent>
#include <QtGui/QWheelEvent>

namespace MoxelGraphics
{

bool Perform( const VGesture& i_rGesture, CoreGraphics::VCameraController& io_rCamera )
{
  const auto Mouse = [&]() -> const QMouseEvent&
  {
    return static_cast< const QMouseEvent& >( *i_rGesture.pEvent );
  };
  switch ( i_rGesture.Kind )
  {
  case VGesture::EPress:
    io_rCamera.OnMousePress( Mouse(), i_rGesture.Ratio );
    return true;
  case VGesture::EMove:
    io_rCamera.OnMouseMove( Mouse(), i_rGesture.Ratio );
    return true;
  case VGesture::ERelease:
    io_rCamera.OnMouseRelease( Mouse(), i_rGesture.Ratio );
    return true;
  case VGesture::EWheel:
    io_rCamera.OnWheel( static_cast< const QWheelEvent& >( *i_rGesture.pEvent ) );
    return true;
  case VGesture::EKey:
    return io_rCamera.OnKeyPress( i_rGesture.Value );
  case VGesture::EViewType:
    io_rCamera.SetViewType( i_rGesture.Value );
    return true;
  }
  return false;
}

} // namespace MoxelGraphics

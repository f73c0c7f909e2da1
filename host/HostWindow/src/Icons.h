#pragma once

#include <QtGui/QIcon>

namespace HostWindow
{

enum class EIcon
{
  Play,
  Pause,
  StepBack,
  StepForward,
  First,
  Last,
  Loop,
  Live,
  Reset
};

/// Drawn in the colour of the text, so that they fit every theme and ratio.
QIcon MakeIcon( EIcon i_Icon, const QColor& i_rColour );

} // namespace HostWindow

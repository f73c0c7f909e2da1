#pragma once

#include <QtCore/QPointF>
#include <QtCore/QString>
#include <QtCore/QVariant>
#include <QtCore/Qt>

#include <string>
#include <variant>

namespace HostWindow
{

/// A press and release of the left button, or two of them.
struct VClickAction
{
  QPointF At;
  bool bDouble = false;
};

/// A rectangle drawn with the gesture of selection.
struct VBandAction
{
  QPointF From;
  QPointF To;
};

/// The pointer moves there with no button down.
struct VHoverAction
{
  QPointF At;
};

/// A drag with buttons down, as for orbit, pan and zoom.
struct VDragAction
{
  QPointF From;
  QPointF To;
  Qt::MouseButtons Buttons = Qt::LeftButton;
};

struct VWheelAction
{
  QPointF At;
  int Delta = 120; ///< eighths of a degree; positive is away from the user
};

struct VKeyAction
{
  Qt::Key Key = Qt::Key_unknown;
};

/// A view type by its name.
struct VViewTypeAction
{
  int Index = 0;
};

/// An option of the scene.
struct VSetAction
{
  QString Key;
  QVariant Value;
};

/// Something is selected by the text that the report writes for it; the modifiers say what that does to the selection.
struct VSelectAction
{
  std::string Item; ///< empty: nothing stays selected
};

/// A command of the window.
struct VCommandAction
{
  std::string Text;
};

/// One thing done to a view. Points are item pixels from the top left.
struct VViewAction
{
  using VWhat = std::variant< VClickAction, VBandAction, VHoverAction, VDragAction, VWheelAction, VKeyAction,
                              VViewTypeAction, VSetAction, VSelectAction, VCommandAction >;
  VWhat What;
  Qt::KeyboardModifiers Modifiers = Qt::NoModifier;
  std::string Option; ///< such as "--click"
  std::string Text;   ///< as it was written
};

/// The names of the view types, by their index.
const QStringList& ViewTypeNames();

/// Reads the value of one of the options "--click", "--double-click", "--band", "--hover", "--drag", "--wheel",
/// "--key", "--view", "--set", "--select", "--tracking" and "--command". An empty text means success, anything else
/// says what is wrong with the value.
std::string ParseViewAction( const std::string& i_rOption, const std::string& i_rText, VViewAction& o_rAction );

/// Reads a list such as "shift,ctrl"; "none" is the empty set. An empty text means success.
std::string ParseModifiers( const std::string& i_rText, Qt::KeyboardModifiers& o_rModifiers );

} // namespace HostWindow

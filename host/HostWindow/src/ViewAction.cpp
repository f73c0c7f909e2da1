#include <HostWindow/ViewAction.h>

#include <QtCore/QStringList>
#include <QtGui/QKeySequence>

#include <array>
#include <cmath>

namespace HostWindow
{
namespace
{
/// Numbers between commas; false unless there are exactly that many and all are finite.
template < std::size_t N >
bool ReadNumbers( const QStringList& i_rParts, std::array< double, N >& o_rNumbers )
{
  if ( i_rParts.size() != static_cast< qsizetype >( N ) )
  {
    return false;
  }
  for ( std::size_t i = 0; i < N; ++i )
  {
    bool bOk = false;
    o_rNumbers[i] = i_rParts[static_cast< qsizetype >( i )].trimmed().toDouble( &bOk );
    if ( !bOk || !std::isfinite( o_rNumbers[i] ) )
    {
      return false;
    }
  }
  return true;
}

bool ReadButtons( const QString& i_rText, Qt::MouseButtons& o_rButtons )
{
  o_rButtons = Qt::NoButton;
  for ( const QString& rName : i_rText.split( '+' ) )
  {
    const QString Name = rName.trimmed().toLower();
    if ( Name == "left" )
    {
      o_rButtons |= Qt::LeftButton;
    }
    else if ( Name == "right" )
    {
      o_rButtons |= Qt::RightButton;
    }
    else if ( Name == "middle" )
    {
      o_rButtons |= Qt::MiddleButton;
    }
    else
    {
      return false;
    }
  }
  return o_rButtons != Qt::NoButton;
}

std::string ParseDrag( QStringList i_Parts, VViewAction::VWhat& o_rWhat )
{
  VDragAction Drag;
  if ( i_Parts.size() == 5 && !ReadButtons( i_Parts.takeLast(), Drag.Buttons ) )
  {
    return "the buttons are left, right and middle, joined by \"+\"";
  }
  std::array< double, 4 > N{};
  if ( !ReadNumbers( i_Parts, N ) )
  {
    return "expected X0,Y0,X1,Y1 or X0,Y0,X1,Y1,BUTTONS";
  }
  Drag.From = { N[0], N[1] };
  Drag.To = { N[2], N[3] };
  o_rWhat = Drag;
  return {};
}

std::string ParseKey( const QString& i_rText, VViewAction::VWhat& o_rWhat )
{
  const QKeySequence Sequence = QKeySequence::fromString( i_rText, QKeySequence::PortableText );
  if ( Sequence.count() != 1 || Sequence[0].key() == Qt::Key_unknown ||
       Sequence[0].keyboardModifiers() != Qt::NoModifier )
  {
    return "no key has that name; examples are Home, Space, F and Left";
  }
  o_rWhat = VKeyAction{ Sequence[0].key() };
  return {};
}

std::string ParseSetting( const QString& i_rText, VViewAction::VWhat& o_rWhat )
{
  const qsizetype Equals = i_rText.indexOf( '=' );
  if ( Equals < 1 )
  {
    return "expected KEY=VALUE";
  }
  const QString Text = i_rText.mid( Equals + 1 );
  VSetAction Set{ i_rText.left( Equals ), Text };
  bool bInteger = false;
  bool bNumber = false;
  const int Integer = Text.toInt( &bInteger );
  const double Number = Text.toDouble( &bNumber );
  if ( Text == "true" || Text == "false" )
  {
    Set.Value = Text == "true";
  }
  else if ( bInteger )
  {
    Set.Value = Integer;
  }
  else if ( bNumber && std::isfinite( Number ) )
  {
    Set.Value = Number;
  }
  o_rWhat = Set;
  return {};
}

std::string ParseView( const QString& i_rText, VViewAction::VWhat& o_rWhat )
{
  for ( qsizetype i = 0; i < ViewTypeNames().size(); ++i )
  {
    if ( ViewTypeNames()[i].compare( i_rText, Qt::CaseInsensitive ) == 0 )
    {
      o_rWhat = VViewTypeAction{ static_cast< int >( i ) };
      return {};
    }
  }
  return "the views are " + ViewTypeNames().join( ", " ).toStdString();
}

std::string ParseTracking( const QString& i_rText, VViewAction::VWhat& o_rWhat )
{
  struct VRow
  {
    const char* pName;
    const char* pCommand;
  };
  static constexpr VRow Rows[] = { { "none", "Workspace3d:NoTracking" },
                                   { "selection", "Workspace3d:TrackSelection" },
                                   { "objects", "Workspace3d:TrackObjects" },
                                   { "lock", "Workspace3d:TrackingLock" } };
  for ( const VRow& rRow : Rows )
  {
    if ( i_rText.compare( QLatin1String( rRow.pName ), Qt::CaseInsensitive ) == 0 )
    {
      o_rWhat = VCommandAction{ rRow.pCommand };
      return {};
    }
  }
  return "a view tracks none, selection or objects, or is locked: lock";
}

std::string ParsePoints( const std::string& i_rOption, const QStringList& i_rParts, VViewAction::VWhat& o_rWhat )
{
  if ( i_rOption == "--band" )
  {
    std::array< double, 4 > N{};
    if ( !ReadNumbers( i_rParts, N ) )
    {
      return "expected X0,Y0,X1,Y1";
    }
    o_rWhat = VBandAction{ { N[0], N[1] }, { N[2], N[3] } };
    return {};
  }
  if ( i_rOption == "--wheel" )
  {
    std::array< double, 3 > N{};
    if ( !ReadNumbers( i_rParts, N ) || std::abs( N[2] ) > 1e6 )
    {
      return "expected X,Y,DELTA";
    }
    o_rWhat = VWheelAction{ { N[0], N[1] }, static_cast< int >( std::lround( N[2] ) ) };
    return {};
  }
  std::array< double, 2 > N{};
  if ( !ReadNumbers( i_rParts, N ) )
  {
    return "expected X,Y";
  }
  if ( i_rOption == "--hover" )
  {
    o_rWhat = VHoverAction{ { N[0], N[1] } };
  }
  else
  {
    o_rWhat = VClickAction{ { N[0], N[1] }, i_rOption == "--double-click" };
  }
  return {};
}
} // namespace

const QStringList& ViewTypeNames()
{
  static const QStringList Names{ "Perspective", "Front", "Back", "Left", "Right", "Top", "Bottom" };
  return Names;
}

std::string ParseViewAction( const std::string& i_rOption, const std::string& i_rText, VViewAction& o_rAction )
{
  o_rAction.Option = i_rOption;
  o_rAction.Text = i_rText;
  const QString Text = QString::fromStdString( i_rText );
  if ( i_rOption == "--key" )
  {
    return ParseKey( Text, o_rAction.What );
  }
  if ( i_rOption == "--view" )
  {
    return ParseView( Text, o_rAction.What );
  }
  if ( i_rOption == "--set" )
  {
    return ParseSetting( Text, o_rAction.What );
  }
  if ( i_rOption == "--tracking" )
  {
    return ParseTracking( Text, o_rAction.What );
  }
  if ( i_rOption == "--select" )
  {
    o_rAction.What = VSelectAction{ i_rText };
    return {};
  }
  if ( i_rOption == "--command" )
  {
    o_rAction.What = VCommandAction{ i_rText };
    return {};
  }
  if ( i_rOption == "--drag" )
  {
    return ParseDrag( Text.split( ',' ), o_rAction.What );
  }
  return ParsePoints( i_rOption, Text.split( ',' ), o_rAction.What );
}

std::string ParseModifiers( const std::string& i_rText, Qt::KeyboardModifiers& o_rModifiers )
{
  Qt::KeyboardModifiers Modifiers = Qt::NoModifier;
  for ( const QString& rName : QString::fromStdString( i_rText ).split( ',' ) )
  {
    const QString Name = rName.trimmed().toLower();
    if ( Name == "shift" )
    {
      Modifiers |= Qt::ShiftModifier;
    }
    else if ( Name == "ctrl" || Name == "control" )
    {
      Modifiers |= Qt::ControlModifier;
    }
    else if ( Name == "alt" )
    {
      Modifiers |= Qt::AltModifier;
    }
    else if ( Name != "none" )
    {
      return "the modifiers are shift, ctrl, alt and none, joined by commas";
    }
  }
  o_rModifiers = Modifiers;
  return {};
}

} // namespace HostWindow

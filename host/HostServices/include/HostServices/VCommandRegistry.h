#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

#include <QtCore/QStringList>

namespace HostServices
{

/// A command that a key can call.
struct VKeyedCommand
{
  QString Group;
  QString Text;
  QString DefaultKey; ///< as QKeySequence reads it; may be empty
  std::function< void() > Callback;

  /// The text that runs it, such as "Workspace3d:Toggle Object Manipulator".
  QString Name() const { return Group + QLatin1Char( ':' ) + Text; }
};

/// An entry of the menu bar.
struct VMenuAction
{
  std::vector< QString > Path; ///< menus from the bar down, then the entry; "&" marks the mnemonic
  std::vector< QString > Icons;
  QString ToolTip;
  std::function< void() > Callback;

  /// The text that runs it: the path without mnemonics, joined by "/", such as "Developer/Reload Shaders".
  QString Name() const;
};

/// Commands and menu entries as data: a main window turns them into menus and shortcuts, a command box and the
/// command line run them by name. An entry whose name exists replaces that one, in its place. Thread: GUI.
class VCommandRegistry final : public HarrowPluginInterface::ICommandRegistry
{
public:
  VCommandRegistry();
  ~VCommandRegistry() override;

  /// Entries without a path or a callback are refused with a log line of level 3.
  void AddAction( const std::vector< QString >& i_rMenuPath, std::function< void() > i_Callback,
                  const std::vector< QString >& i_rIcons, const QString& i_rToolTip ) override;
  std::shared_ptr< HarrowPluginInterface::IKeyedCommands > KeyedCommands() const override;

  const std::vector< VMenuAction >& Actions() const { return m_Actions; }
  const std::vector< VKeyedCommand >& Commands() const;
  /// Fires when entries are added, replaced or removed.
  ZEK::IMultiCallback< void() >& Changed();
  /// Runs the command or menu entry of that name; false when there is none.
  bool Execute( const QString& i_rName );
  /// The names that `Execute` takes, commands first.
  QStringList Names() const;
  void Clear();

private:
  class VKeyed;
  std::shared_ptr< VKeyed > m_pKeyed;
  std::vector< VMenuAction > m_Actions;
};

} // namespace HostServices

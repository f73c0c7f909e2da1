#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

#include <QtGui/QPalette>

namespace HostServices
{

/// The one QML engine, and a calm dark theme. Warnings of the engine go to the log's category "Qml" at level 3, each
/// text once. Thread: GUI.
class VQuickHost final : public HarrowPluginInterface::IHarrowQuickHost
{
public:
  VQuickHost();
  ~VQuickHost() override;

  /// Null after `Shutdown`.
  QQmlEngine* Engine() const override;
  QColor ThemeColour( EThemeColour i_Colour ) const override;
  ZEK::IMultiCallback< void() >& ThemeChanged() override { return m_ThemeChanged; }

  void SetThemeColour( EThemeColour i_Colour, const QColor& i_rValue );
  /// The theme for widgets.
  QPalette Palette() const;
  /// Deletes the engine; every document must be gone. A reference that a plug-in still holds stays harmless.
  void Shutdown();

private:
  struct VState;
  std::unique_ptr< VState > m_pState;
  QColor m_Colours[4];
  ZEK::VMultiCallback< void() > m_ThemeChanged;
};

} // namespace HostServices

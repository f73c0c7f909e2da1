#pragma once

#include <HarrowGraphics/VQMLSceneWidget.h>
#include <HarrowPluginInterface/IWorkspaceContent.h>

#include <QtCore/QPointer>

class QComboBox;

namespace HarrowGraphics
{

/// One scene window: the view, the tools that it puts into the host's toolbar, and its saved state. Thread: GUI.
class VSceneWindowContent : public HarrowPluginInterface::VWindowFrameContent,
                            public HarrowPluginInterface::IHarrowWindowPersist,
                            public HarrowPluginInterface::IHarrowExecuteCommand
{
  Q_OBJECT

public:
  VSceneWindowContent( std::string i_Name, const QPointer< QWidget >& i_rpToolbar, VSceneWidgetArguments i_Arguments );
  ~VSceneWindowContent() override;

  void SaveState( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& i_rPrefix ) override;
  void RestoreState( const HarrowPluginInterface::IStateReader& i_rReader, const QString& i_rPrefix ) override;
  bool ExecuteCommand( const std::string& i_rText ) override;

  VQMLSceneWidget& SceneWidget() { return *m_pWidget; }

private:
  void FillToolbar( QWidget& io_rToolbar );

  std::string m_Name;
  EWindowKind m_Kind;
  VQMLSceneWidget* m_pWidget; ///< a child widget
  QPointer< QComboBox > m_pCameraType;
};

} // namespace HarrowGraphics

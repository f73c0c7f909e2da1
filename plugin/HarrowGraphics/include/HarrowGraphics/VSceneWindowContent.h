#pragma once

#include <HarrowGraphics/VQMLSceneWidget.h>
#include <HarrowPluginInterface/IWorkspaceContent.h>

#include <QtCore/QList>
#include <QtCore/QPointer>

class QComboBox;
class QPushButton;

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
  void AddCameraTypes( QWidget& io_rToolbar );
  void AddCameraTools( QWidget& io_rToolbar );
  void AddPoses( QWidget& io_rToolbar );
  void ShowPoses();
  QPushButton* AddButton( QWidget& io_rToolbar, const QString& i_rName, const QString& i_rText );
  void UpdateMaskButtons();
  void SaveCameras( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& i_rPrefix );
  void RestoreCameras( const HarrowPluginInterface::IStateReader& i_rReader, const QString& i_rPrefix );

  std::string m_Name;
  EWindowKind m_Kind;
  bool m_bChoosesPoses;
  VQMLSceneWidget* m_pWidget;           ///< a child widget
  QList< QPointer< QWidget > > m_Tools; ///< in the host's toolbar
  QPointer< QComboBox > m_pPose;
  QPointer< QPushButton > m_pPin;
  QPointer< QPushButton > m_pMaskPaint;
  QPointer< QPushButton > m_pMaskErase;
  QPointer< QPushButton > m_pMaskEraseAll;
};

} // namespace HarrowGraphics

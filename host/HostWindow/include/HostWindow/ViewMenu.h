#pragma once

#include <QtCore/QVariantMap>
#include <QtGui/QActionGroup>
#include <QtWidgets/QMenu>

#include <functional>
#include <utility>

namespace HostWindow
{
class VWorkspaceDock;

/// The part of the View menu that is about the active view: from where it looks, what its camera follows and what it
/// shows. A view of the scene and a view of cameras have entries of their own, and the keys of those that are not shown
/// do nothing. The checks tell the true state of the view; without a view everything is disabled. Thread: GUI.
class VViewMenu : public QMenu
{
  Q_OBJECT

public:
  VViewMenu( const QString& i_rTitle, std::function< VWorkspaceDock*() > i_ActiveDock, QWidget* i_pParent );

  /// To be called when the active view is another one: shortcuts work without the menu being opened.
  void Refresh();

signals:
  /// What was chosen could not be done; a sentence says why.
  void Refused( const QString& i_rWhy );

private:
  struct VToggle
  {
    QAction* pAction;
    QString Key;
    QVariant On;
    QVariant Off;
  };

  /// A choice of several settings at once.
  struct VChoice
  {
    QAction* pAction;
    QVariantMap Options;
  };

  void AddViewTypes();
  void AddCamera();
  void AddTracking();
  void AddToggles();
  void AddNames();
  void AddChoices( const QString& i_rTitle, const QList< std::pair< QString, QVariantMap > >& i_rChoices );
  void AddCameraToggles();
  void AddCentroidColours();
  void AddToggle( const QString& i_rText, const QKeySequence& i_rKey, const QString& i_rOption, QVariant i_On = true,
                  QVariant i_Off = false );
  QAction* AddCommand( const QString& i_rText, const QKeySequence& i_rKey, const char* i_pCommand,
                       const QString& i_rRefusal );
  void Run( const char* i_pCommand, const QString& i_rRefusal );
  void Toggle( const VToggle& i_rToggle );
  void Choose( const VChoice& i_rChoice );
  void ShowFor( bool i_bCameraView );
  void ShowConditions( bool i_bExact );

  std::function< VWorkspaceDock*() > m_ActiveDock;
  QActionGroup m_ViewTypes;
  QActionGroup m_Tracking;
  QActionGroup m_CentroidColours; ///< in the order of the option's values
  QList< QAction* > m_For3D;      ///< shown for a view of the scene only
  QList< QAction* > m_ForCameras; ///< shown for a view of cameras only
  QList< QAction* > m_ForView;    ///< need a view
  QList< VToggle > m_Toggles;
  QList< VChoice > m_Choices;
  QList< QAction* > m_ForBounds; ///< need something selected that has a place
  QAction* m_pLock = nullptr;
};

} // namespace HostWindow

#pragma once

#include <HostWindow/SceneView.h>
#include <HostWindow/Session.h>

#include <HarrowPluginInterface/IWorkspaceContent.h>

#include <QtCore/QJsonObject>
#include <QtWidgets/QDockWidget>
#include <QtWidgets/QVBoxLayout>

namespace HostWindow
{

/// One workspace window: the content that a plug-in made, with its toolbar above it.
///
/// It holds the content by the shared reference alone, never as a Qt child at the time of its end, so that closing it
/// while states arrive frees each object once. Thread: GUI.
class VWorkspaceDock : public QDockWidget
{
  Q_OBJECT

public:
  VWorkspaceDock( VSession& i_rSession, std::string i_Kind, QWidget* i_pParent = nullptr );
  ~VWorkspaceDock() override;

  const std::string& Kind() const { return m_Kind; }
  const std::string& ContextName() const { return m_ContextName; }
  VSceneView View() const { return VSceneView( m_pContent.get() ); }
  /// Makes the content anew on the session's context of now; what the user set up in the window stays.
  void Rebuild();
  /// Through the toolbar's own list where there is one, so that it shows the choice.
  void SetViewType( int i_Index );

  /// A content that nobody sees draws nothing.
  void SetSeen( bool i_bSeen );

  QJsonObject SaveState() const;
  void RestoreState( const QJsonObject& i_rState );

signals:
  void Closed( VWorkspaceDock* i_pDock );
  void Activated( VWorkspaceDock* i_pDock );

protected:
  void closeEvent( QCloseEvent* io_pEvent ) override;
  bool eventFilter( QObject* io_pObject, QEvent* io_pEvent ) override;

private:
  void DropContent();

  VSession& m_rSession;
  std::string m_Kind;
  std::string m_ContextName;
  QWidget* m_pInside = nullptr;
  QVBoxLayout* m_pLayout = nullptr;
  QPointer< QWidget > m_pToolbar;
  std::shared_ptr< HarrowPluginInterface::VWindowFrameContent > m_pContent;
};

} // namespace HostWindow

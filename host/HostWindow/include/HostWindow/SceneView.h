#pragma once

#include <QtCore/QPointer>
#include <QtCore/QStringList>
#include <QtCore/QVariant>
#include <QtQuick/QQuickItem>
#include <QtQuickWidgets/QQuickWidget>
#include <QtWidgets/QWidget>

namespace HostWindow
{

/// The scene view inside the content of a workspace window, reached through Qt's meta-object alone: the host knows no
/// class of the plug-in. Every operation is safe when the content is gone or its document failed to load. Thread: GUI.
class VSceneView
{
public:
  VSceneView() = default;
  explicit VSceneView( QWidget* i_pContent )
    : m_pContent( i_pContent )
  {
  }

  QQuickWidget* Widget() const;
  /// The item that draws the scene; null until the document is loaded, or when it has none.
  QQuickItem* Item() const;
  /// What went wrong with the document; empty when nothing did.
  QString LoadErrors() const;

  QStringList OptionKeys() const;
  QVariant Option( const QString& i_rKey ) const;
  /// False when the view has no such option.
  bool SetOption( const QString& i_rKey, const QVariant& i_rValue );

  void SetViewType( int i_Index );
  /// The index of the view type; -1 without a view.
  int ViewType() const;
  /// What the camera follows: 0 nothing, 1 what was selected, 2 the selection, 3 rides on an object; -1 without a view.
  int Tracking() const;
  /// Whether the view's camera can follow anything; true of a view that does not say.
  bool TrackingSupported() const;
  /// Whether what is selected has a place in the view, or a pose.
  bool SelectionHasBounds() const;
  bool SelectionHasPose() const;
  void FocusSelected();
  /// Runs a command of the window; false when it knows none of that text.
  bool ExecuteCommand( const std::string& i_rText );

  /// Which poses subjects stand in, of all or of those that are labelled or solved; without effect in other views.
  void SetPoses( int i_All, int i_Labelling, int i_Solving );
  void SetReporting( bool i_bOn );
  QVariantMap FrameReport() const;
  /// The tiles of a view of cameras with what they show; empty in other views.
  QVariantList CameraReport() const;
  /// The number of frames drawn so far.
  qint64 Frames() const;
  QString ToolTip() const;

private:
  QPointer< QWidget > m_pContent;
  mutable QPointer< QQuickWidget > m_pWidget;
  mutable QPointer< QQuickItem > m_pItem;
};

/// Those of `i_rNames` that look most like `i_rName`, for a message about a name that does not exist.
QStringList Nearest( const QString& i_rName, const QStringList& i_rNames, int i_Most = 3 );

} // namespace HostWindow

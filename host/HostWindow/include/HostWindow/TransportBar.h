#pragma once

#include <HostWindow/Session.h>

#include <QtWidgets/QComboBox>
#include <QtWidgets/QHBoxLayout>
#include <QtWidgets/QLabel>
#include <QtWidgets/QSlider>
#include <QtWidgets/QToolButton>
#include <QtWidgets/QWidget>

#include <functional>

namespace HostWindow
{

/// Play, pause, step, scrub, rate, loop and live, over the session's clock.
class VTransportBar : public QWidget
{
  Q_OBJECT

public:
  explicit VTransportBar( VSession& i_rSession, QWidget* i_pParent = nullptr );

  /// Without effect while live. At the end of what is played it begins again.
  void TogglePlay();
  void Step( int i_Frames );

private:
  QToolButton* AddButton( const char* i_pName, const QString& i_rToolTip, std::function< void() > i_OnClick );
  void AddMoves();
  void AddPosition();
  void AddModes();
  void ShowState();
  void ShowPosition();

  VSession& m_rSession;
  QHBoxLayout* m_pLayout = nullptr;
  QToolButton* m_pPlay = nullptr;
  QToolButton* m_pLoop = nullptr;
  QToolButton* m_pLive = nullptr;
  QSlider* m_pSlider = nullptr;
  QComboBox* m_pRate = nullptr;
  QLabel* m_pTime = nullptr;
  QLabel* m_pFrame = nullptr;
  std::vector< QWidget* > m_NeedRecording;
  QTimer m_LiveTimer; ///< while live the position is shown at the pace of eyes, not of frames
  ZEK::VConnection m_StateConnection;
  ZEK::VConnection m_FrameConnection;
};

/// Minutes, seconds and milliseconds, such as "0:02.430".
QString TimeText( double i_Seconds );

} // namespace HostWindow

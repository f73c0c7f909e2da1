#pragma once

#include <ZEK/Log.h>

#include <QtCore/QTimer>
#include <QtWidgets/QComboBox>
#include <QtWidgets/QDockWidget>
#include <QtWidgets/QLabel>
#include <QtWidgets/QPlainTextEdit>
#include <QtWidgets/QToolBar>

#include <memory>

namespace HostWindow
{

/// A strip with a message that waits until it is read and closed; the program goes on behind it.
class VMessageBar : public QToolBar
{
  Q_OBJECT

public:
  explicit VMessageBar( QWidget* i_pParent = nullptr );
  void ShowMessage( const QString& i_rText, bool i_bFailure );
  QString Text() const { return m_pText->text(); }

private:
  QLabel* m_pText = nullptr;
};

/// Shows the newest lines of the log. Costs nothing while it is closed.
class VLogPanel : public QDockWidget
{
  Q_OBJECT

public:
  explicit VLogPanel( std::shared_ptr< ZEK::VLogRing > i_pRing, QWidget* i_pParent = nullptr );

private:
  void Refresh( bool i_bAlways );

  std::shared_ptr< ZEK::VLogRing > m_pRing;
  QPlainTextEdit* m_pLines = nullptr;
  QComboBox* m_pLevel = nullptr;
  QTimer m_Timer;
  std::size_t m_Shown = 0;
};

} // namespace HostWindow

#pragma once

#include <QtCore/QObject>
#include <QtCore/QSocketNotifier>

#include <memory>

namespace HostWindow
{

/// While it lives, the signals that end a session (SIGTERM, SIGINT, SIGHUP) quit the application as its menu does:
/// windows close, and what is to be kept is saved. A second signal ends the program at once. Thread: GUI; one at a
/// time.
class VQuitSignals : public QObject
{
public:
  VQuitSignals();
  ~VQuitSignals() override;

private:
  void Quit();

  int m_Ends[2] = { -1, -1 };
  std::unique_ptr< QSocketNotifier > m_pNotifier;
};

} // namespace HostWindow

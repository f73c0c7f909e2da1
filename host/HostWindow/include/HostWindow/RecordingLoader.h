#pragma once

#include <HostSources/VReadOptions.h>
#include <HostSources/VRecording.h>
#include <ZEK/Callback.h>
#include <ZEK/Result.h>

#include <QtCore/QObject>
#include <QtCore/QString>

#include <atomic>
#include <memory>
#include <thread>

namespace HostWindow
{

/// Reads recordings on a thread of its own, one at a time. Thread: GUI; the signals come there too.
class VRecordingLoader : public QObject
{
  Q_OBJECT

public:
  explicit VRecordingLoader( std::shared_ptr< ZEK::IPostalService > i_pPostal, HostSources::VReadOptions i_Reading = {},
                             QObject* i_pParent = nullptr );
  ~VRecordingLoader() override;

  /// Begins to read; what is still being read is given up without a word.
  void Load( const QString& i_rPath );
  /// Gives up what is being read; `Failed` follows with the code `Canceled`.
  void Cancel();
  bool IsLoading() const { return m_pJob != nullptr; }

signals:
  void Progress( const QString& i_rPath, double i_Fraction );
  /// The message is empty unless something was odd about the file.
  void Loaded( const QString& i_rPath, std::shared_ptr< const HostSources::VRecording > i_pRecording,
               const QString& i_rMessage );
  void Failed( const QString& i_rPath, const QString& i_rMessage, quint32 i_Code );

private:
  struct VJob;
  void Finish( const std::shared_ptr< VJob >& i_rpJob );
  void Abandon();

  std::shared_ptr< ZEK::IPostalService > m_pPostal;
  HostSources::VReadOptions m_Reading;
  std::shared_ptr< VJob > m_pJob;
  std::thread m_Thread;
};

} // namespace HostWindow

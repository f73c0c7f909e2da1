#pragma once

#include <chrono>
#include <optional>

namespace HostServices
{

/// Says when a save of what changes is due. Without a clock or a thread of its own.
class VSaveSchedule
{
public:
  using VDuration = std::chrono::steady_clock::duration;
  using VTime = std::chrono::steady_clock::time_point;

  struct VDelays
  {
    VDuration AfterChange = std::chrono::seconds( 2 );
    VDuration AtMost = std::chrono::seconds( 20 );       ///< since the first change, while changes do not end
    VDuration AfterFailure = std::chrono::seconds( 5 );  ///< doubles with each failure in a row
    VDuration AfterFailures = std::chrono::minutes( 1 ); ///< and stays there
  };

  VSaveSchedule() = default;
  explicit VSaveSchedule( const VDelays& i_rDelays )
    : m_Delays( i_rDelays )
  {
  }

  void Changed( VTime i_Now );
  /// Makes a save due at once, whether something changed or not.
  void Requested() { m_bRequested = true; }
  /// A save begins: what changes from here on may not be in it.
  void Begun();
  /// After a failure what that save was for is pending again.
  void Ended( bool i_bSaved, VTime i_Now );

  bool IsPending() const { return m_bRequested || m_First || m_Retry; }
  /// When the next save is to begin, also a time that is past; nothing while none is pending.
  std::optional< VTime > Due() const;

private:
  VDelays m_Delays;
  std::optional< VTime > m_First; ///< changes since the last save began
  std::optional< VTime > m_Last;
  std::optional< VTime > m_Retry;
  VDuration m_NextRetry{};
  bool m_bRequested = false;
};

} // namespace HostServices

#pragma once

#include <ZEK/Callback.h>

#include <functional>
#include <memory>

namespace HostServices
{

/// The queue onto the thread that makes it, which is the GUI thread.
///
/// Functions run in the order in which they were posted, each in a turn of the event loop of its own; one that is
/// posted from inside another runs in a later turn. Nested event loops keep the order. A function that throws is
/// logged and the next one runs.
///
/// Thread: `Post` from any thread, at any time; after `Close`, or once the application object is going, a posted
/// function is dropped without being run.
class VPostalService final : public ZEK::IPostalService
{
public:
  VPostalService();
  ~VPostalService() override;

  void Post( std::function< void() > i_Function ) override;

  /// Runs what is queued, and what that posts, until nothing is left; false when it gave up because functions post
  /// each other without end. Thread: GUI.
  bool DrainForTest();
  /// Drops what is queued and everything that is posted later.
  void Close();

private:
  struct VState;
  std::shared_ptr< VState > m_pState;
};

} // namespace HostServices

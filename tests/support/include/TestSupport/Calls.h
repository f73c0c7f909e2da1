#pragma once

#include <ZEK/Callback.h>

#include <atomic>

namespace TestSupport
{

/// Counts the calls of a notifier, on the thread that fires. Thread: any.
class VCalls
{
public:
  explicit VCalls( ZEK::IMultiCallback< void() >& i_rNotifier )
    : m_Connection( i_rNotifier.Connect(
          [this]
          {
            ++m_Count;
          },
          nullptr ) )
  {
  }

  int Count() const { return m_Count; }
  /// The calls since the last time that it was asked.
  int Take() { return m_Count.exchange( 0 ); }

private:
  std::atomic< int > m_Count{ 0 };
  ZEK::VConnection m_Connection;
};

} // namespace TestSupport

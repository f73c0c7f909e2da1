#include <ZEK/DebugServices.h>

#include <cstdio>
#include <cstdlib>
#include <mutex>
#include <utility>

namespace DebugServices
{
namespace
{
std::mutex& Guard()
{
  static std::mutex Mutex;
  return Mutex;
}

AssertFailHandler& Handler()
{
  static AssertFailHandler Current;
  return Current;
}
} // namespace

AssertFailHandler SetAssertFailHandler( AssertFailHandler i_Handler )
{
  const std::lock_guard Lock( Guard() );
  return std::exchange( Handler(), std::move( i_Handler ) );
}

void CallAssertFailHandler( const char* i_pExpression, const char* i_pFile, int i_Line )
{
  AssertFailHandler Current;
  {
    const std::lock_guard Lock( Guard() );
    Current = Handler();
  }
  if ( Current )
  {
    Current( i_pExpression, i_pFile, i_Line );
    return;
  }
  std::fprintf( stderr, "Assertion failed: %s (%s:%d)\n", i_pExpression, i_pFile, i_Line );
  std::abort();
}

} // namespace DebugServices

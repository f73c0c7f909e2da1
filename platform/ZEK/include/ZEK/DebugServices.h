#pragma once

#include <ZEK/Export.h>

#include <functional>

/// Catches misuse by a caller: a broken precondition ends in one replaceable handler.
namespace DebugServices
{

/// Receives the failed expression word for word, with its place.
using AssertFailHandler = std::function< void( const char* i_pExpression, const char* i_pFile, int i_Line ) >;

/// Replaces the handler and returns the former one. An empty handler restores the default, which writes the
/// text to stderr and aborts. Thread: any; the swap is guarded.
ZEK_API AssertFailHandler SetAssertFailHandler( AssertFailHandler i_Handler );

/// Calls the handler. A handler may return (tests record and go on); the caller must then leave in good order.
ZEK_API void CallAssertFailHandler( const char* i_pExpression, const char* i_pFile, int i_Line );

/// Calls the handler when `i_bHolds` is false, and returns `i_bHolds`, so that a caller can leave.
inline bool Check( bool i_bHolds, const char* i_pExpression, const char* i_pFile, int i_Line )
{
  if ( !i_bHolds )
  {
    CallAssertFailHandler( i_pExpression, i_pFile, i_Line );
  }
  return i_bHolds;
}

} // namespace DebugServices

#pragma once

#if defined( __SANITIZE_THREAD__ )
#define HARROW_THREAD_SANITIZER
#elif defined( __has_feature )
#if __has_feature( thread_sanitizer )
#define HARROW_THREAD_SANITIZER
#endif
#endif

#ifdef HARROW_THREAD_SANITIZER
#include <sanitizer/tsan_interface.h>
#endif

namespace MoxelGraphics
{

// Qt holds the GUI thread while an item meets its renderer, by locks that a thread sanitizer does not see where Qt is
// not built with it. These two tell it of the hand-over; without the sanitizer they are nothing.

/// What this thread did so far is seen by whoever takes `i_pPlace` over afterwards.
inline void HandOver( [[maybe_unused]] const void* i_pPlace )
{
#ifdef HARROW_THREAD_SANITIZER
  __tsan_release( const_cast< void* >( i_pPlace ) );
#endif
}

/// This thread sees what was done before `i_pPlace` was last handed over.
inline void TakeOver( [[maybe_unused]] const void* i_pPlace )
{
#ifdef HARROW_THREAD_SANITIZER
  __tsan_acquire( const_cast< void* >( i_pPlace ) );
#endif
}

} // namespace MoxelGraphics

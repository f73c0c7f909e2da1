#pragma once

#include <cstdio>
#include <cstdlib>

namespace FuzzCheck
{

/// Ends the process, so that the fuzzer keeps the input.
inline void Require( bool i_bTrue, const char* i_pWhat )
{
  if ( !i_bTrue )
  {
    std::fprintf( stderr, "a reader broke its promise: %s\n", i_pWhat );
    std::abort();
  }
}

} // namespace FuzzCheck

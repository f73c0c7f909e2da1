#pragma once

#include <ZEK/Schema.h>

namespace ZEK::IO
{

/// `GetUniqueSchema` that says why: null and a text for a description that is not well formed.
const ISchema* InternSchema( const ISchema& i_rDescription, const char*& o_rpComplaint );

constexpr bool IsEnum( EType i_Type )
{
  return i_Type >= EType::Enum8 && i_Type <= EType::Enum32;
}

} // namespace ZEK::IO

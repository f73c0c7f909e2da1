#pragma once

#include <ZEK/Schema.h>

/// A library that is loaded at run time and has the templates of values compiled into itself: the schemas that it
/// refers to.
extern "C" const ZEK::IO::ISchema* SchemaOfModule( bool i_bPod );

#pragma once

/// Marks what libZEK shares between host and plug-in. Everything else of the system is hidden in its module.
#define ZEK_API __attribute__( ( visibility( "default" ) ) )

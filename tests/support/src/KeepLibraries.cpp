// Linked into programs that are built with a sanitizer. A driver that is unloaded takes its name with it: what it left
// can no longer be told from what we left, and the thread sanitizer gives up when a library of its suppressions goes.
// Libraries therefore stay until the process ends.
extern "C" __attribute__( ( visibility( "default" ) ) ) int dlclose( void* )
{
  return 0;
}

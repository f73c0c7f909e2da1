// A library that loads, and is no plug-in.
extern "C" __attribute__( ( visibility( "default" ) ) ) int SomethingElse()
{
  return 0;
}

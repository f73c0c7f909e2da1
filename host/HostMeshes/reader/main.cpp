// Reads one mesh file for another program, and ends: what breaks here breaks nothing there.

#include <HostMeshes/ReadMesh.h>

#include <sys/resource.h>

#include <cstdio>

int main( int i_Count, char** i_ppArguments )
{
  if ( i_Count != 2 )
  {
    std::fputs( "usage: harrow-mesh-reader FILE: writes the mesh to its output, for harrow to read\n", stderr );
    return 2;
  }
  // No picture of the memory is left behind, and no more is taken than a mesh may need.
  const rlimit NoCore{ 0, 0 };
  (void)setrlimit( RLIMIT_CORE, &NoCore );
  // Who would end it may be gone.
  const rlimit Time{ 120, 120 };
  (void)setrlimit( RLIMIT_CPU, &Time );
#ifdef HARROW_LIMIT_MEMORY
  const rlimit Memory{ 6ull << 30u, 6ull << 30u };
  (void)setrlimit( RLIMIT_AS, &Memory );
#endif
  return HostMeshes::RunMeshReader( i_ppArguments[1], stdout );
}

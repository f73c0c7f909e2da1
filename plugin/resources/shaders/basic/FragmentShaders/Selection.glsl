#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT vec3 u_SelectionId;

void main()
{
  gl_FragColor = vec4( u_SelectionId, 1.0 / 255.0 );
}

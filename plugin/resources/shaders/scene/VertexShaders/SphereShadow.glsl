#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT vec4 u_ReconPosAndSize;
uniform mat4 u_ViewProjection;
uniform mat4 u_Projection;
uniform vec3 u_LightVector;
uniform vec3 u_Up;

attribute vec3 a_position;

varying vec4 v_colour;

// In front of what lies in the same plane. A parallel view would shrink with w: there it is 10 mm of depth.
vec4 Nearer( vec4 position )
{
  if ( u_Projection[3][3] != 0.0 )
  {
    position.z += 10.0 * u_Projection[2][2];
  }
  else
  {
    position.w += 0.02;
  }
  return position;
}

void main()
{
  vec3 world = a_position * u_ReconPosAndSize.w + u_ReconPosAndSize.xyz;
  float height = dot( u_ReconPosAndSize.xyz, u_Up );
  float slope = max( dot( u_LightVector, u_Up ), 1.0e-3 );
  vec3 fallen = world - u_LightVector * ( dot( world, u_Up ) / slope );
  float alpha = 0.5 * clamp( 1.0 - height / 3000.0, 0.0, 1.0 );
  v_colour = vec4( 0.0, 0.0, 0.0, alpha );
  gl_Position = Nearer( u_ViewProjection * vec4( fallen, 1.0 ) );
}

#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT vec4 u_ReconPosAndSize;
uniform mat4 u_ViewProjection;
uniform vec3 u_LightVector;
uniform vec3 u_Up;

attribute vec3 a_position;

varying vec4 v_colour;

void main()
{
  vec3 world = a_position * u_ReconPosAndSize.w + u_ReconPosAndSize.xyz;
  float height = dot( u_ReconPosAndSize.xyz, u_Up );
  float slope = max( dot( u_LightVector, u_Up ), 1.0e-3 );
  vec3 fallen = world - u_LightVector * ( dot( world, u_Up ) / slope );
  float alpha = 0.5 * clamp( 1.0 - height / 3000.0, 0.0, 1.0 );
  v_colour = vec4( 0.0, 0.0, 0.0, alpha );
  gl_Position = u_ViewProjection * vec4( fallen, 1.0 );
  gl_Position.w += 0.02; // in front of the floor
}

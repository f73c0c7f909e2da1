#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT vec4 u_ReconPosAndSize;
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;
uniform vec3 u_CameraPosition;

attribute vec3 a_position;

varying vec3 v_normal;
varying vec4 v_colour;
varying vec3 v_eye;

void main()
{
  vec3 world = a_position * u_ReconPosAndSize.w + u_ReconPosAndSize.xyz;
  v_normal = a_position;
  v_colour = u_ModelColour;
  v_eye = world - u_CameraPosition;
  gl_Position = u_ViewProjection * vec4( world, 1.0 );
}

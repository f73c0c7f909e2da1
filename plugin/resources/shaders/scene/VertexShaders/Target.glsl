#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT vec4 u_TargetPosAndSize;
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;

attribute vec3 a_position;
attribute vec3 a_normal;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;

void main()
{
  v_position = a_position * u_TargetPosAndSize.w + u_TargetPosAndSize.xyz;
  v_normal = a_normal;
  v_colour = u_ModelColour;
  gl_Position = u_ViewProjection * vec4( v_position, 1.0 );
}

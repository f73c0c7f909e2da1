#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT mat4 u_ModelTransform;
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;

attribute vec3 a_position;
attribute vec2 a_uv;

varying vec2 v_uv;
varying vec4 v_colour;

void main()
{
  v_uv = a_position.xz;
  v_colour = u_ModelColour;
  gl_Position = u_ViewProjection * ( u_ModelTransform * vec4( a_position, 1.0 ) );
}

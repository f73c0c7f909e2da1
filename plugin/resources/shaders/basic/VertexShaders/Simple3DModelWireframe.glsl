#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT mat4 u_ModelTransform;
uniform mat4 u_ViewProjection;

attribute vec3 a_position;
attribute vec4 a_colour;

varying vec4 v_colour;

void main()
{
  v_colour = a_colour;
  gl_Position = u_ViewProjection * ( u_ModelTransform * vec4( a_position, 1.0 ) );
}

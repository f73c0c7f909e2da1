#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT mat4 u_ModelTransform;
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;

attribute vec3 a_position;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;

void main()
{
  v_position = ( u_ModelTransform * vec4( a_position, 1.0 ) ).xyz;
  v_normal = mat3( u_ModelTransform ) * a_position;
  v_colour = u_ModelColour;
  gl_Position = u_ViewProjection * vec4( v_position, 1.0 );
}

#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT mat4 u_ModelTransform;
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;

attribute vec3 a_position;
attribute vec3 a_normal;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;
varying float v_faceradial;

// A cylinder of radius 1 along z from 0 to 1 becomes a body that ends at the lens.
void main()
{
  vec4 world = u_ModelTransform * vec4( a_position.xy * 40.0, a_position.z * 100.0 - 100.0, 1.0 );
  v_position = world.xyz;
  v_normal = mat3( u_ModelTransform ) * a_normal;
  v_colour = u_ModelColour;
  v_faceradial = a_normal.z > 0.5 ? length( a_position.xy ) : 0.0;
  gl_Position = u_ViewProjection * world;
}

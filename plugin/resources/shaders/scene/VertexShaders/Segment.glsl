#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT mat4 u_ModelTransform;
PER_OBJECT vec4 u_SegmentColour;
uniform mat4 u_ViewProjection;

attribute vec3 a_position;
attribute vec3 a_normal;
attribute vec2 a_uv;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;
varying vec3 v_localnormal;
varying vec2 v_uv;

// Normals of a scaled mesh stand on its scaled faces.
vec3 WorldNormal( mat4 model, vec3 normal )
{
  vec3 x = model[0].xyz;
  vec3 y = model[1].xyz;
  vec3 z = model[2].xyz;
  vec3 yz = cross( y, z );
  vec3 turned = yz * normal.x + cross( z, x ) * normal.y + cross( x, y ) * normal.z;
  return dot( x, yz ) < 0.0 ? -turned : turned;
}

void main()
{
  v_position = ( u_ModelTransform * vec4( a_position, 1.0 ) ).xyz;
  v_normal = WorldNormal( u_ModelTransform, a_normal );
  v_localnormal = a_normal;
  v_colour = u_SegmentColour;
  v_uv = a_uv;
  gl_Position = u_ViewProjection * vec4( v_position, 1.0 );
}

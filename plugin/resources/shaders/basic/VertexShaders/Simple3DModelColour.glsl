#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT mat4 u_ModelTransform;
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;

attribute vec3 a_position;
attribute vec4 a_colour;
attribute vec3 a_normal;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;

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
  v_colour = a_colour * u_ModelColour;
  gl_Position = u_ViewProjection * vec4( v_position, 1.0 );
}

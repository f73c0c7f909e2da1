#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT mat4 u_ModelTransform;
PER_OBJECT vec4 u_StickColourA;
PER_OBJECT vec4 u_StickColourB;
uniform mat4 u_ViewProjection;
uniform mat4 u_Projection;
uniform vec3 u_LightVector;
uniform vec3 u_Up;

attribute vec3 a_position;
attribute vec3 a_normal;

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

// The mesh runs along z from 0 to 1; a stick that cannot be seen throws no shadow.
void main()
{
  vec3 world = ( u_ModelTransform * vec4( a_position, 1.0 ) ).xyz;
  float height = dot( ( u_ModelTransform * vec4( 0.0, 0.0, a_position.z, 1.0 ) ).xyz, u_Up );
  float slope = max( dot( u_LightVector, u_Up ), 1.0e-3 );
  vec3 fallen = world - u_LightVector * ( dot( world, u_Up ) / slope );
  float alpha = 0.5 * clamp( 1.0 - height / 3000.0, 0.0, 1.0 );
  v_colour = vec4( 0.0, 0.0, 0.0, alpha * mix( u_StickColourA.a, u_StickColourB.a, a_position.z ) );
  gl_Position = Nearer( u_ViewProjection * vec4( fallen, 1.0 ) );
}

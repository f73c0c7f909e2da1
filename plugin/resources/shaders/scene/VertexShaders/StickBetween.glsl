#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT vec3 u_StickA;
PER_OBJECT vec3 u_StickB;
PER_OBJECT vec4 u_StickColourA;
PER_OBJECT vec4 u_StickColourB;
uniform mat4 u_ViewProjection;
uniform mat4 u_Projection;
uniform vec2 u_ViewportSize;
uniform float u_StickRadius;
uniform float u_SmallestRadius; // pixels
uniform float u_Retreat;        // how far behind its place it stands, in radii: what it ends in goes first
uniform vec3 u_CameraPosition;

attribute vec3 a_position;

varying vec4 v_colour;

// A stick by its two ends: 24 bytes in place of a transform. The mesh runs along z from 0 to 1, with radius 1.
void main()
{
  vec3 along = u_StickB - u_StickA;
  float size = length( along );
  vec3 axis = size > 0.0 ? along / size : vec3( 0.0, 0.0, 1.0 );
  vec3 side = normalize( cross( axis, abs( axis.z ) < 0.7 ? vec3( 0.0, 0.0, 1.0 ) : vec3( 1.0, 0.0, 0.0 ) ) );
  vec3 end = u_StickA + along * a_position.z;
  float w = max( ( u_ViewProjection * vec4( end, 1.0 ) ).w, 0.0 );
  float smallest = 2.0 * u_SmallestRadius * w / ( u_Projection[1][1] * u_ViewportSize.y );
  float radius = max( u_StickRadius, smallest );
  v_colour = mix( u_StickColourA, u_StickColourB, a_position.z );
  vec3 place = end + radius * ( a_position.x * side + a_position.y * cross( axis, side ) );
  vec3 away = u_Projection[3][3] == 0.0 ? normalize( place - u_CameraPosition ) : vec3( 0.0 );
  gl_Position = u_ViewProjection * vec4( place + u_Retreat * radius * away, 1.0 );
}

#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

// A stretch of a trail as a ribbon of so many pixels that faces the eye. w: how strong it is there; below 0 there is no
// trail, and no stretch to or from it.
PER_OBJECT vec4 u_StickA;
PER_OBJECT vec4 u_StickB;
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;
uniform vec2 u_ViewportSize;
uniform float u_PointSize; // width in pixels

attribute vec3 a_position; // x: 0 at the start, 1 at the end; y: -1 to 1 across

varying vec4 v_colour;

const float Nearest = 0.5; // what lies behind the eye has no place on the screen

void main()
{
  vec4 a = u_ViewProjection * vec4( u_StickA.xyz, 1.0 );
  vec4 b = u_ViewProjection * vec4( u_StickB.xyz, 1.0 );
  bool bWhole = u_StickA.w >= 0.0 && u_StickB.w >= 0.0 && min( a.w, b.w ) >= Nearest;
  vec2 way = ( b.xy / b.w - a.xy / a.w ) * u_ViewportSize;
  float length2 = dot( way, way );
  vec2 along = length2 > 1.0e-8 ? way * inversesqrt( length2 ) : vec2( 1.0, 0.0 );
  vec2 across = vec2( -along.y, along.x );
  vec4 here = a_position.x > 0.5 ? b : a;
  float strength = a_position.x > 0.5 ? u_StickB.w : u_StickA.w;
  v_colour = vec4( u_ModelColour.rgb, u_ModelColour.a * strength );
  here.xy += across * a_position.y * u_PointSize / u_ViewportSize * here.w;
  gl_Position = bWhole ? here : vec4( 0.0, 0.0, 2.0, 1.0 );
}

#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT vec4 u_TargetPosAndSize;
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;
uniform mat4 u_Projection;
uniform vec2 u_ViewportSize;

attribute vec3 a_position;
attribute vec3 a_normal;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;

// Across the volume it would be a speck: nothing is drawn smaller than this radius, in pixels.
const float SmallestRadius = 1.75;

float Radius()
{
  vec4 depth = vec4( u_ViewProjection[0].w, u_ViewProjection[1].w, u_ViewProjection[2].w, u_ViewProjection[3].w );
  float w = max( dot( depth, vec4( u_TargetPosAndSize.xyz, 1.0 ) ), 0.0 );
  float smallest = 2.0 * SmallestRadius * w / ( u_Projection[1][1] * u_ViewportSize.y );
  return u_TargetPosAndSize.w > 0.0 ? max( u_TargetPosAndSize.w, smallest ) : u_TargetPosAndSize.w;
}

void main()
{
  v_position = a_position * Radius() + u_TargetPosAndSize.xyz;
  v_normal = a_normal;
  v_colour = u_ModelColour;
  gl_Position = u_ViewProjection * vec4( v_position, 1.0 );
}

#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT vec4 u_ReconPosAndSize;
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;
uniform mat4 u_Projection;
uniform vec2 u_ViewportSize;
uniform vec3 u_CameraPosition;

attribute vec3 a_position;

varying vec3 v_normal;
varying vec4 v_colour;
varying vec3 v_eye;

// Across the volume it would be a speck: nothing is drawn smaller than this radius, in pixels.
const float SmallestRadius = 1.75;

float Radius()
{
  vec4 depth = vec4( u_ViewProjection[0].w, u_ViewProjection[1].w, u_ViewProjection[2].w, u_ViewProjection[3].w );
  float w = max( dot( depth, vec4( u_ReconPosAndSize.xyz, 1.0 ) ), 0.0 );
  float smallest = 2.0 * SmallestRadius * w / ( u_Projection[1][1] * u_ViewportSize.y );
  return u_ReconPosAndSize.w > 0.0 ? max( u_ReconPosAndSize.w, smallest ) : u_ReconPosAndSize.w;
}

void main()
{
  vec3 world = a_position * Radius() + u_ReconPosAndSize.xyz;
  v_normal = a_position;
  v_colour = u_ModelColour;
  v_eye = world - u_CameraPosition;
  gl_Position = u_ViewProjection * vec4( world, 1.0 );
}

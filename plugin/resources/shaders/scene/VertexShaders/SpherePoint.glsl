#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

// A sphere too small for triangles: one vertex, of centre and radius, drawn as a point of its size.
PER_OBJECT vec4 u_ModelColour;
uniform mat4 u_ViewProjection;
uniform mat4 u_Projection;
uniform vec2 u_ViewportSize;
uniform vec3 u_CameraPosition;

attribute vec4 a_position;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;

void main()
{
  v_position = a_position.xyz;
  v_normal = normalize( u_CameraPosition - a_position.xyz );
  v_colour = u_ModelColour;
  gl_Position = u_ViewProjection * vec4( a_position.xyz, 1.0 );
  // Never a speck: the size that Sphere keeps, too.
  gl_PointSize = max( 3.0, a_position.w * u_Projection[1][1] * u_ViewportSize.y / max( gl_Position.w, 1.0e-6 ) );
}

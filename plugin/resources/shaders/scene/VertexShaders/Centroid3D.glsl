#ifndef PER_OBJECT
#define PER_OBJECT uniform
#endif

PER_OBJECT mat4 u_ModelTransform;
uniform mat4 u_ViewProjection;
uniform vec2 u_SensorSize;

attribute vec2 a_position;
attribute vec4 a_colour;

varying vec4 v_colour;

// On the plane z = 1 of the camera, where the sensor reaches from -1 to 1.
vec4 OnPlane( vec2 p )
{
  return u_ViewProjection * ( u_ModelTransform * vec4( p / u_SensorSize * 2.0 - 1.0, 1.0, 1.0 ) );
}

void main()
{
  v_colour = a_colour;
  gl_Position = OnPlane( a_position );
  gl_PointSize = 1.0;
}

uniform vec4 u_View2D;
uniform vec2 u_SensorSize;
uniform vec2 u_RadialDistortionCentre;
uniform vec3 u_RadialDistortionParameters;
uniform vec2 u_RotationCentre;
uniform mat2 u_Rotation;
uniform vec2 u_Offset; // sensor pixels

attribute vec2 a_position;
attribute vec4 a_colour;

varying vec4 v_colour;

// From where the sensor saw it to where a lens without distortion shows it, in sensor pixels.
vec2 Distort( vec2 p )
{
  if ( u_RadialDistortionCentre == vec2( 0.0 ) )
  {
    return p;
  }
  vec2 offset = p - u_RadialDistortionCentre;
  vec3 k = u_RadialDistortionParameters;
  float d = dot( offset, offset );
  return u_RadialDistortionCentre + offset * ( 1.0 + d * ( k.x + d * ( k.y + d * k.z ) ) );
}

// Of a point in units of the sensor's size, about a centre in sensor pixels.
vec2 Rotate( vec2 p )
{
  return ( u_Rotation * ( p * u_SensorSize - u_RotationCentre ) + u_RotationCentre ) / u_SensorSize;
}

vec4 SensorTransform( vec2 p )
{
  vec2 view = Rotate( p / u_SensorSize ) - u_View2D.zw;
  return vec4( 2.0 * u_View2D.xy * vec2( view.x, -view.y ), 0.0, 1.0 );
}

void main()
{
  v_colour = a_colour;
  gl_Position = SensorTransform( Distort( a_position ) + u_Offset );
}

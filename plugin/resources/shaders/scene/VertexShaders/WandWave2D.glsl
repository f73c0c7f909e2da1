uniform vec4 u_View2D;
uniform vec2 u_SensorSize;
uniform vec2 u_RadialDistortionCentre;
uniform vec3 u_RadialDistortionParameters;
uniform vec2 u_RotationCentre;
uniform mat2 u_Rotation;
uniform vec2 u_ViewportSize;
uniform float u_FrameNumber;

attribute vec3 a_position;
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

const float Lifetime = 500.0; // frames
const vec3 NewColour = vec3( 231.0, 101.0, 0.0 ) / 255.0;
const vec3 OldColourA = vec3( 75.0, 120.0, 170.0 ) / 255.0;
const vec3 OldColourB = vec3( 80.0, 125.0, 177.5 ) / 255.0;

void main()
{
  float fresh = clamp( 1.0 - ( u_FrameNumber - a_position.z ) / Lifetime, 0.0, 1.0 );
  vec3 old = mix( OldColourA, OldColourB, abs( cos( 0.01 * a_position.z ) ) );
  v_colour = vec4( mix( old, NewColour, fresh ), a_colour.a );
  gl_Position = SensorTransform( Distort( a_position.xy ) + 0.5 );
  gl_PointSize = max( 1.0, 25.0 * u_ViewportSize.x * u_View2D.x * 2.0 / u_SensorSize.x ) + fresh;
}

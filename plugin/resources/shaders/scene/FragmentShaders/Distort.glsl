uniform sampler2D t_DiffuseTexture;
uniform vec4 u_View2D;
uniform vec2 u_SensorSize;
uniform vec2 u_RadialDistortionCentre;
uniform vec3 u_RadialDistortionParameters;
uniform vec2 u_RotationCentre;
uniform mat2 u_Rotation;
uniform mat2 u_RotationInverse;

varying vec2 v_uv;

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

void main()
{
  // Back from the screen to what the sensor saw there.
  vec2 view = ( v_uv - 0.5 ) / u_View2D.xy;
  vec2 turned = ( vec2( view.x, -view.y ) + u_View2D.zw ) * u_SensorSize;
  vec2 p = u_RotationInverse * ( turned - u_RotationCentre ) + u_RotationCentre;
  if ( p != clamp( p, vec2( 0.0 ), u_SensorSize ) )
  {
    gl_FragColor = vec4( 0.0, 0.0, 0.0, 1.0 );
    return;
  }
  // Forward to where a lens without distortion shows it. What lies beyond the picture was not drawn.
  view = Rotate( ( Distort( p - 0.5 ) + 0.5 ) / u_SensorSize ) - u_View2D.zw;
  vec2 uv = u_View2D.xy * vec2( view.x, -view.y ) + 0.5;
  gl_FragColor = uv == clamp( uv, 0.0, 1.0 ) ? textureLod( t_DiffuseTexture, uv, 0.0 ) : vec4( 0.0 );
}

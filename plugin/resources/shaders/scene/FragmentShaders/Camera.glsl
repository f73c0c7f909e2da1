uniform vec3 u_LightVector;
uniform vec3 u_Up;
uniform vec3 u_CameraPosition;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;
varying float v_faceradial;

const float InnerRadius = 0.5;

// Light from all around, from the floor, from above and from the eye.
float SimpleLighting( vec3 normal, float ambient, float bounce, float top, float camera )
{
  vec3 to_camera = normalize( u_CameraPosition - v_position );
  float light = ambient + bounce * max( 0.0, -dot( normal, u_Up ) ) + top * max( 0.0, dot( normal, u_LightVector ) ) +
                camera * max( 0.0, dot( normal, to_camera ) );
  return min( light, 1.0 );
}

void main()
{
  gl_FragColor = vec4( v_colour.rgb * SimpleLighting( normalize( v_normal ), 0.1, 0.2, 0.0, 0.0 ), v_colour.a );
  if ( v_faceradial > InnerRadius )
  {
    gl_FragColor.rgb = vec3( 1.0, 0.0, 0.0 ); // the strobe around the lens
  }
}

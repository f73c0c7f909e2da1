uniform vec3 u_LightVector;
uniform vec3 u_Up;
uniform vec3 u_CameraPosition;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;
varying vec3 v_localnormal;

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
  // A stripe shows how the bone is turned about itself.
  float stripe = v_localnormal.y > 0.0 && abs( v_localnormal.x ) < 0.1 ? 1.0 - 0.33 : 1.0;
  float light = stripe * SimpleLighting( normalize( v_normal ), 0.2, 0.2, 0.8, 0.5 );
  gl_FragColor = vec4( v_colour.rgb * light, v_colour.a );
}

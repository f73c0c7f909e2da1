uniform vec3 u_LightVector;
uniform vec3 u_Up;
uniform vec3 u_CameraPosition;
uniform vec3 u_Force;            // newtons
uniform vec3 u_CentreOfPressure; // in the world, mm

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;

const float SmallestForce = 25.0;
const float Thickness = 8.0;

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
  vec3 normal = normalize( v_normal );
  gl_FragColor = vec4( v_colour.rgb * SimpleLighting( normal, 0.2, 0.2, 0.8, 0.5 ), v_colour.a );
  vec2 place = vec2( v_position.x, u_Up.y > 0.0 ? v_position.z : v_position.y );
  vec2 centre = vec2( u_CentreOfPressure.x, u_Up.y > 0.0 ? u_CentreOfPressure.z : u_CentreOfPressure.y );
  // From far away a line keeps the width of a pixel, so that it does not fall into dots.
  vec2 half_width = max( vec2( 0.5 * Thickness ), 0.5 * fwidth( place ) );
  bool on_line = any( lessThan( abs( place - centre ), half_width ) );
  if ( on_line && dot( normal, u_Up ) > 0.1 && dot( u_Force, u_Force ) > SmallestForce * SmallestForce )
  {
    gl_FragColor.rgb = vec3( 1.0, 0.5, 0.5 );
  }
}

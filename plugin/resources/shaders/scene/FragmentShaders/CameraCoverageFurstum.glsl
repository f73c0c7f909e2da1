uniform vec3 u_Up;

varying vec3 v_position;
varying vec4 v_colour;

void main()
{
  float height = dot( v_position, u_Up );
  if ( height < 0.0 )
  {
    discard;
  }
  gl_FragColor = height <= 10.0 ? vec4( 1.0, 0.0, 1.0, 1.0 ) : v_colour;
}

uniform vec3 u_Up;

varying vec3 v_position;
varying vec4 v_colour;

void main()
{
  if ( dot( v_position, u_Up ) < 0.0 )
  {
    discard;
  }
  gl_FragColor = v_colour;
}

uniform vec3 u_SourcePoint;
uniform vec4 u_Colour;

varying vec3 v_position;

void main()
{
  if ( mod( distance( v_position, u_SourcePoint ), 8.0 ) > 4.0 )
  {
    discard;
  }
  gl_FragColor = u_Colour;
}

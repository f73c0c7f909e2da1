varying vec4 v_colour;

void main()
{
  gl_FragColor = vec4( v_colour.rrr, 1.0 );
}

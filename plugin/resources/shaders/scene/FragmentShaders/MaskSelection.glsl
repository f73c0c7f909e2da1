uniform bool u_ShowSelection;

varying vec4 v_colour;

// What is neither selected nor preselected has none of these bits in its blue.
void main()
{
  if ( u_ShowSelection && v_colour.b < 31.5 / 255.0 )
  {
    discard;
  }
  gl_FragColor = vec4( v_colour.rgb, 1.0 / 255.0 );
}

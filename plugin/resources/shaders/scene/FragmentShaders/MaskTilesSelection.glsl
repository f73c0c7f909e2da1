uniform bool u_ShowSelection;

varying vec4 v_colour;
flat varying vec4 v_window;

// Only inside its tile.
bool Outside()
{
  return any( lessThan( gl_FragCoord.xy, v_window.xy ) ) || any( greaterThan( gl_FragCoord.xy, v_window.zw ) );
}

// What is neither selected nor preselected has none of these bits in its blue.
void main()
{
  if ( Outside() || ( u_ShowSelection && v_colour.b < 31.5 / 255.0 ) )
  {
    discard;
  }
  gl_FragColor = vec4( v_colour.rgb, 1.0 / 255.0 );
}

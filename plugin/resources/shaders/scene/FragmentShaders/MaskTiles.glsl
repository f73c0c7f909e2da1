varying vec4 v_colour;
flat varying vec4 v_window;

// Only inside its tile.
bool Outside()
{
  return any( lessThan( gl_FragCoord.xy, v_window.xy ) ) || any( greaterThan( gl_FragCoord.xy, v_window.zw ) );
}

void main()
{
  if ( Outside() )
  {
    discard;
  }
  gl_FragColor = v_colour;
}

varying vec4 v_colour;
flat varying vec4 v_window;

// Only inside its tile.
bool Outside()
{
  return any( lessThan( gl_FragCoord.xy, v_window.xy ) ) || any( greaterThan( gl_FragCoord.xy, v_window.zw ) );
}

void main()
{
  float alpha = max( 0.0, 1.0 - 2.0 * length( gl_PointCoord - 0.5 ) );
  if ( Outside() || alpha == 0.0 )
  {
    discard;
  }
  gl_FragColor = vec4( v_colour.rgb, v_colour.a * alpha );
}

uniform bool u_ShowSelection;

varying vec4 v_colour;
varying float v_size;
varying vec2 v_point;
flat varying vec4 v_window;

// What is neither selected nor preselected has none of these bits in its blue.
void main()
{
  bool bOutside = any( lessThan( gl_FragCoord.xy, v_window.xy ) ) || any( greaterThan( gl_FragCoord.xy, v_window.zw ) ) ||
                  ( v_size > 2.0 && length( v_point - 0.5 ) > 0.5 );
  if ( bOutside || ( u_ShowSelection && v_colour.b < 31.5 / 255.0 ) )
  {
    discard;
  }
  gl_FragColor = vec4( v_colour.rgb, 1.0 / 255.0 );
}

varying vec4 v_colour;

void main()
{
  float alpha = max( 0.0, 1.0 - 2.0 * length( gl_PointCoord - 0.5 ) );
  gl_FragColor = vec4( v_colour.rgb, v_colour.a * alpha );
}

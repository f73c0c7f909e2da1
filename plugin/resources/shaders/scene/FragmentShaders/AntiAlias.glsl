uniform sampler2D t_Buffer;

void main()
{
  vec2 size = vec2( textureSize( t_Buffer, 0 ) );
  gl_FragColor = 0.25 * ( texture2D( t_Buffer, ( gl_FragCoord.xy + vec2( -0.25, -0.25 ) ) / size ) +
                          texture2D( t_Buffer, ( gl_FragCoord.xy + vec2( 0.25, -0.25 ) ) / size ) +
                          texture2D( t_Buffer, ( gl_FragCoord.xy + vec2( -0.25, 0.25 ) ) / size ) +
                          texture2D( t_Buffer, ( gl_FragCoord.xy + vec2( 0.25, 0.25 ) ) / size ) );
}

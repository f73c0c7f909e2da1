uniform sampler2D t_Selection;
uniform vec4 u_PrimaryColour;
uniform vec3 u_PreSelectColour;

// Equal texels may differ by a trace behind a linear filter.
const float Same = 0.25 / 255.0;

void main()
{
  vec3 centre = texelFetch( t_Selection, ivec2( gl_FragCoord.xy ), 0 ).rgb;
  vec2 size = vec2( textureSize( t_Selection, 0 ) );
  vec3 a = texture2D( t_Selection, ( gl_FragCoord.xy + vec2( -0.9, -0.9 ) ) / size ).rgb;
  vec3 b = texture2D( t_Selection, ( gl_FragCoord.xy + vec2( 0.9, -0.9 ) ) / size ).rgb;
  vec3 c = texture2D( t_Selection, ( gl_FragCoord.xy + vec2( -0.9, 0.9 ) ) / size ).rgb;
  vec3 d = texture2D( t_Selection, ( gl_FragCoord.xy + vec2( 0.9, 0.9 ) ) / size ).rgb;

  vec3 largest = max( max( abs( a - centre ), abs( b - centre ) ), max( abs( c - centre ), abs( d - centre ) ) );
  float intensity = max( largest.r, max( largest.g, largest.b ) ) > Same ? 0.75 : 0.0;

  // Blue: 32 selected, 64 preselected, 128 primary, below them bits of the id.
  float blue = max( max( centre.b, max( a.b, b.b ) ), max( c.b, d.b ) );
  if ( blue > 99.5 / 255.0 )
  {
    float hatch = fract( 0.25 * ( floor( gl_FragCoord.x ) + floor( gl_FragCoord.y ) ) ) > 0.5 ? 1.0 : 0.0;
    gl_FragColor = vec4( u_PrimaryColour.rgb * ( hatch + intensity ), intensity );
  }
  else
  {
    vec3 fill = centre.b > 63.5 / 255.0 ? u_PreSelectColour : vec3( centre.b > 0.5 / 255.0 ? 0.25 : 0.0 );
    gl_FragColor = vec4( fill + intensity, 0.0 );
  }
}

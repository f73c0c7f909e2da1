uniform sampler2D t_Texture;
uniform highp int u_PhaseX; // column and row, 0 or 1, of the first red pixel
uniform highp int u_PhaseY;
uniform float u_GammaCorrection;
uniform float u_VideoSaturation;

varying vec2 v_uv;

bool IsOutside( vec2 uv )
{
  return uv != clamp( uv, 0.0, 1.0 );
}

vec3 Adjusted( vec3 colour )
{
  vec3 light = pow( clamp( colour, 0.0, 1.0 ), vec3( 1.0 / max( u_GammaCorrection, 0.01 ) ) );
  return mix( vec3( dot( light, vec3( 0.299, 0.587, 0.114 ) ) ), light, u_VideoSaturation );
}

// At the edges the neighbour of the same colour stands in.
float At( ivec2 pixel, ivec2 last )
{
  return texelFetch( t_Texture, max( last - abs( last - abs( pixel ) ), 0 ), 0 ).r;
}

void main()
{
  if ( IsOutside( v_uv ) )
  {
    discard;
  }
  ivec2 size = textureSize( t_Texture, 0 );
  ivec2 last = size - 1;
  ivec2 at = min( ivec2( v_uv * vec2( size ) ), last );
  float own = At( at, last );
  float beside = 0.5 * ( At( at - ivec2( 1, 0 ), last ) + At( at + ivec2( 1, 0 ), last ) );
  float above = 0.5 * ( At( at - ivec2( 0, 1 ), last ) + At( at + ivec2( 0, 1 ), last ) );
  float corners = 0.25 * ( At( at - ivec2( 1, 1 ), last ) + At( at + ivec2( 1, -1 ), last ) +
                           At( at + ivec2( -1, 1 ), last ) + At( at + ivec2( 1, 1 ), last ) );
  bool bRedColumn = ( ( at.x ^ u_PhaseX ) & 1 ) == 0;
  bool bRedRow = ( ( at.y ^ u_PhaseY ) & 1 ) == 0;
  float cross = 0.5 * ( beside + above );
  vec3 red_row = bRedColumn ? vec3( own, cross, corners ) : vec3( beside, own, above );
  vec3 blue_row = bRedColumn ? vec3( above, own, beside ) : vec3( corners, cross, own );
  gl_FragColor = vec4( Adjusted( bRedRow ? red_row : blue_row ), 1.0 );
}

uniform sampler2D t_Texture;
uniform vec2 u_GridSpacings;
uniform vec3 u_Up;
uniform vec3 u_CameraPosition;

varying vec2 v_floor;

// Tiles the texture whatever its wrapping, without a seam in the choice of the mipmap.
float Lines( float spacing )
{
  vec2 uv = v_floor / spacing;
  return textureGrad( t_Texture, fract( uv ), dFdx( uv ), dFdy( uv ) ).r;
}

void main()
{
  float line = min( Lines( u_GridSpacings.x ) + 0.5 * Lines( u_GridSpacings.y ), 1.0 );
  float alpha = dot( u_CameraPosition, u_Up ) < 0.0 ? 0.25 : 0.75;
  gl_FragColor = vec4( mix( vec3( 0.16 ), vec3( 0.5 ), line ), alpha );
}

uniform sampler2D t_Texture;
uniform bool u_Wide; // two bytes a pixel in r and g, the lesser one first
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

void main()
{
  if ( IsOutside( v_uv ) )
  {
    discard;
  }
  vec2 bytes = texture2D( t_Texture, v_uv ).rg;
  float grey = u_Wide ? dot( bytes, vec2( 1.0, 256.0 ) ) / 257.0 : bytes.r;
  gl_FragColor = vec4( Adjusted( vec3( grey ) ), 1.0 );
}

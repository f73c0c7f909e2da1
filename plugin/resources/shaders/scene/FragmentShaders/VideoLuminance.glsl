uniform sampler2D t_Texture;
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
  gl_FragColor = vec4( Adjusted( texture2D( t_Texture, v_uv ).rrr ), 1.0 );
}

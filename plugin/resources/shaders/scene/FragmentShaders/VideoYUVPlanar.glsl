uniform sampler2D t_TextureY;
uniform sampler2D t_TextureU;
uniform sampler2D t_TextureV;
uniform bool u_Paired;     // both chroma channels are in t_TextureU
uniform vec2 u_ChromaTrim; // the part of the chroma that lies beyond a picture of odd size
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

// Limited range; from 720 lines on by the rules of high definition.
vec3 FromYUV( vec3 yuv, highp int lines )
{
  float y = ( yuv.x * 255.0 - 16.0 ) / 219.0;
  vec2 c = ( yuv.yz * 255.0 - 128.0 ) / 224.0;
  return lines < 720 ? vec3( y + 1.402 * c.y, y - 0.344136 * c.x - 0.714136 * c.y, y + 1.772 * c.x )
                     : vec3( y + 1.5748 * c.y, y - 0.187324 * c.x - 0.468124 * c.y, y + 1.8556 * c.x );
}

void main()
{
  if ( IsOutside( v_uv ) )
  {
    discard;
  }
  vec2 uv = v_uv * ( 1.0 - u_ChromaTrim );
  vec2 chroma = texture2D( t_TextureU, uv ).rg;
  chroma.g = u_Paired ? chroma.g : texture2D( t_TextureV, uv ).r;
  vec3 yuv = vec3( texture2D( t_TextureY, v_uv ).r, chroma );
  gl_FragColor = vec4( Adjusted( FromYUV( yuv, textureSize( t_TextureY, 0 ).y ) ), 1.0 );
}

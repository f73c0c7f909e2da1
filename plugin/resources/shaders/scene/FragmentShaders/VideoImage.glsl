uniform sampler2D t_Texture;
uniform float u_Opacity;

varying vec2 v_uv;

void main()
{
  vec4 colour = texture2D( t_Texture, v_uv );
  gl_FragColor = vec4( colour.rgb, colour.a * u_Opacity );
}

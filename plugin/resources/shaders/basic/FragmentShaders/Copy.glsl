uniform sampler2D t_DiffuseTexture;
uniform vec2 u_FrameSize;

void main()
{
  gl_FragColor = texture2D( t_DiffuseTexture, gl_FragCoord.xy / u_FrameSize );
}

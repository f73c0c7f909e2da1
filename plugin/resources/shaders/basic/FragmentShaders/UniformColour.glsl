uniform vec4 u_Colour;

void main()
{
  gl_FragColor = u_Colour;
}

uniform highp sampler2D t_Texture; // red: the letters; green: these and the soft dark edge around them

flat varying vec4 v_colour; // premultiplied
varying vec2 v_uv;

// Premultiplied: the letters over their dark edge.
void main()
{
  vec2 shape = texelFetch( t_Texture, ivec2( v_uv ), 0 ).rg;
  gl_FragColor = v_colour * shape.rrrg;
}

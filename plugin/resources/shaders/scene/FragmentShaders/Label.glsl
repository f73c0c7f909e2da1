uniform highp sampler2D t_Texture; // red: the letters; green: the soft edge around them

varying vec4 v_colour;
varying vec2 v_uv;

const float Edge = 0.8;

// Premultiplied: the letters over their dark edge.
void main()
{
  vec2 shape = texelFetch( t_Texture, ivec2( floor( v_uv ) ), 0 ).rg;
  float dark = shape.g * Edge * ( 1.0 - shape.r );
  gl_FragColor = vec4( v_colour.rgb * shape.r, shape.r + dark ) * v_colour.a;
}

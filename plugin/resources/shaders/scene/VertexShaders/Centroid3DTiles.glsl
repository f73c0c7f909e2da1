uniform highp sampler2D t_Tiles; // eight texels a camera: the first three rows of the matrix from its sensor to the world
uniform mat4 u_ViewProjection;

attribute vec2 a_position;
attribute vec4 a_colour;
attribute float a_Tile;

varying vec4 v_colour;

vec4 Tile( int row, int part )
{
  return texelFetch( t_Tiles, ivec2( ( row & 255 ) * 8 + part, row >> 8 ), 0 );
}

void main()
{
  int row = int( a_Tile + 0.5 );
  vec4 p = vec4( a_position, 1.0, 1.0 );
  vec4 world = vec4( dot( Tile( row, 0 ), p ), dot( Tile( row, 1 ), p ),
                     dot( Tile( row, 2 ), p ), 1.0 );
  v_colour = a_colour;
  gl_Position = a_colour != vec4( 0.0 ) ? u_ViewProjection * world : vec4( 0.0, 0.0, 2.0, 1.0 );
  gl_PointSize = 1.0;
}

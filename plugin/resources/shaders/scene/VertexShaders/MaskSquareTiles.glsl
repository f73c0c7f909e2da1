// A rectangle of pixels of the sensor, in the tile of its camera.
uniform highp sampler2D t_Tiles; // eight texels a camera

attribute vec4 a_position; // left, top, right, bottom: edges of pixels
attribute vec4 a_colour;
attribute float a_Tile;
attribute vec2 a_uv; // in the unit square

varying vec4 v_colour;
flat varying vec4 v_window;

vec4 Tile( int row, int part )
{
  return texelFetch( t_Tiles, ivec2( ( row & 255 ) * 8 + part, row >> 8 ), 0 );
}

// From where the sensor saw it to where a lens without distortion shows it, in sensor pixels.
vec2 Distort( vec2 p, vec4 lens, float k3 )
{
  if ( lens.xy == vec2( 0.0 ) )
  {
    return p;
  }
  vec2 offset = p - lens.xy;
  float d = dot( offset, offset );
  return lens.xy + offset * ( 1.0 + d * ( lens.z + d * ( lens.w + d * k3 ) ) );
}

// Of a pixel's centre, in the frame.
vec4 InFrame( int row, vec2 sensor )
{
  vec4 turn = Tile( row, 0 );
  vec4 place = Tile( row, 1 );
  vec2 p = Distort( sensor, Tile( row, 2 ), Tile( row, 3 ).x ) - place.xy;
  return vec4( vec2( dot( turn.xy, p ), dot( turn.zw, p ) ) + place.zw, 0.0, 1.0 );
}

void main()
{
  int row = int( a_Tile + 0.5 );
  v_colour = a_colour;
  v_window = Tile( row, 4 );
  // Half a pixel behind the lens belongs to centres alone.
  vec4 turn = Tile( row, 0 );
  gl_Position = InFrame( row, mix( a_position.xy, a_position.zw, a_uv ) );
  gl_Position.xy -= 0.5 * vec2( turn.x + turn.y, turn.z + turn.w );
}

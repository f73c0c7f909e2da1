// Edges of blobs, a point each, in the tile of their camera.
uniform highp sampler2D t_Tiles; // eight texels a camera

attribute vec3 a_position; // sensor pixels, grey
attribute float a_Tile;

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
  v_colour = vec4( a_position.zzz, 1.0 );
  v_window = Tile( row, 4 );
  gl_Position = InFrame( row, a_position.xy );
  gl_PointSize = clamp( 0.5 * Tile( row, 3 ).y, 1.0, 4.0 ); // a pixel of the sensor
}

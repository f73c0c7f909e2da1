uniform highp sampler2D t_Tiles; // eight texels a camera

attribute vec4 a_position; // the blob's first and last column and row: left, top, right, bottom
attribute float a_normal;  // its first line
attribute vec4 a_colour;
attribute float a_Tile;
attribute vec2 a_uv; // corner of the unit square

varying vec4 v_colour;
varying vec2 v_sensor; // behind the lens
flat varying vec4 v_box;
flat varying vec4 v_image;
flat varying vec4 v_lens;
flat varying vec4 v_more;
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

void main()
{
  int row = int( a_Tile + 0.5 );
  vec4 turn = Tile( row, 0 );
  vec4 place = Tile( row, 1 );
  v_lens = Tile( row, 2 );
  vec4 more = Tile( row, 3 );
  v_window = Tile( row, 4 );
  v_image = Tile( row, 5 );
  v_box = a_position;
  v_colour = a_colour;
  v_more = vec4( more.x, more.zw, a_normal );
  // Never smaller than a pixel of the screen. A lens bends the edges, by less than the diagonal; what the wider square
  // covers and the blob does not is left out behind.
  vec2 middle = 0.5 * ( a_position.xy + a_position.zw );
  vec2 size = max( a_position.zw - a_position.xy + 1.0, 2.0 * more.zw );
  if ( v_lens.xy != vec2( 0.0 ) )
  {
    vec2 centre = v_image.zw * middle + v_image.xy;
    vec2 reach = 0.5 * v_image.zw * size;
    vec2 bent = Distort( centre, v_lens, more.x ) -
                0.5 * ( Distort( centre - reach, v_lens, more.x ) + Distort( centre + reach, v_lens, more.x ) );
    size += 1.0 + 3.0 * length( bent / v_image.zw );
  }
  v_sensor = Distort( v_image.zw * ( middle + ( a_uv - 0.5 ) * size ) + v_image.xy, v_lens, more.x );
  vec2 p = v_sensor - place.xy;
  vec2 clip = vec2( dot( turn.xy, p ), dot( turn.zw, p ) ) + place.zw;
  gl_Position = a_colour != vec4( 0.0 ) ? vec4( clip, 0.0, 1.0 ) : vec4( 0.0, 0.0, 2.0, 1.0 );
}

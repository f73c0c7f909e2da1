uniform highp sampler2D t_Tiles; // eight texels a camera
uniform vec2 u_ViewportSize;
uniform vec2 u_Sizes; // of discs drawn here, pixels: from the first up to below the second

attribute vec3 a_position;
attribute vec4 a_colour;
attribute float a_Tile;
attribute vec2 a_uv; // corner of the unit square

varying vec4 v_colour;
varying float v_size;
varying vec2 v_point;
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
  vec4 lens = Tile( row, 2 );
  vec4 more = Tile( row, 3 );
  v_window = Tile( row, 4 );
  vec2 p = Distort( a_position.xy, lens, more.x ) - place.xy;
  vec2 clip = vec2( dot( turn.xy, p ), dot( turn.zw, p ) ) + place.zw;
  v_size = a_position.z * more.y;
  v_colour = a_colour;
  v_point = vec2( a_uv.x, 1.0 - a_uv.y );
  bool bSeen = v_size >= u_Sizes.x && v_size < u_Sizes.y && a_colour != vec4( 0.0 );
  vec2 corner = clip + ( a_uv - 0.5 ) * v_size * 2.0 / u_ViewportSize;
  gl_Position = bSeen ? vec4( corner, 0.0, 1.0 ) : vec4( 0.0, 0.0, 2.0, 1.0 );
}

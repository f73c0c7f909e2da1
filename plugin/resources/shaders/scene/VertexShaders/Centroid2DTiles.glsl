uniform highp sampler2D t_Tiles; // eight texels a camera
uniform vec2 u_ViewportSize;
uniform vec2 u_ViewportOffset;
uniform vec2 u_Sizes; // of points drawn here, pixels: from the first up to below the second

uniform float u_Dot;  // side of a point, pixels

attribute vec3 a_position;
attribute vec4 a_colour;
attribute float a_Tile;

varying vec4 v_colour;

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
  vec4 window = Tile( row, 4 );
  vec2 p = Distort( a_position.xy, lens, more.x ) - place.xy;
  vec2 clip = vec2( dot( turn.xy, p ), dot( turn.zw, p ) ) + place.zw;
  vec2 at = ( clip * 0.5 + 0.5 ) * u_ViewportSize + u_ViewportOffset;
  float size = a_position.z * more.y;
  bool bSeen = all( greaterThanEqual( at, window.xy ) ) && all( lessThan( at, window.zw ) ) && size >= u_Sizes.x &&
               size < u_Sizes.y && a_colour != vec4( 0.0 );
  v_colour = a_colour;
  gl_Position = bSeen ? vec4( clip, 0.0, 1.0 ) : vec4( 0.0, 0.0, 2.0, 1.0 );
  gl_PointSize = u_Dot;
}

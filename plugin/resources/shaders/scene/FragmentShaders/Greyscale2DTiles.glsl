#ifdef TEXTURE_BUFFERS
uniform highp usamplerBuffer t_Lines; // a line: its first column, its length above bit 16; its first byte
uniform highp samplerBuffer t_Pixels;
#else
#ifdef GL_ES
precision highp int;
#endif
uniform highp usampler2D t_Lines;
uniform sampler2D t_Pixels;
#endif
uniform highp int u_FirstLine;
uniform highp int u_FirstPixel;

varying vec2 v_sensor;
flat varying vec4 v_box;
flat varying vec4 v_image;
flat varying vec4 v_lens;
flat varying vec4 v_more;
flat varying vec4 v_window;

uvec2 Line( int index )
{
#ifdef TEXTURE_BUFFERS
  return texelFetch( t_Lines, u_FirstLine + index ).xy;
#else
  return texelFetch( t_Lines, ivec2( index & 2047, index >> 11 ), 0 ).xy;
#endif
}

float Pixel( int index )
{
#ifdef TEXTURE_BUFFERS
  return texelFetch( t_Pixels, u_FirstPixel + index ).r;
#else
  return texelFetch( t_Pixels, ivec2( index & 2047, index >> 11 ), 0 ).r;
#endif
}

// Back to where the sensor saw what a lens without distortion shows at that place.
vec2 Undistort( vec2 p )
{
  if ( v_lens.xy == vec2( 0.0 ) )
  {
    return p;
  }
  vec2 offset = p - v_lens.xy;
  vec2 raw = offset;
  for ( int step = 0; step < 6; ++step )
  {
    float d = dot( raw, raw );
    raw = offset / ( 1.0 + d * ( v_lens.z + d * ( v_lens.w + d * v_more.x ) ) );
  }
  return v_lens.xy + raw;
}

// The grey that this fragment shows; -1 where the blob has none. Half a pixel of the screen may be wider than half a
// pixel of the image: the fragment then shows the nearest that it covers.
float Grey()
{
  if ( any( lessThan( gl_FragCoord.xy, v_window.xy ) ) || any( greaterThan( gl_FragCoord.xy, v_window.zw ) ) )
  {
    return -1.0;
  }
  vec2 image = ( Undistort( v_sensor ) - v_image.xy ) / v_image.zw;
  vec2 inside = clamp( image, v_box.xy, v_box.zw );
  vec2 reach = max( v_more.yz, 0.5 );
  if ( any( greaterThan( abs( image - inside ), reach ) ) )
  {
    return -1.0;
  }
  uvec2 line = Line( int( v_more.w + 0.5 ) + int( floor( inside.y + 0.5 ) - v_box.y + 0.5 ) );
  float first = float( line.x & 0xFFFFu );
  float last = first + float( line.x >> 16 ) - 1.0;
  float column = clamp( floor( image.x + 0.5 ), first, last );
  if ( abs( image.x - column ) > reach.x )
  {
    return -1.0;
  }
  return Pixel( int( line.y ) + int( column - first + 0.5 ) );
}

void main()
{
  float grey = Grey();
  if ( grey < 0.0 )
  {
    discard;
  }
  gl_FragColor = vec4( grey, grey, grey, 1.0 );
}

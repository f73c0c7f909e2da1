uniform highp sampler2D t_Labels; // a texel a label: its place in pixels from the lower left, strength, marked
uniform vec2 u_ViewportSize;
uniform vec4 u_MarkedColour;

attribute vec4 a_position; // of a glyph: left and top, pixels from the label's place, y down; width and height
attribute vec2 a_uv;       // its left and top in the sheet, pixels
attribute vec4 a_colour;
attribute float a_Tile;

varying vec4 v_colour;
varying vec2 v_uv;

void main()
{
  int row = int( a_Tile + 0.5 );
  vec4 label = texelFetch( t_Labels, ivec2( row & 2047, row >> 11 ), 0 );
  vec2 corner = vec2( float( gl_VertexID & 1 ), float( gl_VertexID >> 1 ) ) * a_position.zw;
  vec2 at = label.xy + vec2( 1.0, -1.0 ) * ( a_position.xy + corner );
  v_uv = a_uv + corner;
  v_colour = vec4( label.w > 0.5 ? u_MarkedColour.rgb : a_colour.rgb, label.z );
  gl_Position = vec4( at / u_ViewportSize * 2.0 - 1.0, 0.0, 1.0 );
}

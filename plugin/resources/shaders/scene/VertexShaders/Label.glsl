uniform vec2 u_ViewportSize;

attribute vec4 a_position; // of a text: left and top, pixels from the lower left of the view; width and height
attribute vec2 a_uv;       // its left and top in the sheet, pixels
attribute vec4 a_colour;

flat varying vec4 v_colour; // premultiplied
varying vec2 v_uv;

void main()
{
  vec2 corner = vec2( float( gl_VertexID & 1 ), float( gl_VertexID >> 1 ) ) * a_position.zw;
  v_uv = a_uv + corner;
  v_colour = vec4( a_colour.rgb * a_colour.a, a_colour.a );
  gl_Position = vec4( ( a_position.xy + vec2( corner.x, -corner.y ) ) / u_ViewportSize * 2.0 - 1.0, 0.0, 1.0 );
}

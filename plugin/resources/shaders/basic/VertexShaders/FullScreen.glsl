attribute vec2 a_position;

varying vec2 v_uv;

void main()
{
  v_uv = a_position;
  gl_Position = vec4( a_position * 2.0 - 1.0, 0.0, 1.0 );
}

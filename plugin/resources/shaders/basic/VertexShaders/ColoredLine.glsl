uniform mat4 mv;
uniform mat4 u_Projection;

attribute vec3 a_position;

varying vec3 v_position;

void main()
{
  v_position = a_position;
  gl_Position = u_Projection * ( mv * vec4( a_position, 1.0 ) );
}

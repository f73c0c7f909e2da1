uniform mat4 u_View;

attribute vec3 a_position;
attribute vec4 a_colour;

varying vec4 v_colour;

void main()
{
  mat4 rotation = u_View;
  rotation[3] = vec4( 0.0, 0.0, 0.0, 1.0 );
  v_colour = a_colour;
  vec4 position = rotation * vec4( a_position, 1.0 );
  // What points at the eye lies in front.
  gl_Position = vec4( position.xy, -position.z, 1.0 );
}

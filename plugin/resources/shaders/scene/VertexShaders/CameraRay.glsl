uniform mat4 u_ViewProjection;

attribute vec4 a_position;
attribute vec4 a_colour;

varying vec3 v_position;
varying vec4 v_colour;

void main()
{
  v_position = a_position.xyz / a_position.w;
  v_colour = a_colour;
  gl_Position = u_ViewProjection * a_position;
}

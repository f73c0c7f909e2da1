uniform mat4 u_ViewProjection;
uniform vec4 u_Colour;

attribute vec3 a_position;

varying vec4 v_colour;

void main()
{
  v_colour = u_Colour;
  gl_Position = u_ViewProjection * vec4( a_position, 1.0 );
  gl_PointSize = 4.0;
}

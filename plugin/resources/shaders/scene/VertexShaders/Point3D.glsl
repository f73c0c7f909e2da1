uniform mat4 u_ViewProjection;
uniform mat4 u_Projection;

attribute vec3 a_position;
attribute vec4 a_colour;

varying vec4 v_colour;

// In front of what lies in the same plane. A parallel view would shrink with w: there it is 10 mm of depth.
vec4 Nearer( vec4 position )
{
  if ( u_Projection[3][3] != 0.0 )
  {
    position.z += 10.0 * u_Projection[2][2];
  }
  else
  {
    position.w += 0.02;
  }
  return position;
}

void main()
{
  v_colour = a_colour;
  gl_Position = Nearer( u_ViewProjection * vec4( a_position, 1.0 ) );
  gl_PointSize = 2.0;
}

uniform mat4 u_ViewProjection;
uniform vec3 u_Up;
uniform vec4 u_Extents;

attribute vec2 a_position;

varying vec2 v_floor;

void main()
{
  v_floor = mix( u_Extents.xy, u_Extents.zw, a_position );
  vec3 world = u_Up.y > 0.0 ? vec3( v_floor.x, 0.0, v_floor.y ) : vec3( v_floor, 0.0 );
  gl_Position = u_ViewProjection * vec4( world, 1.0 );
}

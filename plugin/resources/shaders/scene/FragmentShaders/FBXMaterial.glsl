uniform sampler2D t_DiffuseTexture;
uniform vec4 u_UserColourA; // stands for the texture by its alpha, where that of the texture is high
uniform vec4 u_UserColourB; // where it is low
uniform vec3 u_SpecularColour;
uniform vec3 u_EmissiveColour;
uniform float u_Shininess; // 0: no highlight
uniform float u_Alpha;
uniform vec3 u_LightVector;
uniform vec3 u_Up;

varying vec3 v_normal;
varying vec4 v_colour;
varying vec2 v_uv;
varying vec3 v_eye;

void main()
{
  vec3 normal = normalize( v_normal );
  vec3 to_camera = normalize( -v_eye );
  float facing = max( 0.0, dot( normal, to_camera ) );
  float light = 0.2 + 0.2 * max( 0.0, -dot( normal, u_Up ) ) + 0.8 * max( 0.0, dot( normal, u_LightVector ) ) +
                0.5 * max( 0.0, 1.0 - dot( to_camera, u_Up ) ) * facing;
  vec4 image = texture2D( t_DiffuseTexture, v_uv );
  vec4 user = image.a < 0.5 ? u_UserColourB : u_UserColourA;
  vec3 colour = mix( image.rgb, user.rgb, user.a ) * v_colour.rgb * min( light, 1.0 );
  float away = 1.0 - facing;
  colour += 0.25 * away * away * away * away;
  if ( u_Shininess > 0.0 )
  {
    float glance = max( 0.0, dot( normal, normalize( u_LightVector + to_camera ) ) );
    colour += u_SpecularColour * pow( glance, u_Shininess );
  }
  gl_FragColor = vec4( colour + u_EmissiveColour, u_Alpha );
}

uniform sampler2D t_DiffuseTexture;

varying vec3 v_normal;
varying vec4 v_colour;
varying vec2 v_uv;
varying vec3 v_eye;

void main()
{
  float intensity = dot( texture2D( t_DiffuseTexture, v_uv ).rgb, vec3( 0.299, 0.587, 0.114 ) );
  float facing = dot( -normalize( v_eye ), normalize( v_normal ) );
  gl_FragColor = vec4( v_colour.rgb, ( 1.0 - facing ) * 0.25 + intensity * 0.03 );
}

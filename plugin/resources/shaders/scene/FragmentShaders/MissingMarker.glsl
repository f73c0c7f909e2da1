varying vec3 v_normal;
varying vec4 v_colour;
varying vec3 v_eye;

void main()
{
  vec3 forward = normalize( v_eye );
  gl_FragColor = vec4( v_colour.rgb, max( 0.0, dot( -forward, normalize( v_normal ) ) - 0.5 ) );
}

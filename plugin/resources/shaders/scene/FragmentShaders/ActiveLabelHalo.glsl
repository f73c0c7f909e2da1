varying vec2 v_uv;
varying vec4 v_colour;

const float Radius = 0.2;
const float Border = 0.1;

// Premultiplied.
void main()
{
  float reach = length( v_uv );
  float ring = smoothstep( Radius - Border, Radius, reach ) - smoothstep( Radius, Radius + Border, reach );
  gl_FragColor = mix( vec4( 0.0 ), v_colour, ring );
}

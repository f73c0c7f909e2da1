varying vec4 v_colour;
varying float v_size;
varying vec2 v_point;
flat varying vec4 v_window;

const float Border = 2.0;
const float Cross = 1.5;
const float Inside = 0.3; // how much of the colour fills the disc

void main()
{
  if ( any( lessThan( gl_FragCoord.xy, v_window.xy ) ) || any( greaterThan( gl_FragCoord.xy, v_window.zw ) ) )
  {
    discard;
  }
  vec2 offset = ( v_point - 0.5 ) * v_size;
  float inner = 0.5 * v_size - length( offset ); // pixels from the edge
  float cover = clamp( inner + 0.5, 0.0, 1.0 );
  bool bLine = inner < Border || min( abs( offset.x ), abs( offset.y ) ) < 0.5 * Cross;
  float alpha = v_size <= 2.0 ? 1.0 : cover * ( bLine ? 1.0 : Inside );
  gl_FragColor = vec4( v_colour.rgb, v_colour.a * alpha );
}

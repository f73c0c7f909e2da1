uniform mat4 u_ViewProjection;
uniform vec3 u_CameraPosition;
uniform mat4 u_BoneTransforms[250]; // element [3][3] is the bone's health, 0 to 1
uniform bool u_HighlightMissing;

attribute vec3 a_position;
attribute vec3 a_normal;
attribute vec2 a_uv;
attribute vec4 a_BoneIndices;
attribute vec4 a_BoneWeights;

varying vec3 v_position;
varying vec3 v_normal;
varying vec4 v_colour;
varying vec2 v_uv;
varying vec3 v_eye;

void main()
{
  vec3 position = vec3( 0.0 );
  vec3 normal = vec3( 0.0 );
  float health = 1.0;
  for ( int i = 0; i < 4; ++i )
  {
    float weight = a_BoneWeights[i];
    if ( weight > 0.0 )
    {
      mat4 bone = u_BoneTransforms[clamp( int( a_BoneIndices[i] + 0.5 ), 0, 249 )];
      health -= ( 1.0 - bone[3][3] ) * weight;
      bone[3][3] = 1.0;
      position += weight * ( bone * vec4( a_position, 1.0 ) ).xyz;
      normal += weight * ( mat3( bone ) * a_normal );
    }
  }
  v_position = position;
  v_normal = normal;
  v_colour = u_HighlightMissing ? vec4( 1.0, health, health, 1.0 ) : vec4( 1.0 );
  v_uv = a_uv;
  v_eye = position - u_CameraPosition;
  gl_Position = u_ViewProjection * vec4( position, 1.0 );
}

// Single-channel frames: the red channel spread over all three.
uniform sampler2D t_DiffuseTexture;

varying vec2 v_uv;

void main()
{
  if( any( lessThan( v_uv, vec2( 0.0 ) ) ) || any( greaterThan( v_uv, vec2( 1.0 ) ) ) )
    discard;
  float luminance = texture2D( t_DiffuseTexture, v_uv ).r;
  gl_FragColor = vec4( luminance, luminance, luminance, 0.5 );
}

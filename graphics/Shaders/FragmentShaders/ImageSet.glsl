// A single-channel image tinted by a colour.
uniform sampler2D t_DiffuseTexture;
uniform vec4 u_ColourTint;

varying vec2 v_uv;

void main()
{
  if( any( lessThan( v_uv, vec2( 0.0 ) ) ) || any( greaterThan( v_uv, vec2( 1.0 ) ) ) )
    discard;
  gl_FragColor = vec4( texture2D( t_DiffuseTexture, v_uv ).r ) * u_ColourTint;
}

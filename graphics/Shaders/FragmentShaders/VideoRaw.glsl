// RGB frames as they are; u_Swizzle serves the blue-first byte orders.
uniform sampler2D t_DiffuseTexture;
uniform bool u_Swizzle;

varying vec2 v_uv;

void main()
{
  // An image smaller than the sensor keeps to its rectangle.
  if( any( lessThan( v_uv, vec2( 0.0 ) ) ) || any( greaterThan( v_uv, vec2( 1.0 ) ) ) )
    discard;
  vec4 colour = texture2D( t_DiffuseTexture, v_uv );
  if( u_Swizzle )
    colour.rgb = colour.bgr;
  gl_FragColor = vec4( colour.rgb, 0.5 );
}

// 4:2:2 frames with two pixels in each RGBA texel. Full-range luma is assumed.
uniform sampler2D t_DiffuseTexture;
uniform bool u_Swizzle;
uniform vec2 u_Resolution;

varying vec2 v_uv;

void main()
{
  if( any( lessThan( v_uv, vec2( 0.0 ) ) ) || any( greaterThan( v_uv, vec2( 1.0 ) ) ) )
    discard;

  // Snapping to the middle of the image pixel keeps pixel borders free of seams when zoomed.
  vec2 invSize = vec2( 1.0 / u_Resolution.x, 1.0 / u_Resolution.y );
  vec2 centre = v_uv - mod( v_uv, invSize ) + 0.5 * invSize;
  float alternate = mod( centre.x, 2.0 * invSize.x );

  vec4 texel = texture2D( t_DiffuseTexture, centre );
  if( u_Swizzle )
    texel = texel.yxwz;
  // texel is now Y0, U, Y1, V.
  vec3 yuv = alternate > invSize.x ? vec3( texel.z, texel.y, texel.w ) : vec3( texel.x, texel.y, texel.w );
  yuv.yz -= 0.5;

  vec3 colour;
  colour.r = yuv.x + 1.403 * yuv.z;
  colour.g = yuv.x - 0.344 * yuv.y - 0.714 * yuv.z;
  colour.b = yuv.x + 1.770 * yuv.y;
  gl_FragColor = vec4( colour, 0.5 );
}

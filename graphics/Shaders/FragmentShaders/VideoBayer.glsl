// High-quality linear demosaic with the 5 by 5 filters of Malvar, He and Cutler, followed by
// the gamma and saturation settings of the display.
uniform sampler2D t_DiffuseTexture;
uniform vec2 u_Resolution;
uniform vec2 u_FirstRed;
uniform vec2 u_ColourCorrection;

varying vec2 v_uv;

// Weights of the four filters (cross, checker, theta, phi) for each group of neighbours.
const vec4 kC = vec4( 4.0, 6.0, 5.0, 5.0 ) / 8.0;
const vec4 kA = vec4( -1.0, -1.5, 0.5, -1.0 ) / 8.0;
const vec4 kB = vec4( 2.0, 0.0, 0.0, 4.0 ) / 8.0;
const vec4 kD = vec4( 0.0, 2.0, -1.0, -1.0 ) / 8.0;

void main()
{
  if( any( lessThan( v_uv, vec2( 0.0 ) ) ) || any( greaterThan( v_uv, vec2( 1.0 ) ) ) )
    discard;

  // Neighbours are reached by adding multiples of invSize, so the lookup must start in the
  // middle of a pixel; nearest filtering alone would not do.
  vec2 invSize = vec2( 1.0 / u_Resolution.x, 1.0 / u_Resolution.y );
  vec2 centre = v_uv - mod( v_uv, invSize ) + 0.5 * invSize;

  float C = texture2D( t_DiffuseTexture, centre ).r;
  vec2 alternate = mod( floor( centre * u_Resolution + u_FirstRed ), 2.0 );

  float D = texture2D( t_DiffuseTexture, centre + vec2( -1.0, -1.0 ) * invSize ).r +
            texture2D( t_DiffuseTexture, centre + vec2( -1.0, 1.0 ) * invSize ).r +
            texture2D( t_DiffuseTexture, centre + vec2( 1.0, -1.0 ) * invSize ).r +
            texture2D( t_DiffuseTexture, centre + vec2( 1.0, 1.0 ) * invSize ).r;
  float A = texture2D( t_DiffuseTexture, centre + vec2( 0.0, -2.0 ) * invSize ).r +
            texture2D( t_DiffuseTexture, centre + vec2( 0.0, 2.0 ) * invSize ).r;
  float B = texture2D( t_DiffuseTexture, centre + vec2( 0.0, -1.0 ) * invSize ).r +
            texture2D( t_DiffuseTexture, centre + vec2( 0.0, 1.0 ) * invSize ).r;
  float E = texture2D( t_DiffuseTexture, centre + vec2( -2.0, 0.0 ) * invSize ).r +
            texture2D( t_DiffuseTexture, centre + vec2( 2.0, 0.0 ) * invSize ).r;
  float F = texture2D( t_DiffuseTexture, centre + vec2( -1.0, 0.0 ) * invSize ).r +
            texture2D( t_DiffuseTexture, centre + vec2( 1.0, 0.0 ) * invSize ).r;

  vec4 kE = kA.xywz;
  vec4 kF = kB.xywz;
  // x: cross, y: checker, z: theta, w: phi.
  vec4 value = C * kC + A * kA + B * kB + D * kD + E * kE + F * kF;

  vec3 colour;
  if( alternate.y == 0.0 )
  {
    if( alternate.x == 0.0 )
      colour = vec3( C, value.x, value.y );
    else
      colour = vec3( value.z, C, value.w );
  }
  else
  {
    if( alternate.x == 0.0 )
      colour = vec3( value.w, C, value.z );
    else
      colour = vec3( value.y, value.x, C );
  }

  // pow is undefined below zero, and the filters overshoot there near sharp edges.
  colour = sign( colour ) * pow( abs( colour ), vec3( 1.0 / u_ColourCorrection.x ) );

  float amount = u_ColourCorrection.y - 1.0;
  float grey = dot( max( colour, vec3( 0.0 ) ), vec3( 1.0 / 3.0 ) );
  colour = mix( colour, vec3( grey ), min( -amount, 1.0 ) );

  gl_FragColor = vec4( colour, 0.5 );
}

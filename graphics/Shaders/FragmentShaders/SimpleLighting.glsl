// Three diffuse lights: one from the camera, a key light from above and a weak fill from below.
uniform mat4 u_View;
uniform vec3 u_Up;

varying vec3 v_normal;
varying lowp vec4 v_colour;

void main()
{
  vec3 normal = normalize( v_normal );
  vec3 towardsCamera = vec3( u_View[ 0 ][ 2 ], u_View[ 1 ][ 2 ], u_View[ 2 ][ 2 ] );
  float light = 0.5 * max( dot( normal, towardsCamera ), 0.0 ) + 0.2 * max( dot( normal, -u_Up ), 0.0 ) +
                0.8 * max( dot( normal, u_Up ), 0.0 ) + 0.2;
  gl_FragColor = vec4( v_colour.rgb * light, v_colour.a );
}

// Dashes of four units, measured from the source point of the line.
uniform vec3 u_SourcePoint;
uniform lowp vec4 u_ModelColour;

varying vec4 position;

void main()
{
  if( mod( distance( position.xyz, u_SourcePoint ), 8.0 ) > 4.0 )
    discard;
  gl_FragColor = u_ModelColour;
}

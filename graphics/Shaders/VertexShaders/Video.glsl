// Lays the sensor mesh into the view. Lens distortion moves the vertices, not the texture
// lookups: each vertex keeps the texture coordinate of its undistorted place, so the picture
// bends with the mesh.
attribute mediump vec4 a_position;

uniform vec4 u_View2D;
uniform vec2 u_SensorSize;
uniform vec2 u_RadialDistortionCentre;
uniform vec3 u_RadialDistortionParameters;
uniform mat2 u_Rotation;
uniform vec2 u_RotationCentre;
uniform vec4 u_VideoScaleAndOffset;
uniform bool u_Inverted;

varying vec2 v_uv;

void main()
{
  vec4 position = a_position;
  position.z = 0.0;

  vec2 p = u_SensorSize * position.xy;
  if( u_RadialDistortionCentre != vec2( 0.0, 0.0 ) )
  {
    p -= u_RadialDistortionCentre;
    float s = dot( p, p );
    vec3 k = u_RadialDistortionParameters;
    p *= 1.0 + s * ( k.x + s * ( k.y + s * k.z ) );
    p += u_RadialDistortionCentre;
  }
  p /= u_SensorSize;

  p = p * u_SensorSize - u_RotationCentre;
  p = u_Rotation * p + u_RotationCentre;
  p /= u_SensorSize;

  vec2 clip = p - u_View2D.zw;
  clip.y = -clip.y;
  clip *= 2.0 * u_View2D.xy;
  gl_Position = vec4( clip, 0.0, a_position.w );

  v_uv = a_position.xy;
  if( u_Inverted )
    v_uv.y = 1.0 - v_uv.y;
  v_uv = ( v_uv + u_VideoScaleAndOffset.zw ) * u_VideoScaleAndOffset.xy;
}

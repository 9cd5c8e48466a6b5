attribute vec4 a_position;

uniform mat4 u_ViewProjection;
uniform float u_PointSize;

void main()
{
  gl_Position = u_ViewProjection * a_position;
  gl_PointSize = u_PointSize;
}

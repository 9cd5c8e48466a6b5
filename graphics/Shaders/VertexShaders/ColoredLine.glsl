// Passes the position on so that the fragment stage can measure along the line.
attribute vec4 a_position;

uniform mat4 u_ViewProjection;

varying vec4 position;

void main()
{
  gl_Position = u_ViewProjection * a_position;
  position = a_position;
}

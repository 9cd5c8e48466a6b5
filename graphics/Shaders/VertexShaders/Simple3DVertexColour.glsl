attribute vec4 a_position;
attribute lowp vec4 a_colour;

uniform mat4 u_ViewProjection;

varying lowp vec4 v_colour;

void main()
{
  gl_Position = u_ViewProjection * a_position;
  v_colour = a_colour;
}

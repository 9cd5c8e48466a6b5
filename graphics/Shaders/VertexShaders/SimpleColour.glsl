attribute vec4 a_position;
attribute lowp vec4 a_colour;

varying lowp vec4 v_colour;

void main()
{
  gl_Position = a_position;
  v_colour = a_colour;
}

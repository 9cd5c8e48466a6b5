attribute vec4 a_position;
attribute lowp vec4 a_colour;

uniform mat4 u_ViewProjection;
uniform mat4 u_ModelTransform;

varying lowp vec4 v_colour;

void main()
{
  gl_Position = u_ViewProjection * ( u_ModelTransform * a_position );
  v_colour = a_colour;
}

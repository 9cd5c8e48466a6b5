attribute vec4 a_position;
attribute vec3 a_normal;
attribute lowp vec4 a_colour;

uniform mat4 u_ViewProjection;
uniform mat4 u_ModelTransform;

varying vec3 v_normal;
varying lowp vec4 v_colour;

void main()
{
  gl_Position = u_ViewProjection * ( u_ModelTransform * a_position );
  v_normal = normalize( mat3( u_ModelTransform ) * a_normal );
  v_colour = a_colour;
}

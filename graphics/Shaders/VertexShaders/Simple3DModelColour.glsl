attribute vec4 a_position;
attribute vec3 a_normal;

uniform mat4 u_ViewProjection;
uniform mat4 u_ModelTransform;
uniform lowp vec4 u_ModelColour;

varying vec3 v_normal;
varying lowp vec4 v_colour;
varying vec3 v_position;

void main()
{
  vec4 world = u_ModelTransform * a_position;
  gl_Position = u_ViewProjection * world;
  v_normal = normalize( mat3( u_ModelTransform ) * a_normal );
  v_colour = u_ModelColour;
  v_position = world.xyz;
}

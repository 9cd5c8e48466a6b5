#include "graphics/CoreGraphics/VShader.h"

#include <gtest/gtest.h>

namespace
{
  // The preambles are a contract with every shader file: the files are written against them.
  TEST( ShaderPreamble, VertexStage )
  {
    EXPECT_EQ( CoreGraphics::VShader::Preamble( CoreGraphics::VShader::Kind_Vertex ).toStdString(),
               "#version 300 es\n"
               "#undef highp\n"
               "precision highp sampler2D;\n"
               "#define attribute in\n"
               "#define varying out\n"
               "#define texture2D texture\n" );
  }

  TEST( ShaderPreamble, FragmentStage )
  {
    EXPECT_EQ( CoreGraphics::VShader::Preamble( CoreGraphics::VShader::Kind_Fragment ).toStdString(),
               "#version 300 es\n"
               "#undef highp\n"
               "precision highp float;\n"
               "#define varying in\n"
               "out vec4 FragColor;\n"
               "#define gl_FragColor FragColor\n"
               "#define texture2D texture\n" );
  }
} // namespace

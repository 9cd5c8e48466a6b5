#include "graphics/CoreGraphics/VShader.h"

#include <gtest/gtest.h>

namespace
{
  // The preambles are a contract with every shader file: the files are written against them.
  TEST( ShaderPreamble, EachStageGetsItsOwn )
  {
    using CoreGraphics::VShader;
    EXPECT_EQ( VShader::Preamble( VShader::Kind_Vertex ).toStdString(),
               "#version 300 es\n#undef highp\nprecision highp sampler2D;\n"
               "#define attribute in\n#define varying out\n#define texture2D texture\n" );
    EXPECT_EQ( VShader::Preamble( VShader::Kind_Fragment ).toStdString(),
               "#version 300 es\n#undef highp\nprecision highp float;\n#define varying in\n"
               "out vec4 FragColor;\n#define gl_FragColor FragColor\n#define texture2D texture\n" );
  }
} // namespace

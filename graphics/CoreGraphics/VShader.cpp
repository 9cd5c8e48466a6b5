#include "graphics/CoreGraphics/VShader.h"

#include "services/Log.h"

#include <QFile>
#include <QOpenGLContext>
#include <QOpenGLShader>

namespace CoreGraphics
{
  QByteArray VShader::Preamble( EKind i_Kind )
  {
    // Qt defines lowp, mediump and highp away on desktop contexts; highp is brought back so that
    // the default precision statement stays legal, the others keep vanishing from declarations.
    if( i_Kind == Kind_Vertex )
      return QByteArrayLiteral( "#version 300 es\n"
                                "#undef highp\nprecision highp sampler2D;\n"
                                "#define attribute in\n#define varying out\n#define texture2D texture\n" );
    return QByteArrayLiteral( "#version 300 es\n"
                              "#undef highp\nprecision highp float;\n"
                              "#define varying in\nout vec4 FragColor;\n#define gl_FragColor FragColor\n"
                              "#define texture2D texture\n" );
  }

  VShader::VShader( EKind i_Kind, const QString& i_rPath ) : m_Kind( i_Kind ), m_Path( i_rPath )
  {
    const std::string Path = i_rPath.toStdString();
    LUMEK_LOG( "CoreGraphics", ZOL::LogDetail, "Loading shader file %1%", Path );

    QFile File( i_rPath );
    if( !File.open( QIODevice::ReadOnly ) )
    {
      LUMEK_LOG( "CoreGraphics", ZOL::LogFailure, "Failed to open %1%", Path );
      return;
    }
    const QByteArray Text = File.readAll();
    if( QOpenGLContext::currentContext() == nullptr )
    {
      LUMEK_LOG( "CoreGraphics", ZOL::LogFailure, "Shader Failed To Compile<%1%> Log=<%2%>", Path,
                 "no current OpenGL context" );
      return;
    }

    const QString Source = QString::fromLatin1( Preamble( i_Kind ) + "#line 1\n" + Text );
    auto pShader =
        std::make_unique< QOpenGLShader >( i_Kind == Kind_Vertex ? QOpenGLShader::Vertex : QOpenGLShader::Fragment );
    if( !pShader->compileSourceCode( Source ) )
    {
      LUMEK_LOG( "CoreGraphics", ZOL::LogFailure, "Shader Failed To Compile<%1%> Log=<%2%>", Path,
                 pShader->log().toStdString() );
      return;
    }
    m_pShader = std::move( pShader );
  }

  VShader::~VShader() = default;
} // namespace CoreGraphics

#include "graphics/CoreGraphics/VShaderProgram.h"

#include "graphics/CoreGraphics/MurmurHash3.h"
#include "graphics/CoreGraphics/VShader.h"
#include "services/Log.h"

#include <QOpenGLContext>
#include <QOpenGLExtraFunctions>
#include <QOpenGLShaderProgram>

#include <vector>

namespace CoreGraphics
{
  const char* StandardUniformName( int i_Uniform )
  {
    static const char* const Names[StandardUniformCount] = { "u_ViewProjection",
                                                             "u_View",
                                                             "u_Projection",
                                                             "u_View2D",
                                                             "u_ViewportSize",
                                                             "u_ViewportOffset",
                                                             "u_FrameSize",
                                                             "u_LightVector",
                                                             "u_Up",
                                                             "u_GlobalTime",
                                                             "u_CameraPosition",
                                                             "u_RadialDistortionCentre",
                                                             "u_RadialDistortionParameters",
                                                             "u_SensorSize" };
    return ( i_Uniform >= 0 && i_Uniform < StandardUniformCount ) ? Names[i_Uniform] : nullptr;
  }

  VShaderProgram::VShaderProgram( std::shared_ptr< VShader > i_pVertex, std::shared_ptr< VShader > i_pFragment )
  {
    Link( std::move( i_pVertex ), std::move( i_pFragment ) );
  }

  VShaderProgram::~VShaderProgram() = default;

  void VShaderProgram::Relink( std::shared_ptr< VShader > i_pVertex, std::shared_ptr< VShader > i_pFragment )
  {
    Link( std::move( i_pVertex ), std::move( i_pFragment ) );
  }

  void VShaderProgram::Link( std::shared_ptr< VShader > i_pVertex, std::shared_ptr< VShader > i_pFragment )
  {
    m_pProgram.reset();
    m_bBound = false;
    m_StandardUniforms.fill( -1 );
    m_StandardAttributes.fill( -1 );
    m_UniformsByHash.clear();
    if( !i_pVertex || !i_pFragment || !i_pVertex->IsCompiled() || !i_pFragment->IsCompiled() ||
        QOpenGLContext::currentContext() == nullptr )
      return;

    auto pProgram = std::make_unique< QOpenGLShaderProgram >();
    if( !pProgram->addShader( i_pVertex->GetShader() ) || !pProgram->addShader( i_pFragment->GetShader() ) )
      return;
    if( !pProgram->link() )
    {
      LUMEK_LOG( "CoreGraphics", ZOL::LogFailure, "Shader Program Failed To Link<%1%, %2%> Log=<%3%>",
                 i_pVertex->GetPath().toStdString(), i_pFragment->GetPath().toStdString(),
                 pProgram->log().toStdString() );
      return;
    }

    // The stages stay referenced: the program holds raw pointers to their QOpenGLShader objects.
    m_pVertex = std::move( i_pVertex );
    m_pFragment = std::move( i_pFragment );
    m_pProgram = std::move( pProgram );
    m_pProgram->bind();
    m_bBound = true;

    for( int i = 0; i < StandardUniformCount; ++i )
      m_StandardUniforms[i] = m_pProgram->uniformLocation( StandardUniformName( i ) );
    for( int i = 0; i < StandardAttributeCount; ++i )
      m_StandardAttributes[i] = m_pProgram->attributeLocation( StandardAttributeName( i ) );
    ReadUniformTable();
  }

  void VShaderProgram::ReadUniformTable()
  {
    QOpenGLExtraFunctions* pGL = QOpenGLContext::currentContext()->extraFunctions();
    const GLuint Id = m_pProgram->programId();
    GLint Count = 0;
    GLint MaxLength = 0;
    pGL->glGetProgramiv( Id, GL_ACTIVE_UNIFORMS, &Count );
    pGL->glGetProgramiv( Id, GL_ACTIVE_UNIFORM_MAX_LENGTH, &MaxLength );
    std::vector< char > Name( static_cast< std::size_t >( std::max( MaxLength, 1 ) ) + 1, 0 );
    for( GLint i = 0; i < Count; ++i )
    {
      GLsizei Length = 0;
      GLint Size = 0;
      GLenum Type = 0;
      pGL->glGetActiveUniform( Id, static_cast< GLuint >( i ), static_cast< GLsizei >( Name.size() ), &Length, &Size,
                               &Type, Name.data() );
      const int Location = pGL->glGetUniformLocation( Id, Name.data() );
      m_UniformsByHash[MurmurHash3_32( Name.data(), static_cast< std::size_t >( Length ) )] = Location;
    }
  }

  bool VShaderProgram::Bind()
  {
    if( !m_pProgram )
      return false;
    m_bBound = m_pProgram->bind();
    return m_bBound;
  }

  void VShaderProgram::Release()
  {
    if( m_pProgram && m_bBound )
      m_pProgram->release();
    m_bBound = false;
  }

  int VShaderProgram::UniformLocation( const char* i_pName ) const
  {
    return m_pProgram ? m_pProgram->uniformLocation( i_pName ) : -1;
  }

  int VShaderProgram::UniformLocationByHash( std::uint32_t i_NameHash ) const
  {
    const auto It = m_UniformsByHash.find( i_NameHash );
    return It == m_UniformsByHash.end() ? -1 : It->second;
  }

  int VShaderProgram::StandardUniformLocation( int i_Uniform ) const
  {
    return ( i_Uniform >= 0 && i_Uniform < StandardUniformCount ) ? m_StandardUniforms[i_Uniform] : -1;
  }

  int VShaderProgram::StandardAttributeLocation( int i_Attribute ) const
  {
    return ( i_Attribute >= 0 && i_Attribute < StandardAttributeCount ) ? m_StandardAttributes[i_Attribute] : -1;
  }

#define LUMEK_SET_UNIFORM( TYPE )                                                                                      \
  void VShaderProgram::SetUniform( int i_Location, TYPE i_Value )                                                      \
  {                                                                                                                    \
    if( m_pProgram && i_Location >= 0 )                                                                                \
      m_pProgram->setUniformValue( i_Location, i_Value );                                                              \
  }

  LUMEK_SET_UNIFORM( int )
  LUMEK_SET_UNIFORM( float )
  LUMEK_SET_UNIFORM( const QSize& )
  LUMEK_SET_UNIFORM( const QPoint& )
  LUMEK_SET_UNIFORM( const QVector2D& )
  LUMEK_SET_UNIFORM( const QVector3D& )
  LUMEK_SET_UNIFORM( const QVector4D& )
  LUMEK_SET_UNIFORM( const QMatrix2x2& )
  LUMEK_SET_UNIFORM( const QMatrix4x4& )
#undef LUMEK_SET_UNIFORM
} // namespace CoreGraphics

#include "graphics/CoreGraphics/VRenderContext.h"

#include "graphics/CoreGraphics/VShaderProgram.h"
#include "services/Log.h"

#include <QOpenGLContext>
#include <QOpenGLDebugLogger>
#include <QOpenGLExtraFunctions>
#include <QOpenGLFramebufferObject>
#include <QOpenGLTexture>

#ifndef GL_VERTEX_PROGRAM_POINT_SIZE
#define GL_VERTEX_PROGRAM_POINT_SIZE 0x8642
#endif
#ifndef GL_POINT_SPRITE
#define GL_POINT_SPRITE 0x8861
#endif
#ifndef GL_POINT_SMOOTH
#define GL_POINT_SMOOTH 0x0B10
#endif
#ifndef GL_DEBUG_OUTPUT_SYNCHRONOUS
#define GL_DEBUG_OUTPUT_SYNCHRONOUS 0x8242
#endif
#ifndef GL_RGB565
#define GL_RGB565 0x8D62
#endif

namespace CoreGraphics
{
  namespace
  {
    struct VClientFormat
    {
      GLenum InternalFormat;
      GLenum Format;
      GLenum Type;
    };

    const VClientFormat ClientFormats[] = {
        { GL_R8, GL_RED, GL_UNSIGNED_BYTE },
        { GL_RGB8, GL_RGB, GL_UNSIGNED_BYTE },
        { GL_RGBA8, GL_RGBA, GL_UNSIGNED_BYTE },
        { GL_RGB565, GL_RGB, GL_UNSIGNED_SHORT_5_6_5 },
    };

    int DebugLevel( QOpenGLDebugMessage::Severity i_Severity )
    {
      switch( i_Severity )
      {
      case QOpenGLDebugMessage::HighSeverity:
        return ZOL::LogFailure;
      case QOpenGLDebugMessage::MediumSeverity:
        return ZOL::LogWarning;
      case QOpenGLDebugMessage::LowSeverity:
        return ZOL::LogInfo;
      default:
        return ZOL::LogDetail;
      }
    }
  } // namespace

  bool ClientFormatOf( GLenum i_InternalFormat, GLenum& o_rFormat, GLenum& o_rType )
  {
    for( const VClientFormat& rRow : ClientFormats )
      if( rRow.InternalFormat == i_InternalFormat )
      {
        o_rFormat = rRow.Format;
        o_rType = rRow.Type;
        return true;
      }
    return false;
  }

  VRenderContext::VRenderContext() = default;
  VRenderContext::~VRenderContext() = default;

  void VRenderContext::Initialise()
  {
    m_pContext = QOpenGLContext::currentContext();
    if( m_pContext == nullptr )
      return;
    m_pFunctions = m_pContext->extraFunctions();
    m_pFunctions->initializeOpenGLFunctions();

    if( QSurfaceFormat::defaultFormat().testOption( QSurfaceFormat::DebugContext ) )
    {
      LUMEK_LOG( "CoreGraphics", ZOL::LogInfo, "Debug OpenGL context requested" );
      if( m_pContext->hasExtension( QByteArrayLiteral( "GL_KHR_debug" ) ) )
      {
        LUMEK_LOG( "CoreGraphics", ZOL::LogInfo, "Initialising debug logger" );
        m_pDebugLogger = std::make_unique< QOpenGLDebugLogger >();
        m_pDebugLogger->initialize();
        m_pFunctions->glEnable( GL_DEBUG_OUTPUT_SYNCHRONOUS );
      }
      else
        LUMEK_LOG( "CoreGraphics", ZOL::LogWarning, "GL_KHR_debug not available" );
    }

    SetClearColour( QColor( 25, 25, 25, 255 ) );
    ResetState();
  }

  void VRenderContext::ResetState()
  {
    if( m_pFunctions == nullptr )
      return;
    QOpenGLExtraFunctions& rGL = *m_pFunctions;
    for( GLuint i = 0; i < 8; ++i )
      rGL.glDisableVertexAttribArray( i );
    m_EnabledArrays.reset();
    rGL.glBindBuffer( GL_ARRAY_BUFFER, 0 );
    rGL.glBindBuffer( GL_ELEMENT_ARRAY_BUFFER, 0 );
    rGL.glUseProgram( 0 );
    rGL.glDisable( GL_CULL_FACE );
    rGL.glDisable( GL_BLEND );
    rGL.glDisable( GL_DEPTH_TEST );
    rGL.glColorMask( GL_TRUE, GL_TRUE, GL_TRUE, GL_TRUE );
    rGL.glDepthMask( GL_TRUE );
    rGL.glCullFace( GL_BACK );
    if( !m_pContext->isOpenGLES() )
    {
      rGL.glEnable( GL_VERTEX_PROGRAM_POINT_SIZE );
      rGL.glEnable( GL_POINT_SPRITE );
      if( m_pContext->format().majorVersion() < 3 )
        rGL.glDisable( GL_POINT_SMOOTH );
    }
    rGL.glActiveTexture( GL_TEXTURE0 );
    rGL.glBindTexture( GL_TEXTURE_2D, 0 );
    if( m_pProgram )
      m_pProgram->Release();
    m_pProgram.reset();
    CheckErrors();
  }

  void VRenderContext::CheckErrors()
  {
    if( !m_pDebugLogger )
      return;
    for( const QOpenGLDebugMessage& rMessage : m_pDebugLogger->loggedMessages() )
      LUMEK_LOG( "CoreGraphics", DebugLevel( rMessage.severity() ), "%1%", rMessage.message().toStdString() );
  }

  void VRenderContext::SetViewport( const QRect& i_rViewport )
  {
    m_Viewport = i_rViewport;
    if( m_pFunctions != nullptr )
      m_pFunctions->glViewport( i_rViewport.x(), i_rViewport.y(), i_rViewport.width(), i_rViewport.height() );
  }

  void VRenderContext::SetUpDirection( bool i_bYIsUp )
  {
    m_bYIsUp = i_bYIsUp;
    m_Up = i_bYIsUp ? QVector3D( 0.0f, 1.0f, 0.0f ) : QVector3D( 0.0f, 0.0f, 1.0f );
  }

  void VRenderContext::SetView2D( const QVector2D& i_rScale, const QVector2D& i_rCentre )
  {
    m_View2D = QVector4D( i_rScale.x(), i_rScale.y(), i_rCentre.x(), i_rCentre.y() );
  }

  void VRenderContext::SetRadialDistortion( const QVector2D& i_rCentre, const QVector3D& i_rParameters )
  {
    m_RadialDistortionCentre = i_rCentre;
    m_RadialDistortionParameters = i_rParameters;
  }

  bool VRenderContext::UseProgram( const std::shared_ptr< VShaderProgram >& i_pProgram )
  {
    if( !i_pProgram || !i_pProgram->IsLinked() )
      return false;
    if( m_pProgram )
      m_pProgram->Release();
    if( !i_pProgram->Bind() )
      return false;

    VShaderProgram& rProgram = *i_pProgram;
    auto Location = [&rProgram]( EStandardUniform i_Uniform ) { return rProgram.StandardUniformLocation( i_Uniform ); };
    rProgram.SetUniform( Location( Uniform_ViewProjection ), m_Projection * m_View );
    rProgram.SetUniform( Location( Uniform_View ), m_View );
    rProgram.SetUniform( Location( Uniform_Projection ), m_Projection );
    rProgram.SetUniform( Location( Uniform_View2D ), m_View2D );
    rProgram.SetUniform( Location( Uniform_ViewportSize ), m_Viewport.size() );
    rProgram.SetUniform( Location( Uniform_ViewportOffset ), m_Viewport.topLeft() );
    rProgram.SetUniform( Location( Uniform_FrameSize ), m_FrameSize );
    rProgram.SetUniform( Location( Uniform_LightVector ), m_LightVector );
    rProgram.SetUniform( Location( Uniform_Up ), m_Up );
    rProgram.SetUniform( Location( Uniform_GlobalTime ), m_GlobalTime );
    rProgram.SetUniform( Location( Uniform_CameraPosition ), m_View.inverted().map( QVector3D() ) );
    rProgram.SetUniform( Location( Uniform_RadialDistortionCentre ), m_RadialDistortionCentre );
    rProgram.SetUniform( Location( Uniform_RadialDistortionParameters ), m_RadialDistortionParameters );
    rProgram.SetUniform( Location( Uniform_SensorSize ), m_SensorSize );
    m_pProgram = i_pProgram;
    CheckErrors();
    return true;
  }

  void VRenderContext::ApplyState( const VRenderState& i_rState )
  {
    if( m_pFunctions == nullptr )
      return;
    QOpenGLExtraFunctions& rGL = *m_pFunctions;

    struct VBlend
    {
      GLenum Source;
      GLenum Destination;
    };
    static const VBlend ColourBlends[] = { { GL_ONE, GL_ZERO },
                                           { GL_SRC_ALPHA, GL_ONE_MINUS_SRC_ALPHA },
                                           { GL_SRC_ALPHA, GL_ONE },
                                           { GL_CONSTANT_ALPHA, GL_ONE },
                                           { GL_ONE, GL_ONE_MINUS_SRC_ALPHA } };
    if( i_rState.ColourBlendMode != 0 || i_rState.AlphaBlendMode != 0 )
    {
      rGL.glEnable( GL_BLEND );
      const int Mode = ( i_rState.ColourBlendMode >= 0 && i_rState.ColourBlendMode < 5 ) ? i_rState.ColourBlendMode : 0;
      if( Mode == 3 )
        rGL.glBlendColor( i_rState.BlendConstant, i_rState.BlendConstant, i_rState.BlendConstant,
                          i_rState.BlendConstant );
      const VBlend Alpha = i_rState.AlphaBlendMode == 0   ? VBlend{ GL_ZERO, GL_ONE }
                           : i_rState.AlphaBlendMode == 1 ? VBlend{ GL_ONE, GL_ONE }
                                                          : VBlend{ GL_ONE, GL_ZERO };
      rGL.glBlendFuncSeparate( ColourBlends[Mode].Source, ColourBlends[Mode].Destination, Alpha.Source,
                               Alpha.Destination );
    }
    else
      rGL.glDisable( GL_BLEND );

    if( i_rState.CullMode == 0 )
      rGL.glDisable( GL_CULL_FACE );
    else
    {
      rGL.glEnable( GL_CULL_FACE );
      rGL.glCullFace( i_rState.CullMode == 1 ? GL_FRONT : GL_BACK );
    }

    static const GLenum DepthFunctions[] = { GL_LESS, GL_LEQUAL, GL_GREATER, GL_GEQUAL, GL_NOTEQUAL, GL_EQUAL };
    if( i_rState.DepthTest )
    {
      rGL.glEnable( GL_DEPTH_TEST );
      if( i_rState.DepthFunction >= 0 && i_rState.DepthFunction < 6 )
        rGL.glDepthFunc( DepthFunctions[i_rState.DepthFunction] );
    }
    else
      rGL.glDisable( GL_DEPTH_TEST );

    rGL.glColorMask( i_rState.RedWrite, i_rState.GreenWrite, i_rState.BlueWrite, i_rState.AlphaWrite );
    rGL.glDepthMask( i_rState.DepthWrite );
    CheckErrors();
  }

  void VRenderContext::ApplyTextureState( const VTextureState& i_rState )
  {
    if( m_pFunctions == nullptr )
      return;
    static const GLenum MinFilters[] = { GL_NEAREST_MIPMAP_NEAREST, GL_LINEAR_MIPMAP_NEAREST, GL_LINEAR_MIPMAP_LINEAR,
                                         GL_NEAREST };
    const int Filter = ( i_rState.MinificationFilter >= 0 && i_rState.MinificationFilter < 4 )
                           ? i_rState.MinificationFilter
                           : VTextureState::LinearMipmapNearest;
    QOpenGLExtraFunctions& rGL = *m_pFunctions;
    rGL.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, static_cast< GLint >( MinFilters[Filter] ) );
    rGL.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, i_rState.MagnificationLinear ? GL_LINEAR : GL_NEAREST );
    rGL.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, i_rState.ClampS ? GL_CLAMP_TO_EDGE : GL_REPEAT );
    rGL.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, i_rState.ClampT ? GL_CLAMP_TO_EDGE : GL_REPEAT );
    CheckErrors();
  }

  void VRenderContext::SetClearColour( const QColor& i_rColour )
  {
    if( m_pFunctions != nullptr )
      m_pFunctions->glClearColor( i_rColour.redF(), i_rColour.greenF(), i_rColour.blueF(), i_rColour.alphaF() );
  }

  void VRenderContext::Clear( bool i_bColour, bool i_bDepth )
  {
    if( m_pFunctions == nullptr )
      return;
    const GLbitfield Mask = ( i_bColour ? GL_COLOR_BUFFER_BIT : 0 ) | ( i_bDepth ? GL_DEPTH_BUFFER_BIT : 0 );
    if( Mask != 0 )
      m_pFunctions->glClear( Mask );
  }

  void VRenderContext::BindVertexBuffer( VVertexBuffer& io_rBuffer )
  {
    if( m_pFunctions == nullptr || io_rBuffer.GetLayout() == nullptr || !io_rBuffer.GetBuffer().isCreated() )
      return;
    QOpenGLExtraFunctions& rGL = *m_pFunctions;
    io_rBuffer.GetBuffer().bind();
    const VVertexLayout& rLayout = *io_rBuffer.GetLayout();

    // The arrays are counted by the entry's place in the layout while the pointers go to the
    // attribute's location; the two agree for layouts whose locations follow their order.
    std::bitset< 8 > Used;
    for( std::size_t i = 0; i < rLayout.Entries.size() && i < 8; ++i )
    {
      const VVertexLayoutEntry& rEntry = rLayout.Entries[i];
      const int Location = m_pProgram ? m_pProgram->StandardAttributeLocation( rEntry.Attribute ) : -1;
      if( Location < 0 )
        continue;
      rGL.glVertexAttribPointer( static_cast< GLuint >( Location ), rEntry.Components, rEntry.GetGLType(),
                                 rEntry.Normalised ? GL_TRUE : GL_FALSE, static_cast< GLsizei >( rLayout.Stride ),
                                 reinterpret_cast< const void* >( static_cast< std::uintptr_t >( rEntry.Offset ) ) );
      Used.set( i );
    }
    if( Used != m_EnabledArrays )
    {
      for( GLuint i = 0; i < 8; ++i )
        if( Used[i] != m_EnabledArrays[i] )
        {
          if( Used[i] )
            rGL.glEnableVertexAttribArray( i );
          else
            rGL.glDisableVertexAttribArray( i );
        }
      m_EnabledArrays = Used;
    }
    CheckErrors();
  }

  void VRenderContext::DrawIndexed( GLenum i_Mode, VIndexBuffer& io_rIndices )
  {
    if( m_pFunctions == nullptr || !io_rIndices.GetBuffer().isCreated() || io_rIndices.GetIndexCount() == 0 )
      return;
    io_rIndices.GetBuffer().bind();
    m_pFunctions->glDrawElements( i_Mode, static_cast< GLsizei >( io_rIndices.GetIndexCount() ),
                                  io_rIndices.GetIndexType(), nullptr );
    CheckErrors();
  }

  void VRenderContext::DrawArrays( GLenum i_Mode, int i_First, int i_Count )
  {
    if( m_pFunctions == nullptr )
      return;
    m_pFunctions->glDrawArrays( i_Mode, i_First, i_Count );
    CheckErrors();
  }

  void VRenderContext::DrawArraysInstanced( GLenum i_Mode, int i_First, int i_Count, int i_Instances )
  {
    if( m_pFunctions == nullptr )
      return;
    m_pFunctions->glDrawArraysInstanced( i_Mode, i_First, i_Count, i_Instances );
    CheckErrors();
  }

  void VRenderContext::BindTexture( int i_Unit, QOpenGLTexture* i_pTexture )
  {
    if( m_pFunctions == nullptr )
      return;
    m_pFunctions->glActiveTexture( GL_TEXTURE0 + static_cast< GLenum >( i_Unit ) );
    m_pFunctions->glBindTexture( GL_TEXTURE_2D, i_pTexture ? i_pTexture->textureId() : 0 );
    CheckErrors();
  }

  bool VRenderContext::UploadTexture( const QSize& i_rSize, const void* i_pPixels, GLenum i_InternalFormat, int i_Level,
                                      int i_Layer )
  {
    GLenum Format = 0;
    GLenum Type = 0;
    if( m_pFunctions == nullptr || !ClientFormatOf( i_InternalFormat, Format, Type ) )
      return false;
    QOpenGLExtraFunctions& rGL = *m_pFunctions;

    // Rows are tightly packed. The default alignment of 4 would make the driver read rows of
    // a padded length: a frame whose row is not a multiple of four bytes comes out sheared and
    // its last rows are read past the end of the buffer.
    GLint Alignment = 4;
    rGL.glGetIntegerv( GL_UNPACK_ALIGNMENT, &Alignment );
    rGL.glPixelStorei( GL_UNPACK_ALIGNMENT, 1 );
    if( i_Layer < 0 )
      rGL.glTexSubImage2D( GL_TEXTURE_2D, i_Level, 0, 0, i_rSize.width(), i_rSize.height(), Format, Type, i_pPixels );
    else
      rGL.glTexSubImage3D( GL_TEXTURE_2D_ARRAY, i_Level, 0, 0, i_Layer, i_rSize.width(), i_rSize.height(), 1, Format,
                           Type, i_pPixels );
    rGL.glPixelStorei( GL_UNPACK_ALIGNMENT, Alignment );
    CheckErrors();
    return true;
  }

  void VRenderContext::BindFramebufferTexture( int i_Unit, QOpenGLFramebufferObject* i_pFramebuffer )
  {
    if( m_pFunctions == nullptr || i_pFramebuffer == nullptr )
      return;
    QOpenGLExtraFunctions& rGL = *m_pFunctions;
    rGL.glActiveTexture( GL_TEXTURE0 + static_cast< GLenum >( i_Unit ) );
    rGL.glBindTexture( GL_TEXTURE_2D, i_pFramebuffer->texture() );
    const GLint Filter = m_bNearestFramebufferFiltering ? GL_NEAREST : GL_LINEAR;
    rGL.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, Filter );
    rGL.glTexParameteri( GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, Filter );
    CheckErrors();
  }

  void VRenderContext::BindFramebuffer( QOpenGLFramebufferObject* i_pFramebuffer )
  {
    if( i_pFramebuffer == nullptr )
    {
      UnbindFramebuffer();
      return;
    }
    i_pFramebuffer->bind();
    m_pFramebuffer = i_pFramebuffer;
    CheckErrors();
  }

  void VRenderContext::UnbindFramebuffer()
  {
    if( m_pFunctions == nullptr )
      return;
    m_pFunctions->glBindFramebuffer( GL_FRAMEBUFFER, m_DefaultFramebuffer );
    m_pFramebuffer = nullptr;
    CheckErrors();
  }

  bool VRenderContext::FramebufferComplete()
  {
    return m_pFunctions != nullptr &&
           m_pFunctions->glCheckFramebufferStatus( GL_FRAMEBUFFER ) == GL_FRAMEBUFFER_COMPLETE;
  }

  void VRenderContext::ReadPixels( const QRect& i_rRect, GLenum i_Format, GLenum i_Type, void* o_pPixels )
  {
    if( m_pFunctions == nullptr )
      return;
    m_pFunctions->glReadPixels( i_rRect.x(), i_rRect.y(), i_rRect.width(), i_rRect.height(), i_Format, i_Type,
                                o_pPixels );
    CheckErrors();
  }

  void VRenderContext::SetScissor( const QRect& i_rRect )
  {
    if( m_pFunctions == nullptr )
      return;
    m_pFunctions->glEnable( GL_SCISSOR_TEST );
    m_pFunctions->glScissor( i_rRect.x(), i_rRect.y(), i_rRect.width(), i_rRect.height() );
    CheckErrors();
  }

  void VRenderContext::Enable( GLenum i_Capability, bool i_bEnabled )
  {
    if( m_pFunctions == nullptr )
      return;
    if( i_bEnabled )
      m_pFunctions->glEnable( i_Capability );
    else
      m_pFunctions->glDisable( i_Capability );
    CheckErrors();
  }
} // namespace CoreGraphics

#include "graphics/Shaders/ShaderResources.h"
#include "graphics/CoreGraphics/MurmurHash3.h"
#include "graphics/CoreGraphics/VMesh.h"
#include "graphics/CoreGraphics/VRenderContext.h"
#include "graphics/CoreGraphics/VResources.h"
#include "graphics/CoreGraphics/VShaderProgram.h"
#include "tests/graphics/CoreGraphics/DisplayTestMain.h"
#include "tests/support/LogCapture.h"

#include <QDir>
#include <QFile>
#include <QImage>
#include <QOffscreenSurface>
#include <QOpenGLContext>
#include <QOpenGLExtraFunctions>
#include <QOpenGLFramebufferObject>
#include <QOpenGLTexture>
#include <QTemporaryDir>

#include <memory>
#include <set>
#include <string>
#include <vector>

namespace
{
  using CoreGraphics::MurmurHash3_32;
  using CoreGraphics::VResources;
  using CoreGraphics::VShader;
  using CoreGraphics::VShaderProgram;

  // A current context on an offscreen surface, the viewer's resources loaded and a render
  // context over them.
  class ShaderResourcesTest : public ::testing::Test
  {
  protected:
    void SetUp() override
    {
      LUMEK_REQUIRE_DISPLAY();
      Shaders::RegisterResources();
      m_Surface.create();
      ASSERT_TRUE( m_Context.create() && m_Context.makeCurrent( &m_Surface ) );
      m_pResources = std::make_unique< VResources >( false, QDir::currentPath() );
      m_pResources->Load();
      m_pRender = std::make_unique< CoreGraphics::VRenderContext >();
      m_pRender->Initialise();
    }
    void TearDown() override
    {
      // The objects are released in the fixture's context, whichever one a test left current.
      m_Context.makeCurrent( &m_Surface );
      m_pRender.reset();
      m_pResources.reset();
      m_Context.doneCurrent();
    }

    QOffscreenSurface m_Surface;
    QOpenGLContext m_Context;
    std::unique_ptr< VResources > m_pResources;
    std::unique_ptr< CoreGraphics::VRenderContext > m_pRender;
  };

  // The viewer's programs and the general-purpose stages in the pairs they are written for:
  // every stage compiles, is in one pair, and each pair links once.
  TEST_F( ShaderResourcesTest, EveryStageCompilesAndEveryProgramLinks )
  {
    // Each vertex stage, then the fragment stages it is linked with.
    const char* const Programs[] = { "Video VideoRaw VideoBayer VideoLuminance VideoYUV UniformColour ImageSet",
                                     "Simple UniformColour",
                                     "SimpleColour Colour",
                                     "Simple3D UniformColour",
                                     "Simple3DPointSize UniformColour",
                                     "Simple3DUniformColour Colour",
                                     "Simple3DVertexColour Colour",
                                     "Simple3DModel SimpleLighting",
                                     "Simple3DModelColour SimpleLighting",
                                     "Simple3DModelWireframe Colour",
                                     "ColoredLine StippledLine" };
    std::set< QString > Vertex, Fragment;
    for( const char* pProgram : Programs )
    {
      const QStringList Stages = QString( pProgram ).split( ' ' );
      Vertex.insert( Stages[0] );
      for( const QString& rFragment : Stages.mid( 1 ) )
      {
        Fragment.insert( rFragment );
        std::shared_ptr< VShaderProgram > pLinked = m_pResources->GetProgram( Stages[0], rFragment );
        EXPECT_TRUE( pLinked && pLinked->IsLinked() ) << pProgram << " " << rFragment.toStdString();
        EXPECT_EQ( m_pResources->GetProgram( Stages[0], rFragment ), pLinked ) << "a pair is linked once";
      }
    }
    EXPECT_EQ( m_pResources->GetShaderNames( VShader::Kind_Vertex ), QStringList( Vertex.begin(), Vertex.end() ) );
    EXPECT_EQ( m_pResources->GetShaderNames( VShader::Kind_Fragment ),
               QStringList( Fragment.begin(), Fragment.end() ) );

    // Uniforms are found by name and by the hash of the name.
    const std::shared_ptr< VShaderProgram > pVideo = m_pResources->GetProgram( "Video", "VideoBayer" );
    for( const char* pName : { "u_View2D", "u_FirstRed", "t_DiffuseTexture", "u_NotThere" } )
      EXPECT_EQ( pVideo->UniformLocationByHash( MurmurHash3_32( pName ) ), pVideo->UniformLocation( pName ) ) << pName;
    EXPECT_GE( pVideo->UniformLocation( "u_FirstRed" ), 0 );
    EXPECT_EQ( pVideo->UniformLocation( "u_NotThere" ), -1 );
  }

  // Stage files of the user's own: a broken or missing one gives no program and a log line; an
  // override folder wins over the resources, and a reload relinks the programs in place.
  TEST_F( ShaderResourcesTest, StageFilesOfOurOwn )
  {
    QTemporaryDir Directory;
    ASSERT_TRUE( QDir( Directory.path() ).mkpath( "FragmentShaders" ) );
    auto Write = [&]( const QString& i_rName, const char* i_pText )
    {
      QFile File( Directory.filePath( i_rName ) );
      EXPECT_TRUE( File.open( QIODevice::WriteOnly | QIODevice::Truncate ) );
      File.write( i_pText );
      return Directory.filePath( i_rName );
    };
    const QString BrokenPath = Write( "Broken.glsl", "void main() { gl_FragColor = undeclared; }\n" );
    LumekTest::VLogCapture Log( "CoreGraphics" );
    m_pResources->AddShaderFile( "Broken", BrokenPath, VShader::Kind_Fragment );
    m_pResources->AddShaderFile( "Absent", Directory.filePath( "Absent.glsl" ), VShader::Kind_Fragment );
    EXPECT_TRUE( Log.Contains( "Shader Failed To Compile<" + BrokenPath.toStdString() + "> Log=<" ) );
    EXPECT_TRUE( Log.Contains( "Failed to open " + Directory.filePath( "Absent.glsl" ).toStdString() ) );
    for( const char* pFragment : { "Broken", "Absent" } )
      EXPECT_EQ( m_pResources->GetProgram( "Video", pFragment ), nullptr ) << pFragment;
    EXPECT_EQ( m_pResources->GetProgram( "NoSuchStage", "VideoRaw" ), nullptr );

    Write( "FragmentShaders/UniformColour.glsl",
           "uniform vec4 u_Overridden;\nvoid main() { gl_FragColor = u_Overridden; }\n" );
    VResources Resources( true, QDir::currentPath() );
    Resources.AddOverrideDirectory( Directory.path() );
    Resources.Load();
    // The vertex stages were not overridden and still come from the resources.
    EXPECT_TRUE( Resources.GetShader( VShader::Kind_Vertex, "Video" ) );
    std::shared_ptr< VShaderProgram > pProgram = Resources.GetProgram( "Video", "UniformColour" );
    ASSERT_TRUE( pProgram && pProgram->IsLinked() );
    EXPECT_GE( pProgram->UniformLocation( "u_Overridden" ), 0 );

    Write( "FragmentShaders/UniformColour.glsl",
           "uniform vec4 u_Reloaded;\nvoid main() { gl_FragColor = u_Reloaded; }\n" );
    Resources.ReloadAll();
    ASSERT_TRUE( pProgram->IsLinked() );
    EXPECT_EQ( pProgram->UniformLocation( "u_Overridden" ), -1 );
    EXPECT_GE( pProgram->UniformLocation( "u_Reloaded" ), 0 );
  }

  // With a debug context the driver's complaints reach the category log.
  TEST_F( ShaderResourcesTest, DebugContextPassesDriverMessagesToTheLog )
  {
    const QSurfaceFormat Previous = QSurfaceFormat::defaultFormat();
    QSurfaceFormat Debug = Previous;
    Debug.setOption( QSurfaceFormat::DebugContext );
    QSurfaceFormat::setDefaultFormat( Debug );
    QOpenGLContext DebugContext;
    DebugContext.setFormat( Debug );
    ASSERT_TRUE( DebugContext.create() && DebugContext.makeCurrent( &m_Surface ) );
    LumekTest::VLogCapture Log( "CoreGraphics" );
    auto pContext = std::make_unique< CoreGraphics::VRenderContext >();
    pContext->Initialise();
    QSurfaceFormat::setDefaultFormat( Previous );
    EXPECT_TRUE( Log.Contains( "Debug OpenGL context requested" ) );
    ASSERT_TRUE( Log.Contains( "Initialising debug logger" ) ) << "llvmpipe has GL_KHR_debug";
    const std::size_t Before = Log.Messages.size();
    pContext->Enable( 0xFFFF, true );
    EXPECT_GT( Log.Messages.size(), Before ) << "an invalid capability is reported";
    pContext.reset(); // while its context is current
  }

  // Buffers count what they hold and refuse writes past their end. Texture rows of any length
  // arrive tightly packed, and whatever alignment was set before stays set.
  TEST_F( ShaderResourcesTest, BuffersAndTexturesTakeWhatFits )
  {
    CoreGraphics::VIndexBuffer Empty, Wide;
    ASSERT_TRUE( Empty.Create( std::vector< std::uint16_t >() ) );
    EXPECT_EQ( Empty.GetIndexCount(), 0u );
    ASSERT_TRUE( Empty.GetBuffer().bind() );
    EXPECT_EQ( Empty.GetBuffer().size(), 0 );
    Empty.GetBuffer().release();
    ASSERT_TRUE( Wide.Create( std::vector< std::uint32_t >{ 0, 1, 2 } ) );
    EXPECT_EQ( Wide.GetIndexType(), GLenum( GL_UNSIGNED_INT ) );
    EXPECT_EQ( Wide.GetIndexCount(), 3u );

    CoreGraphics::VVertexBuffer Vertices;
    ASSERT_TRUE( Vertices.Reserve( CoreGraphics::VVertexLayout::PositionColour(), 64 ) );
    EXPECT_EQ( Vertices.GetVertexCount(), 4u );
    const std::uint8_t Bytes[16] = {};
    EXPECT_TRUE( Vertices.Write( 48, Bytes, 16 ) );
    EXPECT_FALSE( Vertices.Write( 49, Bytes, 16 ) );
    EXPECT_FALSE( Vertices.Write( 80, Bytes, 1 ) );

    CoreGraphics::VRenderContext& Context = *m_pRender;
    QOpenGLExtraFunctions& rGL = *Context.Functions();
    QOpenGLTexture Texture( QOpenGLTexture::Target2D );
    Texture.setSize( 3, 2 );
    Texture.setFormat( QOpenGLTexture::R8_UNorm );
    Texture.setMipLevels( 1 );
    Texture.allocateStorage();
    Context.BindTexture( 0, &Texture );

    const std::uint8_t Pixels[] = { 1, 2, 3, 4, 5, 6 };
    rGL.glPixelStorei( GL_UNPACK_ALIGNMENT, 8 );
    EXPECT_TRUE( Context.UploadTexture( QSize( 3, 2 ), Pixels, GL_R8 ) );
    GLint Alignment = 0;
    rGL.glGetIntegerv( GL_UNPACK_ALIGNMENT, &Alignment );
    EXPECT_EQ( Alignment, 8 );
    EXPECT_FALSE( Context.UploadTexture( QSize( 3, 2 ), Pixels, GL_DEPTH_COMPONENT16 ) ) << "no client format";

    QOpenGLFramebufferObject Framebuffer( 3, 2 );
    rGL.glBindFramebuffer( GL_FRAMEBUFFER, Framebuffer.handle() );
    rGL.glFramebufferTexture2D( GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, Texture.textureId(), 0 );
    std::uint8_t Read[2 * 3 * 4] = {};
    rGL.glPixelStorei( GL_PACK_ALIGNMENT, 1 );
    Context.ReadPixels( QRect( 0, 0, 3, 2 ), GL_RGBA, GL_UNSIGNED_BYTE, Read );
    for( int i = 0; i < 6; ++i )
      EXPECT_EQ( Read[i * 4], Pixels[i] ) << "pixel " << i;
    Context.UnbindFramebuffer();
  }

  // The source (1.0, 0.5, 0.0, 0.5) over the destination (0.2, 0.4, 0.6) in each blend mode, as an
  // indexed quad over the whole clip square through (Simple3D, UniformColour). The projection
  // halves x, so the quad covers the middle columns only: the layout, the standard uniforms and
  // the state come together.
  TEST_F( ShaderResourcesTest, DrawsAnIndexedQuadInEachBlendMode )
  {
    const struct
    {
      const char* Name;
      int ColourMode, AlphaMode;
      float R, G, B; // expected, before clamping
    } Cases[] = {
        { "Opaque", 0, 0, 1.0f, 0.5f, 0.0f },
        // Alpha mode 1 turns blending on for colour mode 0 as well.
        { "Replace", 0, 1, 1.0f, 0.5f, 0.0f },
        { "Alpha", 1, 1, 0.6f, 0.45f, 0.3f },
        { "AdditiveAlpha", 2, 1, 0.7f, 0.65f, 0.6f },
        { "ConstantAlphaAdditive", 3, 1, 0.45f, 0.525f, 0.6f }, // with the blend constant 0.25
        { "Premultiplied", 4, 1, 1.1f, 0.7f, 0.3f },
    };
    CoreGraphics::VRenderContext& rContext = *m_pRender;
    CoreGraphics::VMesh Mesh;
    const float Corners[] = { -1, -1, 0, 1, -1, 0, 1, 1, 0, -1, 1, 0 };
    ASSERT_TRUE( Mesh.Vertices.Create( CoreGraphics::VVertexLayout::Position3D(), Corners, sizeof( Corners ) ) );
    ASSERT_TRUE( Mesh.Indices.Create( std::vector< std::uint16_t >{ 0, 1, 2, 0, 2, 3 } ) );
    const std::shared_ptr< VShaderProgram > pProgram = m_pResources->GetProgram( "Simple3D", "UniformColour" );
    const QColor Clear = QColor::fromRgbF( 0.2, 0.4, 0.6, 1.0 );
    QMatrix4x4 Projection;
    Projection.scale( 0.5f, 1.0f, 1.0f );
    QOpenGLFramebufferObject Framebuffer( 8, 8 );
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      rContext.BindFramebuffer( &Framebuffer );
      EXPECT_TRUE( rContext.FramebufferComplete() );
      rContext.SetViewport( QRect( 0, 0, 8, 8 ) );
      rContext.SetClearColour( Clear );
      rContext.Clear( true, false );
      rContext.SetProjection( Projection );
      ASSERT_TRUE( rContext.UseProgram( pProgram ) );
      pProgram->SetUniform( pProgram->UniformLocation( "u_colour" ), QVector4D( 1.0f, 0.5f, 0.0f, 0.5f ) );
      CoreGraphics::VRenderState State;
      State.ColourBlendMode = rCase.ColourMode;
      State.AlphaBlendMode = rCase.AlphaMode;
      State.BlendConstant = 0.25f;
      rContext.ApplyState( State );
      rContext.BindVertexBuffer( Mesh.Vertices );
      rContext.DrawIndexed( GL_TRIANGLES, Mesh.Indices );
      const QImage Picture = Framebuffer.toImage();
      rContext.ResetState();
      rContext.UnbindFramebuffer();
      const QColor Blended = QColor::fromRgbF( std::min( rCase.R, 1.0f ), rCase.G, rCase.B );
      for( int x = 0; x < 8; ++x )
      {
        const QColor Want = x >= 2 && x < 6 ? Blended : Clear, Got = QColor( Picture.pixel( x, 4 ) );
        EXPECT_LE( std::max( { std::abs( Got.red() - Want.red() ), std::abs( Got.green() - Want.green() ),
                               std::abs( Got.blue() - Want.blue() ) } ),
                   2 )
            << "column " << x;
      }
    }

    // Using no program is refused and leaves the current one in place.
    const std::shared_ptr< VShaderProgram > pCurrent = m_pResources->GetProgram( "Video", "VideoRaw" );
    ASSERT_TRUE( m_pRender->UseProgram( pCurrent ) );
    EXPECT_FALSE( m_pRender->UseProgram( nullptr ) );
    EXPECT_EQ( m_pRender->GetCurrentProgram(), pCurrent );
  }
} // namespace

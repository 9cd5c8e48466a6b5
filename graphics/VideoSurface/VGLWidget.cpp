#include "graphics/VideoSurface/VGLWidget.h"

#include "graphics/CoreGraphics/VMesh.h"
#include "graphics/CoreGraphics/VRenderContext.h"
#include "graphics/CoreGraphics/VResources.h"
#include "graphics/CoreGraphics/VShaderProgram.h"
#include "graphics/CoreVideoUtils/ColourCorrector.h"
#include "graphics/CoreVideoUtils/PixelFormatConverter.h"
#include "graphics/Shaders/ShaderResources.h"
#include "graphics/VideoSurface/VOverlayText.h"
#include "graphics/VideoSurface/VPixelFormatRouting.h"
#include "graphics/VideoSurface/VVideoTexture.h"
#include "videointerface/PixelFormatDescriptor.h"

#include <QCoreApplication>
#include <QMouseEvent>
#include <QPainter>
#include <QTimer>

namespace LumekVideoViewer
{
  namespace
  {
    constexpr int FrameTextureUnit = 1;
    const char* const SoftwareDecoderName = "Software Decoder";
  } // namespace

  VGLWidget::VGLWidget( QWidget* i_pParent )
      : QOpenGLWidget( i_pParent ), m_pRenderContext( std::make_unique< CoreGraphics::VRenderContext >() ),
        m_pAllocator( std::make_shared< VBufferAllocator >() ),
        m_pColourCorrector( std::make_shared< CoreVideoUtils::VColourCorrector >() )
  {
    QSurfaceFormat Format;
    Format.setSamples( 4 );
    setFormat( Format );
    // A file dropped on the picture goes on to the window.
    setAcceptDrops( true );
    setFocusPolicy( Qt::StrongFocus );
    Shaders::RegisterResources();
    // The window may connect the mode and decoder signals across a queue.
    qRegisterMetaType< EScaleMode >( "LumekVideoViewer::EScaleMode" );
    qRegisterMetaType< EDecoder >( "LumekVideoViewer::EDecoder" );

    m_RenderState.AlphaWrite = false;
    m_RenderState.BlendConstant = 1.0f;
  }

  VGLWidget::~VGLWidget()
  {
    makeCurrent();
    if( m_pVideoTexture )
      m_pVideoTexture->DestroyStorage();
    for( CoreGraphics::VMesh* pMesh : { m_pMesh.get(), m_pOutline.get() } )
      if( pMesh != nullptr )
      {
        pMesh->Vertices.GetBuffer().destroy();
        pMesh->Indices.GetBuffer().destroy();
      }
    m_Programs = {};
    m_pOutlineProgram.reset();
    m_pResources.reset();
    doneCurrent();
  }

  QSize VGLWidget::sizeHint() const
  {
    return minimumSizeHint();
  }

  QSize VGLWidget::minimumSizeHint() const
  {
    return m_View.MinimumSizeHint();
  }

  void VGLWidget::initializeGL()
  {
    m_pRenderContext->Initialise();
    m_pRenderContext->SetClearColour( QColor( 0, 0, 0, 255 ) );

    m_pResources = std::make_shared< CoreGraphics::VResources >( false, QCoreApplication::applicationDirPath() );
    m_pResources->Load();
    m_pOutlineProgram = m_pResources->GetProgram( "Video", "UniformColour" );
    for( int i = 0; i < VideoGraphics::VideoProgramCount; ++i )
      m_Programs[i] = m_pResources->GetProgram( "Video", VideoGraphics::VideoProgramStage( i ) );

    m_pVideoTexture = std::make_shared< VideoGraphics::VVideoTexture >();
    m_pTextureState = std::make_shared< CoreGraphics::VTextureState >();
    m_pTextureState->MinificationFilter = CoreGraphics::VTextureState::Nearest;
    m_pTextureState->MagnificationLinear = false;
    m_pTextureState->ClampS = true;
    m_pTextureState->ClampT = true;

    BuildSensorMesh();
  }

  void VGLWidget::BuildSensorMesh()
  {
    constexpr int Cells = 64;
    constexpr int Side = Cells + 1;
    std::vector< float > Vertices;
    Vertices.reserve( Side * Side * 3 );
    for( int Row = 0; Row < Side; ++Row )
      for( int Column = 0; Column < Side; ++Column )
      {
        Vertices.push_back( float( Column ) / Cells );
        Vertices.push_back( float( Row ) / Cells );
        Vertices.push_back( 0.0f );
      }
    std::vector< std::uint16_t > Indices;
    Indices.reserve( Cells * Cells * 6 );
    for( int Row = 0; Row < Cells; ++Row )
      for( int Column = 0; Column < Cells; ++Column )
      {
        const std::uint16_t N = std::uint16_t( Side * Row + Column );
        for( std::uint16_t Offset : { 0, 1, Side + 1, 0, Side + 1, Side } )
          Indices.push_back( std::uint16_t( N + Offset ) );
      }
    m_pMesh = std::make_shared< CoreGraphics::VMesh >();
    m_pMesh->Vertices.Create( CoreGraphics::VVertexLayout::Position3D(), Vertices.data(),
                              Vertices.size() * sizeof( float ) );
    m_pMesh->Indices.Create( Indices );

    // The outline's corners change with every frame; its buffers are made once and rewritten.
    m_pOutline = std::make_shared< CoreGraphics::VMesh >();
    m_pOutline->Vertices.Reserve( CoreGraphics::VVertexLayout::Position3D(), 4 * 3 * sizeof( float ) );
    m_pOutline->Indices.Create( std::vector< std::uint16_t >{ 0, 1, 1, 2, 2, 3, 3, 0 } );
  }

  void VGLWidget::PrepareFrame( int i_FrameIndex, const ZOL::IVideoFrameInfo& i_VideoFrameInfo,
                                const ZOL::IVideoFrame& i_rVideoFrame, bool i_bShowMissingWarning )
  {
    m_FrameIndex = i_FrameIndex;
    m_bShowMissingWarning = i_bShowMissingWarning;
    m_GeometryRecord = i_VideoFrameInfo;
    m_PixelRecord = i_rVideoFrame.VideoFrameInfo;
    // What was stored stays, so a missing frame's warning is still painted over the last picture.
    if( m_PixelRecord.ImageWidth <= 0 || m_PixelRecord.ImageHeight <= 0 ||
        m_PixelRecord.PixelFormat == ZOL::PixelFormat_Unspecified )
      return;

    m_ActiveProgram = VideoGraphics::Program_VideoRaw;
    if( const VideoGraphics::VPixelFormatRoute* pRoute =
            VideoGraphics::FindPixelFormatRoute( m_PixelRecord.PixelFormat ) )
    {
      m_ActiveProgram = pRoute->Program;
      m_DecoderName = pRoute->Label;
    }

    std::shared_ptr< ZOL::IBuffer > pBuffer = i_rVideoFrame.Video;
    if( !pBuffer )
      return;
    if( m_PreferredDecoder == Software )
    {
      if( m_PixelRecord.PixelFormat != ZOL::PixelFormat_R8G8B8 && !ConvertForSoftwareDecoder( pBuffer ) )
      {
        // Nothing to show: the held picture of an earlier frame must not be drawn as this one.
        m_PixelRecord.PixelFormat = ZOL::PixelFormat_Unspecified;
        return;
      }
      m_ActiveProgram = VideoGraphics::Program_VideoRaw;
      m_DecoderName = SoftwareDecoderName;
    }

    makeCurrent();
    m_pRenderContext->ApplyState( m_RenderState );
    if( m_pVideoTexture )
      m_pVideoTexture->SetFrame( m_PixelRecord, std::move( pBuffer ) );
    doneCurrent();

    m_FrameRateMeter.CountFrame();
    UpdateViewGeometry();
  }

  bool VGLWidget::ConvertForSoftwareDecoder( std::shared_ptr< ZOL::IBuffer >& io_pBuffer )
  {
    // The frame's own size bounds the allocation: a description that its bytes can't fill
    // is not converted at all.
    const std::uint64_t SourceSize = ZOL::GetVideoFrameSizeInBytes64( m_PixelRecord );
    if( SourceSize == 0 || io_pBuffer->GetSize() < SourceSize )
      return false;
    const std::uint64_t Size =
        std::uint64_t( m_PixelRecord.ImageWidth ) * std::uint64_t( m_PixelRecord.ImageHeight ) * 3;
    std::shared_ptr< ZOL::IBuffer > pRGB;
    m_pAllocator->Allocate( pRGB, Size );
    if( !pRGB )
      return false;

    // A failed conversion isn't examined: the buffer is shown as it was allocated.
    CoreVideoUtils::VPixelFormatConverter Converter;
    Converter.SetVideoSettings( m_VideoSettings );
    if( !Converter.Convert( m_PixelRecord, io_pBuffer->GetData(), io_pBuffer->GetSize(), ZOL::PixelFormat_R8G8B8,
                            pRGB->GetData(), Size ) )
      ConvertThroughRGBA( Converter, *io_pBuffer, *pRGB );
    // Bayer frames take gamma and saturation a second time on top of the converter's; the
    // software picture is defined that way.
    if( ZOL::IsBayerFormat( m_PixelRecord.PixelFormat ) )
    {
      m_pColourCorrector->Set( m_VideoSettings );
      m_pColourCorrector->Apply( m_PixelRecord.ImageWidth, m_PixelRecord.ImageHeight, ZOL::PixelFormat_R8G8B8,
                                 pRGB->GetData() );
    }
    io_pBuffer = std::move( pRGB );
    m_PixelRecord.PixelFormat = ZOL::PixelFormat_R8G8B8;
    return true;
  }

  void VGLWidget::ConvertThroughRGBA( CoreVideoUtils::VPixelFormatConverter& io_rConverter,
                                      const ZOL::IBuffer& i_rSource, ZOL::IBuffer& o_rRGB )
  {
    // Planar YUV frames convert to the four-byte RGB formats only; the picture goes through
    // R8G8B8u8 on its way to R8G8B8.
    ZOL::IVideoFrameInfo RGBA = m_PixelRecord;
    RGBA.PixelFormat = ZOL::PixelFormat_R8G8B8u8;
    m_Scratch.resize( std::size_t( ZOL::GetVideoFrameSizeInBytes64( RGBA ) ) );
    if( io_rConverter.Convert( m_PixelRecord, i_rSource.GetData(), i_rSource.GetSize(), ZOL::PixelFormat_R8G8B8u8,
                               m_Scratch.data(), m_Scratch.size() ) )
      io_rConverter.Convert( RGBA, m_Scratch.data(), m_Scratch.size(), ZOL::PixelFormat_R8G8B8, o_rRGB.GetData(),
                             o_rRGB.GetSize() );
  }

  void VGLWidget::SetDecoder( EDecoder i_PreferredDecoder )
  {
    m_PreferredDecoder = i_PreferredDecoder;
  }

  void VGLWidget::SetVideoSettings( const ZOL::IVideoSettings& i_rVideoSettings )
  {
    m_VideoSettings = i_rVideoSettings;
  }

  void VGLWidget::SetLensDistortionCalibration( const CoreLumekTypes::VCameraHardware& i_rCameraHardware,
                                                const CoreLumekTypes::VLensDistortionCalibration& i_rCalibration )
  {
    const bool bEnabled = m_Lens.CorrectionEnabled;
    m_Lens = LensDataFrom( i_rCameraHardware, i_rCalibration );
    m_Lens.CorrectionEnabled = bEnabled;
  }

  void VGLWidget::SetLensDistortionCorrectionEnabled( bool i_bEnabled )
  {
    m_Lens.CorrectionEnabled = i_bEnabled;
    UpdateViewGeometry();
  }

  void VGLWidget::Clear()
  {
    makeCurrent();
    if( m_pVideoTexture )
      m_pVideoTexture->DestroyStorage();
    m_PixelRecord = ZOL::IVideoFrameInfo();
    m_FrameIndex = 0;
    m_bShowMissingWarning = false;
    m_Lens.Centre = QVector2D();
    m_Lens.Parameters = QVector3D();
    doneCurrent();
    update();
  }

  void VGLWidget::SetScaleMode( EScaleMode i_ScaleMode )
  {
    m_View.SetScaleMode( i_ScaleMode );
  }

  void VGLWidget::UpdateViewGeometry()
  {
    m_View.Update( m_PixelRecord, m_GeometryRecord, m_Lens, size() );
  }

  void VGLWidget::resizeGL( int, int )
  {
    UpdateViewGeometry();
  }

  void VGLWidget::mousePressEvent( QMouseEvent* i_pEvent )
  {
    m_View.MousePress( i_pEvent->pos(), i_pEvent->buttons() );
  }

  void VGLWidget::mouseReleaseEvent( QMouseEvent* i_pEvent )
  {
    m_View.MouseRelease( i_pEvent->pos(), i_pEvent->buttons() );
  }

  void VGLWidget::mouseMoveEvent( QMouseEvent* i_pEvent )
  {
    if( m_View.MouseMove( i_pEvent->pos(), i_pEvent->buttons(), size() ) )
      emit ScaleModeChanged( ScaleFreely );
  }

  void VGLWidget::paintGL()
  {
    const QSize SensorSize = PaintSensorSize( m_Lens, m_GeometryRecord );

    QPainter Painter( this );
    Painter.setRenderHint( QPainter::Antialiasing );
    Painter.beginNativePainting();
    // The framebuffer keeps its last picture between paints on these drivers: without a clear a
    // pan leaves trails and a cleared surface would not turn black.
    m_pRenderContext->SetClearColour( QColor( 0, 0, 0, 255 ) );
    m_pRenderContext->Clear( true, false );

    const float Zoom = m_View.GetZoom();
    const QVector2D Scale( float( SensorSize.width() ) * Zoom / float( std::max( width(), 1 ) ),
                           float( SensorSize.height() ) * Zoom / float( std::max( height(), 1 ) ) );
    if( m_Lens.CorrectionEnabled )
      m_pRenderContext->SetRadialDistortion( m_Lens.Centre, m_Lens.Parameters );
    else
      m_pRenderContext->SetRadialDistortion( QVector2D(), QVector3D() );
    m_pRenderContext->SetSensorSize( SensorSize );
    m_pRenderContext->SetView2D( Scale, m_View.GetViewCentre() );

    if( m_PixelRecord.IsValid() && m_pVideoTexture && m_pVideoTexture->HasFrame() && !SensorSize.isEmpty() &&
        m_pRenderContext->UseProgram( m_Programs[m_ActiveProgram] ) )
    {
      DrawFrame( SensorSize );
      DrawOutline( SensorSize );
    }

    m_pRenderContext->ResetState();
    Painter.endNativePainting();
    DrawOverlays( Painter );
    Painter.end();
    // The surface keeps repainting itself; nobody else has to ask for it.
    QTimer::singleShot( 10, this, SLOT( update() ) );
  }

  void VGLWidget::DrawFrame( const QSize& i_rSensorSize )
  {
    CoreGraphics::VShaderProgram& rProgram = *m_Programs[m_ActiveProgram];
    rProgram.SetUniform( rProgram.UniformLocation( "t_DiffuseTexture" ), FrameTextureUnit );

    int FirstRedX = 0;
    int FirstRedY = 0;
    if( m_ActiveProgram == VideoGraphics::Program_VideoBayer &&
        ZOL::FirstRedOffset( m_PixelRecord.PixelFormat, FirstRedX, FirstRedY ) )
      rProgram.SetUniform( rProgram.UniformLocation( "u_FirstRed" ),
                           QVector2D( float( FirstRedX ), float( FirstRedY ) ) );
    if( m_ActiveProgram == VideoGraphics::Program_VideoBayer || m_ActiveProgram == VideoGraphics::Program_VideoYUV )
      rProgram.SetUniform( rProgram.UniformLocation( "u_Resolution" ),
                           QVector2D( float( m_PixelRecord.ImageWidth ), float( m_PixelRecord.ImageHeight ) ) );
    if( m_ActiveProgram == VideoGraphics::Program_VideoRaw || m_ActiveProgram == VideoGraphics::Program_VideoYUV )
    {
      const VideoGraphics::VPixelFormatRoute* pRoute = VideoGraphics::FindPixelFormatRoute( m_PixelRecord.PixelFormat );
      rProgram.SetUniform( rProgram.UniformLocation( "u_Swizzle" ), ( pRoute && pRoute->Swizzle ) ? 1 : 0 );
    }
    rProgram.SetUniform( rProgram.UniformLocation( "u_Inverted" ), m_PixelRecord.IsInverted() ? 1 : 0 );
    // Nothing in the viewer rotates the picture; the shader's rotation is fed constants.
    rProgram.SetUniform( rProgram.UniformLocation( "u_Rotation" ), QMatrix2x2() );
    rProgram.SetUniform( rProgram.UniformLocation( "u_RotationCentre" ), QVector2D() );
    rProgram.SetUniform( rProgram.UniformLocation( "u_VideoScaleAndOffset" ),
                         VideoScaleAndOffset( m_GeometryRecord, i_rSensorSize ) );
    if( m_ActiveProgram == VideoGraphics::Program_VideoBayer )
      rProgram.SetUniform( rProgram.UniformLocation( "u_ColourCorrection" ),
                           QVector2D( m_VideoSettings.GammaCorrection, m_VideoSettings.Saturation ) );

    m_pVideoTexture->Bind( FrameTextureUnit, *m_pRenderContext, 0 );
    m_pRenderContext->ApplyTextureState( *m_pTextureState );
    m_pRenderContext->BindVertexBuffer( m_pMesh->Vertices );
    m_pRenderContext->DrawIndexed( GL_TRIANGLES, m_pMesh->Indices );
  }

  void VGLWidget::DrawOutline( const QSize& i_rSensorSize )
  {
    // The outline is the image rectangle as the view knows it: with correction on, that is
    // already the distorted bounds, so the shader must not bend it again.
    m_pRenderContext->SetRadialDistortion( QVector2D(), QVector3D() );
    if( !m_pRenderContext->UseProgram( m_pOutlineProgram ) )
      return;
    CoreGraphics::VShaderProgram& rProgram = *m_pOutlineProgram;
    rProgram.SetUniform( rProgram.UniformLocation( "u_Rotation" ), QMatrix2x2() );
    rProgram.SetUniform( rProgram.UniformLocation( "u_RotationCentre" ), QVector2D() );

    const QRectF& rRect = m_View.GetImageRectangle();
    const float W = float( i_rSensorSize.width() );
    const float H = float( i_rSensorSize.height() );
    const float Corners[] = { float( rRect.left() ) / W,  float( rRect.top() ) / H,    0.0f,
                              float( rRect.left() ) / W,  float( rRect.bottom() ) / H, 0.0f,
                              float( rRect.right() ) / W, float( rRect.bottom() ) / H, 0.0f,
                              float( rRect.right() ) / W, float( rRect.top() ) / H,    0.0f };
    m_pOutline->Vertices.Write( 0, Corners, sizeof( Corners ) );
    rProgram.SetUniform( rProgram.UniformLocation( "u_colour" ), QVector4D( 0.78f, 0.6f, 0.06f, 1.0f ) );
    m_pRenderContext->BindVertexBuffer( m_pOutline->Vertices );
    m_pRenderContext->DrawIndexed( GL_LINES, m_pOutline->Indices );
  }

  void VGLWidget::DrawOverlays( QPainter& io_rPainter )
  {
    QFont Font( "Consolas" );
    Font.setPointSize( 10 );
    Font.setBold( true );
    io_rPainter.setFont( Font );

    if( m_bShowMissingWarning )
      io_rPainter.fillRect( rect(), QColor( 0, 0, 0, 128 ) );
    if( m_View.IsZoomDragging() )
    {
      const QString Text = QString::fromStdString( ZoomText( m_View.GetZoom() ) );
      const QRect TextRect =
          io_rPainter.boundingRect( rect(), Qt::AlignRight | Qt::AlignTop, Text ).translated( -20, 20 );
      DrawPlate( io_rPainter, TextRect, Text );
    }
    if( m_bShowMissingWarning )
    {
      const QString Text = QString::fromStdString( MissingFrameText( m_FrameIndex ) );
      DrawPlate( io_rPainter, io_rPainter.boundingRect( rect(), Qt::AlignCenter, Text ), Text );
    }
  }
} // namespace LumekVideoViewer

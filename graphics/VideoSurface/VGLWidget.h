#pragma once

// The widget that shows the video. The window hands it frames through PrepareFrame, sets the
// display settings, the decoder, the lens data and the scale mode through its slots, and reads
// back the decoder in use, the rate at which frames arrive and the scale mode. It repaints
// itself about every 10 ms; nobody needs to ask it to.
//
// A frame is drawn onto a 65 by 65 vertex mesh laid over the camera's sensor, so that lens
// distortion bends the mesh and not the image data. Raw frames go to the card as they are and
// the video shaders demosaic and convert them (Hardware), or every frame is first converted to
// R8G8B8 on the processor (Software).

#include "graphics/CoreGraphics/VRenderState.h"
#include "graphics/VideoSurface/VFrameRateMeter.h"
#include "graphics/VideoSurface/VViewGeometry.h"
#include "graphics/VideoSurface/VideoSurfaceTypes.h"
#include "utils/UtilsMemory/VThreadSafeRecycler.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/IBuffer.h"
#include "videointerface/IVideoFrameInfo.h"

#include <QOpenGLWidget>
#include <QPainter>
#include <QString>

#include <array>
#include <memory>
#include <vector>

namespace CoreGraphics
{
  class VRenderContext;
  class VResources;
  class VShaderProgram;
  struct VMesh;
  class VVertexBuffer;
  class VIndexBuffer;
} // namespace CoreGraphics

namespace CoreVideoUtils
{
  class VColourCorrector;
  class VPixelFormatConverter;
} // namespace CoreVideoUtils

namespace VideoGraphics
{
  class VVideoTexture;
}

namespace LumekVideoViewer
{
  class VGLWidget : public QOpenGLWidget
  {
    Q_OBJECT

  public:
    using VBufferAllocator =
        ZOL::IStandardBufferAllocator< UtilsMemory::VThreadSafeRecycler< ZOL::IStandardBuffer, 16 > >;

    explicit VGLWidget( QWidget* i_pParent = nullptr );
    ~VGLWidget() override;

    // "Raw Grayscale Decoder", "Hardware Bayer Demosaic", "Hardware RGB Decoder",
    // "Hardware YUV Decoder" or "Software Decoder"; empty until the first frame.
    QString GetDecoderName() const { return m_DecoderName; }
    // Frames a second that reached PrepareFrame, recomputed at most every 401 ms.
    double GetFrameRate() { return m_FrameRateMeter.GetFrameRate(); }
    EScaleMode GetScaleMode() const { return m_View.GetScaleMode(); }

    QSize sizeHint() const override;
    QSize minimumSizeHint() const override;

    // For tests and measurements.
    const VVideoView& GetView() const { return m_View; }
    const VLensData& GetLensData() const { return m_Lens; }
    const ZOL::IVideoFrameInfo& GetPixelRecord() const { return m_PixelRecord; }
    int GetActiveProgram() const { return m_ActiveProgram; }
    const VideoGraphics::VVideoTexture& GetVideoTexture() const { return *m_pVideoTexture; }
    void SetFrameRateClock( VFrameRateMeter::VClock i_Clock ) { m_FrameRateMeter = VFrameRateMeter( i_Clock ); }

  signals:
    // Only the mouse emits it, always with ScaleFreely.
    void ScaleModeChanged( LumekVideoViewer::EScaleMode i_ScaleMode );

  public slots:
    // Takes the next frame: i_VideoFrameInfo says where the image lies on the sensor, the
    // frame's own record what its bytes are. Nothing is uploaded until the next paint. With
    // i_bShowMissingWarning the picture darkens under a "Missing frame" plate.
    void PrepareFrame( int i_FrameIndex, const ZOL::IVideoFrameInfo& i_VideoFrameInfo,
                       const ZOL::IVideoFrame& i_rVideoFrame, bool i_bShowMissingWarning );
    // Takes effect with the next PrepareFrame.
    void SetDecoder( LumekVideoViewer::EDecoder i_PreferredDecoder );
    // Saturation and gamma of Bayer frames: the shader sees them at the next paint, the
    // software path at the next PrepareFrame.
    void SetVideoSettings( const ZOL::IVideoSettings& i_rVideoSettings );
    // The view follows at the next frame or SetLensDistortionCorrectionEnabled.
    void SetLensDistortionCalibration( const CoreLumekTypes::VCameraHardware& i_rCameraHardware,
                                       const CoreLumekTypes::VLensDistortionCalibration& i_rLensDistortionCalibration );
    void SetLensDistortionCorrectionEnabled( bool i_bEnabled );
    // Forgets the frame's description, the warning and the lens: the surface stays black.
    void Clear();
    void SetScaleMode( LumekVideoViewer::EScaleMode i_ScaleMode );

  protected:
    void mousePressEvent( QMouseEvent* i_pEvent ) override;
    void mouseReleaseEvent( QMouseEvent* i_pEvent ) override;
    void mouseMoveEvent( QMouseEvent* i_pEvent ) override;
    void initializeGL() override;
    void resizeGL( int i_Width, int i_Height ) override;
    void paintGL() override;

  private:
    void UpdateViewGeometry();
    // Replaces the frame by its R8G8B8 picture; false when no buffer could be had.
    bool ConvertForSoftwareDecoder( std::shared_ptr< ZOL::IBuffer >& io_pBuffer );
    void ConvertThroughRGBA( CoreVideoUtils::VPixelFormatConverter& io_rConverter, const ZOL::IBuffer& i_rSource,
                             ZOL::IBuffer& o_rRGB );
    void DrawFrame( const QSize& i_rSensorSize );
    void DrawOutline( const QSize& i_rSensorSize );
    void DrawOverlays( QPainter& io_rPainter );
    void BuildSensorMesh();

    std::unique_ptr< CoreGraphics::VRenderContext > m_pRenderContext;
    std::shared_ptr< VBufferAllocator > m_pAllocator;
    std::array< std::shared_ptr< CoreGraphics::VShaderProgram >, 4 > m_Programs;
    std::shared_ptr< CoreGraphics::VShaderProgram > m_pOutlineProgram;
    std::shared_ptr< CoreGraphics::VResources > m_pResources;
    std::shared_ptr< VideoGraphics::VVideoTexture > m_pVideoTexture;
    std::shared_ptr< CoreGraphics::VTextureState > m_pTextureState;
    std::shared_ptr< CoreGraphics::VMesh > m_pMesh;
    std::shared_ptr< CoreGraphics::VMesh > m_pOutline;
    CoreGraphics::VRenderState m_RenderState;

    int m_FrameIndex = 0;
    bool m_bShowMissingWarning = false;
    ZOL::IVideoFrameInfo m_PixelRecord;
    ZOL::IVideoFrameInfo m_GeometryRecord;
    ZOL::IVideoSettings m_VideoSettings;
    QString m_DecoderName;
    VFrameRateMeter m_FrameRateMeter;
    EDecoder m_PreferredDecoder = Hardware;
    int m_ActiveProgram = 0;
    VVideoView m_View;
    std::shared_ptr< CoreVideoUtils::VColourCorrector > m_pColourCorrector;
    VLensData m_Lens;
    // Intermediate pictures of the software path, kept between frames.
    std::vector< std::uint8_t > m_Scratch;
  };
} // namespace LumekVideoViewer

#pragma once

// The GL state and the uniform values all programs share. One render context belongs to one
// widget and is only used with that widget's OpenGL context current.

#include "graphics/CoreGraphics/VMesh.h"
#include "graphics/CoreGraphics/VRenderState.h"

#include <QColor>
#include <QMatrix4x4>
#include <QRect>
#include <QSize>
#include <QVector2D>
#include <QVector3D>
#include <QVector4D>
#include <qopengl.h>

#include <bitset>
#include <memory>

class QOpenGLContext;
class QOpenGLDebugLogger;
class QOpenGLExtraFunctions;
class QOpenGLFramebufferObject;
class QOpenGLTexture;

namespace CoreGraphics
{
  class VShaderProgram;

  class VRenderContext
  {
  public:
    VRenderContext();
    ~VRenderContext();
    VRenderContext( const VRenderContext& ) = delete;
    VRenderContext& operator=( const VRenderContext& ) = delete;

    // Takes the current context, sets up the debug log when the context was asked for one,
    // sets the clear colour to (25, 25, 25) and resets the state.
    void Initialise();
    bool IsInitialised() const { return m_pContext != nullptr; }
    // Back to a known state: no arrays, buffers, program, blending, culling or depth test.
    void ResetState();
    // Passes the messages of the GL debug log to the category log.
    void CheckErrors();

    // Values the standard uniforms take when a program is put to use.
    void SetProjection( const QMatrix4x4& i_rProjection ) { m_Projection = i_rProjection; }
    void SetView( const QMatrix4x4& i_rView ) { m_View = i_rView; }
    // Also sets the GL viewport.
    void SetViewport( const QRect& i_rViewport );
    void SetFrameSize( const QSize& i_rSize ) { m_FrameSize = i_rSize; }
    void SetLightVector( const QVector3D& i_rLight ) { m_LightVector = i_rLight; }
    // Y up gives (0, 1, 0), otherwise (0, 0, 1).
    void SetUpDirection( bool i_bYIsUp );
    void SetGlobalTime( float i_Time ) { m_GlobalTime = i_Time; }
    // u_View2D: xy the scale from sensor-normalised units to half the view, zw the view centre.
    void SetView2D( const QVector2D& i_rScale, const QVector2D& i_rCentre );
    // A centre of exactly (0, 0) switches the lens distortion off.
    void SetRadialDistortion( const QVector2D& i_rCentre, const QVector3D& i_rParameters );
    void SetSensorSize( const QSize& i_rSize ) { m_SensorSize = i_rSize; }
    void SetNearestFramebufferFiltering( bool i_bNearest ) { m_bNearestFramebufferFiltering = i_bNearest; }

    const QVector4D& GetView2D() const { return m_View2D; }
    const QVector2D& GetRadialDistortionCentre() const { return m_RadialDistortionCentre; }
    const QVector3D& GetRadialDistortionParameters() const { return m_RadialDistortionParameters; }
    const QSize& GetSensorSize() const { return m_SensorSize; }
    const QRect& GetViewport() const { return m_Viewport; }

    // Binds the program and feeds it the standard uniforms it declares. False, with the current
    // program left in place, for an absent or unlinked program.
    bool UseProgram( const std::shared_ptr< VShaderProgram >& i_pProgram );
    const std::shared_ptr< VShaderProgram >& GetCurrentProgram() const { return m_pProgram; }

    void ApplyState( const VRenderState& i_rState );
    // Filtering and wrapping of the 2D texture bound to the active unit.
    void ApplyTextureState( const VTextureState& i_rState );
    void SetClearColour( const QColor& i_rColour );
    void Clear( bool i_bColour, bool i_bDepth );

    // Points the current program's attributes at the buffer, by its layout.
    void BindVertexBuffer( VVertexBuffer& io_rBuffer );
    void DrawIndexed( GLenum i_Mode, VIndexBuffer& io_rIndices );
    void DrawArrays( GLenum i_Mode, int i_First, int i_Count );
    void DrawArraysInstanced( GLenum i_Mode, int i_First, int i_Count, int i_Instances );

    void BindTexture( int i_Unit, QOpenGLTexture* i_pTexture );
    // Writes pixels into the texture bound to the active unit: the 2D texture for a layer below
    // 0, that layer of the bound 2D array texture otherwise. Rows are tightly packed whatever
    // their length. False for an internal format without a known client format.
    bool UploadTexture( const QSize& i_rSize, const void* i_pPixels, GLenum i_InternalFormat, int i_Level = 0,
                        int i_Layer = -1 );
    void BindFramebufferTexture( int i_Unit, QOpenGLFramebufferObject* i_pFramebuffer );
    void BindFramebuffer( QOpenGLFramebufferObject* i_pFramebuffer );
    // Binds the default framebuffer, which for a widget is an object of its own.
    void UnbindFramebuffer();
    void SetDefaultFramebuffer( GLuint i_Id ) { m_DefaultFramebuffer = i_Id; }
    bool FramebufferComplete();
    void ReadPixels( const QRect& i_rRect, GLenum i_Format, GLenum i_Type, void* o_pPixels );
    // Also enables the scissor test.
    void SetScissor( const QRect& i_rRect );
    void Enable( GLenum i_Capability, bool i_bEnabled );

    QOpenGLExtraFunctions* Functions() const { return m_pFunctions; }

  private:
    QOpenGLContext* m_pContext = nullptr;
    std::unique_ptr< QOpenGLDebugLogger > m_pDebugLogger;
    QOpenGLExtraFunctions* m_pFunctions = nullptr;
    std::bitset< 8 > m_EnabledArrays;
    QMatrix4x4 m_Projection;
    QMatrix4x4 m_View;
    QVector4D m_View2D;
    QRect m_Viewport;
    QVector3D m_LightVector;
    QVector3D m_Up{ 0.0f, 0.0f, 1.0f };
    QSize m_FrameSize;
    bool m_bYIsUp = false;
    float m_GlobalTime = 0.0f;
    QVector2D m_RadialDistortionCentre;
    QVector3D m_RadialDistortionParameters;
    QSize m_SensorSize;
    bool m_bNearestFramebufferFiltering = false;
    QOpenGLFramebufferObject* m_pFramebuffer = nullptr;
    std::shared_ptr< VShaderProgram > m_pProgram;
    GLuint m_DefaultFramebuffer = 0;
  };

  // Client format and type of glTexSubImage2D for an internal format; false when unknown.
  bool ClientFormatOf( GLenum i_InternalFormat, GLenum& o_rFormat, GLenum& o_rType );
} // namespace CoreGraphics

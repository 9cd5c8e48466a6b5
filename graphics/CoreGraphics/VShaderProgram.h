#pragma once

#include "graphics/CoreGraphics/VMesh.h"

#include <boost/container/flat_map.hpp>

#include <QMatrix4x4>
#include <QPoint>
#include <QSize>
#include <QVector2D>
#include <QVector3D>
#include <QVector4D>

#include <array>
#include <cstdint>
#include <memory>

class QOpenGLShaderProgram;

namespace CoreGraphics
{
  class VShader;

  // The uniforms the render context feeds to every program that declares them.
  enum EStandardUniform : int
  {
    Uniform_ViewProjection = 0,
    Uniform_View,
    Uniform_Projection,
    Uniform_View2D,
    Uniform_ViewportSize,
    Uniform_ViewportOffset,
    Uniform_FrameSize,
    Uniform_LightVector,
    Uniform_Up,
    Uniform_GlobalTime,
    Uniform_CameraPosition,
    Uniform_RadialDistortionCentre,
    Uniform_RadialDistortionParameters,
    Uniform_SensorSize,
  };
  constexpr int StandardUniformCount = 14;

  // The shader name of a standard uniform ("u_ViewProjection", ...), or nullptr.
  const char* StandardUniformName( int i_Uniform );

  // A linked pair of stages. Uniform setters take a location and skip -1, so a uniform that the
  // compiler removed costs nothing.
  class VShaderProgram
  {
  public:
    // Links in the current context; a failure leaves the program unlinked.
    VShaderProgram( std::shared_ptr< VShader > i_pVertex, std::shared_ptr< VShader > i_pFragment );
    ~VShaderProgram();
    VShaderProgram( const VShaderProgram& ) = delete;
    VShaderProgram& operator=( const VShaderProgram& ) = delete;

    // Links again from the given stages, for a reload of the shader files.
    void Relink( std::shared_ptr< VShader > i_pVertex, std::shared_ptr< VShader > i_pFragment );

    bool IsLinked() const { return m_pProgram != nullptr; }
    bool IsBound() const { return m_bBound; }
    bool Bind();
    void Release();

    // -1 when the program has no such uniform or no program exists.
    int UniformLocation( const char* i_pName ) const;
    // The same by the MurmurHash3 of the name, from the table filled at link time.
    int UniformLocationByHash( std::uint32_t i_NameHash ) const;
    int StandardUniformLocation( int i_Uniform ) const;
    int StandardAttributeLocation( int i_Attribute ) const;
    // Active uniforms of the linked program, by name hash.
    const boost::container::flat_map< std::uint32_t, int >& GetUniformTable() const { return m_UniformsByHash; }

    void SetUniform( int i_Location, int i_Value );
    void SetUniform( int i_Location, float i_Value );
    void SetUniform( int i_Location, const QSize& i_rValue );
    void SetUniform( int i_Location, const QPoint& i_rValue );
    void SetUniform( int i_Location, const QVector2D& i_rValue );
    void SetUniform( int i_Location, const QVector3D& i_rValue );
    void SetUniform( int i_Location, const QVector4D& i_rValue );
    void SetUniform( int i_Location, const QMatrix2x2& i_rValue );
    void SetUniform( int i_Location, const QMatrix4x4& i_rValue );

    QOpenGLShaderProgram* GetProgram() const { return m_pProgram.get(); }

  private:
    void Link( std::shared_ptr< VShader > i_pVertex, std::shared_ptr< VShader > i_pFragment );
    void ReadUniformTable();

    std::shared_ptr< VShader > m_pVertex;
    std::shared_ptr< VShader > m_pFragment;
    std::unique_ptr< QOpenGLShaderProgram > m_pProgram;
    std::array< int, StandardUniformCount > m_StandardUniforms;
    std::array< int, StandardAttributeCount > m_StandardAttributes;
    bool m_bBound = false;
    boost::container::flat_map< std::uint32_t, int > m_UniformsByHash;
  };
} // namespace CoreGraphics

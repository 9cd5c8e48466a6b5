#pragma once

#include <QByteArray>
#include <QString>

#include <cstdint>
#include <memory>

class QOpenGLShader;

namespace CoreGraphics
{
  // One compiled shader stage read from a file. The files are written in the GLSL ES 1.00
  // manner; a preamble turns them into GLSL ES 3.00 whatever the context's own version is,
  // so one set of sources runs on desktop and on ES drivers alike.
  class VShader
  {
  public:
    enum EKind : std::uint32_t
    {
      Kind_Vertex = 0,
      Kind_Fragment = 1,
    };

    // Compiles in the current context. A file that cannot be read or compiled is logged and
    // leaves the stage without a shader.
    VShader( EKind i_Kind, const QString& i_rPath );
    ~VShader();
    VShader( const VShader& ) = delete;
    VShader& operator=( const VShader& ) = delete;

    EKind GetKind() const { return m_Kind; }
    const QString& GetPath() const { return m_Path; }
    // The compiled stage, or nullptr.
    QOpenGLShader* GetShader() const { return m_pShader.get(); }
    bool IsCompiled() const { return m_pShader != nullptr; }

    // The text put in front of every source of that kind.
    static QByteArray Preamble( EKind i_Kind );

  private:
    EKind m_Kind;
    QString m_Path;
    std::unique_ptr< QOpenGLShader > m_pShader;
  };
} // namespace CoreGraphics

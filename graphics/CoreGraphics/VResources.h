#pragma once

#include "graphics/CoreGraphics/VShader.h"

#include <QString>
#include <QStringList>

#include <map>
#include <memory>
#include <utility>
#include <vector>

class QOpenGLContext;

namespace CoreGraphics
{
  class VShaderProgram;

  // The library of shader stages, known by the base names of their files, and of the programs
  // linked from pairs of them. Stages come from the resources ":/VertexShaders" and
  // ":/FragmentShaders"; with overrides on, files in override directories win, which lets a
  // shader be edited and reloaded without a rebuild.
  class VResources
  {
  public:
    VResources( bool i_bOverrides, QString i_ApplicationDirectory );
    ~VResources();
    VResources( const VResources& ) = delete;
    VResources& operator=( const VResources& ) = delete;

    // Compiles every stage in the current context. Runs once per instance.
    void Load();
    // The program of the pair, linked on first request; nullptr if a stage is missing or did
    // not compile. A program that failed to link is returned unlinked.
    std::shared_ptr< VShaderProgram > GetProgram( const QString& i_rVertexName, const QString& i_rFragmentName );
    void AddOverrideDirectory( const QString& i_rDirectory );
    // Compiles one file as the stage of that name, replacing a former one.
    void AddShaderFile( const QString& i_rName, const QString& i_rPath, VShader::EKind i_Kind );
    // Compiles every stage again from its file and relinks every program in place.
    void ReloadAll();

    std::shared_ptr< VShader > GetShader( VShader::EKind i_Kind, const QString& i_rName ) const;
    // Names of the loaded stages of a kind, in lexical order.
    QStringList GetShaderNames( VShader::EKind i_Kind ) const;
    const QString& GetApplicationDirectory() const { return m_ApplicationDirectory; }

  private:
    using VShaderMap = std::map< QString, std::shared_ptr< VShader > >;

    VShaderMap& Shaders( VShader::EKind i_Kind ) { return i_Kind == VShader::Kind_Vertex ? m_Vertex : m_Fragment; }
    const VShaderMap& Shaders( VShader::EKind i_Kind ) const
    {
      return i_Kind == VShader::Kind_Vertex ? m_Vertex : m_Fragment;
    }
    // Loads every ".glsl" file of a directory; i_bOnlyNew keeps stages already known.
    void LoadDirectory( const QString& i_rDirectory, VShader::EKind i_Kind, bool i_bOnlyNew );

    QOpenGLContext* m_pContext = nullptr;
    VShaderMap m_Vertex;
    VShaderMap m_Fragment;
    std::map< std::pair< QString, QString >, std::shared_ptr< VShaderProgram > > m_Programs;
    QStringList m_OverrideDirectories;
    QString m_ApplicationDirectory;
    bool m_bOverrides = false;
  };
} // namespace CoreGraphics

#include "graphics/CoreGraphics/VResources.h"

#include "graphics/CoreGraphics/VShaderProgram.h"

#include <QDirIterator>
#include <QFileInfo>
#include <QOpenGLContext>

namespace CoreGraphics
{
  namespace
  {
    const char* const VertexDirectory = ":/VertexShaders";
    const char* const FragmentDirectory = ":/FragmentShaders";
  } // namespace

  VResources::VResources( bool i_bOverrides, QString i_ApplicationDirectory )
      : m_ApplicationDirectory( std::move( i_ApplicationDirectory ) ), m_bOverrides( i_bOverrides )
  {
  }

  VResources::~VResources() = default;

  void VResources::Load()
  {
    if( m_pContext != nullptr )
      return;
    m_pContext = QOpenGLContext::currentContext();

    if( m_bOverrides )
    {
      for( const QString& rDirectory : m_OverrideDirectories )
      {
        LoadDirectory( rDirectory + "/VertexShaders", VShader::Kind_Vertex, false );
        LoadDirectory( rDirectory + "/FragmentShaders", VShader::Kind_Fragment, false );
      }
      // Stages nobody overrode still come from the resources.
      LoadDirectory( VertexDirectory, VShader::Kind_Vertex, true );
      LoadDirectory( FragmentDirectory, VShader::Kind_Fragment, true );
    }
    if( m_Vertex.empty() )
    {
      LoadDirectory( VertexDirectory, VShader::Kind_Vertex, false );
      LoadDirectory( FragmentDirectory, VShader::Kind_Fragment, false );
    }
  }

  void VResources::LoadDirectory( const QString& i_rDirectory, VShader::EKind i_Kind, bool i_bOnlyNew )
  {
    VShaderMap& rShaders = Shaders( i_Kind );
    QDirIterator It( i_rDirectory, QDir::Files );
    while( It.hasNext() )
    {
      const QFileInfo Info( It.next() );
      if( Info.suffix() != "glsl" )
        continue;
      const QString Name = Info.completeBaseName();
      if( i_bOnlyNew && rShaders.count( Name ) != 0 )
        continue;
      rShaders[Name] = std::make_shared< VShader >( i_Kind, Info.filePath() );
    }
  }

  std::shared_ptr< VShaderProgram > VResources::GetProgram( const QString& i_rVertexName,
                                                            const QString& i_rFragmentName )
  {
    const auto Key = std::make_pair( i_rVertexName, i_rFragmentName );
    const auto Found = m_Programs.find( Key );
    if( Found != m_Programs.end() )
      return Found->second;

    std::shared_ptr< VShader > pVertex = GetShader( VShader::Kind_Vertex, i_rVertexName );
    std::shared_ptr< VShader > pFragment = GetShader( VShader::Kind_Fragment, i_rFragmentName );
    if( !pVertex || !pFragment || !pVertex->IsCompiled() || !pFragment->IsCompiled() )
      return nullptr;
    auto pProgram = std::make_shared< VShaderProgram >( pVertex, pFragment );
    m_Programs.emplace( Key, pProgram );
    return pProgram;
  }

  void VResources::AddOverrideDirectory( const QString& i_rDirectory )
  {
    m_OverrideDirectories.append( i_rDirectory );
  }

  void VResources::AddShaderFile( const QString& i_rName, const QString& i_rPath, VShader::EKind i_Kind )
  {
    Shaders( i_Kind )[i_rName] = std::make_shared< VShader >( i_Kind, i_rPath );
  }

  void VResources::ReloadAll()
  {
    for( VShaderMap* pMap : { &m_Vertex, &m_Fragment } )
      for( auto& rEntry : *pMap )
        rEntry.second = std::make_shared< VShader >( rEntry.second->GetKind(), rEntry.second->GetPath() );
    // Programs are relinked in place, so whoever holds one sees the new code.
    for( auto& rEntry : m_Programs )
      rEntry.second->Relink( GetShader( VShader::Kind_Vertex, rEntry.first.first ),
                             GetShader( VShader::Kind_Fragment, rEntry.first.second ) );
  }

  std::shared_ptr< VShader > VResources::GetShader( VShader::EKind i_Kind, const QString& i_rName ) const
  {
    const VShaderMap& rShaders = Shaders( i_Kind );
    const auto It = rShaders.find( i_rName );
    return It == rShaders.end() ? nullptr : It->second;
  }

  QStringList VResources::GetShaderNames( VShader::EKind i_Kind ) const
  {
    QStringList Names;
    for( const auto& rEntry : Shaders( i_Kind ) )
      Names.append( rEntry.first );
    return Names;
  }
} // namespace CoreGraphics

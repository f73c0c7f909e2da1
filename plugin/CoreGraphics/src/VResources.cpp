#include <CoreGraphics/VResources.h>

#include <CoreGraphics/ShaderResources.h>

#include "GraphicsLog.h"

#include <HarrowPluginInterface/IHarrowServices.h>

#include <QtCore/QDirIterator>
#include <QtCore/QFileInfo>
#include <QtGui/QOpenGLContext>
#include <QtGui/QOpenGLFunctions>

#include <boost/format.hpp>

namespace CoreGraphics
{
namespace
{
constexpr GLenum MaximumVertexUniformVectors = 0x8DFB;
constexpr GLenum MaximumVertexUniformComponents = 0x8B4A;
// 250 bone matrices and what else a skinned vertex needs.
constexpr int SkinningVectors = 1040;

const char* FolderName( EShaderType i_Type )
{
  return i_Type == EVertexShader ? "/VertexShaders" : "/FragmentShaders";
}

int VertexUniformVectors( QOpenGLContext& i_rContext )
{
  const bool bVectors = i_rContext.isOpenGLES() || i_rContext.hasExtension( "GL_ARB_ES2_compatibility" );
  GLint Value = 0;
  i_rContext.functions()->glGetIntegerv( bVectors ? MaximumVertexUniformVectors : MaximumVertexUniformComponents,
                                         &Value );
  return bVectors ? Value : Value / 4;
}
} // namespace

VResources::VResources( std::shared_ptr< HarrowPluginInterface::IRenderResources > i_pHost )
  : m_pHost( std::move( i_pHost ) )
{
}

VResources::~VResources() = default;

std::string VResources::VersionText( bool i_bES, int i_Major, int i_Minor )
{
  const bool bGood = i_bES ? i_Major >= 3 : i_Major > 4 || ( i_Major == 4 && i_Minor >= 3 );
  if ( bGood )
  {
    return {};
  }
  boost::format Format( "%1% context version %2%.%3% is unsupported" );
  return ( Format % ( i_bES ? "OpenGL ES" : "OpenGL" ) % i_Major % i_Minor ).str();
}

bool VResources::Prepare()
{
  QOpenGLContext* pContext = QOpenGLContext::currentContext();
  if ( !pContext )
  {
    return false;
  }
  if ( m_bPrepared && m_pGroup )
  {
    const bool bSame = pContext->shareGroup() == m_pGroup;
    if ( !bSame )
    {
      ZEK::Log( GraphicsLog(), ZEK::ELogFailure,
                "The OpenGL context of a view shares no objects with the first one of its scene; nothing is drawn" );
    }
    return bSame;
  }
  m_pGroup = pContext->shareGroup();
  m_bPrepared = true;
  ReadContext();
  InitBasicShaderResources();
  m_Generation = m_pHost ? m_pHost->Generation() : 0;
  Scan();
  Rebuild( true );
  return true;
}

void VResources::ReadContext()
{
  QOpenGLContext& rContext = *QOpenGLContext::currentContext();
  const QSurfaceFormat Format = rContext.format();
  const bool bES = Format.renderableType() == QSurfaceFormat::OpenGLES;
  m_VersionNotice = VersionText( bES, Format.majorVersion(), Format.minorVersion() );
  if ( !m_VersionNotice.empty() )
  {
    ZEK::Log( GraphicsLog(), ZEK::ELogWarning, "%1%", m_VersionNotice );
  }
  m_Dialect = EDialectES300;
  if ( !bES && !rContext.hasExtension( "GL_ARB_ES3_compatibility" ) )
  {
    m_Dialect = EDialectDesktop330;
    ZEK::Log( GraphicsLog(), ZEK::ELogWarning, "GL_ARB_ES3_compatibility not available, using GLSL 3.30" );
  }
  m_bSkinning = VertexUniformVectors( rContext ) >= SkinningVectors;
  if ( !m_bSkinning )
  {
    ZEK::Log( GraphicsLog(), ZEK::ELogWarning, "Too few uniform vectors for skinned meshes: %1% of %2%",
              VertexUniformVectors( rContext ), SkinningVectors );
  }
}

void VResources::Scan()
{
  m_VertexFiles.clear();
  m_FragmentFiles.clear();
  if ( m_pHost )
  {
    for ( const std::filesystem::path& rFolder : m_pHost->OverrideFolders() )
    {
      ScanFolder( QString::fromStdU16String( rFolder.u16string() ) );
    }
  }
  ScanFolder( ":" );
}

// What was found in an earlier folder stays.
void VResources::ScanFolder( const QString& i_rFolder )
{
  for ( const EShaderType Type : { EVertexShader, EFragmentShader } )
  {
    VFileMap& rFiles = Type == EVertexShader ? m_VertexFiles : m_FragmentFiles;
    QDirIterator It( i_rFolder + FolderName( Type ), { "*.glsl" }, QDir::Files );
    while ( It.hasNext() )
    {
      const QString Path = It.next();
      rFiles.try_emplace( QFileInfo( Path ).completeBaseName().toStdString(), Path );
    }
  }
}

QString VResources::FindFile( EShaderType i_Type, const std::string& i_rName ) const
{
  const VFileMap& rFiles = i_Type == EVertexShader ? m_VertexFiles : m_FragmentFiles;
  const auto It = rFiles.find( i_rName );
  return It != rFiles.end() ? It->second
                            : QString( ":" ) + FolderName( i_Type ) + '/' + QString::fromStdString( i_rName ) + ".glsl";
}

std::shared_ptr< VShader > VResources::FindShader( EShaderType i_Type, const std::string& i_rName, EShaderForm i_Form )
{
  std::shared_ptr< VShader >& rpShader = m_Shaders[{ i_Type, i_rName, i_Form }];
  if ( !rpShader )
  {
    rpShader = std::make_shared< VShader >( FindFile( i_Type, i_rName ), i_Type, i_Form, m_Dialect );
  }
  return rpShader;
}

std::shared_ptr< VShaderProgram > VResources::GetProgram( const std::string& i_rVertexName,
                                                          const std::string& i_rFragmentName, EShaderForm i_Form )
{
  if ( !m_bPrepared )
  {
    Prepare();
  }
  std::shared_ptr< VShaderProgram >& rpProgram = m_Programs[{ i_rVertexName, i_rFragmentName, i_Form }];
  if ( !rpProgram )
  {
    const bool bSelection = i_Form == EFormInstancedSelection || i_Form == EFormPointsSelection;
    const EShaderForm Single = i_Form == EFormTextureBuffers ? EFormTextureBuffers : EFormSingle;
    rpProgram = std::make_shared< VShaderProgram >(
        FindShader( EVertexShader, i_rVertexName, i_Form ),
        FindShader( EFragmentShader, i_rFragmentName, bSelection ? EFormInstancedSelection : Single ) );
  }
  return rpProgram;
}

bool VResources::Update()
{
  if ( !m_pGroup )
  {
    return Prepare();
  }
  if ( !m_pHost || m_pHost->Generation() == m_Generation )
  {
    return false;
  }
  m_Generation = m_pHost->Generation();
  Reload();
  return true;
}

void VResources::Reload()
{
  Scan();
  Rebuild( false );
}

void VResources::Rebuild( bool i_bForce )
{
  std::vector< const VShader* > Changed;
  for ( const auto& [rKey, rpShader] : m_Shaders )
  {
    const auto& [Type, rName, Form] = rKey;
    if ( rpShader->Reload( FindFile( Type, rName ), m_Dialect, i_bForce ) )
    {
      Changed.push_back( rpShader.get() );
    }
  }
  const auto IsChanged = [&]( const std::shared_ptr< VShader >& i_rpShader )
  {
    return std::find( Changed.begin(), Changed.end(), i_rpShader.get() ) != Changed.end();
  };
  for ( const auto& [rKey, rpProgram] : m_Programs )
  {
    if ( IsChanged( rpProgram->Vertex() ) || IsChanged( rpProgram->Fragment() ) )
    {
      rpProgram->Relink();
    }
  }
}

} // namespace CoreGraphics

#include "MeshImport.h"

#include "FbxGuard.h"

#include <assimp/DefaultIOSystem.h>
#include <assimp/Importer.hpp>
#include <assimp/MemoryIOWrapper.h>
#include <assimp/config.h>
#include <assimp/importerdesc.h>
#include <assimp/postprocess.h>
#include <assimp/scene.h>

#include <exception>
#include <string_view>

namespace HostMeshes
{
namespace
{
/// Serves the file itself from memory, and others from its folder.
class VFolderFiles final : public Assimp::DefaultIOSystem
{
public:
  VFolderFiles( std::span< const std::byte > i_Bytes, std::string i_Main, std::filesystem::path i_Folder )
    : m_Bytes( i_Bytes )
    , m_Main( std::move( i_Main ) )
    , m_Folder( std::move( i_Folder ) )
  {
  }
  bool Exists( const char* i_pPath ) const override
  {
    return i_pPath == m_Main || ( IsInside( i_pPath ) && DefaultIOSystem::Exists( i_pPath ) );
  }
  Assimp::IOStream* Open( const char* i_pPath, const char* i_pMode ) override
  {
    if ( i_pPath == m_Main )
    {
      return new Assimp::MemoryIOStream( reinterpret_cast< const std::uint8_t* >( m_Bytes.data() ), m_Bytes.size() );
    }
    return IsInside( i_pPath ) && std::string_view( i_pMode ).starts_with( 'r' )
               ? DefaultIOSystem::Open( i_pPath, i_pMode )
               : nullptr;
  }

private:
  bool IsInside( const std::filesystem::path& i_rPath ) const
  {
    std::error_code Error;
    const std::filesystem::path Whole = std::filesystem::weakly_canonical( i_rPath, Error );
    const std::filesystem::path Folder = std::filesystem::weakly_canonical( m_Folder, Error );
    return !m_Folder.empty() && !Error && std::filesystem::is_regular_file( Whole, Error ) &&
           std::mismatch( Folder.begin(), Folder.end(), Whole.begin(), Whole.end() ).first == Folder.end();
  }

  std::span< const std::byte > m_Bytes;
  std::string m_Main;
  std::filesystem::path m_Folder;
};

/// Leaves the importer with the two formats that are meant: it would else go by what a file looks like.
void LeaveMeantFormats( Assimp::Importer& io_rImporter )
{
  for ( std::size_t Index = io_rImporter.GetImporterCount(); Index-- > 0; )
  {
    const aiImporterDesc* const pInfo = io_rImporter.GetImporterInfo( Index );
    const std::string_view Extensions = pInfo && pInfo->mFileExtensions ? pInfo->mFileExtensions : "";
    if ( Extensions != "fbx" && Extensions != "obj" )
    {
      io_rImporter.UnregisterLoader( io_rImporter.GetImporter( Index ) );
    }
  }
}
} // namespace

VMeshImport::VMeshImport()
  : m_pImporter( std::make_unique< Assimp::Importer >() )
{
  LeaveMeantFormats( *m_pImporter );
  // Animations move the nodes that the file names, not helpers beside them.
  m_pImporter->SetPropertyBool( AI_CONFIG_IMPORT_FBX_PRESERVE_PIVOTS, false );
  m_pImporter->SetPropertyBool( AI_CONFIG_IMPORT_FBX_READ_LIGHTS, false );
  m_pImporter->SetPropertyBool( AI_CONFIG_IMPORT_FBX_READ_CAMERAS, false );
}

VMeshImport::~VMeshImport() = default;

const aiScene* VMeshImport::Read( std::span< const std::byte > i_Bytes, const std::string& i_rName,
                                  const std::filesystem::path& i_rFolder, std::string& o_rReason )
{
  const bool bFbx = QString::fromStdString( i_rName ).endsWith( ".fbx", Qt::CaseInsensitive );
  o_rReason = i_Bytes.empty() ? "it is empty" : bFbx ? FindFbxFault( i_Bytes ) : std::string();
  if ( !o_rReason.empty() )
  {
    return nullptr;
  }
  const std::string Main = ( i_rFolder / i_rName ).string();
  const aiScene* pScene = nullptr;
  try
  {
    m_pImporter->SetIOHandler( new VFolderFiles( i_Bytes, Main, i_rFolder ) );
    // Vertices stay as the corners of the file's polygons, in their order.
    pScene = m_pImporter->ReadFile( Main, aiProcess_Triangulate );
    o_rReason = pScene ? "" : m_pImporter->GetErrorString();
  }
  catch ( const std::exception& rError )
  {
    o_rReason = rError.what();
  }
  if ( pScene && !pScene->mRootNode )
  {
    o_rReason = "it holds no scene";
    return nullptr;
  }
  if ( !pScene && o_rReason.empty() )
  {
    o_rReason = "it cannot be understood";
  }
  return pScene;
}

} // namespace HostMeshes

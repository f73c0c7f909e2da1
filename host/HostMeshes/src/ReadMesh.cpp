#include <HostMeshes/ReadMesh.h>

#include "MeshImport.h"
#include "SceneBuilder.h"

#include <assimp/scene.h>

#include <fstream>
#include <system_error>

namespace HostMeshes
{
namespace
{
using HarrowPluginInterface::VMeshScene;

bool HasEnding( const std::filesystem::path& i_rPath, const char* i_pEnding )
{
  return QString::fromStdU16String( i_rPath.extension().u16string() ).compare( i_pEnding, Qt::CaseInsensitive ) == 0;
}

double MillimetresPerUnit( const aiScene& i_rScene, bool i_bFbx )
{
  if ( !i_bFbx )
  {
    return 1;
  }
  double Centimetres = 1;
  float Single = 1;
  if ( i_rScene.mMetaData && !i_rScene.mMetaData->Get( "UnitScaleFactor", Centimetres ) &&
       i_rScene.mMetaData->Get( "UnitScaleFactor", Single ) )
  {
    Centimetres = Single;
  }
  return Centimetres > 1e-6 && Centimetres < 1e6 ? 10 * Centimetres : 10;
}

ZEK::IResult Read( std::span< const std::byte > i_Bytes, const std::string& i_rName,
                   const std::filesystem::path& i_rFolder, VMeshScene& o_rMesh, std::string& o_rMessage )
{
  o_rMesh = {};
  std::string Reason;
  VMeshImport Import;
  const aiScene* const pScene = Import.Read( i_Bytes, i_rName, i_rFolder, Reason );
  if ( pScene )
  {
    VSceneBuilder Builder( *pScene, i_rFolder );
    if ( Builder.Build( MillimetresPerUnit( *pScene, HasEnding( i_rName, ".fbx" ) ), o_rMesh, Reason ) )
    {
      o_rMesh.Name = i_rName;
      o_rMessage = Builder.Repairs();
      return ZEK::IResult::Ok;
    }
  }
  o_rMessage = i_rName + ": " + Reason;
  return ZEK::IResult::InvalidFormat;
}

ZEK::IResult Fail( const std::string& i_rName, const char* i_pReason, ZEK::IResult i_Result, VMeshScene& o_rMesh,
                   std::string& o_rMessage )
{
  o_rMesh = {};
  o_rMessage = i_rName + ": " + i_pReason;
  return i_Result;
}
} // namespace

bool IsMeshName( const std::filesystem::path& i_rPath )
{
  return HasEnding( i_rPath, ".fbx" ) || HasEnding( i_rPath, ".obj" );
}

ZEK::IResult ReadMesh( std::span< const std::byte > i_Bytes, const std::string& i_rName, VMeshScene& o_rMesh,
                       std::string& o_rMessage )
{
  if ( !IsMeshName( i_rName ) )
  {
    return Fail( i_rName, "it is neither FBX nor OBJ", ZEK::IResult::InvalidFormat, o_rMesh, o_rMessage );
  }
  return Read( i_Bytes, i_rName, {}, o_rMesh, o_rMessage );
}

ZEK::IResult ReadMesh( const std::filesystem::path& i_rPath, VMeshScene& o_rMesh, std::string& o_rMessage )
{
  const std::string Name = i_rPath.filename().string();
  std::error_code Error;
  if ( !IsMeshName( i_rPath ) )
  {
    return Fail( Name, "it is neither FBX nor OBJ", ZEK::IResult::InvalidFormat, o_rMesh, o_rMessage );
  }
  if ( !std::filesystem::is_regular_file( i_rPath, Error ) )
  {
    return Fail( Name, "there is no such file", ZEK::IResult::FileNotFound, o_rMesh, o_rMessage );
  }
  const std::uintmax_t Size = std::filesystem::file_size( i_rPath, Error );
  if ( Error || Size > LargestMeshFile )
  {
    return Fail( Name, "it is larger than 128 MiB", ZEK::IResult::InvalidValue, o_rMesh, o_rMessage );
  }
  std::vector< std::byte > Bytes( static_cast< std::size_t >( Size ) );
  std::ifstream File( i_rPath, std::ios::binary );
  if ( !File.read( reinterpret_cast< char* >( Bytes.data() ), static_cast< std::streamsize >( Bytes.size() ) ) )
  {
    return Fail( Name, "it cannot be read", ZEK::IResult::FileIOFailure, o_rMesh, o_rMessage );
  }
  return Read( Bytes, Name, i_rPath.parent_path(), o_rMesh, o_rMessage );
}

} // namespace HostMeshes

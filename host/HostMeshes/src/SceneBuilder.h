#pragma once

#include <HarrowPluginInterface/VMeshScene.h>

#include <filesystem>
#include <string>
#include <unordered_map>
#include <vector>

struct aiMesh;
struct aiNode;
struct aiScene;

namespace HostMeshes
{

/// Makes a mesh out of what the importer read. What is broken is mended or left out, and counted.
class VSceneBuilder
{
public:
  /// `i_rFolder` is where pictures may lie; empty: in the file alone.
  VSceneBuilder( const aiScene& i_rScene, std::filesystem::path i_Folder );

  /// False, with a reason, when no triangle is left.
  bool Build( double i_MillimetresPerUnit, HarrowPluginInterface::VMeshScene& o_rMesh, std::string& o_rReason );
  /// What was mended, for the log; empty for a clean file.
  std::string Repairs() const;

private:
  struct VFaults
  {
    std::size_t Vertices = 0, Triangles = 0, Weights = 0, Surfaces = 0, Keys = 0;
  };

  void AddNodes();
  bool AddSurfaces( std::string& o_rReason );
  void AddSurface( const aiMesh& i_rMesh, std::uint32_t i_Node );
  void AddMaterials();
  void AddAnimations();
  /// The bone of that node with that inverse bind, made when there is none.
  std::uint32_t BoneOf( std::uint32_t i_Node, const HarrowPluginInterface::VMeshTransform& i_rInverseBind );
  std::vector< HarrowPluginInterface::VMeshInfluence > Influences( const aiMesh& i_rMesh, std::uint32_t i_Node,
                                                                   const HarrowPluginInterface::VMeshTransform& i_rUp );

  const aiScene& m_rScene;
  std::filesystem::path m_Folder;
  HarrowPluginInterface::VMeshScene m_Mesh;
  std::vector< const aiNode* > m_Sources;                            ///< by node
  std::vector< HarrowPluginInterface::VMeshTransform > m_RestWorlds; ///< by node
  std::unordered_map< std::string, std::uint32_t > m_NodesByName;
  std::unordered_multimap< std::uint32_t, std::uint32_t > m_BonesByNode;
  VFaults m_Faults;
};

} // namespace HostMeshes

#include "PerformerMeshes.h"

#include <HostSources/PerformerMesh.h>

#include <HarrowPluginInterface/MeshMath.h>

#include <numeric>

namespace HostWindow
{
namespace
{

using namespace HarrowPluginInterface;

VMeshTransform TransformOf( const CoreMoxelTypes::Rigid& i_rRigid )
{
  const double* const pR = i_rRigid.R;
  const double* const pT = i_rRigid.T;
  return { pR[0], pR[1], pR[2], pT[0], pR[3], pR[4], pR[5], pT[1], pR[6], pR[7], pR[8], pT[2] };
}

/// A node for each bone, where it is at rest, beside a root.
void AddBones( const HostSources::VPerformerMesh& i_rMesh, VMeshScene& o_rScene )
{
  o_rScene.Nodes.push_back( { "Body", -1, MeshIdentity } );
  for ( const auto& rBone : i_rMesh.Bones )
  {
    VMeshNode& rNode = o_rScene.Nodes.emplace_back();
    rNode.Name = rBone.Name;
    rNode.Parent = 0;
    const VMeshTransform Inverse = TransformOf( rBone.InverseBind );
    (void)InvertMesh( Inverse, rNode.Local ); // a rigid place has an inverse
    o_rScene.Bones.push_back( { rBone.Name, static_cast< std::uint32_t >( o_rScene.Nodes.size() - 1 ), Inverse } );
  }
}

std::shared_ptr< const VMeshScene > SceneOf( HostSources::EPerformerMesh i_Which )
{
  HostSources::VPerformerMesh Mesh = HostSources::MakePerformerMesh( i_Which );
  auto pScene = std::make_shared< VMeshScene >();
  pScene->Name = HostSources::PerformerMeshName( i_Which );
  AddBones( Mesh, *pScene );
  VMeshMaterial& rMaterial = pScene->Materials.emplace_back();
  rMaterial.Name = "Suit";
  rMaterial.Colour = { 0.86F, 0.88F, 0.92F };
  VMeshSurface& rSurface = pScene->Surfaces.emplace_back();
  rSurface.Name = "Body";
  rSurface.UVs.assign( Mesh.Positions.size(), {} );
  rSurface.ControlPoints.resize( Mesh.Positions.size() );
  std::iota( rSurface.ControlPoints.begin(), rSurface.ControlPoints.end(), 0u );
  for ( const auto& rHold : Mesh.Influences )
  {
    rSurface.Influences.push_back( { rHold.Bones, rHold.Weights } );
  }
  rSurface.Positions = std::move( Mesh.Positions );
  rSurface.Normals = std::move( Mesh.Normals );
  rSurface.Triangles = std::move( Mesh.Triangles );
  return pScene;
}

} // namespace

void AddPerformerMeshes( const HostSources::VSimulatedCaptureOptions& i_rOptions, HostMeshes::VMeshCache& io_rCache )
{
  using enum HostSources::EPerformerMesh;
  if ( i_rOptions.Performers > 0 )
  {
    io_rCache.AddBuiltIn( HostSources::PerformerMeshName( Performer ), SceneOf( Performer ) );
    if ( i_rOptions.bRetargeting )
    {
      io_rCache.AddBuiltIn( HostSources::PerformerMeshName( Character ), SceneOf( Character ) );
    }
  }
}

} // namespace HostWindow

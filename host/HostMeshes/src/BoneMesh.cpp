#include "BoneMesh.h"

#include <HarrowPluginInterface/MeshMath.h>

namespace HostMeshes
{
namespace
{
constexpr float Waist = 0.15F;
constexpr float HalfWidth = 0.07F;
} // namespace

std::shared_ptr< const HarrowPluginInterface::VMeshScene > MakeBoneMesh()
{
  using VPoint = std::array< float, 3 >;
  auto pScene = std::make_shared< HarrowPluginInterface::VMeshScene >();
  pScene->Name = BoneMeshName;
  pScene->Nodes.push_back( { "Bone", -1, HarrowPluginInterface::MeshIdentity } );
  pScene->Materials.emplace_back().Name = "Bone";
  auto& rSurface = pScene->Surfaces.emplace_back();
  rSurface.Name = "Bone";
  const auto Face = [&]( const VPoint& i_rA, const VPoint& i_rB, const VPoint& i_rC )
  {
    VPoint U, V;
    for ( std::size_t Axis = 0; Axis < 3; ++Axis )
    {
      U[Axis] = i_rB[Axis] - i_rA[Axis];
      V[Axis] = i_rC[Axis] - i_rA[Axis];
    }
    const VPoint Across{ U[1] * V[2] - U[2] * V[1], U[2] * V[0] - U[0] * V[2], U[0] * V[1] - U[1] * V[0] };
    const float Length = std::hypot( Across[0], Across[1], Across[2] );
    for ( const VPoint& rCorner : { i_rA, i_rB, i_rC } )
    {
      const auto Index = static_cast< std::uint32_t >( rSurface.Positions.size() );
      rSurface.Triangles.push_back( Index );
      rSurface.ControlPoints.push_back( Index );
      rSurface.Positions.push_back( rCorner );
      rSurface.Normals.push_back( { Across[0] / Length, Across[1] / Length, Across[2] / Length } );
      rSurface.UVs.push_back( { rCorner[0], 0.5F } );
    }
  };
  const VPoint Begin{ 0, 0, 0 }, End{ 1, 0, 0 };
  // The faces look along y and z: the one towards y is the stripe that shows how a bone is turned.
  const VPoint Corners[] = { { Waist, HalfWidth, -HalfWidth },
                             { Waist, HalfWidth, HalfWidth },
                             { Waist, -HalfWidth, HalfWidth },
                             { Waist, -HalfWidth, -HalfWidth } };
  for ( std::size_t Side = 0; Side < 4; ++Side )
  {
    Face( Corners[Side], Corners[( Side + 1 ) % 4], End );
    Face( Corners[( Side + 1 ) % 4], Corners[Side], Begin );
  }
  return pScene;
}

} // namespace HostMeshes

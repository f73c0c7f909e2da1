#pragma once

#include "FrameFixture.h"

#include <MoxelGraphics/VSubjectSkins.h>

#include <HarrowPluginInterface/MeshMath.h>

#include <map>

namespace MoxelGraphics
{

using HarrowPluginInterface::VMeshScene;
using HarrowPluginInterface::VMeshTransform;

/// Meshes that a test puts in.
class VTestMeshes final : public HarrowPluginInterface::VMeshSceneCache
{
public:
  void SetSearchFolders( const std::string&, std::vector< std::filesystem::path > ) override {}
  ZEK::IMultiCallback< void() >& Changed() override { return m_Changed; }
  std::shared_ptr< const VMeshScene > Request( const std::string& i_rCategory, const std::string& i_rName ) override
  {
    ++Requests;
    const auto It = m_Meshes.find( i_rCategory + '/' + i_rName );
    return It == m_Meshes.end() ? nullptr : It->second;
  }
  bool CanRead( const std::filesystem::path& ) const override { return false; }

  void Put( const std::string& i_rName, VMeshScene i_Mesh )
  {
    m_Meshes[i_rName] = std::make_shared< const VMeshScene >( std::move( i_Mesh ) );
    m_Changed.Fire();
  }
  int Requests = 0;

private:
  std::map< std::string, std::shared_ptr< const VMeshScene > > m_Meshes;
  ZEK::VMultiCallback< void() > m_Changed;
};

/// The skins of one group, and outlines.
class VSkinScene final : public VMoxelScene
{
public:
  VSkinScene()
    : VMoxelScene( nullptr, std::make_shared< HostServices::VSelectionService >(), std::make_shared< VTestMeshes >(),
                   nullptr, false )
  {
    pDraw->Function = [this]( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions&, std::uint32_t i_Pass )
    {
      if ( i_Pass == ( bXRay ? ERenderPassTranslucent : ERenderPassOpaque ) )
      {
        Skins.Draw( io_rContext, Group, 1, bXRay );
      }
    };
    m_RenderList = { pDraw };
  }
  void Initialise( CoreGraphics::VRenderContext& io_rContext ) override
  {
    VMoxelScene::Initialise( io_rContext );
    if ( m_PostList.empty() && CanDraw() )
    {
      m_PostList = { std::make_shared< VRenderOutlines >( *this ) };
    }
  }
  bool ProcessPending() override
  {
    const bool bRan = VMoxelScene::ProcessPending();
    if ( TakeDirty() )
    {
      Registry().Reset();
    }
    return bRan;
  }
  ZEK::VSelection ResolveIds( std::span< const std::uint32_t > i_Ids, std::vector< std::string >& ) override
  {
    ZEK::VSelection Items;
    for ( const std::uint32_t Id : i_Ids )
    {
      Items.push_back( { ZEK::ESelectSubject, "id", Id, 0 } );
    }
    return Items;
  }
  VTestMeshes& Meshes() { return static_cast< VTestMeshes& >( *MeshCache() ); }

  VSubjectGroup Group;
  VSubjectSkins Skins{ *this };
  bool bXRay = false;
  const std::shared_ptr< VTestDraw > pDraw = std::make_shared< VTestDraw >();
};

inline VMeshTransform Shift( double i_X, double i_Y = 0, double i_Z = 0 )
{
  return { 1, 0, 0, i_X, 0, 1, 0, i_Y, 0, 0, 1, i_Z };
}

/// An arm along x of three joints, 40 units apart, in a file whose unit is a centimetre: a tube of radius 8 that bends
/// softly, and a stiff box that rides on the middle of the first bone. Joints have a size of their own, as files have.
inline VMeshScene MakeArm( std::size_t i_MoreBones = 0 )
{
  using namespace HarrowPluginInterface;
  VMeshScene Mesh;
  Mesh.MillimetresPerUnit = 10;
  Mesh.Materials.resize( 2 );
  Mesh.Materials[0].Colour = { 0.9F, 0.7F, 0.5F };
  Mesh.Materials[1].Colour = { 0, 1, 0 };
  Mesh.Nodes = { { "scene", -1, MeshIdentity } };
  const VMeshTransform Large{ 100, 0, 0, 0, 0, 100, 0, 0, 0, 0, 100, 0 };
  for ( const char* const pName : { "Rig:Upper", "Rig:Lower", "Rig:Hand" } )
  {
    const auto Joint = static_cast< std::uint32_t >( Mesh.Nodes.size() );
    Mesh.Nodes.push_back( { pName, static_cast< std::int32_t >( Joint - 1 ), Joint == 1 ? Large : Shift( 0.4 ) } );
    VMeshTransform InverseBind;
    (void)InvertMesh( Shift( 40.0 * ( Joint - 1 ) ) * Large, InverseBind );
    Mesh.Bones.push_back( { pName, Joint, InverseBind } );
  }
  for ( std::size_t More = 0; More < i_MoreBones; ++More )
  {
    Mesh.Bones.push_back( { "more", 3, Mesh.Bones[2].InverseBind } );
  }
  VMeshSurface Tube;
  constexpr std::uint32_t Sides = 12, Rings = 31;
  for ( std::uint32_t Ring = 0; Ring < Rings; ++Ring )
  {
    for ( std::uint32_t Side = 0; Side < Sides; ++Side )
    {
      const float Angle = 6.2831853F * static_cast< float >( Side ) / Sides;
      const float Along = 4.0F * static_cast< float >( Ring ); // 0 to 120
      const float Middle = std::clamp( ( Along - 20 ) / 40, 0.0F, 1.99F );
      const auto Bone = static_cast< std::uint16_t >( Middle );
      const float Share = Middle - static_cast< float >( Bone );
      Tube.Positions.push_back( { Along, 8 * std::cos( Angle ), 8 * std::sin( Angle ) } );
      Tube.Normals.push_back( { 0, std::cos( Angle ), std::sin( Angle ) } );
      Tube.Influences.push_back( { { Bone, static_cast< std::uint16_t >( Bone + 1 ), 0, 0 }, { 1 - Share, Share } } );
      if ( Ring > 0 )
      {
        const std::uint32_t A = Ring * Sides + Side, B = Ring * Sides + ( Side + 1 ) % Sides;
        Tube.Triangles.insert( Tube.Triangles.end(), { A - Sides, A, B, A - Sides, B, B - Sides } );
      }
    }
  }
  VMeshSurface Box;
  for ( std::uint32_t Corner = 0; Corner < 8; ++Corner )
  {
    Box.Positions.push_back( { Corner & 1 ? 12.0F : 28.0F, Corner & 2 ? 4.0F : -4.0F, Corner & 4 ? 6.0F : 14.0F } );
    Box.Normals.push_back( { 0, 0, 1 } );
  }
  Box.Triangles = { 0, 1, 2, 1, 2, 3, 4, 5, 6, 5, 6, 7, 0, 1, 4, 1, 4, 5,
                    2, 3, 6, 3, 6, 7, 0, 2, 4, 2, 4, 6, 1, 3, 5, 3, 5, 7 };
  Box.Material = 1;
  Mesh.Surfaces = { Tube, Box };
  for ( VMeshSurface& rSurface : Mesh.Surfaces )
  {
    rSurface.UVs.resize( rSurface.Positions.size() );
    rSurface.ControlPoints.resize( rSurface.Positions.size() );
  }
  return Mesh;
}

} // namespace MoxelGraphics

#include "SceneSetup.h"

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>

#include <cmath>

namespace SceneBench
{

MoxelGraphics::VScenePoint PointAt( std::size_t i_Index, const VPopulation& i_rPopulation, int i_Frame )
{
  const auto Place = static_cast< float >( i_Index ) / static_cast< float >( i_rPopulation.Count() );
  const float Angle = 40.0F * Place + 0.02F * static_cast< float >( i_Frame );
  const float Radius = 400.0F + 2200.0F * Place;
  return { Radius * std::cos( Angle ), Radius * std::sin( Angle ),
           50.0F + 1700.0F * std::fmod( Place * 37.0F + 0.002F * static_cast< float >( i_Frame ), 1.0F ),
           i_Index < i_rPopulation.Small ? 7.0F : 9.0F };
}

VReconstructionScene::VReconstructionScene( const VPopulation& i_rPopulation )
  : VFlowScene( nullptr, nullptr, nullptr, nullptr, false )
{
  const ZEK::VFlowStateFactoryRef Factory = HostFlow::MakeStateFactory();
  const ZEK::VFlowStoreRef Store = HostFlow::MakeItemStore();
  for ( int Frame = 0; Frame < FrameCount; ++Frame )
  {
    ZEK::IResult Status;
    ZEK::VFlowItemRef Item;
    Store->CreateItem( Status, ZEK::FlowValueType< CoreMoxelTypes::FlowReconstructionSet >::Descriptor, Item );
    auto& rSet = *ZEK::FlowMutablePayload< CoreMoxelTypes::VReconstructionSet >( Item.Get() );
    for ( std::size_t Index = 0; Index < i_rPopulation.Count(); ++Index )
    {
      const MoxelGraphics::VScenePoint Point = PointAt( Index, i_rPopulation, Frame );
      rSet.Items.push_back(
          { static_cast< std::uint32_t >( Index + 1 ), { Point.X, Point.Y, Point.Z }, Point.Radius, 0, 3 } );
    }
    ZEK::VFlowStateRef State;
    (void)Factory->CreateState( State, { Frame, 1, 1 }, {}, {} );
    State->AddItem( Item );
    m_States.push_back( std::move( State ) );
  }
}

} // namespace SceneBench

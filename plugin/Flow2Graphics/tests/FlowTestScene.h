#pragma once

#include <CoreMoxelTypes/FlowTypes.h>
#include <Flow2Graphics/VFlowRenderFloorGrid.h>
#include <Flow2Graphics/VFlowRenderForcePlates.h>
#include <Flow2Graphics/VFlowRenderReconstructionVolume.h>
#include <Flow2Graphics/VFlowRenderReconstructions.h>
#include <Flow2Graphics/VFlowScene.h>
#include <HostFlow/VFlowFramework.h>

#include <memory>
#include <string>

namespace FlowTest
{

/// A selection that a test sets by hand.
class VSelection : public ZEK::ISelectionService
{
public:
  ZEK::VSelection Get( ESet i_Set ) const override { return m_Sets[i_Set]; }
  bool Get( ESet i_Set, const std::vector< std::uint32_t >& i_rKinds, ZEK::VSelection& o_rSelection ) const override
  {
    o_rSelection.clear();
    for ( const ZEK::VSelectionItem& rItem : m_Sets[i_Set] )
    {
      if ( std::find( i_rKinds.begin(), i_rKinds.end(), rItem.Kind ) != i_rKinds.end() )
      {
        o_rSelection.push_back( rItem );
      }
    }
    return !o_rSelection.empty();
  }
  std::uint64_t Generation() const override { return m_Generation; }
  void Set( ESet i_Set, ZEK::VSelection i_Selection ) override
  {
    m_Sets[i_Set] = std::move( i_Selection );
    ++m_Generation;
  }
  std::shared_ptr< ZEK::IMultiCallback< void() > > ForKinds( const std::vector< std::uint32_t >& ) override
  {
    return std::make_shared< ZEK::VMultiCallback< void() > >();
  }
  ZEK::VSelectionItem FromName( const std::string& i_rText ) const override
  {
    return i_rText.empty() ? ZEK::VSelectionItem{} : ZEK::VSelectionItem{ ZEK::ESelectDevice, i_rText, 0, 0 };
  }
  std::string Text( const ZEK::VSelectionItem& i_rItem ) const override { return i_rItem.Device; }

private:
  ZEK::VSelection m_Sets[2];
  std::uint64_t m_Generation = 1;
};

class VScene : public Flow2Graphics::VFlowScene
{
public:
  explicit VScene( std::shared_ptr< VSelection > i_pSelection = nullptr )
    : VFlowScene( nullptr, std::move( i_pSelection ), nullptr, nullptr, false )
  {
    CreateRenderTypes();
  }

  /// Shows that state as a frame would, before anything is drawn.
  void Show( const ZEK::VFlowStateRef& i_rState )
  {
    State = i_rState;
    MarkDirty();
    ProcessPending();
  }
  Flow2Graphics::VFlowRenderFloorGrid& Floor()
  {
    return dynamic_cast< Flow2Graphics::VFlowRenderFloorGrid& >( *FlowRenderTypes().at( 0 ) );
  }
  Flow2Graphics::VFlowRenderReconstructions& Reconstructions()
  {
    return dynamic_cast< Flow2Graphics::VFlowRenderReconstructions& >( *FlowRenderTypes().at( 2 ) );
  }
  Flow2Graphics::VFlowRenderForcePlates& Plates()
  {
    return dynamic_cast< Flow2Graphics::VFlowRenderForcePlates& >( *FlowRenderTypes().at( 1 ) );
  }
  Flow2Graphics::VFlowRenderReconstructionVolume& Volume()
  {
    return dynamic_cast< Flow2Graphics::VFlowRenderReconstructionVolume& >( *FlowRenderTypes().at( 3 ) );
  }

  ZEK::VFlowStateRef State;
  int Fetches = 0;

protected:
  ZEK::VFlowStateRef FetchState() override
  {
    ++Fetches;
    return State;
  }
};

/// Makes states from values.
class VMaker
{
public:
  ZEK::VFlowStateRef State( std::int64_t i_Frame = 0 )
  {
    ZEK::VFlowStateRef State;
    (void)m_Factory->CreateState( State, { i_Frame, 1, 1 }, {}, {} );
    return State;
  }

  /// A device's item, named by its URN.
  template < typename TFlow >
  ZEK::VFlowItemRef Device( const typename ZEK::FlowValueType< TFlow >::type& i_rValue, const std::string& i_rURN )
  {
    const ZEK::VFlowItemRef Made = Item< TFlow >( i_rValue );
    Made->MutableValue().SetName( ZEK::EFlowNameDevice, i_rURN );
    return Made;
  }

  template < typename TFlow >
  ZEK::VFlowItemRef Item( const typename ZEK::FlowValueType< TFlow >::type& i_rValue, const std::string& i_rName = {} )
  {
    ZEK::IResult Status;
    ZEK::VFlowItemRef Item;
    m_Store->CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, Item );
    *ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( Item.Get() ) = i_rValue;
    if ( !i_rName.empty() )
    {
      Item->MutableValue().SetName( ZEK::EFlowNameObject, i_rName );
    }
    return Item;
  }

  ZEK::VFlowItemRef Points( std::size_t i_Count )
  {
    CoreMoxelTypes::VReconstructionSet Set;
    for ( std::size_t Index = 0; Index < i_Count; ++Index )
    {
      const double Place = static_cast< double >( Index );
      Set.Items.push_back( { static_cast< std::uint32_t >( Index + 1 ), { 100 * Place, 0, 10 * Place }, 0, 0, 2 } );
    }
    return Item< CoreMoxelTypes::FlowReconstructionSet >( Set );
  }

  ZEK::VFlowItemRef Subject( std::uint32_t i_Id, const std::string& i_rName,
                             const std::vector< std::string >& i_rMarkers )
  {
    CoreMoxelTypes::VSubject Subject;
    Subject.Id = i_Id;
    Subject.Name = i_rName;
    for ( const std::string& rMarker : i_rMarkers )
    {
      Subject.Markers.emplace_back().Name = rMarker;
    }
    return Item< CoreMoxelTypes::FlowSubject >( Subject, i_rName );
  }

private:
  ZEK::VFlowStateFactoryRef m_Factory = HostFlow::MakeStateFactory();
  ZEK::VFlowStoreRef m_Store = HostFlow::MakeItemStore();
};

} // namespace FlowTest

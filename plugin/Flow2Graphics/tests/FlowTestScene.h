#pragma once

#include <CoreMoxelTypes/FlowTypes.h>
#include <Flow2Graphics/VFlowRenderFloorGrid.h>
#include <Flow2Graphics/VFlowRenderForcePlates.h>
#include <Flow2Graphics/VFlowRenderGeometry.h>
#include <Flow2Graphics/VFlowRenderReconstructionVolume.h>
#include <Flow2Graphics/VFlowRenderReconstructions.h>
#include <Flow2Graphics/VFlowRenderSubjects.h>
#include <Flow2Graphics/VFlowScene.h>
#include <HostFlow/VFlowFramework.h>

#include <TestScene.h> // of the room below

namespace FlowTest
{

class VScene : public Flow2Graphics::VFlowScene
{
public:
  explicit VScene( std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > i_pMeshCache = nullptr,
                   std::shared_ptr< ZEK::IPostalService > i_pPostal = nullptr )
    : VFlowScene( nullptr, std::make_shared< HostServices::VSelectionService >(), std::move( i_pMeshCache ),
                  std::move( i_pPostal ), false )
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
  void Select( ZEK::VSelection i_Items )
  {
    SelectionService()->Set( ZEK::ISelectionService::EPrimary, std::move( i_Items ) );
  }
  auto& Floor() { return Type< Flow2Graphics::VFlowRenderFloorGrid >(); }
  auto& Plates() { return Type< Flow2Graphics::VFlowRenderForcePlates >(); }
  auto& Reconstructions() { return Type< Flow2Graphics::VFlowRenderReconstructions >(); }
  auto& Volume() { return Type< Flow2Graphics::VFlowRenderReconstructionVolume >(); }
  auto& Geometry() { return Type< Flow2Graphics::VFlowRenderGeometry >(); }
  const MoxelGraphics::VSubjectGroup& Group( Flow2Graphics::EFlowSubjectGroup i_Group )
  {
    return Subjects()->Group( i_Group ).Group();
  }
  const std::vector< std::shared_ptr< MoxelGraphics::IRenderType > >& RenderList() const { return m_RenderList; }

  ZEK::VFlowStateRef State;
  int Fetches = 0;

protected:
  ZEK::VFlowStateRef FetchState() override
  {
    ++Fetches;
    return State;
  }

private:
  template < typename TType >
  TType& Type()
  {
    for ( const auto& rpType : FlowRenderTypes() )
    {
      if ( auto* const pType = dynamic_cast< TType* >( rpType.get() ) )
      {
        return *pType;
      }
    }
    throw std::logic_error( "The scene lacks a type" );
  }
};

/// A view of a scene in a context of its own.
class VFrame
{
public:
  explicit VFrame( std::shared_ptr< VScene > i_pScene, QSize i_Size = { 480, 270 } )
    : m_Size( i_Size )
    , m_Frame( std::move( i_pScene ), std::make_shared< CoreGraphics::VCameraController >() )
  {
  }
  MoxelGraphics::VSceneFrame& Frame() { return m_Frame; }
  QImage Draw()
  {
    const QImage Picture = m_Offscreen.Draw( m_Frame, m_Size );
    EXPECT_TRUE( m_Offscreen.bDrawn );
    return Picture;
  }
  /// The pixel that shows a place.
  QPoint Screen( const QVector3D& i_rPlace )
  {
    const CoreGraphics::VCameraFields& rCamera = m_Frame.Controller().Fields();
    const QVector3D Clip = ( rCamera.projection * rCamera.view ).map( i_rPlace );
    return QPointF( ( static_cast< qreal >( Clip.x() ) + 1 ) * m_Size.width() / 2,
                    ( 1 - static_cast< qreal >( Clip.y() ) ) * m_Size.height() / 2 )
        .toPoint();
  }

private:
  QSize m_Size;
  MoxelGraphics::VOffscreen m_Offscreen;
  MoxelGraphics::VSceneFrame m_Frame;
};

/// Makes states from values.
class VMaker
{
public:
  ZEK::VFlowStateRef State( std::int64_t i_Frame = 0, const std::vector< ZEK::VFlowItemRef >& i_rItems = {} )
  {
    ZEK::VFlowStateRef State;
    (void)m_Factory->CreateState( State, { i_Frame, 1, 1 }, {}, {} );
    for ( const ZEK::VFlowItemRef& rItem : i_rItems )
    {
      State->AddItem( rItem );
    }
    return State;
  }

  template < typename TFlow >
  ZEK::VFlowItemRef Item( const typename ZEK::FlowValueType< TFlow >::type& i_rValue, const std::string& i_rName = {},
                          ZEK::EFlowName i_Selector = ZEK::EFlowNameObject )
  {
    ZEK::IResult Status;
    ZEK::VFlowItemRef Item;
    m_Store->CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, Item );
    *ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( Item.Get() ) = i_rValue;
    if ( !i_rName.empty() )
    {
      Item->MutableValue().SetName( i_Selector, i_rName );
    }
    return Item;
  }

  /// A device's item, named by its URN.
  template < typename TFlow >
  ZEK::VFlowItemRef Device( const typename ZEK::FlowValueType< TFlow >::type& i_rValue, const std::string& i_rURN )
  {
    return Item< TFlow >( i_rValue, i_rURN, ZEK::EFlowNameDevice );
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

#include <Flow2Graphics/VFlowScene.h>

#include "StateUpAxis.h"

#include <Flow2Graphics/VContributions.h>
#include <Flow2Graphics/VFlowContributions.h>
#include <Flow2Graphics/VFlowRenderCameras.h>
#include <Flow2Graphics/VFlowRenderCentroidAssignments.h>
#include <Flow2Graphics/VFlowRenderFloorGrid.h>
#include <Flow2Graphics/VFlowRenderForcePlates.h>
#include <Flow2Graphics/VFlowRenderReconstructionVolume.h>
#include <Flow2Graphics/VFlowRenderReconstructions.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <MoxelGraphics/VRenderAxis.h>
#include <MoxelGraphics/VRenderCameraBackdrop.h>
#include <MoxelGraphics/VRenderCameraData2D.h>
#include <MoxelGraphics/VRenderCameraData3D.h>
#include <MoxelGraphics/VRenderOutlines.h>

namespace Flow2Graphics
{
VFlowScene::VFlowScene( std::shared_ptr< HarrowPluginInterface::IRenderResources > i_pRenderResources,
                        std::shared_ptr< ZEK::ISelectionService > i_pSelectionService,
                        std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > i_pMeshCache,
                        std::shared_ptr< ZEK::IPostalService > i_pPostalService, bool i_bDeveloperMode )
  : VMoxelScene( std::move( i_pRenderResources ), std::move( i_pSelectionService ), std::move( i_pMeshCache ),
                 i_pPostalService, i_bDeveloperMode )
  , m_pContributions( std::make_shared< VContributions >( i_pPostalService ) )
{
  m_pContributions->SetOnWatched(
      [this]
      {
        MarkDirty(); // the frame that is shown is looked at again
      } );
}

VFlowScene::~VFlowScene()
{
  // Documents may let go of the list after the scene.
  m_pContributions->SetOnWatched( {} );
}

QObject* VFlowScene::ContributionsObject() const
{
  return m_pContributions.get();
}

QVariantMap VFlowScene::SceneReport()
{
  if ( !m_bReported )
  {
    m_bReported = true;
    m_pContributions->watchRows();
  }
  m_pContributions->Flush();
  return { { "contributions", m_pContributions->Rows() } };
}

void VFlowScene::Initialise( CoreGraphics::VRenderContext& io_rContext )
{
  VMoxelScene::Initialise( io_rContext );
  CreateRenderTypes();
}

void VFlowScene::CreateRenderTypes()
{
  if ( !m_RenderList.empty() )
  {
    return;
  }
  // The order of the lines is the order of drawing and of updating: the floor lies under everything that follows, and
  // the gizmo is drawn over it.
  const auto pFloor = std::make_shared< VFlowRenderFloorGrid >( Resources() );
  const auto pPlates = std::make_shared< VFlowRenderForcePlates >( *this );
  const auto pReconstructions = std::make_shared< VFlowRenderReconstructions >( *this );
  m_pCameraProvider = std::make_shared< VFlowRenderCameraProvider >( *this );
  const auto pAssignments = std::make_shared< VFlowRenderCentroidAssignments >( *this, m_pCameraProvider );
  const auto pBackdrop = std::make_shared< MoxelGraphics::VRenderCameraBackdrop >( *this, m_pCameraProvider );
  m_pCameras = std::make_shared< VFlowRenderCameras >( *this, m_pCameraProvider );
  const auto pData2D = std::make_shared< MoxelGraphics::VRenderCameraData2D >( *this, m_pCameraProvider );
  const auto pData3D = std::make_shared< MoxelGraphics::VRenderCameraData3D >( *this, m_pCameraProvider );
  const auto pVolume = std::make_shared< VFlowRenderReconstructionVolume >( Resources() );
  const auto pAxis = std::make_shared< MoxelGraphics::VRenderAxis >( Resources() );

  m_PostList = { std::make_shared< MoxelGraphics::VRenderOutlines >( *this ) };
  m_pBackdrop = pBackdrop;
  m_RenderList = { pFloor,     pPlates, pReconstructions, pAssignments, pBackdrop,
                   m_pCameras, pData2D, pData3D,          pVolume,      pAxis };
  m_FlowRenderTypes = { pFloor,
                        pPlates,
                        pReconstructions,
                        pVolume,
                        m_pCameraProvider,
                        pAssignments,
                        m_pCameras,
                        std::make_shared< VFlowContributions >( *this, m_pCameraProvider, m_pContributions ) };
}

bool VFlowScene::ProcessPending()
{
  const bool bRan = VMoxelScene::ProcessPending();
  if ( !TakeDirty() )
  {
    return bRan;
  }
  const ZEK::VFlowStateRef State = FetchState();
  if ( State && State->ItemCount() != 0 )
  {
    UpdateFromState( *State, {} );
  }
  else
  {
    // Nothing to show yet: the last picture stays, and the next frame asks again.
    MarkDirty();
  }
  return bRan;
}

void VFlowScene::UpdateFromState( const ZEK::IFlowState& i_rState, const VSubjectChanges& i_rChanges )
{
  ClearLabels();
  Registry().Reset();
  for ( const std::shared_ptr< IFlowRenderType >& rpType : m_FlowRenderTypes )
  {
    rpType->UpdateFromState( i_rState, i_rChanges );
  }
  SetYUp( IsYUp( i_rState, YUp() ) );
  emit Updated();
}

std::vector< MoxelGraphics::VScenePoint > VFlowScene::GetSelectionPositions( const ZEK::VSelection& i_rSelection )
{
  std::vector< MoxelGraphics::VScenePoint > Points;
  for ( const ZEK::VSelectionItem& rItem : i_rSelection )
  {
    MoxelGraphics::VScenePoint Point;
    if ( Registry().GetPosition( rItem, Point ) )
    {
      Points.push_back( Point );
    }
  }
  return Points;
}

bool VFlowScene::GetSelectionPose( const ZEK::VSelection& i_rSelection, MoxelGraphics::VScenePose& o_rPose )
{
  return i_rSelection.size() == 1 && Registry().GetPose( i_rSelection.front(), o_rPose );
}

ZEK::VSelection VFlowScene::ResolveIds( std::span< const std::uint32_t > i_Ids, std::vector< std::string >& o_rLabels )
{
  return Registry().ResolveAll( i_Ids, o_rLabels );
}

std::vector< std::uint32_t > VFlowScene::SelectionItemsToIds( const ZEK::VSelection& i_rSelection )
{
  std::vector< std::uint32_t > Ids;
  for ( const ZEK::VSelectionItem& rItem : i_rSelection )
  {
    if ( const std::uint32_t Id = Registry().FindId( rItem ) )
    {
      Ids.push_back( Id );
    }
  }
  return Ids;
}

QString VFlowScene::GetSelectedCameraURN()
{
  ZEK::VSelection Cameras;
  const auto& rpService = SelectionService();
  if ( !rpService || !rpService->Get( ZEK::ISelectionService::EPrimary, { ZEK::ESelectDevice }, Cameras ) ||
       Cameras.size() != 1 )
  {
    return {};
  }
  return QString::fromStdString( rpService->Text( Cameras.front() ) );
}

void VFlowScene::SelectDevice( const QString& i_rName, bool i_bPreselect )
{
  const auto& rpService = SelectionService();
  if ( !rpService )
  {
    return;
  }
  const ZEK::VSelectionItem Item = rpService->FromName( i_rName.toStdString() );
  rpService->Set( i_bPreselect ? ZEK::ISelectionService::ESecondary : ZEK::ISelectionService::EPrimary,
                  Item.Kind != ZEK::ESelectNone ? ZEK::VSelection{ Item } : ZEK::VSelection{} );
}

} // namespace Flow2Graphics

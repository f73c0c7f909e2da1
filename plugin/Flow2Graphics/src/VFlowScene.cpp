#include <Flow2Graphics/VFlowScene.h>

#include "StateUpAxis.h"
#include "SubjectReport.h"

#include <Flow2Graphics/VContributions.h>
#include <Flow2Graphics/VFlowContributions.h>
#include <Flow2Graphics/VFlowRenderCameras.h>
#include <Flow2Graphics/VFlowRenderCentroidAssignments.h>
#include <Flow2Graphics/VFlowRenderFloorGrid.h>
#include <Flow2Graphics/VFlowRenderForcePlates.h>
#include <Flow2Graphics/VFlowRenderGeometry.h>
#include <Flow2Graphics/VFlowRenderMarkerTrails.h>
#include <Flow2Graphics/VFlowRenderReconstructionVolume.h>
#include <Flow2Graphics/VFlowRenderReconstructions.h>
#include <Flow2Graphics/VFlowRenderSubjects.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <MoxelGraphics/VRenderAxis.h>
#include <MoxelGraphics/VRenderCameraBackdrop.h>
#include <MoxelGraphics/VRenderCameraData2D.h>
#include <MoxelGraphics/VRenderCameraData3D.h>
#include <MoxelGraphics/VRenderMarkerHalo.h>
#include <MoxelGraphics/VRenderOutlines.h>
#include <MoxelGraphics/VRenderSubjectLabels.h>

#include <QtCore/QPointer>

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
        MarkStale(); // the frame that is shown is looked at again
      } );
  ConnectMeshCache();
}

void VFlowScene::ConnectMeshCache()
{
  if ( MeshCache() )
  {
    m_MeshCacheChanged = MeshCache()->Changed().Connect(
        [pSelf = QPointer( this )]
        {
          if ( !pSelf )
          {
            return;
          }
          if ( const auto pSubjects = pSelf->Subjects() )
          {
            pSubjects->MarkDirty();
          }
          pSelf->MarkStale();
        },
        PostalService() );
  }
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
  const auto pSubjects = Subjects();
  return { { "contributions", m_pContributions->Rows() },
           { "subjects", pSubjects ? ReportSubjects( *pSubjects ) : QVariantMap() } };
}

std::shared_ptr< VFlowRenderSubjects > VFlowScene::Subjects() const
{
  const std::lock_guard Lock( m_SubjectsGuard );
  return m_pSubjects;
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
  const auto pSubjects = std::make_shared< VFlowRenderSubjects >( *this );
  const auto pReconstructions = std::make_shared< VFlowRenderReconstructions >( *this, pSubjects );
  m_pCameraProvider = std::make_shared< VFlowRenderCameraProvider >( *this );
  const auto pAssignments = std::make_shared< VFlowRenderCentroidAssignments >( *this, m_pCameraProvider );
  const auto pBackdrop = std::make_shared< MoxelGraphics::VRenderCameraBackdrop >( *this, m_pCameraProvider );
  m_pCameras = std::make_shared< VFlowRenderCameras >( *this, m_pCameraProvider );
  const auto pData2D = std::make_shared< MoxelGraphics::VRenderCameraData2D >( *this, m_pCameraProvider );
  const auto pData3D = std::make_shared< MoxelGraphics::VRenderCameraData3D >( *this, m_pCameraProvider );
  const auto pGeometry = std::make_shared< VFlowRenderGeometry >( *this );
  const auto pVolume = std::make_shared< VFlowRenderReconstructionVolume >( Resources() );
  const auto pTrails = std::make_shared< VFlowRenderMarkerTrails >( *this );
  const auto pHalo = std::make_shared< MoxelGraphics::VRenderMarkerHalo >( *this );
  const auto pLabels = std::make_shared< MoxelGraphics::VRenderSubjectLabels >( *this );
  const auto pAxis = std::make_shared< MoxelGraphics::VRenderAxis >( Resources() );
  const auto Lists = [&]( EFlowSubjectGroup i_Group )
  {
    return &pSubjects->Group( i_Group ).Group();
  };
  pTrails->SetGroups( { Lists( EGroupSubject ), Lists( EGroupProp ) } );
  pHalo->SetGroups(
      { Lists( EGroupRigidObject ), Lists( EGroupSubject ), Lists( EGroupProp ), Lists( EGroupSolving ) } );
  pLabels->SetGroups( { Lists( EGroupRigidObject ), Lists( EGroupSubject ), Lists( EGroupProp ), Lists( EGroupSolving ),
                        Lists( EGroupRetargeting ), Lists( EGroupSceneMesh ) } );

  m_PostList = { std::make_shared< MoxelGraphics::VRenderOutlines >( *this ) };
  m_pBackdrop = pBackdrop;
  m_RenderList = { pFloor, pPlates, pReconstructions };
  pSubjects->SetAssignments( pAssignments );
  for ( auto& rpType : pSubjects->RenderTypes() )
  {
    m_RenderList.push_back( std::move( rpType ) );
  }
  m_RenderList.insert( m_RenderList.end(), { pBackdrop, m_pCameras, pData2D, pData3D, pGeometry, pVolume, pTrails,
                                             pHalo, pLabels, pAxis } );
  m_FlowRenderTypes = { pFloor,
                        pPlates,
                        pReconstructions,
                        pSubjects,
                        m_pCameraProvider,
                        pAssignments,
                        m_pCameras,
                        pGeometry,
                        pVolume,
                        pTrails,
                        std::make_shared< VFlowContributions >( *this, m_pCameraProvider, m_pContributions ) };
  const std::lock_guard Lock( m_SubjectsGuard );
  m_pSubjects = pSubjects;
}

void VFlowScene::MarkStale()
{
  m_bStale.store( true, std::memory_order_release );
  MarkDirty();
}

/// An update with the state and the selection that the types hold would find nothing to do.
void VFlowScene::UpdateUnlessTaken( const ZEK::VFlowStateRef& i_rState )
{
  // Read first: what changes from here on is seen as new next time.
  const bool bStale = m_bStale.exchange( false, std::memory_order_acq_rel );
  const std::uint64_t Selection = SelectionService() ? SelectionService()->Generation() : 0;
  if ( bStale || i_rState != m_TakenState || Selection != m_TakenSelection )
  {
    UpdateFromState( *i_rState, {} );
    m_TakenState = i_rState;
    m_TakenSelection = Selection;
  }
}

bool VFlowScene::ProcessPending()
{
  const bool bRan = VMoxelScene::ProcessPending();
  if ( !TakeDirty() )
  {
    return bRan;
  }
  ++m_Looks;
  const ZEK::VFlowStateRef State = FetchState();
  if ( State && State->ItemCount() != 0 )
  {
    UpdateUnlessTaken( State );
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
  m_TakenState = {};
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

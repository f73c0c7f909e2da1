#include <Flow2Graphics/VFlowContributions.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <algorithm>
#include <cmath>
#include <utility>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;

constexpr std::size_t MostRows = 500;

bool Take( ZEK::VFlowItemRef& io_rHeld, const ZEK::IFlowState& i_rState, std::uint32_t i_Tag )
{
  ZEK::VFlowItemRef New;
  i_rState.FindItem( New, i_Tag, ZEK::EFlowTimeMatch::Overlap );
  const bool bOther = IsOtherValue( io_rHeld, New );
  io_rHeld = std::move( New );
  return bOther;
}

bool Take( ZEK::VFlowItemRef& io_rHeld, const ZEK::IFlowItem* i_pNew )
{
  if ( io_rHeld.Get() == i_pNew )
  {
    return false;
  }
  io_rHeld = ZEK::VFlowItemRef( const_cast< ZEK::IFlowItem* >( i_pNew ) );
  return true;
}

/// The greatest error first, then what was not measured; by camera and reconstruction where they are alike.
bool GoesBefore( const VContribution& i_rA, const VContribution& i_rB )
{
  const bool bA = !std::isnan( i_rA.Error ), bB = !std::isnan( i_rB.Error );
  if ( bA != bB || ( bA && i_rA.Error != i_rB.Error ) )
  {
    return bA != bB ? bA : i_rA.Error > i_rB.Error;
  }
  return std::pair( i_rA.Camera, i_rA.Centroid ) < std::pair( i_rB.Camera, i_rB.Centroid );
}
} // namespace

VFlowContributions::VFlowContributions( MoxelGraphics::VMoxelScene& i_rScene,
                                        std::shared_ptr< const VFlowRenderCameraProvider > i_pProvider,
                                        std::shared_ptr< VContributions > i_pTo )
  : m_rScene( i_rScene )
  , m_pProvider( std::move( i_pProvider ) )
  , m_pTo( std::move( i_pTo ) )
{
}

void VFlowContributions::Update( const ZEK::IFlowState& i_rState )
{
  const bool bWatched = m_pTo->IsWatched();
  bool bChanged = std::exchange( m_bWatched, bWatched ) != bWatched;
  const bool bRows = m_pTo->AreRowsWatched();
  bChanged = std::exchange( m_bRowsWatched, bRows ) != bRows || bChanged;
  if ( !bWatched )
  {
    return;
  }
  const std::uint64_t Generation = m_rScene.Registry().MarksGeneration();
  bChanged = std::exchange( m_MarksGeneration, Generation ) != Generation || bChanged;
  bChanged = Take( m_Set, i_rState, ZEK::FlowTag< FlowReconstructionSet > ) || bChanged;
  bChanged = Take( m_Labels, i_rState, ZEK::FlowTag< FlowReconstructionLabelSet > ) || bChanged;
  bChanged = TakeCameras() || bChanged;
  if ( !bChanged )
  {
    return;
  }
  FindSelected();
  FindContributors();
  FillSeenBy();
  FillRows();
  m_pTo->Offer( m_Report );
}

bool VFlowContributions::TakeCameras()
{
  const auto& rCameras = m_pProvider->FlowCameras();
  bool bChanged = m_Taken.size() != rCameras.size();
  m_Taken.resize( rCameras.size() );
  for ( std::size_t Index = 0; Index < rCameras.size(); ++Index )
  {
    const VFlowRenderCamera& rCamera = *rCameras[Index];
    VTaken& rTaken = m_Taken[Index];
    const bool bOther = std::exchange( rTaken.pCamera, &rCamera ) != &rCamera;
    const bool bSeen = Take( rTaken.Centroids, rCamera.GetItem( ECameraCentroids ) ) |
                       Take( rTaken.Assignments, rCamera.GetItem( ECameraCentroidAssignments ) );
    const bool bModel = Take( rTaken.Hardware, rCamera.GetItem( ECameraHardware ) ) |
                        Take( rTaken.Calibration, rCamera.GetItem( ECameraCalibration ) );
    if ( bOther || bModel )
    {
      const auto* const pHardware = ZEK::FlowPayload< VCameraHardware >( rTaken.Hardware.Get() );
      const auto* const pCalibration = ZEK::FlowPayload< VCameraCalibration >( rTaken.Calibration.Get() );
      rTaken.Projection =
          pHardware && pCalibration ? VSensorProjection( *pHardware, *pCalibration ) : VSensorProjection();
    }
    bChanged = bChanged || bOther || bSeen || bModel;
  }
  return bChanged;
}

/// Cameras count only while nothing that cameras see is selected.
void VFlowContributions::FindSelected()
{
  m_Reconstructions.clear();
  m_Cameras.clear();
  m_Report.Missing.clear();
  const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() );
  const auto* const pLabels = ZEK::FlowPayload< VReconstructionLabelSet >( m_Labels.Get() );
  const auto& rCameras = m_pProvider->FlowCameras();
  std::size_t Points = 0, Devices = 0, MissingPoints = 0;
  for ( const MoxelGraphics::VSelectionRegistry::VMark& rMark : m_rScene.Registry().Marks() )
  {
    const ZEK::VSelectionItem& rItem = rMark.Item;
    if ( ( rMark.Flags & MoxelGraphics::EIdSelected ) == 0 )
    {
      continue;
    }
    if ( rItem.Kind == ZEK::ESelectReconstruction || rItem.Kind == ZEK::ESelectMarker )
    {
      ++Points;
      const std::size_t Before = m_Reconstructions.size();
      if ( rItem.Kind == ZEK::ESelectReconstruction && pSet && rItem.Sub < pSet->Items.size() )
      {
        m_Reconstructions.push_back( rItem.Sub );
      }
      for ( std::size_t Label = 0; rItem.Kind == ZEK::ESelectMarker && pLabels && Label < pLabels->Labels.size();
            ++Label )
      {
        const VReconstructionLabelSet::L& rLabel = pLabels->Labels[Label];
        if ( rLabel.SubjectId == rItem.Object && rLabel.MarkerId == rItem.Sub && pSet &&
             rLabel.Reconstruction < pSet->Items.size() )
        {
          m_Reconstructions.push_back( rLabel.Reconstruction );
        }
      }
      MissingPoints += m_Reconstructions.size() == Before;
    }
    else if ( rItem.Kind == ZEK::ESelectDevice )
    {
      const auto It = std::find_if( rCameras.begin(), rCameras.end(),
                                    [&]( const auto& i_rpCamera )
                                    {
                                      return i_rpCamera->GetName() == rItem.Device;
                                    } );
      if ( It != rCameras.end() )
      {
        ++Devices;
        m_Cameras.push_back( static_cast< std::uint32_t >( It - rCameras.begin() ) );
      }
      else
      {
        m_Report.Missing.push_back( std::string( "There is no camera \"" ).append( rItem.Device ).append( "\"" ) );
      }
    }
  }
  std::sort( m_Reconstructions.begin(), m_Reconstructions.end() );
  m_Reconstructions.erase( std::unique( m_Reconstructions.begin(), m_Reconstructions.end() ), m_Reconstructions.end() );
  m_Report.bOfCameras = Points == 0 && Devices > 0;
  m_Report.Selected = Points > 0 ? Points : Devices;
  m_Report.Cameras = rCameras.size();
  if ( Points > 0 )
  {
    m_Report.Missing.clear();
    m_Cameras.clear();
  }
  if ( MissingPoints > 0 )
  {
    m_Report.Missing.push_back( MissingPoints == 1
                                    ? std::string( "One point is not in this frame" )
                                    : std::to_string( MissingPoints ) + " points are not in this frame" );
  }
}

void VFlowContributions::FindContributors()
{
  m_Found.clear();
  m_Contributors.clear();
  for ( const VTaken& rTaken : m_Taken )
  {
    m_Contributors.push_back( { &rTaken.Projection, ZEK::FlowPayload< VCentroidSet >( rTaken.Centroids.Get() ),
                                ZEK::FlowPayload< VCentroidAssignmentSet >( rTaken.Assignments.Get() ) } );
  }
  if ( const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() ) )
  {
    for ( const std::uint32_t Index : m_Reconstructions )
    {
      FindContributions( m_Contributors, *pSet, Index, m_Found );
    }
    for ( const std::uint32_t Camera : m_Cameras )
    {
      FindCameraContributions( m_Contributors, *pSet, Camera, m_Found );
    }
  }
  m_Report.Total = m_Found.size();
}

/// Of all that was found, however long the list is. Texts keep their memory from frame to frame.
void VFlowContributions::FillSeenBy()
{
  m_Worst.assign( m_Taken.size(), { false, std::nan( "" ) } );
  std::size_t Count = 0;
  for ( const VContribution& rFound : m_Found )
  {
    auto& [rbSees, rError] = m_Worst[rFound.Camera];
    Count += !m_Report.bOfCameras && !std::exchange( rbSees, true );
    rError = std::fmax( rError, rFound.Error ); // passes over what is no number
  }
  m_Report.SeenBy.resize( Count );
  for ( std::size_t Camera = 0, To = 0; To < Count; ++Camera )
  {
    if ( m_Worst[Camera].first )
    {
      m_Report.SeenBy[To].Camera = m_Taken[Camera].pCamera->GetName();
      m_Report.SeenBy[To++].Error = m_Worst[Camera].second;
    }
  }
}

void VFlowContributions::FillRows()
{
  m_Report.Rows.clear();
  const auto* const pSet = ZEK::FlowPayload< VReconstructionSet >( m_Set.Get() );
  const std::size_t Count = m_bRowsWatched && pSet ? std::min( m_Found.size(), MostRows ) : 0;
  std::partial_sort( m_Found.begin(), m_Found.begin() + static_cast< std::ptrdiff_t >( Count ), m_Found.end(),
                     GoesBefore );
  for ( std::size_t Index = 0; Index < Count; ++Index )
  {
    const VContribution& rFound = m_Found[Index];
    m_Report.Rows.push_back( { m_Taken[rFound.Camera].pCamera->GetName(), LabelOf( rFound.Reconstruction ),
                               rFound.Reconstruction, pSet->Items[rFound.Reconstruction].Id, rFound.State,
                               rFound.Error } );
  }
}

std::string VFlowContributions::LabelOf( std::uint32_t i_Reconstruction ) const
{
  ZEK::VSelectionItem Item{ ZEK::ESelectReconstruction, {}, 0, i_Reconstruction };
  if ( const auto* const pLabels = ZEK::FlowPayload< VReconstructionLabelSet >( m_Labels.Get() ) )
  {
    for ( const VReconstructionLabelSet::L& rLabel : pLabels->Labels )
    {
      if ( rLabel.Reconstruction == i_Reconstruction )
      {
        Item = { ZEK::ESelectMarker, {}, rLabel.SubjectId, rLabel.MarkerId };
        break;
      }
    }
  }
  std::string Label;
  ZEK::VSelectionItem Found;
  const auto& rRegistry = *m_rScene.RegistryPtr();
  const std::uint32_t Id = rRegistry.FindId( Item );
  return Id != 0 && rRegistry.Resolve( Id, Found, Label ) ? Label : std::string();
}

} // namespace Flow2Graphics

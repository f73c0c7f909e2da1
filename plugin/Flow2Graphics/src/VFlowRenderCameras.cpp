#include <Flow2Graphics/VFlowRenderCameras.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <algorithm>
#include <cmath>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;
using MoxelGraphics::VCameraPictures;

constexpr unsigned FlagShift = 21;
/// A view that is fitted to a camera shows its frustum too.
constexpr float PointRadius = 300; // mm

/// Takes another item than the held one; true when it did.
bool Take( ZEK::VFlowItemRef& io_rHeld, const ZEK::IFlowItem* i_pItem )
{
  if ( io_rHeld.Get() == i_pItem )
  {
    return false;
  }
  io_rHeld = ZEK::VFlowItemRef( const_cast< ZEK::IFlowItem* >( i_pItem ) );
  return true;
}

std::uint32_t CellsOf( const VFlowRenderCamera& i_rCamera )
{
  const auto* const pMask = i_rCamera.Value< VCameraMaskGrid >( ECameraMaskGrid );
  return pMask ? MoxelGraphics::CellCount( *pMask ) : 0;
}

bool IsSelected( const VCameraMarks& i_rMarks )
{
  return ( i_rMarks.Device & MoxelGraphics::EIdSelected ) != 0;
}

bool HasSelectedCells( const VCameraMarks& i_rMarks )
{
  return std::any_of( i_rMarks.MaskCells.begin(), i_rMarks.MaskCells.end(),
                      []( const VCameraMarks::VMember& i_rCell )
                      {
                        return ( i_rCell.Flags & MoxelGraphics::EIdSelected ) != 0;
                      } );
}
} // namespace

bool VCameraBodyMembers::ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem,
                                       std::string& o_rLabel ) const
{
  if ( i_Index >= Cameras.size() )
  {
    return false;
  }
  const ZEK::IRenderCamera& rCamera = *Cameras[i_Index];
  o_rItem = { ZEK::ESelectDevice, rCamera.GetName(), 0, 0 };
  o_rLabel = rCamera.GetDisplayName().empty() ? rCamera.GetName() : rCamera.GetDisplayName();
  return true;
}

bool VCameraBodyMembers::FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const
{
  if ( i_rItem.Kind != ZEK::ESelectDevice )
  {
    return false;
  }
  const auto It = std::lower_bound( Cameras.begin(), Cameras.end(), i_rItem.Device,
                                    []( const ZEK::VRenderCameraRef& i_rpCamera, const std::string& i_rName )
                                    {
                                      return i_rpCamera->GetName() < i_rName;
                                    } );
  o_rIndex = static_cast< std::uint32_t >( It - Cameras.begin() );
  return It != Cameras.end() && ( *It )->GetName() == i_rItem.Device;
}

bool VCameraBodyMembers::GetPoint( std::uint32_t i_Index, MoxelGraphics::VScenePoint& o_rPoint ) const
{
  if ( i_Index >= Cameras.size() )
  {
    return false;
  }
  const std::array< float, 3 >& rPlace = Cameras[i_Index]->GetInfo().Position;
  o_rPoint = { rPlace[0], rPlace[1], rPlace[2], PointRadius };
  return true;
}

bool VCameraBodyMembers::GetPose( std::uint32_t i_Index, MoxelGraphics::VScenePose& o_rPose ) const
{
  if ( i_Index >= Cameras.size() )
  {
    return false;
  }
  o_rPose.Matrix = Cameras[i_Index]->GetModel().WorldFromCamera;
  o_rPose.Index = Cameras[i_Index]->GetInfo().UserId;
  return true;
}

VFlowRenderCameras::VFlowRenderCameras( MoxelGraphics::VMoxelScene& i_rScene,
                                        std::shared_ptr< const VFlowRenderCameraProvider > i_pProvider )
  : VRenderCameras( i_rScene, i_pProvider )
  , m_pCameras( std::move( i_pProvider ) )
  , m_Cells( ZEK::ESelectMaskCell, ": mask cell " )
{
}

void VFlowRenderCameras::Update( const ZEK::IFlowState& i_rState )
{
  const bool bCameras =
      std::exchange( m_CamerasGeneration, m_pCameras->GetGeneration() ) != m_pCameras->GetGeneration();
  if ( bCameras && TakeCameras() )
  {
    m_Members.Cameras.assign( Bodies().begin(), Bodies().end() );
  }
  GiveBodyIds();
  m_Seen = {};
  if ( bCameras )
  {
    TakePictures();
  }
  SettleWand( i_rState.GetKey() );
  const double Frame = m_NewestWand + m_WandAge;
  if ( GiveCellIds() || bCameras )
  {
    SetPictures( m_Pictures, Frame );
  }
  else
  {
    SetPicturesFrame( Frame );
  }
}

void VFlowRenderCameras::GiveBodyIds()
{
  MoxelGraphics::VSelectionRegistry& rRegistry = m_rScene.Registry();
  const auto Count = static_cast< std::uint32_t >( m_Members.Cameras.size() );
  const std::uint32_t First = Count != 0 ? rRegistry.AllocateRange( Count, m_Members ) : 0;
  m_Flags.clear();
  for ( const MoxelGraphics::VSelectionRegistry::VMark& rMark : rRegistry.Marks() )
  {
    std::uint32_t Index = 0;
    if ( m_Members.FindIndex( rMark.Item, Index ) )
    {
      m_Flags.resize( Count, 0 );
      m_Flags[Index] = static_cast< std::uint8_t >( rMark.Flags >> FlagShift );
    }
  }
  SetIds( First, m_Flags );
}

void VFlowRenderCameras::TakePictures()
{
  const auto& rCameras = m_pCameras->FlowCameras();
  const std::uint64_t Generation = m_rScene.Registry().MarksGeneration();
  const bool bMarks = std::exchange( m_MarksGeneration, Generation ) != Generation;
  m_Kept.resize( rCameras.size() );
  m_Pictures.resize( rCameras.size() );
  for ( std::size_t Index = 0; Index < rCameras.size(); ++Index )
  {
    const VFlowRenderCamera& rCamera = *rCameras[Index];
    VKept& rKept = m_Kept[Index];
    VCameraPictures& rPictures = m_Pictures[Index];
    const bool bOther = rKept.pCamera != rCameras[Index];
    if ( bOther )
    {
      rKept = {};
      rKept.pCamera = rCameras[Index];
      rPictures = {};
    }
    if ( Take( rKept.Mask, rCamera.GetItem( ECameraMaskGrid ) ) )
    {
      rPictures.pMask = rCamera.Value< VCameraMaskGrid >( ECameraMaskGrid );
      rPictures.MaskGeneration = rPictures.pMask ? ++m_Generation : 0;
    }
    if ( Take( rKept.Edges, rCamera.GetItem( ECameraEdgePairs ) ) )
    {
      rPictures.pEdges = rCamera.Value< VEdgePairSet >( ECameraEdgePairs );
      rPictures.EdgesGeneration = rPictures.pEdges ? ++m_Generation : 0;
    }
    if ( Take( rKept.WandItem, rCamera.GetItem( ECameraWand ) ) )
    {
      TakeWand( rKept, rPictures );
    }
    if ( bOther || bMarks )
    {
      TakeMarkedCells( rKept, rPictures );
    }
  }
}

void VFlowRenderCameras::TakeMarkedCells( VKept& io_rKept, VCameraPictures& io_rPictures )
{
  io_rKept.MarkedCells.clear();
  for ( const VCameraMarks::VMember& rCell : io_rKept.pCamera->GetMarks().MaskCells )
  {
    io_rKept.MarkedCells.push_back( { rCell.Sub, rCell.Flags } );
  }
  io_rPictures.MarkedCells = io_rKept.MarkedCells;
}

void VFlowRenderCameras::TakeWand( VKept& io_rKept, VCameraPictures& io_rPictures )
{
  const auto* const pWand = io_rKept.pCamera->Value< VCameraWand2d >( ECameraWand );
  if ( !pWand || pWand->Points.empty() )
  {
    return; // what it left fades where it is
  }
  std::vector< MoxelGraphics::VWandPoint >& rPoints = io_rKept.Wand;
  const auto Newest = static_cast< float >( std::max_element( pWand->Points.begin(), pWand->Points.end(),
                                                              []( const auto& i_rA, const auto& i_rB )
                                                              {
                                                                return i_rA.Frame < i_rB.Frame;
                                                              } )
                                                ->Frame );
  // Time went back, or the source began anew.
  if ( !rPoints.empty() && Newest < rPoints.back().Frame )
  {
    rPoints.clear();
    m_Seen.bBack = true;
  }
  m_Seen.bAny = m_Seen.bAny || rPoints.empty() || Newest > rPoints.back().Frame;
  m_Seen.Newest = std::max( m_Seen.Newest, static_cast< double >( Newest ) );
  const float Known = rPoints.empty() ? -std::numeric_limits< float >::infinity() : rPoints.back().Frame;
  for ( const VCameraWand2d::P& rPoint : pWand->Points )
  {
    const auto Frame = static_cast< float >( rPoint.Frame );
    if ( Frame > Known && Frame > Newest - WandFrames && std::isfinite( rPoint.x ) && std::isfinite( rPoint.y ) )
    {
      rPoints.push_back( { rPoint.x, rPoint.y, Frame } );
    }
  }
  std::stable_sort( rPoints.begin(), rPoints.end(),
                    []( const MoxelGraphics::VWandPoint& i_rA, const MoxelGraphics::VWandPoint& i_rB )
                    {
                      return i_rA.Frame < i_rB.Frame;
                    } );
  auto Keep = std::find_if( rPoints.begin(), rPoints.end(),
                            [&]( const MoxelGraphics::VWandPoint& i_rPoint )
                            {
                              return i_rPoint.Frame > Newest - WandFrames;
                            } );
  Keep = std::max( Keep, rPoints.end() - static_cast< std::ptrdiff_t >( std::min( rPoints.size(), MostWandPoints ) ) );
  rPoints.erase( rPoints.begin(), Keep );
  io_rPictures.Wand = rPoints;
  io_rPictures.WandGeneration = ++m_Generation;
}

void VFlowRenderCameras::SettleWand( const ZEK::VFlowTimeKey& i_rKey )
{
  if ( !m_Seen.bAny )
  {
    // The wand is gone, and what it left grows old with the states.
    const std::int64_t Frames = ( i_rKey.Frame - m_WandState ) / std::max< std::int64_t >( i_rKey.Span, 1 );
    m_WandAge = static_cast< double >( std::max< std::int64_t >( Frames, 0 ) );
    return;
  }
  m_WandState = i_rKey.Frame;
  m_WandAge = 0;
  const bool bAnew = m_Seen.bBack || m_NewestWand > m_Seen.Newest + static_cast< double >( WandFrames );
  m_NewestWand = bAnew ? m_Seen.Newest : std::max( m_NewestWand, m_Seen.Newest );
  for ( std::size_t Index = 0; m_Seen.bBack && Index < m_Kept.size(); ++Index )
  {
    // A camera that does not see the wand now would show for ever what is yet to come.
    std::vector< MoxelGraphics::VWandPoint >& rPoints = m_Kept[Index].Wand;
    if ( !rPoints.empty() && static_cast< double >( rPoints.back().Frame ) > m_NewestWand )
    {
      rPoints.clear();
      m_Pictures[Index].Wand = {};
      m_Pictures[Index].WandGeneration = ++m_Generation;
    }
  }
}

std::shared_ptr< VFlowRenderCamera > VFlowRenderCameras::EditedCamera() const
{
  std::shared_ptr< VFlowRenderCamera > pSelected, pWithCells;
  std::size_t Selected = 0, WithCells = 0;
  if ( m_rScene.Registry().Marks().empty() )
  {
    return nullptr;
  }
  for ( const std::shared_ptr< VFlowRenderCamera >& rpCamera : m_pCameras->FlowCameras() )
  {
    const VCameraMarks& rMarks = rpCamera->GetMarks();
    if ( IsSelected( rMarks ) )
    {
      ++Selected;
      pSelected = rpCamera;
    }
    if ( HasSelectedCells( rMarks ) )
    {
      ++WithCells;
      pWithCells = rpCamera;
    }
  }
  if ( Selected != 0 )
  {
    return Selected == 1 ? pSelected : nullptr;
  }
  return WithCells == 1 ? pWithCells : nullptr;
}

bool VFlowRenderCameras::GiveCellIds()
{
  const std::uint32_t Before = m_Cells.Count;
  if ( Before != 0 )
  {
    m_Cells.Clear();
    for ( VCameraPictures& rPictures : m_Pictures )
    {
      rPictures.FirstCellId = 0;
    }
  }
  if ( const std::shared_ptr< VFlowRenderCamera > pCamera = EditedCamera() )
  {
    m_Cells.Add( *pCamera, CellsOf( *pCamera ) );
  }
  if ( m_Cells.Count != 0 )
  {
    const std::uint32_t Number = m_Cells.Parts.front().pCamera->GetInfo().Number;
    m_Pictures[Number].FirstCellId = m_rScene.Registry().AllocateRange( m_Cells.Count, m_Cells );
  }
  return Before != 0 || m_Cells.Count != 0;
}

} // namespace Flow2Graphics

#include <Flow2Graphics/VFlowRenderCameraProvider.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <algorithm>
#include <limits>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;
using Flow2TypesUtils::ETagRequirement;
using Flow2TypesUtils::VTaggedCoreTypeExtractor;
using ZEK::EFlowTimeMatch;

/// Where the items of a camera's own tags go.
struct VCameraTag
{
  ECameraItem Item;
  std::uint32_t Tag;
};
constexpr std::array< VCameraTag, 13 > CameraTags{ {
    { ECameraHardware, ZEK::FlowTag< FlowCameraHardware > },
    { ECameraSettings, ZEK::FlowTag< FlowCameraSettings > },
    { ECameraPhysicalSensorData, ZEK::FlowTag< FlowCameraPhysicalSensorData > },
    { ECameraCalibration, ZEK::FlowTag< FlowCameraCalibration > },
    { ECameraMaskGrid, ZEK::FlowTag< FlowCameraMaskGrid > },
    { ECameraCentroids, ZEK::FlowTag< FlowCentroidSet > },
    { ECameraCentroidLabels, ZEK::FlowTag< FlowCentroidLabelSet > },
    { ECameraCentroidAssignments, ZEK::FlowTag< FlowCentroidAssignmentSet > },
    { ECameraEdgePairs, ZEK::FlowTag< FlowEdgePairSet > },
    { ECameraImageSet, ZEK::FlowTag< FlowImageSet > },
    { ECameraGreyscaleBlobs, ZEK::FlowTag< FlowGreyscaleBlobSet > },
    { ECameraVideoFrame, ZEK::FlowTag< FlowVideoFrame > },
    { ECameraWand, ZEK::FlowTag< FlowCameraWand2d > },
} };

void AddCameraCaches( VTaggedCoreTypeExtractor& io_rExtractor )
{
  constexpr ETagRequirement Optional = ETagRequirement::Optional;
  io_rExtractor.AddCache< FlowCameraHardware >( ETagRequirement::Required );
  io_rExtractor.AddCache< FlowCameraSettings >( Optional );
  io_rExtractor.AddCache< FlowCameraMaskGrid >( Optional );
  io_rExtractor.AddCache< FlowCentroidSet >( Optional );
  io_rExtractor.AddCache< FlowGreyscaleBlobSet >( Optional );
  io_rExtractor.AddCache< FlowEdgePairSet >( Optional );
  io_rExtractor.AddCache< FlowVideoFrame >( Optional );
  io_rExtractor.AddCache< FlowCameraCalibration >( Optional );
  io_rExtractor.AddCache< FlowCentroidAssignmentSet >( Optional );
  io_rExtractor.AddCache< FlowCameraWand2d >( Optional );
  io_rExtractor.AddCache< FlowCentroidLabelSet >( Optional );
  io_rExtractor.AddCache< FlowCameraPhysicalSensorData >( Optional );
  io_rExtractor.AddCache< FlowImageSet >( Optional );
}

std::int32_t Pixels( std::uint32_t i_Count )
{
  constexpr std::uint32_t Most = std::numeric_limits< std::int32_t >::max();
  return static_cast< std::int32_t >( std::min( i_Count, Most ) );
}

MoxelGraphics::VCameraDefinition DefinitionOf( const VFlowRenderCamera& i_rCamera )
{
  const ZEK::VRenderCameraInfo& rInfo = i_rCamera.GetInfo();
  MoxelGraphics::VCameraDefinition Definition;
  Definition.DeviceURN = i_rCamera.GetName();
  Definition.DisplayType = rInfo.DisplayType;
  Definition.UserId = rInfo.UserId;
  Definition.bCalibrated = rInfo.bCalibrated;
  Definition.bVideo = rInfo.bVideo;
  Definition.Position = rInfo.Position;
  Definition.PixelAspect = rInfo.PixelAspect;
  Definition.ImageWidth = Pixels( rInfo.SensorWidth );
  Definition.ImageHeight = Pixels( rInfo.SensorHeight );
  Definition.Rotation = i_rCamera.GetModel().RollRotation;
  Definition.SnappedRotation = i_rCamera.GetModel().SnappedRotation;
  return Definition;
}

/// The members that a mark of that kind belongs to; null for kinds that no camera has.
std::vector< VCameraMarks::VMember >* MembersOf( VCameraMarks& io_rMarks, std::uint32_t i_Kind )
{
  switch ( i_Kind )
  {
  case ZEK::ESelectCentroid:
    return &io_rMarks.Centroids;
  case ZEK::ESelectGreyscaleBlob:
    return &io_rMarks.Blobs;
  case ZEK::ESelectMaskCell:
    return &io_rMarks.MaskCells;
  default:
    return nullptr;
  }
}
} // namespace

bool VCameraMembers::ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const
{
  if ( i_Index >= Count )
  {
    return false;
  }
  const auto It = std::prev( std::upper_bound( Parts.begin(), Parts.end(), i_Index,
                                               []( std::uint32_t i_Sought, const VPart& i_rPart )
                                               {
                                                 return i_Sought < i_rPart.First;
                                               } ) );
  const std::uint32_t Sub = i_Index - It->First;
  const VFlowRenderCamera& rCamera = *It->pCamera;
  o_rItem = { m_Kind, rCamera.GetName(), 0, Sub };
  o_rLabel = rCamera.GetDisplayName().empty() ? rCamera.GetName() : rCamera.GetDisplayName();
  o_rLabel.append( m_pWord ).append( std::to_string( Sub ) );
  return true;
}

bool VCameraMembers::FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const
{
  if ( i_rItem.Kind != m_Kind )
  {
    return false;
  }
  const auto It = std::lower_bound( Parts.begin(), Parts.end(), i_rItem.Device,
                                    []( const VPart& i_rPart, const std::string& i_rName )
                                    {
                                      return i_rPart.pCamera->GetName() < i_rName;
                                    } );
  if ( It == Parts.end() || It->pCamera->GetName() != i_rItem.Device )
  {
    return false;
  }
  const std::uint32_t End = std::next( It ) == Parts.end() ? Count : std::next( It )->First;
  if ( i_rItem.Sub >= End - It->First )
  {
    return false;
  }
  o_rIndex = It->First + i_rItem.Sub;
  return true;
}

void VCameraMembers::Clear()
{
  Parts.clear();
  Count = 0;
}

void VCameraMembers::Add( VFlowRenderCamera& i_rCamera, std::size_t i_Count )
{
  if ( i_Count > 0 )
  {
    Parts.push_back( { &i_rCamera, Count } );
    Count += static_cast< std::uint32_t >( i_Count );
  }
}

VFlowRenderCameraProvider::VFlowRenderCameraProvider( MoxelGraphics::VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_Centroids( ZEK::ESelectCentroid, ": centroid " )
  , m_Blobs( ZEK::ESelectGreyscaleBlob, ": grey blob " )
{
  AddCameraCaches( CameraExtractor );
  SubjectExtractor.AddCache< FlowSubject >( ETagRequirement::Required );
  SubjectExtractor.AddCache< FlowSubjectApplicationData >( ETagRequirement::Required );
}

VFlowRenderCameraProvider::~VFlowRenderCameraProvider() = default;

ZEK::VRenderCameraRef VFlowRenderCameraProvider::GetCamera( const std::string& i_rName ) const
{
  const auto It = Cameras.find( i_rName );
  return It == Cameras.end() ? nullptr : It->second;
}

void VFlowRenderCameraProvider::Update( const ZEK::IFlowState& i_rState )
{
  const bool bSubjects = TakeSubjects( i_rState );
  CameraExtractor.Update( i_rState, ZEK::EFlowNameDevice, EFlowTimeMatch::Overlap, i_rState.GetKey() );
  const bool bNames = CameraExtractor.NamesChanged();
  const bool bLabels = TakeReconstructionLabels( i_rState );
  if ( bNames )
  {
    TakeNames();
  }
  const bool bMarks = GiveMarks( bNames );
  const bool bItems = bNames || bLabels || CameraExtractor.Changed();
  const bool bChanged = bItems && GiveItems( i_rState, bNames );
  const bool bIds = GiveIds( bNames );
  if ( bItems || bSubjects || bMarks || bIds || m_Generation == 0 )
  {
    ++m_Generation;
  }
  if ( bNames || bChanged )
  {
    TellScene();
  }
}

bool VFlowRenderCameraProvider::TakeSubjects( const ZEK::IFlowState& i_rState )
{
  SubjectExtractor.Update( i_rState, ZEK::EFlowNameObject, EFlowTimeMatch::Overlap, i_rState.GetKey() );
  if ( !SubjectExtractor.Changed() )
  {
    return false;
  }
  m_pColours->Clear();
  const auto& rSubjects = SubjectExtractor.Values< FlowSubject >();
  const auto& rData = SubjectExtractor.Values< FlowSubjectApplicationData >();
  for ( std::size_t Slot = 0; Slot < rSubjects.size() && Slot < rData.size(); ++Slot )
  {
    if ( rSubjects[Slot] && rData[Slot] )
    {
      m_pColours->AddSubject( *rSubjects[Slot], *rData[Slot] );
    }
  }
  return true;
}

bool VFlowRenderCameraProvider::TakeReconstructionLabels( const ZEK::IFlowState& i_rState )
{
  ZEK::VFlowItemRef New;
  // They are new in every frame, and only tell centroids apart that are assigned to a reconstruction.
  if ( CameraExtractor.Occurs( ZEK::FlowTag< FlowCentroidAssignmentSet > ) )
  {
    i_rState.FindItem( New, ZEK::FlowTag< FlowReconstructionLabelSet >, EFlowTimeMatch::Overlap );
  }
  m_bOtherLabels = IsOtherValue( m_ReconstructionLabels, New );
  if ( m_bOtherLabels )
  {
    m_pColours->SetReconstructionLabels( ZEK::FlowPayload< VReconstructionLabelSet >( New.Get() ) );
  }
  m_ReconstructionLabels = std::move( New );
  return m_bOtherLabels;
}

void VFlowRenderCameraProvider::TakeNames()
{
  VCameraMap New;
  New.reserve( CameraExtractor.Names().size() );
  m_Slots.clear();
  m_List.clear();
  m_Centroids.Clear();
  m_Blobs.Clear();
  for ( const std::string& rName : CameraExtractor.Names() )
  {
    const auto It = Cameras.find( rName );
    std::shared_ptr< VFlowRenderCamera > pCamera =
        It != Cameras.end() ? It->second : std::make_shared< VFlowRenderCamera >( rName, m_pColours );
    pCamera->SetNumber( static_cast< std::uint32_t >( m_Slots.size() ) );
    m_List.push_back( pCamera );
    m_Slots.push_back( pCamera );
    New.emplace( rName, std::move( pCamera ) );
  }
  Cameras.swap( New );
}

bool VFlowRenderCameraProvider::GiveItems( const ZEK::IFlowState& i_rState, bool i_bAll )
{
  std::array< const std::vector< ZEK::VFlowCursor >*, ECameraItemCount > Entries{};
  for ( const VCameraTag& rTag : CameraTags )
  {
    if ( i_bAll || CameraExtractor.Changed( rTag.Tag ) )
    {
      Entries[rTag.Item] = &CameraExtractor.Entries( rTag.Tag );
    }
  }
  ZEK::VFlowCursor End;
  i_rState.EndCursor( End );
  bool bChanged = false;
  for ( std::size_t Slot = 0; Slot < m_Slots.size(); ++Slot )
  {
    VFlowRenderCamera& rCamera = *m_Slots[Slot];
    const std::int32_t Before = rCamera.GetInfo().ChangeCount;
    for ( std::uint32_t Item = 0; Item < ECameraItemCount; ++Item )
    {
      if ( Item == ECameraReconstructionLabels )
      {
        rCamera.SetItem( ECameraReconstructionLabels, m_ReconstructionLabels.Get() );
      }
      else if ( Entries[Item] )
      {
        const ZEK::VFlowCursor& rEntry = ( *Entries[Item] )[Slot];
        rCamera.SetItem( static_cast< ECameraItem >( Item ), rEntry == End ? nullptr : rEntry->pItem );
      }
    }
    bChanged = bChanged || rCamera.GetInfo().ChangeCount != Before;
  }
  return bChanged;
}

bool VFlowRenderCameraProvider::GiveMarks( bool i_bAll )
{
  const MoxelGraphics::VSelectionRegistry& rRegistry = m_rScene.Registry();
  if ( !i_bAll && m_MarksGeneration == rRegistry.MarksGeneration() )
  {
    return false;
  }
  m_MarksGeneration = rRegistry.MarksGeneration();
  m_Marks.resize( m_Slots.size() );
  for ( VCameraMarks& rMarks : m_Marks )
  {
    rMarks.Clear();
  }
  for ( const MoxelGraphics::VSelectionRegistry::VMark& rMark : rRegistry.Marks() )
  {
    const auto It = Cameras.find( rMark.Item.Device );
    if ( It == Cameras.end() )
    {
      continue;
    }
    VCameraMarks& rMarks = m_Marks[It->second->GetInfo().Number];
    if ( rMark.Item.Kind == ZEK::ESelectDevice )
    {
      rMarks.Device = rMark.Flags;
    }
    else if ( auto* const pMembers = MembersOf( rMarks, rMark.Item.Kind ) )
    {
      pMembers->push_back( { rMark.Item.Sub, rMark.Flags } );
    }
  }
  for ( std::size_t Slot = 0; Slot < m_Slots.size(); ++Slot )
  {
    m_Slots[Slot]->SetMarks( m_Marks[Slot] );
  }
  return true;
}

bool VFlowRenderCameraProvider::GiveIds( bool i_bAll )
{
  const bool bOthers = i_bAll || CameraExtractor.Changed( ZEK::FlowTag< FlowCentroidSet > ) ||
                       CameraExtractor.Changed( ZEK::FlowTag< FlowGreyscaleBlobSet > );
  if ( bOthers )
  {
    m_Centroids.Clear();
    m_Blobs.Clear();
    for ( const auto& rpCamera : m_Slots )
    {
      m_Centroids.Add( *rpCamera, rpCamera->CentroidCount() );
      m_Blobs.Add( *rpCamera, rpCamera->BlobCount() );
    }
  }
  const auto Allocate = [&]( const VCameraMembers& i_rMembers )
  {
    return i_rMembers.Count == 0 ? 0 : m_rScene.Registry().AllocateRange( i_rMembers.Count, i_rMembers );
  };
  const std::uint32_t FirstCentroid = Allocate( m_Centroids );
  const std::uint32_t FirstBlob = Allocate( m_Blobs );
  if ( !bOthers && FirstCentroid == m_FirstCentroid && FirstBlob == m_FirstBlob )
  {
    return false;
  }
  m_FirstCentroid = FirstCentroid;
  m_FirstBlob = FirstBlob;
  for ( const auto& rpCamera : m_Slots )
  {
    rpCamera->SetFirstIds( 0, 0 );
  }
  for ( const VCameraMembers::VPart& rPart : m_Blobs.Parts )
  {
    rPart.pCamera->SetFirstIds( 0, FirstBlob == 0 ? 0 : FirstBlob + rPart.First );
  }
  for ( const VCameraMembers::VPart& rPart : m_Centroids.Parts )
  {
    rPart.pCamera->SetFirstIds( FirstCentroid == 0 ? 0 : FirstCentroid + rPart.First,
                                rPart.pCamera->GetInfo().FirstBlobId );
  }
  return true;
}

void VFlowRenderCameraProvider::TellScene()
{
  std::vector< MoxelGraphics::VCameraDefinition > Definitions;
  Definitions.reserve( m_Slots.size() );
  for ( const auto& rpCamera : m_Slots )
  {
    Definitions.push_back( DefinitionOf( *rpCamera ) );
  }
  m_rScene.SetCameraDefinitions( std::move( Definitions ) );
}

} // namespace Flow2Graphics

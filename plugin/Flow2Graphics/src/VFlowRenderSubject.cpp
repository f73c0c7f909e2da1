#include <Flow2Graphics/VFlowRenderSubject.h>

#include "SubjectOwn.h"

#include <algorithm>
#include <cstring>
#include <utility>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;
using MoxelGraphics::VBonePose;
using MoxelGraphics::VScenePoint;
using MoxelGraphics::VSubjectRecord;

/// Of points that were recorded without one, mm.
constexpr float UsualRadius = 7.0F;
constexpr unsigned FlagShift = 21;
/// How many points ahead the memory is asked for one.
constexpr std::size_t Ahead = 32;
constexpr VScenePoint Nowhere{ NoPlace, NoPlace, NoPlace, 0 };

using VLabel = VReconstructionLabelSet::L;

/// A row in one register.
using VFour = float __attribute__( ( vector_size( 16 ) ) );
using VFourDoubles = double __attribute__( ( vector_size( 32 ) ) );

/// Rotation row by row and translation, as a pose; none unless all of it is finite.
inline void WritePose( const double* i_pRotation, const double* i_pTranslation, VBonePose& o_rPose )
{
  VFour Excess{}; // 0 for numbers, else NaN
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    const double* const pRow = i_pRotation + 3 * Row;
    const auto New =
        __builtin_convertvector( ( VFourDoubles{ pRow[0], pRow[1], pRow[2], i_pTranslation[Row] } ), VFour );
    Excess += New - New;
    std::memcpy( o_rPose.data() + 4 * Row, &New, sizeof( New ) );
  }
  if ( ( Excess[0] + Excess[1] ) + ( Excess[2] + Excess[3] ) != 0 )
  {
    o_rPose = NoPose;
  }
}

/// Poses and points of a new state lie in the memory, not in a cache: asked for ahead, they are there when their turn
/// comes.
void Prefetch( std::span< const std::byte > i_Memory )
{
  constexpr std::size_t Line = 64;
  for ( std::size_t At = 0; At < i_Memory.size(); At += Line )
  {
    __builtin_prefetch( i_Memory.data() + At );
  }
}

void WritePose( const Rigid* i_pPose, VBonePose& o_rPose )
{
  if ( i_pPose )
  {
    WritePose( i_pPose->R, i_pPose->T, o_rPose );
  }
  else
  {
    o_rPose = NoPose;
  }
}

VScenePoint Placed( const VBonePose& i_rPose, const std::array< float, 3 >& i_rLocal, float i_Radius )
{
  const auto Row = [&]( std::size_t i_First )
  {
    return i_rPose[i_First] * i_rLocal[0] + i_rPose[i_First + 1] * i_rLocal[1] + i_rPose[i_First + 2] * i_rLocal[2] +
           i_rPose[i_First + 3];
  };
  return { Row( 0 ), Row( 4 ), Row( 8 ), i_Radius };
}

VScenePoint Placed( const D3& i_rPlace, float i_Radius )
{
  return { static_cast< float >( i_rPlace.x ), static_cast< float >( i_rPlace.y ), static_cast< float >( i_rPlace.z ),
           i_Radius };
}

bool Give( MoxelGraphics::VSelectionRegistry& io_rRegistry, const VSubjectMembers& i_rMembers,
           std::uint32_t& io_rFirst )
{
  const std::uint32_t Count = i_rMembers.Count();
  const std::uint32_t First = Count != 0 ? io_rRegistry.AllocateRange( Count, i_rMembers ) : 0;
  return std::exchange( io_rFirst, First ) != First;
}
} // namespace

VFlowRenderSubject::VFlowRenderSubject( std::unique_ptr< ISubjectSelectionMaker > i_pMaker )
  : m_pMaker( std::move( i_pMaker ) )
  , m_Records( VSubjectMembers::ERecords, m_Group, *m_pMaker, m_Directory )
  , m_Markers( VSubjectMembers::EMarkers, m_Group, *m_pMaker, m_Directory )
  , m_Sticks( VSubjectMembers::ESticks, m_Group, *m_pMaker, m_Directory )
  , m_Bones( VSubjectMembers::EBones, m_Group, *m_pMaker, m_Directory )
{
  m_pMaker->AddCaches( m_Extractor );
}

VFlowRenderSubject::~VFlowRenderSubject() = default;

void VFlowRenderSubject::MarkDirty( const VSubjectChanges& i_rNames )
{
  const std::vector< std::string >& rOwn = m_Extractor.Names();
  if ( std::any_of( i_rNames.begin(), i_rNames.end(),
                    [&]( const std::string& i_rName )
                    {
                      return std::binary_search( rOwn.begin(), rOwn.end(), i_rName );
                    } ) )
  {
    MarkDirty();
  }
}

void VFlowRenderSubject::Take( const ZEK::IFlowState& i_rState )
{
  m_Extractor.Update( i_rState, ZEK::EFlowNameObject, ZEK::EFlowTimeMatch::Overlap, i_rState.GetKey() );
  const bool bMarked = m_bRebuild.exchange( false, std::memory_order_acq_rel );
  const bool bStructure = m_pMaker->StructureChanged( m_Extractor ) || bMarked;
  if ( bStructure )
  {
    Rebuild();
  }
  m_bMotionsRead = false;
  m_bMoved = bStructure || m_pMaker->MotionChanged( m_Extractor );
  if ( m_bMoved )
  {
    Move();
  }
}

/// Read once an update: poses and markers both ask.
const VSubjectMotion& VFlowRenderSubject::MotionOf( std::size_t i_Record )
{
  if ( !std::exchange( m_bMotionsRead, true ) )
  {
    m_Motions.resize( m_Own.size() );
    for ( std::size_t Index = 0; Index < m_Own.size(); ++Index )
    {
      m_pMaker->Motion( m_Extractor, m_Own[Index].Slot, m_Motions[Index] );
    }
  }
  return m_Motions[i_Record];
}

void VFlowRenderSubject::Move()
{
  for ( std::size_t Index = 0; Index < m_Own.size(); ++Index )
  {
    VOwn& rOwn = m_Own[Index];
    VSubjectRecord& rRecord = m_Group.Records[Index];
    const VSubjectMotion& rMotion = MotionOf( Index );
    if ( Index + 1 < m_Own.size() )
    {
      Prefetch( std::as_bytes( MotionOf( Index + 1 ).Segments ) );
    }
    if ( rRecord.Bones.Count != 0 && !rOwn.bOneBone )
    {
      MoveBones( rMotion, rOwn, rRecord );
      rRecord.Root = rOwn.RootBone != VOwn::NoBone ? m_Group.Poses[rOwn.RootBone] : NoPose;
    }
    else
    {
      WritePose( rMotion.pRoot, rRecord.Root );
    }
    if ( rOwn.bOneBone )
    {
      m_Group.Poses[rRecord.Bones.First] = rRecord.Root;
    }
    rRecord.Mesh.AnimationTime = std::isfinite( rMotion.AnimationTime ) ? rMotion.AnimationTime : 0;
    rRecord.Mesh.Bones.resize( rMotion.MeshBones.size() );
    for ( std::size_t Bone = 0; Bone < rMotion.MeshBones.size(); ++Bone )
    {
      WritePose( &rMotion.MeshBones[Bone], rRecord.Mesh.Bones[Bone] );
    }
  }
  ++m_Group.PoseGeneration;
}

/// Poses as they come, else worked out from the joints.
void VFlowRenderSubject::MoveBones( const VSubjectMotion& i_rMotion, VOwn& io_rOwn, VSubjectRecord& io_rRecord )
{
  const std::size_t Count = io_rRecord.Bones.Count;
  VBonePose* const pPoses = m_Group.Poses.data() + io_rRecord.Bones.First;
  float* const pHealth = m_Group.Health.data() + io_rRecord.Bones.First;
  for ( std::size_t Bone = 0; Bone < Count; ++Bone )
  {
    const float Health = Bone < i_rMotion.Health.size() ? i_rMotion.Health[Bone] : 1.0F;
    pHealth[Bone] = Health >= 0 && Health <= 1 ? Health : Health < 0 ? 0.0F : 1.0F;
  }
  std::span< const ComputeSubject::VRigidTransform > Worlds;
  if ( i_rMotion.Segments.empty() && !i_rMotion.JointState.empty() )
  {
    if ( !std::exchange( io_rOwn.bKinematicsTried, true ) )
    {
      VSubjectStructure Structure;
      std::string Message;
      m_pMaker->Structure( m_Extractor, io_rOwn.Slot, Structure );
      if ( Structure.pSkeleton &&
           !ComputeSubject::VComputeSubjectFK::Build( *Structure.pSkeleton, io_rOwn.pKinematics, Message ).IsOk() )
      {
        ZEK::Log( SubjectCategory(), ZEK::ELogDetail, "\"%1%\" has no poses: %2%", io_rRecord.Name, Message );
      }
    }
    if ( io_rOwn.pKinematics && !io_rOwn.pKinematics->LoadState( i_rMotion.JointState ).IsError() )
    {
      Worlds = io_rOwn.pKinematics->WorldTransforms();
    }
  }
  for ( std::size_t Bone = 0; Bone < Count; ++Bone )
  {
    if ( Bone < Worlds.size() )
    {
      WritePose( Worlds[Bone].m_Rotation, Worlds[Bone].m_Translation, pPoses[Bone] );
    }
    else
    {
      WritePose( Bone < i_rMotion.Segments.size() ? &i_rMotion.Segments[Bone] : nullptr, pPoses[Bone] );
    }
  }
}

void VFlowRenderSubject::PlaceMarkers( const VLabelledSet& i_rSet )
{
  const bool bSet = i_rSet.pSet != nullptr;
  m_bPlaced = i_rSet.bChanged || m_bMoved || bSet != m_bHadSet;
  if ( !m_bPlaced )
  {
    return;
  }
  m_bHadSet = bSet;
  m_Used.clear();
  m_Reconstructions.clear();
  if ( m_Group.Markers.empty() )
  {
    ++m_Group.MarkerGeneration; // whoever drew markers is to forget them
    return;
  }
  PlaceByModel( bSet );
  if ( bSet )
  {
    PlaceByLabels( i_rSet );
  }
  ++m_Group.MarkerGeneration;
}

void VFlowRenderSubject::PlaceByModel( bool i_bSet )
{
  for ( std::size_t Index = 0; Index < m_Own.size(); ++Index )
  {
    PlaceRecord( MotionOf( Index ), m_Own[Index], m_Group.Records[Index], i_bSet );
  }
}

/// Where the model has the markers of an object. They are seen there when nothing else tells where they are: in a
/// frame without reconstructions, where none is missing, and of objects that are tracked as one. Else they are left as
/// they are, for whoever places them by their labels.
void VFlowRenderSubject::PlaceRecord( const VSubjectMotion& i_rMotion, VOwn& io_rOwn, const VSubjectRecord& i_rRecord,
                                      bool i_bSet )
{
  const bool bSeen = !i_bSet || io_rOwn.bOneBone;
  const bool bModel = io_rOwn.bOneBone || !i_rMotion.Solved.empty();
  if ( !bModel && !bSeen && !std::exchange( io_rOwn.bModelled, false ) )
  {
    return;
  }
  io_rOwn.bModelled = bModel;
  for ( std::uint32_t Number = 0; Number < i_rRecord.Markers.Count; ++Number )
  {
    const std::uint32_t Index = i_rRecord.Markers.First + Number;
    const float Radius = m_Radii[Index] > 0 ? m_Radii[Index] : UsualRadius;
    const bool bVisible = Number >= i_rMotion.Visible.size() || i_rMotion.Visible[Number] != 0;
    VScenePoint Place = Nowhere;
    if ( io_rOwn.bOneBone )
    {
      Place = Placed( i_rRecord.Root, m_Locals[Index], Radius );
    }
    else if ( Number < i_rMotion.Solved.size() )
    {
      Place = Placed( i_rMotion.Solved[Number], Radius );
    }
    m_Group.Solved[Index] = i_bSet || bVisible ? Place : Nowhere;
    if ( bSeen )
    {
      m_Group.Markers[Index] = bVisible ? Place : Nowhere;
    }
  }
}

void VFlowRenderSubject::PlaceByLabels( const VLabelledSet& i_rSet )
{
  const std::vector< VReconstruction >& rItems = i_rSet.pSet->Items;
  m_Used.assign( rItems.size(), 0 );
  m_Reconstructions.assign( m_Group.Markers.size(), NoReconstruction );
  // Through pointers: a byte that is written might else be part of any list.
  std::uint8_t* const pUsed = m_Used.data();
  std::uint32_t* const pReconstructions = m_Reconstructions.data();
  VScenePoint* const pMarkers = m_Group.Markers.data();
  const float* const pRadii = m_Radii.data();
  MoxelGraphics::VSubjectRange Markers;
  std::uint32_t Subject = 0;
  bool bFirst = true;
  const auto Labels = i_rSet.pLabels ? std::span( i_rSet.pLabels->Labels ) : std::span< const VLabel >();
  for ( std::size_t Number = 0; Number < Labels.size(); ++Number )
  {
    const VLabel& rLabel = Labels[Number];
    if ( Number + Ahead < Labels.size() )
    {
      __builtin_prefetch( rItems.data() +
                          std::min( std::size_t{ Labels[Number + Ahead].Reconstruction }, rItems.size() ) );
    }
    // Labels of one object mostly stand together.
    if ( bFirst || Subject != rLabel.SubjectId )
    {
      bFirst = false;
      Subject = rLabel.SubjectId;
      std::uint32_t Record = 0;
      Markers = m_Directory.Find( Subject, Record ) ? m_Group.Records[Record].Markers : MoxelGraphics::VSubjectRange();
    }
    const std::uint32_t Reconstruction = rLabel.Reconstruction;
    const std::uint32_t Index = Markers.First + rLabel.MarkerId;
    if ( rLabel.MarkerId >= Markers.Count || Reconstruction >= rItems.size() || pUsed[Reconstruction] != 0 ||
         pReconstructions[Index] != NoReconstruction )
    {
      continue;
    }
    pUsed[Reconstruction] = 1;
    pReconstructions[Index] = Reconstruction;
    const VReconstruction& rItem = rItems[Reconstruction];
    const float Own = pRadii[Index];
    pMarkers[Index] = Placed( rItem.Position, Own > 0 ? Own : rItem.Radius > 0 ? rItem.Radius : UsualRadius );
  }
  for ( std::size_t Record = 0; Record < m_Own.size(); ++Record )
  {
    const MoxelGraphics::VSubjectRange& rRange = m_Group.Records[Record].Markers;
    for ( std::uint32_t Index = rRange.First; !m_Own[Record].bOneBone && Index < rRange.First + rRange.Count; ++Index )
    {
      if ( pReconstructions[Index] == NoReconstruction )
      {
        pMarkers[Index] = Nowhere;
      }
    }
  }
}

void VFlowRenderSubject::GiveIds( MoxelGraphics::VSelectionRegistry& io_rRegistry )
{
  // Objects come first: whoever looks for one by its item finds the object before its parts.
  std::uint32_t First = m_Group.Records.empty() ? 0 : m_Group.Records.front().Id;
  bool bRecords = Give( io_rRegistry, m_Records, First );
  for ( std::uint32_t Index = 0; bRecords && Index < m_Group.Records.size(); ++Index )
  {
    m_Group.Records[Index].Id = First != 0 ? First + Index : 0;
  }
  m_Group.RecordGeneration += bRecords;
  m_Group.MarkerIds.Generation += Give( io_rRegistry, m_Markers, m_Group.MarkerIds.First );
  m_Group.StickIds.Generation += Give( io_rRegistry, m_Sticks, m_Group.StickIds.First );
  m_Group.BoneIds.Generation += Give( io_rRegistry, m_Bones, m_Group.BoneIds.First );
  if ( m_MarksGeneration != io_rRegistry.MarksGeneration() || m_FlaggedStructure != m_Group.StructureGeneration )
  {
    GiveFlags( io_rRegistry );
    m_MarksGeneration = io_rRegistry.MarksGeneration();
    m_FlaggedStructure = m_Group.StructureGeneration;
  }
}

void VFlowRenderSubject::GiveFlags( const MoxelGraphics::VSelectionRegistry& i_rRegistry )
{
  m_Group.MarkerIds.Generation += FindFlags( i_rRegistry, m_Markers, m_Group.MarkerIds.Flags );
  m_Group.StickIds.Generation += FindFlags( i_rRegistry, m_Sticks, m_Group.StickIds.Flags );
  m_Group.BoneIds.Generation += FindFlags( i_rRegistry, m_Bones, m_Group.BoneIds.Flags );
  std::uint64_t Changes = 0;
  for ( VSubjectRecord& rRecord : m_Group.Records )
  {
    const auto Flags = static_cast< std::uint8_t >( i_rRegistry.Flags( rRecord.Item ) >> FlagShift );
    Changes += std::exchange( rRecord.Flags, Flags ) != Flags;
  }
  m_Group.RecordGeneration += Changes;
}

/// Whether the flags became others. They are empty when no member is marked.
bool VFlowRenderSubject::FindFlags( const MoxelGraphics::VSelectionRegistry& i_rRegistry,
                                    const VSubjectMembers& i_rMembers, std::vector< std::uint8_t >& io_rFlags )
{
  m_Flags.clear();
  for ( const MoxelGraphics::VSelectionRegistry::VMark& rMark : i_rRegistry.Marks() )
  {
    const MoxelGraphics::VSubjectRange Found = i_rMembers.FindAll( rMark.Item );
    if ( Found.Count != 0 )
    {
      m_Flags.resize( i_rMembers.Count(), 0 );
      // An item may be marked under its number alone and in full.
      for ( std::uint32_t Index = Found.First; Index < Found.First + Found.Count; ++Index )
      {
        m_Flags[Index] |= static_cast< std::uint8_t >( rMark.Flags >> FlagShift );
      }
    }
  }
  if ( m_Flags == io_rFlags )
  {
    return false;
  }
  io_rFlags.swap( m_Flags );
  return true;
}

} // namespace Flow2Graphics

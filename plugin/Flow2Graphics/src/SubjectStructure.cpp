#include "SubjectOwn.h"

#include <algorithm>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;
using MoxelGraphics::VSubjectBone;
using MoxelGraphics::VSubjectGroup;
using MoxelGraphics::VSubjectRecord;
using MoxelGraphics::VSubjectTarget;

constexpr std::uint32_t Opaque = 0xFF000000;
/// For objects that bring no colours: one calm colour each.
constexpr std::array< std::uint32_t, 6 > Palette{ 0xFFE8B45A, 0xFF6FC97F, 0xFF5AA9F2,
                                                  0xFFD78BE0, 0xFF7FD6DC, 0xFFB0B8C4 };

template < typename TList >
std::uint32_t CountOf( const TList& i_rList )
{
  return static_cast< std::uint32_t >( i_rList.size() );
}

float Finite( float i_Value, float i_Else )
{
  return std::isfinite( i_Value ) ? i_Value : i_Else;
}

std::array< float, 3 > ToFloats( const D3& i_rPlace )
{
  return { static_cast< float >( i_rPlace.x ), static_cast< float >( i_rPlace.y ), static_cast< float >( i_rPlace.z ) };
}

/// Cuts every link of the bones from `i_First` on that leads to no bone, or round in a circle.
void MendParents( std::vector< VSubjectBone >& io_rBones, std::uint32_t i_First )
{
  const std::uint32_t Count = CountOf( io_rBones ) - i_First;
  // By bone: 0 not looked at, else the number of the walk that came by.
  std::vector< std::uint32_t > Walks( Count, 0 );
  for ( std::uint32_t Index = 0; Index < Count; ++Index )
  {
    const std::uint32_t Walk = Index + 1;
    std::uint32_t At = Index;
    while ( Walks[At] == 0 )
    {
      Walks[At] = Walk;
      VSubjectBone& rBone = io_rBones[i_First + At];
      const std::int64_t Parent = std::int64_t{ rBone.Parent } - i_First;
      if ( Parent < 0 || Parent >= Count || Walks[static_cast< std::size_t >( Parent )] == Walk )
      {
        rBone.Parent = -1;
        break;
      }
      At = static_cast< std::uint32_t >( Parent );
    }
  }
}

void AppendTargets( const VSubjectStructure& i_rStructure, const VSubjectRecord& i_rRecord, VSubjectGroup& io_rGroup )
{
  for ( std::uint32_t Number = 0; Number < i_rStructure.Markers.size(); ++Number )
  {
    const VMarker& rMarker = i_rStructure.Markers[Number];
    const std::int64_t Bone = i_rStructure.bOneBone ? 0 : std::int64_t{ rMarker.Segment };
    const std::array< float, 3 > Local = ToFloats( rMarker.Local );
    if ( Bone < 0 || Bone >= i_rRecord.Bones.Count || !std::isfinite( Local[0] + Local[1] + Local[2] ) )
    {
      continue;
    }
    VSubjectTarget Target{
        i_rRecord.Bones.First + static_cast< std::uint32_t >( Bone ), i_rRecord.Markers.First + Number, Local, {} };
    float Sum = 0;
    for ( std::size_t Index = 0; Index < 9; ++Index )
    {
      Target.Covariance[Index] = static_cast< float >( rMarker.Covariance[Index] );
      Sum += 0 * Target.Covariance[Index];
    }
    Target.Covariance = Sum == 0 ? Target.Covariance : std::array< float, 9 >{};
    io_rGroup.Targets.push_back( Target );
  }
}

void AppendSticks( const VSubjectStructure& i_rStructure, const VSubjectRecord& i_rRecord, VSubjectGroup& io_rGroup )
{
  const std::uint32_t Count = i_rRecord.Markers.Count, First = i_rRecord.Markers.First;
  for ( const VStick& rStick : i_rStructure.Sticks )
  {
    if ( rStick.A < Count && rStick.B < Count && rStick.A != rStick.B )
    {
      io_rGroup.Sticks.push_back(
          { First + rStick.A, First + rStick.B, rStick.ColourA | Opaque, rStick.ColourB | Opaque } );
    }
  }
}

void AppendWires( const VSubjectStructure& i_rStructure, const VSubjectRecord& i_rRecord, VSubjectGroup& io_rGroup )
{
  for ( const auto& [Segment, Marker] : i_rStructure.Clusters )
  {
    if ( Segment < i_rRecord.Bones.Count && Marker < i_rRecord.Markers.Count )
    {
      io_rGroup.Wires.push_back( { i_rRecord.Bones.First + Segment, i_rRecord.Markers.First + Marker } );
    }
  }
}
} // namespace

ZEK::VLogCategory& SubjectCategory()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Subjects" );
  return rCategory;
}

void VFlowRenderSubject::Rebuild()
{
  m_Own.clear();
  m_Radii.clear();
  m_Locals.clear();
  m_Group.Records.clear();
  m_Group.MarkerColours.clear();
  m_Group.MarkerNames.clear();
  m_Group.Sticks.clear();
  m_Group.Bones.clear();
  m_Group.BoneNames.clear();
  m_Group.Targets.clear();
  m_Group.Wires.clear();
  for ( std::size_t Slot = 0; Slot < m_Extractor.Names().size(); ++Slot )
  {
    VSubjectStructure Structure;
    const ESubjectFit Fit = m_pMaker->Structure( m_Extractor, Slot, Structure );
    if ( Fit == ESubjectFit::Shown )
    {
      Append( Slot, Structure );
    }
    else if ( Fit == ESubjectFit::ColoursDiffer )
    {
      ZEK::Log( SubjectCategory(), ZEK::ELogDetail, "\"%1%\" is not shown: it has %2% markers and other colours",
                m_Extractor.Names()[Slot], Structure.Markers.size() );
    }
  }
  m_Directory.Build( m_Group );
  m_Group.Markers.assign( m_Group.MarkerNames.size(), { NoPlace, NoPlace, NoPlace, 0 } );
  m_Group.Solved.assign( m_Group.MarkerNames.size(), { NoPlace, NoPlace, NoPlace, 0 } );
  m_Group.Poses.assign( m_Group.Bones.size(), NoPose );
  m_Group.Health.assign( m_Group.Bones.size(), 1 );
  m_Reconstructions.reserve( m_Group.Markers.size() );
  ++m_Group.StructureGeneration;
  const std::lock_guard Lock( m_NamesGuard );
  m_Names.clear();
  for ( const VSubjectRecord& rRecord : m_Group.Records )
  {
    m_Names.push_back( rRecord.Name );
  }
}

std::vector< std::string > VFlowRenderSubject::Names() const
{
  const std::lock_guard Lock( m_NamesGuard );
  return m_Names;
}

void VFlowRenderSubject::Append( std::size_t i_Slot, const VSubjectStructure& i_rStructure )
{
  const std::string& rName =
      i_rStructure.pName && !i_rStructure.pName->empty() ? *i_rStructure.pName : m_Extractor.Names()[i_Slot];
  VSubjectRecord& rRecord = m_Group.Records.emplace_back();
  rRecord.Item = m_pMaker->ObjectItem( i_rStructure.Id, rName );
  rRecord.Name = rName;
  rRecord.Colour = i_rStructure.Colour != 0 ? i_rStructure.Colour | Opaque : Palette[i_Slot % Palette.size()];
  VOwn& rOwn = m_Own.emplace_back();
  rOwn.Slot = i_Slot;
  rOwn.bOneBone = i_rStructure.bOneBone;
  AppendMarkers( i_rStructure, rRecord );
  AppendBones( i_rStructure, rRecord );
  for ( std::uint32_t Bone = 0; Bone < rRecord.Bones.Count && rOwn.RootBone == VOwn::NoBone; ++Bone )
  {
    if ( m_Group.Bones[rRecord.Bones.First + Bone].Parent < 0 )
    {
      rOwn.RootBone = rRecord.Bones.First + Bone;
    }
  }
  const auto Add = [&]( auto& io_rList, MoxelGraphics::VSubjectRange& o_rRange, auto i_pAppend )
  {
    o_rRange.First = CountOf( io_rList );
    i_pAppend( i_rStructure, rRecord, m_Group );
    o_rRange.Count = CountOf( io_rList ) - o_rRange.First;
  };
  Add( m_Group.Targets, rRecord.Targets, AppendTargets );
  Add( m_Group.Sticks, rRecord.Sticks, AppendSticks );
  Add( m_Group.Wires, rRecord.Wires, AppendWires );
  if ( i_rStructure.pMesh )
  {
    rRecord.Mesh.Category = m_pMaker->MeshCategory();
    rRecord.Mesh.Name = *i_rStructure.pMesh;
    rRecord.Mesh.Scale = i_rStructure.MeshScale > 0 ? Finite( i_rStructure.MeshScale, 1 ) : 1;
    rRecord.Mesh.bByRoot = i_rStructure.bMeshByRoot;
  }
}

void VFlowRenderSubject::AppendMarkers( const VSubjectStructure& i_rStructure, VSubjectRecord& io_rRecord )
{
  io_rRecord.Markers = { CountOf( m_Group.MarkerNames ), CountOf( i_rStructure.Markers ) };
  for ( std::uint32_t Number = 0; Number < i_rStructure.Markers.size(); ++Number )
  {
    const VMarker& rMarker = i_rStructure.Markers[Number];
    m_Group.MarkerNames.push_back( rMarker.Name );
    m_Group.MarkerColours.push_back( i_rStructure.MarkerColours.empty() ? io_rRecord.Colour
                                                                        : i_rStructure.MarkerColours[Number] | Opaque );
    m_Radii.push_back( rMarker.Radius > 0 ? Finite( rMarker.Radius, 0 ) : 0 );
    m_Locals.push_back( ToFloats( rMarker.Local ) );
  }
}

void VFlowRenderSubject::AppendBones( const VSubjectStructure& i_rStructure, VSubjectRecord& io_rRecord )
{
  const std::uint32_t First = CountOf( m_Group.Bones );
  if ( i_rStructure.bOneBone )
  {
    io_rRecord.Bones = { First, 1 };
    m_Group.Bones.push_back( { -1, io_rRecord.Colour, 0 } );
    m_Group.BoneNames.push_back( io_rRecord.Name );
    return;
  }
  io_rRecord.Bones = { First, CountOf( i_rStructure.Segments ) };
  const bool bColours = i_rStructure.SegmentColours.size() == i_rStructure.Segments.size();
  for ( std::uint32_t Number = 0; Number < i_rStructure.Segments.size(); ++Number )
  {
    const VSegment& rSegment = i_rStructure.Segments[Number];
    const std::int64_t Parent = rSegment.Parent < 0 ? -1 : std::int64_t{ rSegment.Parent } + First;
    m_Group.Bones.push_back(
        { Parent <= std::numeric_limits< std::int32_t >::max() ? static_cast< std::int32_t >( Parent ) : -1,
          bColours ? i_rStructure.SegmentColours[Number] | Opaque : io_rRecord.Colour,
          Finite( rSegment.BoneLength, 0 ) } );
    m_Group.BoneNames.push_back( rSegment.Name );
  }
  MendParents( m_Group.Bones, First );
}

} // namespace Flow2Graphics

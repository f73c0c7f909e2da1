#include <Flow2Graphics/VSubjectMembers.h>

#include <algorithm>
#include <cmath>

namespace Flow2Graphics
{
namespace
{
using MoxelGraphics::VBonePose;
using MoxelGraphics::VScenePoint;
using MoxelGraphics::VSubjectGroup;
using MoxelGraphics::VSubjectRange;
using MoxelGraphics::VSubjectRecord;

constexpr float SmallestRadius = 50;     // mm; what a view focuses on is not a point
constexpr float RadiusOfAnything = 1000; // mm; of what is known by its origin alone

bool IsPlace( const VScenePoint& i_rPoint )
{
  return std::isfinite( i_rPoint.X + i_rPoint.Y + i_rPoint.Z );
}

bool IsPose( const VBonePose& i_rPose )
{
  float Sum = 0;
  for ( const float Value : i_rPose )
  {
    Sum += 0 * Value;
  }
  return Sum == 0;
}

/// A place on the x axis of a pose.
VScenePoint Along( const VBonePose& i_rPose, float i_X )
{
  return { i_rPose[3] + i_X * i_rPose[0], i_rPose[7] + i_X * i_rPose[4], i_rPose[11] + i_X * i_rPose[8], 0 };
}

/// The sphere about the box of what was added.
struct VBounds
{
  void Add( const VScenePoint& i_rPoint )
  {
    if ( IsPlace( i_rPoint ) )
    {
      const float Place[3] = { i_rPoint.X, i_rPoint.Y, i_rPoint.Z };
      for ( std::size_t Axis = 0; Axis < 3; ++Axis )
      {
        Low[Axis] = bAny ? std::min( Low[Axis], Place[Axis] ) : Place[Axis];
        High[Axis] = bAny ? std::max( High[Axis], Place[Axis] ) : Place[Axis];
      }
      bAny = true;
    }
  }
  bool Sphere( VScenePoint& o_rPoint ) const
  {
    const float X = 0.5F * ( High[0] - Low[0] ), Y = 0.5F * ( High[1] - Low[1] ), Z = 0.5F * ( High[2] - Low[2] );
    o_rPoint = { Low[0] + X, Low[1] + Y, Low[2] + Z, std::max( std::hypot( X, Y, Z ), SmallestRadius ) };
    return bAny;
  }

  bool bAny = false;
  float Low[3] = {}, High[3] = {};
};

bool PointOfBone( const VBonePose& i_rPose, float i_Length, VScenePoint& o_rPoint )
{
  VBounds Bounds;
  Bounds.Add( Along( i_rPose, 0 ) );
  Bounds.Add( Along( i_rPose, i_Length ) );
  return IsPose( i_rPose ) && Bounds.Sphere( o_rPoint );
}

bool PointOfRecord( const VSubjectGroup& i_rGroup, const VSubjectRecord& i_rRecord, VScenePoint& o_rPoint )
{
  VBounds Bounds;
  for ( std::uint32_t Index = 0; Index < i_rRecord.Markers.Count; ++Index )
  {
    Bounds.Add( i_rGroup.Markers[i_rRecord.Markers.First + Index] );
  }
  for ( std::uint32_t Index = i_rRecord.Bones.First; Index < i_rRecord.Bones.First + i_rRecord.Bones.Count; ++Index )
  {
    if ( IsPose( i_rGroup.Poses[Index] ) )
    {
      Bounds.Add( Along( i_rGroup.Poses[Index], 0 ) );
      Bounds.Add( Along( i_rGroup.Poses[Index], i_rGroup.Bones[Index].Length ) );
    }
  }
  if ( Bounds.Sphere( o_rPoint ) )
  {
    return true;
  }
  o_rPoint = Along( i_rRecord.Root, 0 );
  o_rPoint.Radius = RadiusOfAnything;
  return IsPose( i_rRecord.Root );
}
} // namespace

void VSubjectDirectory::Build( const VSubjectGroup& i_rGroup )
{
  m_Entries.clear();
  for ( std::uint32_t Record = 0; Record < i_rGroup.Records.size(); ++Record )
  {
    m_Entries.emplace_back( i_rGroup.Records[Record].Item.Object, Record );
  }
  std::sort( m_Entries.begin(), m_Entries.end() );
}

bool VSubjectDirectory::Find( std::uint64_t i_Id, std::uint32_t& o_rRecord ) const
{
  const auto It = std::lower_bound( m_Entries.begin(), m_Entries.end(), std::pair( i_Id, std::uint32_t{ 0 } ) );
  if ( It == m_Entries.end() || It->first != i_Id )
  {
    return false;
  }
  o_rRecord = It->second;
  return true;
}

VSubjectMembers::VSubjectMembers( EPart i_Part, const VSubjectGroup& i_rGroup, const ISubjectSelectionMaker& i_rMaker,
                                  const VSubjectDirectory& i_rDirectory )
  : m_Part( i_Part )
  , m_rGroup( i_rGroup )
  , m_rMaker( i_rMaker )
  , m_rDirectory( i_rDirectory )
{
}

std::uint32_t VSubjectMembers::Count() const
{
  const std::size_t Counts[] = { m_rGroup.Records.size(), m_rGroup.MarkerNames.size(), m_rGroup.Sticks.size(),
                                 m_rGroup.Bones.size() };
  return static_cast< std::uint32_t >( Counts[m_Part] );
}

VSubjectRange VSubjectMembers::RangeOf( const VSubjectRecord& i_rRecord ) const
{
  switch ( m_Part )
  {
  case EMarkers:
    return i_rRecord.Markers;
  case ESticks:
    return i_rRecord.Sticks;
  case EBones:
    return i_rRecord.Bones;
  default:
    return { static_cast< std::uint32_t >( &i_rRecord - m_rGroup.Records.data() ), 1 };
  }
}

const VSubjectRecord* VSubjectMembers::RecordOf( std::uint32_t i_Index ) const
{
  if ( i_Index >= Count() )
  {
    return nullptr;
  }
  // The last record that begins at or before the index; empty ones lie before the one that holds it.
  const auto Above = std::upper_bound( m_rGroup.Records.begin(), m_rGroup.Records.end(), i_Index,
                                       [&]( std::uint32_t i_Left, const VSubjectRecord& i_rRight )
                                       {
                                         return i_Left < RangeOf( i_rRight ).First;
                                       } );
  return Above == m_rGroup.Records.begin() ? nullptr : &*( Above - 1 );
}

bool VSubjectMembers::ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const
{
  const VSubjectRecord* const pRecord = RecordOf( i_Index );
  if ( !pRecord )
  {
    return false;
  }
  const std::uint32_t Number = i_Index - RangeOf( *pRecord ).First;
  if ( m_Part == EMarkers )
  {
    o_rItem = m_rMaker.MarkerItem( *pRecord, m_rGroup.MarkerNames[i_Index], Number );
  }
  else
  {
    o_rItem = m_Part == EBones ? m_rMaker.BoneItem( *pRecord, m_rGroup.BoneNames[i_Index], Number ) : pRecord->Item;
  }
  o_rLabel = o_rItem.Device;
  return true;
}

VSubjectRange VSubjectMembers::FindAll( const ZEK::VSelectionItem& i_rItem ) const
{
  const bool bParts = m_Part == EMarkers || ( m_Part == EBones && m_rMaker.BoneKind() == ZEK::ESelectSegment );
  const std::uint32_t Kind = m_Part == EMarkers ? std::uint32_t{ ZEK::ESelectMarker }
                             : bParts           ? m_rMaker.BoneKind()
                                                : m_rMaker.ObjectKind();
  std::uint32_t Record = 0;
  if ( i_rItem.Kind != Kind || !m_rDirectory.Find( i_rItem.Object, Record ) )
  {
    return {};
  }
  const VSubjectRange Range = RangeOf( m_rGroup.Records[Record] );
  // The numbers say which; a text, that it is this object's and no other's of the same id.
  if ( !bParts )
  {
    return i_rItem.Device.empty() || i_rItem == m_rGroup.Records[Record].Item ? Range : VSubjectRange{};
  }
  ZEK::VSelectionItem Own;
  std::string Label;
  const bool bOwn = i_rItem.Sub < Range.Count && ResolveIndex( Range.First + i_rItem.Sub, Own, Label );
  return bOwn && ( i_rItem.Device.empty() || Own == i_rItem ) ? VSubjectRange{ Range.First + i_rItem.Sub, 1 }
                                                              : VSubjectRange{};
}

bool VSubjectMembers::FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const
{
  // An object is found as its record, not as one of its parts.
  const bool bParts =
      m_Part == ERecords || m_Part == EMarkers || ( m_Part == EBones && m_rMaker.BoneKind() == ZEK::ESelectSegment );
  const VSubjectRange Found = bParts ? FindAll( i_rItem ) : VSubjectRange{};
  o_rIndex = Found.First;
  return Found.Count != 0;
}

bool VSubjectMembers::GetPoint( std::uint32_t i_Index, VScenePoint& o_rPoint ) const
{
  if ( i_Index >= Count() )
  {
    return false;
  }
  switch ( m_Part )
  {
  case EMarkers:
    o_rPoint = m_rGroup.Markers[i_Index];
    if ( !IsPlace( o_rPoint ) )
    {
      o_rPoint = m_rGroup.Solved[i_Index];
    }
    return IsPlace( o_rPoint );
  case EBones:
    return PointOfBone( m_rGroup.Poses[i_Index], m_rGroup.Bones[i_Index].Length, o_rPoint );
  case ERecords:
    return PointOfRecord( m_rGroup, m_rGroup.Records[i_Index], o_rPoint );
  default:
    return false;
  }
}

bool VSubjectMembers::GetPose( std::uint32_t i_Index, MoxelGraphics::VScenePose& o_rPose ) const
{
  if ( i_Index >= Count() || ( m_Part != EBones && m_Part != ERecords ) )
  {
    return false;
  }
  const VBonePose& rPose = m_Part == EBones ? m_rGroup.Poses[i_Index] : m_rGroup.Records[i_Index].Root;
  o_rPose = {};
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    for ( std::size_t Column = 0; Column < 4; ++Column )
    {
      o_rPose.Matrix[4 * Column + Row] = rPose[4 * Row + Column];
    }
  }
  return IsPose( rPose );
}

} // namespace Flow2Graphics

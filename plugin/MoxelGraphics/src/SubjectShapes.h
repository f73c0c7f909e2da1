#pragma once

// Where the objects of a group of subjects stand, kind by kind. Each kind tells for its object i: the geometry (false
// when it is not to be drawn), the selection id, the flags and the colour. Nothing here trusts an index of the group.

#include <MoxelGraphics/VSubjectGroup.h>

#include <algorithm>
#include <array>
#include <bit>
#include <cmath>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace MoxelGraphics
{

constexpr float BoneJointRadius = 5.0F; // mm
constexpr float TargetRadius = 5.0F;    // mm
constexpr float AxisLength = 50.0F;     // mm
constexpr float StickRadius = 3.5F;     // mm
constexpr float MarkerRadius = 7.0F;    // mm, of a marker that brings none
constexpr float EllipsoidSigmas = 2.0F;

/// A transform by its columns, without the last row.
using VColumns = std::array< float, 12 >;
/// A stick.
struct VEnds
{
  std::array< float, 3 > A, B;
};

/// Where no view reaches.
constexpr float Away = 1e18F;
constexpr VColumns NowhereColumns{ 0, 0, 0, 0, 0, 0, 0, 0, 0, Away, Away, Away };
constexpr VEnds NowhereEnds{ { Away, Away, Away }, { Away, Away, Away } };

inline bool IsPlace( const VScenePoint& i_rPoint )
{
  const float Sum = i_rPoint.X * 0 + i_rPoint.Y * 0 + i_rPoint.Z * 0;
  return Sum == 0.0F;
}
inline bool IsPose( const VBonePose& i_rPose )
{
  // Four sums side by side: one alone would be a chain of waiting.
  std::array< float, 4 > Sums{};
  for ( std::size_t Row = 0; Row < 12; Row += 4 )
  {
    for ( std::size_t Column = 0; Column < 4; ++Column )
    {
      Sums[Column] += i_rPose[Row + Column] * 0;
    }
  }
  return ( Sums[0] + Sums[1] ) + ( Sums[2] + Sums[3] ) == 0.0F;
}
/// The pose as columns, its axes scaled.
inline VColumns ToColumns( const VBonePose& i_rPose, float i_X, float i_YZ )
{
  const VBonePose& P = i_rPose;
  return { P[0] * i_X,  P[4] * i_X,  P[8] * i_X,   P[1] * i_YZ, P[5] * i_YZ, P[9] * i_YZ,
           P[2] * i_YZ, P[6] * i_YZ, P[10] * i_YZ, P[3],        P[7],        P[11] };
}

/// Flags of the objects of one kind as they are drawn: their own and, when the current subject is to be told by its
/// parts, those of the current subject; else the current subject looks as any other that is selected.
class VSubjectFlags
{
public:
  /// `i_pRange` is what a record has of the objects.
  void Update( const VSubjectGroup& i_rGroup, const VSubjectIds& i_rIds, std::size_t i_Count,
               VSubjectRange VSubjectRecord::*i_pRange, bool i_bHighlightCurrent );
  std::uint8_t At( std::size_t i_Index ) const { return i_Index < m_Flags.size() ? m_Flags[i_Index] : std::uint8_t{}; }
  /// Empty when nothing is marked.
  const std::vector< std::uint8_t >& All() const { return m_Flags; }
  bool AnyMarked() const { return !m_Flags.empty(); }
  std::uint32_t First() const { return m_First; }
  /// The id of an object; 0 for none.
  std::uint32_t Id( std::size_t i_Index ) const
  {
    return m_First == 0 ? 0 : m_First + static_cast< std::uint32_t >( i_Index );
  }
  /// Grows when anything here became another.
  std::uint64_t Generation() const { return m_Generation; }

private:
  std::vector< std::uint8_t > m_Flags;
  std::array< std::uint64_t, 5 > m_Seen{};
  std::uint32_t m_First = 0;
  std::uint64_t m_Generation = 0;
};

struct VStickShapes
{
  using VGeometry = VEnds;
  const VSubjectGroup& rGroup;
  const VSubjectFlags& rFlags;
  bool bDuringGaps = false;

  std::size_t Count() const { return rGroup.Sticks.size(); }
  /// What `Make` does for a stick whose ends were both seen, at less cost; false for any other.
  bool MakeWhole( std::size_t i_Index, VEnds& o_rEnds ) const
  {
    const VSubjectStick& rStick = rGroup.Sticks[i_Index];
    if ( rStick.A >= rGroup.Markers.size() || rStick.B >= rGroup.Markers.size() )
    {
      return false;
    }
    const VScenePoint& rA = rGroup.Markers[rStick.A];
    const VScenePoint& rB = rGroup.Markers[rStick.B];
    o_rEnds = { { rA.X, rA.Y, rA.Z }, { rB.X, rB.Y, rB.Z } };
    return ( ( rA.X + rA.Y ) + ( rA.Z + rB.X ) + ( rB.Y + rB.Z ) ) * 0 == 0;
  }
  bool Make( std::size_t i_Index, VEnds& o_rEnds ) const
  {
    const VSubjectStick& rStick = rGroup.Sticks[i_Index];
    return End( rStick.A, o_rEnds.A ) && End( rStick.B, o_rEnds.B );
  }
  std::uint32_t Id( std::size_t i_Index ) const { return rFlags.Id( i_Index ); }
  std::uint8_t Flags( std::size_t i_Index ) const { return rFlags.At( i_Index ); }

private:
  bool End( std::uint32_t i_Marker, std::array< float, 3 >& o_rPlace ) const
  {
    if ( i_Marker >= rGroup.Markers.size() )
    {
      return false;
    }
    const VScenePoint* pPoint = &rGroup.Markers[i_Marker];
    if ( !IsPlace( *pPoint ) )
    {
      if ( !bDuringGaps || i_Marker >= rGroup.Solved.size() || !IsPlace( rGroup.Solved[i_Marker] ) )
      {
        return false;
      }
      pPoint = &rGroup.Solved[i_Marker];
    }
    o_rPlace = { pPoint->X, pPoint->Y, pPoint->Z };
    return true;
  }
};

struct VBoneShapes
{
  using VGeometry = VColumns;
  const VSubjectGroup& rGroup;
  const VSubjectFlags& rFlags;

  std::size_t Count() const { return std::min( rGroup.Bones.size(), rGroup.Poses.size() ); }
  bool Make( std::size_t i_Index, VColumns& o_rColumns ) const
  {
    // Long bones are no thicker than a limb, short ones no thinner than a finger.
    constexpr float Thinnest = 60.0F, Thickest = 400.0F, Longest = 1e6F;
    const float Length = rGroup.Bones[i_Index].Length;
    const VBonePose& rPose = rGroup.Poses[i_Index];
    if ( !( Length > 0 && Length < Longest ) || !IsPose( rPose ) )
    {
      return false;
    }
    o_rColumns = ToColumns( rPose, Length, std::clamp( Length, Thinnest, Thickest ) );
    return true;
  }
  /// Makes a bone no thinner than a radius, so that it can be hit.
  static void Widen( VColumns& io_rColumns, float i_Radius )
  {
    constexpr float HalfWidth = 0.07F;
    const float Square =
        io_rColumns[3] * io_rColumns[3] + io_rColumns[4] * io_rColumns[4] + io_rColumns[5] * io_rColumns[5];
    const float Wanted = i_Radius / HalfWidth;
    if ( Square > 0 && Square < Wanted * Wanted )
    {
      const float Factor = Wanted / std::sqrt( Square );
      for ( std::size_t Index = 3; Index < 9; ++Index )
      {
        io_rColumns[Index] *= Factor;
      }
    }
  }
  std::uint32_t Id( std::size_t i_Index ) const { return rFlags.Id( i_Index ); }
  std::uint8_t Flags( std::size_t i_Index ) const { return rFlags.At( i_Index ); }
};

struct VJointShapes
{
  using VGeometry = VScenePoint;
  const VSubjectGroup& rGroup;
  const VSubjectFlags& rFlags;

  std::size_t Count() const { return std::min( rGroup.Bones.size(), rGroup.Poses.size() ); }
  bool Make( std::size_t i_Index, VScenePoint& o_rSphere ) const
  {
    const VBonePose& rPose = rGroup.Poses[i_Index];
    o_rSphere = { rPose[3], rPose[7], rPose[11], BoneJointRadius };
    return IsPose( rPose );
  }
  std::uint32_t Id( std::size_t i_Index ) const { return rFlags.Id( i_Index ); }
  std::uint8_t Flags( std::size_t i_Index ) const { return rFlags.At( i_Index ); }
  std::uint32_t Colour( std::size_t i_Index ) const;
};

struct VAxisShapes
{
  using VGeometry = VColumns;
  const VSubjectGroup& rGroup;
  const VSubjectFlags& rFlags;

  std::size_t Count() const { return std::min( rGroup.Bones.size(), rGroup.Poses.size() ); }
  bool Make( std::size_t i_Index, VColumns& o_rColumns ) const
  {
    o_rColumns = ToColumns( rGroup.Poses[i_Index], AxisLength, AxisLength );
    return IsPose( rGroup.Poses[i_Index] );
  }
  std::uint32_t Id( std::size_t i_Index ) const { return rFlags.Id( i_Index ); }
  std::uint8_t Flags( std::size_t i_Index ) const { return rFlags.At( i_Index ); }
  std::uint32_t Colour( std::size_t ) const { return 0xFFFFFFFF; }
};

/// Origins say which subject they belong to, as its skin does.
struct VOriginShapes
{
  using VGeometry = VColumns;
  const VSubjectGroup& rGroup;
  bool bHighlightCurrent = true;

  std::size_t Count() const { return rGroup.Records.size(); }
  bool Make( std::size_t i_Index, VColumns& o_rColumns ) const
  {
    o_rColumns = ToColumns( rGroup.Records[i_Index].Root, AxisLength, AxisLength );
    return IsPose( rGroup.Records[i_Index].Root );
  }
  std::uint32_t Id( std::size_t i_Index ) const { return rGroup.Records[i_Index].Id; }
  std::uint8_t Flags( std::size_t i_Index ) const;
  std::uint32_t Colour( std::size_t ) const { return 0xFFFFFFFF; }
};

struct VTargetShapes
{
  using VGeometry = VScenePoint;
  const VSubjectGroup& rGroup;
  const VSubjectFlags& rFlags;

  std::size_t Count() const { return rGroup.Targets.size(); }
  bool Make( std::size_t i_Index, VScenePoint& o_rSphere ) const;
  std::uint32_t Id( std::size_t i_Index ) const { return rFlags.Id( rGroup.Targets[i_Index].Marker ); }
  std::uint8_t Flags( std::size_t i_Index ) const { return rFlags.At( rGroup.Targets[i_Index].Marker ); }
  std::uint32_t Colour( std::size_t i_Index ) const;
};

struct VCovarianceShapes
{
  using VGeometry = VColumns;
  const VSubjectGroup& rGroup;
  const VSubjectFlags& rFlags;

  std::size_t Count() const { return rGroup.Targets.size(); }
  bool Make( std::size_t i_Index, VColumns& o_rColumns ) const;
  std::uint32_t Id( std::size_t i_Index ) const { return rFlags.Id( rGroup.Targets[i_Index].Marker ); }
  std::uint8_t Flags( std::size_t i_Index ) const { return rFlags.At( rGroup.Targets[i_Index].Marker ); }
  std::uint32_t Colour( std::size_t i_Index ) const;
};

/// Markers that were not seen, where the model has them.
struct VMissingShapes
{
  using VGeometry = VScenePoint;
  const VSubjectGroup& rGroup;
  const VSubjectFlags& rFlags;
  bool bOwnRadius = true;
  float Scale = 1;

  std::size_t Count() const { return std::min( rGroup.Markers.size(), rGroup.Solved.size() ); }
  bool Make( std::size_t i_Index, VScenePoint& o_rSphere ) const
  {
    o_rSphere = rGroup.Solved[i_Index];
    o_rSphere.Radius = Scale * ( bOwnRadius && o_rSphere.Radius > 0 ? o_rSphere.Radius : MarkerRadius );
    return !IsPlace( rGroup.Markers[i_Index] ) && IsPlace( o_rSphere ) && o_rSphere.Radius < Away;
  }
  std::uint32_t Id( std::size_t i_Index ) const { return rFlags.Id( i_Index ); }
  std::uint8_t Flags( std::size_t i_Index ) const { return rFlags.At( i_Index ); }
  std::uint32_t Colour( std::size_t i_Index ) const;
  /// What these depend on; the last part is free.
  std::array< std::uint64_t, 4 > Key() const
  {
    const std::uint64_t Sizing = std::uint64_t{ std::bit_cast< std::uint32_t >( Scale ) } << 1;
    return { rGroup.StructureGeneration, rGroup.MarkerGeneration, Sizing | ( bOwnRadius ? 1U : 0U ), 0 };
  }
  /// At most how many there are.
  std::size_t Missing() const
  {
    return static_cast< std::size_t >( std::count_if( rGroup.Markers.begin(), rGroup.Markers.end(),
                                                      []( const VScenePoint& i_rPoint )
                                                      {
                                                        return !IsPlace( i_rPoint );
                                                      } ) );
  }
};

/// The axes of an ellipsoid from a covariance (mm², row by row), each `i_Sigmas` long; false for what is no covariance
/// or none at all.
bool EllipsoidAxes( const std::array< float, 9 >& i_rCovariance, float i_Sigmas,
                    std::array< std::array< double, 3 >, 3 >& o_rAxes );

/// A colour a marker; white where there is none.
std::uint32_t MarkerColour( const VSubjectGroup& i_rGroup, std::size_t i_Marker );

} // namespace MoxelGraphics

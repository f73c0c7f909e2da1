#include "SubjectShapes.h"

#include <CoreGraphics/VVertexLayout.h>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
using VMatrix = std::array< std::array< double, 3 >, 3 >;

constexpr std::uint8_t MarkFlags =
    CoreGraphics::EInstanceSelected | CoreGraphics::EInstancePreselected | CoreGraphics::EInstancePrimary;

/// Turns the symmetric matrix so that its element (p, q) becomes 0, and the vectors, which are columns, with it.
void Rotate( VMatrix& io_rMatrix, VMatrix& io_rVectors, std::size_t i_P, std::size_t i_Q )
{
  VMatrix& M = io_rMatrix;
  if ( M[i_P][i_Q] == 0 )
  {
    return;
  }
  const double Theta = ( M[i_Q][i_Q] - M[i_P][i_P] ) / ( 2 * M[i_P][i_Q] );
  const double Tangent = ( Theta < 0 ? -1.0 : 1.0 ) / ( std::abs( Theta ) + std::sqrt( Theta * Theta + 1 ) );
  const double Cosine = 1 / std::sqrt( Tangent * Tangent + 1 ), Sine = Tangent * Cosine;
  for ( std::size_t K = 0; K < 3; ++K )
  {
    const double A = M[K][i_P], B = M[K][i_Q];
    M[K][i_P] = Cosine * A - Sine * B;
    M[K][i_Q] = Sine * A + Cosine * B;
  }
  for ( std::size_t K = 0; K < 3; ++K )
  {
    const double A = M[i_P][K], B = M[i_Q][K];
    M[i_P][K] = Cosine * A - Sine * B;
    M[i_Q][K] = Sine * A + Cosine * B;
    const double C = io_rVectors[K][i_P], D = io_rVectors[K][i_Q];
    io_rVectors[K][i_P] = Cosine * C - Sine * D;
    io_rVectors[K][i_Q] = Sine * C + Cosine * D;
  }
}

std::uint32_t BoneColour( const VSubjectGroup& i_rGroup, std::size_t i_Bone )
{
  return i_Bone < i_rGroup.Bones.size() ? i_rGroup.Bones[i_Bone].Colour : 0xFFFFFFFF;
}

/// Where a bone carries a point.
VScenePoint Carried( const VBonePose& i_rPose, const std::array< float, 3 >& i_rLocal )
{
  const auto Row = [&]( std::size_t i_Row )
  {
    const float* pRow = i_rPose.data() + 4 * i_Row;
    return pRow[0] * i_rLocal[0] + pRow[1] * i_rLocal[1] + pRow[2] * i_rLocal[2] + pRow[3];
  };
  return { Row( 0 ), Row( 1 ), Row( 2 ), TargetRadius };
}
} // namespace

void VSubjectFlags::Update( const VSubjectGroup& i_rGroup, const VSubjectIds& i_rIds, std::size_t i_Count,
                            VSubjectRange VSubjectRecord::*i_pRange, bool i_bHighlightCurrent )
{
  const std::array< std::uint64_t, 5 > Seen{ i_rIds.Generation, i_rGroup.RecordGeneration, i_rGroup.StructureGeneration,
                                             i_Count, i_bHighlightCurrent ? 2U : 1U };
  if ( Seen == m_Seen && m_First == i_rIds.First )
  {
    return;
  }
  m_Seen = Seen;
  m_First = i_rIds.First;
  ++m_Generation;
  const bool bOwn = i_rIds.Flags.size() == i_Count;
  m_Flags.clear();
  if ( bOwn )
  {
    m_Flags.assign( i_rIds.Flags.begin(), i_rIds.Flags.end() );
  }
  for ( const VSubjectRecord& rRecord : i_rGroup.Records )
  {
    if ( ( rRecord.Flags & CoreGraphics::EInstancePrimary ) == 0 || ( !i_bHighlightCurrent && !bOwn ) )
    {
      continue;
    }
    m_Flags.resize( i_Count );
    const VSubjectRange& rRange = rRecord.*i_pRange;
    const std::size_t First = std::min< std::size_t >( rRange.First, i_Count );
    const std::size_t End = First + std::min< std::size_t >( rRange.Count, i_Count - First );
    for ( std::size_t Index = First; Index < End; ++Index )
    {
      const int Flags = i_bHighlightCurrent ? m_Flags[Index] | ( rRecord.Flags & MarkFlags )
                                            : m_Flags[Index] & ~CoreGraphics::EInstancePrimary;
      m_Flags[Index] = static_cast< std::uint8_t >( Flags );
    }
  }
  if ( std::none_of( m_Flags.begin(), m_Flags.end(),
                     []( std::uint8_t i_Flags )
                     {
                       return ( i_Flags & MarkFlags ) != 0;
                     } ) )
  {
    m_Flags.clear();
  }
}

std::uint8_t VOriginShapes::Flags( std::size_t i_Index ) const
{
  const std::uint8_t Flags = rGroup.Records[i_Index].Flags & MarkFlags;
  return static_cast< std::uint8_t >( bHighlightCurrent ? Flags : Flags & ~CoreGraphics::EInstancePrimary );
}

std::uint32_t VJointShapes::Colour( std::size_t i_Index ) const
{
  return BoneColour( rGroup, i_Index );
}

bool VTargetShapes::Make( std::size_t i_Index, VScenePoint& o_rSphere ) const
{
  const VSubjectTarget& rTarget = rGroup.Targets[i_Index];
  if ( rTarget.Bone >= rGroup.Poses.size() || rTarget.Marker >= rGroup.Markers.size() )
  {
    return false;
  }
  o_rSphere = Carried( rGroup.Poses[rTarget.Bone], rTarget.Local );
  return IsPlace( o_rSphere );
}

std::uint32_t VTargetShapes::Colour( std::size_t i_Index ) const
{
  return MarkerColour( rGroup, rGroup.Targets[i_Index].Marker );
}

bool VCovarianceShapes::Make( std::size_t i_Index, VColumns& o_rColumns ) const
{
  const VSubjectTarget& rTarget = rGroup.Targets[i_Index];
  VMatrix Axes;
  if ( rTarget.Bone >= rGroup.Poses.size() || rTarget.Marker >= rGroup.Markers.size() ||
       !IsPose( rGroup.Poses[rTarget.Bone] ) || !EllipsoidAxes( rTarget.Covariance, EllipsoidSigmas, Axes ) )
  {
    return false;
  }
  const VBonePose& rPose = rGroup.Poses[rTarget.Bone];
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    for ( std::size_t Row = 0; Row < 3; ++Row )
    {
      const double Value =
          rPose[4 * Row] * Axes[Axis][0] + rPose[4 * Row + 1] * Axes[Axis][1] + rPose[4 * Row + 2] * Axes[Axis][2];
      o_rColumns[3 * Axis + Row] = static_cast< float >( Value );
    }
  }
  const VScenePoint Middle = Carried( rPose, rTarget.Local );
  o_rColumns[9] = Middle.X;
  o_rColumns[10] = Middle.Y;
  o_rColumns[11] = Middle.Z;
  return IsPlace( Middle );
}

std::uint32_t VCovarianceShapes::Colour( std::size_t i_Index ) const
{
  return MarkerColour( rGroup, rGroup.Targets[i_Index].Marker );
}

std::uint32_t VMissingShapes::Colour( std::size_t i_Index ) const
{
  return MarkerColour( rGroup, i_Index );
}

std::uint32_t MarkerColour( const VSubjectGroup& i_rGroup, std::size_t i_Marker )
{
  return i_Marker < i_rGroup.MarkerColours.size() ? i_rGroup.MarkerColours[i_Marker] : 0xFFFFFFFF;
}

bool EllipsoidAxes( const std::array< float, 9 >& i_rCovariance, float i_Sigmas,
                    std::array< std::array< double, 3 >, 3 >& o_rAxes )
{
  constexpr double Largest = 1e12;   // mm²; more is no covariance of a place
  constexpr double Tolerance = 1e-4; // of the largest element, for what rounding left
  constexpr double Thinnest = 0.25;  // mm; what is known exactly in a direction is still to be seen from the side
  const auto At = [&]( std::size_t i_Row, std::size_t i_Column )
  {
    return static_cast< double >( i_rCovariance[3 * i_Row + i_Column] );
  };
  double Greatest = 0;
  for ( const float Value : i_rCovariance )
  {
    if ( !( std::abs( Value ) < Largest ) )
    {
      return false;
    }
    Greatest = std::max( Greatest, static_cast< double >( std::abs( Value ) ) );
  }
  VMatrix Matrix, Vectors{ { { 1, 0, 0 }, { 0, 1, 0 }, { 0, 0, 1 } } };
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    for ( std::size_t Column = 0; Column < 3; ++Column )
    {
      if ( std::abs( At( Row, Column ) - At( Column, Row ) ) > Tolerance * Greatest )
      {
        return false;
      }
      Matrix[Row][Column] = 0.5 * ( At( Row, Column ) + At( Column, Row ) );
    }
  }
  for ( int Sweep = 0; Sweep < 8; ++Sweep )
  {
    Rotate( Matrix, Vectors, 0, 1 );
    Rotate( Matrix, Vectors, 0, 2 );
    Rotate( Matrix, Vectors, 1, 2 );
  }
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    const double Variance = Matrix[Axis][Axis];
    if ( !( Greatest > 0 ) || Variance < -Tolerance * Greatest )
    {
      return false;
    }
    const double Length = std::max( i_Sigmas * std::sqrt( std::max( Variance, 0.0 ) ), Thinnest );
    o_rAxes[Axis] = { Length * Vectors[0][Axis], Length * Vectors[1][Axis], Length * Vectors[2][Axis] };
  }
  // A mirrored ellipsoid would show its inside.
  const VMatrix& A = o_rAxes;
  const double Volume = A[0][0] * ( A[1][1] * A[2][2] - A[1][2] * A[2][1] ) -
                        A[0][1] * ( A[1][0] * A[2][2] - A[1][2] * A[2][0] ) +
                        A[0][2] * ( A[1][0] * A[2][1] - A[1][1] * A[2][0] );
  if ( Volume < 0 )
  {
    o_rAxes[2] = { -A[2][0], -A[2][1], -A[2][2] };
  }
  return true;
}

} // namespace MoxelGraphics

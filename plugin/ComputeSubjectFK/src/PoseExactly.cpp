#include "PoseData.h"
#include "RotationVector.h"

#include <cmath>

namespace ComputeSubject
{
namespace
{
/// Whether the loops had a turn of this square for certain: near the border they may have rounded it to the other side.
bool IsWithin( double i_Square )
{
  return 0.25 * i_Square <= 0.9 * MostHalfTurnSquared;
}

/// Whether the loops had it, and else its rotation.
bool TurnOf( EPoseKind i_Kind, const double* i_pState, double* o_pTurn )
{
  switch ( i_Kind )
  {
  case EPoseFree:
  case EPoseBall:
    if ( IsWithin( Dot( i_pState, i_pState ) ) )
    {
      return false;
    }
    RotationFromVector( i_pState, o_pTurn );
    return true;
  case EPoseHardySpicer:
  case EPoseHinge:
  {
    const bool bTwo = i_Kind == EPoseHardySpicer;
    const double A = i_pState[0], B = bTwo ? i_pState[1] : 0;
    if ( IsWithin( A * A ) && IsWithin( B * B ) )
    {
      return false;
    }
    const double Sa = std::sin( A ), Ca = std::cos( A ), Sb = std::sin( B ), Cb = std::cos( B );
    const double Turn[9] = { Ca * Cb, -Sa, Ca * Sb, Sa * Cb, Ca, Sa * Sb, -Sb, 0, Cb };
    for ( int Index = 0; Index < 9; ++Index )
    {
      o_pTurn[Index] = Turn[Index];
    }
    return true;
  }
  default:
    return false;
  }
}
} // namespace

void PoseExactly( EPoseKind i_Kind, const VPoseTree& i_rTree, const double* i_pState, double* o_pResults )
{
  for ( std::uint32_t Block = 0; Block < i_rTree.BlockCounts[i_Kind]; ++Block )
  {
    const VPoseBlock& rBlock = i_rTree.pBlocks[i_Kind][Block];
    for ( int Lane = 0; Lane < PoseLanes; ++Lane )
    {
      double Turn[9], Fixed[9], Product[9];
      const double* pState = i_pState + rBlock.State[Lane];
      if ( !TurnOf( i_Kind, pState, Turn ) )
      {
        continue;
      }
      for ( int Index = 0; Index < 9; ++Index )
      {
        Fixed[Index] = rBlock.Fixed[Index][Lane];
      }
      Multiply( Fixed, Turn, Product );
      double* pRows = o_pResults + 12 * std::size_t( rBlock.Segment[Lane] );
      for ( int Index = 0; Index < 9; ++Index )
      {
        pRows[Index / 3 * 4 + Index % 3] = Product[Index];
      }
    }
  }
}

} // namespace ComputeSubject

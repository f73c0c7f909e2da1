#pragma once

#include <CoreMoxelTypes/Basic.h>

#include <algorithm>

namespace ComputeSubject
{

/// A rotation row by row, applied to column vectors, then a translation in mm. Starts as all zeros.
struct VRigidTransform
{
  double m_Rotation[9] = {};
  double m_Translation[3] = {};

  static VRigidTransform Identity()
  {
    VRigidTransform Result;
    Result.m_Rotation[0] = Result.m_Rotation[4] = Result.m_Rotation[8] = 1;
    return Result;
  }
  static VRigidTransform From( const CoreMoxelTypes::Rigid& i_rRigid )
  {
    VRigidTransform Result;
    std::copy_n( i_rRigid.R, 9, Result.m_Rotation );
    std::copy_n( i_rRigid.T, 3, Result.m_Translation );
    return Result;
  }
  CoreMoxelTypes::Rigid ToRigid() const
  {
    CoreMoxelTypes::Rigid Result;
    std::copy_n( m_Rotation, 9, Result.R );
    std::copy_n( m_Translation, 3, Result.T );
    return Result;
  }

  /// First `i_rB`, then `i_rA`.
  friend VRigidTransform operator*( const VRigidTransform& i_rA, const VRigidTransform& i_rB )
  {
    VRigidTransform Result;
    for ( int Row = 0; Row < 3; ++Row )
    {
      const double* pA = i_rA.m_Rotation + 3 * Row;
      for ( int Column = 0; Column < 3; ++Column )
      {
        const double* pB = i_rB.m_Rotation + Column;
        Result.m_Rotation[3 * Row + Column] = pA[0] * pB[0] + pA[1] * pB[3] + pA[2] * pB[6];
      }
      const double* pT = i_rB.m_Translation;
      Result.m_Translation[Row] = pA[0] * pT[0] + pA[1] * pT[1] + pA[2] * pT[2] + i_rA.m_Translation[Row];
    }
    return Result;
  }
  friend bool operator==( const VRigidTransform& i_rA, const VRigidTransform& i_rB )
  {
    return std::equal( i_rA.m_Rotation, i_rA.m_Rotation + 9, i_rB.m_Rotation ) &&
           std::equal( i_rA.m_Translation, i_rA.m_Translation + 3, i_rB.m_Translation );
  }

  /// The place of a point that moves with the transform, and the turned direction.
  void Place( const double i_Local[3], double o_World[3] ) const
  {
    Turn( i_Local, o_World );
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      o_World[Axis] += m_Translation[Axis];
    }
  }
  void Turn( const double i_Local[3], double o_World[3] ) const
  {
    for ( int Row = 0; Row < 3; ++Row )
    {
      const double* pRow = m_Rotation + 3 * Row;
      o_World[Row] = pRow[0] * i_Local[0] + pRow[1] * i_Local[1] + pRow[2] * i_Local[2];
    }
  }
  bool IsFinite() const;
  /// Whether the rows are of length 1 and at right angles, right-handed, to within `i_Tolerance` an element of the
  /// product with the transpose.
  bool IsRotation( double i_Tolerance ) const;
};
static_assert( sizeof( VRigidTransform ) == 12 * sizeof( double ) );

} // namespace ComputeSubject

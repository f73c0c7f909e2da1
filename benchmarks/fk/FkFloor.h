#pragma once

// The same kinematics as a plain loop: parents first, parent times fixed times joint.
namespace FkFloor
{

constexpr int Segments = 21, Degrees = 66;
/// Of the free root and the 20 balls.
constexpr int Parents[Segments] = { -1, 0, 1, 2, 3, 4, 5, 4, 7, 8, 9, 4, 11, 12, 13, 0, 15, 16, 0, 18, 19 };

struct alignas( 32 ) VRigid
{
  double R[9], T[3];
};

void FromRotationVector( const double* i_pVector, double* o_pRotation );
/// From 66 numbers, the root's rotation vector, its translation and the rotation vectors of the others.
void Plain( const double* i_pState, const VRigid* i_pFixed, VRigid* o_pWorld );

} // namespace FkFloor

#include "FkFloor.h"

#include <cmath>
#include <cstring>

namespace FkFloor
{
namespace
{
inline void Turn( const VRigid& i_rA, const double* i_pB, VRigid& o_rProduct )
{
  for ( int Row = 0; Row < 3; ++Row )
  {
    const double* pA = i_rA.R + 3 * Row;
    for ( int Column = 0; Column < 3; ++Column )
    {
      o_rProduct.R[3 * Row + Column] = pA[0] * i_pB[Column] + pA[1] * i_pB[3 + Column] + pA[2] * i_pB[6 + Column];
    }
    o_rProduct.T[Row] = i_rA.T[Row];
  }
}

inline void Compose( const VRigid& i_rA, const VRigid& i_rB, VRigid& o_rProduct )
{
  Turn( i_rA, i_rB.R, o_rProduct );
  for ( int Row = 0; Row < 3; ++Row )
  {
    const double* pA = i_rA.R + 3 * Row;
    o_rProduct.T[Row] = pA[0] * i_rB.T[0] + pA[1] * i_rB.T[1] + pA[2] * i_rB.T[2] + i_rA.T[Row];
  }
}

inline void Rotation( const double* i_pV, double* o_pR )
{
  const double N = std::sqrt( i_pV[0] * i_pV[0] + i_pV[1] * i_pV[1] + i_pV[2] * i_pV[2] );
  if ( N < 2.220446049250313e-15 )
  {
    const double Identity[9] = { 1, 0, 0, 0, 1, 0, 0, 0, 1 };
    std::memcpy( o_pR, Identity, sizeof Identity );
    return;
  }
  const double S = std::sin( N ), C = std::cos( N ), I = 1 / N;
  const double X = i_pV[0] * I, Y = i_pV[1] * I, Z = i_pV[2] * I, D = 1 - C;
  const double Dx = D * X, Dy = D * Y, Dz = D * Z;
  o_pR[0] = Dx * X + C;
  o_pR[1] = Dx * Y - S * Z;
  o_pR[2] = Dx * Z + S * Y;
  o_pR[3] = Dy * X + S * Z;
  o_pR[4] = Dy * Y + C;
  o_pR[5] = Dy * Z - S * X;
  o_pR[6] = Dz * X - S * Y;
  o_pR[7] = Dz * Y + S * X;
  o_pR[8] = Dz * Z + C;
}
} // namespace

void FromRotationVector( const double* i_pVector, double* o_pRotation )
{
  Rotation( i_pVector, o_pRotation );
}

void Plain( const double* i_pState, const VRigid* i_pFixed, VRigid* o_pWorld )
{
  VRigid Joint, Fixed;
  Rotation( i_pState, Joint.R );
  std::memcpy( Joint.T, i_pState + 3, sizeof Joint.T );
  Compose( i_pFixed[0], Joint, o_pWorld[0] );
  i_pState += 6;
  for ( int Segment = 1; Segment < Segments; ++Segment, i_pState += 3 )
  {
    Rotation( i_pState, Joint.R );
    Compose( o_pWorld[Parents[Segment]], i_pFixed[Segment], Fixed );
    Turn( Fixed, Joint.R, o_pWorld[Segment] );
  }
}

} // namespace FkFloor

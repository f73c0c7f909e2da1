#pragma once

#include <HarrowPluginInterface/VMeshScene.h>

#include <cmath>
#include <cstddef>

namespace HarrowPluginInterface
{

inline VMeshTransform operator*( const VMeshTransform& i_rA, const VMeshTransform& i_rB )
{
  VMeshTransform Product{};
  for ( std::size_t Row = 0; Row < 12; Row += 4 )
  {
    for ( std::size_t Column = 0; Column < 4; ++Column )
    {
      Product[Row + Column] = i_rA[Row] * i_rB[Column] + i_rA[Row + 1] * i_rB[4 + Column] +
                              i_rA[Row + 2] * i_rB[8 + Column] + ( Column == 3 ? i_rA[Row + 3] : 0.0 );
    }
  }
  return Product;
}

template < typename TValue >
std::array< TValue, 3 > MovePoint( const VMeshTransform& i_rTransform, const std::array< TValue, 3 >& i_rPoint )
{
  std::array< TValue, 3 > Moved;
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    const double* const pRow = i_rTransform.data() + 4 * Row;
    Moved[Row] =
        static_cast< TValue >( pRow[0] * i_rPoint[0] + pRow[1] * i_rPoint[1] + pRow[2] * i_rPoint[2] + pRow[3] );
  }
  return Moved;
}

/// The adjugate of the upper 3 by 3, row by row: the inverse times the determinant.
inline std::array< double, 9 > MeshAdjugate( const VMeshTransform& i_rM )
{
  return { i_rM[5] * i_rM[10] - i_rM[6] * i_rM[9], i_rM[2] * i_rM[9] - i_rM[1] * i_rM[10],
           i_rM[1] * i_rM[6] - i_rM[2] * i_rM[5],  i_rM[6] * i_rM[8] - i_rM[4] * i_rM[10],
           i_rM[0] * i_rM[10] - i_rM[2] * i_rM[8], i_rM[2] * i_rM[4] - i_rM[0] * i_rM[6],
           i_rM[4] * i_rM[9] - i_rM[5] * i_rM[8],  i_rM[1] * i_rM[8] - i_rM[0] * i_rM[9],
           i_rM[0] * i_rM[5] - i_rM[1] * i_rM[4] };
}

inline double MeshDeterminant( const VMeshTransform& i_rM )
{
  const std::array< double, 9 > Adjugate = MeshAdjugate( i_rM );
  return i_rM[0] * Adjugate[0] + i_rM[1] * Adjugate[3] + i_rM[2] * Adjugate[6];
}

/// False, with nothing written, when it flattens space, or is not finite.
inline bool InvertMesh( const VMeshTransform& i_rTransform, VMeshTransform& o_rInverse )
{
  const std::array< double, 9 > Adjugate = MeshAdjugate( i_rTransform );
  const double Determinant = MeshDeterminant( i_rTransform );
  if ( !std::isfinite( 1.0 / Determinant ) || !std::isfinite( Determinant ) )
  {
    return false;
  }
  VMeshTransform Inverse{};
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    for ( std::size_t Column = 0; Column < 3; ++Column )
    {
      Inverse[4 * Row + Column] = Adjugate[3 * Row + Column] / Determinant;
      Inverse[4 * Row + 3] -= Inverse[4 * Row + Column] * i_rTransform[4 * Column + 3];
    }
  }
  o_rInverse = Inverse;
  return true;
}

/// Scale, then rotation (a quaternion x, y, z, w of unit length), then translation.
inline VMeshTransform ComposeMesh( const std::array< double, 3 >& i_rPosition, const std::array< double, 4 >& i_rTurn,
                                   const std::array< double, 3 >& i_rScale )
{
  const auto [X, Y, Z, W] = i_rTurn;
  const std::array< double, 9 > Turn{ 1 - 2 * ( Y * Y + Z * Z ), 2 * ( X * Y - Z * W ),     2 * ( X * Z + Y * W ),
                                      2 * ( X * Y + Z * W ),     1 - 2 * ( X * X + Z * Z ), 2 * ( Y * Z - X * W ),
                                      2 * ( X * Z - Y * W ),     2 * ( Y * Z + X * W ),     1 - 2 * ( X * X + Y * Y ) };
  VMeshTransform Composed{};
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    for ( std::size_t Column = 0; Column < 3; ++Column )
    {
      Composed[4 * Row + Column] = Turn[3 * Row + Column] * i_rScale[Column];
    }
    Composed[4 * Row + 3] = i_rPosition[Row];
  }
  return Composed;
}

} // namespace HarrowPluginInterface

#pragma once

#include "PoseData.h"

namespace ComputeSubject
{

using VLanes = double __attribute__( ( vector_size( PoseLanes * sizeof( double ) ) ) );
using VFlags = long long __attribute__( ( vector_size( PoseLanes * sizeof( double ) ) ) );
/// The loops of a pose. `TProcessor` is a type of the including source alone, so that its instance stays there too.
///
/// First each joint's fixed transform times its moving part, four joints of a kind at a time. Turns are taken by half
/// their angle h, whose sin h / h and cos h are polynomials of h²: neither root nor quotient, and no turn is no special
/// case. Then from root to leaf, four columns at a time.
template < typename TProcessor >
struct VPoseKernel
{
  /// Elements of a lane's transform: rotation row by row, then translation.
  struct VTransforms
  {
    VLanes E[12];
  };

  // From and to any place: neither states nor results need to stand where vectors would.
  static VLanes Load( const double* i_pFrom )
  {
    VLanes Value;
    __builtin_memcpy( &Value, i_pFrom, sizeof Value );
    return Value;
  }
  static void Store( double* o_pTo, VLanes i_Value ) { __builtin_memcpy( o_pTo, &i_Value, sizeof i_Value ); }
  static VLanes Splat( double i_Value ) { return VLanes{ i_Value, i_Value, i_Value, i_Value }; }
  static VLanes Number( const VPoseBlock& i_rBlock, const double* i_pState, int i_Which )
  {
    const double* p = i_pState + i_Which;
    return VLanes{ p[i_rBlock.State[0]], p[i_rBlock.State[1]], p[i_rBlock.State[2]], p[i_rBlock.State[3]] };
  }

  /// sin h / h and cos h from y = h². Off by less than 4e-17 before rounding.
  static void Half( VLanes i_Y, VLanes& o_rSinc, VLanes& o_rCos )
  {
    const VLanes Y = i_Y, Y2 = Y * Y, Y4 = Y2 * Y2;
    const VLanes S = ( ( -0.16666666666666666 + 0.008333333333333314 * Y ) +
                       ( -0.0001984126984125376 + 2.7557319218837673e-06 * Y ) * Y2 ) +
                     ( ( -2.505210757580932e-08 + 1.605897465969838e-10 * Y ) +
                       ( -7.643886158204389e-13 + 2.730402537561207e-15 * Y ) * Y2 ) *
                         Y4;
    const VLanes C =
        ( ( -0.5 + 0.041666666666666304 * Y ) + ( -0.001388888888885841 + 2.4801587291829438e-05 * Y ) * Y2 ) +
        ( ( -2.755731768929377e-07 + 2.0876625841954573e-09 * Y ) +
          ( -1.146453049361302e-11 + 4.625701609891324e-14 * Y ) * Y2 ) *
            Y4;
    o_rSinc = 1 + S * Y;
    o_rCos = 1 + C * Y;
  }

  static void SinCos( VLanes i_Angle, VFlags& io_rBeyond, VLanes& o_rSin, VLanes& o_rCos )
  {
    const VLanes H = 0.5 * i_Angle, Y = H * H;
    VLanes Sinc, Cos;
    Half( Y, Sinc, Cos );
    const VLanes Sin = H * Sinc;
    io_rBeyond |= ~( Y <= MostHalfTurnSquared );
    o_rSin = 2 * Sin * Cos;
    o_rCos = 1 - 2 * Sin * Sin;
  }

  /// A row of the fixed rotation times the moving one.
  static void Row( const double ( &i_rFixed )[12][PoseLanes], int i_Row, const VLanes ( &i_rMoving )[9],
                   VTransforms& o_rProduct )
  {
    const VLanes A = Load( i_rFixed[3 * i_Row] ), B = Load( i_rFixed[3 * i_Row + 1] ),
                 C = Load( i_rFixed[3 * i_Row + 2] );
    o_rProduct.E[3 * i_Row] = A * i_rMoving[0] + B * i_rMoving[3] + C * i_rMoving[6];
    o_rProduct.E[3 * i_Row + 1] = A * i_rMoving[1] + B * i_rMoving[4] + C * i_rMoving[7];
    o_rProduct.E[3 * i_Row + 2] = A * i_rMoving[2] + B * i_rMoving[5] + C * i_rMoving[8];
  }
  static void KeepTranslation( const VPoseBlock& i_rBlock, VTransforms& o_rProduct )
  {
    o_rProduct.E[9] = Load( i_rBlock.Fixed[9] );
    o_rProduct.E[10] = Load( i_rBlock.Fixed[10] );
    o_rProduct.E[11] = Load( i_rBlock.Fixed[11] );
  }

  static void Ball( const VPoseBlock& i_rBlock, const double* i_pState, VFlags& io_rBeyond, VTransforms& o_rProduct )
  {
    const VLanes Vx = Number( i_rBlock, i_pState, 0 ), Vy = Number( i_rBlock, i_pState, 1 ),
                 Vz = Number( i_rBlock, i_pState, 2 );
    const VLanes Square = Vx * Vx + Vy * Vy + Vz * Vz, Y = 0.25 * Square;
    constexpr double Least = 2.220446049250313e-15 * 2.220446049250313e-15;
    VLanes Sinc, W;
    Half( Y, Sinc, W );
    io_rBeyond |= ~( Y <= MostHalfTurnSquared );
    const VLanes Factor = Square < Least ? Splat( 0 ) : 0.5 * Sinc;
    // The unit quaternion X, Y, Z, W; its products are doubled once.
    const VLanes X = Factor * Vx, U = Factor * Vy, Z = Factor * Vz;
    const VLanes X2 = X + X, U2 = U + U, Z2 = Z + Z;
    const VLanes Xx = X * X2, Yy = U * U2, Zz = Z * Z2, Xy = X * U2, Xz = X * Z2, Yz = U * Z2;
    const VLanes Wx = W * X2, Wy = W * U2, Wz = W * Z2;
    const VLanes Moving[9] = { 1 - ( Yy + Zz ), Xy - Wz, Xz + Wy, Xy + Wz,        1 - ( Xx + Zz ),
                               Yz - Wx,         Xz - Wy, Yz + Wx, 1 - ( Xx + Yy ) };
    Row( i_rBlock.Fixed, 0, Moving, o_rProduct );
    Row( i_rBlock.Fixed, 1, Moving, o_rProduct );
    Row( i_rBlock.Fixed, 2, Moving, o_rProduct );
    KeepTranslation( i_rBlock, o_rProduct );
  }

  static void Free( const VPoseBlock& i_rBlock, const double* i_pState, VFlags& io_rBeyond, VTransforms& o_rProduct )
  {
    Ball( i_rBlock, i_pState, io_rBeyond, o_rProduct );
    const VLanes X = Number( i_rBlock, i_pState, 3 ), Y = Number( i_rBlock, i_pState, 4 ),
                 Z = Number( i_rBlock, i_pState, 5 );
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      o_rProduct.E[9 + Axis] += Load( i_rBlock.Fixed[3 * Axis] ) * X + Load( i_rBlock.Fixed[3 * Axis + 1] ) * Y +
                                Load( i_rBlock.Fixed[3 * Axis + 2] ) * Z;
    }
  }

  static void HardySpicer( const VPoseBlock& i_rBlock, const double* i_pState, VFlags& io_rBeyond,
                           VTransforms& o_rProduct )
  {
    VLanes Sa, Ca, Sb, Cb;
    SinCos( Number( i_rBlock, i_pState, 0 ), io_rBeyond, Sa, Ca );
    SinCos( Number( i_rBlock, i_pState, 1 ), io_rBeyond, Sb, Cb );
    const VLanes Moving[9] = { Ca * Cb, -Sa, Ca * Sb, Sa * Cb, Ca, Sa * Sb, -Sb, Splat( 0 ), Cb };
    Row( i_rBlock.Fixed, 0, Moving, o_rProduct );
    Row( i_rBlock.Fixed, 1, Moving, o_rProduct );
    Row( i_rBlock.Fixed, 2, Moving, o_rProduct );
    KeepTranslation( i_rBlock, o_rProduct );
  }

  static void Hinge( const VPoseBlock& i_rBlock, const double* i_pState, VFlags& io_rBeyond, VTransforms& o_rProduct )
  {
    VLanes S, C;
    SinCos( Number( i_rBlock, i_pState, 0 ), io_rBeyond, S, C );
    for ( int Element = 0; Element < 9; Element += 3 )
    {
      const VLanes A = Load( i_rBlock.Fixed[Element] ), B = Load( i_rBlock.Fixed[Element + 1] );
      o_rProduct.E[Element] = A * C + B * S;
      o_rProduct.E[Element + 1] = B * C - A * S;
      o_rProduct.E[Element + 2] = Load( i_rBlock.Fixed[Element + 2] );
    }
    KeepTranslation( i_rBlock, o_rProduct );
  }

  static void Slider( const VPoseBlock& i_rBlock, const double* i_pState, VFlags&, VTransforms& o_rProduct )
  {
    const VLanes Distance = Number( i_rBlock, i_pState, 0 );
    for ( int Element = 0; Element < 9; ++Element )
    {
      o_rProduct.E[Element] = Load( i_rBlock.Fixed[Element] );
    }
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      o_rProduct.E[9 + Axis] = Load( i_rBlock.Fixed[9 + Axis] ) + o_rProduct.E[3 * Axis + 2] * Distance;
    }
  }

  /// To each lane's segment, as rows of rotation and translation.
  static void Scatter( const VPoseBlock& i_rBlock, const VTransforms& i_rProduct, double* o_pResults )
  {
    for ( int Row = 0; Row < 3; ++Row )
    {
      const VLanes A = i_rProduct.E[3 * Row], B = i_rProduct.E[3 * Row + 1], C = i_rProduct.E[3 * Row + 2],
                   D = i_rProduct.E[9 + Row];
      const VLanes LowAB = __builtin_shufflevector( A, B, 0, 4, 2, 6 ),
                   LowCD = __builtin_shufflevector( C, D, 0, 4, 2, 6 );
      const VLanes HighAB = __builtin_shufflevector( A, B, 1, 5, 3, 7 ),
                   HighCD = __builtin_shufflevector( C, D, 1, 5, 3, 7 );
      double* pTo = o_pResults + 4 * Row;
      Store( pTo + 12 * std::size_t( i_rBlock.Segment[0] ), __builtin_shufflevector( LowAB, LowCD, 0, 1, 4, 5 ) );
      Store( pTo + 12 * std::size_t( i_rBlock.Segment[1] ), __builtin_shufflevector( HighAB, HighCD, 0, 1, 4, 5 ) );
      Store( pTo + 12 * std::size_t( i_rBlock.Segment[2] ), __builtin_shufflevector( LowAB, LowCD, 2, 3, 6, 7 ) );
      Store( pTo + 12 * std::size_t( i_rBlock.Segment[3] ), __builtin_shufflevector( HighAB, HighCD, 2, 3, 6, 7 ) );
    }
  }

  template < auto Joints >
  static void EachBlock( EPoseKind i_Kind, const VPoseTree& i_rTree, const double* i_pState, double* o_pResults )
  {
    VFlags Beyond = {};
    const VPoseBlock* pEnd = i_rTree.pBlocks[i_Kind] + i_rTree.BlockCounts[i_Kind];
    for ( const VPoseBlock* pBlock = i_rTree.pBlocks[i_Kind]; pBlock != pEnd; ++pBlock )
    {
      VTransforms Product;
      Joints( *pBlock, i_pState, Beyond, Product );
      Scatter( *pBlock, Product, o_pResults );
    }
    if ( ( Beyond[0] | Beyond[1] | Beyond[2] | Beyond[3] ) != 0 )
    {
      PoseExactly( i_Kind, i_rTree, i_pState, o_pResults );
    }
  }

  static VLanes TimesRows( const double* i_pParent, int i_Row, VLanes i_A, VLanes i_B, VLanes i_C )
  {
    constexpr VFlags Translation = { 0, 0, 0, -1 };
    const double* pRow = i_pParent + 3 * i_Row;
    const VLanes Moved = Translation ? Splat( i_pParent[9 + i_Row] ) : Splat( 0 );
    return ( Splat( pRow[0] ) * i_A + Splat( pRow[1] ) * i_B ) + ( Splat( pRow[2] ) * i_C + Moved );
  }

  static void Run( const VPoseTree& i_rTree, const double* i_pState, double* o_pResults )
  {
    EachBlock< Free >( EPoseFree, i_rTree, i_pState, o_pResults );
    EachBlock< Ball >( EPoseBall, i_rTree, i_pState, o_pResults );
    EachBlock< HardySpicer >( EPoseHardySpicer, i_rTree, i_pState, o_pResults );
    EachBlock< Hinge >( EPoseHinge, i_rTree, i_pState, o_pResults );
    EachBlock< Slider >( EPoseSlider, i_rTree, i_pState, o_pResults );
    for ( std::uint32_t Index = 0; Index < i_rTree.StillCount; ++Index )
    {
      const VPoseStill& rStill = i_rTree.pStills[Index];
      double* pTo = o_pResults + 12 * std::size_t( rStill.Segment );
      Store( pTo, Load( rStill.Rows ) );
      Store( pTo + 4, Load( rStill.Rows + 4 ) );
      Store( pTo + 8, Load( rStill.Rows + 8 ) );
    }
    for ( std::uint32_t Segment = 0; Segment < i_rTree.SegmentCount; ++Segment )
    {
      double* pResult = o_pResults + 12 * std::size_t( Segment );
      VLanes A = Load( pResult ), B = Load( pResult + 4 ), C = Load( pResult + 8 );
      if ( const std::int32_t Parent = i_rTree.pParents[Segment]; Parent >= 0 )
      {
        const double* pParent = o_pResults + 12 * std::size_t( Parent );
        const VLanes Row0 = TimesRows( pParent, 0, A, B, C ), Row1 = TimesRows( pParent, 1, A, B, C );
        C = TimesRows( pParent, 2, A, B, C );
        A = Row0;
        B = Row1;
      }
      // Rows without their fourth number, which the next store covers.
      Store( pResult, A );
      Store( pResult + 3, B );
      Store( pResult + 6, C );
      pResult[9] = A[3];
      pResult[10] = B[3];
      pResult[11] = C[3];
    }
  }
};

} // namespace ComputeSubject

#include "Colours.h"

#include <cmath>
#include <cstdlib>
#include <vector>

namespace CoreVideoUtils
{
using namespace CoreMoxelTypes;

namespace
{
/// Places mirrored at the rims, so that they keep their colour; a line of one pixel has that pixel alone.
int Mirrored( int i_Place, int i_Last )
{
  return std::max( i_Last - std::abs( i_Last - std::abs( i_Place ) ), 0 );
}

u8 Mean( int i_Sum, int i_Count )
{
  return static_cast< u8 >( ( i_Sum + i_Count / 2 ) / i_Count );
}

u8 Level( double i_Value )
{
  return static_cast< u8 >( std::lround( std::clamp( i_Value, 0.0, 255.0 ) ) );
}

/// Factors of 65536.
struct VRules
{
  VRules( double i_Kr, double i_Kb )
    : RedOfV( Factor( 2 * ( 1 - i_Kr ) ) )
    , BlueOfU( Factor( 2 * ( 1 - i_Kb ) ) )
    , GreenOfV( Factor( 2 * ( 1 - i_Kr ) * i_Kr / ( 1 - i_Kr - i_Kb ) ) )
    , GreenOfU( Factor( 2 * ( 1 - i_Kb ) * i_Kb / ( 1 - i_Kr - i_Kb ) ) )
  {
  }
  static int Factor( double i_Weight ) { return static_cast< int >( std::lround( i_Weight * 65536 * 255 / 224 ) ); }
  static constexpr int Luma = 76309; // 65536 * 255 / 219

  int RedOfV, BlueOfU, GreenOfV, GreenOfU;
};

u8 FromFixed( int i_Value )
{
  return static_cast< u8 >( std::clamp( ( i_Value + 32768 ) >> 16, 0, 255 ) );
}

/// One of the two chroma channels.
struct VChroma
{
  const u8* pFirst = nullptr;
  std::size_t Stride = 0;
  int Step = 1; ///< bytes from one value to the next
  int Columns = 0, Rows = 0;
  bool bPlanar = false;

  /// Of one row of pixels, 16 times as large.
  void Row( int i_Y, std::vector< int >& o_rValues ) const
  {
    const int OwnRow = bPlanar ? i_Y / 2 : i_Y;
    const int OtherRow = bPlanar ? std::clamp( i_Y & 1 ? OwnRow + 1 : OwnRow - 1, 0, Rows - 1 ) : OwnRow;
    const u8* const pOwn = pFirst + Stride * static_cast< std::size_t >( OwnRow );
    const u8* const pOther = pFirst + Stride * static_cast< std::size_t >( OtherRow );
    for ( int X = 0; X < static_cast< int >( o_rValues.size() ); ++X )
    {
      const int Own = X / 2 * Step;
      const int Other = bPlanar ? std::clamp( X & 1 ? X / 2 + 1 : X / 2 - 1, 0, Columns - 1 ) * Step : Own;
      o_rValues[static_cast< std::size_t >( X )] = 9 * pOwn[Own] + 3 * pOwn[Other] + 3 * pOther[Own] + pOther[Other];
    }
  }
};

std::array< VChroma, 2 > ChromaOf( const VVideoFrame& i_rFrame, const VVideoPlanes& i_rPlanes )
{
  const auto& [rFirst, rSecond, rThird] = i_rPlanes.Planes;
  const int Columns = static_cast< int >( ( i_rFrame.Width + 1 ) / 2 ), Rows = static_cast< int >( rSecond.Rows );
  switch ( i_rFrame.Format )
  {
  case EPixelFormat::YUYV:
    return { { { rFirst.pData + 1, rFirst.Stride, 4, Columns }, { rFirst.pData + 3, rFirst.Stride, 4, Columns } } };
  case EPixelFormat::UYVY:
    return { { { rFirst.pData, rFirst.Stride, 4, Columns }, { rFirst.pData + 2, rFirst.Stride, 4, Columns } } };
  case EPixelFormat::NV12:
    return { { { rSecond.pData, rSecond.Stride, 2, Columns, Rows, true },
               { rSecond.pData + 1, rSecond.Stride, 2, Columns, Rows, true } } };
  default:
    return { { { rSecond.pData, rSecond.Stride, 1, Columns, Rows, true },
               { rThird.pData, rThird.Stride, 1, Columns, Rows, true } } };
  }
}
} // namespace

void YuvToRgba( const VVideoFrame& i_rFrame, const VVideoPlanes& i_rPlanes, u8* o_pRgba )
{
  const VRules Rules = i_rFrame.Height < HighDefinitionLines ? VRules( 0.299, 0.114 ) : VRules( 0.2126, 0.0722 );
  const auto Chroma = ChromaOf( i_rFrame, i_rPlanes );
  const bool bPacked = FamilyOf( i_rFrame.Format ) == EPixelFamily::YUV;
  const std::size_t Step = bPacked ? 2 : 1, Start = i_rFrame.Format == EPixelFormat::UYVY ? 1 : 0;
  const VVideoPlane& rLuma = i_rPlanes.Planes[0];
  std::vector< int > U( i_rFrame.Width ), V( i_rFrame.Width );
  for ( u32 Y = 0; Y < i_rFrame.Height; ++Y )
  {
    Chroma[0].Row( static_cast< int >( Y ), U );
    Chroma[1].Row( static_cast< int >( Y ), V );
    const u8* pLuma = rLuma.pData + rLuma.Stride * Y + Start;
    for ( u32 X = 0; X < i_rFrame.Width; ++X, pLuma += Step, o_pRgba += 4 )
    {
      const int Luma = Rules.Luma * ( *pLuma - 16 );
      const int Blue = U[X] - 16 * 128, Red = V[X] - 16 * 128;
      o_pRgba[0] = FromFixed( Luma + Rules.RedOfV * Red / 16 );
      o_pRgba[1] = FromFixed( Luma - ( Rules.GreenOfU * Blue + Rules.GreenOfV * Red ) / 16 );
      o_pRgba[2] = FromFixed( Luma + Rules.BlueOfU * Blue / 16 );
      o_pRgba[3] = 255;
    }
  }
}

void MosaicToRgba( const VVideoPlane& i_rMosaic, const std::array< int, 2 >& i_rPhase, u8* o_pRgba )
{
  const int LastX = static_cast< int >( i_rMosaic.RowBytes ) - 1, LastY = static_cast< int >( i_rMosaic.Rows ) - 1;
  for ( int Y = 0; Y <= LastY; ++Y )
  {
    const auto Row = [&]( int i_Y )
    {
      return i_rMosaic.pData + i_rMosaic.Stride * static_cast< std::size_t >( Mirrored( i_Y, LastY ) );
    };
    const u8 *const pAbove = Row( Y - 1 ), *const pRow = Row( Y ), *const pBelow = Row( Y + 1 );
    const bool bRedRow = ( ( Y ^ i_rPhase[1] ) & 1 ) == 0;
    for ( int X = 0; X <= LastX; ++X, o_pRgba += 4 )
    {
      const int Left = Mirrored( X - 1, LastX ), Right = Mirrored( X + 1, LastX );
      const u8 Own = pRow[X];
      const u8 Beside = Mean( pRow[Left] + pRow[Right], 2 ), Over = Mean( pAbove[X] + pBelow[X], 2 );
      const u8 Cross = Mean( pRow[Left] + pRow[Right] + pAbove[X] + pBelow[X], 4 );
      const u8 Corners = Mean( pAbove[Left] + pAbove[Right] + pBelow[Left] + pBelow[Right], 4 );
      const bool bRedColumn = ( ( X ^ i_rPhase[0] ) & 1 ) == 0;
      o_pRgba[0] = bRedRow ? bRedColumn ? Own : Beside : bRedColumn ? Over : Corners;
      o_pRgba[1] = bRedRow == bRedColumn ? Cross : Own;
      o_pRgba[2] = bRedRow ? bRedColumn ? Corners : Over : bRedColumn ? Beside : Own;
      o_pRgba[3] = 255;
    }
  }
}

void BgraToMosaic( const u8* i_pBgra, u32 i_Width, u32 i_Height, const std::array< int, 2 >& i_rPhase, u8* o_pMosaic )
{
  for ( u32 Y = 0; Y < i_Height; ++Y )
  {
    const u32 RowPart = ( Y ^ static_cast< u32 >( i_rPhase[1] ) ) & 1;
    for ( u32 X = 0; X < i_Width; ++X, i_pBgra += 4 )
    {
      // Red lies two bytes behind blue: one step for each turn of column and row away from it.
      *o_pMosaic++ = i_pBgra[2 - ( ( X ^ static_cast< u32 >( i_rPhase[0] ) ) & 1 ) - RowPart];
    }
  }
}

void BgraToI422HighDefinition( const u8* i_pBgra, u32 i_Width, u32 i_Height, u8* o_pY, u8* o_pU, u8* o_pV )
{
  constexpr double Kr = 0.2126, Kb = 0.0722, Kg = 1 - Kr - Kb, LumaScale = 219.0 / 255, ChromaScale = 224.0 / 255;
  for ( u32 Y = 0; Y < i_Height; ++Y )
  {
    for ( u32 X = 0; X < i_Width; X += 2 )
    {
      double Blue = 0, Red = 0;
      const u32 Count = std::min( i_Width - X, 2u );
      for ( u32 Pixel = 0; Pixel < Count; ++Pixel, i_pBgra += 4 )
      {
        const double Luma = Kb * i_pBgra[0] + Kg * i_pBgra[1] + Kr * i_pBgra[2];
        *o_pY++ = Level( 16 + LumaScale * Luma );
        Blue += i_pBgra[0] - Luma;
        Red += i_pBgra[2] - Luma;
      }
      *o_pU++ = Level( 128 + ChromaScale * Blue / ( 2 * ( 1 - Kb ) * Count ) );
      *o_pV++ = Level( 128 + ChromaScale * Red / ( 2 * ( 1 - Kr ) * Count ) );
    }
  }
}

} // namespace CoreVideoUtils

#pragma once

#include <CoreMoxelTypes/Camera.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstddef>
#include <memory>
#include <random>
#include <vector>

// Video frames for tests, and what colour each of their pixels has: in double precision, from the definitions.

namespace TestSupport
{

using VReferenceColour = std::array< double, 3 >; ///< R, G, B; 0 to 255

/// Reads frames of any format and layout. Chroma of planar formats lies between the pixels that share it.
class VVideoReference
{
public:
  explicit VVideoReference( const CoreMoxelTypes::VVideoFrame& i_rFrame )
    : m_rFrame( i_rFrame )
  {
  }

  /// Of a pixel as it is stored, whatever the flags.
  VReferenceColour At( int i_X, int i_Y ) const
  {
    using enum CoreMoxelTypes::EPixelFormat;
    switch ( m_rFrame.Format )
    {
    case Luminance8:
      return Grey( Byte( 0, i_X, i_Y ) );
    case Luminance16:
      return Grey( ( Byte( 0, 2 * i_X, i_Y ) + 256 * Byte( 0, 2 * i_X + 1, i_Y ) ) / 257 );
    case YUYV:
      return FromYuv( Byte( 0, 2 * i_X, i_Y ), Byte( 0, i_X / 2 * 4 + 1, i_Y ), Byte( 0, i_X / 2 * 4 + 3, i_Y ) );
    case UYVY:
      return FromYuv( Byte( 0, 2 * i_X + 1, i_Y ), Byte( 0, i_X / 2 * 4, i_Y ), Byte( 0, i_X / 2 * 4 + 2, i_Y ) );
    case I420:
      return FromYuv( Byte( 0, i_X, i_Y ), Chroma( 1, 1, 0, i_X, i_Y ), Chroma( 2, 1, 0, i_X, i_Y ) );
    case NV12:
      return FromYuv( Byte( 0, i_X, i_Y ), Chroma( 1, 2, 0, i_X, i_Y ), Chroma( 1, 2, 1, i_X, i_Y ) );
    default:
      return Mosaic( i_X, i_Y );
    }
  }

private:
  int Width() const { return static_cast< int >( m_rFrame.Width ); }
  int Height() const { return static_cast< int >( m_rFrame.Height ); }
  static VReferenceColour Grey( double i_Level ) { return { i_Level, i_Level, i_Level }; }

  double Byte( std::size_t i_Plane, int i_Place, int i_Row ) const
  {
    return ( *m_rFrame.Data )[m_rFrame.Offset[i_Plane] +
                              std::size_t{ m_rFrame.Stride[i_Plane] } * static_cast< std::size_t >( i_Row ) +
                              static_cast< std::size_t >( i_Place )];
  }
  double Chroma( std::size_t i_Plane, int i_Step, int i_Start, int i_X, int i_Y ) const
  {
    const double X = ( i_X + 0.5 ) / 2 - 0.5, Y = ( i_Y + 0.5 ) / 2 - 0.5;
    const int Left = static_cast< int >( std::floor( X ) ), Top = static_cast< int >( std::floor( Y ) );
    double Sum = 0;
    for ( const int Row : { Top, Top + 1 } )
    {
      for ( const int Column : { Left, Left + 1 } )
      {
        const double Weight = ( 1 - std::abs( X - Column ) ) * ( 1 - std::abs( Y - Row ) );
        Sum += Weight * Byte( i_Plane, std::clamp( Column, 0, ( Width() - 1 ) / 2 ) * i_Step + i_Start,
                              std::clamp( Row, 0, ( Height() - 1 ) / 2 ) );
      }
    }
    return Sum;
  }
  VReferenceColour FromYuv( double i_Y, double i_U, double i_V ) const
  {
    const double Kr = Height() < 720 ? 0.299 : 0.2126, Kb = Height() < 720 ? 0.114 : 0.0722;
    const double Luma = ( i_Y - 16 ) * 255 / 219, Blue = ( i_U - 128 ) * 255 / 224, Red = ( i_V - 128 ) * 255 / 224;
    const double R = Luma + 2 * ( 1 - Kr ) * Red, B = Luma + 2 * ( 1 - Kb ) * Blue;
    const double G = ( Luma - Kr * R - Kb * B ) / ( 1 - Kr - Kb );
    return { std::clamp( R, 0.0, 255.0 ), std::clamp( G, 0.0, 255.0 ), std::clamp( B, 0.0, 255.0 ) };
  }
  /// 0, 1 or 2: what the sensor sees at a place.
  int Channel( int i_X, int i_Y ) const
  {
    const int Place = static_cast< int >( m_rFrame.Format ) - 2;
    return ( ( i_X + Place ) & 1 ) + ( ( i_Y + Place / 2 ) & 1 );
  }
  /// The mean of the pixels around that are of a colour; at the rims the picture goes on as in a mirror.
  VReferenceColour Mosaic( int i_X, int i_Y ) const
  {
    VReferenceColour Sum{}, Count{};
    for ( int Dy = -1; Dy <= 1; ++Dy )
    {
      for ( int Dx = -1; Dx <= 1; ++Dx )
      {
        const int X = i_X + Dx < 0 ? 1 : i_X + Dx >= Width() ? Width() - 2 : i_X + Dx;
        const int Y = i_Y + Dy < 0 ? 1 : i_Y + Dy >= Height() ? Height() - 2 : i_Y + Dy;
        const auto Which = static_cast< std::size_t >( Channel( i_X + Dx, i_Y + Dy ) );
        const auto Own = static_cast< std::size_t >( Channel( i_X, i_Y ) );
        if ( Which != Own || ( Dx == 0 && Dy == 0 ) )
        {
          Sum[Which] += Byte( 0, X, Y );
          ++Count[Which];
        }
      }
    }
    return { Sum[0] / Count[0], Sum[1] / Count[1], Sum[2] / Count[2] };
  }

  const CoreMoxelTypes::VVideoFrame& m_rFrame;
};

/// A frame of noise, its planes apart from one another and its rows longer than they need be.
inline CoreMoxelTypes::VVideoFrame NoiseFrame( CoreMoxelTypes::EPixelFormat i_Format, std::uint32_t i_Width,
                                               std::uint32_t i_Height, unsigned i_Seed )
{
  using enum CoreMoxelTypes::EPixelFormat;
  const bool bTwoBytes = i_Format == Luminance16 || i_Format == YUYV || i_Format == UYVY;
  const std::uint32_t Even = ( i_Width + 1 ) / 2 * 2;
  CoreMoxelTypes::VVideoFrame Frame;
  Frame.Format = i_Format;
  Frame.Width = i_Width;
  Frame.Height = i_Height;
  Frame.Stride[0] = ( bTwoBytes ? 2 * Even : i_Width ) + 7;
  Frame.Stride[1] = ( i_Format == NV12 ? Even : Even / 2 ) + 5;
  Frame.Stride[2] = Even / 2 + 3;
  Frame.Offset[0] = 11;
  Frame.Offset[1] = Frame.Offset[0] + Frame.Stride[0] * i_Height;
  Frame.Offset[2] = Frame.Offset[1] + Frame.Stride[1] * ( ( i_Height + 1 ) / 2 );
  std::vector< CoreMoxelTypes::u8 > Bytes( Frame.Offset[2] + Frame.Stride[2] * ( ( i_Height + 1 ) / 2 ) );
  std::mt19937 Random( i_Seed );
  std::generate( Bytes.begin(), Bytes.end(),
                 [&]
                 {
                   return static_cast< CoreMoxelTypes::u8 >( Random() >> 8 );
                 } );
  Frame.Data = std::make_shared< const std::vector< CoreMoxelTypes::u8 > >( std::move( Bytes ) );
  return Frame;
}

} // namespace TestSupport

#include "SimulatedVideo.h"

#include "SimulatedStage.h"

#include <algorithm>
#include <cmath>
#include <cstddef>
#include <mutex>
#include <utility>

using namespace CoreMoxelTypes;

namespace HostSources::Simulation
{
namespace
{

constexpr std::size_t Width = VVideoPainter::Width, Height = VVideoPainter::Height;
constexpr std::uint32_t VideoFlag = 2;

struct VColour
{
  int R = 0, G = 0, B = 0;
};

VColour ColourAt( const std::vector< u8 >& i_rPicture, std::size_t i_X, std::size_t i_Y )
{
  const u8* const pPixel = i_rPicture.data() + ( i_Y * Width + i_X ) * 3;
  return { pPixel[0], pPixel[1], pPixel[2] };
}

/// Of a square of pixels.
VColour MeanAt( const std::vector< u8 >& i_rPicture, std::size_t i_X, std::size_t i_Y, std::size_t i_Rows )
{
  VColour Sum;
  for ( std::size_t Row = 0; Row < i_Rows; ++Row )
  {
    for ( std::size_t Column = 0; Column < 2; ++Column )
    {
      const VColour Colour = ColourAt( i_rPicture, i_X + Column, i_Y + Row );
      Sum = { Sum.R + Colour.R, Sum.G + Colour.G, Sum.B + Colour.B };
    }
  }
  const int Count = static_cast< int >( 2 * i_Rows );
  return { Sum.R / Count, Sum.G / Count, Sum.B / Count };
}

u8 Light( const VColour& i_rColour )
{
  return static_cast< u8 >( ( 77 * i_rColour.R + 150 * i_rColour.G + 29 * i_rColour.B ) >> 8 );
}
u8 Luma( const VColour& i_rColour )
{
  return static_cast< u8 >( ( ( 66 * i_rColour.R + 129 * i_rColour.G + 25 * i_rColour.B + 128 ) >> 8 ) + 16 );
}
u8 ChromaB( const VColour& i_rColour )
{
  return static_cast< u8 >( ( ( -38 * i_rColour.R - 74 * i_rColour.G + 112 * i_rColour.B + 128 ) >> 8 ) + 128 );
}
u8 ChromaR( const VColour& i_rColour )
{
  return static_cast< u8 >( ( ( 112 * i_rColour.R - 94 * i_rColour.G - 18 * i_rColour.B + 128 ) >> 8 ) + 128 );
}

void PackLight( const std::vector< u8 >& i_rPicture, bool i_bWide, u8* o_pTo )
{
  for ( std::size_t Pixel = 0; Pixel < Width * Height; ++Pixel )
  {
    const u8 Grey = Light( ColourAt( i_rPicture, Pixel % Width, Pixel / Width ) );
    *o_pTo++ = Grey;
    if ( i_bWide )
    {
      *o_pTo++ = Grey; // 257 times the grey, least byte first
    }
  }
}

/// `i_RedX` and `i_RedY` tell where in a square of four the red pixel lies.
void PackBayer( const std::vector< u8 >& i_rPicture, std::size_t i_RedX, std::size_t i_RedY, u8* o_pTo )
{
  for ( std::size_t Y = 0; Y < Height; ++Y )
  {
    for ( std::size_t X = 0; X < Width; ++X )
    {
      const std::size_t Channel = ( ( X ^ i_RedX ) & 1 ) + ( ( Y ^ i_RedY ) & 1 );
      *o_pTo++ = i_rPicture[( Y * Width + X ) * 3 + Channel];
    }
  }
}

void PackPairs( const std::vector< u8 >& i_rPicture, bool i_bChromaFirst, u8* o_pTo )
{
  const std::size_t LumaAt = i_bChromaFirst ? 1 : 0, ChromaAt = 1 - LumaAt;
  for ( std::size_t Y = 0; Y < Height; ++Y )
  {
    for ( std::size_t X = 0; X < Width; X += 2, o_pTo += 4 )
    {
      const VColour Mean = MeanAt( i_rPicture, X, Y, 1 );
      o_pTo[LumaAt] = Luma( ColourAt( i_rPicture, X, Y ) );
      o_pTo[LumaAt + 2] = Luma( ColourAt( i_rPicture, X + 1, Y ) );
      o_pTo[ChromaAt] = ChromaB( Mean );
      o_pTo[ChromaAt + 2] = ChromaR( Mean );
    }
  }
}

/// Chroma of half the size, in planes of its own or in one of pairs.
void PackPlanes( const std::vector< u8 >& i_rPicture, bool i_bPairs, u8* o_pTo )
{
  for ( std::size_t Pixel = 0; Pixel < Width * Height; ++Pixel )
  {
    *o_pTo++ = Luma( ColourAt( i_rPicture, Pixel % Width, Pixel / Width ) );
  }
  const std::size_t Step = i_bPairs ? 2 : 1;
  u8* pBlue = o_pTo;
  u8* pRed = o_pTo + ( i_bPairs ? 1 : Width * Height / 4 );
  for ( std::size_t Y = 0; Y < Height; Y += 2 )
  {
    for ( std::size_t X = 0; X < Width; X += 2, pBlue += Step, pRed += Step )
    {
      const VColour Mean = MeanAt( i_rPicture, X, Y, 2 );
      *pBlue = ChromaB( Mean );
      *pRed = ChromaR( Mean );
    }
  }
}

} // namespace

struct VVideoBuffers::VBuffer
{
  std::vector< u8 > Bytes;
  alignas( std::max_align_t ) std::byte Room[128]; ///< for what counts the holders
};

struct VVideoBuffers::VShelf
{
  std::mutex Guard;
  std::size_t Made = 0;
  std::vector< std::unique_ptr< VBuffer > > Free; ///< with room for all that were made
};

/// Puts what counts the holders into the buffer itself, and the buffer back on its shelf when nobody counts any more.
template < typename T >
struct VVideoBuffers::VWithin
{
  using value_type = T;

  VWithin( VBuffer* i_pBuffer, std::shared_ptr< VShelf > i_pShelf )
    : pBuffer( i_pBuffer )
    , pShelf( std::move( i_pShelf ) )
  {
  }
  template < typename TOther >
  VWithin( const VWithin< TOther >& i_rOther )
    : pBuffer( i_rOther.pBuffer )
    , pShelf( i_rOther.pShelf )
  {
  }
  T* allocate( std::size_t )
  {
    static_assert( sizeof( T ) <= sizeof( VBuffer::Room ) );
    return reinterpret_cast< T* >( pBuffer->Room );
  }
  void deallocate( T*, std::size_t )
  {
    const std::lock_guard Lock( pShelf->Guard );
    pShelf->Free.emplace_back( pBuffer );
  }
  template < typename TOther >
  bool operator==( const VWithin< TOther >& i_rOther ) const
  {
    return pBuffer == i_rOther.pBuffer;
  }

  VBuffer* pBuffer;
  std::shared_ptr< VShelf > pShelf;
};

VVideoBuffers::VVideoBuffers()
  : m_pShelf( std::make_shared< VShelf >() )
{
}

std::shared_ptr< std::vector< u8 > > VVideoBuffers::Take( std::size_t i_Size )
{
  std::unique_ptr< VBuffer > pBuffer;
  {
    const std::lock_guard Lock( m_pShelf->Guard );
    if ( !m_pShelf->Free.empty() )
    {
      pBuffer = std::move( m_pShelf->Free.back() );
      m_pShelf->Free.pop_back();
    }
    else
    {
      m_pShelf->Free.reserve( m_pShelf->Made + 1 );
      pBuffer = std::make_unique< VBuffer >();
      ++m_pShelf->Made;
    }
  }
  pBuffer->Bytes.resize( i_Size );
  VBuffer* const pTaken = pBuffer.release();
  const auto LeaveAlone = []( std::vector< u8 >* ) {};
  return { &pTaken->Bytes, LeaveAlone, VWithin< VBuffer >( pTaken, m_pShelf ) };
}

VVideoPainter::VVideoPainter()
  : m_Stage( Width * Height * 3 )
  , m_Picture( m_Stage )
{
  for ( std::size_t Y = 0; Y < Height; ++Y )
  {
    for ( std::size_t X = 0; X < Width; ++X )
    {
      // A bluish wall above a wooden floor, both brighter in the middle.
      const double Away = std::abs( static_cast< double >( X ) / Width - 0.5 ), Shade = 1 - 0.6 * Away;
      const bool bWall = Y < Height * 2 / 5;
      u8* const pPixel = m_Stage.data() + ( Y * Width + X ) * 3;
      pPixel[0] = static_cast< u8 >( ( bWall ? 45 : 95 ) * Shade );
      pPixel[1] = static_cast< u8 >( ( bWall ? 60 : 75 ) * Shade );
      pPixel[2] = static_cast< u8 >( ( bWall ? 85 : 50 ) * Shade );
    }
  }
}

void VVideoPainter::Dot( double i_X, double i_Y, double i_Radius, std::uint32_t i_Colour )
{
  const auto From = []( double i_Place )
  {
    return static_cast< int >( std::max( i_Place, 0.0 ) );
  };
  const int Right = std::min( From( i_X + i_Radius ), static_cast< int >( Width ) - 1 );
  const int Bottom = std::min( From( i_Y + i_Radius ), static_cast< int >( Height ) - 1 );
  for ( int Y = From( i_Y - i_Radius ); Y <= Bottom; ++Y )
  {
    for ( int X = From( i_X - i_Radius ); X <= Right; ++X )
    {
      const double AwayX = X - i_X, AwayY = Y - i_Y;
      if ( AwayX * AwayX + AwayY * AwayY <= i_Radius * i_Radius )
      {
        u8* const pPixel =
            m_Picture.data() + ( static_cast< std::size_t >( Y ) * Width + static_cast< std::size_t >( X ) ) * 3;
        pPixel[0] = static_cast< u8 >( i_Colour );
        pPixel[1] = static_cast< u8 >( i_Colour >> 8 );
        pPixel[2] = static_cast< u8 >( i_Colour >> 16 );
      }
    }
  }
}

void VVideoPainter::Paint( const VSensorView& i_rView, const std::vector< VStageMarker >& i_rMarkers )
{
  std::copy( m_Stage.begin(), m_Stage.end(), m_Picture.begin() );
  for ( const VStageMarker& rMarker : i_rMarkers )
  {
    VSensorPoint Point;
    if ( i_rView.Project( rMarker.Position, Point ) )
    {
      Dot( ( Point.x - 1.5 ) / Scale, ( Point.y - 1.5 ) / Scale, std::max( MarkerRadius * Point.Scale / Scale, 1.5 ),
           rMarker.Colour );
    }
  }
}

void VVideoPainter::Pack( EPixelFormat i_Format, VVideoFrame& o_rFrame )
{
  constexpr u32 W = Width, Area = Width * Height;
  const bool bWide = i_Format == EPixelFormat::Luminance16;
  const bool bPairs = i_Format == EPixelFormat::YUYV || i_Format == EPixelFormat::UYVY;
  const bool bPlanes = i_Format == EPixelFormat::I420 || i_Format == EPixelFormat::NV12;
  const auto pData = m_Buffers.Take( bWide || bPairs ? 2 * Area : bPlanes ? Area + Area / 2 : Area );
  o_rFrame.Format = i_Format;
  o_rFrame.Width = Width;
  o_rFrame.Height = Height;
  o_rFrame.Flags = VideoFlag;
  o_rFrame.SensorScale = { Scale, Scale };
  o_rFrame.SensorOffset = { ( Scale - 1 ) / 2.0F, ( Scale - 1 ) / 2.0F };
  o_rFrame.Stride[0] = bWide || bPairs ? 2 * W : W;
  switch ( i_Format )
  {
  case EPixelFormat::Luminance8:
  case EPixelFormat::Luminance16:
    PackLight( m_Picture, bWide, pData->data() );
    break;
  case EPixelFormat::BayerRGGB8:
  case EPixelFormat::BayerGRBG8:
  case EPixelFormat::BayerGBRG8:
  case EPixelFormat::BayerBGGR8:
  {
    const auto Place = static_cast< std::size_t >( i_Format ) - static_cast< std::size_t >( EPixelFormat::BayerRGGB8 );
    PackBayer( m_Picture, Place & 1, Place >> 1, pData->data() );
    break;
  }
  case EPixelFormat::YUYV:
  case EPixelFormat::UYVY:
    PackPairs( m_Picture, i_Format == EPixelFormat::UYVY, pData->data() );
    break;
  case EPixelFormat::I420:
  case EPixelFormat::NV12:
  {
    const bool bJoined = i_Format == EPixelFormat::NV12;
    o_rFrame.Stride[1] = bJoined ? W : W / 2;
    o_rFrame.Stride[2] = bJoined ? 0 : W / 2;
    o_rFrame.Offset[1] = Area;
    o_rFrame.Offset[2] = bJoined ? 0 : Area + Area / 4;
    PackPlanes( m_Picture, bJoined, pData->data() );
    break;
  }
  }
  o_rFrame.Data = pData;
}

} // namespace HostSources::Simulation

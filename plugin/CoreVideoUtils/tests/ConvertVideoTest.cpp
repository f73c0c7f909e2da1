#include <CoreVideoUtils/ConvertVideo.h>
#include <CoreVideoUtils/VideoPlanes.h>
#include <CoreVideoUtils/VideoTestPattern.h>

#include <TestSupport/VideoReference.h>

#include <gtest/gtest.h>

namespace CoreVideoUtils
{
namespace
{
using namespace CoreMoxelTypes;
using TestSupport::VVideoReference;
using ZEK::IResult;

/// The greatest difference between what was converted and the reference.
double WorstOf( const VVideoFrame& i_rFrame, const VRgbaPicture& i_rPicture )
{
  const VVideoReference Reference( i_rFrame );
  const bool bTurned = ( i_rFrame.Flags & VideoBottomUp ) != 0;
  double Worst = 0;
  for ( u32 Y = 0; Y < i_rFrame.Height; ++Y )
  {
    for ( u32 X = 0; X < i_rFrame.Width; ++X )
    {
      const auto Expected = Reference.At( static_cast< int >( X ), static_cast< int >( Y ) );
      const u8* const pSeen =
          i_rPicture.Pixels.data() + ( ( bTurned ? i_rFrame.Height - 1 - Y : Y ) * i_rFrame.Width + X ) * 4;
      for ( std::size_t Channel = 0; Channel < 3; ++Channel )
      {
        Worst = std::max( Worst, std::abs( pSeen[Channel] - Expected[Channel] ) );
      }
      Worst = pSeen[3] == 255 ? Worst : 1000;
    }
  }
  return Worst;
}

/// Colours without sharp edges, so that halved chroma changes them little; two pixels of every row spare.
std::vector< u8 > Clouds( u32 i_Width, u32 i_Height, u32 i_Components )
{
  std::vector< u8 > Bytes( std::size_t{ i_Width + 2 } * i_Height * i_Components );
  for ( std::size_t Index = 0; Index < Bytes.size(); ++Index )
  {
    const double X = static_cast< double >( Index / i_Components % ( i_Width + 2 ) ),
                 Y = static_cast< double >( Index / i_Components / ( i_Width + 2 ) ),
                 Channel = static_cast< double >( Index % i_Components );
    Bytes[Index] = static_cast< u8 >( 128 + 100 * std::sin( ( X + 2 * Y ) * 0.012 + Channel * 2 ) );
  }
  return Bytes;
}

class VFormatTest : public testing::TestWithParam< u32 >
{
protected:
  const EPixelFormat Format = static_cast< EPixelFormat >( GetParam() );
};
} // namespace

INSTANTIATE_TEST_SUITE_P( Formats, VFormatTest, testing::Range( 0u, PixelFormatCount ) );

TEST_P( VFormatTest, ColoursAreThoseOfTheDefinition )
{
  // Odd and even sides, and both rules of colour.
  for ( const auto& [Width, Height] :
        { std::pair{ 64u, 48u }, { 37u, 23u }, { 24u, 719u }, { 24u, 720u }, { 3u, 2u } } )
  {
    VVideoFrame Frame = TestSupport::NoiseFrame( Format, Width, Height, Width );
    for ( const u32 Flags : { 0u, 1u } )
    {
      Frame.Flags = Flags;
      VRgbaPicture Picture;
      ASSERT_EQ( ToRgba( Frame, Picture ), IResult::Ok );
      ASSERT_EQ( Picture.Pixels.size(), std::size_t{ Width } * Height * 4 );
      EXPECT_LE( WorstOf( Frame, Picture ), 3 ) << Width << " x " << Height;
    }
  }
}

TEST_P( VFormatTest, APictureOfAnyOrderComesBack )
{
  for ( const u32 Height : { 46u, 721u } )
  {
    for ( const ERgbOrder Order : { ERgbOrder::RGB, ERgbOrder::BGR, ERgbOrder::RGBA, ERgbOrder::BGRA } )
    {
      constexpr u32 Width = 51;
      const u32 Components = Order == ERgbOrder::RGB || Order == ERgbOrder::BGR ? 3 : 4;
      const bool bTurned = Order == ERgbOrder::BGR || Order == ERgbOrder::BGRA;
      const std::vector< u8 > Bytes = Clouds( Width, Height, Components );
      VVideoFrame Frame;
      Frame.PresentationTime = 4;
      Frame.Flags = VideoBottomUp;
      ASSERT_EQ( FromRgb( { Bytes, Width, Height, std::size_t{ Width + 2 } * Components, Order }, Format, Frame ),
                 IResult::Ok );
      EXPECT_EQ( Frame.PresentationTime, 4 );
      EXPECT_EQ( Frame.Flags, 0u );
      VRgbaPicture Picture;
      ASSERT_EQ( ToRgba( Frame, Picture ), IResult::Ok );
      double Worst = 0;
      for ( u32 Pixel = 0; Pixel < Width * Height; ++Pixel )
      {
        const u8* const pFrom = Bytes.data() + ( Pixel / Width * ( Width + 2 ) + Pixel % Width ) * Components;
        const double R = pFrom[bTurned ? 2 : 0], G = pFrom[1], B = pFrom[bTurned ? 0 : 2];
        const double Grey = 0.299 * R + 0.587 * G + 0.114 * B;
        const bool bGrey = FamilyOf( Format ) == EPixelFamily::Luminance;
        const u8* const pSeen = Picture.Pixels.data() + Pixel * 4;
        Worst =
            std::max( { Worst, std::abs( pSeen[0] - ( bGrey ? Grey : R ) ), std::abs( pSeen[1] - ( bGrey ? Grey : G ) ),
                        std::abs( pSeen[2] - ( bGrey ? Grey : B ) ) } );
      }
      EXPECT_LE( Worst, FamilyOf( Format ) == EPixelFamily::Luminance ? 2 : 8 ) << static_cast< int >( Order );
    }
  }
}

TEST_P( VFormatTest, EveryFormatBecomesEveryOther )
{
  for ( const u32 Height : { 46u, 721u } )
  {
    constexpr u32 Width = 51;
    const std::vector< u8 > Bytes = Clouds( Width, Height, 3 );
    VVideoFrame From;
    From.SensorScale = { 2, 3 };
    ASSERT_EQ( FromRgb( { Bytes, Width, Height, 3 * ( Width + 2 ), ERgbOrder::RGB }, Format, From ), IResult::Ok );
    From.Flags = VideoBottomUp | 2;
    VRgbaPicture Before, After;
    ASSERT_EQ( ToRgba( From, Before ), IResult::Ok );
    for ( u32 Target = 0; Target < PixelFormatCount; ++Target )
    {
      VVideoFrame To;
      ASSERT_EQ( ConvertFrame( From, static_cast< EPixelFormat >( Target ), To ), IResult::Ok );
      EXPECT_EQ( To.Flags, From.Flags );
      EXPECT_EQ( To.SensorScale.y, 3 );
      ASSERT_EQ( ToRgba( To, After ), IResult::Ok );
      const bool bGrey = FamilyOf( To.Format ) == EPixelFamily::Luminance;
      int Worst = 0;
      for ( std::size_t Pixel = 0; Pixel < Before.Pixels.size(); Pixel += 4 )
      {
        const u8 *const pOld = Before.Pixels.data() + Pixel, *const pNew = After.Pixels.data() + Pixel;
        const int Grey = static_cast< int >( 0.299 * pOld[0] + 0.587 * pOld[1] + 0.114 * pOld[2] + 0.5 );
        for ( std::size_t Channel = 0; Channel < 3; ++Channel )
        {
          Worst = std::max( Worst, std::abs( pNew[Channel] - ( bGrey ? Grey : pOld[Channel] ) ) );
        }
      }
      EXPECT_LE( Worst, Target == GetParam() ? 0 : 8 ) << Target << " at " << Height;
    }
  }
}

TEST_P( VFormatTest, WhatDoesNotHoldTogetherIsRefusedAndLeavesTheResult )
{
  const VVideoFrame Good = TestSupport::NoiseFrame( Format, 9, 5, 1 );
  VVideoPlanes Planes;
  ASSERT_EQ( FindPlanes( Good, Planes ), IResult::Ok );
  const auto Expect = [&]( const VVideoFrame& i_rFrame, IResult i_Expected, int i_Line )
  {
    VRgbaPicture Picture{ 1, 1, { 1, 2, 3, 4 } };
    VVideoFrame Result;
    Result.Width = 77;
    EXPECT_EQ( ToRgba( i_rFrame, Picture ), i_Expected ) << i_Line;
    EXPECT_EQ( ConvertFrame( i_rFrame, EPixelFormat::I420, Result ), i_Expected ) << i_Line;
    EXPECT_EQ( Picture.Pixels.size(), 4u );
    EXPECT_EQ( Result.Width, 77u );
  };
  for ( std::size_t Plane = 0; Plane < Planes.Count; ++Plane )
  {
    VVideoFrame Bad = Good;
    Bad.Stride[Plane] = static_cast< u32 >( Planes.Planes[Plane].RowBytes );
    VRgbaPicture Picture;
    EXPECT_EQ( ToRgba( Bad, Picture ), IResult::Ok );
    --Bad.Stride[Plane];
    Expect( Bad, IResult::InvalidValue, __LINE__ );
    Bad.Stride[Plane] = 0;
    Expect( Bad, IResult::InvalidValue, __LINE__ );
    Bad.Stride[Plane] = 0xFFFFFFFF;
    Expect( Bad, IResult::InvalidValue, __LINE__ );
    Bad = Good;
    Bad.Offset[Plane] = 0xFFFFFFFF;
    Expect( Bad, IResult::EndOfData, __LINE__ );
    // The last byte that the plane needs, and one less.
    const std::size_t End = Good.Offset[Plane] + Planes.Planes[Plane].Stride * ( Planes.Planes[Plane].Rows - 1 ) +
                            Planes.Planes[Plane].RowBytes;
    if ( Plane + 1 == Planes.Count )
    {
      const auto Cut = [&]( std::size_t i_Bytes )
      {
        return std::make_shared< const std::vector< u8 > >( Good.Data->begin(),
                                                            Good.Data->begin() + static_cast< long >( i_Bytes ) );
      };
      Bad = Good;
      Bad.Data = Cut( End );
      EXPECT_EQ( ToRgba( Bad, Picture ), IResult::Ok );
      Bad.Data = Cut( End - 1 );
      Expect( Bad, IResult::EndOfData, __LINE__ );
    }
  }
  VVideoFrame Bad = Good;
  Bad.Data = nullptr;
  Expect( Bad, IResult::EndOfData, __LINE__ );
  Bad = Good;
  Bad.Height = 0;
  Expect( Bad, IResult::InvalidValue, __LINE__ );
  Bad.Height = 0xFFFFFFFF;
  Expect( Bad, IResult::InvalidValue, __LINE__ );
  for ( const u32 Unknown : { PixelFormatCount, 0xFFFFFFFFu } )
  {
    Bad = Good;
    Bad.Format = static_cast< EPixelFormat >( Unknown );
    Expect( Bad, IResult::InvalidFormat, __LINE__ );
    VVideoFrame Result;
    EXPECT_EQ( ConvertFrame( Good, Bad.Format, Result ), IResult::InvalidFormat );
    EXPECT_EQ( ColourBars( Bad.Format, 8, 8, Result ), IResult::InvalidFormat );
  }
}

TEST( ConvertVideo, PicturesAndImagesAreCheckedToo )
{
  const std::vector< u8 > Bytes( 3 * 4 * 5, 9 );
  VVideoFrame Frame;
  EXPECT_EQ( FromRgb( { Bytes, 4, 5, 12, ERgbOrder::RGB }, EPixelFormat::I420, Frame ), IResult::Ok );
  EXPECT_EQ( FromRgb( { Bytes, 4, 5, 12, ERgbOrder::RGBA }, EPixelFormat::I420, Frame ), IResult::InvalidValue );
  EXPECT_EQ( FromRgb( { Bytes, 4, 6, 12, ERgbOrder::RGB }, EPixelFormat::I420, Frame ), IResult::EndOfData );
  EXPECT_EQ( FromRgb( { Bytes, 4, 5, 13, ERgbOrder::RGB }, EPixelFormat::I420, Frame ), IResult::EndOfData );
  EXPECT_EQ( FromRgb( { {}, 4, 5, 12, ERgbOrder::RGB }, EPixelFormat::I420, Frame ), IResult::EndOfData );
  EXPECT_EQ( FromRgb( { Bytes, 0, 5, 12, ERgbOrder::RGB }, EPixelFormat::I420, Frame ), IResult::InvalidValue );

  VRgbaPicture Picture;
  const std::vector< u8 > Expected[] = { {}, { 1, 1, 1, 255 }, { 1, 1, 1, 2 }, { 1, 2, 3, 255 }, { 1, 2, 3, 4 } };
  for ( u32 Components = 1; Components <= 4; ++Components )
  {
    VImageSet::I Image{ "", 2, 1, Components, {} };
    for ( u32 Byte = 0; Byte < 2 * Components; ++Byte )
    {
      Image.Data.push_back( static_cast< u8 >( Byte % Components + 1 ) );
    }
    ASSERT_EQ( ImageToRgba( Image, Picture ), IResult::Ok );
    EXPECT_EQ( std::vector< u8 >( Picture.Pixels.begin() + 4, Picture.Pixels.end() ), Expected[Components] );
    Image.Data.pop_back();
    EXPECT_EQ( ImageToRgba( Image, Picture ), IResult::EndOfData );
    Image.Components = Components == 1 ? 0 : 5;
    EXPECT_EQ( ImageToRgba( Image, Picture ), IResult::InvalidFormat );
    Image.Components = Components;
    Image.Width = 0;
    EXPECT_EQ( ImageToRgba( Image, Picture ), IResult::InvalidValue );
  }
}

TEST( ConvertVideo, TheTestPatternHasItsBars )
{
  VVideoFrame Frame;
  ASSERT_EQ( ColourBars( EPixelFormat::NV12, 160, 90, Frame ), IResult::Ok );
  VRgbaPicture Picture;
  ASSERT_EQ( ToRgba( Frame, Picture ), IResult::Ok );
  constexpr int Bars[8][3] = { { 1, 1, 1 }, { 1, 1, 0 }, { 0, 1, 1 }, { 0, 1, 0 },
                               { 1, 0, 1 }, { 1, 0, 0 }, { 0, 0, 1 }, { 0, 0, 0 } };
  for ( std::size_t Bar = 0; Bar < 8; ++Bar )
  {
    const u8* const pBar = Picture.Pixels.data() + ( 30 * 160 + Bar * 20 + 10 ) * 4;
    const u8* const pRamp = Picture.Pixels.data() + ( 80 * 160 + Bar * 20 + 10 ) * 4;
    for ( std::size_t Channel = 0; Channel < 3; ++Channel )
    {
      EXPECT_NEAR( pBar[Channel], 255 * Bars[Bar][Channel], 4 ) << Bar;
      EXPECT_NEAR( pRamp[Channel], static_cast< double >( Bar * 20 + 10 ) * 255 / 159, 3 ) << Bar;
    }
  }
}

} // namespace CoreVideoUtils

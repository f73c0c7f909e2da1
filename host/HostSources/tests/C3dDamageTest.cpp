#include "ReadHelpers.h"

#include <random>

namespace HostSources
{
namespace
{
using C3dWriter::VFile;

VOutcome Read( std::span< const std::byte > i_Bytes )
{
  VOutcome Outcome;
  Outcome.Result = ReadC3d( i_Bytes, "damaged.c3d", Outcome.Recording, Outcome.Message );
  return Outcome;
}

void ExpectSound( const VOutcome& i_rOutcome )
{
  if ( i_rOutcome.Result.IsError() )
  {
    EXPECT_EQ( i_rOutcome.Recording.FrameCount, 0 );
    EXPECT_THAT( i_rOutcome.Message, testing::StartsWith( "damaged.c3d: byte offset " ) );
    EXPECT_THAT( i_rOutcome.Message, testing::HasSubstr( "expected" ) );
    return;
  }
  const VRecording& rR = i_rOutcome.Recording;
  EXPECT_GT( rR.FrameCount, 0 );
  EXPECT_EQ( rR.Points.size(), static_cast< std::size_t >( rR.FrameCount ) * rR.PointCount() );
  EXPECT_EQ( rR.Analog.size(),
             static_cast< std::size_t >( rR.FrameCount ) * rR.AnalogPerFrame * rR.AnalogChannels.size() );
  EXPECT_FALSE( DescribeRecording( rR ).Text().empty() );
}

/// Ten frames with points, analog channels and a force plate.
VFile WholeFile()
{
  VFile File;
  File.Points = 20;
  File.Channels = 6;
  File.PerFrame = 4;
  for ( int Index = 0; Index < 20; ++Index )
  {
    File.Labels.push_back( std::string( 1, 'M' ).append( std::to_string( Index ) ) );
  }
  File.Frames.assign( 10, std::vector< double >( 4 * 20 + 24, 1.5 ) );
  File.SetParameter( { "FORCE_PLATFORM", "USED", 2, {}, { 1 }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "TYPE", 2, { 1 }, { 2 }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "CORNERS", 4, { 3, 4, 1 }, { 1, 1, 0, 1, 0, 0, 0, 0, 0, 0, 1, 0 }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "ORIGIN", 4, { 3, 1 }, { 0, 0, -40 }, {} } );
  File.SetParameter( { "FORCE_PLATFORM", "CHANNEL", 2, { 6, 1 }, { 1, 2, 3, 4, 5, 6 }, {} } );
  return File;
}
} // namespace

TEST( C3dDamage, CutOffAnywhereGivesTheWholeFramesOrAMessage )
{
  const auto Whole = C3dWriter::Write( WholeFile() );
  const std::size_t FrameBytes = ( 4 * 20 + 24 ) * 4;
  const std::size_t Data = ( std::to_integer< std::size_t >( Whole[16] ) - 1 ) * 512;
  for ( std::size_t Size = 0; Size < Whole.size(); Size += Size % 512 == 511 || Size % 512 == 0 ? 1 : 85 )
  {
    SCOPED_TRACE( Size );
    const VOutcome Outcome = Read( std::span( Whole ).first( Size ) );
    ExpectSound( Outcome );
    const std::size_t Frames = Size > Data ? std::min< std::size_t >( ( Size - Data ) / FrameBytes, 10 ) : 0;
    EXPECT_EQ( Outcome.Recording.FrameCount, static_cast< std::int64_t >( Frames ) );
    EXPECT_EQ( Outcome.Result, Frames == 10           ? ZEK::IResult::Ok
                               : Frames > 0           ? ZEK::IResult::OkButPartial
                               : Size < 2 && Size > 0 ? ZEK::IResult::InvalidFormat
                                                      : ZEK::IResult::EndOfData );
  }
}

TEST( C3dDamage, AnyByteAndManyBytesOfHeaderAndParametersMayBeWrong )
{
  const auto Whole = C3dWriter::Write( WholeFile() );
  const std::size_t Data = ( std::to_integer< std::size_t >( Whole[16] ) - 1 ) * 512;
  for ( std::size_t Offset = 0; Offset < Data; ++Offset )
  {
    for ( const unsigned Value : { 0u, 0x7Fu, 0x80u, 0xFFu } )
    {
      auto Damaged = Whole;
      Damaged[Offset] = static_cast< std::byte >( Value );
      ExpectSound( Read( Damaged ) );
      ASSERT_FALSE( testing::Test::HasFailure() ) << "byte offset " << Offset << " value " << Value;
    }
  }
  std::mt19937 Random( 7 );
  for ( int Round = 0; Round < 3000; ++Round )
  {
    auto Damaged = Whole;
    for ( int Count = 0; Count < 20; ++Count )
    {
      Damaged[Random() % 2048] = static_cast< std::byte >( Random() );
    }
    Damaged[1] = std::byte{ 0x50 };
    ExpectSound( Read( Damaged ) );
    ASSERT_FALSE( testing::Test::HasFailure() ) << "round " << Round;
  }
}

TEST( C3dDamage, MessagesSayWhereAndWhat )
{
  const auto Expect = []( const VOutcome& i_rOutcome, ZEK::IResult i_Result, const std::string& i_rText )
  {
    EXPECT_EQ( i_rOutcome.Result, i_Result );
    EXPECT_THAT( i_rOutcome.Message, testing::StartsWith( "damaged.c3d: byte offset " + i_rText ) );
  };
  auto Bytes = C3dWriter::Write( WholeFile() );
  Bytes[515] = std::byte{ 83 };
  Expect( Read( Bytes ), ZEK::IResult::InvalidFormat,
          "515: expected the processor type 84 (Intel), 85 (DEC) or 86 (MIPS), found 83" );
  Bytes[1] = std::byte{ 0 };
  Expect( Read( Bytes ), ZEK::IResult::InvalidFormat, "0: expected" );
  VFile File = WholeFile();
  File.Frames.clear();
  File.HeaderFirst = 1;
  File.HeaderLast = 0;
  const auto Empty = C3dWriter::Write( File );
  Expect( Read( Empty ), ZEK::IResult::EndOfData,
          std::to_string( Empty.size() ) + ": expected frames of 416 bytes, 0 of them" );
  File = WholeFile();
  File.Points = File.Channels = File.PerFrame = 0;
  Expect( Read( C3dWriter::Write( File ) ), ZEK::IResult::InvalidFormat, "2: expected points or analog channels" );
  File = WholeFile();
  File.SetParameter( { "POINT", "SCALE", 4, {}, { 0 }, {} } );
  Expect( Read( C3dWriter::Write( File ) ), ZEK::IResult::InvalidFormat,
          "12: expected the scale of the points, a number other than 0, found 0" );
}

TEST( C3dDamage, WhatIsOddIsNotedAndAsksForNoMoreThanTheFileHolds )
{
  VFile File = WholeFile();
  File.Rate = 0;
  File.SetParameter( { "POINT", "DESCRIPTIONS", -1, { 0, 0 }, {}, {} } );
  File.SetParameter( { "ANALOG", "USED", 2, {}, { 24 }, {} } );
  VRecording R = MustReadC3d( File );
  EXPECT_EQ( R.RateHz, 100 );
  EXPECT_EQ( R.AnalogChannels.size(), 24u );
  EXPECT_EQ( R.AnalogPerFrame, 1u );
  EXPECT_THAT( R.Notes, testing::IsSupersetOf(
                            { testing::HasSubstr( "no usable frame rate" ), testing::HasSubstr( "ANALOG:USED" ) } ) );
  // So slowly that its ticks could not be counted.
  File = WholeFile();
  File.Rate = 1.2e-5;
  File.Frames.resize( 500, File.Frames[0] );
  EXPECT_EQ( MustReadC3d( File ).RateHz, 100 );

  File = WholeFile();
  for ( int Index = 0; Index < 70000; ++Index )
  {
    File.SetParameter( { "POINT", std::string( "N" ).append( std::to_string( Index ) ), 1, {}, { 1 }, {} } );
  }
  R = MustReadC3d( File );
  EXPECT_EQ( R.FrameCount, 10 );
  EXPECT_THAT( R.Notes, testing::Contains( testing::HasSubstr( "no more than 65535 parameters" ) ) );

  File = WholeFile();
  File.HeaderLast = 65535;
  File.SetParameter( { "POINT", "LONG_FRAMES", 4, {}, { 3e9 }, {} } );
  const VOutcome Outcome = Read( C3dWriter::Write( File ) );
  EXPECT_EQ( Outcome.Result, ZEK::IResult( ZEK::IResult::OkButPartial ) );
  EXPECT_LE( Outcome.Recording.FrameCount, 11 );
  EXPECT_LT( Outcome.Recording.Points.capacity(), 1000u );
}

} // namespace HostSources

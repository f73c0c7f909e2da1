#include "ReadHelpers.h"

#include <cmath>

namespace HostSources
{
namespace
{
using C3dWriter::EForm;
using C3dWriter::VFile;

/// Two points and two channels of two samples, three frames; the second point is a gap in the second frame.
VFile SmallFile( EForm i_Form, bool i_bFloat )
{
  VFile File;
  File.Form = i_Form;
  File.bFloat = i_bFloat;
  File.Scale = 0.5;
  File.Points = 2;
  File.Channels = 2;
  File.PerFrame = 2;
  File.Labels = { "HEAD", "FOOT" };
  // Words of an integer file are halved by the scale.
  const double Unit = i_bFloat ? 1 : 2;
  for ( double Frame = 0; Frame < 3; ++Frame )
  {
    const bool bGap = Frame == 1;
    File.Frames.push_back( { 100 * Unit, -20.5 * Unit, ( 1000 + Frame ) * Unit, 0x0304, 1 * Unit, 2 * Unit, 3 * Unit,
                             bGap ? -1.0 : 0.0, 7, -9, 11 + Frame, -13 } );
  }
  return File;
}

void SetLongTrial( VFile& io_rFile, std::uint32_t i_First, std::uint32_t i_Last )
{
  const auto Words = []( std::uint32_t i_Value )
  {
    return std::vector< double >{ static_cast< double >( i_Value & 0xFFFF ), static_cast< double >( i_Value >> 16 ) };
  };
  io_rFile.SetParameter( { "TRIAL", "ACTUAL_START_FIELD", 2, { 2 }, Words( i_First ), {} } );
  io_rFile.SetParameter( { "TRIAL", "ACTUAL_END_FIELD", 2, { 2 }, Words( i_Last ), {} } );
}

/// One point whose x tells the frame.
VFile LongFile( std::size_t i_Frames )
{
  VFile File;
  File.Points = 1;
  File.Labels = { "P" };
  for ( std::size_t Frame = 0; Frame < i_Frames; ++Frame )
  {
    File.Frames.push_back( { static_cast< double >( Frame ), 0, 0, 0 } );
  }
  return File;
}
} // namespace

class C3dForms : public testing::TestWithParam< std::tuple< EForm, bool > >
{
};

TEST_P( C3dForms, EveryNumberArrives )
{
  const auto [Form, bFloat] = GetParam();
  VFile File = SmallFile( Form, bFloat );
  File.FirstFrame = 12;
  File.SetParameter( { "ANALOG", "SCALE", 4, { 2 }, { 0.25, -2 }, {} } );
  File.SetParameter( { "ANALOG", "OFFSET", 2, { 2 }, { 3, -1 }, {} } );
  File.SetParameter( { "ANALOG", "GEN_SCALE", 4, {}, { 10 }, {} } );
  const VRecording R = MustReadC3d( File );
  EXPECT_EQ( R.FirstFrame, 12 );
  ASSERT_EQ( R.FrameCount, 3 );
  EXPECT_EQ( R.RateHz, 100 );
  ExpectPoint( R, 0, "HEAD", 100, -20.5, 1000 );
  ExpectPoint( R, 2, "HEAD", 100, -20.5, 1002 );
  ExpectPoint( R, 0, "FOOT", 1, 2, 3 );
  EXPECT_FALSE( R.Frame( 1 )[1].IsValid() );
  EXPECT_EQ( R.GapCount, 1u );
  EXPECT_FLOAT_EQ( R.Frame( 0 )[0].Residual, 4 * 0.5f );
  ASSERT_EQ( R.CameraMasks.size(), 6u );
  EXPECT_EQ( R.CameraMasks[0], 3 );
  EXPECT_EQ( R.CameraMasks[1], 0 );
  ASSERT_EQ( R.Analog.size(), 12u );
  EXPECT_FLOAT_EQ( R.Analog[0], ( 7 - 3 ) * 0.25f * 10 );
  EXPECT_FLOAT_EQ( R.Analog[1], ( -9 + 1 ) * -2.0f * 10 );
  EXPECT_FLOAT_EQ( R.Analog[4 * 2 + 2], ( 13 - 3 ) * 0.25f * 10 );
  ExpectBounds( R.Bounds, { 1, 100, -20.5, 2, 3, 1002 }, 1e-4 );
}

INSTANTIATE_TEST_SUITE_P( All, C3dForms,
                          testing::Combine( testing::Values( EForm::Intel, EForm::Dec, EForm::Mips ),
                                            testing::Bool() ) );

TEST( C3dUnits, LengthsBecomeMillimetres )
{
  VFile File = SmallFile( EForm::Dec, true );
  // The first point is of very large and very small numbers, which the DEC form holds as well.
  std::copy_n( std::array{ 3.0e34, -1.5e-30, 0.0 }.begin(), 3, File.Frames[0].begin() );
  for ( const auto& [Name, Scale] :
        { std::pair{ "mm", 1.0 }, { "cm", 10.0 }, { "M", 1000.0 }, { "in", 25.4 }, { "furlong", 1.0 } } )
  {
    SCOPED_TRACE( Name );
    File.Unit = Name;
    const VRecording R = MustReadC3d( File );
    EXPECT_FLOAT_EQ( R.Points[0].x, static_cast< float >( 3.0e34 * Scale ) );
    EXPECT_FLOAT_EQ( R.Points[0].y, static_cast< float >( -1.5e-30 * Scale ) );
    EXPECT_EQ( R.Points[0].z, 0 );
    ExpectPoint( R, 0, "FOOT", Scale, 2 * Scale, 3 * Scale );
    EXPECT_FLOAT_EQ( R.Frame( 0 )[0].Residual, static_cast< float >( 2 * Scale ) );
    EXPECT_EQ( R.Notes.empty(), R.Unit == Name ) << "only what is not known is noted";
  }
}

TEST( C3dGaps, PositionsThatAreNoNumbersAreMissing )
{
  VFile File = SmallFile( EForm::Intel, true );
  File.Frames[0][0] = std::nan( "" );
  File.Frames[0][5] = std::numeric_limits< double >::infinity();
  File.Frames[2][3] = std::nan( "" );
  File.Frames[2][6] = -std::numeric_limits< double >::infinity();
  const VRecording R = MustReadC3d( File );
  EXPECT_EQ( R.GapCount, 5u );
  EXPECT_TRUE( R.Frame( 1 )[0].IsValid() );
  EXPECT_TRUE( std::isnan( R.Frame( 0 )[1].x ) ) << "a missing point is missing altogether";
  ExpectBounds( R.Bounds, { 100, 100, -20.5, -20.5, 1001, 1001 }, 1e-4 );
}

TEST( C3dAnalog, UnsignedWordsGoBeyond32767 )
{
  VFile File = SmallFile( EForm::Intel, false );
  File.Frames[0][8] = 40000;
  File.SetParameter( { "ANALOG", "OFFSET", 2, { 2 }, { 32768, 32768 }, {} } );
  const VFile Signed = File;
  File.SetParameter( { "ANALOG", "FORMAT", -1, { 8 }, {}, { "UNSIGNED" } } );
  EXPECT_FLOAT_EQ( MustReadC3d( File ).Analog[0], 40000 - 32768 );
  EXPECT_FLOAT_EQ( MustReadC3d( Signed ).Analog[0], ( 40000 - 65536 ) + 32768 );
}

TEST( C3dLabels, RepeatsTakeTheirDescriptionOrANumber )
{
  VFile File = SmallFile( EForm::Intel, true );
  File.Points = 6;
  File.Channels = File.PerFrame = 0;
  File.Labels = { "RANK", "RANK", "KNEE", "KNEE", "HIP", "*17" };
  File.SetParameter( { "POINT",
                       "DESCRIPTIONS",
                       -1,
                       { 8, 6 },
                       {},
                       { "R.Ankle ", "R.AnkleM", "HIP     ", "        ", "what ", "none" } } );
  File.Frames = { std::vector< double >( 24 ) };
  const VRecording R = MustReadC3d( File );
  EXPECT_THAT( R.Labels, testing::ElementsAre( "R.Ankle", "R.AnkleM", "HIP_1", "KNEE", "HIP", "" ) );
  EXPECT_THAT( R.FileLabels, testing::ElementsAre( "RANK", "RANK", "KNEE", "KNEE", "HIP", "*17" ) );
}

TEST( C3dLabels, MoreThan255 )
{
  VFile File;
  File.Points = 600;
  for ( std::size_t Index = 0; Index < File.Points; ++Index )
  {
    File.Labels.push_back( "L" + std::to_string( Index ) );
  }
  File.Labels[599] = "caf\xE9"; // Latin-1
  std::vector< double > Frame;
  for ( std::size_t Index = 0; Index < File.Points; ++Index )
  {
    Frame.insert( Frame.end(), { static_cast< double >( Index ), 0, 0, 0 } );
  }
  File.Frames = { Frame };
  const VRecording R = MustReadC3d( File );
  ASSERT_EQ( R.PointCount(), 600u );
  ExpectPoint( R, 0, "L254", 254, 0, 0 );
  ExpectPoint( R, 0, "L255", 255, 0, 0 );
  ExpectPoint( R, 0, "L598", 598, 0, 0 );
  EXPECT_EQ( R.Labels[599], "caf\xC3\xA9" );
}

TEST( C3dLongFiles, EveryWayOfSayingTheLength )
{
  VFile Unsaid = LongFile( 70000 );
  Unsaid.HeaderLast = 65535;
  VFile Trial = Unsaid, LongFrames = Unsaid, FloatFrames = Unsaid;
  SetLongTrial( Trial, 1, 70000 );
  VFile Wrapped = Trial;
  Wrapped.HeaderLast = 70000 & 0xFFFF;
  LongFrames.SetParameter( { "POINT", "LONG_FRAMES", 4, {}, { 70000 }, {} } );
  FloatFrames.SetParameter( { "POINT", "FRAMES", 4, {}, { 70000 }, {} } );
  for ( const VFile& rFile : { Trial, Wrapped, LongFrames, FloatFrames, Unsaid } )
  {
    const VRecording R = MustReadC3d( rFile );
    ASSERT_GE( R.FrameCount, 70000 );
    ASSERT_LT( R.FrameCount, 70000 + 32 ) << "no more than the padding of the last block";
    EXPECT_EQ( R.Frame( 69999 )[0].x, 69999 );
    EXPECT_EQ( R.FirstFrame, 1 );
  }
  EXPECT_EQ( MustReadC3d( LongFile( 40000 ) ).FrameCount, 40000 ) << "a word has no sign";
  VFile Late = LongFile( 5 );
  Late.HeaderFirst = Late.HeaderLast = 65535;
  SetLongTrial( Late, 200000, 200004 );
  const VRecording R = MustReadC3d( Late );
  EXPECT_EQ( R.FirstFrame, 200000 );
  EXPECT_EQ( R.FrameCount, 5 );
}

TEST( C3dEvents, FromTheGroupAndFromTheHeader )
{
  VFile File = SmallFile( EForm::Mips, true );
  File.FirstFrame = 101;
  File.HeaderEvents = { { "FS", 1.5 }, { "FO", 1.75 } };
  VRecording R = MustReadC3d( File );
  ASSERT_EQ( R.Events.size(), 2u );
  EXPECT_EQ( R.Events[1].Label, "FO" );
  EXPECT_DOUBLE_EQ( R.Events[1].FileSeconds, 1.75 );
  EXPECT_DOUBLE_EQ( R.Events[1].Seconds, 0.75 );
  File.SetParameter( { "EVENT", "USED", 2, {}, { 2 }, {} } );
  File.SetParameter( { "EVENT", "LABELS", -1, { 4, 2 }, {}, { "Late", "Soon" } } );
  File.SetParameter( { "EVENT", "CONTEXTS", -1, { 5, 2 }, {}, { "Left ", "Right" } } );
  File.SetParameter( { "EVENT", "TIMES", 4, { 2, 2 }, { 1, 2.5, 0, 3 }, {} } );
  R = MustReadC3d( File );
  ASSERT_EQ( R.Events.size(), 2u );
  EXPECT_EQ( R.Events[0].Label, "Soon" );
  EXPECT_EQ( R.Events[1].Context, "Left" );
  EXPECT_DOUBLE_EQ( R.Events[1].FileSeconds, 62.5 );
}

TEST( C3dUpAxis, IsReadFromTheScreenAxesOrTheData )
{
  const std::tuple< const char*, const char*, EUpAxis, const char* > Cases[] = {
      { "+X", "+Z", EUpAxis::Z, "z is up: POINT:Y_SCREEN is \"+Z\"" },
      { "+X", "+Y", EUpAxis::Y, "y is up: POINT:Y_SCREEN" },
      { "-X", "-Z", EUpAxis::Z, "z is up: POINT:Y_SCREEN" },
      { "+Y", "", EUpAxis::Z, "z is up: POINT:X_SCREEN" },
      { "+Z", "", EUpAxis::Y, "y is up: POINT:X_SCREEN" },
      { "", "", EUpAxis::Y, "y is up: POINT:X_SCREEN and Y_SCREEN do not tell" } };
  for ( const auto& [pX, pY, Expected, pReason] : Cases )
  {
    VFile File = SmallFile( EForm::Intel, true );
    File.SetParameter( { "POINT", "X_SCREEN", -1, { 2 }, {}, { pX } } );
    File.SetParameter( { "POINT", "Y_SCREEN", -1, { 2 }, {}, { pY } } );
    // A body 1.7 m tall along y.
    File.Frames = { { 400, 10, 300, 0, 500, 1700, 350, 0, 0, 0, 0, 0 } };
    const VRecording R = MustReadC3d( File );
    EXPECT_EQ( R.UpAxis, Expected );
    EXPECT_THAT( R.UpAxisReason, testing::StartsWith( pReason ) );
  }
}

} // namespace HostSources

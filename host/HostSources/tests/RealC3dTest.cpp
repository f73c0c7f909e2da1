// The figures of real files, read from them by another program.

#include "ReadHelpers.h"

#include <cmath>
#include <set>

namespace HostSources
{
namespace
{
VRecordingInfo::VPlate Plate( const VRecording& i_rRecording, std::size_t i_Index )
{
  const VRecordingInfo Info = DescribeRecording( i_rRecording );
  return i_Index < Info.ForcePlates.size() ? Info.ForcePlates[i_Index] : VRecordingInfo::VPlate();
}

void ExpectPeak( const VRecordingInfo::VPlate& i_rPlate, double i_Force, std::uint64_t i_Sample, std::int64_t i_Frame,
                 double i_X, double i_Y )
{
  SCOPED_TRACE( i_rPlate.Name );
  EXPECT_NEAR( i_rPlate.PeakForce, i_Force, 0.006 );
  EXPECT_EQ( i_rPlate.PeakSample, i_Sample );
  EXPECT_EQ( i_rPlate.PeakFrame, i_Frame );
  EXPECT_NEAR( i_rPlate.PeakCentre.x, i_X, 0.6 );
  EXPECT_NEAR( i_rPlate.PeakCentre.y, i_Y, 0.6 );
}

void ExpectCorners( const VForcePlate& i_rPlate, std::array< double, 12 > i_Corners )
{
  for ( std::size_t Corner = 0; Corner < 4; ++Corner )
  {
    EXPECT_NEAR( i_rPlate.Corners[Corner].x, i_Corners[3 * Corner], 1e-3 );
    EXPECT_NEAR( i_rPlate.Corners[Corner].y, i_Corners[3 * Corner + 1], 1e-3 );
    EXPECT_NEAR( i_rPlate.Corners[Corner].z, i_Corners[3 * Corner + 2], 1e-3 );
  }
}
} // namespace

TEST( RealC3d, FilesHoldTheirFramesPointsAndChannels )
{
  HARROW_NEEDS_RECORDINGS();
  struct VCase
  {
    const char* pFile;
    const char* pForm;
    std::size_t Points;
    std::int64_t First, Frames;
    double Rate;
    std::uint64_t Gaps;
    std::size_t Channels;
    double AnalogRate;
    std::size_t Plates;
  };
  for ( const VCase& rCase : { VCase{ "c3d-trc/Gait.c3d", "integer, DEC", 33, 1, 487, 100, 9682, 28, 1000, 2 },
                               { "c3d-trc/mocap36.c3d", "float, Intel", 36, 1, 1380, 100, 8244, 0, 0, 0 },
                               { "c3d-trc/emg-only.c3d", "float, Intel", 0, 1, 4564, 1000, 0, 8, 1000, 0 },
                               { "c3d-gpl/Qualisys.c3d", "float, Intel", 55, 705, 340, 200, 0, 69, 2000, 2 },
                               { "c3d-gpl/FP_Type3.c3d", "float, Intel", 34, 1166, 2, 250, 0, 16, 1000, 2 } } )
  {
    SCOPED_TRACE( rCase.pFile );
    const VRecording R = Real( rCase.pFile );
    EXPECT_EQ( R.Form, rCase.pForm );
    EXPECT_EQ( R.PointCount(), rCase.Points );
    EXPECT_EQ( R.FirstFrame, rCase.First );
    EXPECT_EQ( R.FrameCount, rCase.Frames );
    EXPECT_EQ( R.RateHz, rCase.Rate );
    EXPECT_EQ( R.GapCount, rCase.Gaps );
    EXPECT_EQ( R.Points.size(), rCase.Points * static_cast< std::size_t >( rCase.Frames ) );
    EXPECT_EQ( R.AnalogChannels.size(), rCase.Channels );
    EXPECT_EQ( R.AnalogRateHz(), rCase.AnalogRate );
    EXPECT_EQ( R.ForcePlates.size(), rCase.Plates );
    EXPECT_EQ( R.Bounds.IsEmpty(), rCase.Points == 0 );
  }
}

TEST( RealRecordings, PointsLieWhereTheyLie )
{
  HARROW_NEEDS_RECORDINGS();
  const std::tuple< const char*, std::int64_t, const char*, double, double, double > Cases[] = {
      { "c3d-trc/Gait.c3d", 243, "RSHO", 640.4994, 155.2884, 1381.1512 },
      { "c3d-trc/Gait.c3d", 243, "ROFF", 775.4001, 117.7126, 1296.1035 },
      { "c3d-trc/mocap36.c3d", 0, "Skeleton_Hip1", 198.9177, 24.8411, 981.4937 },
      { "c3d-trc/mocap36.c3d", 0, "Skeleton_Hip2", -138.3683, 24.7229, 973.5464 },
      { "c3d-trc/mocap36.c3d", 690, "Skeleton_Hip2", -149.4506, 1544.8630, 954.0317 },
      { "c3d-gpl/Qualisys.c3d", 0, "L_IAS", -220.1226, 306.4248, 846.3361 },
      { "c3d-gpl/Qualisys.c3d", 0, "L_IPS", -398.1731, 237.0688, 872.8574 },
      { "c3d-gpl/Qualisys.c3d", 339, "L_IAS", 2266.2837, 315.5139, 856.4126 },
      { "c3d-gpl/FP_Type3.c3d", 0, "LPSIS", 397.6465, 177.6959, 1175.8829 },
      { "c3d-gpl/FP_Type3.c3d", 0, "RPSIS", 493.9481, 183.7718, 1179.5167 },
      { "c3d-trc/Gait.trc", 243, "R.Shoulder", 640.56439, 155.33781, 1381.36707 },
      // These are in metres, with y up.
      { "multicam-person/balancing/markers21.trc", 0, "RHip", -64.972, 901.505, -1400.589 },
      { "multicam-person/balancing/markers21.trc", 0, "LWrist", 354.631, 937.762, -1458.089 },
      { "multicam-person/balancing/markers21.trc", 99, "RHip", -59.509, 908.462, -659.343 },
      { "multicam-person/balancing/markers64.trc", 0, "RHip", -64.9978, 869.0172, -1400.5736 },
      { "multicam-person/balancing/markers64.trc", 0, "L_mwrist_study", 362.0462, 870.0455, -1483.688 },
      { "multicam-person/static/markers21.trc", 0, "RHip", -80.589, 869.695, 76.164 },
      { "multicam-person/static/markers21.trc", 0, "LWrist", -68.235, 983.020, -508.783 } };
  for ( const auto& [pFile, Frame, pLabel, X, Y, Z] : Cases )
  {
    ExpectPoint( Real( pFile ), Frame, pLabel, X, Y, Z,
                 std::string_view( pFile ).starts_with( "multi" ) ? 2e-3 : 1e-4 );
  }
  const VRecording Mocap = Real( "c3d-trc/mocap36.c3d" );
  ExpectBounds( Mocap.Bounds, { -723, 766, -2222, 1815, 42, 1820 }, 0.6 );
  for ( std::int64_t Frame = 0; Frame < Mocap.FrameCount; ++Frame )
  {
    for ( const VRecordingPoint& rPoint : Mocap.Frame( Frame ) )
    {
      ASSERT_EQ( rPoint.IsValid(), Frame < 1380 - 229 ) << Frame;
    }
  }
  ExpectBounds( Real( "c3d-gpl/Qualisys.c3d" ).Bounds, { -606, 2439, -125, 527, 8, 1496 }, 0.6 );
}

TEST( RealC3d, NamesAnalogValuesAndTheUpAxis )
{
  HARROW_NEEDS_RECORDINGS();
  const VRecording Gait = Real( "c3d-trc/Gait.c3d" );
  EXPECT_EQ( Gait.Unit, "mm" );
  EXPECT_EQ( std::set( Gait.FileLabels.begin(), Gait.FileLabels.end() ).size(), 27u );
  EXPECT_EQ( std::set( Gait.Labels.begin(), Gait.Labels.end() ).size(), 33u );
  EXPECT_THAT( Gait.Labels, testing::IsSupersetOf( { "R.Ankle", "R.Ankle.Medial", "L.Foot.Lateral", "C7" } ) );
  EXPECT_THAT( Gait.Labels, testing::Not( testing::Contains( "RANK" ) ) );
  EXPECT_TRUE( Gait.Events.empty() );
  EXPECT_EQ( Gait.UpAxis, EUpAxis::Z );
  EXPECT_THAT( Gait.UpAxisReason, testing::HasSubstr( "POINT:Y_SCREEN is \"+Z\"" ) );
  EXPECT_EQ( Gait.AnalogChannels[0].Name, "F1X" );
  EXPECT_EQ( Gait.AnalogChannels[3].Unit, "Nmm" );
  const std::array< double, 4 > Raw{ 30, 8, 0, -11 };
  for ( std::size_t Channel = 0; Channel < Raw.size(); ++Channel )
  {
    EXPECT_NEAR( static_cast< double >( Gait.Analog[Channel] ), Raw[Channel] * -0.1221001, 1e-5 );
  }
  const VRecording Emg = Real( "c3d-trc/emg-only.c3d" );
  EXPECT_EQ( Emg.AnalogChannels[0].Name, "Right Rectus Femoris" );
  EXPECT_EQ( Emg.AnalogChannels[7].Unit, "mV" );
  EXPECT_THAT( Emg.Analog, testing::Each( testing::AllOf( testing::Gt( -100.f ), testing::Lt( 100.f ) ) ) );
}

TEST( RealC3d, ForcePlatesFeelWhatTheyFelt )
{
  HARROW_NEEDS_RECORDINGS();
  const VRecording Gait = Real( "c3d-trc/Gait.c3d" );
  const VRecording Walk = Real( "c3d-gpl/Qualisys.c3d" );
  const VRecording Stand = Real( "c3d-gpl/FP_Type3.c3d" );
  ASSERT_TRUE( Gait.ForcePlates.size() == 2 && Walk.ForcePlates.size() == 2 && Stand.ForcePlates.size() == 2 );
  EXPECT_EQ( Gait.ForcePlates[0].Type, 4u );
  ExpectCorners( Gait.ForcePlates[0], { -306.4, -620.7, 0, -306.4, -11.1, 0, 608, -11.1, 0, 608, -620.7, 0 } );
  ExpectCorners( Gait.ForcePlates[1], { -9.3, -10.1, 0, -9.3, 599.5, 0, 905.1, 599.5, 0, 905.1, -10.1, 0 } );
  EXPECT_NEAR( Gait.ForcePlates[0].Origin.x, -0.94, 1e-5 );
  EXPECT_NEAR( Gait.ForcePlates[0].Origin.z, -59.428, 1e-5 );
  EXPECT_NEAR( Gait.ForcePlates[1].Origin.y, -1.885, 1e-5 );
  EXPECT_NEAR( Gait.ForcePlates[1].Origin.z, -52.979, 1e-5 );
  ExpectPeak( Plate( Gait, 0 ), 798.41, 3007, 300, -50, -90 );
  ExpectPeak( Plate( Gait, 1 ), 871.17, 2529, 252, 675, 74 );

  EXPECT_EQ( Walk.ForcePlates[0].Type, 2u );
  EXPECT_THAT( Walk.ForcePlates[0].Channels, testing::ElementsAre( 57, 58, 59, 60, 61, 62 ) );
  EXPECT_THAT( Walk.ForcePlates[1].Channels, testing::ElementsAre( 63, 64, 65, 66, 67, 68 ) );
  ExpectCorners( Walk.ForcePlates[0], { 508, 464, 0, 508, 0, 0, 0, 0, 0, 0, 464, 0 } );
  ExpectCorners( Walk.ForcePlates[1], { 1017, 464, 0, 1017, 0, 0, 509, 0, 0, 509, 464, 0 } );
  EXPECT_NEAR( Walk.ForcePlates[0].Origin.z, 34.036, 1e-4 );
  EXPECT_NEAR( Walk.ForcePlates[1].Origin.z, 36.322, 1e-4 );
  ExpectPeak( Plate( Walk, 0 ), 808.43, 380, 38, 194, 292 );
  ExpectPeak( Plate( Walk, 1 ), 839.72, 1294, 129, 814, 159 );

  const VForcePlate& rCorners = Stand.ForcePlates[0];
  EXPECT_EQ( rCorners.Type, 3u );
  EXPECT_TRUE( rCorners.Origin.x == 210 && rCorners.Origin.y == 350 && rCorners.Origin.z == -53 );
  ExpectCorners( rCorners, { 881.199, 581.160, -4.928, 880.102, -2.366, -5.843, -0.813, -6.946, -6.118, -4.827, 578.421,
                             -6.172 } );
  const VRecordingInfo::VPlate Info = Plate( Stand, 0 );
  EXPECT_NEAR( Info.PeakForce, 886.7, 0.05 );
  EXPECT_NEAR( Info.PeakCentre.x, 446.5, 0.5 );
  EXPECT_NEAR( Info.PeakCentre.y, 291, 0.5 );
  // Nobody stands on the second plate, so it has no centre of pressure.
  EXPECT_TRUE( std::isnan( Stand.ForcePlates[1].Wrench[0][6] ) );
  // The force on the body points up, out of the floor, also from the file that holds the force on the plate.
  EXPECT_GT( Gait.ForcePlates[0].Wrench[3007][2], 700.0f );
  EXPECT_GT( Gait.ForcePlates[1].Wrench[2529][2], 700.0f );
  EXPECT_GT( Walk.ForcePlates[0].Wrench[380][2], 700.0f );
  EXPECT_GT( rCorners.Wrench[0][2], 880.0f );
}

TEST( RealC3d, EventsCountFromTheFirstFrame )
{
  HARROW_NEEDS_RECORDINGS();
  const VRecording Walk = Real( "c3d-gpl/Qualisys.c3d" );
  const std::vector< std::string > Labels{ "LHS", "RTO", "RHS", "LTO", "LHS", "RTO", "RHS" };
  const std::vector< double > Seconds{ 3.590, 3.685, 4.050, 4.160, 4.535, 4.650, 5.030 };
  ASSERT_EQ( Walk.Events.size(), Labels.size() );
  for ( std::size_t Index = 0; Index < Labels.size(); ++Index )
  {
    EXPECT_EQ( Walk.Events[Index].Label, Labels[Index] );
    EXPECT_EQ( Walk.Events[Index].Context, "" );
    EXPECT_NEAR( Walk.Events[Index].FileSeconds, Seconds[Index], 1e-6 );
    EXPECT_NEAR( Walk.Events[Index].Seconds, Seconds[Index] - 3.52, 1e-6 );
  }
}

TEST( RealC3d, CutOffFileGivesItsWholeFrames )
{
  HARROW_NEEDS_RECORDINGS();
  const auto Path = TestSupport::RecordingsDir() / "c3d-gpl/Optotrak.c3d";
  VRecording Cut;
  std::string Message;
  EXPECT_EQ( ReadRecording( Path, Cut, Message ), ZEK::IResult( ZEK::IResult::OkButPartial ) );
  EXPECT_THAT( Message, testing::HasSubstr( Path.string() + ": byte offset 28640: expected 1149 frames" ) );
  EXPECT_EQ( Cut.PointCount(), 54u );
  EXPECT_EQ( Cut.FrameCount, 29 );
  EXPECT_EQ( Cut.RateHz, 30 );
  EXPECT_EQ( Cut.Points.size(), 1566u );
  EXPECT_EQ( Cut.GapCount, 59u );
  ExpectPoint( Cut, 0, "Marker_1", 326.3138, 328.6311, -366.1706 );
  EXPECT_THAT( Cut.Notes, testing::Contains( testing::HasSubstr( "29 whole frames" ) ) );
}

} // namespace HostSources

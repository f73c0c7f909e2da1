#include <HostSources/CameraCalibrations.h>

#include <ComputeCameraModel/VCameraModel.h>
#include <ComputeCameraModel/VRadialDistortion.h>
#include <TestSupport/Paths.h>

#include <gmock/gmock.h>

#include <cmath>
#include <fstream>
#include <map>
#include <numbers>
#include <sstream>

using namespace HostSources;
using CoreMoxelTypes::D3;

namespace
{
struct VBoard
{
  struct VSeen
  {
    std::size_t Camera = 0;
    VPinholeCamera::VPoint At;
    D3 Place; ///< mm
  };
  VCameraCalibrations Calibrations;
  std::vector< VSeen > Seen;
};

std::vector< std::vector< std::string > > Rows( const std::filesystem::path& i_rPath )
{
  std::vector< std::vector< std::string > > Rows;
  std::ifstream Stream( i_rPath );
  for ( std::string Line; std::getline( Stream, Line ); )
  {
    std::istringstream Cells( Line );
    Rows.emplace_back();
    for ( std::string Cell; std::getline( Cells, Cell, ',' ); )
    {
      Rows.back().push_back( Cell );
    }
  }
  return Rows;
}

std::size_t Column( const std::vector< std::string >& i_rHead, const std::string& i_rName )
{
  const auto It = std::find( i_rHead.begin(), i_rHead.end(), i_rName );
  EXPECT_NE( It, i_rHead.end() ) << i_rName;
  return static_cast< std::size_t >( It - i_rHead.begin() );
}

VBoard ReadBoard()
{
  VBoard Board;
  const auto Folder = TestSupport::RecordingsDir() / "multicam-board";
  std::string Message;
  EXPECT_EQ( ReadCameraCalibrations( Folder / "camera_array.toml", Board.Calibrations, Message ), ZEK::IResult::Ok )
      << Message;
  const auto In3d = Rows( Folder / "points3d.csv" ), In2d = Rows( Folder / "points2d.csv" );
  std::map< std::pair< std::string, std::string >, D3 > Places;
  const auto& rHead3 = In3d.at( 0 );
  for ( std::size_t Row = 1; Row < In3d.size(); ++Row )
  {
    const auto Metres = [&]( const char* i_pName )
    {
      return 1000 * std::stod( In3d[Row].at( Column( rHead3, i_pName ) ) );
    };
    Places[{ In3d[Row].at( Column( rHead3, "sync_index" ) ), In3d[Row].at( Column( rHead3, "keypoint_id" ) ) }] = {
        Metres( "x_coord" ), Metres( "y_coord" ), Metres( "z_coord" ) };
  }
  const auto& rHead2 = In2d.at( 0 );
  for ( std::size_t Row = 1; Row < In2d.size(); ++Row )
  {
    const auto& rRow = In2d[Row];
    const auto It =
        Places.find( { rRow.at( Column( rHead2, "sync_index" ) ), rRow.at( Column( rHead2, "keypoint_id" ) ) } );
    if ( It != Places.end() )
    {
      Board.Seen.push_back( { std::stoul( rRow.at( Column( rHead2, "cam_id" ) ) ),
                              { std::stod( rRow.at( Column( rHead2, "img_loc_x" ) ) ),
                                std::stod( rRow.at( Column( rHead2, "img_loc_y" ) ) ) },
                              It->second } );
    }
  }
  return Board;
}

/// Through the model's own matrix and the exact lens, as a view shows the place: in sensor pixels.
VPinholeCamera::VPoint ThroughModel( const VCalibratedCamera& i_rCamera, const D3& i_rPlace )
{
  ComputeCameraModel::VCameraModel Model;
  Model.Set( i_rCamera.Hardware, *i_rCamera.Calibration );
  const std::array< double, 4 > World{ i_rPlace.x, i_rPlace.y, i_rPlace.z, 1 };
  const auto Times = []( const ZEK::VMatrix4& i_rMatrix, const std::array< double, 4 >& i_rPoint )
  {
    std::array< double, 4 > Out{};
    for ( std::size_t Row = 0; Row < 4; ++Row )
    {
      for ( std::size_t Step = 0; Step < 4; ++Step )
      {
        Out[Row] += static_cast< double >( i_rMatrix[4 * Step + Row] ) * i_rPoint[Step];
      }
    }
    return Out;
  };
  const auto Image = Times( Model.ImageTransform, Times( Model.CameraFromWorld, World ) );
  // The corner of the sensor is (0, 0) there, and a pixel's centre here.
  const ComputeCameraModel::VImagePoint Ideal{ Image[0] / Image[3] * i_rCamera.Hardware.SensorWidth - 0.5,
                                               Image[1] / Image[3] * i_rCamera.Hardware.SensorHeight - 0.5 };
  const auto& rC = *i_rCamera.Calibration;
  ComputeCameraModel::VImagePoint Raw;
  EXPECT_TRUE( ComputeCameraModel::VRadialDistortion(
                   { rC.RadialModel, rC.RadialParameters, { rC.DistortionCentre[0], rC.DistortionCentre[1] } } )
                   .Distort( Ideal, Raw ) );
  return { Raw.x, Raw.y };
}

ZEK::IResult Read( const std::string& i_rText, VCameraCalibrations& o_rCalibrations, std::string& o_rMessage )
{
  return ReadCameraCalibrations( std::string_view( i_rText ), "test", o_rCalibrations, o_rMessage );
}

/// A table of a good camera in which one line is another.
std::string Table( const std::string& i_rName, const std::string& i_rOther = "" )
{
  std::string Text = "[" + i_rName + "]\n";
  const std::string OtherKey = i_rOther.substr( 0, i_rOther.find( ' ' ) );
  for ( const char* pLine :
        { "size = [ 640, 480]", "matrix = [ [ 500.0, 0.0, 320.0], [ 0.0, 500.0, 240.0], [ 0.0, 0.0, 1.0]]",
          "distortions = [ -0.1, 0.01, 0.0, 0.0]", "rotation = [ 1.0, 0.2, -0.4]", "translation = [ 0.1, 0.2, 3.0]" } )
  {
    const std::string Line = pLine;
    Text += ( Line.substr( 0, Line.find( ' ' ) ) == OtherKey ? i_rOther : Line ) + "\n";
  }
  return Text;
}
} // namespace

TEST( CameraCalibrations, TheBoardIsSeenWhereItsToolkitSeesIt )
{
  HARROW_NEEDS_RECORDINGS();
  const VBoard Board = ReadBoard();
  ASSERT_EQ( Board.Calibrations.Cameras.size(), 4u );
  constexpr std::array< double, 4 > Mean{ 1.055, 1.735, 1.497, 1.128 }, Worst{ 4.0, 6.7, 5.7, 6.3 };
  std::array< double, 4 > Own{}, Toolkit{}, ToolkitWorst{};
  std::array< std::size_t, 4 > Count{};
  for ( const VBoard::VSeen& rSeen : Board.Seen )
  {
    const VCalibratedCamera& rCamera = Board.Calibrations.Cameras[rSeen.Camera];
    VPinholeCamera::VPoint At;
    ASSERT_TRUE( rCamera.Pinhole->Project( rSeen.Place, At ) );
    const double Miss = std::hypot( At.x - rSeen.At.x, At.y - rSeen.At.y );
    Toolkit[rSeen.Camera] += Miss;
    ToolkitWorst[rSeen.Camera] = std::max( ToolkitWorst[rSeen.Camera], Miss );
    const auto InModel = ThroughModel( rCamera, rSeen.Place );
    Own[rSeen.Camera] += std::hypot( InModel.x - rSeen.At.x, InModel.y - rSeen.At.y );
    ++Count[rSeen.Camera];
  }
  for ( std::size_t Camera = 0; Camera < 4; ++Camera )
  {
    const VCalibratedCamera& rCamera = Board.Calibrations.Cameras[Camera];
    const auto Number = static_cast< double >( Count[Camera] );
    std::cout << rCamera.Name << ": " << Count[Camera] << " observations, toolkit " << Toolkit[Camera] / Number
              << " px, converted " << Own[Camera] / Number << " px, refit rms " << rCamera.Refit.Rms << " worst "
              << rCamera.Refit.Worst << " px\n";
    EXPECT_NEAR( Toolkit[Camera] / Number, Mean[Camera], 0.01 );
    EXPECT_NEAR( ToolkitWorst[Camera], Worst[Camera], 0.05 );
    EXPECT_NEAR( Own[Camera] / Number, Toolkit[Camera] / Number, Camera == 0 ? 0.6 : 0.2 );
    EXPECT_EQ( rCamera.UserId, static_cast< std::int32_t >( Camera ) );
    EXPECT_GT( rCamera.Refit.Covered, 0.99 );
    EXPECT_LT( rCamera.Refit.Rms, 2 );
  }
  const auto& rPosition = Board.Calibrations.Cameras[0].Calibration->Position;
  EXPECT_NEAR( rPosition.x, 944.3, 0.06 );
  EXPECT_NEAR( rPosition.y, 756.2, 0.06 );
  EXPECT_NEAR( rPosition.z, -164.0, 0.06 );
}

TEST( CameraCalibrations, ThePersonsCamerasProjectAsTheirFigures )
{
  HARROW_NEEDS_RECORDINGS();
  VCameraCalibrations Person;
  std::string Message;
  ASSERT_EQ(
      ReadCameraCalibrations( TestSupport::RecordingsDir() / "multicam-person" / "calibration.toml", Person, Message ),
      ZEK::IResult::Ok )
      << Message;
  ASSERT_EQ( Person.Cameras.size(), 4u );
  constexpr double Projected[4][2] = { { 382.60, 728.03 }, { 559.62, 750.45 }, { 645.35, 868.16 }, { 440.70, 950.19 } };
  constexpr double Centres[4][3] = { { 1460.2, -1909.2, 1896.5 },
                                     { 2582.0, 706.6, 1691.0 },
                                     { -3216.9, 2231.2, 2088.2 },
                                     { -3758.7, -1415.7, 1881.8 } };
  for ( std::size_t Camera = 0; Camera < 4; ++Camera )
  {
    VCalibratedCamera& rCamera = Person.Cameras[Camera];
    EXPECT_EQ( rCamera.Name, "cam_0" + std::to_string( Camera + 1 ) );
    EXPECT_LT( rCamera.Refit.Worst, 0.02 );
    EXPECT_NEAR( rCamera.Calibration->Position.x, Centres[Camera][0], 0.06 );
    EXPECT_NEAR( rCamera.Calibration->Position.y, Centres[Camera][1], 0.06 );
    EXPECT_NEAR( rCamera.Calibration->Position.z, Centres[Camera][2], 0.06 );
    // Without the lens, as the figures are.
    rCamera.Calibration->RadialModel = 2;
    rCamera.Calibration->RadialParameters.clear();
    const auto At = ThroughModel( rCamera, { -1400.589, -64.972, 901.505 } );
    EXPECT_NEAR( At.x, Projected[Camera][0], 0.02 );
    EXPECT_NEAR( At.y, Projected[Camera][1], 0.02 );
  }
}

/// Pixels that are not square, a skew and each kind of turn, against a plain pinhole.
TEST( CameraCalibrations, ConvertedPinholesSeeWhatThePinholeSees )
{
  const double Pi = std::numbers::pi;
  for ( const D3& rTurn :
        { D3{ 0, 0, 0 }, { 1.3, -0.4, 0.2 }, { Pi, 0, 0 }, { 0, -Pi * 0.6, Pi * 0.8 }, { 1e-9, 0, 0 } } )
  {
    D3 Again;
    ASSERT_TRUE( RotationVector( RotationMatrix( rTurn ), Again ) );
    const auto R = RotationMatrix( rTurn ), R2 = RotationMatrix( Again );
    for ( std::size_t Index = 0; Index < 9; ++Index )
    {
      EXPECT_NEAR( R[Index], R2[Index], 1e-9 );
    }
    VPinholeCamera Pinhole;
    Pinhole.Fx = 900;
    Pinhole.Fy = 700;
    Pinhole.Cx = 610;
    Pinhole.Cy = 390;
    Pinhole.Skew = 12;
    Pinhole.Rotation = rTurn;
    Pinhole.Translation = { 100, -200, 3000 };
    VCalibratedCamera Camera;
    Camera.Hardware.SensorWidth = 1280;
    Camera.Hardware.SensorHeight = 720;
    std::string Reason;
    ASSERT_TRUE( ConvertPinhole( Pinhole, Camera, Reason ) ) << Reason;
    for ( const D3& rInCamera : { D3{ 0, 0, 3000 }, { 400, 300, 3500 }, { -700, 100, 2800 } } )
    {
      const D3 Off{ rInCamera.x - 100, rInCamera.y + 200, rInCamera.z - 3000 };
      const D3 Place{ R[0] * Off.x + R[3] * Off.y + R[6] * Off.z, R[1] * Off.x + R[4] * Off.y + R[7] * Off.z,
                      R[2] * Off.x + R[5] * Off.y + R[8] * Off.z };
      const auto Seen = ThroughModel( Camera, Place );
      EXPECT_NEAR( Seen.x, ( 900 * rInCamera.x + 12 * rInCamera.y ) / rInCamera.z + 610, 2e-3 );
      EXPECT_NEAR( Seen.y, 700 * rInCamera.y / rInCamera.z + 390, 2e-3 );
    }
  }
  D3 Vector;
  EXPECT_FALSE( RotationVector( { 1, 0, 0, 0, 1, 0, 0, 0, -1 }, Vector ) ) << "a mirror";
  EXPECT_FALSE( RotationVector( { 1, 0, 0, 0, 1.1, 0, 0, 0, 1 }, Vector ) );
  EXPECT_FALSE( RotationVector( { std::nan( "" ), 0, 0, 0, 1, 0, 0, 0, 1 }, Vector ) );
}

TEST( CameraCalibrations, WhatCannotBeUsedIsToldAndTheRestIsKept )
{
  struct VCase
  {
    const char* pLine;
    const char* pWord;
    bool bThere;
  };
  VCameraCalibrations Calibrations;
  std::string Message;
  for ( const auto& [pLine, pWord, bThere] :
        { VCase{ "size = [0, 480]", "size", false },
          { "size = [640]", "size", false },
          { "size = 3", "size", false },
          { "size = [nan, 480]", "size", false },
          { "size = [1e9, 480]", "size", false },
          { "matrix = [[0.0, 0, 320], [0, 500, 240], [0, 0, 1]]", "focal", true },
          { "matrix = [[nan, 0, 320], [0, 500, 240], [0, 0, 1]]", "finite", true },
          { "matrix = [[500, 0, 320], [0, 500, 240]]", "matrix", true },
          { "matrix = [[500, 0, 320], [0, 500, 240], [0, 1, 1]]", "pinhole", true },
          { "matrix = \"none\"", "matrix", true },
          { "distortions = [ 0.1, 0.2, 0.3]", "distortions", true },
          { "distortions = [ 0.1, 0.2, 0, 0, 0, 1, 1, 1]", "distortions", true },
          { "distortions = [ inf, 0.2, 0, 0]", "finite", true },
          { "distortions = [ -1e9, 0.2, 0, 0]", "inverse", true },
          { "rotation = [ nan, 0, 0]", "finite", true },
          { "rotation = [[1, 0, 0], [0, 2, 0], [0, 0, 1]]", "rotation", true },
          { "rotation = [1, 2]", "rotation", true },
          { "translation = []", "translation", true },
          { "translation = [0, 0, -inf]", "finite", true } } )
  {
    SCOPED_TRACE( pLine );
    ASSERT_EQ( Read( Table( "good" ) + Table( "bad", pLine ), Calibrations, Message ), ZEK::IResult::OkButPartial )
        << Message;
    EXPECT_EQ( Calibrations.Cameras.size(), bThere ? 2u : 1u );
    EXPECT_TRUE( Calibrations.Cameras[0].Calibration );
    EXPECT_FALSE( bThere && Calibrations.Cameras[1].Calibration );
    ASSERT_EQ( Calibrations.Notes.size(), 1u );
    EXPECT_THAT( Calibrations.Notes[0],
                 testing::AllOf( testing::HasSubstr( "\"bad\"" ), testing::HasSubstr( pWord ) ) );
  }
  for ( const char* pTurn : { "rotation = [1e-12, 0, 0]", "rotation = [1e7, -1e7, 3]" } )
  {
    EXPECT_EQ( Read( Table( "c", pTurn ), Calibrations, Message ), ZEK::IResult::Ok ) << pTurn;
  }
  EXPECT_EQ( Read( Table( "c" ) + "fisheye = true\n", Calibrations, Message ), ZEK::IResult::OkButPartial );

  // Names: empty, twice, and odd ones.
  const std::string Quoted = Table( "a.\"\"" ) + Table( "twin" ) + Table( "twin" ) + Table( "'twin (2)'" ) +
                             Table( "\"\\\"x\xFF\"" ) + Table( "b.7" );
  EXPECT_EQ( Read( Quoted, Calibrations, Message ), ZEK::IResult::OkButPartial ) << Message;
  std::vector< std::string > Names;
  for ( const VCalibratedCamera& rCamera : Calibrations.Cameras )
  {
    Names.push_back( rCamera.Name );
  }
  EXPECT_THAT( Names, testing::ElementsAre( "camera (1)", "twin", "twin (3)", "twin (2)", "\"x\xC3\xBF", "cam_7" ) );
}

TEST( CameraCalibrations, FilesThatAreNoneSayWhere )
{
  VCameraCalibrations Calibrations;
  std::string Message;
  struct VCase
  {
    std::string Text;
    const char* pWhere;
  };
  for ( const VCase& rCase : std::vector< VCase >{ { "", "found nothing" },
                                                   { "\xEF\xBB\xBF\n", "found nothing" },
                                                   { "# none\n[metadata]\nerror = 0.0\n", "found none" },
                                                   { "[a]\nb = \n", "line 2: expected a value" },
                                                   { "[a]\n\nb = [1, 2\n", "line 4: expected" },
                                                   { "[a\n", "line 1: expected ]" },
                                                   { "[a]\nb = \"x\n", "line 2: a text without an end" },
                                                   { "[a]\nb = 1 c = 2\n", "line 2: expected the end" },
                                                   { "a = " + std::string( 5000, '[' ), "too deep" },
                                                   { "{", "byte offset 1" },
                                                   { "{\"format\": \"other\", \"cameras\": []}", "harrow-cameras" },
                                                   { "{\"format\": \"harrow-cameras\", \"cameras\": 1}", "list" },
                                                   { std::string( 100000, '{' ), "byte offset" },
                                                   { std::string( "\0\1\2", 3 ), "line 1" } } )
  {
    EXPECT_EQ( Read( rCase.Text, Calibrations, Message ), ZEK::IResult::InvalidFormat ) << rCase.Text.substr( 0, 40 );
    EXPECT_THAT( Message, testing::AllOf( testing::StartsWith( "test: " ), testing::HasSubstr( rCase.pWhere ) ) );
    EXPECT_TRUE( Calibrations.Cameras.empty() );
  }
  const TestSupport::VTemporaryDir Folder;
  EXPECT_EQ( ReadCameraCalibrations( Folder.Path() / "none", Calibrations, Message ), ZEK::IResult::FileNotFound );
  EXPECT_EQ( ReadCameraCalibrations( Folder.Path(), Calibrations, Message ), ZEK::IResult::FileIOFailure );
}

TEST( CameraCalibrations, TheReportIsReadAgainAsItWas )
{
  VCameraCalibrations First, Again;
  std::string Message;
  std::string Odd = Table( "two", "size = [ 0x280, 4_80]" );
  ASSERT_EQ( Read( Table( "one", "distortions = [ -0.3, 0.05, -0.004, 0.004, 0.06]" ) + Odd +
                       Table( "three", "rotation = [ nan, 0, 0]" ),
                   First, Message ),
             ZEK::IResult::OkButPartial );
  const std::string Json = CameraCalibrationsJson( First );
  ASSERT_EQ( Read( Json, Again, Message ), ZEK::IResult::OkButPartial ) << Message;
  ASSERT_EQ( Again.Cameras.size(), 3u );
  EXPECT_FALSE( Again.Cameras[2].Calibration );
  for ( std::size_t Camera = 0; Camera < 2; ++Camera )
  {
    const auto& rA = *First.Cameras[Camera].Calibration;
    const auto& rB = *Again.Cameras[Camera].Calibration;
    EXPECT_EQ( rA.RadialParameters, rB.RadialParameters );
    EXPECT_EQ( rA.PrincipalPoint[1], rB.PrincipalPoint[1] );
    EXPECT_EQ( rA.Position.y, rB.Position.y );
    EXPECT_EQ( rA.Rotation.z, rB.Rotation.z );
    EXPECT_EQ( First.Cameras[Camera].Hardware.SensorWidth, Again.Cameras[Camera].Hardware.SensorWidth );
    // The same models but for the refit, which belongs to the file that was converted.
    const auto Model = []( const std::string& i_rText, std::size_t i_From )
    {
      const std::size_t Begin = i_rText.find( "\"model\"", i_From );
      return i_rText.substr( Begin, i_rText.find( "distortionDomain", Begin ) - Begin );
    };
    EXPECT_EQ( Model( Json, 0 ), Model( CameraCalibrationsJson( Again ), 0 ) );
  }
  for ( const char* pKey : { "residualRms", "residualWorst", "maxRawRadius", "roll", "imageTransformSnapped" } )
  {
    EXPECT_THAT( Json, testing::HasSubstr( pKey ) );
  }

  const auto Camera = []( const std::string& i_rCalibration )
  {
    return R"({"format":"harrow-cameras","cameras":[{"name":"a","sensor":[640,480],"calibration":{"rotation":[0,0,0],)"
           R"("position":[0,0,0],"principalPoint":[320,240],"distortionCentre":[320,240],)" +
           i_rCalibration + "}}]}";
  };
  EXPECT_EQ( Read( Camera( R"("focalLength":500,"radialModel":1,"radialParameters":[0,0,0])" ), Again, Message ),
             ZEK::IResult::Ok );
  for ( const char* pBad :
        { R"("focalLength":0,"radialParameters":[0,0])", R"("focalLength":NaN,"radialParameters":[0,0])",
          R"("focalLength":500,"radialParameters":[0,0,0])", R"("focalLength":500)",
          R"("focalLength":500,"radialModel":2,"radialParameters":[])",
          R"("focalLength":500,"radialModel":-1,"radialParameters":[0,0])",
          R"("focalLength":500,"radialModel":"x","radialParameters":[0,0])",
          R"("focalLength":500,"radialParameters":[0,null])",
          R"("focalLength":500,"aspectRatio":0,"radialParameters":[0,0])",
          R"("focalLength":500,"skew":Infinity,"radialParameters":[0,0])" } )
  {
    EXPECT_EQ( Read( Camera( pBad ), Again, Message ), ZEK::IResult::OkButPartial ) << pBad;
    ASSERT_EQ( Again.Cameras.size(), 1u ) << pBad;
    EXPECT_FALSE( Again.Cameras[0].Calibration ) << pBad;
  }
}

TEST( CameraCalibrations, TenThousandCamerasOfOneName )
{
  std::string Text;
  for ( int Camera = 0; Camera < 10000; ++Camera )
  {
    Text += Table( "same", "distortions = []" );
  }
  VCameraCalibrations Calibrations;
  std::string Message;
  EXPECT_EQ( Read( Text, Calibrations, Message ), ZEK::IResult::OkButPartial );
  ASSERT_EQ( Calibrations.Cameras.size(), 10000u );
  EXPECT_EQ( Calibrations.Cameras.back().Name, "same (10000)" );
}

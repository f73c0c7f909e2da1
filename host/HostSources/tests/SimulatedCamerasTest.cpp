#include "SimulatedLens.h"
#include "SimulatedMarkers.h"
#include "SimulatedStage.h"
#include "SimulatedStates.h"

#include <ComputeCameraModel/VCameraModel.h>

#include <algorithm>
#include <cstring>
#include <map>
#include <set>

using namespace ZEK;
using namespace CoreMoxelTypes;
using namespace HostSources;
using namespace HostSources::Simulation;

namespace
{

/// From the camera through a point of the raw image, by way of the matrices that views draw with.
struct VRay
{
  D3 From, Way;
};
VRay RayOf( const VCameraHardware& i_rHardware, const VCameraCalibration& i_rCalibration, const VCentroid& i_rCentroid )
{
  ComputeCameraModel::VCameraModel Model;
  Model.Set( i_rHardware, i_rCalibration );
  const ComputeCameraModel::VRadialDistortion Lens(
      { i_rCalibration.RadialModel,
        i_rCalibration.RadialParameters,
        { i_rCalibration.DistortionCentre[0], i_rCalibration.DistortionCentre[1] } } );
  ComputeCameraModel::VImagePoint Point{ i_rCentroid.x, i_rCentroid.y };
  EXPECT_TRUE( Lens.Correct( Point, Point ) );
  // The image transform by columns: u w = M0 x + M4 y + M8 z and so on, solved for z = -1.
  const auto& M = Model.ImageTransform;
  const double U = ( Point.x + 0.5 ) / i_rHardware.SensorWidth, V = ( Point.y + 0.5 ) / i_rHardware.SensorHeight;
  const double A = M[0] - U * M[3], B = M[4] - U * M[7], C = M[8] - U * M[11];
  const double D = M[1] - V * M[3], E = M[5] - V * M[7], F = M[9] - V * M[11];
  const double Determinant = A * E - B * D;
  const double X = ( C * E - B * F ) / Determinant, Y = ( A * F - C * D ) / Determinant;
  const auto& W = Model.WorldFromCamera; // y down, z forward
  const D3 Way = D3{ W[0], W[1], W[2] } * X + D3{ W[4], W[5], W[6] } * -Y + D3{ W[8], W[9], W[10] };
  return { i_rCalibration.Position, Unit( Way ) };
}

/// Half way between two rays where they come closest.
D3 Meet( const VRay& i_rA, const VRay& i_rB )
{
  const D3 Between = i_rB.From - i_rA.From;
  const double Cosine = Dot( i_rA.Way, i_rB.Way ), Rest = 1 - Cosine * Cosine;
  const double AlongA = ( Dot( Between, i_rA.Way ) - Cosine * Dot( Between, i_rB.Way ) ) / Rest;
  const double AlongB = ( Cosine * Dot( Between, i_rA.Way ) - Dot( Between, i_rB.Way ) ) / Rest;
  return ( i_rA.From + i_rA.Way * AlongA + i_rB.From + i_rB.Way * AlongB ) * 0.5;
}

constexpr u8 Merged = 120;

/// Everything that a frame's cameras saw, as bytes.
std::string PrintOf( VSimulatedCapture& i_rCapture, std::int64_t i_Frame )
{
  const auto State = StateOf( i_rCapture, i_Frame );
  std::string Print;
  const auto Add = [&]( const auto& i_rVector )
  {
    for ( const auto& rElement : i_rVector )
    {
      Print += std::to_string( rElement ) + ' ';
    }
  };
  for ( const auto& [Name, pSet] : ByCamera< VCentroidSet >( *State, 0x1003 ) )
  {
    Print += Name;
    for ( const VCentroid& rCentroid : pSet->Centroids )
    {
      Add( std::vector< double >{ rCentroid.x, rCentroid.y, rCentroid.radius, double( rCentroid.Quality ) } );
    }
  }
  for ( const auto& [Name, pSet] : ByCamera< VCentroidAssignmentSet >( *State, 0x100c ) )
  {
    Add( pSet->Reconstruction );
  }
  for ( const auto& [Name, pSet] : ByCamera< VGreyscaleBlobSet >( *State, 0x1005 ) )
  {
    Add( pSet->Pixels );
  }
  return Print;
}

} // namespace

TEST( SimulatedCameras, RaysOfTheSameReconstructionMeetInIt )
{
  VSimulatedCapture Capture( { .NoiseMm = 0 } );
  const auto State = StateOf( Capture, 77 );
  const auto& rPoints = Only< VReconstructionSet >( *State, 0x100d ).Items;
  const auto Hardware = ByCamera< VCameraHardware >( *State, 0x1000 );
  const auto Calibrations = ByCamera< VCameraCalibration >( *State, 0x100a );
  const auto Assignments = ByCamera< VCentroidAssignmentSet >( *State, 0x100c );
  std::vector< std::vector< VRay > > Rays( rPoints.size() );
  double Bent = 0;
  for ( const auto& [Name, pSet] : ByCamera< VCentroidSet >( *State, 0x1003 ) )
  {
    ASSERT_EQ( Assignments.at( Name )->Reconstruction.size(), pSet->Centroids.size() );
    for ( std::size_t Index = 0; Index < pSet->Centroids.size(); ++Index )
    {
      const VCentroid& rCentroid = pSet->Centroids[Index];
      const i32 Reconstruction = Assignments.at( Name )->Reconstruction[Index];
      if ( Reconstruction >= 0 && rCentroid.Quality != Merged )
      {
        ASSERT_LT( Reconstruction, static_cast< i32 >( rPoints.size() ) );
        Rays[static_cast< std::size_t >( Reconstruction )].push_back(
            RayOf( *Hardware.at( Name ), *Calibrations.at( Name ), rCentroid ) );
      }
      Bent = std::max( Bent, std::hypot( rCentroid.x - 640.0, rCentroid.y - 512.0 ) );
    }
  }
  EXPECT_GT( Bent, 400 ) << "where the lens bends";
  std::size_t Pairs = 0;
  double Worst = 0;
  for ( std::size_t Point = 0; Point < Rays.size(); ++Point )
  {
    for ( std::size_t Ray = 1; Ray < Rays[Point].size(); ++Ray )
    {
      const VRay &rA = Rays[Point][Ray - 1], &rB = Rays[Point][Ray];
      if ( std::abs( Dot( rA.Way, rB.Way ) ) < 0.95 )
      {
        Worst = std::max( Worst, Length( Meet( rA, rB ) - rPoints[Point].Position ) );
        ++Pairs;
      }
    }
  }
  EXPECT_GT( Pairs, 200u );
  EXPECT_LT( Worst, 0.05 ) << "mm";
}

TEST( SimulatedCameras, CentroidsAgreeWithReconstructionsLabelsAndBlobs )
{
  VSimulatedCapture Capture( { .Performers = 6, .GapProbability = 0.2, .ExtraPoints = 30 } );
  std::size_t Unassigned = 0, MergedOnes = 0, Edges = 0;
  for ( std::int64_t Frame = 0; Frame < 300; Frame += 60 )
  {
    const auto State = StateOf( Capture, Frame );
    const auto& rPoints = Only< VReconstructionSet >( *State, 0x100d ).Items;
    std::map< i32, VReconstructionLabelSet::L > Labels;
    for ( const auto& rLabel : Only< VReconstructionLabelSet >( *State, 0x100f ).Labels )
    {
      Labels[static_cast< i32 >( rLabel.Reconstruction )] = rLabel;
    }
    const auto Assignments = ByCamera< VCentroidAssignmentSet >( *State, 0x100c );
    const auto CentroidLabels = ByCamera< VCentroidLabelSet >( *State, 0x1022 );
    const auto Blobs = ByCamera< VGreyscaleBlobSet >( *State, 0x1005 );
    const auto Masks = ByCamera< VCameraMaskGrid >( *State, 0x1002 );
    std::vector< u32 > Counted( rPoints.size() );
    for ( const auto& [Name, pSet] : ByCamera< VCentroidSet >( *State, 0x1003 ) )
    {
      const auto& rAssigned = Assignments.at( Name )->Reconstruction;
      const VGreyscaleBlobSet& rBlobs = *Blobs.at( Name );
      const VCameraMaskGrid& rMask = *Masks.at( Name );
      ASSERT_EQ( rAssigned.size(), pSet->Centroids.size() );
      ASSERT_EQ( CentroidLabels.at( Name )->Labels.size(), pSet->Centroids.size() );
      ASSERT_EQ( rBlobs.Blobs.size(), pSet->Centroids.size() );
      ASSERT_TRUE( std::count( rMask.Cells.begin(), rMask.Cells.end(), 0xFF ) > 0 );
      std::set< i32 > Once;
      std::set< std::pair< int, int > > Pixels;
      for ( std::size_t Index = 0; Index < rAssigned.size(); ++Index )
      {
        const VCentroid& rCentroid = pSet->Centroids[Index];
        const auto& rLabel = CentroidLabels.at( Name )->Labels[Index];
        ASSERT_TRUE( rCentroid.x >= -0.5F && rCentroid.x < 1279.5F && rCentroid.y >= -0.5F && rCentroid.y < 1023.5F );
        ASSERT_TRUE( rCentroid.radius >= 0.5F && rCentroid.radius < 20 ) << rCentroid.radius;
        if ( rAssigned[Index] >= 0 )
        {
          ASSERT_TRUE( Once.insert( rAssigned[Index] ).second );
          ++Counted.at( static_cast< std::size_t >( rAssigned[Index] ) );
          const auto Label = Labels.find( rAssigned[Index] );
          EXPECT_EQ( rLabel.SubjectId, Label == Labels.end() ? NoSubject : Label->second.SubjectId );
          EXPECT_EQ( rLabel.MarkerId, Label == Labels.end() ? NoSubject : Label->second.MarkerId );
        }
        else
        {
          EXPECT_EQ( rLabel.SubjectId, NoSubject );
          ++Unassigned;
        }
        // The grey pixels lie about the centroid, each once, in lines that follow each other.
        const VGreyscaleBlob& rBlob = rBlobs.Blobs.at( rCentroid.Blob );
        ASSERT_EQ( rBlob.Centroid, static_cast< i32 >( Index ) );
        double Sum = 0, X = 0, Y = 0;
        bool bCut = false;
        for ( std::size_t Line = rBlob.FirstLine; Line < rBlob.FirstLine + rBlob.LineCount; ++Line )
        {
          const VGreyscaleLine& rLine = rBlobs.Lines.at( Line );
          ASSERT_LE( rLine.x + rLine.length, 1280 );
          ASSERT_LT( rLine.y, 1024 );
          bCut = bCut || rLine.x == 0 || rLine.y == 0 || rLine.x + rLine.length == 1280 || rLine.y == 1023;
          for ( int Column = 0; Column < rLine.length; ++Column )
          {
            const double Grey = rBlobs.Pixels.at( rLine.First + static_cast< std::size_t >( Column ) ) - 39.0;
            ASSERT_GT( Grey, 0 );
            ASSERT_TRUE( Pixels.insert( { rLine.x + Column, rLine.y } ).second ) << "blobs share no pixel";
            Sum += Grey;
            X += Grey * ( rLine.x + Column );
            Y += Grey * rLine.y;
          }
        }
        ASSERT_GT( Sum, 0 );
        if ( rCentroid.Quality == Merged )
        {
          ++MergedOnes;
        }
        else if ( !bCut )
        {
          ASSERT_NEAR( X / Sum, rCentroid.x, 0.2 );
          ASSERT_NEAR( Y / Sum, rCentroid.y, 0.2 );
        }
      }
    }
    for ( std::size_t Point = 0; Point < rPoints.size(); ++Point )
    {
      ASSERT_EQ( rPoints[Point].Rays, Counted[Point] );
    }
    for ( const auto& [Name, pSet] : ByCamera< VEdgePairSet >( *State, 0x1006 ) )
    {
      Edges += pSet->Pairs.size();
      ASSERT_EQ( pSet->Pairs.size(), Blobs.at( Name )->Lines.size() );
      for ( std::size_t Pair = 0; Pair < pSet->Pairs.size(); ++Pair )
      {
        const VGreyscaleLine& rLine = Blobs.at( Name )->Lines[Pair];
        ASSERT_EQ( pSet->Pairs[Pair].y, rLine.y );
        ASSERT_LE( pSet->Pairs[Pair].Left, pSet->Pairs[Pair].Right );
        ASSERT_EQ( pSet->Pairs[Pair].GreyLeft, Blobs.at( Name )->Pixels[rLine.First] );
      }
    }
  }
  EXPECT_GT( Unassigned, 50u );
  EXPECT_GT( MergedOnes, 50u );
  EXPECT_GT( Edges, 100u );
}

TEST( SimulatedCameras, TheSeedAndTheFrameDecideWhatCamerasSee )
{
  VSimulatedCapture First( { .Seed = 5 } ), Second( { .Seed = 5 } ), Other( { .Seed = 6 } );
  const std::string Later = PrintOf( First, 90 ), Earlier = PrintOf( First, 3 );
  EXPECT_EQ( PrintOf( Second, 3 ), Earlier );
  EXPECT_EQ( PrintOf( Second, 90 ), Later );
  EXPECT_NE( Earlier, Later );
  EXPECT_NE( PrintOf( Other, 3 ), Earlier );
}

TEST( SimulatedCameras, AFullHouseOfCamerasHasNamesOfItsOwn )
{
  VSimulatedCapture Capture( { .Cameras = 256, .VideoCameras = 1000 } );
  EXPECT_EQ( Capture.Options().VideoCameras, 128u );
  VSimulatedCapture Full( { .Cameras = 256, .VideoCameras = 0 } );
  const auto State = StateOf( Full, 12 );
  for ( const std::uint32_t Tag : { 0x1000, 0x1001, 0x1002, 0x1003, 0x100a, 0x100c, 0x1022 } )
  {
    EXPECT_EQ( ItemsOf( *State, Tag ).size(), 256u ) << Tag;
  }
  std::size_t Empty = 0;
  for ( const auto& [Name, pSet] : ByCamera< VCentroidSet >( *State, 0x1003 ) )
  {
    Empty += pSet->Centroids.size() < 20;
  }
  EXPECT_EQ( Empty, 0u ) << "every camera sees the people";
}

TEST( SimulatedCameras, FaultsShowInTheCameraThatHasThemAndInNoOther )
{
  const auto Fault = []( std::uint32_t i_Camera, ESimulatedFault i_Fault )
  {
    return VSimulatedFault{ i_Camera, i_Fault };
  };
  VSimulatedCapture Capture(
      { .Faults = { Fault( 0, ESimulatedFault::Bumped ), Fault( 1, ESimulatedFault::Missing ),
                    Fault( 2, ESimulatedFault::Disconnected ), Fault( 3, ESimulatedFault::Disabled ),
                    Fault( 4, ESimulatedFault::NotContributing ), Fault( 5, ESimulatedFault::Uncalibrated ),
                    Fault( 6, ESimulatedFault::Hot ), Fault( 7, ESimulatedFault::Warned ),
                    Fault( 500, ESimulatedFault::Hot ), Fault( 8, static_cast< ESimulatedFault >( 77 ) ) } } );
  const auto State = StateOf( Capture, 40 );
  const auto Centroids = ByCamera< VCentroidSet >( *State, 0x1003 );
  const auto Assignments = ByCamera< VCentroidAssignmentSet >( *State, 0x100c );
  const auto Settings = ByCamera< VCameraSettings >( *State, 0x1001 );
  const auto Calibrations = ByCamera< VCameraCalibration >( *State, 0x100a );
  const auto Health = ByCamera< VCameraCalibrationHealth >( *State, 0x100b );
  const auto Details = ByCamera< VCameraCalibrationDetails >( *State, 0x102f );
  const auto Sensors = ByCamera< VCameraPhysicalSensorData >( *State, 0x102e );
  const auto Warnings = ByCamera< VDeviceWarnings >( *State, 0x1037 );
  const auto Is = [&]( const std::string& i_rName, const char* i_pKey )
  {
    return std::get< bool >( Settings.at( i_rName )->Values.at( i_pKey ) );
  };
  for ( int Number = 1; Number <= 10; ++Number )
  {
    const std::string Name = "Camera " + std::to_string( Number );
    SCOPED_TRACE( Name );
    EXPECT_EQ( Is( Name, "Connected" ), Number != 2 && Number != 3 );
    EXPECT_EQ( Is( Name, "Missing" ), Number == 2 );
    EXPECT_EQ( Is( Name, "Enabled" ), Number != 4 );
    EXPECT_EQ( Is( Name, "Contributing" ), Number != 5 );
    EXPECT_EQ( Calibrations.contains( Name ), Number != 6 );
    EXPECT_EQ( Centroids.contains( Name ), Number < 2 || Number > 4 );
    EXPECT_EQ( Warnings.at( Name )->Flags, Number == 8 ? 0xFFu : 0u );
    if ( Number != 6 )
    {
      EXPECT_EQ( Health.at( Name )->IsBumped, Number == 1 );
      EXPECT_EQ( Health.at( Name )->Score > 0.66F, Number == 1 );
      const auto* pSensor = Sensors.at( Name );
      EXPECT_EQ( std::abs( pSensor->Temperature - Details.at( Name )->EndedTemperature ) >
                     pSensor->TemperatureTolerance,
                 Number == 7 );
    }
    if ( Assignments.contains( Name ) )
    {
      const auto& rAssigned = Assignments.at( Name )->Reconstruction;
      EXPECT_FALSE( rAssigned.empty() );
      EXPECT_EQ( std::all_of( rAssigned.begin(), rAssigned.end(),
                              []( i32 i_Value )
                              {
                                return i_Value < 0;
                              } ),
                 Number == 1 || Number == 5 || Number == 6 );
    }
  }
}

namespace
{

using VPicture = std::vector< std::array< double, 3 > >; // R, G, B; 0 to 255

/// As a reader of the format takes it; what a format does not tell of a pixel is not a number.
VPicture Decoded( const VVideoFrame& i_rFrame )
{
  const std::vector< u8 >& rData = *i_rFrame.Data;
  const auto At = [&]( int i_Plane, std::size_t i_X, std::size_t i_Y )
  {
    return static_cast< double >( rData.at( i_rFrame.Offset[i_Plane] + i_Y * i_rFrame.Stride[i_Plane] + i_X ) );
  };
  const double None = std::nan( "" );
  VPicture Picture;
  for ( std::size_t Y = 0; Y < i_rFrame.Height; ++Y )
  {
    for ( std::size_t X = 0; X < i_rFrame.Width; ++X )
    {
      double L = None, B = 128, R = 128;
      std::array< double, 3 > Colour{ None, None, None };
      const std::size_t Pair = X / 2 * 4;
      switch ( i_rFrame.Format )
      {
      case EPixelFormat::Luminance8:
      case EPixelFormat::Luminance16:
        Colour[0] = i_rFrame.Format == EPixelFormat::Luminance8
                        ? At( 0, X, Y )
                        : ( At( 0, 2 * X, Y ) + 256 * At( 0, 2 * X + 1, Y ) ) / 257;
        Colour[1] = Colour[2] = Colour[0];
        break;
      case EPixelFormat::YUYV:
        L = At( 0, 2 * X, Y ), B = At( 0, Pair + 1, Y ), R = At( 0, Pair + 3, Y );
        break;
      case EPixelFormat::UYVY:
        L = At( 0, 2 * X + 1, Y ), B = At( 0, Pair, Y ), R = At( 0, Pair + 2, Y );
        break;
      case EPixelFormat::I420:
        L = At( 0, X, Y ), B = At( 1, X / 2, Y / 2 ), R = At( 2, X / 2, Y / 2 );
        break;
      case EPixelFormat::NV12:
        L = At( 0, X, Y ), B = At( 1, X / 2 * 2, Y / 2 ), R = At( 1, X / 2 * 2 + 1, Y / 2 );
        break;
      default:
      {
        const char* const pSquares[] = { "RGGB", "GRBG", "GBRG", "BGGR" };
        const char Letter = pSquares[static_cast< u32 >( i_rFrame.Format ) - 2][Y % 2 * 2 + X % 2];
        Colour[Letter == 'R' ? 0 : Letter == 'G' ? 1 : 2] = At( 0, X, Y );
      }
      }
      if ( !std::isnan( L ) )
      {
        const double Light = ( L - 16 ) * 255 / 219, Blue = ( B - 128 ) * 255 / 224, Red = ( R - 128 ) * 255 / 224;
        Colour = { Light + 1.402 * Red, Light - 0.344136 * Blue - 0.714136 * Red, Light + 1.772 * Blue };
      }
      Picture.push_back( Colour );
    }
  }
  return Picture;
}

} // namespace

TEST( SimulatedCameras, VideoIsTheSamePictureInEveryFormat )
{
  constexpr std::int64_t Frame = 1001;
  const auto VideoOf = [&]( EPixelFormat i_Format, VFlowStateRef& o_rState )
  {
    VSimulatedCapture Capture( { .RateHz = 100, .VideoFormat = i_Format } );
    o_rState = StateOf( Capture, Frame );
    const auto Frames = ByCamera< VVideoFrame >( *o_rState, 0x1007 );
    EXPECT_EQ( Frames.size(), 2u );
    return Frames.at( "Camera 12" );
  };
  VFlowStateRef Kept;
  const VPicture Reference = Decoded( *VideoOf( EPixelFormat::YUYV, Kept ) );
  for ( u32 Format = 0; Format < 10; ++Format )
  {
    SCOPED_TRACE( Format );
    VFlowStateRef State;
    const VVideoFrame* pFrame = VideoOf( static_cast< EPixelFormat >( Format ), State );
    ASSERT_EQ( static_cast< u32 >( pFrame->Format ), Format );
    EXPECT_NEAR( pFrame->PresentationTime, 300 / 30.0, 1e-9 );
    const VPicture Picture = Decoded( *pFrame );
    ASSERT_EQ( Picture.size(), Reference.size() );
    double Error = 0, Count = 0;
    for ( std::size_t Pixel = 0; Pixel < Picture.size(); ++Pixel )
    {
      const auto& rGood = Reference[Pixel];
      const double Grey = 0.299 * rGood[0] + 0.587 * rGood[1] + 0.114 * rGood[2];
      for ( std::size_t Channel = 0; Channel < 3; ++Channel )
      {
        if ( !std::isnan( Picture[Pixel][Channel] ) )
        {
          Error += std::abs( Picture[Pixel][Channel] - ( Format < 2 ? Grey : rGood[Channel] ) );
          ++Count;
        }
      }
    }
    EXPECT_GE( Count, Picture.size() );
    EXPECT_LT( Error / Count, 2.5 ) << "grey values";
  }
}

TEST( SimulatedCameras, VideoKeepsItsOwnRateAndGoesThroughAllFormats )
{
  VSimulatedCapture Capture( { .RateHz = 120 } ), Again( { .RateHz = 120 } );
  std::set< EPixelFormat > Formats;
  for ( std::int64_t Frame = 0; Frame < 2400; Frame += 240 )
  {
    const auto First = StateOf( Capture, Frame ), Held = StateOf( Capture, Frame + 3 ),
               Next = StateOf( Capture, Frame + 4 );
    ASSERT_EQ( ItemsOf( *First, 0x1007 ), ItemsOf( *Held, 0x1007 ) );
    ASSERT_NE( ItemsOf( *First, 0x1007 ), ItemsOf( *Next, 0x1007 ) );
    const auto Frames = ByCamera< VVideoFrame >( *First, 0x1007 );
    Formats.insert( Frames.at( "Camera 11" )->Format );
    // Asked for in the middle of the frame, the picture is that of its beginning.
    const auto Middle = StateOf( Again, Frame + 2 );
    ASSERT_EQ( *ByCamera< VVideoFrame >( *Middle, 0x1007 ).at( "Camera 11" )->Data, *Frames.at( "Camera 11" )->Data );
    ASSERT_FALSE( ByCamera< VCentroidSet >( *First, 0x1003 ).contains( "Camera 11" ) );
    ASSERT_TRUE( ByCamera< VCameraHardware >( *First, 0x1000 ).at( "Camera 11" )->Video );
  }
  EXPECT_EQ( Formats.size(), 10u );
}

#include "CameraTest.h"

#include <Flow2Graphics/VFlowRenderCentroidAssignments.h>
#include <TestSupport/Allocations.h>

#include <map>
#include <random>

using namespace FlowTest;

namespace
{
class CameraDrawData : public VCameraFixture
{
};

/// The pixels of a set as its lines have them, later ones over earlier ones.
std::map< std::pair< int, int >, int > Paint( const VGreyscaleBlobSet& i_rSet )
{
  std::map< std::pair< int, int >, int > Image;
  for ( const VGreyscaleBlob& rBlob : i_rSet.Blobs )
  {
    for ( u32 Line = rBlob.FirstLine; Line < rBlob.FirstLine + rBlob.LineCount; ++Line )
    {
      const VGreyscaleLine& rLine = i_rSet.Lines[Line];
      for ( u32 Step = 0; Step < rLine.length; ++Step )
      {
        Image[{ static_cast< int >( rLine.x + Step ), rLine.y }] = i_rSet.Pixels[rLine.First + Step];
      }
    }
  }
  return Image;
}

/// The same as a program would that is given a box a record and looks its pixels up.
std::map< std::pair< int, int >, int > Paint( const ZEK::VGreyscaleData& i_rData )
{
  std::map< std::pair< int, int >, int > Image;
  for ( const ZEK::VGreyscaleRecord& rRecord : i_rData.Records )
  {
    for ( int Y = rRecord.Top; Y <= rRecord.Bottom; ++Y )
    {
      const ZEK::VGreyscaleSpan& rSpan = i_rData.Lines.at( rRecord.FirstLine + static_cast< u32 >( Y - rRecord.Top ) );
      for ( int X = rRecord.Left; X <= rRecord.Right; ++X )
      {
        if ( X >= rSpan.X && X < rSpan.X + rSpan.Length )
        {
          Image[{ X, Y }] = i_rData.Pixels[rSpan.FirstByte + static_cast< u32 >( X - rSpan.X )];
        }
      }
    }
  }
  return Image;
}
} // namespace

TEST_F( CameraDrawData, CentroidsAreColouredBySchemeAndMarkedBySelection )
{
  VSubject Subject;
  Subject.Id = 4;
  Subject.Markers.resize( 2 );
  Subject.Markers[1].Id = 9;
  VSubjectApplicationData Looks, Short;
  Looks.MarkerColours = { 0xFF000011, 0xFF000022 };
  Looks.Sticks = { { 0, 1, 1, 2 }, { 0, 2, 3, 4 } };
  Short.MarkerColours = { 0xFF000033 };
  VSubject Other = Subject;
  Other.Id = 5;
  VCentroidLabelSet Labels;
  Labels.Labels = { { 4, 9 }, { 4, 0 }, { 5, 0 }, {} };
  VReconstructionLabelSet ReconstructionLabels;
  ReconstructionLabels.Labels = { { 1, 4, 9 }, { 0xFFFFFFFF, 1, 1 } };
  const std::vector< VFlowItemRef > Items{ Hard( "a" ),
                                           Hard( "b" ),
                                           Item< FlowCameraCalibration >( Calibration() ),
                                           Item< FlowCentroidSet >( Centroids( 5 ) ),
                                           Item< FlowCentroidSet >( Centroids( 2 ), "b" ),
                                           Item< FlowCentroidLabelSet >( Labels ),
                                           Item< FlowCentroidAssignmentSet >( { { 0, 1, -1, 77 } } ),
                                           Maker.Item< FlowReconstructionLabelSet >( ReconstructionLabels ),
                                           Maker.Item< FlowSubject >( Subject, "One" ),
                                           Maker.Item< FlowSubject >( Other, "Two" ),
                                           Maker.Item< FlowSubjectApplicationData >( Looks, "One" ),
                                           Maker.Item< FlowSubjectApplicationData >( Short, "Two" ) };
  Scene.Select( { { ZEK::ESelectCentroid, "a", 0, 3 }, { ZEK::ESelectCentroid, "b", 0, 1 } } );
  Show( Items );
  EXPECT_EQ( pProvider->Colours().StickIndices, ( std::vector< u32 >{ 0, 1 } ) ) << "a stick that names no marker";

  ZEK::VCameraLists2D Lists;
  ZEK::VDrawWords Colours;
  const VFlowRenderCamera& rA = Camera( "a" );
  const u32 First = rA.GetInfo().FirstCentroidId;
  ASSERT_NE( First, 0u );
  const auto Get = [&]( ZEK::ECentroidColourScheme i_Scheme )
  {
    rA.GetDrawData2D( First, i_Scheme, false, Lists, Colours );
    return *Colours;
  };
  const std::vector< u32 > Marker = Get( ZEK::EColourMarker );
  EXPECT_EQ( Marker[0], 0xFF000022u );
  EXPECT_EQ( Marker[1], 0xFF000011u );
  EXPECT_EQ( Marker[2], Marker[4] ) << "of a subject whose colours are not one a marker, and without a label";
  const std::vector< u32 > Connection = Get( ZEK::EColourConnection );
  EXPECT_EQ( Connection[0], Connection[3] );
  EXPECT_NE( Connection[0], Connection[1] ) << "the second one's reconstruction is labelled";
  EXPECT_NE( Connection[0], Connection[2] );
  EXPECT_EQ( Connection[4], Connection[2] ) << "beyond the assignments";
  const std::vector< u32 > Generator = Get( ZEK::EColourGenerator );
  EXPECT_EQ( Generator[0], Generator[3] );
  EXPECT_NE( Generator[0], Generator[1] );

  ASSERT_EQ( Lists.pCentroids->size(), 5u );
  EXPECT_EQ( ( *Lists.pCentroids )[2].X, 120 );
  EXPECT_EQ( ( *Lists.pCentroids )[2].Colour, Generator[2] );
  const u32 Word = ( *Lists.pIds )[3];
  EXPECT_EQ( Word & MoxelGraphics::EIdMask, First + 3 );
  EXPECT_NE( Word & MoxelGraphics::EIdSelected, 0u );
  EXPECT_EQ( ( *Lists.pIds )[2], First + 2 );
  ZEK::VSelectionItem Picked;
  ASSERT_TRUE( Scene.Registry().Resolve( Camera( "b" ).GetInfo().FirstCentroidId + 1, Picked ) );
  EXPECT_EQ( Picked, ( ZEK::VSelectionItem{ ZEK::ESelectCentroid, "b", 0, 1 } ) );
  EXPECT_EQ( Scene.Registry().FindId( { ZEK::ESelectCentroid, "a", 0, 4 } ), First + 4 );
  EXPECT_EQ( Scene.Registry().FindId( { ZEK::ESelectCentroid, "a", 0, 5 } ), 0u );

  // In the third dimension the lens is taken out, and a camera without a calibration has nothing to show.
  ZEK::VCameraLists3D Space;
  ZEK::VDrawWords Ids;
  rA.GetDrawData3D( Ids, Space, ZEK::EColourGenerator );
  const float X = 100 - 640, Y = 200 - 512, Factor = 1 - 1e-7F * ( X * X + Y * Y );
  ASSERT_EQ( Space.pCentroids->size(), 5u );
  EXPECT_NEAR( ( *Space.pCentroids )[0].X, 640 + X * Factor, 1e-2 );
  EXPECT_NEAR( ( *Space.pCentroids )[0].Y, 512 + Y * Factor, 1e-2 );
  Camera( "b" ).GetDrawData3D( Ids, Space, ZEK::EColourGenerator );
  EXPECT_TRUE( Space.pCentroids->empty() );
  EXPECT_EQ( Ids->size(), 2u );
}

TEST_F( CameraDrawData, GreyBlobsAreTheSamePictureFromTheirRecords )
{
  for ( std::uint32_t Seed = 0; Seed < 60; ++Seed )
  {
    std::mt19937 Random( Seed );
    VGreyscaleBlobSet Set;
    for ( std::uint32_t Blob = 0; Blob < Random() % 5; ++Blob )
    {
      const auto First = static_cast< u32 >( Set.Lines.size() );
      u32 Y = Random() % 40;
      for ( std::uint32_t Row = 0; Row < Random() % 12; ++Row )
      {
        // Sometimes a hole in a row, sometimes a row left out or one that goes back.
        for ( std::uint32_t Part = 0; Part < 1 + Random() % 4 / 3; ++Part )
        {
          const u32 Length = Random() % 9;
          Set.Lines.push_back( { static_cast< u16 >( Random() % 50 ), static_cast< u16 >( Y ),
                                 static_cast< u16 >( Length ), static_cast< u32 >( Set.Pixels.size() ) } );
          for ( u32 Pixel = 0; Pixel < Length; ++Pixel )
          {
            Set.Pixels.push_back( static_cast< u8 >( Random() ) );
          }
        }
        Y = Random() % 8 == 0 ? Random() % 60 : Y + 1;
      }
      Set.Blobs.push_back( { First, static_cast< u32 >( Set.Lines.size() ) - First, -1 } );
    }
    Show( { Hard( "a" ), Item< FlowGreyscaleBlobSet >( Set ), Item< FlowCameraCalibration >( Calibration() ) } );
    ZEK::VCameraLists2D Lists;
    ZEK::VDrawWords Colours;
    Camera( "a" ).GetDrawData2D( 0, ZEK::EColourConnection, true, Lists, Colours );
    EXPECT_EQ( Paint( *Lists.pGreyscale ), Paint( Set ) ) << "seed " << Seed;
    EXPECT_LE( Lists.pGreyscale->Lines.size(), Set.Lines.size() );
  }
  // Lines and pixels that are not there, and blobs that all claim every line.
  VGreyscaleBlobSet Broken;
  Broken.Pixels.resize( 10 );
  Broken.Lines = { { 0, 0, 10, 1 }, { 65535, 1, 2, 0 }, { 5, 2, 3, 0xFFFFFFFF }, { 5, 3, 3, 0 } };
  Broken.Blobs.assign( 1000, { 0, 4, 0 } );
  Broken.Blobs.push_back( { 0xFFFFFFFF, 0xFFFFFFFF, 0 } );
  Show( { Hard( "a" ), Item< FlowGreyscaleBlobSet >( Broken ) } );
  ZEK::VCameraLists2D Lists;
  ZEK::VDrawWords Colours;
  Camera( "a" ).GetDrawData2D( 0, ZEK::EColourConnection, true, Lists, Colours );
  EXPECT_EQ( Lists.pGreyscale->Lines.size(), 1u );
}

TEST_F( CameraDrawData, BuffersAreKeptForWhoHoldsThemAndFramesAllocateNothing )
{
  std::vector< VFlowItemRef > Slow;
  for ( int Number = 0; Number < 20; ++Number )
  {
    Slow.push_back( Hard( std::to_string( Number ) ) );
    Slow.push_back( Item< FlowCameraCalibration >( Calibration(), std::to_string( Number ) ) );
  }
  const auto Moved = [&]( float i_Step, std::vector< VFlowItemRef > i_Items )
  {
    for ( int Number = 0; Number < 20; ++Number )
    {
      i_Items.push_back( Item< FlowCentroidSet >( Centroids( 30, i_Step ), std::to_string( Number ) ) );
    }
    return Maker.State( ++Frame, i_Items );
  };
  ZEK::VCameraLists2D Lists;
  ZEK::VDrawWords Colours, Ids;
  ZEK::VCameraLists3D Space;
  const auto Draw = [&]
  {
    for ( const ZEK::VRenderCameraRef& rpCamera : pProvider->GetCameras() )
    {
      rpCamera->GetDrawData2D( rpCamera->GetInfo().FirstCentroidId, ZEK::EColourConnection, true, Lists, Colours );
      rpCamera->GetDrawData3D( Ids, Space, ZEK::EColourConnection );
    }
  };
  const ZEK::VFlowStateRef One = Moved( 1, Slow ), Two = Moved( 2, Slow ), Three = Moved( 3, Slow );
  for ( const ZEK::VFlowStateRef* pState : { &One, &Two, &Three } )
  {
    Show( *pState );
    Draw();
  }
  const std::uint64_t Still = TestSupport::AllocationCount();
  const std::uint64_t Generation = Lists.Generation;
  Show( Three );
  Draw();
  EXPECT_EQ( TestSupport::AllocationCount(), Still ) << "an unchanged frame";
  EXPECT_EQ( Lists.Generation, Generation );
  for ( const ZEK::VFlowStateRef* pState : { &One, &Two, &One } )
  {
    Show( *pState );
    Draw();
  }
  EXPECT_EQ( TestSupport::AllocationCount(), Still ) << "frames in which all centroids moved";
  EXPECT_NE( Lists.Generation, Generation );

  const ZEK::VCameraLists2D Kept = Lists;
  const float Place = ( *Kept.pCentroids )[5].X;
  Show( Three );
  Draw();
  EXPECT_EQ( ( *Kept.pCentroids )[5].X, Place );
  EXPECT_NE( ( *Lists.pCentroids )[5].X, Place );
}

TEST_F( CameraDrawData, AssignmentsRunFromCalibratedCamerasToTheReconstructionsOfTheFrame )
{
  Flow2Graphics::VFlowRenderCentroidAssignments Feed( Scene, pProvider );
  const auto Lines = [&]( int i_Type )
  {
    Feed.Update( *State );
    return Feed.Lines( i_Type ).size() / 6;
  };
  VReconstructionLabelSet Labels;
  Labels.Labels = { { 2, 8, 3 } };
  std::vector< VFlowItemRef > Items{ Hard( "a" ),
                                     Hard( "b" ),
                                     Item< FlowCameraCalibration >( Calibration() ),
                                     Item< FlowCentroidAssignmentSet >( { { 0, -1, 2, 2, 99, -7 } } ),
                                     Item< FlowCentroidAssignmentSet >( { { 1 } }, "b" ),
                                     Maker.Points( 3 ),
                                     Maker.Item< FlowReconstructionLabelSet >( Labels ) };
  Show( Items );
  EXPECT_EQ( Lines( MoxelGraphics::ENone ), 0u );
  EXPECT_TRUE( Feed.Cameras().empty() ) << "nobody looks at them";
  EXPECT_EQ( Lines( MoxelGraphics::EUnion ), 3u ) << "the other camera is not calibrated";
  const auto Line = Feed.Lines( MoxelGraphics::EUnion );
  EXPECT_FLOAT_EQ( Line[0], 3000 );
  EXPECT_FLOAT_EQ( Line[2], 1500 );
  EXPECT_FLOAT_EQ( Line[9], 200 );
  EXPECT_EQ( Lines( MoxelGraphics::ECameras ), 0u );

  // The marker that the third one is labelled as.
  Scene.Select( { { ZEK::ESelectMarker, "s:m", 8, 3 }, { ZEK::ESelectReconstruction, {}, 0, 0 } } );
  Show( Items );
  EXPECT_EQ( Lines( MoxelGraphics::EReconstructions ), 3u );
  Scene.Select( { { ZEK::ESelectDevice, "a" }, { ZEK::ESelectReconstruction, {}, 0, 0 } } );
  Show( Items );
  EXPECT_EQ( Lines( MoxelGraphics::EIntersection ), 1u );

  Items.push_back( Item< FlowCameraCalibration >( Calibration( 900 ), "b" ) );
  Show( Items );
  EXPECT_EQ( Lines( MoxelGraphics::ECameras ), 3u );
  Scene.Select( {} );
  Show( Items );
  EXPECT_EQ( Lines( MoxelGraphics::EUnion ), 4u );
  Show( { Hard( "a" ) } );
  EXPECT_EQ( Lines( MoxelGraphics::EUnion ), 0u );
}

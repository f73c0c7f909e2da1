#include "ReadHelpers.h"
#include "RecordingPlayer.h"

#include <ComputeSubjectFK/VComputeSubjectFK.h>
#include <HostSources/VBvhReader.h>

#include <cmath>
#include <fstream>
#include <set>

namespace HostSources
{
namespace
{
using namespace CoreMoxelTypes;
const ZEK::IResult Ok = ZEK::IResult::Ok;

VOutcome Read( std::string_view i_Text )
{
  VOutcome Outcome;
  Outcome.Result = ReadBvh( Bytes( i_Text ), "made.bvh", Outcome.Recording, Outcome.Message );
  return Outcome;
}

/// A hip that moves, a bone without channels along y, and one that turns about z at its end; three frames.
const std::string Small = "HIERARCHY\n"
                          "ROOT Hip {\n"
                          "  OFFSET 1 2 3\n"
                          "  CHANNELS 4 Yposition Zrotation Xrotation Yrotation\n"
                          "  JOINT Upper arm\r\n  {\n    OFFSET 0 10 0\n    CHANNELS 0\n"
                          "    JOINT Lower\n    {\n      OFFSET 0 0 20\n      CHANNELS 1 Zrotation\n"
                          "      End Site\n      {\n        OFFSET 5 0 0\n      }\n    }\n  }\n}\n"
                          "MOTION\n\nFrames: 3\nFrame Time: 0.033333\n"
                          "90 90 0 0 0\n90 90 0 0 90\n90 90\n0 0 90\n";

std::string With( const std::string& i_rOld, const std::string& i_rNew )
{
  std::string Text = Small;
  const std::size_t At = Text.find( i_rOld );
  EXPECT_NE( At, std::string::npos ) << i_rOld;
  return Text.replace( At, i_rOld.size(), i_rNew );
}
} // namespace

TEST( Bvh, JointsStandWhereTheHierarchyAndTheRowsPutThem )
{
  VOutcome Outcome = Read( Small );
  ASSERT_EQ( Outcome.Result, Ok ) << Outcome.Message;
  EXPECT_EQ( Outcome.Recording.RateHz, 30 );
  EXPECT_EQ( Outcome.Recording.UpAxis, EUpAxis::Y );
  ASSERT_EQ( Outcome.Recording.Skeletons.size(), 1u );
  const VSubject& rSubject = Outcome.Recording.Skeletons[0].Subject;
  ASSERT_EQ( rSubject.Segments.size(), 3u );
  EXPECT_EQ( rSubject.Name, "made" );
  EXPECT_EQ( rSubject.Segments[1].Name, "Upper arm" );
  EXPECT_EQ( rSubject.Segments[0].Joint, EJointType::Free );
  EXPECT_EQ( rSubject.Segments[1].Joint, EJointType::Dummy );
  EXPECT_EQ( rSubject.Segments[2].Joint, EJointType::Ball );
  EXPECT_EQ( rSubject.Segments[0].BoneLength, 100 );
  EXPECT_EQ( rSubject.Segments[2].BoneLength, 50 ) << "to the end site";
  VRecordingPlayer Player( Outcome.Recording );
  Player.Show( 1 );
  // Only y of the hip moves; the quarter turn lays y along -x; the last bone then points along -x as well.
  Player.ExpectJoint( "Hip", 1, 90, 3 );
  Player.ExpectJoint( "Upper arm", -9, 90, 3 );
  Player.ExpectJoint( "Lower", -9, 90, 23 );
  const auto& rPoses = Player.Value< FlowSubjectDynamicParameters >().Segments;
  EXPECT_NEAR( rPoses[2].R[0], -1, 1e-12 );
  EXPECT_NEAR( rPoses[0].R[0], -1, 1e-12 ) << "a segment's x axis lies along its bone";
  EXPECT_NEAR( rPoses[1].R[6], 1, 1e-12 );
  const ZEK::VFlowItemRef Subject = Player.Item< FlowSubject >(), Moves = Player.Item< FlowSubjectDynamicParameters >();
  Player.Show( 2 );
  EXPECT_EQ( Player.Item< FlowSubjectDynamicParameters >(), Moves ) << "the same numbers, over two lines";
  Player.Show( 0 );
  EXPECT_NE( Player.Item< FlowSubjectDynamicParameters >(), Moves );
  EXPECT_EQ( Player.Item< FlowSubject >(), Subject );
  const auto& rStructure = Player.Value< FlowSubjectParametrised >();
  ASSERT_EQ( rStructure.Poses.size(), 2u );
  EXPECT_EQ( rStructure.Poses[1], Player.Value< FlowSubjectDynamicParameters >().JointState );
  EXPECT_EQ( rStructure.Poses[0].size(), 9u );
  // Those poses are z up, the recording is y up.
  const auto pTurned = ComputeSubject::VComputeSubjectFK::Build( rStructure.Base );
  ASSERT_TRUE( pTurned->LoadState( rStructure.Poses[1] ).IsOk() );
  const auto& rFirst = Player.Value< FlowSubjectDynamicParameters >().Segments;
  for ( std::size_t Index = 0; Index < rFirst.size(); ++Index )
  {
    const double* const pPlace = pTurned->WorldTransforms()[Index].m_Translation;
    EXPECT_NEAR( pPlace[0], rFirst[Index].T[0], 1e-9 );
    EXPECT_NEAR( pPlace[1], -rFirst[Index].T[2], 1e-9 );
    EXPECT_NEAR( pPlace[2], rFirst[Index].T[1], 1e-9 );
  }
}

TEST( Bvh, AStateOfZerosIsTheFigureAsItIsDrawnUp )
{
  VOutcome Outcome = Read( "HIERARCHY\nROOT A\n{\nOFFSET 0 90 0\nCHANNELS 3 Xposition Yposition Zposition\n"
                           "JOINT B\n{\nOFFSET 10 20 0\nCHANNELS 3 Xposition Yposition Zposition\n"
                           "End Site\n{\nOFFSET 0 5 0\n}\n}\n}\n"
                           "MOTION\nFrames: 1\nFrame Time: 0.1\n1 2 3 4 5 6\n" );
  ASSERT_EQ( Outcome.Result, Ok ) << Outcome.Message;
  const VRecordingSkeleton& rSkeleton = Outcome.Recording.Skeletons.at( 0 );
  const auto pSubject = ComputeSubject::VComputeSubjectFK::Build( rSkeleton.Subject );
  const auto ExpectPlace = [&]( std::size_t i_Joint, double i_X, double i_Y, double i_Z )
  {
    const double* const pPlace = pSubject->WorldTransforms()[i_Joint].m_Translation;
    EXPECT_NEAR( pPlace[0], i_X, 1e-9 );
    EXPECT_NEAR( pPlace[1], i_Y, 1e-9 );
    EXPECT_NEAR( pPlace[2], i_Z, 1e-9 );
  };
  ASSERT_TRUE( pSubject->LoadState( std::vector< double >( rSkeleton.StateSize ) ).IsOk() );
  constexpr double Unit = 10; // mm in one of the file's
  ExpectPlace( 1, 10 * Unit, 110 * Unit, 0 );
  ASSERT_TRUE( pSubject->LoadState( rSkeleton.State( 0 ) ).IsOk() );
  ExpectPlace( 0, 1 * Unit, 2 * Unit, 3 * Unit );
  ExpectPlace( 1, 5 * Unit, 7 * Unit, 9 * Unit );
}

TEST( Bvh, EveryJointIsJoinedToItsParentWhereverThatTurns )
{
  const std::string Leg = "CHANNELS 3 Zrotation Xrotation Yrotation\nEnd Site { OFFSET 0 -40 3 } }\n";
  VOutcome Outcome = Read( "HIERARCHY ROOT Hips\n{ OFFSET 0 90 0 CHANNELS 3 Zrotation Xrotation Yrotation\n"
                           "JOINT Sacrum\n{ OFFSET 0 0 0 CHANNELS 1 Xrotation\n"
                           "JOINT Spine\n{ OFFSET 0 15 2 " +
                           Leg + "JOINT Tail\n{ OFFSET 0 1 -9 " + Leg + "}\nJOINT Left\n{ OFFSET 9 -2 0 " + Leg +
                           "JOINT Right\n{ OFFSET -9 -2 0 " + Leg +
                           "} MOTION Frames: 1 Frame Time: 0.1\n"
                           "10 20 30 40 5 6 7 8 9 10 11 12 13 14 15 16\n" );
  ASSERT_EQ( Outcome.Result, Ok ) << Outcome.Message;
  const VRecordingSkeleton& rSkeleton = Outcome.Recording.Skeletons.at( 0 );
  const std::vector< VSegment >& rSegments = rSkeleton.Subject.Segments;
  EXPECT_EQ( rSkeleton.JointCount, 6u );
  EXPECT_EQ( rSkeleton.StateSize, 18u ) << "bones take no state";
  ASSERT_EQ( rSegments.size(), 8u ) << "the sacrum is where the hips are, and needs no bone";
  EXPECT_EQ( rSegments[6].Name, "Sacrum to Tail" );
  EXPECT_EQ( rSegments[7].Name, "Hips to Right" );
  EXPECT_EQ( rSegments[4].Name, "Left" );
  const auto pSubject = ComputeSubject::VComputeSubjectFK::Build( rSkeleton.Subject );
  ASSERT_TRUE( pSubject->LoadState( rSkeleton.State( 0 ) ).IsOk() );
  const auto Poses = pSubject->WorldTransforms();
  std::set< std::size_t > Joined;
  for ( std::size_t Bone = 0; Bone < rSegments.size(); ++Bone )
  {
    const ComputeSubject::VRigidTransform& rPose = Poses[Bone];
    for ( std::size_t Joint = 1; Joint < rSkeleton.JointCount; ++Joint )
    {
      const auto Parent = static_cast< std::size_t >( rSegments[Joint].Parent );
      const auto From = Bone < rSkeleton.JointCount ? Bone : static_cast< std::size_t >( rSegments[Bone].Parent );
      double Off = 0;
      for ( std::size_t Axis = 0; Axis < 3; ++Axis )
      {
        Off += std::abs( rPose.m_Translation[Axis] + rPose.m_Rotation[3 * Axis] * rSegments[Bone].BoneLength -
                         Poses[Joint].m_Translation[Axis] ) +
               std::abs( rPose.m_Translation[Axis] - Poses[From].m_Translation[Axis] );
      }
      if ( From == Parent && rSegments[Bone].BoneLength > 0 && Off < 1e-3 )
      {
        EXPECT_TRUE( Joined.insert( Joint ).second ) << "twice " << Joint;
      }
    }
  }
  EXPECT_EQ( Joined, ( std::set< std::size_t >{ 2, 3, 4, 5 } ) );
}

TEST( Bvh, RealFilesAgreeWithTheirFigures )
{
  HARROW_NEEDS_RECORDINGS();
  const VRecording Louise = Real( "bvh/louise.bvh" );
  EXPECT_EQ( Louise.FrameCount, 2998 );
  EXPECT_EQ( Louise.RateHz, 100 );
  ASSERT_EQ( Louise.Skeletons.size(), 1u );
  EXPECT_EQ( Louise.Skeletons[0].JointCount, 18u );
  EXPECT_EQ( Louise.Skeletons[0].EndSiteCount, 5u );
  EXPECT_EQ( Louise.Skeletons[0].ChannelCount, 57u );
  VRecordingPlayer Player( Louise );
  Player.Show( 0 );
  Player.ExpectJoint( "Hips", 12.6297, 91.9799, -4.7173 );
  Player.ExpectJoint( "Head", 8.0463, 155.9385, -3.1395 );
  Player.ExpectJoint( "LeftWrist", -58.1643, 130.8952, -19.7317 );
  Player.ExpectJoint( "RightAnkle", 16.6497, 6.1092, 11.1632 );
  Player.Show( 1499 );
  Player.ExpectJoint( "Hips", 36.2957, 113.1518, 54.6973 );
  Player.ExpectJoint( "LeftWrist", -19.3100, 111.6712, 75.3346 );

  const VRecording Milad = Real( "bvh/milad.bvh" );
  EXPECT_EQ( Milad.FrameCount, 422 );
  EXPECT_EQ( Milad.RateHz, 125 );
  EXPECT_EQ( Milad.Skeletons.at( 0 ).JointCount, 59u );
  EXPECT_EQ( Milad.Skeletons[0].EndSiteCount, 13u );
  EXPECT_EQ( Milad.Skeletons[0].ChannelCount, 354u );
  VRecordingPlayer Suit( Milad );
  Suit.Show( 0 );
  Suit.ExpectJoint( "Hips", 34.6316, 94.0860, -42.0484 );
  Suit.ExpectJoint( "Head", 33.9384, 156.9412, -33.1584 );
  Suit.ExpectJoint( "LeftHand", 1.6448, 97.6048, -28.4455 );
  Suit.ExpectJoint( "RightFoot", 43.7682, 9.3696, -29.4245 );
  Suit.Show( 421 );
  Suit.ExpectJoint( "LeftHand", 36.9983, 97.5083, -15.7936 );
  const VRecordingInfo Info = DescribeRecording( Milad );
  EXPECT_THAT( Info.Text(),
               testing::HasSubstr( "59 joints, 71 bones, 13 end sites, 354 channels, 354 degrees of freedom, "
                                   "0 markers, 422 poses" ) );
  EXPECT_THAT( Info.Json(), testing::HasSubstr( "\"format\": \"BVH\"" ) );
}

TEST( Bvh, DamagedFilesGiveTheirWholeRowsOrAReason )
{
  struct VCase
  {
    std::string Text;
    ZEK::IResult::ECode Code;
    const char* pMessage;
  };
  using enum ZEK::IResult::ECode;
  std::string Deep = "HIERARCHY\n";
  for ( int Joint = 0; Joint < 5000; ++Joint )
  {
    Deep += Joint == 0 ? "ROOT a{\n" : "JOINT a\n{\n";
  }
  std::string Zeros( std::size_t{ 12 } << 20, '0' );
  for ( std::size_t At = 1; At < Zeros.size(); At += 2 )
  {
    Zeros[At] = ' ';
  }
  const std::string OneChannel =
      "HIERARCHY ROOT a { OFFSET 0 0 0 CHANNELS 1 Xposition } MOTION Frames: 900000000 Frame Time: 1\n";
  const VCase Cases[] = {
      { OneChannel + Zeros, NotSupported, "expected poses in proportion to the file, found some that need 2" },
      { "", EndOfData, "HIERARCHY" },
      { "HIERARCHY", EndOfData, "expected ROOT, found the end of the file" },
      { "hierarchy", InvalidFormat, "\"HIERARCHY\", the mark of a BVH file, found \"hierarchy\"" },
      { With( "ROOT", "JOINT" ), InvalidFormat, "line 2: expected ROOT, found \"JOINT\"" },
      { With( "OFFSET 1 2 3", "OFFSET 1 x 3" ), InvalidFormat, "line 3: expected a number for an offset, found \"x\"" },
      { With( "OFFSET 1 2 3", "OFFSET 1 nan 3" ), InvalidFormat, "a number for an offset" },
      { With( "OFFSET 1 2 3", "OFFSET 1 1e99 3" ), InvalidFormat, "at most 1e8" },
      { With( "CHANNELS 4", "CHANNELS 7" ), InvalidFormat, "up to six channels" },
      { With( "CHANNELS 4", "CHANNELS -1" ), InvalidFormat, "up to six channels" },
      { With( "CHANNELS 4", "CHANNELS 5" ), InvalidFormat, "the name of a channel, found \"JOINT\"" },
      { With( "  End Site", "  CHANNELS 1 Xrotation" ), InvalidFormat, "once a joint" },
      { With( "\n}\nMOTION", "\nMOTION" ), InvalidFormat, "found \"MOTION\"" },
      { With( "Frames: 3", "Frames: many" ), InvalidFormat, "the count of frames" },
      { With( "Frames: 3", "Frames: 1e999" ), InvalidFormat, "the count of frames" },
      { With( "Frames: 3", "Frames: -3" ), InvalidFormat, "a count of frames" },
      { With( "Frame Time:", "Frame Rate:" ), InvalidFormat, "\"Frame Time:\", found \"Rate:\"" },
      { With( "90 90 0 0 90", "90 90 zero 0 90" ), InvalidFormat, "a number for a channel, found \"zero\"" },
      { With( "90 90 0 0 90", "1e300 90 0 0 90" ), InvalidFormat, "positions of at most 1e8" },
      { With( "Frames: 3", "Frames: 0" ), EndOfData, "rows of frames" },
      { With( "Frames: 3", "Frames: 900000000000000" ), OkButPartial, "whole rows before it that were read: 3" },
      { With( "90 90\n0 0 90\n", "90 90\n" ), OkButPartial, "were read: 2" },
      { With( "90 90\n0 0 90\n", "90 90\n0 0 9" ), Ok, "" },
      { With( "90 90 0 0 90\n90 90\n0 0 90\n", "90 90 0 0 9" ), OkButPartial, "were read: 1" },
      { With( "0.033333", "0" ), Ok, "" },
      { Small + "1 2 3 4 5\n", Ok, "" },
      { "HIERARCHY ROOT a { OFFSET 0 0 0 CHANNELS 0 } MOTION Frames: 5 Frame Time: 1", InvalidFormat,
        "a joint with channels" },
      { Deep, InvalidFormat, "at most 4096 joints" },
  };
  for ( const VCase& rCase : Cases )
  {
    SCOPED_TRACE( rCase.Text.substr( 0, 400 ) );
    const VOutcome Outcome = Read( rCase.Text );
    EXPECT_EQ( Outcome.Result, ZEK::IResult( rCase.Code ) ) << Outcome.Message;
    EXPECT_THAT( Outcome.Message, testing::HasSubstr( rCase.pMessage ) );
    EXPECT_EQ( Outcome.Recording.Skeletons.empty(), Outcome.Result.IsError() );
  }
  EXPECT_EQ( Read( With( "0.033333", "0" ) ).Recording.RateHz, 100 );
}

TEST( Bvh, IsToldByItsContentAndMayBeStopped )
{
  const TestSupport::VTemporaryDir Folder;
  const auto Path = Folder.Path() / "walk.txt";
  std::ofstream( Path ) << "\n " << Small;
  EXPECT_EQ( MustRead( Path ).Format, ERecordingFormat::Bvh );
  VRecording Recording;
  std::string Message;
  const auto Stop = []( double )
  {
    return false;
  };
  EXPECT_EQ( ReadBvh( Bytes( Small ), "a.bvh", Recording, Message, Stop ), ZEK::IResult( ZEK::IResult::Canceled ) );
  EXPECT_THAT( Message, testing::HasSubstr( "the reading was stopped" ) );
}

} // namespace HostSources

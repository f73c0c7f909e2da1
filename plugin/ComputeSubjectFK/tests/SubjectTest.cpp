#include "RandomTrees.h"

#include "VPosePlan.h"

#include <ComputeSubjectFK/Joints.h>

#include <gtest/gtest.h>

#include <numbers>
#include <thread>

using namespace ComputeSubject;

namespace
{
constexpr double Pi = std::numbers::pi;
const ZEK::IResult Ok = ZEK::IResult::Ok, Invalid = ZEK::IResult::InvalidArgument;

bool IsFinite( const VRigidTransform& i_rTransform )
{
  return i_rTransform.IsFinite();
}

/// What the products of a tree's matrices may lose: grows with its farthest place, mm.
double Rounding( const std::vector< VMatrix >& i_rWorlds )
{
  double Farthest = 1;
  for ( const VMatrix& rWorld : i_rWorlds )
  {
    Farthest = std::max( { Farthest, std::abs( rWorld[3] ), std::abs( rWorld[7] ), std::abs( rWorld[11] ) } );
  }
  return 8e-15 * Farthest;
}

/// Both ways of working a pose out that this processor has.
std::vector< VPoseFunction > PoseFunctions()
{
  std::vector< VPoseFunction > Functions{ PoseBaseline };
  if ( HasAvx2() )
  {
    Functions.push_back( PoseAvx2 );
  }
  return Functions;
}
} // namespace

/// Small states stay within the loops, large ones do not, and of mixed ones some joints do.
TEST( SubjectFK, PosesAreTheProductsOfTheMatrices )
{
  const auto Base = static_cast< std::uint32_t >( std::random_device{}() );
  for ( std::uint32_t Round = 0; Round < 300; ++Round )
  {
    const std::uint32_t Seed = Base + Round;
    SCOPED_TRACE( testing::Message() << "seed " << Seed );
    VRandom Random( Seed );
    VRandomTree Tree( Random, 1 + Random.Below( 40 ), Round % 2 == 0 );
    VComputeSubjectFK& rSubject = Tree.Subject;
    const std::vector< double > State = Tree.RandomState( Random, Round % 3 == 0 ? 1.0 : Round % 3 == 1 ? Pi : 6.0 );
    EXPECT_EQ( rSubject.LoadState( State ), Ok );
    std::vector< VMatrix > Results;
    const std::vector< VMatrix > Worlds = Tree.Worlds( State, &Results );
    double Worst = 0;
    for ( std::size_t Index = 0; Index < Worlds.size(); ++Index )
    {
      const VComputeSegmentFK& rSegment = rSubject.Segment( Index );
      const VMatrix Moving = MovingPart( Tree.Joints[Index].m_Type, State.data() + rSubject.FirstDegree( Index ) );
      Worst =
          std::max( { Worst, LargestDifference( MatrixOf( rSubject.WorldTransforms()[Index] ), Worlds[Index] ),
                      LargestDifference( MatrixOf( rSegment.WorldTransform() ), Worlds[Index] ),
                      LargestDifference( MatrixOf( rSegment.Transform() ), Results[Index] ),
                      LargestDifference( MatrixOf( rSegment.JointTransform() ), Moving ),
                      LargestDifference( Times( MatrixOf( rSegment.FixedTransform() ), Moving ), Results[Index] ) } );
      const std::size_t Parent = Tree.Parents[Index];
      EXPECT_EQ( rSegment.TreeDepth(),
                 Parent == VComputeSubjectFK::NoParent ? 1 : rSubject.Segment( Parent ).TreeDepth() + 1 );
    }
    EXPECT_LE( Worst, Rounding( Worlds ) );
    std::vector< double > Copied;
    rSubject.CopyState( Copied );
    EXPECT_EQ( Copied, State );
  }
}

TEST( SubjectFK, EveryProcessorsLoopsGiveTheSame )
{
  for ( std::uint32_t Seed = 0; Seed < 100; ++Seed )
  {
    SCOPED_TRACE( testing::Message() << "seed " << Seed );
    VRandom Random( Seed );
    VRandomTree Tree( Random, 30, false );
    const std::vector< double > State = Tree.RandomState( Random, Seed % 2 == 0 ? 2.0 : 8.0 );
    VPosePlan Plan;
    for ( std::size_t Index = 0; Index < Tree.Joints.size(); ++Index )
    {
      Plan.Append( Tree.Joints[Index].m_Type, static_cast< std::int32_t >( Tree.Parents[Index] ),
                   static_cast< std::uint32_t >( Tree.Subject.FirstDegree( Index ) ), Tree.Joints[Index].m_Pre,
                   VRigidTransform::Identity() );
    }
    const std::vector< VMatrix > Worlds = Tree.Worlds( State );
    const double Bound = Rounding( Worlds );
    for ( const VPoseFunction pPose : PoseFunctions() )
    {
      std::vector< VRigidTransform > Poses( Tree.Joints.size() );
      pPose( Plan.Tree(), State.data(), Poses[0].m_Rotation );
      for ( std::size_t Index = 0; Index < Worlds.size(); ++Index )
      {
        EXPECT_LE( LargestDifference( MatrixOf( Poses[Index] ), Worlds[Index] ), Bound ) << "segment " << Index;
      }
    }
  }
}

/// About the borders between no turn and a turn, and between the loops and what they leave out.
TEST( SubjectFK, TurnsOfEveryLengthJoinUp )
{
  VComputeSubjectFK Subject;
  for ( const EJointType Type : { EJointType::Free, EJointType::Ball, EJointType::HardySpicer, EJointType::Hinge } )
  {
    Subject.AddSegment( VComputeSubjectFK::NoParent,
                        { Type, VRigidTransform::Identity(), VRigidTransform::Identity() } );
  }
  const double Border = 2 * std::sqrt( 2.5 );
  for ( double Angle : { 0.0, 1e-300, 2.2e-15, 1e-9, 1e-4, Pi / 2, 3.0, Pi, Border, 3.5, 100.0, 1e9, 1e200 } )
  {
    for ( int Step = -2; Step <= 2; ++Step, Angle = std::nextafter( Angle, HUGE_VAL ) )
    {
      const std::vector< double > State{ 0, -Angle, 0, 1, 2, 3, 0, 0, Angle, Angle, -Angle, Angle };
      ASSERT_EQ( Subject.LoadState( State ), Ok );
      for ( std::size_t Index = 0; Index < Subject.SegmentCount(); ++Index )
      {
        const VRigidTransform Moving = Subject.Segment( Index ).JointTransform();
        const double Difference = LargestDifference( MatrixOf( Subject.WorldTransforms()[Index] ), MatrixOf( Moving ) );
        const bool bTooLong = Angle > 1e154 && Index < 2; // its square is beyond all numbers
        EXPECT_TRUE( Difference <= 2e-15 || ( bTooLong && !Moving.IsFinite() ) )
            << Angle << " at " << Index << ": " << Difference;
      }
    }
  }
}

TEST( SubjectFK, ManyStatesAtOnceAreThoseOneByOne )
{
  VRandom Random( 4 );
  for ( const bool bPosts : { false, true } )
  {
    VRandomTree Tree( Random, 25, bPosts );
    VComputeSubjectFK& rSubject = Tree.Subject;
    const std::size_t Count = 9, Segments = rSubject.SegmentCount();
    std::vector< double > States;
    for ( std::size_t Index = 0; Index < Count; ++Index )
    {
      const std::vector< double > State = Tree.RandomState( Random, 4 );
      States.insert( States.end(), State.begin(), State.end() );
    }
    std::vector< VRigidTransform > Poses( Count * Segments );
    EXPECT_EQ( rSubject.Pose( States, Count, Poses ), Ok );
    for ( std::size_t Index = 0; Index < Count; ++Index )
    {
      ASSERT_EQ(
          rSubject.LoadState( std::span( States ).subspan( Index * rSubject.StateSize(), rSubject.StateSize() ) ), Ok );
      EXPECT_TRUE( std::equal( rSubject.WorldTransforms().begin(), rSubject.WorldTransforms().end(),
                               Poses.begin() + static_cast< std::ptrdiff_t >( Index * Segments ) ) );
    }
    const std::vector< VRigidTransform > Before = Poses;
    EXPECT_EQ( rSubject.Pose( States, Count + 1, Poses ), Invalid );
    EXPECT_EQ( rSubject.Pose( std::span( States ).first( States.size() - 1 ), Count, Poses ), Invalid );
    EXPECT_EQ( rSubject.Pose( States, Count, std::span( Poses ).first( Poses.size() - 1 ) ), Invalid );
    EXPECT_EQ( Poses, Before );
    EXPECT_EQ( rSubject.Pose( {}, 0, {} ), Ok );
  }
  EXPECT_EQ( VComputeSubjectFK().Pose( {}, 5, {} ), Ok ) << "five poses of nothing";
  VRigidTransform One;
  EXPECT_EQ( VComputeSubjectFK().Pose( {}, 1, { &One, 1 } ), Invalid );
}

TEST( SubjectFK, StatesThatDoNotFitLeaveEverythingAsItWas )
{
  VRandom Random( 5 );
  VRandomTree Tree( Random, 12, true );
  VComputeSubjectFK& rSubject = Tree.Subject;
  std::vector< double > State = Tree.RandomState( Random, 1 );
  ASSERT_EQ( rSubject.LoadState( State ), Ok );
  const std::vector< VRigidTransform > Before( rSubject.WorldTransforms().begin(), rSubject.WorldTransforms().end() );
  for ( const std::size_t Size : { State.size() - 1, State.size() + 1, std::size_t( 0 ) } )
  {
    std::vector< double > Wrong( Size, 9.0 );
    EXPECT_EQ( rSubject.LoadState( Wrong ), Invalid );
    EXPECT_EQ( rSubject.NormaliseState( Wrong ), Invalid );
    EXPECT_EQ( Wrong, std::vector< double >( Size, 9.0 ) );
  }
  EXPECT_EQ( rSubject.State(), State );
  EXPECT_TRUE( std::equal( Before.begin(), Before.end(), rSubject.WorldTransforms().begin() ) );
}

/// What is no number stays with its joint and what hangs on it.
TEST( SubjectFK, NumbersThatAreNoneStayOnTheirBranch )
{
  VRandom Random( 6 );
  VRandomTree Tree( Random, 40, true );
  VComputeSubjectFK& rSubject = Tree.Subject;
  for ( const double Nonsense : std::initializer_list< double >{ NAN, HUGE_VAL, -HUGE_VAL } )
  {
    for ( std::size_t Broken = 1; Broken < rSubject.SegmentCount(); ++Broken )
    {
      if ( rSubject.Segment( Broken ).Joint().DegreesOfFreedom() == 0 )
      {
        continue;
      }
      std::vector< double > State = Tree.RandomState( Random, 2 );
      State[rSubject.FirstDegree( Broken )] = Nonsense;
      EXPECT_EQ( rSubject.LoadState( State ), ZEK::IResult( ZEK::IResult::OkButPartial ) );
      for ( std::size_t Index = 0; Index < rSubject.SegmentCount(); ++Index )
      {
        std::size_t Above = Index;
        while ( Above != VComputeSubjectFK::NoParent && Above != Broken )
        {
          Above = rSubject.ParentOf( Above );
        }
        EXPECT_EQ( IsFinite( rSubject.WorldTransforms()[Index] ), Above != Broken ) << Index << " under " << Broken;
      }
    }
  }
}

/// And a place that is none leaves rotations alone.
TEST( SubjectFK, PlacesThatAreNoneStillTurn )
{
  VRandom Random( 9 );
  VRandomTree Tree( Random, 30, true );
  for ( std::size_t Broken = 0; Broken < 30; ++Broken )
  {
    const EJointType Type = Tree.Joints[Broken].m_Type;
    if ( Type != EJointType::Free && Type != EJointType::Slider )
    {
      continue;
    }
    std::vector< double > State = Tree.RandomState( Random, 2 );
    ASSERT_EQ( Tree.Subject.LoadState( State ), Ok );
    std::vector< VRigidTransform > Whole( Tree.Subject.WorldTransforms().begin(),
                                          Tree.Subject.WorldTransforms().end() );
    State[Tree.Subject.FirstDegree( Broken ) + ( Type == EJointType::Free ? 5 : 0 )] = NAN;
    EXPECT_EQ( Tree.Subject.LoadState( State ), ZEK::IResult( ZEK::IResult::OkButPartial ) );
    for ( std::size_t Index = 0; Index < Whole.size(); ++Index )
    {
      EXPECT_TRUE( std::equal( Whole[Index].m_Rotation, Whole[Index].m_Rotation + 9,
                               Tree.Subject.WorldTransforms()[Index].m_Rotation ) )
          << Index << " under " << Broken;
    }
  }
}

TEST( SubjectFK, AClonePosesOnItsOwn )
{
  VRandom Random( 7 );
  VRandomTree Tree( Random, 30, true );
  VTargetRecord Target;
  Target.Kind = ETargetKind::RigidBody;
  Target.Segment = 29;
  Tree.Subject.AddTarget( FindTargetFactory( Target.Kind ).Create( Target ) );
  const std::vector< double > First = Tree.RandomState( Random, 2 ), Second = Tree.RandomState( Random, 2 );
  ASSERT_EQ( Tree.Subject.LoadState( First ), Ok );
  const std::unique_ptr< VComputeSubjectFK > pClone = Tree.Subject.Clone();
  const auto Same = []( const VComputeSubjectFK& i_rA, const VComputeSubjectFK& i_rB )
  {
    std::vector< double > A, B;
    i_rA.Jacobian( A );
    i_rB.Jacobian( B );
    return A == B && i_rA.State() == i_rB.State() &&
           std::equal( i_rA.WorldTransforms().begin(), i_rA.WorldTransforms().end(), i_rB.WorldTransforms().begin(),
                       i_rB.WorldTransforms().end() );
  };
  EXPECT_TRUE( Same( *pClone, Tree.Subject ) );
  EXPECT_EQ( pClone->Segment( 29 ).TreeDepth(), Tree.Subject.Segment( 29 ).TreeDepth() );
  EXPECT_NE( &pClone->Segment( 3 ).Joint(), &Tree.Subject.Segment( 3 ).Joint() );
  const auto Play = []( VComputeSubjectFK& io_rSubject, const std::vector< double >& i_rState )
  {
    EXPECT_EQ( io_rSubject.LoadState( i_rState ), Ok );
    const VRigidTransform Before = io_rSubject.Segment( 29 ).Transform();
    for ( int Round = 0; Round < 500; ++Round )
    {
      EXPECT_EQ( io_rSubject.LoadState( i_rState ), Ok );
      EXPECT_EQ( io_rSubject.Segment( 29 ).Transform(), Before ) << "round " << Round;
    }
  };
  std::thread Other(
      [&]
      {
        Play( *pClone, Second );
      } );
  Play( Tree.Subject, First );
  Other.join();
  EXPECT_FALSE( Same( *pClone, Tree.Subject ) );
  ASSERT_EQ( Tree.Subject.LoadState( Second ), Ok );
  EXPECT_TRUE( Same( *pClone, Tree.Subject ) );
}

TEST( SubjectFK, ASegmentAloneFollowsItsParent )
{
  VRandom Random( 8 );
  std::vector< std::shared_ptr< VComputeSegmentFK > > Chain;
  VMatrix World = Unit;
  const std::vector< double > State{ 0.3, -0.4, 0.5, 10, 20, 30, 1.5, -0.7, 0.8 };
  ConstStateIterator It = State.begin();
  for ( const EJointType Type : { EJointType::Free, EJointType::Dummy, EJointType::HardySpicer, EJointType::Hinge } )
  {
    const VJointRecord Joint{ Type, Random.Rigid( 50 ), Random.Rigid( 50 ) };
    Chain.push_back( std::make_shared< VComputeSegmentFK >( Chain.empty() ? nullptr : Chain.back(),
                                                            FindJointFactory( Type ).Create( Joint ) ) );
    const double* pNumbers = State.data() + ( It - State.begin() );
    Chain.back()->LoadState( It );
    World = Times( Times( World, MatrixOf( Joint.m_Pre ) ),
                   Times( MovingPart( Type, pNumbers ), MatrixOf( Joint.m_Post ) ) );
    EXPECT_LE( LargestDifference( MatrixOf( Chain.back()->WorldTransform() ), World ), 1e-12 );
    EXPECT_EQ( Chain.back()->TreeDepth(), Chain.size() );
  }
  EXPECT_EQ( It, State.end() );
  EXPECT_THROW( VComputeSegmentFK( nullptr, nullptr ), VConstructionException );
}

TEST( SubjectFK, ATreeMayGrowWhileItIsPosedAndBeVeryDeep )
{
  VComputeSubjectFK Subject;
  VJointRecord Joint{ EJointType::Slider, VRigidTransform::Identity(), VRigidTransform::Identity() };
  Subject.AddSegment( VComputeSubjectFK::NoParent, Joint );
  ASSERT_EQ( Subject.LoadState( std::vector{ 5.0 } ), Ok );
  Joint.m_Post.m_Translation[0] = 1;
  constexpr std::size_t Deep = 200000;
  for ( std::size_t Index = 0; Index < Deep; ++Index )
  {
    Subject.AddSegment( Index, Joint );
  }
  EXPECT_EQ( Subject.WorldTransforms()[0].m_Translation[2], 5 ) << "the first posts must not undo the pose";
  EXPECT_EQ( Subject.WorldTransforms()[Deep].m_Translation[0], double( Deep ) );
  std::vector< double > State( Deep + 1, 0.25 );
  ASSERT_EQ( Subject.LoadState( State ), Ok );
  EXPECT_EQ( Subject.WorldTransforms()[Deep].m_Translation[2], 0.25 * ( Deep + 1 ) );
  EXPECT_EQ( Subject.Clone()->WorldTransforms()[Deep], Subject.WorldTransforms()[Deep] );
  EXPECT_THROW( Subject.AddSegment( Deep + 1, Joint ), VConstructionException ) << "its own parent";
  EXPECT_EQ( Subject.SegmentCount(), Deep + 1 );
}

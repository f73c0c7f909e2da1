#include "RandomTrees.h"

#include <ComputeSubjectFK/IComputeJointConstraints.h>
#include <ComputeSubjectFK/Targets.h>

#include <gtest/gtest.h>

using namespace ComputeSubject;

namespace
{
const ZEK::IResult Ok = ZEK::IResult::Ok;
constexpr std::uint32_t Kinds = static_cast< std::uint32_t >( ETargetKind::BadTargetKind );

VTargetPose RandomPose( VRandom& io_rRandom, double i_Reach )
{
  const VRigidTransform Place = io_rRandom.Rigid( i_Reach ), Turn = io_rRandom.Rigid( 1 );
  VTargetPose Pose;
  std::copy_n( Place.m_Rotation, 9, Pose.Rotation );
  std::copy_n( Place.m_Translation, 3, Pose.Point );
  std::copy_n( Turn.m_Rotation, 3, Pose.Direction );
  return Pose;
}

/// Where a target is now, as its goal.
VTargetPose PoseNow( const VComputeSubjectFK& i_rSubject, const VTargetRecord& i_rRecord )
{
  const VRigidTransform& rWorld = i_rSubject.WorldTransforms()[i_rRecord.Segment];
  VRigidTransform Local;
  std::copy_n( i_rRecord.Local.Rotation, 9, Local.m_Rotation );
  VTargetPose Pose;
  rWorld.Place( i_rRecord.Local.Point, Pose.Point );
  rWorld.Turn( i_rRecord.Local.Direction, Pose.Direction );
  std::copy_n( ( rWorld * Local ).m_Rotation, 9, Pose.Rotation );
  return Pose;
}

void AddTarget( VComputeSubjectFK& io_rSubject, const VTargetRecord& i_rRecord )
{
  io_rSubject.AddTarget( FindTargetFactory( i_rRecord.Kind ).Create( i_rRecord ) );
}

std::vector< double > ResidualsAt( VComputeSubjectFK& io_rSubject, std::vector< double > i_State )
{
  std::vector< double > Residuals;
  EXPECT_EQ( io_rSubject.LoadState( i_State ), Ok );
  io_rSubject.Residuals( Residuals );
  return Residuals;
}

/// The step that brings a linear model nearest to no residual: normal equations, a little damped.
std::vector< double > Step( const std::vector< double >& i_rJacobian, const std::vector< double >& i_rResiduals,
                            std::size_t i_Columns )
{
  const std::size_t N = i_Columns, Rows = i_rResiduals.size();
  std::vector< double > A( N * ( N + 1 ) );
  for ( std::size_t I = 0; I < N; ++I )
  {
    for ( std::size_t Row = 0; Row < Rows; ++Row )
    {
      const double Value = i_rJacobian[Row * N + I];
      for ( std::size_t J = 0; J < N && Value != 0; ++J )
      {
        A[I * ( N + 1 ) + J] += Value * i_rJacobian[Row * N + J];
      }
      A[I * ( N + 1 ) + N] -= Value * i_rResiduals[Row];
    }
    A[I * ( N + 1 ) + I] += 1e-9;
  }
  for ( std::size_t I = 0; I < N; ++I ) // positive definite: no pivots are needed
  {
    for ( std::size_t Row = 0; Row < N; ++Row )
    {
      const double Factor = Row == I ? 0 : A[Row * ( N + 1 ) + I] / A[I * ( N + 1 ) + I];
      for ( std::size_t J = I; J <= N && Factor != 0; ++J )
      {
        A[Row * ( N + 1 ) + J] -= Factor * A[I * ( N + 1 ) + J];
      }
    }
  }
  std::vector< double > Result( N );
  for ( std::size_t I = 0; I < N; ++I )
  {
    Result[I] = A[I * ( N + 1 ) + N] / A[I * ( N + 1 ) + I];
  }
  return Result;
}
} // namespace

/// All kinds of targets on trees of all kinds of joints.
TEST( Targets, AreMetWhereTheyAreAndMoveAsTheirDerivativesSay )
{
  const auto Base = static_cast< std::uint32_t >( std::random_device{}() );
  for ( std::uint32_t Round = 0; Round < 40; ++Round )
  {
    SCOPED_TRACE( testing::Message() << "seed " << Base + Round );
    VRandom Random( Base + Round );
    VRandomTree Tree( Random, 14, true );
    VComputeSubjectFK& rSubject = Tree.Subject;
    const std::vector< double > State = Tree.RandomState( Random, 2.5 );
    ASSERT_EQ( rSubject.LoadState( State ), Ok );
    std::vector< bool > Turns; // by row: a rotation vector, which leaps where the turn is half a one
    for ( std::uint32_t Kind = 0; Kind < Kinds; ++Kind )
    {
      for ( const std::size_t Segment : { std::size_t( 13 ), Random.Below( 14 ) } )
      {
        VTargetRecord Record{ static_cast< ETargetKind >( Kind ), Segment, 0, Random.In( 0.5, 2 ),
                              RandomPose( Random, 100 ),          {} };
        Record.Goal = PoseNow( rSubject, Record );
        AddTarget( rSubject, Record );
        const bool bTurn = Record.Kind == ETargetKind::LocalRotationToWorldRotation;
        Turns.resize( rSubject.ResidualCount(), bTurn );
        std::fill_n( Turns.rbegin(), Record.Kind == ETargetKind::RigidBody ? 3 : 0, true );
      }
    }
    ASSERT_EQ( rSubject.ResidualCount(), 2 * ( 3 + 3 + 1 + 6 + 3 + 3 ) );
    for ( const double Residual : ResidualsAt( rSubject, State ) )
    {
      EXPECT_NEAR( Residual, 0, 1e-11 );
    }
    for ( std::size_t Index = 0; Index < rSubject.TargetCount(); ++Index )
    {
      rSubject.Target( Index ).SetGoal( RandomPose( Random, 100 ) );
    }
    std::vector< double > Jacobian;
    ASSERT_EQ( rSubject.LoadState( State ), Ok );
    rSubject.Jacobian( Jacobian );
    ASSERT_EQ( Jacobian.size(), rSubject.ResidualCount() * State.size() );
    constexpr double Move = 1e-5;
    for ( std::size_t Column = 0; Column < State.size(); ++Column )
    {
      std::vector< double > Up = State, Down = State;
      Up[Column] += Move;
      Down[Column] -= Move;
      const std::vector< double > Above = ResidualsAt( rSubject, Up ), Below = ResidualsAt( rSubject, Down );
      for ( std::size_t Row = 0; Row < Above.size(); ++Row )
      {
        const double Slope = ( Above[Row] - Below[Row] ) / ( 2 * Move );
        const bool bWrapped = Turns[Row] && std::abs( Above[Row] - Below[Row] ) > 0.1;
        EXPECT_TRUE( bWrapped || std::abs( Jacobian[Row * State.size() + Column] - Slope ) <=
                                     1e-6 * std::max( 1.0, std::abs( Slope ) ) )
            << "row " << Row << " column " << Column << ": " << Jacobian[Row * State.size() + Column] << ", not "
            << Slope;
      }
    }
  }
}

TEST( Targets, AFewStepsBringFiftyThreeMarkersToTheirPlaces )
{
  VRandom Random( 11 );
  VComputeSubjectFK Subject;
  for ( std::size_t Index = 0; Index < 12; ++Index )
  {
    const EJointType Types[] = { EJointType::Ball, EJointType::HardySpicer, EJointType::Hinge };
    Subject.AddSegment(
        Index == 0 ? VComputeSubjectFK::NoParent : ( Index - 1 ) / 2,
        { Index == 0 ? EJointType::Free : Types[Index % 3], Random.Rigid( 200 ), VRigidTransform::Identity() } );
  }
  std::vector< double > Wanted( Subject.StateSize() ), State( Subject.StateSize() );
  for ( double& rValue : Wanted )
  {
    rValue = Random.In( -0.5, 0.5 );
  }
  ASSERT_EQ( Subject.LoadState( Wanted ), Ok );
  std::vector< std::array< double, 3 > > Places( 53 ), Positions( 53 );
  for ( std::size_t Marker = 0; Marker < 53; ++Marker )
  {
    VTargetRecord Record{ ETargetKind::LocalPointToWorldPoint, Marker % 12, Marker, 1, RandomPose( Random, 100 ), {} };
    Record.Goal = PoseNow( Subject, Record );
    std::copy_n( Record.Goal.Point, 3, Places[Marker].begin() );
    AddTarget( Subject, Record );
  }
  for ( int Round = 0; Round < 12; ++Round )
  {
    const std::vector< double > Residuals = ResidualsAt( Subject, State );
    std::vector< double > Jacobian;
    Subject.Jacobian( Jacobian );
    const std::vector< double > Change = Step( Jacobian, Residuals, State.size() );
    for ( std::size_t Index = 0; Index < State.size(); ++Index )
    {
      State[Index] += Change[Index];
    }
    EXPECT_EQ( Subject.NormaliseState( State ), Ok );
  }
  ASSERT_EQ( Subject.LoadState( State ), Ok );
  EXPECT_EQ( Subject.Positions( Positions ), Ok );
  for ( std::size_t Marker = 0; Marker < 53; ++Marker )
  {
    for ( std::size_t Axis = 0; Axis < 3; ++Axis )
    {
      EXPECT_NEAR( Positions[Marker][Axis], Places[Marker][Axis], 1e-9 ) << "marker " << Marker;
    }
  }
  Positions.resize( 50 );
  EXPECT_EQ( Subject.Positions( Positions ), ZEK::IResult( ZEK::IResult::OkButPartial ) );
}

TEST( Targets, RecordsThatNoFactoryServesThrow )
{
  using enum ZEK::IResult::ECode;
  std::vector< std::pair< VTargetRecord, ZEK::IResult::ECode > > Cases;
  const auto Case = [&]( ZEK::IResult::ECode i_Code ) -> VTargetRecord&
  {
    Cases.emplace_back( VTargetRecord{}, i_Code ).first.Kind = ETargetKind::RigidBody;
    return Cases.back().first;
  };
  Case( ZEK::IResult::Ok );
  Case( InvalidType ).Kind = ETargetKind::BadTargetKind;
  Case( InvalidIndex ).Segment = 1;
  Case( InvalidValue ).Local.Point[2] = NAN;
  Case( InvalidValue ).Goal.Direction[2] = 1.1;
  Case( InvalidValue ).Local.Rotation[4] = -1;
  Case( InvalidValue ).Weight = -1;
  VComputeSubjectFK Subject;
  Subject.AddSegment( VComputeSubjectFK::NoParent, {} );
  for ( std::size_t Index = 0; Index < Cases.size(); ++Index )
  {
    ZEK::IResult Seen = ZEK::IResult::Ok;
    try
    {
      AddTarget( Subject, Cases[Index].first );
    }
    catch ( const VConstructionException& rFailure )
    {
      Seen = rFailure.Code();
    }
    EXPECT_EQ( Seen, ZEK::IResult( Cases[Index].second ) ) << "case " << Index;
  }
  EXPECT_THROW( Subject.AddTarget( nullptr ), VConstructionException );
  EXPECT_THROW( VTargetFKFactory< VTargetFKRigidBody >().Create( {} ), VConstructionException );
  EXPECT_EQ( Subject.TargetCount(), 1u );
}

TEST( JointLimits, PushBackOutsideOnly )
{
  const VComputeJointLimits Limits( { { 0, -1, 2, 3 }, { 2, 0, 0, 1 }, { 9, -1, 1, 1 }, { 1, -HUGE_VAL, 5, 2 } } );
  ASSERT_EQ( Limits.ResidualCount(), 4u );
  EXPECT_EQ( Limits.Degree( 2 ), 9u );
  using V = std::vector< double >;
  const auto Rows = [&]( const V& i_rState, bool i_bDerivative )
  {
    V Result( 4, NAN );
    i_bDerivative ? Limits.Derivative( i_rState, Result.data() ) : Limits.Residual( i_rState, Result.data() );
    return Result;
  };
  EXPECT_EQ( Rows( { 4, 7, -0.5 }, false ), ( V{ 6, -0.5, 0, 4 } ) );
  EXPECT_EQ( Rows( { 4, 7, -0.5 }, true ), ( V{ 3, 1, 0, 2 } ) );
  EXPECT_EQ( Rows( { -1, -1e300, 0 }, false ), ( V{ 0, 0, 0, 0 } ) );
  EXPECT_EQ( Rows( { -1, -1e300, 0 }, true ), ( V{ 0, 0, 0, 0 } ) );
  EXPECT_THROW( VComputeJointLimits( { { 0, 2, 1, 1 } } ), VConstructionException );
  EXPECT_THROW( VComputeJointLimits( { { 0, NAN, 1, 1 } } ), VConstructionException );
  EXPECT_THROW( VComputeJointLimits( { { 0, 0, 1, HUGE_VAL } } ), VConstructionException );
}

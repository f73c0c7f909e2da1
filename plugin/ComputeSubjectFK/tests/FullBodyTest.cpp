#include "OsimModel.h"
#include "RandomTrees.h"
#include "RotationVector.h"

#include <TestSupport/Paths.h>

#include <gtest/gtest.h>

#include <set>

using namespace ComputeSubject;
using OsimModel::VFrame;
using OsimModel::VJoint;
using OsimModel::VTable;

namespace
{
constexpr double Millimetres = 1000;

VRigidTransform Turned( const OsimModel::VVector& i_rAxis, double i_Angle )
{
  const double Vector[3] = { i_rAxis[0] * i_Angle, i_rAxis[1] * i_Angle, i_rAxis[2] * i_Angle };
  VRigidTransform Result;
  RotationFromVector( Vector, Result.m_Rotation );
  return Result;
}

VRigidTransform OffsetOf( const VFrame& i_rFrame )
{
  const OsimModel::VVector& rO = i_rFrame.Orientation;
  VRigidTransform Result = Turned( { 1, 0, 0 }, rO[0] ) * Turned( { 0, 1, 0 }, rO[1] ) * Turned( { 0, 0, 1 }, rO[2] );
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    Result.m_Translation[Axis] = i_rFrame.Translation[Axis] * Millimetres;
  }
  return Result;
}

VRigidTransform Inverse( const VRigidTransform& i_rTransform )
{
  VRigidTransform Result;
  for ( int Index = 0; Index < 9; ++Index )
  {
    Result.m_Rotation[Index] = i_rTransform.m_Rotation[Index % 3 * 3 + Index / 3];
  }
  double Back[3];
  Result.Turn( i_rTransform.m_Translation, Back );
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    Result.m_Translation[Axis] = -Back[Axis];
  }
  return Result;
}

/// Where a body is in a row of the table, whose z is up.
VRigidTransform PoseOf( const VTable& i_rTable, const std::string& i_rBody, std::size_t i_Row )
{
  if ( i_rBody == "ground" )
  {
    return Turned( { 1, 0, 0 }, std::acos( 0.0 ) );
  }
  const auto At = [&]( const char* i_pColumn )
  {
    return i_rTable.at( i_rBody + i_pColumn ).at( i_Row );
  };
  VRigidTransform Result = Turned( { 0, 0, 1 }, At( "_rotz" ) ) * Turned( { 0, 1, 0 }, At( "_roty" ) ) *
                           Turned( { 1, 0, 0 }, At( "_rotx" ) );
  Result.m_Translation[0] = At( "_x" ) * Millimetres;
  Result.m_Translation[1] = At( "_y" ) * Millimetres;
  Result.m_Translation[2] = At( "_z" ) * Millimetres;
  return Result;
}

/// Joints whose shifts, or whose turns, depend on each other: knees, kneecaps, the head and the abdomen.
const std::set< std::string > Coupled{ "walker_knee_r",    "walker_knee_l", "patellofemoral_r",
                                       "patellofemoral_l", "head_torso",    "Abdjnt" };

EJointType TypeOf( const VJoint& i_rJoint )
{
  if ( i_rJoint.Kind == "PinJoint" )
  {
    return EJointType::Hinge;
  }
  if ( i_rJoint.Kind == "UniversalJoint" )
  {
    return EJointType::HardySpicer;
  }
  return i_rJoint.Kind == "WeldJoint"       ? EJointType::Dummy
         : i_rJoint.Name == "ground_pelvis" ? EJointType::Free
                                            : EJointType::Ball;
}

void AppendState( const VJoint& i_rJoint, const VTable& i_rMotion, std::size_t i_Row, std::vector< double >& io_rState )
{
  const auto Value = [&]( const std::string& i_rCoordinate )
  {
    return i_rCoordinate.empty() ? 0.0 : i_rMotion.at( i_rCoordinate ).at( i_Row );
  };
  if ( i_rJoint.Axes.empty() )
  {
    for ( const std::string& rCoordinate : i_rJoint.Coordinates )
    {
      io_rState.push_back( Value( rCoordinate ) );
    }
    return;
  }
  VRigidTransform Turn = VRigidTransform::Identity();
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    Turn = Turn *
           Turned( i_rJoint.Axes[Axis].Direction, i_rJoint.Axes[Axis].Slope * Value( i_rJoint.Axes[Axis].Coordinate ) );
  }
  double Vector[3];
  VectorFromRotation( Turn.m_Rotation, Vector );
  io_rState.insert( io_rState.end(), Vector, Vector + 3 );
  for ( std::size_t Axis = 3; Axis < 6 && TypeOf( i_rJoint ) == EJointType::Free; ++Axis )
  {
    io_rState.push_back( Value( i_rJoint.Axes[Axis].Coordinate ) * Millimetres );
  }
}
} // namespace

/// Each child from where the table has its parent: pairs of a free segment and one on the joint, all in one subject.
TEST( FullBody, JointsOfAModelGiveTheTabulatedPoses )
{
  HARROW_NEEDS_RECORDINGS();
  const std::filesystem::path Folder = TestSupport::RecordingsDir() / "fk-fullbody";
  std::vector< VJoint > Joints = OsimModel::ReadJoints( Folder / "model.osim" );
  const VTable Motion = OsimModel::ReadMotion( Folder / "motion.mot" ),
               Table = OsimModel::ReadSegments( Folder / "segments.csv" );
  ASSERT_EQ( Joints.size(), 30u );
  ASSERT_EQ( Table.size(), 181u );
  ASSERT_EQ( Motion.at( "time" ).size(), 100u );
  std::erase_if( Joints,
                 []( const VJoint& i_rJoint )
                 {
                   return Coupled.contains( i_rJoint.Name );
                 } );
  std::map< EJointType, int > Kinds;
  VComputeSubjectFK Subject;
  // A universal joint turns about x, then y; ours about z, then y.
  const VRigidTransform ZToX = Turned( { 0, 1, 0 }, std::acos( 0.0 ) );
  for ( const VJoint& rJoint : Joints )
  {
    const EJointType Type = TypeOf( rJoint );
    ++Kinds[Type];
    VJointRecord Record{ Type, OffsetOf( rJoint.Frames.at( rJoint.ParentFrame ) ),
                         Inverse( OffsetOf( rJoint.Frames.at( rJoint.ChildFrame ) ) ) };
    if ( Type == EJointType::HardySpicer )
    {
      Record.m_Pre = Record.m_Pre * ZToX;
      Record.m_Post = Inverse( ZToX ) * Record.m_Post;
    }
    const std::size_t Parent = Subject.AddSegment(
        VComputeSubjectFK::NoParent, { EJointType::Free, VRigidTransform::Identity(), VRigidTransform::Identity() } );
    Subject.AddSegment( Parent, Record );
  }
  EXPECT_EQ( Kinds, ( std::map< EJointType, int >{ { EJointType::Hinge, 8 },
                                                   { EJointType::HardySpicer, 2 },
                                                   { EJointType::Dummy, 1 },
                                                   { EJointType::Free, 1 },
                                                   { EJointType::Ball, 12 } } ) );
  double WorstTurn = 0, WorstPlace = 0;
  for ( std::size_t Row = 0; Row < 100; ++Row )
  {
    std::vector< double > State;
    for ( const VJoint& rJoint : Joints )
    {
      const VRigidTransform Parent = PoseOf( Table, rJoint.Frames.at( rJoint.ParentFrame ).Body, Row );
      double Vector[3];
      VectorFromRotation( Parent.m_Rotation, Vector );
      State.insert( State.end(), Vector, Vector + 3 );
      State.insert( State.end(), Parent.m_Translation, Parent.m_Translation + 3 );
      AppendState( rJoint, Motion, Row, State );
    }
    ASSERT_EQ( Subject.LoadState( State ), ZEK::IResult( ZEK::IResult::Ok ) );
    for ( std::size_t Index = 0; Index < Joints.size(); ++Index )
    {
      const std::string& rBody = Joints[Index].Frames.at( Joints[Index].ChildFrame ).Body;
      const VRigidTransform Difference =
          Inverse( PoseOf( Table, rBody, Row ) ) * Subject.WorldTransforms()[2 * Index + 1];
      double Turn[3];
      VectorFromRotation( Difference.m_Rotation, Turn );
      const double Angle = std::hypot( Turn[0], Turn[1], Turn[2] );
      const double* T = Difference.m_Translation;
      const double Place = std::hypot( T[0], T[1], T[2] );
      EXPECT_LE( Angle, 1e-6 ) << Joints[Index].Name << " in row " << Row;
      EXPECT_LE( Place, 1e-3 ) << Joints[Index].Name << " in row " << Row;
      WorstTurn = std::max( WorstTurn, Angle );
      WorstPlace = std::max( WorstPlace, Place );
    }
  }
  std::printf( "24 of 30 joints over 100 rows: off by at most %.2g rad and %.2g mm; the coupled joints of knees, "
               "kneecaps, head and abdomen are left out\n",
               WorstTurn, WorstPlace );
}

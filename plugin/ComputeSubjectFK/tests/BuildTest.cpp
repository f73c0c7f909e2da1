#include <ComputeSubjectFK/VComputeSubjectFK.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <cmath>

using namespace ComputeSubject;
using CoreMoxelTypes::VSubject;

namespace
{
VSubject Arm()
{
  VSubject Subject;
  Subject.Name = "Ann";
  const char* const Names[] = { "Trunk", "Upper", "Lower" };
  for ( int Index = 0; Index < 3; ++Index )
  {
    CoreMoxelTypes::VSegment Segment;
    Segment.Name = Names[Index];
    Segment.Parent = Index - 1;
    Segment.Joint = Index == 0   ? CoreMoxelTypes::EJointType::Free
                    : Index == 1 ? CoreMoxelTypes::EJointType::Ball
                                 : CoreMoxelTypes::EJointType::Hinge;
    Segment.Pre.T[0] = 100 * Index;
    Subject.Segments.push_back( Segment );
  }
  for ( int Index = 0; Index < 4; ++Index )
  {
    CoreMoxelTypes::VMarker Marker;
    Marker.Name = std::string( "M" ).append( std::to_string( Index ) );
    Marker.Segment = Index - 1;
    Marker.Local = { 1.0 * Index, 0, 5 };
    Subject.Markers.push_back( Marker );
  }
  return Subject;
}
} // namespace

TEST( SubjectFKBuild, MakesSegmentsAndAPointTargetForEachMarkerOnOne )
{
  std::unique_ptr< VComputeSubjectFK > pSubject;
  std::string Message = "old";
  ASSERT_EQ( VComputeSubjectFK::Build( Arm(), pSubject, Message ), ZEK::IResult( ZEK::IResult::Ok ) );
  EXPECT_EQ( Message, "" );
  ASSERT_EQ( pSubject->SegmentCount(), 3u );
  EXPECT_EQ( pSubject->StateSize(), 10u );
  EXPECT_EQ( pSubject->TargetCount(), 3u ) << "the first marker has no segment";
  EXPECT_EQ( pSubject->Segment( 2 ).Joint().JointType(), EJointType::Hinge );
  const std::vector< double > State{ 0, 0, 0, 1000, 0, 0, 0, 0, 0, M_PI / 2 };
  ASSERT_EQ( pSubject->LoadState( State ), ZEK::IResult( ZEK::IResult::Ok ) );
  std::vector< std::array< double, 3 > > Positions( 4, { NAN, NAN, NAN } );
  ASSERT_EQ( pSubject->Positions( Positions ), ZEK::IResult( ZEK::IResult::Ok ) );
  EXPECT_TRUE( std::isnan( Positions[0][0] ) );
  EXPECT_NEAR( Positions[3][0], 1300, 1e-12 );
  EXPECT_NEAR( Positions[3][1], 3, 1e-12 );
  EXPECT_NEAR( Positions[2][0], 1102, 1e-12 );
  VSubject Rounded = Arm();
  Rounded.Segments[2].Pre.R[0] = 1 + 4e-7;
  EXPECT_NO_THROW( VComputeSubjectFK::Build( Rounded ) ) << "as near to a rotation as single precision brings it";
  EXPECT_EQ( VComputeSubjectFK::Build( VSubject{} )->SegmentCount(), 0u );
}

TEST( SubjectFKBuild, SaysWhatIsWrongWithASubject )
{
  struct VCase
  {
    void ( *pBreak )( VSubject& );
    ZEK::IResult::ECode Code;
    const char* pMessage;
  };
  using enum ZEK::IResult::ECode;
  const VCase Cases[] = {
      { []( VSubject& o_r )
        {
          o_r.Segments[1].Parent = 2;
        },
        InvalidIndex, "Segment 1 \"Upper\": Segment 1 has a parent" },
      { []( VSubject& o_r )
        {
          o_r.Segments[1].Parent = 1;
        },
        InvalidIndex, "does not stand before it" },
      { []( VSubject& o_r )
        {
          o_r.Segments[0].Parent = 2147483647;
        },
        InvalidIndex, "Segment 0 \"Trunk\"" },
      { []( VSubject& o_r )
        {
          o_r.Segments[2].Parent = -2;
        },
        InvalidIndex, "Segment 2 \"Lower\"" },
      { []( VSubject& o_r )
        {
          o_r.Segments[2].Joint = static_cast< CoreMoxelTypes::EJointType >( 6 );
        },
        InvalidType, "type 6" },
      { []( VSubject& o_r )
        {
          o_r.Segments[2].Joint = static_cast< CoreMoxelTypes::EJointType >( ~0u );
        },
        InvalidType, "Segment 2" },
      { []( VSubject& o_r )
        {
          o_r.Segments[2].Pre.T[1] = NAN;
        },
        InvalidValue, "not finite" },
      { []( VSubject& o_r )
        {
          o_r.Segments[2].Post.R[0] = 3;
        },
        InvalidValue, "not a rotation" },
      { []( VSubject& o_r )
        {
          o_r.Segments[2].Pre.R[0] = -1;
        },
        InvalidValue, "Segment 2" }, // a mirror
      { []( VSubject& o_r )
        {
          o_r.Segments[2].Pre.R[0] = 1 + 2e-6;
        },
        InvalidValue, "Segment 2" },
      { []( VSubject& o_r )
        {
          o_r.Markers[3].Segment = 3;
        },
        InvalidIndex, "Marker 3 \"M3\"" },
      { []( VSubject& o_r )
        {
          o_r.Markers[3].Segment = -2147483647 - 1;
        },
        InvalidIndex, "Marker 3 \"M3\"" },
      { []( VSubject& o_r )
        {
          o_r.Markers[2].Local.z = HUGE_VAL;
        },
        InvalidValue, "Marker 2 \"M2\"" },
      { []( VSubject& o_r )
        {
          o_r.Segments.clear();
        },
        InvalidIndex, "segment that is not there" },
  };
  for ( const VCase& rCase : Cases )
  {
    SCOPED_TRACE( rCase.pMessage );
    VSubject Subject = Arm();
    rCase.pBreak( Subject );
    auto pSubject = std::make_unique< VComputeSubjectFK >();
    std::string Message;
    EXPECT_EQ( VComputeSubjectFK::Build( Subject, pSubject, Message ), ZEK::IResult( rCase.Code ) );
    EXPECT_EQ( pSubject, nullptr );
    EXPECT_THAT( Message, testing::HasSubstr( rCase.pMessage ) );
    EXPECT_THAT( Message, testing::StartsWith( "Subject \"Ann\": " ) );
    EXPECT_THROW( VComputeSubjectFK::Build( Subject ), VConstructionException );
  }
}

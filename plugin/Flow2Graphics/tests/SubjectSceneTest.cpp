#include "FlowTestScene.h"

#include <Flow2Graphics/VFlowSubjectSceneTransform.h>

#include <TestSupport/LogGuard.h>

#include <numbers>
#include <set>

using namespace CoreMoxelTypes;

namespace
{
constexpr double Right = std::numbers::pi / 2;

class SubjectScene : public testing::Test
{
protected:
  using VParameters = ZEK::VFlowParameterMap;

  /// A body that stands at its root, and an arm along x that a hinge swings about the vertical. Pose i has the root at
  /// (1000, 2000, 900 + i) and the arm at i right angles.
  static VSubjectParametrised Person( double i_Arm = 300, int i_Poses = 4 )
  {
    VSubjectParametrised Person;
    Person.Base.Name = "Person";
    Person.Base.Segments.resize( 2 );
    Person.Base.Segments[0].BoneLength = 100;
    Person.Base.Segments[1].Parent = 0;
    Person.Base.Segments[1].Joint = EJointType::Hinge;
    Person.Base.Segments[1].Pre.T[0] = 100;
    Person.Base.Segments[1].BoneLength = static_cast< f32 >( i_Arm );
    Person.Base.Markers.resize( 2 );
    Person.Base.Markers[0].Segment = 1;
    Person.Base.Markers[0].Local = { i_Arm, 0, 50 };
    for ( int Pose = 0; Pose < i_Poses; ++Pose )
    {
      Person.Poses.push_back( { 0, 0, 0, 1000, 2000, 900.0 + Pose, Pose * Right } );
    }
    return Person;
  }
  ZEK::VFlowItemRef Labelled( const VSubjectParametrised& i_rValue, const std::string& i_rName )
  {
    return Maker.Item< FlowSubjectParametrised >( i_rValue, i_rName );
  }
  ZEK::VFlowItemRef Solved( const VSubjectParametrised& i_rValue, const std::string& i_rName )
  {
    return Maker.Item< FlowSubjectParametrisedForSolving >( i_rValue, i_rName );
  }
  void Transform( const std::vector< ZEK::VFlowItemRef >& i_rItems, const VParameters& i_rParameters = {} )
  {
    Scene.Transform( State, Maker.State( ++Frame, i_rItems ), i_rParameters );
    ASSERT_TRUE( State );
  }
  /// The items of a kind in the order of the state.
  template < typename TFlow >
  std::vector< ZEK::VFlowItemRef > Items() const
  {
    std::vector< ZEK::VFlowItemRef > Found;
    ZEK::VFlowCursor It, End;
    State->TagBegin( It, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
    State->TagEnd( End, ZEK::FlowTag< TFlow >, ZEK::EFlowTimeMatch::Overlap );
    for ( ; It != End; ++It )
    {
      Found.emplace_back( It->pItem );
    }
    return Found;
  }
  /// The one item of a kind, null when there is none.
  template < typename TFlow >
  ZEK::VFlowItemRef Item() const
  {
    const auto Found = Items< TFlow >();
    EXPECT_LE( Found.size(), 1u );
    return Found.empty() ? nullptr : Found.front();
  }
  template < typename TFlow = FlowSubjectDynamicParameters >
  VSubjectDynamicParameters Posed() const
  {
    const ZEK::VFlowItemRef Found = Item< TFlow >();
    const auto* const pPosed = ZEK::FlowPayload< VSubjectDynamicParameters >( Found.Get() );
    return pPosed ? *pPosed : VSubjectDynamicParameters();
  }
  /// The height of the root tells the pose; 0 is the neutral one.
  template < typename TFlow = FlowSubjectDynamicParameters >
  int Pose() const
  {
    const auto Found = Posed< TFlow >();
    const int Height = Found.Segments.empty() ? -1 : static_cast< int >( Found.Segments[0].T[2] );
    return Height == 0 ? -1 : Height - 900;
  }
  std::array< int, 4 > Volume() const
  {
    const ZEK::VFlowItemRef Found = Item< FlowVolumeProperties >();
    const auto* const pVolume = ZEK::FlowPayload< VVolumeProperties >( Found.Get() );
    return pVolume ? std::array{ pVolume->XMin, pVolume->YMin, pVolume->XMax, pVolume->YMax } : std::array< int, 4 >();
  }
  static void ExpectPlace( const double i_Place[3], const D3& i_rExpected )
  {
    EXPECT_NEAR( i_Place[0], i_rExpected.x, 1e-9 );
    EXPECT_NEAR( i_Place[1], i_rExpected.y, 1e-9 );
    EXPECT_NEAR( i_Place[2], i_rExpected.z, 1e-9 );
  }

  FlowTest::VMaker Maker;
  Flow2Graphics::VFlowSubjectSceneTransform Scene{ HostFlow::MakeItemStore() };
  ZEK::VFlowStateRef State;
  int Frame = 0;
};
} // namespace

TEST_F( SubjectScene, OfALiveStateNineTagsPassBesideWhatIsMade )
{
  std::vector< ZEK::VFlowItemRef > Live;
  [&]< typename... T >( std::tuple< T*... >* )
  {
    ( Live.push_back( Maker.Item< T >( {}, "Ada" ) ), ... );
  }( static_cast< VAllFlowTypes* >( nullptr ) );
  const std::set< std::uint32_t > Passed{ 0x1029, 0x1012, 0x101B, 0x101A, 0x102C, 0x1013, 0x101C, 0x1027, 0x1044 };
  const std::set< std::uint32_t > Made{ 0x1011, 0x101d, 0x1031 };
  const ZEK::VFlowStateRef Input = Maker.State( 7, Live );
  const std::size_t Before = Input->ItemCount();
  Scene.Transform( State, Input, {} );
  EXPECT_EQ( State->ItemCount(), Passed.size() + Made.size() );
  EXPECT_EQ( State->GetKey(), Input->GetKey() );
  for ( const ZEK::VFlowItemRef& rItem : Live )
  {
    ZEK::VFlowItemRef Shown;
    const std::uint32_t Tag = rItem->Id().Type;
    State->FindItem( Shown, Tag, ZEK::EFlowTimeMatch::Equal );
    EXPECT_EQ( Shown == rItem, Passed.contains( Tag ) ) << std::hex << Tag;
    EXPECT_EQ( Shown && Shown != rItem, Made.contains( Tag ) ) << std::hex << Tag;
  }
  EXPECT_EQ( Input->ItemCount(), Before );
}

TEST_F( SubjectScene, PosesComeFromTextsAndEachKindHasItsOwn )
{
  const std::vector< ZEK::VFlowItemRef > Live{ Labelled( Person(), "Ada" ), Solved( Person(), "Ada" ) };
  struct VCase
  {
    VParameters Parameters;
    int Labelling, Solving;
  };
  const VCase Cases[] = {
      { {}, 0, 0 },
      { { { "PoseIndex", " 3\t" } }, 3, 3 },
      { { { "PoseIndex", "" } }, 0, 0 },
      { { { "PoseIndex", "x" } }, 0, 0 },
      { { { "PoseIndex", "1 1" } }, 0, 0 },
      { { { "PoseIndex", "99999999999" } }, 0, 0 },
      { { { "PoseIndex", std::int64_t( 2 ) } }, 0, 0 },
      { { { "PoseIndex", "-1" } }, -1, -1 },
      { { { "PoseIndex", "4" } }, -1, -1 },
      { { { "PoseIndex", "2" }, { "LabellingPoseIndex", "x" }, { "SolvingPoseIndex", "1" } }, 2, 1 },
      { { { "LabellingPoseIndex", "1" }, { "SolvingPoseIndex", "99999999999" } }, 1, 0 },
  };
  for ( const VCase& rCase : Cases )
  {
    SCOPED_TRACE( &rCase - Cases );
    Transform( Live, rCase.Parameters );
    EXPECT_EQ( Pose(), rCase.Labelling );
    EXPECT_EQ( Pose< FlowSubjectDynamicParametersForSolving >(), rCase.Solving );
  }
  Transform( Live, { { "SolvingPoseIndex", "1" } } );
  const auto Labelling = Item< FlowSubjectDynamicParameters >();
  const auto Solving = Item< FlowSubjectDynamicParametersForSolving >();
  Transform( Live, { { "SolvingPoseIndex", "2" } } );
  EXPECT_EQ( Item< FlowSubjectDynamicParameters >(), Labelling );
  EXPECT_NE( Item< FlowSubjectDynamicParametersForSolving >(), Solving );
}

TEST_F( SubjectScene, APoseStandsOverTheOriginAndTurnsWithTheUpAxis )
{
  for ( const std::uint32_t Up : { 2u, 1u } )
  {
    SCOPED_TRACE( Up );
    const auto World = [Up]( double i_X, double i_Y, double i_Z )
    {
      return Up == 1 ? D3{ i_X, i_Z, -i_Y } : D3{ i_X, i_Y, i_Z };
    };
    Transform( { Maker.Item< FlowWorldAxis >( { Up } ), Labelled( Person(), "Ada" ) }, { { "PoseIndex", "1" } } );
    const auto Ada = Posed();
    ASSERT_EQ( Ada.Segments.size(), 2u );
    ExpectPlace( Ada.Segments[0].T, World( 0, 0, 901 ) );
    ExpectPlace( Ada.Segments[1].T, World( 100, 0, 901 ) );
    ASSERT_EQ( Ada.MarkerPositions.size(), 2u );
    ExpectPlace( &Ada.MarkerPositions[0].x, World( 100, 300, 951 ) );
    EXPECT_TRUE( std::isnan( Ada.MarkerPositions[1].x ) ) << "it is on no segment";
    EXPECT_EQ( Ada.MarkerVisible, ( std::vector< u8 >{ 1, 1 } ) );
    EXPECT_EQ( Ada.SegmentHealth, ( std::vector< f32 >{ 1, 1 } ) );
    const double Along[3] = { Ada.Segments[1].R[0], Ada.Segments[1].R[3], Ada.Segments[1].R[6] };
    ExpectPlace( Along, World( 0, 1, 0 ) );
    EXPECT_EQ( Volume(), ( std::array{ -2000, -2000, 2000, 2000 } ) );
  }
  VSubjectParametrised Deep = Person();
  Deep.Base.Segments[1].Pre.T[2] = -850;
  Transform( { Labelled( Deep, "Ada" ) }, { { "PoseIndex", "-1" } } );
  EXPECT_NEAR( Posed().Segments[1].T[2], 0, 1e-9 ) << "what would hang through the floor stands on it";
}

TEST_F( SubjectScene, WhatDidNotChangeIsKept )
{
  const auto Ada = Labelled( Person(), "Ada" ), Cai = Labelled( Person(), "Cai" );
  const auto Settings = [&]( bool i_bEnabled )
  {
    VSubjectSettings Value;
    Value.Enabled = i_bEnabled;
    return Maker.Item< FlowSubjectSettings >( Value, "Ada" );
  };
  Transform( {} );
  EXPECT_FALSE( Item< FlowVolumeProperties >() ) << "without subjects the floor stays as it is";
  const auto First = Settings( true );
  Transform( { Ada, First } );
  auto Volume = Item< FlowVolumeProperties >();
  auto Posed = Items< FlowSubjectDynamicParameters >();
  ASSERT_TRUE( Volume && Posed.size() == 1 );
  Transform( { Ada, First } );
  EXPECT_EQ( Item< FlowVolumeProperties >(), Volume );
  EXPECT_EQ( Items< FlowSubjectDynamicParameters >(), Posed );
  Transform( { Ada, Settings( false ) } );
  EXPECT_NE( std::exchange( Volume, Item< FlowVolumeProperties >() ), Item< FlowVolumeProperties >() );
  EXPECT_EQ( Items< FlowSubjectDynamicParameters >(), Posed ) << "settings move nobody";
  Transform( { Ada, Cai } );
  const auto Both = Items< FlowSubjectDynamicParameters >();
  ASSERT_EQ( Both.size(), 2u );
  EXPECT_NE( Both[0], Posed[0] ) << "it moved";
  Transform( { Ada, Labelled( Person(), "Cai" ) } );
  EXPECT_EQ( Items< FlowSubjectDynamicParameters >()[0], Both[0] );
  EXPECT_NE( Items< FlowSubjectDynamicParameters >()[1], Both[1] );
  Transform( { Ada, Cai, Maker.Item< FlowWorldAxis >( { 1 } ) } );
  EXPECT_NE( Items< FlowSubjectDynamicParameters >()[0], Both[0] ) << "it was turned";
}

TEST_F( SubjectScene, SubjectsNeverStandInEachOther )
{
  // The reach of Bea is the largest, and only her solved form has it.
  Transform( { Labelled( Person( 100 ), "Ada" ), Labelled( Person( 100 ), "Bea" ), Labelled( Person( 300 ), "Cai" ),
               Solved( Person( 830 ), "Bea" ), Maker.Item< FlowSubjectSettings >( {}, "Aaron" ) } );
  std::vector< D3 > Roots;
  for ( const ZEK::VFlowItemRef& rItem : Items< FlowSubjectDynamicParameters >() )
  {
    const auto& rSegments = ZEK::FlowPayload< VSubjectDynamicParameters >( rItem.Get() )->Segments;
    Roots.push_back( { rSegments[0].T[0], rSegments[0].T[1], 0 } );
  }
  ASSERT_EQ( Roots.size(), 3u );
  constexpr double Half = 1250; // of a cell: the reach of 930 to both sides, up to 2000, and a gap of 500
  ExpectPlace( &Roots[0].x, { -Half, Half, 0 } );
  ExpectPlace( &Roots[1].x, { Half, Half, 0 } );
  ExpectPlace( &Roots[2].x, { -Half, -Half, 0 } );
  ExpectPlace( Posed< FlowSubjectDynamicParametersForSolving >().Segments[0].T, { Half, Half, 900 } );
  EXPECT_EQ( Volume(), ( std::array{ -3000, -3000, 3000, 3000 } ) );
  // Four rows of four, a metre each.
  std::vector< ZEK::VFlowItemRef > Many;
  for ( char Letter = 'a'; Letter < 'q'; ++Letter )
  {
    Many.push_back( Labelled( Person( 100 ), std::string( 1, Letter ) ) );
  }
  Transform( Many );
  EXPECT_EQ( Volume(), ( std::array{ -2000, -2000, 2000, 2000 } ) );
}

TEST_F( SubjectScene, WhatCannotBePosedIsToldAndLeftOut )
{
  constexpr double Nothing = std::numeric_limits< double >::quiet_NaN();
  VSubjectParametrised Cyclic = Person(), Short = Person(), Broken = Person(), Endless = Person();
  Cyclic.Base.Segments[0].Parent = 1;
  Short.Poses[0].pop_back();
  Broken.Poses[0][3] = Nothing;
  Endless.Base.Segments[1].BoneLength = std::numeric_limits< f32 >::infinity();
  const std::vector< ZEK::VFlowItemRef > Live{ Labelled( Cyclic, "A" ), Labelled( Short, "B" ), Labelled( Broken, "C" ),
                                               Labelled( Endless, "D" ), Labelled( {}, "E" ) };
  Transform( Live );
  const auto Told = TestSupport::LogTexts( "SubjectScene", ZEK::ELogWarning );
  ASSERT_EQ( Told.size(), 3u );
  EXPECT_NE( Told[0].find( "Segment 0" ), std::string::npos ) << Told[0];
  EXPECT_NE( Told[1].find( "has 6 numbers, its joints need 7" ), std::string::npos ) << Told[1];
  EXPECT_NE( Told[2].find( "not finite" ), std::string::npos ) << Told[2];
  EXPECT_EQ( Items< FlowSubjectDynamicParameters >().size(), 4u );
  for ( const ZEK::VFlowItemRef& rItem : Items< FlowSubjectDynamicParameters >() )
  {
    for ( const Rigid& rBone : ZEK::FlowPayload< VSubjectDynamicParameters >( rItem.Get() )->Segments )
    {
      EXPECT_TRUE( std::isfinite( rBone.T[0] + rBone.T[1] + rBone.T[2] ) );
      EXPECT_LT( std::abs( rBone.T[0] ), 3000 );
    }
  }
  Transform( Live );
  EXPECT_EQ( TestSupport::LogTexts( "SubjectScene", ZEK::ELogWarning ).size(), 3u ) << "once is enough";
}

#pragma once

#include "FlowTestScene.h"

#include <ZEK/Selection.h>

namespace FlowTest
{

using namespace CoreMoxelTypes;

constexpr double NotANumber = std::numeric_limits< double >::quiet_NaN();

/// Subjects as a source would describe them.
class VSubjects : public testing::Test
{
protected:
  /// Two bones, the second from the end of the first, and three markers: one on each and one on none.
  static VSubject Person( std::uint32_t i_Id, const std::string& i_rName )
  {
    VSubject Subject;
    Subject.Id = i_Id;
    Subject.Name = i_rName;
    Subject.Segments = { { "Hips", -1, EJointType::Free, {}, {}, 200 }, { "Chest", 0, EJointType::Ball, {}, {}, 300 } };
    Subject.Segments[1].Pre.T[0] = 200;
    for ( const char* const pName : { "HIP", "CHE", "LOOSE" } )
    {
      VMarker& rMarker = Subject.Markers.emplace_back();
      rMarker.Name = pName;
      rMarker.Segment = static_cast< std::int32_t >( Subject.Markers.size() ) - 1;
      rMarker.Local = { 10, 20, 30 };
      rMarker.Radius = 9;
      rMarker.Covariance[0] = rMarker.Covariance[4] = rMarker.Covariance[8] = 4;
    }
    Subject.Markers[2].Segment = -1;
    Subject.Clusters = { { 0, 0 }, { 1, 2 } };
    return Subject;
  }
  static VSubjectApplicationData Looks( std::size_t i_Markers = 3 )
  {
    VSubjectApplicationData Data;
    for ( std::uint32_t Marker = 0; Marker < i_Markers; ++Marker )
    {
      Data.MarkerColours.push_back( 0xFF000001 + Marker );
    }
    Data.SegmentColours = { 0xFF0000AA, 0xFF0000BB };
    Data.Sticks = { { 0, 1, 0xFF111111, 0xFF222222 }, { 1, 2, 0xFF333333, 0xFF444444 } };
    Data.Skin = "body.fbx";
    return Data;
  }
  /// Solved at x = 1000, 1001, ...; bones stand at 10 and 20.
  static VSubjectDynamicParameters Motion( double i_By = 0 )
  {
    VSubjectDynamicParameters Motion;
    Motion.Segments.resize( 2 );
    Motion.Segments[0].T[0] = 10 + i_By;
    Motion.Segments[1].T[0] = 20 + i_By;
    for ( std::size_t Marker = 0; Marker < 3; ++Marker )
    {
      Motion.MarkerPositions.push_back( { 1000.0 + static_cast< double >( Marker ) + i_By, 0, 0 } );
    }
    Motion.MarkerVisible = { 1, 1, 0 };
    Motion.SegmentHealth = { 0.25F, 0.75F };
    return Motion;
  }
  ZEK::VFlowItemRef Labels( std::vector< VReconstructionLabelSet::L > i_Labels )
  {
    return Maker.Item< FlowReconstructionLabelSet >( { std::move( i_Labels ) } );
  }
  /// The x of each marker, NaN where it was not seen.
  static std::vector< float > Xs( const std::vector< MoxelGraphics::VScenePoint >& i_rPoints )
  {
    std::vector< float > Result;
    for ( const auto& rPoint : i_rPoints )
    {
      Result.push_back( rPoint.X );
    }
    return Result;
  }
  const MoxelGraphics::VSubjectGroup& Group( Flow2Graphics::EFlowSubjectGroup i_Group )
  {
    return Scene.Group( i_Group );
  }
  std::vector< std::string > Names( Flow2Graphics::EFlowSubjectGroup i_Group )
  {
    return Scene.Subjects()->Group( i_Group ).Names();
  }
  /// What the id of a part stands for.
  ZEK::VSelectionItem Resolved( std::uint32_t i_Id )
  {
    ZEK::VSelectionItem Item;
    EXPECT_TRUE( Scene.Registry().Resolve( i_Id, Item ) );
    return Item;
  }

  VMaker Maker;
  VScene Scene;
};

/// Whether a group's lists are as many as they have to be and point nowhere but into each other.
inline void ExpectSound( const MoxelGraphics::VSubjectGroup& i_rGroup )
{
  const std::size_t Markers = i_rGroup.Markers.size(), Bones = i_rGroup.Bones.size();
  EXPECT_TRUE( i_rGroup.Solved.size() == Markers && i_rGroup.MarkerColours.size() == Markers &&
               i_rGroup.MarkerNames.size() == Markers );
  EXPECT_TRUE( i_rGroup.Poses.size() == Bones && i_rGroup.Health.size() == Bones &&
               i_rGroup.BoneNames.size() == Bones );
  bool bSound = true;
  for ( const auto& rStick : i_rGroup.Sticks )
  {
    bSound = bSound && rStick.A < Markers && rStick.B < Markers;
  }
  for ( const auto& rTarget : i_rGroup.Targets )
  {
    bSound = bSound && rTarget.Bone < Bones && rTarget.Marker < Markers && std::isfinite( rTarget.Local[0] );
  }
  for ( const auto& rWire : i_rGroup.Wires )
  {
    bSound = bSound && rWire.Bone < Bones && rWire.Marker < Markers;
  }
  for ( std::size_t Bone = 0; Bone < Bones; ++Bone )
  {
    std::size_t Steps = 0;
    for ( std::int32_t At = static_cast< std::int32_t >( Bone ); At >= 0 && Steps <= Bones; ++Steps )
    {
      bSound = bSound && static_cast< std::size_t >( At ) < Bones;
      At = bSound ? i_rGroup.Bones[static_cast< std::size_t >( At )].Parent : -1;
    }
    bSound = bSound && Steps <= Bones && i_rGroup.Health[Bone] >= 0 && i_rGroup.Health[Bone] <= 1 &&
             std::isfinite( i_rGroup.Bones[Bone].Length );
  }
  EXPECT_TRUE( bSound );
  std::size_t Seen[5] = {};
  for ( const auto& rRecord : i_rGroup.Records )
  {
    const MoxelGraphics::VSubjectRange Ranges[] = { rRecord.Markers, rRecord.Sticks, rRecord.Bones, rRecord.Targets,
                                                    rRecord.Wires };
    for ( std::size_t Kind = 0; Kind < 5; ++Kind )
    {
      EXPECT_EQ( Ranges[Kind].First, Seen[Kind] );
      Seen[Kind] += Ranges[Kind].Count;
    }
  }
  EXPECT_TRUE( Seen[0] == Markers && Seen[1] == i_rGroup.Sticks.size() && Seen[2] == Bones &&
               Seen[3] == i_rGroup.Targets.size() && Seen[4] == i_rGroup.Wires.size() );
}

} // namespace FlowTest

#pragma once

#include "FrameFixture.h"

#include <MoxelGraphics/VRenderSubjectDynamics.h>
#include <MoxelGraphics/VRenderSubjectMarkers.h>
#include <MoxelGraphics/VSubjectGroup.h>

namespace MoxelGraphics
{

/// A pose whose x axis runs from one point to another.
inline VBonePose PoseAlong( const QVector3D& i_rFrom, const QVector3D& i_rTo )
{
  const QVector3D X = ( i_rTo - i_rFrom ).normalized();
  const QVector3D Aside = std::abs( X.y() ) < 0.9f ? QVector3D( 0, 1, 0 ) : QVector3D( 0, 0, 1 );
  const QVector3D Z = QVector3D::crossProduct( X, Aside ).normalized(), Y = QVector3D::crossProduct( Z, X );
  VBonePose Pose;
  for ( int Row = 0; Row < 3; ++Row )
  {
    const auto Place = static_cast< std::size_t >( 4 * Row );
    Pose[Place] = X[Row];
    Pose[Place + 1] = Y[Row];
    Pose[Place + 2] = Z[Row];
    Pose[Place + 3] = i_rFrom[Row];
  }
  return Pose;
}

/// The joints of a standing person, mm, z up, and of which joint each is the child.
struct VTestJoint
{
  QVector3D Place;
  int Parent;
};
inline const std::vector< VTestJoint >& PersonJoints()
{
  static const std::vector< VTestJoint > Joints = {
      { { 0, 0, 980 }, -1 },     { { 10, 0, 1130 }, 0 },   { { 0, 0, 1300 }, 1 },     { { -10, 0, 1460 }, 2 },
      { { 10, 0, 1740 }, 3 },    { { 0, 190, 1430 }, 3 },  { { 0, 230, 1140 }, 5 },   { { 60, 240, 890 }, 6 },
      { { 80, 240, 800 }, 7 },   { { 0, -190, 1430 }, 3 }, { { 0, -230, 1140 }, 9 },  { { 60, -240, 890 }, 10 },
      { { 80, -240, 800 }, 11 }, { { 0, 100, 930 }, 0 },   { { 20, 120, 500 }, 13 },  { { -20, 130, 90 }, 14 },
      { { 140, 140, 30 }, 15 },  { { 0, -100, 930 }, 0 },  { { 20, -120, 500 }, 17 }, { { -20, -130, 90 }, 18 },
      { { 140, -140, 30 }, 19 } };
  return Joints;
}

/// Adds a person of 20 bones, 40 markers, 59 sticks, 40 targets and 40 wires; each of its lists ends in the group's.
inline void AddPerson( VSubjectGroup& io_rGroup, const QVector3D& i_rAt, std::uint32_t i_Colour,
                       std::uint32_t i_StickColour = 0xFFE0E0E0 )
{
  VSubjectRecord Record;
  Record.Item = { ZEK::ESelectSubject, "person", io_rGroup.Records.size() + 1, 0 };
  Record.Colour = i_Colour;
  const auto Next = []( const auto& i_rList )
  {
    return static_cast< std::uint32_t >( i_rList.size() );
  };
  Record.Markers.First = Next( io_rGroup.Markers );
  Record.Sticks.First = Next( io_rGroup.Sticks );
  Record.Bones.First = Next( io_rGroup.Bones );
  Record.Targets.First = Next( io_rGroup.Targets );
  Record.Wires.First = Next( io_rGroup.Wires );
  Record.Root = { 1, 0, 0, i_rAt.x(), 0, 1, 0, i_rAt.y(), 0, 0, 1, i_rAt.z() };
  const auto& rJoints = PersonJoints();
  for ( std::size_t Index = 1; Index < rJoints.size(); ++Index )
  {
    const QVector3D From = rJoints[static_cast< std::size_t >( rJoints[Index].Parent )].Place + i_rAt;
    const QVector3D To = rJoints[Index].Place + i_rAt;
    const VBonePose Pose = PoseAlong( From, To );
    const std::uint32_t Bone = Next( io_rGroup.Bones ), Marker = Next( io_rGroup.Markers );
    const float Length = ( To - From ).length();
    io_rGroup.Bones.push_back( { rJoints[Index].Parent - 1, i_Colour, Length } );
    io_rGroup.Poses.push_back( Pose );
    for ( const float Side : { -1.0f, 1.0f } )
    {
      const std::array< float, 3 > Local{ Length * ( 0.55f + 0.3f * Side ), 12 * Side, 55 };
      const auto Row = [&]( std::size_t i_Row )
      {
        return Pose[4 * i_Row] * Local[0] + Pose[4 * i_Row + 1] * Local[1] + Pose[4 * i_Row + 2] * Local[2] +
               Pose[4 * i_Row + 3];
      };
      const VScenePoint Place{ Row( 0 ), Row( 1 ), Row( 2 ), 9 };
      io_rGroup.Targets.push_back( { Bone, Next( io_rGroup.Markers ), Local, { 150, 60, 0, 60, 400, 20, 0, 20, 90 } } );
      io_rGroup.Wires.push_back( { Bone, Next( io_rGroup.Markers ) } );
      io_rGroup.Solved.push_back( Place );
      io_rGroup.Markers.push_back( { Place.X + 4, Place.Y - 3, Place.Z + 2, 9 } );
      io_rGroup.MarkerColours.push_back( i_Colour );
    }
    io_rGroup.Sticks.push_back( { Marker, Marker + 1, i_StickColour, i_StickColour } );
    if ( Index > 1 )
    {
      const int Parent = std::max( rJoints[Index].Parent - 1, 0 );
      const std::uint32_t Above = Record.Markers.First + 2 * static_cast< std::uint32_t >( Parent );
      io_rGroup.Sticks.push_back( { Above + 1, Marker, i_StickColour, i_StickColour } );
      io_rGroup.Sticks.push_back( { Above, Marker + 1, i_StickColour, i_Colour } );
    }
  }
  Record.Markers.Count = Next( io_rGroup.Markers ) - Record.Markers.First;
  Record.Sticks.Count = Next( io_rGroup.Sticks ) - Record.Sticks.First;
  Record.Bones.Count = Next( io_rGroup.Bones ) - Record.Bones.First;
  Record.Targets.Count = Next( io_rGroup.Targets ) - Record.Targets.First;
  Record.Wires.Count = Next( io_rGroup.Wires ) - Record.Wires.First;
  io_rGroup.Records.push_back( std::move( Record ) );
}

/// A scene of subjects.
class VSubjectScene : public VTestScene
{
public:
  using VGroups = std::array< VSubjectGroup, VRenderSubjectDynamics::GroupCount >;

  VSubjectScene()
  {
    BeforePoints = [this]
    {
      TakeIds();
    };
  }
  void Initialise( CoreGraphics::VRenderContext& io_rContext ) override
  {
    const bool bFirst = m_RenderList.empty();
    VTestScene::Initialise( io_rContext );
    if ( bFirst && !m_RenderList.empty() )
    {
      pMarkers = std::make_shared< VRenderSubjectMarkers >( *this );
      pDynamics = std::make_shared< VRenderSubjectDynamics >( *this );
      const auto At = [&]( std::size_t i_Group )
      {
        return &Groups[i_Group];
      };
      pMarkers->SetGroups( { At( 0 ), At( 1 ), At( 2 ), At( 3 ) } );
      pDynamics->SetGroups( { At( 0 ), At( 1 ), At( 2 ), At( 3 ), At( 4 ), At( 5 ) } );
      m_RenderList.insert( m_RenderList.begin() + 1, { pMarkers, pDynamics } );
    }
  }
  /// Of a group, by either of the two.
  std::uint32_t Count( std::size_t i_Group, ESubjectKind i_Kind ) const
  {
    if ( i_Kind == ESubjectMarkers || i_Kind == ESubjectSticks || i_Kind == ESubjectTargets )
    {
      return i_Group < VRenderSubjectMarkers::GroupCount
                 ? pMarkers->Counts( VRenderSubjectMarkers::EGroup( i_Group ) ).At( i_Kind )
                 : 0;
    }
    return pDynamics->Counts( VRenderSubjectDynamics::EGroup( i_Group ) ).At( i_Kind );
  }
  /// All generations of a group moved.
  static void Touch( VSubjectGroup& io_rGroup )
  {
    ++io_rGroup.StructureGeneration;
    ++io_rGroup.MarkerGeneration;
    ++io_rGroup.PoseGeneration;
    ++io_rGroup.RecordGeneration;
    for ( VSubjectIds* pIds : { &io_rGroup.MarkerIds, &io_rGroup.StickIds, &io_rGroup.BoneIds } )
    {
      ++pIds->Generation;
    }
  }

  VGroups Groups;
  std::shared_ptr< VRenderSubjectMarkers > pMarkers;
  std::shared_ptr< VRenderSubjectDynamics > pDynamics;

private:
  void TakeIds()
  {
    std::uint64_t Object = 0;
    const auto Take = [&]( VSubjectIds& io_rIds, std::size_t i_Count )
    {
      io_rIds.First = Registry().Allocate( { ZEK::ESelectReconstruction, "all", ++Object, 0 },
                                           static_cast< std::uint32_t >( i_Count ) );
    };
    for ( VSubjectGroup& rGroup : Groups )
    {
      Take( rGroup.MarkerIds, rGroup.Markers.size() );
      Take( rGroup.StickIds, rGroup.Sticks.size() );
      Take( rGroup.BoneIds, rGroup.Bones.size() );
      for ( VSubjectRecord& rRecord : rGroup.Records )
      {
        rRecord.Id = Registry().Allocate( rRecord.Item );
      }
    }
  }
};

/// Options that show nothing of any subject but what is turned on then.
inline void HideSubjects( VSceneOptions& io_rOptions )
{
  VDisplayRecord Nothing;
  Nothing.Bones = Nothing.Markers = Nothing.Sticks = Nothing.MissingMarkers = Nothing.Origins = Nothing.Clusters =
      Nothing.Skin = false;
  io_rOptions.PropSubject = io_rOptions.LabellingSubject = io_rOptions.SolvingSubject = io_rOptions.RetargetingSubject =
      io_rOptions.SceneMesh = Nothing;
}

inline constexpr std::size_t Subjects = VRenderSubjectDynamics::ESubjects, Solved = VRenderSubjectDynamics::ESolved;

inline void Lose( VSubjectGroup& io_rGroup, std::size_t i_Marker )
{
  io_rGroup.Markers[i_Marker] = { VSubjectGroup::None, 0, 0, 0 };
  ++io_rGroup.MarkerGeneration;
}

class VSubjectTest : public VSceneTest< VSubjectScene >
{
protected:
  VSubjectTest()
  {
    HideSubjects( Options() );
    Options().FloorGrid = Options().GlobalAxis = false;
  }
  VSubjectGroup& Group( std::size_t i_Index = Subjects ) { return pScene->Groups[i_Index]; }
  VDisplayRecord& Labelling() { return Options().LabellingSubject; }
  /// Where all of a group lies on the screen, and a little more.
  QRect Around( std::size_t i_Group )
  {
    QRectF Rect;
    for ( const VScenePoint& rPoint : Group( i_Group ).Solved )
    {
      Rect |= QRectF( ScreenPoint( rPoint ), QSizeF( 1, 1 ) );
    }
    // From the root and the joints to the markers.
    return Rect.toAlignedRect().adjusted( -8, -8, 8, 8 );
  }
  std::vector< std::uint32_t > Counts( std::size_t i_Group ) const
  {
    std::vector< std::uint32_t > All;
    for ( std::uint32_t Kind = 0; Kind < ESubjectKindCount; ++Kind )
    {
      All.push_back( pScene->Count( i_Group, ESubjectKind( Kind ) ) );
    }
    return All;
  }
  /// Three bones, sticks and markers so far apart that none hides another.
  void SpreadOut()
  {
    VSubjectGroup& rGroup = Group();
    VSubjectRecord Record;
    Record.Item = { ZEK::ESelectSubject, "spread", 1, 0 };
    Record.Markers = { 0, 6 };
    Record.Sticks = Record.Bones = { 0, 3 };
    for ( int Index = 0; Index < 3; ++Index )
    {
      const float Along = -1500.0f + 1300.0f * static_cast< float >( Index );
      rGroup.Markers.push_back( { Along, -600, 200, 30 } );
      rGroup.Markers.push_back( { Along + 300, -1500, 700, 30 } );
      rGroup.Bones.push_back( { -1, 0xFF40C0FF, 900 } );
      rGroup.Poses.push_back( PoseAlong( { Along, 300, 100 }, { Along + 200, 1000, 500 } ) );
      const auto First = static_cast< std::uint32_t >( 2 * Index );
      rGroup.Sticks.push_back( { First, First + 1 } );
    }
    rGroup.Solved = rGroup.Markers;
    rGroup.Records.push_back( Record );
    pScene->Touch( rGroup );
    pScene->MarkDirty();
    Labelling().Markers = Labelling().Sticks = Labelling().Bones = true;
    Draw();
  }
  /// Points of an object on the screen, from one end to the other.
  std::vector< QPointF > Along( std::uint32_t i_Id )
  {
    const VSubjectGroup& rGroup = Group();
    QVector3D A, B;
    const auto Place = []( const VScenePoint& i_rPoint )
    {
      return QVector3D( i_rPoint.X, i_rPoint.Y, i_rPoint.Z );
    };
    if ( i_Id < rGroup.StickIds.First )
    {
      A = B = Place( rGroup.Markers[i_Id - rGroup.MarkerIds.First] );
    }
    else if ( i_Id < rGroup.BoneIds.First )
    {
      const VSubjectStick& rStick = rGroup.Sticks[i_Id - rGroup.StickIds.First];
      A = Place( rGroup.Markers[rStick.A] );
      B = Place( rGroup.Markers[rStick.B] );
    }
    else
    {
      const VBonePose& rPose = rGroup.Poses[i_Id - rGroup.BoneIds.First];
      A = { rPose[3], rPose[7], rPose[11] };
      B = A + 900 * QVector3D( rPose[0], rPose[4], rPose[8] );
    }
    std::vector< QPointF > Points;
    for ( int Step = 0; Step <= 100; ++Step )
    {
      const QVector3D At = A + ( B - A ) * ( static_cast< float >( Step ) / 100 );
      Points.push_back( ScreenPoint( { At.x(), At.y(), At.z(), 0 } ) );
    }
    return Points;
  }
  /// As each of the three blocks of ids stands.
  std::uint32_t End() { return Group().BoneIds.First + 3; }
};

} // namespace MoxelGraphics

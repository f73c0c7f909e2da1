#include "Program.h"

#include <TestSupport/Paths.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>
#include <HostSources/VSimulatedCapture.h>

#include <QtCore/QJsonArray>
#include <QtCore/QJsonDocument>

#include <gmock/gmock.h>

#include <set>

using namespace ProgramTest;

namespace
{
struct VMarkerAt
{
  std::string Label;
  double x = 0, y = 0, z = 0;
};

QString LabelOf( const QJsonValue& i_rAction )
{
  const QJsonArray Selection = i_rAction.toObject()["selection"].toArray();
  return Selection.size() == 1 ? Selection[0].toObject()["label"].toString() : QString();
}

/// Clicks on the place of a marker, as another run of the program reports its camera, and tells what was picked.
QString Pick( QStringList i_Arguments, const VMarkerAt& i_rMarker )
{
  i_Arguments << "--size"
              << "1280x720";
  const QJsonObject Plain = Render( i_Arguments );
  const QPointF Place = Project( Plain, i_rMarker.x, i_rMarker.y, i_rMarker.z );
  EXPECT_TRUE( QRectF( 0, 0, 1280, 720 ).contains( Place ) ) << Text( Place ).toStdString();
  const QJsonObject Clicked = Render( i_Arguments + QStringList{ "--click", Text( Place ) } );
  const QJsonArray Actions = Clicked["actions"].toArray();
  EXPECT_EQ( Actions.size(), 1 );
  return LabelOf( Actions[0] );
}

/// The first labelled point of a frame of the simulated capture.
VMarkerAt SimulatedMarker( double i_Seconds )
{
  HostSources::VSimulatedCapture Capture;
  ZEK::VFlowStateRef State;
  const auto Index = static_cast< std::int64_t >( i_Seconds * Capture.RateHz() + 0.5 );
  const ZEK::IResult Made =
      Capture.MakeState( Index, { HostFlow::MakeStateFactory(), HostFlow::MakeItemStore(), 1 }, State );
  EXPECT_TRUE( Made.IsOk() );
  const auto Find = [&]( std::uint32_t i_Tag )
  {
    ZEK::VFlowItemRef Item;
    State->FindItem( Item, i_Tag, ZEK::EFlowTimeMatch::Overlap );
    return Item;
  };
  const ZEK::VFlowItemRef Points = Find( 0x100d );
  const ZEK::VFlowItemRef Labels = Find( 0x100f );
  const ZEK::VFlowItemRef Subject = Find( 0x1012 );
  const auto* pPoints = ZEK::FlowPayload< CoreMoxelTypes::VReconstructionSet >( Points.Get() );
  const auto* pLabels = ZEK::FlowPayload< CoreMoxelTypes::VReconstructionLabelSet >( Labels.Get() );
  const auto* pSubject = ZEK::FlowPayload< CoreMoxelTypes::VSubject >( Subject.Get() );
  EXPECT_TRUE( pPoints && pLabels && pSubject );
  // The highest marker of the subject is hidden by nothing when seen from above.
  VMarkerAt Best{ {}, 0, 0, -1e9 };
  for ( const auto& rLabel : pLabels->Labels )
  {
    const auto& rPosition = pPoints->Items[rLabel.Reconstruction].Position;
    if ( rLabel.SubjectId == pSubject->Id && rPosition.z > Best.z )
    {
      std::string_view Name;
      EXPECT_TRUE( Subject->Value().GetName( ZEK::EFlowNameObject, Name ) );
      Best = { std::string( Name ) + ":" + pSubject->Markers[rLabel.MarkerId].Name, rPosition.x, rPosition.y,
               rPosition.z };
    }
  }
  return Best;
}
} // namespace

TEST( Pick, ClickOnAMarkerOfAFileReportsItsLabel )
{
  HARROW_NEEDS_MODULE();
  HARROW_NEEDS_RECORDINGS();
  const QStringList AtTime{ "--time", "2.43" }, YUp{ "--up", "y" };
  const std::tuple< const char*, QStringList, VMarkerAt > Cases[] = {
      { "c3d-trc/Gait.c3d", AtTime, { "Gait:RSHO", 640.4994, 155.2884, 1381.1512 } },
      { "c3d-trc/Gait.c3d", AtTime, { "Gait:ROFF", 775.4001, 117.7126, 1296.1035 } },
      { "c3d-trc/Gait.trc", AtTime, { "Gait:R.Shoulder", 640.56439, 155.33781, 1381.36707 } },
      // In metres, with y up.
      { "multicam-person/static/markers21.trc", YUp, { "markers21:RHip", -80.589, 869.695, 76.164 } } };
  for ( const auto& [pFile, rMore, rMarker] : Cases )
  {
    EXPECT_EQ( Pick( QStringList{ "--source", Recording( pFile ) } + rMore, rMarker ).toStdString(), rMarker.Label );
  }
}

TEST( Pick, ClickOnASimulatedMarkerReportsItsLabelAtAnyRatio )
{
  HARROW_NEEDS_MODULE();
  const VMarkerAt Marker = SimulatedMarker( 1.0 );
  for ( const char* pRatio : { "1", "1.5", "2" } )
  {
    EXPECT_EQ( Pick( { "--time", "1.0", "--ratio", pRatio }, Marker ).toStdString(), Marker.Label ) << pRatio;
  }
}

TEST( Pick, ActionsWorkInTheirOrderAndModifiersEditTheSelection )
{
  HARROW_NEEDS_MODULE();
  const VMarkerAt Marker = SimulatedMarker( 1.0 );
  const QStringList View{ "--time", "1.0", "--size", "640x360" };
  const QString Place = Text( Project( Render( View ), Marker.x, Marker.y, Marker.z ) );
  const QJsonObject Report = Render( View + QStringList{ "--hover", Place, "--click", Place, "--band", "0,0,639,359",
                                                         "--modifiers", "shift,ctrl", "--click", Place, "--modifiers",
                                                         "none", "--hover", "2,2", "--click", "2,2" } );
  const QJsonArray Actions = Report["actions"].toArray();
  ASSERT_EQ( Actions.size(), 6 );
  const auto Selected = [&]( int i_Index )
  {
    return Actions[i_Index].toObject()["selection"].toArray().size();
  };
  const QJsonObject Hover = Actions[0].toObject();
  EXPECT_EQ( Hover["toolTip"].toString().toStdString(), Marker.Label );
  ASSERT_EQ( Hover["preselection"].toArray().size(), 1 );
  EXPECT_EQ( Hover["preselection"].toArray()[0].toObject()["label"].toString().toStdString(), Marker.Label );
  EXPECT_EQ( Selected( 0 ), 0 );
  EXPECT_EQ( LabelOf( Actions[1] ).toStdString(), Marker.Label );
  const auto Band = Selected( 2 );
  EXPECT_GT( Band, 30 ) << "two performers wear more markers than that";
  EXPECT_EQ( Selected( 3 ), Band - 1 ) << "Shift with Control removes";
  EXPECT_EQ( Selected( 5 ), 0 ) << "a click on nothing clears";
  EXPECT_EQ( Report["selection"].toArray().size(), 0 );
}

TEST( Pick, ABandAroundALegReportsItsMarkersAndThoseBehindThem )
{
  HARROW_NEEDS_MODULE();
  HARROW_NEEDS_RECORDINGS();
  // Seen from the right, the knee's marker hides the one inside of the knee, and the toe's the one inside of the foot.
  const QStringList View{ "--source", Recording( "c3d-trc/Gait.c3d" ), "--time", "2.43", "--size", "1280x720", "--view",
                          "Front" };
  const double Scale = Render( View )["camera"].toObject()["orthoScale"].toDouble();
  ASSERT_GT( Scale, 0 );
  const auto Place = [&]( double i_X, double i_Z )
  {
    return Text( { 640 - i_X / Scale, 360 - i_Z / Scale } );
  };
  const QString Corners = Place( 540, 660 ) + "," + Place( 900, 12 );
  const QJsonObject Report = Render( View + QStringList{ "--band", Corners } );
  std::set< std::string > Labels;
  for ( const QJsonValue& rItem : Report["selection"].toArray() )
  {
    Labels.insert( rItem.toObject()["label"].toString().toStdString() );
  }
  EXPECT_THAT( Labels, testing::UnorderedElementsAre(
                           "Gait:RTHI", "Gait:R.Knee", "Gait:RSHA", "Gait:R.Ankle", "Gait:RHEE", "Gait:RTOE",
                           "Gait:R.Knee.Medial", "Gait:R.Ankle.Medial", "Gait:R.Foot.Medial", "Gait:R.Foot.Lateral" ) );
}

TEST( Report, SaysWhichFrameItShowsAndWhatItDrewWith )
{
  HARROW_NEEDS_MODULE();
  HARROW_NEEDS_RECORDINGS();
  const QJsonObject Report = Render( { "--source", Recording( "c3d-gpl/Qualisys.c3d" ), "--time", "0.0124", "--size",
                                       "640x360", "--set", "YUp=true", "--view", "Top", "--key", "Home" } );
  // The file begins with frame 705 at 200 Hz; the nearest frame to 12.4 ms is the third.
  const QJsonObject Frame = Report["frame"].toObject();
  EXPECT_EQ( Frame["index"].toInt( -1 ), 2 );
  EXPECT_EQ( Frame["number"].toInt( -1 ), 707 );
  EXPECT_DOUBLE_EQ( Frame["time"].toDouble(), 0.01 );
  EXPECT_EQ( Report["camera"].toObject()["viewType"].toString(), "Top" );
  EXPECT_EQ( Report["options"].toObject()["YUp"].toBool(), true );
  EXPECT_FALSE( Report["upAxis"].toObject()["reason"].toString().isEmpty() );
  EXPECT_GT( Report["draw_calls"].toInt(), 0 );
  EXPECT_GT( Report["frames"].toInt(), 3 );
  for ( const char* pTiming : { "update_ms", "select_ms", "highlight_ms", "draw_ms" } )
  {
    EXPECT_TRUE( Report["timings"].toObject()[pTiming].isDouble() ) << pTiming;
  }
  EXPECT_FALSE( Report["gl"].toObject().isEmpty() );
  EXPECT_EQ( Report["notice"].toString(), "" );
  EXPECT_EQ( QJsonDocument( Report["log"].toArray() ).toJson( QJsonDocument::Compact ).toStdString(), "[]" );
}

TEST( Report, DragsAndTheWheelMoveTheCamera )
{
  HARROW_NEEDS_MODULE();
  const QStringList View{ "--size", "320x200" };
  const auto Camera = [&]( const QStringList& i_rDone )
  {
    return Render( View + i_rDone )["camera"].toObject();
  };
  // A fifth of a degree a pixel; one turn of the wheel comes nearer by a tenth; a zoom goes 15 mm a pixel.
  EXPECT_NEAR( Camera( { "--drag", "100,100,150,100" } )["azimuth"].toDouble(), 55, 1e-3 );
  EXPECT_NEAR( Camera( { "--wheel", "100,100,120" } )["distance"].toDouble(), 6300, 1e-2 );
  EXPECT_NEAR( Camera( { "--drag", "100,100,100,150,right" } )["distance"].toDouble(), 7750, 1e-2 );
  const QJsonObject Home = Camera( { "--drag", "100,100,150,120", "--wheel", "9,9,-120", "--key", "Home" } );
  EXPECT_NEAR( Home["azimuth"].toDouble(), 45, 1e-6 );
  EXPECT_NEAR( Home["distance"].toDouble(), 7000, 1e-6 );
}

TEST( Report, ACutOffRecordingIsNotedAndAFrameOffTheEndIsTheLastOne )
{
  HARROW_NEEDS_MODULE();
  HARROW_NEEDS_RECORDINGS();
  const QJsonObject Report =
      Render( { "--source", Recording( "c3d-gpl/Optotrak.c3d" ), "--size", "320x200", "--time", "1000" } );
  EXPECT_EQ( Report["frame"].toObject()["count"].toInt(), 29 );
  EXPECT_EQ( Report["frame"].toObject()["index"].toInt(), 28 );
  EXPECT_TRUE( Report["notes"].toArray().at( 0 ).toString().contains( "Optotrak.c3d" ) );
}

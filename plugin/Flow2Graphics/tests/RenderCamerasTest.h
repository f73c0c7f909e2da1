#pragma once

#include "CameraTest.h"

#include <Flow2Graphics/VFlowRenderCameras.h>

#include <QtGui/QQuaternion>

#include <numbers>

namespace FlowTest
{

/// A camera at a place that looks at another, its image upright.
inline VCameraCalibration LookingAt( const QVector3D& i_rEye, const QVector3D& i_rAt )
{
  const QVector3D Z = ( i_rAt - i_rEye ).normalized();
  const QVector3D X = QVector3D::crossProduct( Z, { 0, 0, 1 } ).normalized();
  QVector3D Axis;
  float Degrees = 0;
  QQuaternion::fromAxes( X, QVector3D::crossProduct( Z, X ), Z ).getAxisAndAngle( &Axis, &Degrees );
  const QVector3D Turn = -Degrees * std::numbers::pi_v< float > / 180 * Axis;
  VCameraCalibration Value = Calibration();
  Value.RadialParameters.clear();
  Value.Rotation = { double( Turn.x() ), double( Turn.y() ), double( Turn.z() ) };
  Value.Position = { double( i_rEye.x() ), double( i_rEye.y() ), double( i_rEye.z() ) };
  return Value;
}

/// Cameras in a ring about the origin, looking at its middle; each with a view of its own.
class VRenderCamerasFixture : public testing::Test
{
protected:
  static constexpr QSize ViewSize{ 640, 360 };

  VRenderCamerasFixture() { Options().GlobalAxis = false; }

  MoxelGraphics::VSceneOptions& Options() { return View.Frame().Input().Options; }
  const MoxelGraphics::VFrameFigures& Figures() { return View.Frame().Figures(); }
  QImage Draw() { return View.Draw(); }
  static std::string Name( std::size_t i_Index ) { return "vi:" + std::to_string( 1001 + i_Index ); }
  static ZEK::VSelectionItem Device( std::size_t i_Index ) { return { ZEK::ESelectDevice, Name( i_Index ), 0, 0 }; }
  static QVector3D Eye( std::size_t i_Index, std::size_t i_Count, float i_Radius = 2500 )
  {
    const float Angle =
        2 * std::numbers::pi_v< float > * ( static_cast< float >( i_Index ) + 0.3F ) / static_cast< float >( i_Count );
    return { i_Radius * std::cos( Angle ), i_Radius * std::sin( Angle ), 1400 };
  }

  void AddRing( std::size_t i_Count )
  {
    for ( std::size_t Index = 0; Index < i_Count; ++Index )
    {
      VCameraSettings Settings;
      Settings.Values = { { "Name", "Camera " + std::to_string( Index + 1 ) },
                          { "UserId", static_cast< std::int64_t >( Index + 1 ) } };
      Items.push_back( Maker.Device< FlowCameraHardware >( Hardware(), Name( Index ) ) );
      Items.push_back( Maker.Device< FlowCameraSettings >( Settings, Name( Index ) ) );
      Items.push_back(
          Maker.Device< FlowCameraCalibration >( LookingAt( Eye( Index, i_Count ), { 0, 0, 800 } ), Name( Index ) ) );
    }
  }
  /// The state goes on with the same items.
  void Show()
  {
    pScene->State = Maker.State( ++Frame, Items );
    pScene->MarkDirty();
  }
  std::vector< std::uint32_t > Pick( QPoint i_Point, int i_Mode = MoxelGraphics::EPickHover )
  {
    View.Frame().Input().PickMode = i_Mode;
    View.Frame().Input().Pointer = i_Point;
    Draw();
    View.Frame().Input().PickMode = MoxelGraphics::EPickNone;
    return View.Frame().Result().Ids;
  }
  ZEK::VSelection Band( QPoint i_Start, QPoint i_End )
  {
    View.Frame().Input().BandStart = i_Start;
    Pick( i_End, MoxelGraphics::EPickBandDone );
    ZEK::VSelection Found = View.Frame().Result().Selection;
    std::sort( Found.begin(), Found.end() );
    return Found;
  }

  FlowTest::VMaker Maker;
  std::shared_ptr< FlowTest::VScene > pScene = std::make_shared< FlowTest::VScene >();
  FlowTest::VFrame View{ pScene, ViewSize };
  std::vector< VFlowItemRef > Items;
  std::int64_t Frame = 0;
};

} // namespace FlowTest

#include "ItemFixture.h"

#include <MoxelGraphics/IManipulator.h>
#include <MoxelGraphics/VOverlayObjects.h>

#include <gmock/gmock.h>

namespace MoxelGraphics
{
namespace
{
/// Handles that write down what they are asked.
class VTestHandles final : public IManipulator
{
public:
  VTestHandles( std::string i_Name, const VTestScene& i_rScene, std::vector< std::string >& io_rSeen )
    : m_Name( std::move( i_Name ) )
    , m_rScene( i_rScene )
    , m_rSeen( io_rSeen )
  {
  }
  bool IsShown() const override { return bShown; }
  bool IsGrabbed() const override { return bGrabbed; }
  bool TakesPress( const QMouseEvent&, const CoreGraphics::VCameraController& i_rCamera, double i_Ratio ) override
  {
    EXPECT_NE( i_rCamera.Fields().view, QMatrix4x4() ) << "the camera is one that has drawn";
    EXPECT_GE( i_Ratio, 1.0 );
    m_rSeen.push_back( m_Name + " asked" );
    return bTakes;
  }
  void Press( const QMouseEvent&, const CoreGraphics::VCameraController&, double ) override
  {
    bGrabbed = true;
    AtPress = m_rScene.GetSelection();
    m_rSeen.push_back( m_Name + " pressed" );
  }
  bool Move( const QMouseEvent&, const CoreGraphics::VCameraController&, double ) override { return bGrabbed; }
  bool Release( const QMouseEvent&, const CoreGraphics::VCameraController&, double ) override
  {
    return std::exchange( bGrabbed, false );
  }
  void LetGo() override { bGrabbed = false; }

  bool bShown = true;
  bool bTakes = false;
  bool bGrabbed = false;
  ZEK::VSelection AtPress;

private:
  std::string m_Name;
  const VTestScene& m_rScene;
  std::vector< std::string >& m_rSeen;
};

class VHandlesScene final : public VTestScene, public IManipulatorSource
{
public:
  VManipulators Manipulators() const override { return { pObject, pVolume, pHotspot }; }
  bool GetSelectionPose( const ZEK::VSelection& i_rSelection, VScenePose& o_rPose ) override
  {
    o_rPose = Pose;
    return i_rSelection.size() == 1;
  }
  QString GetSelectedCameraURN() override
  {
    const ZEK::VSelection Selection = GetSelection();
    return Selection.size() == 1 ? QString( "vi:%1" ).arg( Selection[0].Sub ) : QString();
  }

  std::vector< std::string > Seen;
  VScenePose Pose;
  std::shared_ptr< VTestHandles > pObject = std::make_shared< VTestHandles >( "object", *this, Seen );
  std::shared_ptr< VTestHandles > pVolume = std::make_shared< VTestHandles >( "volume", *this, Seen );
  std::shared_ptr< VTestHandles > pHotspot = std::make_shared< VTestHandles >( "hotspot", *this, Seen );
};

class VItemHooks : public VItemTest
{
protected:
  VItemHooks()
    : VItemTest( std::make_shared< VHandlesScene >() )
  {
  }
  VHandlesScene& Scene() { return static_cast< VHandlesScene& >( *pScene ); }
};
} // namespace

TEST_F( VItemHooks, ManipulatorsAreAskedInOrderAndTakeTheMouseBeforeTheCamera )
{
  const ZEK::VSelectionItem Handle{ ZEK::ESelectObjectManipulator, {}, 0, 2 };
  const ZEK::VSelectionItem Former{ ZEK::ESelectObjectManipulator, {}, 0, 9 };
  const ZEK::VSelectionItem Corner{ ZEK::ESelectVolumeManipulator, {}, 0, 5 };
  pScene->Select( { Recon( 1 ), Former } );
  pScene->Preselect( { Handle, Corner, Recon( 0 ) } );
  const float Azimuth = Camera().azimuth;
  const auto Drag = [&]( Qt::KeyboardModifiers i_Modifiers )
  {
    Scene().Seen.clear();
    pWidget->Press( Place( 0 ), i_Modifiers );
    pWidget->Drag( Place( 0 ) + QPointF( 40, 0 ), i_Modifiers );
    pWidget->Release( Place( 0 ) + QPointF( 40, 0 ), i_Modifiers );
    return Scene().Seen;
  };
  Scene().pHotspot->bTakes = true;
  Scene().pVolume->bShown = false;
  using testing::ElementsAre;
  EXPECT_THAT( Drag( Qt::NoModifier ), ElementsAre( "object asked", "hotspot asked", "hotspot pressed" ) );
  EXPECT_THAT( Scene().pHotspot->AtPress, ElementsAre( Recon( 1 ), Former, Corner ) );
  Scene().pObject->bTakes = true;
  EXPECT_THAT( Drag( Qt::AltModifier ), ElementsAre( "object asked", "object pressed" ) );
  EXPECT_THAT( Scene().pObject->AtPress, ElementsAre( Recon( 1 ), Corner, Handle ) );
  EXPECT_FALSE( pItem->IsPickPending() ) << "no click, and no band either";
  EXPECT_EQ( Camera().azimuth, Azimuth );

  Scene().pObject->bGrabbed = true;
  pWidget->Hover( Empty );
  pWidget->Hover( Place( 1 ) );
  Settle();
  EXPECT_EQ( pItem->ToolTipText(), "" ) << "hovering selects nothing while handles are held";
  pWidget->Press( Place( 0 ) );
  pItem->ungrabMouse();
  EXPECT_FALSE( Scene().pObject->bGrabbed );
  pWidget->Release( Place( 0 ) );
  Scene().pObject->bTakes = Scene().pHotspot->bTakes = false;
  EXPECT_THAT( Drag( Qt::NoModifier ), ElementsAre( "object asked", "hotspot asked" ) );
  EXPECT_NE( Camera().azimuth, Azimuth ) << "what nobody takes moves the camera";
}

TEST_F( VItemHooks, AMouseThatIsTakenAwayEndsItsGesture )
{
  pWidget->Press( { 100, 100 } );
  pWidget->Drag( { 150, 100 } );
  const float Azimuth = Camera().azimuth;
  EXPECT_TRUE( Camera().orbiting );
  pItem->ungrabMouse();
  EXPECT_FALSE( Camera().orbiting );
  pWidget->Release( { 150, 100 } );
  pWidget->Press( { 400, 100 } );
  pWidget->Drag( { 410, 100 } );
  EXPECT_NEAR( Camera().azimuth, Azimuth + 10 * 0.2 * pWidget->devicePixelRatioF(), 0.01 );
}

TEST_F( VItemHooks, TrackingTakesWhatIsSelectedWhenItBegins )
{
  const auto pAnnounced = Counted( pItem, &VSceneFramebufferObject::TrackSelectionChanged );
  const auto Centre = [&]
  {
    Frames( 3 );
    return Camera().centre;
  };
  pScene->Select( { Recon( 1 ) } );
  pItem->SetTracking( ETrackCurrent );
  EXPECT_EQ( *pAnnounced, 1 );
  EXPECT_EQ( Centre(), QVector3D( 1500, 300, 900 ) );
  EXPECT_NEAR( Camera().distance, 7000, 1 ) << "tracking does not fit";
  pScene->Select( { Recon( 2 ) } );
  pScene->Change( { { 0, 0, 0, 7 }, { 700, 800, 900, 7 }, { -900, -1600, 200, 7 } } );
  EXPECT_EQ( Centre(), QVector3D( 700, 800, 900 ) ) << "it follows what was selected, where that goes";
  pItem->SetTracking( ETrackSelection );
  EXPECT_EQ( Centre(), QVector3D( -900, -1600, 200 ) );
  pScene->Select( { Recon( 0 ) } );
  EXPECT_EQ( Centre(), QVector3D( 0, 0, 0 ) );
  EXPECT_EQ( *pAnnounced, 1 );
  Scene().Pose.Matrix = { 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 10, 20, 30, 1 };
  pItem->SetTracking( ELockCurrent );
  EXPECT_EQ( *pAnnounced, 2 );
  Frames( 2 );
  EXPECT_EQ( Camera().tilt, -90 );
  EXPECT_EQ( Camera().distance, 1000 );
  EXPECT_EQ( Camera().lockPose.column( 3 ), QVector4D( 10, 20, 30, 1 ) );
  pItem->SetTracking( ETrackNone );
  Frames( 2 );
  EXPECT_EQ( Camera().tilt, -60 );
  EXPECT_TRUE( Camera().lockPose.isIdentity() );
  EXPECT_EQ( *pAnnounced, 2 );
}

TEST_F( VItemHooks, CamerasAndNamesStandWhereTheFrameShowsThem )
{
  const auto pMemberships = Counted( pItem, &VSceneFramebufferObject::CamerasChanged );
  // The eye of the first pose stands near (-4287, -4287, 3500).
  std::vector< VCameraDefinition > Cameras( 4 );
  const std::tuple< const char*, std::int32_t, std::array< float, 3 > > Given[] = {
      { "vi:2", 2, { 1500, 300, 900 } }, { "vi:1", -1, {} }, { "vi:7", 7, {} }, { "vi:9", 9, { -9000, -9000, 7000 } } };
  for ( std::size_t Index = 0; Index < 4; ++Index )
  {
    std::tie( Cameras[Index].DeviceURN, Cameras[Index].UserId, Cameras[Index].Position ) = Given[Index];
    Cameras[Index].bCalibrated = Index != 2;
  }
  pScene->SetCameraDefinitions( Cameras );
  pScene->AddLabel( 1, { ZEK::ESelectSubject, "Ada", 1, 0 }, { 1500, 300, 800 }, 700, false, true, "Ada" );
  pScene->AddLabel( 2, { ZEK::ESelectRigidObject, "Wand", 2, 0 }, { -9000, -9000, 7000 }, 0, true, false, "Wand" );
  Frames( 3 );
  ASSERT_EQ( pItem->CameraObjects().size(), 2 );
  EXPECT_EQ( *pMemberships, 1 );
  auto* const pFirst = qobject_cast< VCameraObject* >( pItem->CameraObjects()[1] );
  auto* const pSecond = qobject_cast< VCameraObject* >( pItem->CameraObjects()[0] );
  EXPECT_EQ( pFirst->DeviceURN(), "vi:1" );
  EXPECT_EQ( pFirst->property( "userId" ).toUInt(), 4294967295u );
  const QPointF There = ScreenPoint( { 1500, 300, 900, 0 } );
  EXPECT_LT( QLineF( pSecond->m_Position.toPointF(), There ).length(), 1 );
  EXPECT_GT( pSecond->m_Position.z(), 0.99f );
  EXPECT_LT( pSecond->m_Position.z(), 1.0f );
  ASSERT_EQ( pItem->SubjectObjects().size(), 2 );
  auto* const pAda = qobject_cast< VSubjectObject* >( pItem->SubjectObjects()[0] );
  EXPECT_EQ( pAda->m_Name, "Ada" );
  EXPECT_LT( QLineF( pAda->m_Position.toPointF(), There ).length(), 1 );
  EXPECT_EQ( qobject_cast< VSubjectObject* >( pItem->SubjectObjects()[1] )->m_Position.z(), -1.0f );

  EXPECT_FALSE( pItem->ShowCameraNumbers() );
  pScene->Select( { { ZEK::ESelectDevice, "vi:2", 0, 0 } } );
  pWidget->Wheel( 120 );
  pWidget->Wheel( 120 );
  Frames( 3 );
  EXPECT_EQ( pItem->CameraObjects()[0], pSecond ) << "objects stay for as long as what they stand for";
  EXPECT_GT( std::abs( pSecond->m_Position.x() - There.x() ), 5.0 );
  EXPECT_TRUE( pSecond->m_bSelected );
  EXPECT_FALSE( pFirst->m_bSelected );
  EXPECT_TRUE( pItem->ShowCameraNumbers() );
  EXPECT_EQ( *pMemberships, 1 );
  pScene->SetCameraDefinitions( {} );
  Frames( 3 );
  EXPECT_TRUE( pItem->CameraObjects().isEmpty() );
  EXPECT_EQ( *pMemberships, 2 );
}

TEST_F( VItemHooks, ADoubleClickPreviewsTheCameraEvenBeforeItsPickIsBack )
{
  pScene->Select( { Recon( 2 ) } );
  const auto DoubleClick = [&]( QPointF i_Place )
  {
    pWidget->Click( i_Place );
    pWidget->Press( i_Place );
    pWidget->Mouse( QEvent::MouseButtonDblClick, i_Place, Qt::LeftButton, Qt::LeftButton );
    pWidget->Release( i_Place );
  };
  const auto pPreviews = Counted( pItem, &VSceneFramebufferObject::PreviewCameraChanged );
  DoubleClick( Place( 1 ) );
  ASSERT_TRUE( Until(
      [&]
      {
        return *pPreviews > 0 && pItem->PreviewCamera() == "vi:1";
      } ) );
  pItem->setOption( "CameraView", true );
  pScene->Select( { Recon( 0 ) } );
  DoubleClick( Empty );
  Settle();
  EXPECT_EQ( pItem->PreviewCamera(), "vi:1" ) << "in a camera view the grid answers";
}

TEST_F( VItemHooks, OnlyTheFreeViewIsMultisampled )
{
  const auto Samples = [&]
  {
    Frames( 3 );
    return pItem->frameReport()["gl"].toMap()["samples"].toInt();
  };
  EXPECT_EQ( Samples(), 4 );
  pItem->setOption( "CameraView", true );
  EXPECT_EQ( Samples(), 0 );
  pItem->setOption( "CameraView", false );
  pItem->setOption( "Distort3D", true );
  EXPECT_EQ( Samples(), 4 );
  Click( Place( 1 ) );
  EXPECT_EQ( pWidget->Selected(), ZEK::VSelection{ Recon( 1 ) } )
      << "the targets of picking were made anew with the view's";
}

} // namespace MoxelGraphics

#include "ItemFixture.h"

#include <MoxelGraphics/IManipulator.h>
#include <MoxelGraphics/VOverlayObjects.h>

#include <gmock/gmock.h>

namespace MoxelGraphics
{
namespace
{
class VTestHandles final : public IManipulator
{
public:
  VTestHandles( std::string i_Name, VTestSelection& io_rSelection, std::vector< std::string >& io_rSeen )
    : m_Name( std::move( i_Name ) )
    , m_rSelection( io_rSelection )
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
    AtPress = m_rSelection.Get( ZEK::ISelectionService::EPrimary );
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
  VTestSelection& m_rSelection;
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
    const ZEK::VSelection Selection = pSelection->Get( ZEK::ISelectionService::EPrimary );
    return Selection.size() == 1 ? QString( "vi:%1" ).arg( Selection[0].Sub ) : QString();
  }

  std::vector< std::string > Seen;
  VScenePose Pose;
  std::shared_ptr< VTestHandles > pObject = std::make_shared< VTestHandles >( "object", *pSelection, Seen );
  std::shared_ptr< VTestHandles > pVolume = std::make_shared< VTestHandles >( "volume", *pSelection, Seen );
  std::shared_ptr< VTestHandles > pHotspot = std::make_shared< VTestHandles >( "hotspot", *pSelection, Seen );
};

class VItemHooks : public VItemTest
{
protected:
  VItemHooks()
    : VItemTest( std::make_shared< VHandlesScene >() )
  {
  }
  VHandlesScene& Scene() { return static_cast< VHandlesScene& >( *pScene ); }
  const CoreGraphics::VCameraFields& Camera() { return pItem->Camera().Fields(); }
};
} // namespace

TEST_F( VItemHooks, ManipulatorsAreAskedInOrderAndTakeTheMouseBeforeTheCamera )
{
  const ZEK::VSelectionItem Handle{ ZEK::ESelectObjectManipulator, {}, 0, 2 };
  const ZEK::VSelectionItem Corner{ ZEK::ESelectVolumeManipulator, {}, 0, 5 };
  using ZEK::ISelectionService;
  pScene->pSelection->Set( ISelectionService::EPrimary, { Recon( 1 ), { ZEK::ESelectObjectManipulator, {}, 0, 9 } } );
  pScene->pSelection->Set( ISelectionService::ESecondary, { Handle, Corner, Recon( 0 ) } );
  const float Azimuth = Camera().azimuth;
  const auto Drag = [&]( Qt::KeyboardModifiers i_Modifiers )
  {
    Scene().Seen.clear();
    Mouse( QEvent::MouseButtonPress, Place( 0 ), Qt::LeftButton, Qt::LeftButton, i_Modifiers );
    Mouse( QEvent::MouseMove, Place( 0 ) + QPointF( 40, 0 ), Qt::NoButton, Qt::LeftButton, i_Modifiers );
    Mouse( QEvent::MouseButtonRelease, Place( 0 ) + QPointF( 40, 0 ), Qt::LeftButton, Qt::NoButton, i_Modifiers );
    return Scene().Seen;
  };
  Scene().pHotspot->bTakes = true;
  Scene().pVolume->bShown = false;
  using testing::ElementsAre;
  EXPECT_THAT( Drag( Qt::NoModifier ), ElementsAre( "object asked", "hotspot asked", "hotspot pressed" ) );
  EXPECT_THAT( Scene().pHotspot->AtPress,
               ElementsAre( Recon( 1 ), ZEK::VSelectionItem{ ZEK::ESelectObjectManipulator, {}, 0, 9 }, Corner ) );
  Scene().pObject->bTakes = true;
  EXPECT_THAT( Drag( Qt::AltModifier ), ElementsAre( "object asked", "object pressed" ) );
  EXPECT_THAT( Scene().pObject->AtPress, ElementsAre( Recon( 1 ), Corner, Handle ) );
  EXPECT_FALSE( pItem->IsPickPending() ) << "no click, and no band either";
  EXPECT_EQ( Camera().azimuth, Azimuth );

  Scene().pObject->bGrabbed = true;
  Hover( { 600, 40 } );
  Hover( Place( 1 ) );
  Settle();
  EXPECT_EQ( pItem->ToolTipText(), "" ) << "hovering selects nothing while handles are held";
  Mouse( QEvent::MouseButtonPress, Place( 0 ), Qt::LeftButton, Qt::LeftButton );
  pItem->ungrabMouse();
  EXPECT_FALSE( Scene().pObject->bGrabbed );
  Mouse( QEvent::MouseButtonRelease, Place( 0 ), Qt::LeftButton, Qt::NoButton );
  Scene().pObject->bTakes = Scene().pHotspot->bTakes = false;
  EXPECT_THAT( Drag( Qt::NoModifier ), ElementsAre( "object asked", "hotspot asked" ) );
  EXPECT_NE( Camera().azimuth, Azimuth ) << "what nobody takes moves the camera";
}

TEST_F( VItemHooks, EveryGestureOfATurnReachesTheCameraThatDrawsInItsOrder )
{
  CoreGraphics::VCameraController Expected = pItem->Camera();
  const auto Both = [&]( QEvent::Type i_Type, QPointF i_Place, Qt::MouseButton i_Button, Qt::MouseButtons i_Buttons )
  {
    Mouse( i_Type, i_Place, i_Button, i_Buttons );
    const QMouseEvent Event( i_Type, i_Place, i_Place, i_Button, i_Buttons, Qt::NoModifier );
    const double Ratio = Widget.devicePixelRatioF();
    i_Type == QEvent::MouseButtonPress     ? Expected.OnMousePress( Event, Ratio )
    : i_Type == QEvent::MouseButtonRelease ? Expected.OnMouseRelease( Event, Ratio )
                                           : Expected.OnMouseMove( Event, Ratio );
  };
  const quint64 Before = Drawn();
  Both( QEvent::MouseButtonPress, { 100, 100 }, Qt::LeftButton, Qt::LeftButton );
  Both( QEvent::MouseMove, { 150, 120 }, Qt::NoButton, Qt::LeftButton );
  Both( QEvent::MouseMove, { 161.4, 97.3 }, Qt::NoButton, Qt::LeftButton );
  Both( QEvent::MouseButtonPress, { 161, 97 }, Qt::RightButton, Qt::LeftButton | Qt::RightButton );
  Both( QEvent::MouseMove, { 180, 60 }, Qt::NoButton, Qt::LeftButton | Qt::RightButton );
  Both( QEvent::MouseButtonRelease, { 180, 60 }, Qt::RightButton, Qt::LeftButton );
  Both( QEvent::MouseMove, { 190, 60 }, Qt::NoButton, Qt::LeftButton );
  Both( QEvent::MouseButtonRelease, { 190, 60 }, Qt::LeftButton, Qt::NoButton );
  pItem->SetCameraType( CoreGraphics::EViewTop );
  Expected.SetViewType( CoreGraphics::EViewTop );
  Both( QEvent::MouseButtonPress, { 50, 50 }, Qt::RightButton, Qt::RightButton );
  Both( QEvent::MouseMove, { 50, 80 }, Qt::NoButton, Qt::RightButton );
  Both( QEvent::MouseMove, { 50, 95 }, Qt::NoButton, Qt::RightButton );
  Both( QEvent::MouseButtonRelease, { 50, 95 }, Qt::RightButton, Qt::NoButton );
  EXPECT_EQ( pItem->CameraType(), CoreGraphics::EViewTop );
  const auto Same = [&]( const CoreGraphics::VCameraFields& i_rCamera )
  {
    const CoreGraphics::VCameraFields& rExpected = Expected.Fields();
    EXPECT_EQ( i_rCamera.azimuth, rExpected.azimuth );
    EXPECT_EQ( i_rCamera.tilt, rExpected.tilt );
    EXPECT_EQ( i_rCamera.orthoScale, rExpected.orthoScale );
    EXPECT_EQ( i_rCamera.centre, rExpected.centre );
    EXPECT_EQ( i_rCamera.viewType, rExpected.viewType );
    EXPECT_EQ( i_rCamera.projection, rExpected.projection );
  };
  Same( Camera() );
  EXPECT_EQ( Drawn(), Before ) << "no frame came in between";
  Frames( 2 );
  Same( Camera() );
  const QVariantMap Report = pItem->frameReport()["camera"].toMap();
  EXPECT_EQ( Report["azimuth"].toFloat(), Expected.Fields().azimuth );
  EXPECT_EQ( Report["viewType"], "Top" );
  // A view that nobody sees keeps what is done to it.
  pItem->setVisible( false );
  Settle();
  pItem->SetCameraType( CoreGraphics::EViewLeft );
  Press( Qt::Key_Home );
  Settle();
  pItem->setVisible( true );
  Frames( 2 );
  EXPECT_EQ( pItem->frameReport()["camera"].toMap()["viewType"], "Left" );
  EXPECT_EQ( pItem->frameReport()["camera"].toMap()["orthoScale"].toFloat(), 4.0f );
}

TEST_F( VItemHooks, AMouseThatIsTakenAwayEndsItsGesture )
{
  Mouse( QEvent::MouseButtonPress, { 100, 100 }, Qt::LeftButton, Qt::LeftButton );
  Mouse( QEvent::MouseMove, { 150, 100 }, Qt::NoButton, Qt::LeftButton );
  const float Azimuth = Camera().azimuth;
  EXPECT_TRUE( Camera().orbiting );
  pItem->ungrabMouse();
  EXPECT_FALSE( Camera().orbiting );
  Mouse( QEvent::MouseButtonRelease, { 150, 100 }, Qt::LeftButton, Qt::NoButton );
  Mouse( QEvent::MouseButtonPress, { 400, 100 }, Qt::LeftButton, Qt::LeftButton );
  Mouse( QEvent::MouseMove, { 410, 100 }, Qt::NoButton, Qt::LeftButton );
  EXPECT_NEAR( Camera().azimuth, Azimuth + 10 * 0.2 * Widget.devicePixelRatioF(), 0.01 );
}

TEST_F( VItemHooks, TrackingTakesWhatIsSelectedWhenItBegins )
{
  int Announced = 0;
  QObject::connect( pItem, &VSceneFramebufferObject::TrackSelectionChanged,
                    [&]
                    {
                      ++Announced;
                    } );
  const auto Centre = [&]( int i_Frames = 3 )
  {
    Frames( i_Frames );
    return Camera().centre;
  };
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 1 ) } );
  pItem->SetTracking( ETrackCurrent );
  EXPECT_EQ( Announced, 1 );
  EXPECT_EQ( Centre(), QVector3D( 1500, 300, 900 ) );
  EXPECT_NEAR( Camera().distance, 7000, 1 ) << "tracking does not fit";
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 2 ) } );
  pScene->Change( { { 0, 0, 0, 7 }, { 700, 800, 900, 7 }, { -900, -1600, 200, 7 } } );
  EXPECT_EQ( Centre(), QVector3D( 700, 800, 900 ) ) << "it follows what was selected, where that goes";
  pItem->SetTracking( ETrackSelection );
  EXPECT_EQ( Centre(), QVector3D( -900, -1600, 200 ) );
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 0 ) } );
  EXPECT_EQ( Centre(), QVector3D( 0, 0, 0 ) );
  EXPECT_EQ( Announced, 1 );
  Scene().Pose.Matrix = { 1, 0, 0, 0, 0, 1, 0, 0, 0, 0, 1, 0, 10, 20, 30, 1 };
  pItem->SetTracking( ELockCurrent );
  EXPECT_EQ( Announced, 2 );
  Frames( 2 );
  EXPECT_EQ( Camera().tilt, -90 );
  EXPECT_EQ( Camera().distance, 1000 );
  EXPECT_EQ( Camera().lockPose.column( 3 ), QVector4D( 10, 20, 30, 1 ) );
  pItem->SetTracking( ETrackNone );
  Frames( 2 );
  EXPECT_EQ( Camera().tilt, -60 );
  EXPECT_TRUE( Camera().lockPose.isIdentity() );
  EXPECT_EQ( Announced, 2 );
}

TEST_F( VItemHooks, CamerasAndNamesStandWhereTheFrameShowsThem )
{
  int Memberships = 0;
  QObject::connect( pItem, &VSceneFramebufferObject::CamerasChanged,
                    [&]
                    {
                      ++Memberships;
                    } );
  const auto Definition = []( const char* i_pURN, std::int32_t i_Id, std::array< float, 3 > i_Place )
  {
    VCameraDefinition Camera;
    Camera.DeviceURN = i_pURN;
    Camera.UserId = i_Id;
    Camera.bCalibrated = i_Id != 7;
    Camera.Position = i_Place;
    return Camera;
  };
  // The eye of the first pose stands near (-4287, -4287, 3500).
  pScene->SetCameraDefinitions( { Definition( "vi:2", 2, { 1500, 300, 900 } ), Definition( "vi:1", -1, { 0, 0, 0 } ),
                                  Definition( "vi:7", 7, { 0, 0, 0 } ),
                                  Definition( "vi:9", 9, { -9000, -9000, 7000 } ) } );
  pScene->AddLabel( 1, { ZEK::ESelectSubject, "Ada", 1, 0 }, { 1500, 300, 800 }, 700, false, true, "Ada" );
  pScene->AddLabel( 2, { ZEK::ESelectRigidObject, "Wand", 2, 0 }, { -9000, -9000, 7000 }, 0, true, false, "Wand" );
  Frames( 3 );
  ASSERT_EQ( pItem->CameraObjects().size(), 2 );
  EXPECT_EQ( Memberships, 1 );
  auto* const pFirst = qobject_cast< VCameraObject* >( pItem->CameraObjects()[0] );
  auto* const pSecond = qobject_cast< VCameraObject* >( pItem->CameraObjects()[1] );
  EXPECT_EQ( pFirst->DeviceURN(), "vi:1" );
  EXPECT_EQ( pFirst->property( "userId" ).toUInt(), 4294967295u );
  const QPointF There = ScreenPoint( { 1500, 300, 900, 0 }, Size );
  EXPECT_NEAR( pSecond->m_Position.x(), There.x(), 1.0 );
  EXPECT_NEAR( pSecond->m_Position.y(), There.y(), 1.0 );
  EXPECT_GT( pSecond->m_Position.z(), 0.99f );
  EXPECT_LT( pSecond->m_Position.z(), 1.0f );
  ASSERT_EQ( pItem->SubjectObjects().size(), 2 );
  auto* const pAda = qobject_cast< VSubjectObject* >( pItem->SubjectObjects()[0] );
  EXPECT_EQ( pAda->m_Name, "Ada" );
  EXPECT_NEAR( pAda->m_Position.x(), There.x(), 1.0 );
  EXPECT_NEAR( pAda->m_Position.y(), There.y(), 1.0 );
  EXPECT_EQ( qobject_cast< VSubjectObject* >( pItem->SubjectObjects()[1] )->m_Position.z(), -1.0f );

  EXPECT_FALSE( pItem->ShowCameraNumbers() );
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { { ZEK::ESelectDevice, "vi:2", 0, 0 } } );
  Wheel( 120 );
  Wheel( 120 );
  Frames( 3 );
  EXPECT_EQ( pItem->CameraObjects()[1], pSecond ) << "objects stay for as long as what they stand for";
  EXPECT_GT( std::abs( pSecond->m_Position.x() - There.x() ), 5.0 );
  EXPECT_TRUE( pSecond->m_bSelected );
  EXPECT_FALSE( pFirst->m_bSelected );
  EXPECT_TRUE( pItem->ShowCameraNumbers() );
  EXPECT_EQ( Memberships, 1 );
  pScene->SetCameraDefinitions( {} );
  Frames( 3 );
  EXPECT_TRUE( pItem->CameraObjects().isEmpty() );
  EXPECT_EQ( Memberships, 2 );
}

TEST_F( VItemHooks, ADoubleClickPreviewsTheCameraEvenBeforeItsPickIsBack )
{
  QStringList Previews;
  QObject::connect( pItem, &VSceneFramebufferObject::PreviewCameraChanged,
                    [&]
                    {
                      Previews.append( pItem->PreviewCamera() );
                    } );
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 2 ) } );
  const auto DoubleClick = [&]( QPointF i_Place )
  {
    Mouse( QEvent::MouseButtonPress, i_Place, Qt::LeftButton, Qt::LeftButton );
    Mouse( QEvent::MouseButtonRelease, i_Place, Qt::LeftButton, Qt::NoButton );
    Mouse( QEvent::MouseButtonPress, i_Place, Qt::LeftButton, Qt::LeftButton );
    Mouse( QEvent::MouseButtonDblClick, i_Place, Qt::LeftButton, Qt::LeftButton );
    Mouse( QEvent::MouseButtonRelease, i_Place, Qt::LeftButton, Qt::NoButton );
    return Until(
        [&]
        {
          return !pItem->IsPickPending();
        } );
  };
  ASSERT_TRUE( DoubleClick( Place( 1 ) ) );
  ASSERT_TRUE( Until(
      [&]
      {
        return pItem->PreviewCamera() == "vi:1";
      } ) );
  EXPECT_EQ( Previews.last(), "vi:1" );
  pItem->setOption( "CameraView", true );
  pScene->pSelection->Set( ZEK::ISelectionService::EPrimary, { Recon( 0 ) } );
  ASSERT_TRUE( DoubleClick( { 600, 40 } ) );
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
  EXPECT_EQ( Selected(), ZEK::VSelection{ Recon( 1 ) } ) << "the targets of picking were made anew with the view's";
}

TEST_F( VItemHooks, OptionsTakenAsAWholeReachTheMapAndAreAnnouncedOnce )
{
  int Announced = 0;
  QObject::connect( pItem, &VSceneFramebufferObject::SceneOptionsChanged,
                    [&]
                    {
                      ++Announced;
                    } );
  VSceneOptions Options;
  Options.YUp = true;
  Options.SceneMesh.SkinXRay = true;
  pItem->SetOptions( Options );
  EXPECT_EQ( Announced, 1 );
  EXPECT_TRUE( pItem->Options() == Options );
  EXPECT_TRUE( pItem->OptionsMap().value( "SceneMesh-SkinXRay" ).toBool() );
  EXPECT_EQ( pItem->OptionsMap().value( "ReconstructionScale" ).toFloat(), 1.0f );
  EXPECT_TRUE( pScene->YUp() );
}

} // namespace MoxelGraphics

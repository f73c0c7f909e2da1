#include <HarrowGraphics/VHarrowScene.h>
#include <HarrowGraphics/VHarrowSubjectScene.h>
#include <HarrowGraphics/VSceneManager.h>
#include <HarrowGraphics/VSceneWindowContent.h>
#include <HarrowGraphics/VSceneWindowContentFactory.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostServices/VHost.h>
#include <HostServices/VStateJson.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QElapsedTimer>
#include <QtQml/QQmlEngine>
#include <QtQuick/QQuickItem>
#include <QtWidgets/QComboBox>
#include <QtWidgets/QHBoxLayout>

#include <gtest/gtest.h>

namespace
{
using namespace CoreMoxelTypes;
using HarrowGraphics::VSceneWindowContent;

class SubjectWindow : public testing::Test
{
protected:
  SubjectWindow()
  {
    [[maybe_unused]] static const int Registered =
        qmlRegisterType< MoxelGraphics::VSceneFramebufferObject >( "Flow2Graphics", 1, 0, "SceneFramebufferObject" );
    pManager = std::make_shared< HarrowGraphics::VSceneManager >( Host.Application(), Host.Workspace() );
    Toolbar.setLayout( new QHBoxLayout );
  }

  template < typename TFlow >
  void Add( const ZEK::VFlowStateRef& i_rState, const typename ZEK::FlowValueType< TFlow >::type& i_rValue )
  {
    ZEK::IResult Status;
    ZEK::VFlowItemRef Item;
    Host.ItemStore()->CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, Item );
    *ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( Item.Get() ) = i_rValue;
    Item->MutableValue().SetName( ZEK::EFlowNameObject, "Ada" );
    i_rState->AddItem( Item );
  }
  /// A state of one subject with those poses, and things that are none of a subject view's business.
  void ShowSubject( const std::vector< std::string >& i_rPoses )
  {
    ZEK::VFlowStateRef State;
    (void)Host.StateFactory()->CreateState( State, { ++Frame, 1, 1 }, {}, {} );
    VSubjectParametrised Ada;
    Ada.Base.Name = "Ada";
    Ada.Base.Segments.emplace_back().BoneLength = 1000;
    Ada.Poses.assign( 3, std::vector< f64 >( 6 ) );
    Ada.PoseNames = i_rPoses;
    Add< FlowSubject >( State, Ada.Base );
    Add< FlowSubjectParametrised >( State, Ada );
    Add< FlowReconstructionSet >( State, { { { 1, { 0, 0, 0 }, 0, 0, 2 } } } );
    Add< FlowSubjectDynamicParameters >( State, {} );
    Add< FlowRigidObject >( State, {} );
    EXPECT_TRUE( Host.Contexts()->LiveCache()->Add( State ).IsOk() );
  }
  std::shared_ptr< VSceneWindowContent > Open( HarrowGraphics::EWindowKind i_Kind = HarrowGraphics::EWindowKindSubject )
  {
    const auto pFactory = std::make_shared< HarrowGraphics::VSceneWindowContentFactory >(
        Host.Application(), Host.Workspace(), "Subject", pManager, i_Kind );
    std::shared_ptr< HarrowPluginInterface::VWindowFrameContent > pContent;
    pFactory->Create( pContent, Host.Contexts()->Find( "Live" ), &Toolbar );
    pContent->resize( 320, 240 );
    pContent->show();
    return std::dynamic_pointer_cast< VSceneWindowContent >( pContent );
  }
  static bool WaitFor( const std::function< bool() >& i_rDone )
  {
    QElapsedTimer Timer;
    for ( Timer.start(); !i_rDone() && Timer.elapsed() < 20'000; )
    {
      QCoreApplication::processEvents( QEventLoop::AllEvents, 10 );
    }
    return i_rDone();
  }
  static QVariantMap Report( VSceneWindowContent& i_rContent )
  {
    return i_rContent.SceneWidget().SceneItem()->frameReport()["subjectScene"].toMap();
  }
  QComboBox* PoseBox() const { return Toolbar.findChild< QComboBox* >( "Pose" ); }

  HostServices::VHost Host;
  QWidget Toolbar;
  std::shared_ptr< HarrowGraphics::VSceneManager > pManager;
  std::int64_t Frame = 0;
};
} // namespace

TEST_F( SubjectWindow, EachHasASceneOfItsOwnThatEndsWithIt )
{
  ShowSubject( { "Neutral", "Arms", "" } );
  const auto p3D = Open( HarrowGraphics::EWindowKind3D );
  auto pA = Open(), pB = Open();
  const auto Scene = []( VSceneWindowContent& i_r )
  {
    return i_r.SceneWidget().SceneItem()->Scene();
  };
  EXPECT_NE( Scene( *pA ), Scene( *pB ) );
  EXPECT_NE( Scene( *pA ), Scene( *p3D ) );
  EXPECT_EQ( p3D->SceneWidget().SubjectScene(), nullptr );
  pA->SceneWidget().setPoseIndex( 2 );
  pB->SceneWidget().setSolvingPoseIndex( 1 );
  const QVariantList Tags{ "0x1011", "0x1012", "0x101a", "0x1031" };
  for ( const auto& rpContent : { pA, pB } )
  {
    EXPECT_TRUE( WaitFor(
        [&]
        {
          return Report( *rpContent )["tags"] == Tags;
        } ) )
        << "of the live state its points, its rigid object and its pose are left out";
    EXPECT_EQ( Report( *rpContent )["subjects"], QVariantList{ "Ada" } );
    EXPECT_EQ( Report( *rpContent )["poses"], ( QVariantList{ "Neutral", "Arms", "Pose 2" } ) );
  }
  EXPECT_EQ( Report( *pA )["labellingPose"], 2 );
  EXPECT_EQ( Report( *pA )["solvingPose"], 2 );
  EXPECT_EQ( Report( *pB )["labellingPose"], 0 );
  EXPECT_EQ( Report( *pB )["solvingPose"], 1 );
  const QPointer pClosed = pA->SceneWidget().SubjectScene();
  pA.reset();
  EXPECT_TRUE( pClosed.isNull() );
  ShowSubject( { "Other" } );
  EXPECT_TRUE( WaitFor(
      [&]
      {
        return pB->SceneWidget().SubjectScene()->PoseNames().value( 0 ) == "Other";
      } ) )
      << "the window that is left goes on";
}

TEST_F( SubjectWindow, TheToolbarNamesThePosesAndChoosesOne )
{
  auto pContent = Open();
  QComboBox* pBox = PoseBox();
  ASSERT_NE( pBox, nullptr );
  EXPECT_FALSE( pBox->isEnabled() );
  const auto* const pNone = pContent->SceneWidget().rootObject()->findChild< QQuickItem* >( "noSubjects" );
  ASSERT_NE( pNone, nullptr );
  EXPECT_TRUE( pNone->isVisible() );
  ShowSubject( { "Neutral", "Arms", "" } );
  EXPECT_TRUE( WaitFor(
      [&]
      {
        return pBox->count() == 3;
      } ) );
  EXPECT_EQ( pBox->currentText(), "Neutral" );
  EXPECT_FALSE( pNone->isVisible() );
  emit pBox->activated( 1 );
  EXPECT_EQ( Report( *pContent )["pose"], 1 );
  EXPECT_EQ( pBox->currentText(), "Arms" );
  HostServices::VStateJsonWriter Writer;
  pContent->SaveState( Writer, "W" );
  pContent->SceneWidget().setPoseIndex( 7 );
  EXPECT_EQ( pBox->currentIndex(), -1 ) << "no subject has it";
  pContent->RestoreState( HostServices::VStateJsonReader( Writer.Object() ), "W" );
  EXPECT_EQ( pBox->currentText(), "Arms" );
  EXPECT_EQ( Report( *pContent )["pose"], 1 );
  pContent.reset();
  EXPECT_EQ( PoseBox(), nullptr );
  Host.Features()->SetFlags( HarrowPluginInterface::EFeatureObjects );
  pContent = Open();
  EXPECT_EQ( PoseBox(), nullptr ) << "objects have no poses to choose from";
}

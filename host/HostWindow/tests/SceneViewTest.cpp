#include <HostWindow/SceneView.h>
#include <HostWindow/TransportBar.h>

#include <gmock/gmock.h>

using namespace HostWindow;

TEST( SceneView, IsSafeWithoutContentAndWithoutAnItem )
{
  QWidget Empty;
  for ( VSceneView View : { VSceneView(), VSceneView( &Empty ) } )
  {
    EXPECT_EQ( View.Item(), nullptr );
    EXPECT_FALSE( View.LoadErrors().isEmpty() );
    EXPECT_FALSE( View.SetOption( "Floor", true ) );
    EXPECT_FALSE( View.ExecuteCommand( "Workspace3d:FrameSelected" ) );
    EXPECT_EQ( View.Frames(), 0 );
    View.SetViewType( 3 );
    View.FocusSelected();
    View.SetReporting( true );
  }
}

TEST( SceneView, ForgetsAContentThatIsGone )
{
  auto pContent = std::make_unique< QQuickWidget >();
  VSceneView View( pContent.get() );
  ASSERT_EQ( View.Widget(), pContent.get() );
  pContent.reset();
  EXPECT_EQ( View.Widget(), nullptr );
  EXPECT_EQ( View.Item(), nullptr );
}

TEST( SceneView, NearestNamesComeFirstWhateverTheirCase )
{
  const QStringList Names{ "Reconstructions", "Floor", "FloorGrid", "Axes" };
  EXPECT_EQ( Nearest( "flor", Names, 2 ), QStringList( { "Floor", "Axes" } ) );
  EXPECT_EQ( Nearest( "reconstruction", Names, 1 ), QStringList( { "Reconstructions" } ) );
  EXPECT_EQ( Nearest( "", {}, 3 ), QStringList() );
}

TEST( TransportBar, TimeIsWrittenInMinutesSecondsAndMilliseconds )
{
  EXPECT_EQ( TimeText( 0 ), "0:00.000" );
  EXPECT_EQ( TimeText( 2.43 ), "0:02.430" );
  EXPECT_EQ( TimeText( 59.9996 ), "1:00.000" );
  EXPECT_EQ( TimeText( 3725.5 ), "62:05.500" );
  EXPECT_EQ( TimeText( -1 ), "0:00.000" );
}

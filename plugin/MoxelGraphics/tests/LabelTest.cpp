#include "FrameFixture.h"

#include <MoxelGraphics/VLabelBatch.h>
#include <MoxelGraphics/VRenderMarkerHalo.h>
#include <MoxelGraphics/VRenderSubjectLabels.h>

#include <numeric>

// Labels over a plain background: what is seen is theirs.

namespace MoxelGraphics
{

class VLabelTest : public VFrameTest
{
protected:
  VLabelTest()
  {
    Options().FloorGrid = Options().GlobalAxis = Options().Reconstructions = false;
    Input().PixelRatio = 1;
    Draw(); // the scene's resources are there from now on
    pBatch = std::make_unique< VLabelBatch >( pScene->Resources() );
    pBatch->SetClock(
        [this]
        {
          return Now;
        } );
    pScene->pExtra->Function =
        [this]( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, std::uint32_t i_Pass )
    {
      if ( pType )
      {
        pType->Render( io_rContext, i_rOptions, i_Pass );
      }
      else if ( i_Pass == ERenderPassOverlay && io_rContext.RenderMode() == ERenderModeNormal )
      {
        pBatch->Draw( io_rContext, Style );
      }
    };
  }
  ~VLabelTest() override
  {
    Offscreen.MakeCurrent();
    pScene->pExtra->Function = {};
    pBatch.reset();
    pType.reset();
  }

  /// Labels beside points in a row from near to far, along the line of sight of the first pose but for a step aside.
  void Row( int i_Count, float i_Aside )
  {
    std::vector< VLabelText > Texts;
    for ( int Index = 0; Index < i_Count; ++Index )
    {
      Texts.push_back( { std::string( "m" ).append( std::to_string( Index ) ) } );
    }
    pBatch->SetTexts( Texts );
    PlaceRow( i_Aside );
  }
  void PlaceRow( float i_Aside, bool i_bReversed = false, float i_Step = 0.04F )
  {
    const QVector3D Eye = pFrame->Context()->CameraPosition(), Right( 0.70710678F, -0.70710678F, 0 );
    const auto Points = pBatch->Points();
    for ( std::size_t Index = 0; Index < Points.size(); ++Index )
    {
      const auto Place = static_cast< float >( i_bReversed ? Points.size() - 1 - Index : Index );
      const QVector3D At = Eye * ( 0.6F - i_Step * Place ) + Right * ( i_Aside * static_cast< float >( Index ) - 1000 );
      Points[Index] = { At.x(), At.y(), At.z(), 7 };
    }
    pBatch->Moved();
  }
  std::vector< float > Strengths() { return pBatch->Strengths( *pFrame->Context() ); }
  static QRect Lit( const QImage& i_rImage )
  {
    QRect Box;
    for ( int Y = 0; Y < i_rImage.height(); ++Y )
    {
      for ( int X = 0; X < i_rImage.width(); ++X )
      {
        Box |= Distance( i_rImage.pixel( X, Y ), Background ) > 100 ? QRect( X, Y, 1, 1 ) : QRect();
      }
    }
    return Box;
  }

  double Now = 100;
  VLabelStyle Style{ 13, 0, 100, 0 };
  std::unique_ptr< VLabelBatch > pBatch;
  std::shared_ptr< IRenderType > pType; ///< drawn in place of the batch
};

TEST_F( VLabelTest, ThousandsAreOneDrawAndCostNothingWhileNothingChanges )
{
  const std::uint64_t Without = ( Draw(), pFrame->Figures().DrawCalls );
  std::vector< VLabelText > Texts( 2000 );
  for ( std::size_t Index = 0; Index < Texts.size(); ++Index )
  {
    Texts[Index].Text = std::string( "M" ).append( std::to_string( Index % 50 ) );
  }
  pBatch->SetTexts( Texts );
  for ( std::size_t Index = 0; Index < Texts.size(); ++Index )
  {
    pBatch->Points()[Index] = { static_cast< float >( Index % 50 ) * 80 - 2000,
                                static_cast< float >( Index / 50 ) * 80 - 1600, 0, 7 };
  }
  pBatch->Moved();
  Style.Limit = 2000;
  Draw();
  EXPECT_EQ( pFrame->Figures().DrawCalls, Without + 1 );
  EXPECT_EQ( pBatch->LaidOut(), 50u ) << "the same text is laid out once";
  const std::vector< float > Shown = Strengths();
  const auto Count = std::count( Shown.begin(), Shown.end(), 1.0F );
  EXPECT_GT( Count, 40 );
  EXPECT_EQ( Count + std::count( Shown.begin(), Shown.end(), 0.0F ), 2000 ) << "the first frame is final";
  Draw();
  EXPECT_EQ( pFrame->Figures().BytesUploaded, 0u );
  // Whoever is shown stands clear of the others, and the limit holds.
  Style.Limit = 30;
  Draw();
  const std::vector< float > Few = Strengths();
  EXPECT_FLOAT_EQ( std::accumulate( Few.begin(), Few.end(), 0.0F ), 30 );
  for ( VLabelPoint& rPoint : pBatch->Points() )
  {
    rPoint.bShown = false;
  }
  pBatch->Moved();
  Draw();
  EXPECT_EQ( pFrame->Figures().DrawCalls, Without ) << "nothing to show, nothing drawn";
}

TEST_F( VLabelTest, TheNearestStayAndTheOthersFadeWithoutFlicker )
{
  Row( 4, 500 );
  PlaceRow( 500, false, 0.12F );
  Style.Limit = 2;
  const QRect Before = Lit( Draw() );
  EXPECT_EQ( Strengths(), ( std::vector< float >{ 1, 1, 0, 0 } ) );
  PlaceRow( 500, true, 0.12F );
  Now += 0.1;
  const QRect Moved = Lit( Draw() );
  EXPECT_EQ( Strengths(), ( std::vector< float >{ 1, 1, 0, 0 } ) ) << "it is not yet time for another choice";
  EXPECT_NE( Moved, Before ) << "what is shown goes along with its point";
  Now += 0.1;
  Draw(); // nothing moves any more, but a choice is due
  const std::vector< float > Half = Strengths();
  for ( std::size_t Index = 0; Index < 4; ++Index )
  {
    EXPECT_NEAR( Half[Index], Index < 2 ? 0.6 : 0.4, 1e-4 ) << Index;
  }
  Draw();
  EXPECT_EQ( Strengths(), Half ) << "as long as the clock stands";
  Now += 0.2;
  Draw();
  EXPECT_EQ( Strengths(), ( std::vector< float >{ 0, 0, 1, 1 } ) );
  // Two that are about equally far do not take turns, whoever is the nearer for the moment.
  Row( 2, 400 );
  Style.Limit = 1;
  for ( int Frame = 0; Frame < 8; ++Frame )
  {
    PlaceRow( 400, Frame % 2 == 1 );
    Now += 0.05;
    Draw();
    EXPECT_EQ( Strengths(), ( std::vector< float >{ 1, 0 } ) ) << Frame;
  }
  // Behind the eye, without a place, not wanted: gone at once.
  pBatch->Points()[0].X = std::numeric_limits< float >::quiet_NaN();
  pBatch->Points()[1] = { -9000, -9000, 8000, 7 };
  pBatch->Moved();
  Draw();
  EXPECT_EQ( Strengths(), ( std::vector< float >{ 0, 0 } ) );
  // A name goes before all others, what is marked before names, and one may stand in for another.
  pBatch->SetTexts(
      { { "near" }, { "Name", ~0u, ELabelPlace::Above, true }, { "marked" }, { "else", ~0u, {}, false, 4, 1, 2 } } );
  PlaceRow( 650 );
  pBatch->Points()[2].bMarked = true;
  Style.Limit = 2;
  Draw();
  EXPECT_EQ( Strengths(), ( std::vector< float >{ 0, 1, 1, 0 } ) );
  Style.Limit = 9;
  for ( const auto& [Switches, Else] : { std::pair{ 0u, 0.0F }, { 4u, 1.0F }, { 6u, 0.0F } } )
  {
    Style.Switches = Switches;
    Draw();
    EXPECT_EQ( Strengths(), ( std::vector< float >{ 1, 1, 1, Else } ) ) << Switches;
  }
}

TEST_F( VLabelTest, LabelsEndAtADistanceAndOnlyWhereThereIsOne )
{
  Row( 6, 400 );
  Draw();
  const QVector3D Eye = pFrame->Context()->CameraPosition();
  const auto Away = [&]( std::size_t i_Index )
  {
    const VLabelPoint& rPoint = pBatch->Points()[i_Index];
    return ( QVector3D( rPoint.X, rPoint.Y, rPoint.Z ) - Eye ).length();
  };
  Style.Distance = Away( 3 ) * 1.05F;
  Draw();
  const std::vector< float > Seen = Strengths();
  for ( std::size_t Index = 0; Index < 6; ++Index )
  {
    const float Expected = std::clamp( ( Style.Distance - Away( Index ) ) / ( 0.15F * Style.Distance ), 0.0F, 1.0F );
    EXPECT_NEAR( Seen[Index], Expected, 1e-4 ) << Index;
  }
  EXPECT_TRUE( Seen[3] > 0 && Seen[3] < 1 );
  Style.Distance = 1;
  Draw();
  EXPECT_EQ( Strengths(), std::vector< float >( 6, 0.0F ) );
  for ( VLabelPoint& rPoint : pBatch->Points() )
  {
    rPoint = { rPoint.X / 10, rPoint.Y / 10, 0, 0 };
  }
  pBatch->Moved();
  pFrame->Controller().SetViewType( 6 );
  Now += 1;
  Draw();
  const std::vector< float > Parallel = Strengths();
  EXPECT_GT( std::accumulate( Parallel.begin(), Parallel.end(), 0.0F ), 0 ) << "a view without perspective";
}

TEST_F( VLabelTest, AnyTextIsCrispAtItsPointAndReadableOverAnything )
{
  const VScenePoint Place{ 0, 0, 0, 0 };
  const QPointF At = ScreenPoint( Place );
  const std::string Long( 5000, 'W' );
  const struct
  {
    std::string Text;
    bool bSeen;
  } Cases[] = { { "Marker", true },     { "", false },           { " \n\t ", false },
                { "שלום", true },       { Long, true },          { "\xff\xfe broken \xc3", true },
                { "العربية 12", true }, { "Zeile\nzwei", true }, { "名前 \xf0\x9f\x99\x82", true } };
  for ( const auto& [Text, bSeen] : Cases )
  {
    SCOPED_TRACE( Text.substr( 0, 20 ) );
    pBatch->SetTexts( { { Text, 0xFFFFFFFF, ELabelPlace::Beside }, { Text, 0xFFFFFFFF, ELabelPlace::Above } } );
    for ( const float Ratio : { 1.0F, 1.5F, 2.0F } )
    {
      Input().PixelRatio = Ratio;
      for ( const std::size_t Which : { 0u, 1u } )
      {
        pBatch->Points()[Which] = { Place.X, Place.Y, Place.Z, 0 };
        pBatch->Points()[1 - Which].bShown = false;
        pBatch->Moved();
        Now += 1;
        const QImage Image = Draw();
        const QRect Box = Lit( Image );
        ASSERT_EQ( !Box.isEmpty(), bSeen );
        if ( !bSeen )
        {
          continue;
        }
        EXPECT_LT( Box.width(), 24 * 13 * Ratio ) << "shortened";
        EXPECT_LT( Box.height(), 20 * Ratio );
        EXPECT_NEAR( Which == 0 ? Box.center().y() : Box.bottom(), At.y(), 6 * Ratio );
        EXPECT_NEAR( Which == 0 ? Box.left() : Box.center().x(), At.x(), 6 * Ratio );
        int Brightest = 0;
        for ( int X = Box.left(); X <= Box.right(); ++X )
        {
          for ( int Y = Box.top(); Y <= Box.bottom(); ++Y )
          {
            Brightest = std::max( Brightest, qGreen( Image.pixel( X, Y ) ) );
          }
        }
        EXPECT_GT( Brightest, 250 ) << "strokes stand on whole pixels";
      }
    }
  }
  // White letters on white: their edge keeps them apart.
  Options().BackgroundColorRGB = 0xFFFFFF;
  pBatch->SetTexts( { { "Marker" } } );
  const QImage White = Draw();
  int Dark = 0;
  for ( int X = 0; X < 60; ++X )
  {
    Dark += qGreen( White.pixel( static_cast< int >( At.x() ) + X, static_cast< int >( At.y() ) ) ) < 100 ? 1 : 0;
  }
  EXPECT_GT( Dark, 5 );
}

namespace
{
/// A subject of some markers and one bone.
void AddSubject( VSubjectGroup& io_rGroup, const std::string& i_rName, const std::vector< VScenePoint >& i_rMarkers )
{
  VSubjectRecord& rRecord = io_rGroup.Records.emplace_back();
  rRecord.Name = i_rName;
  rRecord.Item = { ZEK::ESelectSubject, i_rName, io_rGroup.Records.size(), 0 };
  rRecord.Markers = { static_cast< std::uint32_t >( io_rGroup.Markers.size() ),
                      static_cast< std::uint32_t >( i_rMarkers.size() ) };
  for ( const VScenePoint& rPoint : i_rMarkers )
  {
    io_rGroup.MarkerNames.push_back( i_rName.substr( 0, 1 ) + std::to_string( io_rGroup.Markers.size() ) );
    io_rGroup.MarkerColours.push_back( 0xFF8080FF );
    io_rGroup.Markers.push_back( rPoint );
    io_rGroup.Solved.push_back( { 0, 0, 500, 7 } );
  }
  ++io_rGroup.StructureGeneration;
}
constexpr VScenePoint Missing{ VSubjectGroup::None, 0, 0, 0 };
} // namespace

TEST_F( VLabelTest, SubjectsAreNamedAboveTheirHeadsAndMarkersOnRequest )
{
  VSubjectGroup Labelling, Solving;
  AddSubject( Labelling, "Ada", { { -500, 0, 1700, 7 }, { -460, 0, 1700, 7 }, { 900, 0, 200, 7 }, Missing } );
  AddSubject( Labelling, "Bob", { Missing, Missing } );
  AddSubject( Solving, "Ada", { { 0, 0, 0, 7 } } );
  AddSubject( Solving, "Bob", { { 700, 100, 900, 7 } } );
  Labelling.Records[1].Markers.Count = 4000; // more than there are
  const auto pLabels = std::make_shared< VRenderSubjectLabels >( *pScene );
  pLabels->SetGroups( { nullptr, &Labelling, nullptr, &Solving, nullptr, nullptr } );
  pType = pLabels;
  const auto Texts = [&]
  {
    Draw();
    std::vector< std::string > Shown;
    const std::vector< float > All = pLabels->Labels().Strengths( *pFrame->Context() );
    for ( std::size_t Index = 0; Index < All.size(); ++Index )
    {
      if ( All[Index] > 0 )
      {
        Shown.push_back( pLabels->Labels().Texts()[Index].Text );
      }
    }
    return Shown;
  };
  using VTexts = std::vector< std::string >;
  EXPECT_EQ( Texts(), ( VTexts{ "Ada", "Bob" } ) ) << "one of each name";
  const VLabelPoint& rAda = pLabels->Labels().Points()[0];
  EXPECT_NEAR( rAda.X, -480, 0.5 );
  EXPECT_NEAR( rAda.Z, 1800, 0.5 );
  EXPECT_FLOAT_EQ( pLabels->Labels().Points()[1].Z, 600 ) << "the model knows where the markers of Bob are";
  EXPECT_EQ( pLabels->Labels().Count(), 4u ) << "markers nobody asked for have no labels";
  // Turned, the same head is elsewhere.
  pScene->SetYUp( true );
  Draw();
  EXPECT_NEAR( rAda.Y, 100, 1 );
  pScene->SetYUp( false );

  Options().MarkerNames = true;
  Options().SubjectNames = false;
  const VTexts Markers = Texts();
  EXPECT_TRUE( std::find( Markers.begin(), Markers.end(), "A2" ) != Markers.end() );
  EXPECT_TRUE( std::find( Markers.begin(), Markers.end(), "A3" ) == Markers.end() ) << "not seen";
  Options().LabellingSubject.Markers = false;
  EXPECT_EQ( Texts(), VTexts() ) << "the solver's are those of the same subjects";
  Options().LabellingSubject.Enabled = false;
  EXPECT_EQ( Texts(), ( VTexts{ "A0", "B1" } ) );
  Options().SubjectNames = true;
  Options().MarkerNames = false;
  EXPECT_EQ( Texts(), ( VTexts{ "Ada", "Bob" } ) );
  // A selected one is told apart, and a view through a camera has none.
  Solving.Records[1].Flags = CoreGraphics::EInstanceSelected;
  ++Solving.RecordGeneration;
  Draw();
  EXPECT_TRUE( pLabels->Labels().Points()[pLabels->Labels().Count() - 2].bMarked );
  Options().OverlayCamera = "vi:1";
  EXPECT_TRUE( Lit( Draw() ).isEmpty() );
}

TEST_F( VLabelTest, TheCurrentMarkerHasARingThatFacesTheEye )
{
  VSubjectGroup Group;
  AddSubject( Group, "Ada", { { 0, 0, 0, 7 }, { 1000, 0, 0, 7 }, Missing } );
  Group.MarkerIds.Flags = { CoreGraphics::EInstanceSelected | CoreGraphics::EInstancePrimary,
                            CoreGraphics::EInstanceSelected, CoreGraphics::EInstancePrimary };
  const auto pHalo = std::make_shared< VRenderMarkerHalo >( *pScene );
  pHalo->SetGroups( { nullptr, &Group, nullptr, nullptr } );
  pType = pHalo;
  EXPECT_TRUE( Lit( Draw() ).isEmpty() ) << "off";
  Options().ActiveLabelHalo = true;
  const std::uint64_t Before = pFrame->Figures().DrawCalls;
  const QImage Image = Draw();
  EXPECT_EQ( pFrame->Figures().DrawCalls, Before + 1 );
  const QRect Ring = Lit( Image );
  const QPointF At = ScreenPoint( { 0, 0, 0, 0 } );
  EXPECT_LT( QLineF( QRectF( Ring ).center(), At ).length(), 2 );
  EXPECT_NEAR( Ring.width(), Ring.height(), 2 );
  EXPECT_GT( Ring.width(), 14 );
  EXPECT_LT( Distance( Image.pixel( At.toPoint() ), Background ), 5 ) << "the marker stays free";
  Options().LabellingSubject.Markers = false;
  EXPECT_TRUE( Lit( Draw() ).isEmpty() );
}

} // namespace MoxelGraphics

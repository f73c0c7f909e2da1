#include <HostWindow/CommandLine.h>

#include <gmock/gmock.h>

using namespace HostWindow;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

namespace
{
struct VParsed
{
  VCommandLine Line;
  VParseResult Result;
};

VParsed Parse( std::vector< const char* > i_Arguments )
{
  VParsed Parsed;
  i_Arguments.insert( i_Arguments.begin(), "harrow" );
  Parsed.Result = ParseCommandLine( static_cast< int >( i_Arguments.size() ), i_Arguments.data(), Parsed.Line );
  return Parsed;
}

std::vector< std::string > Options( const VCommandLine& i_rLine )
{
  std::vector< std::string > Names;
  for ( const VViewAction& rAction : i_rLine.Render.Actions )
  {
    Names.push_back( rAction.Option + "=" + rAction.Text );
  }
  return Names;
}

template < typename T >
const T& Only( const VCommandLine& i_rLine )
{
  return std::get< T >( i_rLine.Render.Actions.at( 0 ).What );
}
} // namespace

TEST( CommandLine, NothingGivenOpensTheWindow )
{
  const VParsed Parsed = Parse( {} );
  EXPECT_FALSE( Parsed.Result.Exit );
  EXPECT_EQ( Parsed.Line.Mode, EProgramMode::Window );
  EXPECT_EQ( Parsed.Line.Common.Profile, "subjects" );
  EXPECT_FALSE( Parsed.Line.Common.Flags );
  EXPECT_FALSE( Parsed.Line.Common.Up );
}

TEST( CommandLine, ActionsKeepTheirOrderAcrossOptions )
{
  const VParsed Parsed = Parse( { "render", "--click", "1,2", "--key", "Home", "--click", "3,4", "--band", "0,0,9,9",
                                  "--set", "Floor=false", "--hover", "5,6", "--view", "top", "--wheel", "7,8,-120",
                                  "--drag", "1,1,2,2,left+right" } );
  ASSERT_FALSE( Parsed.Result.Exit ) << Parsed.Result.Error;
  EXPECT_THAT( Options( Parsed.Line ),
               ElementsAre( "--click=1,2", "--key=Home", "--click=3,4", "--band=0,0,9,9", "--set=Floor=false",
                            "--hover=5,6", "--view=top", "--wheel=7,8,-120", "--drag=1,1,2,2,left+right" ) );
}

TEST( CommandLine, ModifiersHoldForWhatFollowsAlone )
{
  const VParsed Parsed = Parse( { "render", "--click", "1,1", "--modifiers", "shift,ctrl", "--click", "2,2", "--band",
                                  "0,0,4,4", "--modifiers", "none", "--click", "3,3" } );
  ASSERT_FALSE( Parsed.Result.Exit ) << Parsed.Result.Error;
  const auto& rActions = Parsed.Line.Render.Actions;
  ASSERT_EQ( rActions.size(), 4u );
  EXPECT_EQ( rActions[0].Modifiers, Qt::KeyboardModifiers() );
  EXPECT_EQ( rActions[1].Modifiers, Qt::ShiftModifier | Qt::ControlModifier );
  EXPECT_EQ( rActions[2].Modifiers, Qt::ShiftModifier | Qt::ControlModifier );
  EXPECT_EQ( rActions[3].Modifiers, Qt::KeyboardModifiers() );
}

TEST( CommandLine, ValuesOfSettingsHaveTheirTypes )
{
  const auto Value = []( const char* i_pText )
  {
    const VParsed Parsed = Parse( { "render", "--set", i_pText } );
    return Parsed.Result.Exit ? QVariant() : Only< VSetAction >( Parsed.Line ).Value;
  };
  EXPECT_EQ( Value( "Floor=true" ), QVariant( true ) );
  EXPECT_EQ( Value( "Count=12" ), QVariant( 12 ) );
  EXPECT_EQ( Value( "Scale=1.5" ), QVariant( 1.5 ) );
  EXPECT_EQ( Value( "Colour=#102030" ), QVariant( "#102030" ) );
  EXPECT_EQ( Value( "Name=" ), QVariant( "" ) );
  EXPECT_EQ( Value( "Formula=a=b" ), QVariant( "a=b" ) );
  EXPECT_EQ( Value( "Scale=nan" ), QVariant( "nan" ) ) << "a number that is none stays a text";
}

TEST( CommandLine, PointsMayLieAnywhereAndHaveFractions )
{
  const VParsed Parsed = Parse( { "render", "--click", "-5,10.25" } );
  ASSERT_FALSE( Parsed.Result.Exit ) << Parsed.Result.Error;
  EXPECT_EQ( Only< VClickAction >( Parsed.Line ).At, QPointF( -5, 10.25 ) );
  const VParsed Drag = Parse( { "render", "--drag", "10,20,30,40,left+right" } );
  ASSERT_FALSE( Drag.Result.Exit ) << Drag.Result.Error;
  EXPECT_EQ( Only< VDragAction >( Drag.Line ).To, QPointF( 30, 40 ) );
  EXPECT_EQ( Only< VDragAction >( Drag.Line ).Buttons, Qt::LeftButton | Qt::RightButton );
}

struct VBadCase
{
  std::vector< const char* > Arguments;
  const char* pSays;
};

class BadCommandLine : public testing::TestWithParam< VBadCase >
{
};

TEST_P( BadCommandLine, EndsWithTheUsageCodeAndOneLineThatNamesTheFault )
{
  const VParsed Parsed = Parse( GetParam().Arguments );
  ASSERT_TRUE( Parsed.Result.Exit );
  EXPECT_EQ( *Parsed.Result.Exit, EExitUsage );
  EXPECT_THAT( Parsed.Result.Error, HasSubstr( GetParam().pSays ) );
  EXPECT_THAT( Parsed.Result.Error, Not( HasSubstr( "\n" ) ) );
  EXPECT_THAT( Parsed.Result.Output, testing::IsEmpty() );
}

INSTANTIATE_TEST_SUITE_P(
    Cases, BadCommandLine,
    testing::Values( VBadCase{ { "render", "--click", "10" }, "expected X,Y" },
                     VBadCase{ { "render", "--click", "10,x" }, "--click: \"10,x\"" },
                     VBadCase{ { "render", "--click", "inf,0" }, "expected X,Y" },
                     VBadCase{ { "render", "--band", "0,0,1" }, "expected X0,Y0,X1,Y1" },
                     VBadCase{ { "render", "--wheel", "1,2" }, "expected X,Y,DELTA" },
                     VBadCase{ { "render", "--drag", "1,2,3,4,thumb" }, "left, right and middle" },
                     VBadCase{ { "render", "--key", "Hame" }, "no key has that name" },
                     VBadCase{ { "render", "--view", "Sideways" }, "Perspective, Front, Back" },
                     VBadCase{ { "render", "--tracking", "everything" }, "none, selection or objects" },
                     VBadCase{ { "render", "--set", "Floor" }, "expected KEY=VALUE" },
                     VBadCase{ { "render", "--set", "=1" }, "expected KEY=VALUE" },
                     VBadCase{ { "render", "--modifiers", "shift,hyper" }, "the modifiers are" },
                     VBadCase{ { "render", "--size", "1280" }, "WIDTHxHEIGHT" },
                     VBadCase{ { "render", "--size", "0x720" }, "from 16 to 8192" },
                     VBadCase{ { "render", "--size", "99999x720" }, "from 16 to 8192" },
                     VBadCase{ { "render", "--ratio", "0" }, "0.5 to 4" },
                     VBadCase{ { "render", "--time", "-1" }, "seconds from 0" },
                     VBadCase{ { "render", "--time", "soon" }, "seconds from 0" },
                     VBadCase{ { "render", "--source", "a.c3d", "b.c3d" }, "one source at a time" },
                     VBadCase{ { "render", "--all", "--output", "a.png" }, "--output-dir" },
                     VBadCase{ { "--up", "x" }, "y or z" }, VBadCase{ { "--flags", "0xZZ" }, "32-bit" },
                     VBadCase{ { "--profile", "robots" }, "robots" }, VBadCase{ { "--log", "loud" }, "loud" },
                     VBadCase{ { "open" }, "files" }, VBadCase{ { "info" }, "files" },
                     VBadCase{ { "--no-such-option" }, "--no-such-option" }, VBadCase{ { "draw" }, "draw" } ) );

TEST( CommandLine, CommonOptionsHoldBeforeAndAfterTheSubcommand )
{
  for ( const std::vector< const char* >& rArguments :
        { std::vector< const char* >{ "--up", "y", "--flags", "0x3500c", "info", "a.c3d", "--json" },
          std::vector< const char* >{ "info", "a.c3d", "--json", "--up", "y", "--flags", "0x3500c" } } )
  {
    const VParsed Parsed = Parse( rArguments );
    ASSERT_FALSE( Parsed.Result.Exit ) << Parsed.Result.Error;
    EXPECT_EQ( Parsed.Line.Mode, EProgramMode::Info );
    EXPECT_TRUE( Parsed.Line.bJson );
    EXPECT_THAT( Parsed.Line.Files, ElementsAre( "a.c3d" ) );
    EXPECT_EQ( Parsed.Line.Common.Up, HostSources::EUpAxis::Y );
    EXPECT_EQ( Parsed.Line.Common.Flags, 0x3500cu );
  }
}

TEST( CommandLine, HelpListsEverySubcommandAndEveryAction )
{
  const VParsed Help = Parse( { "--help" } );
  EXPECT_EQ( Help.Result.Exit, EExitOk );
  for ( const char* pWord : { "open", "render", "info", "--plugin", "--content-root", "--flags", "--profile",
                              "--developer", "--log", "--up", "--cameras", "--performers", "--rate", "Exit codes" } )
  {
    EXPECT_THAT( Help.Result.Output, HasSubstr( pWord ) );
  }
  const VParsed Render = Parse( { "render", "--help" } );
  EXPECT_EQ( Render.Result.Exit, EExitOk );
  for ( const char* pWord :
        { "--window",  "--source",    "--time",  "--size",   "--set",    "--view",   "--click",
          "--band",    "--hover",     "--drag",  "--wheel",  "--key",    "--select", "--tracking",
          "--command", "--modifiers", "--ratio", "--output", "--report", "--all",    "--output-dir" } )
  {
    EXPECT_THAT( Render.Result.Output, HasSubstr( pWord ) );
  }
}

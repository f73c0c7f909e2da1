#include <CoreGraphics/VHarrowInteractionMapper.h>

#include <QtCore/Qt>

#include <gtest/gtest.h>

using namespace CoreGraphics;

namespace
{
constexpr int Left = Qt::LeftButton, Right = Qt::RightButton, Middle = Qt::MiddleButton;

// The action of each set of held buttons (index: bits left 1, right 2, middle 4) while navigating: p, o, z or none.
constexpr char Navigation[] = "-oz-----";

char NavigationOf( int i_Buttons )
{
  const bool bPan = ( i_Buttons & Left ) && ( i_Buttons & ( Right | Middle ) );
  return bPan ? 'p' : Navigation[i_Buttons];
}

std::string Actions( const VInteractionMapper& i_rMapper, int i_Buttons, Qt::KeyboardModifiers i_Modifiers )
{
  std::string Text;
  for ( int Action = -1; Action <= 4; ++Action )
  {
    if ( i_rMapper.IsAction( Action, i_Buttons, int( i_Modifiers.toInt() ) ) )
    {
      Text += Action >= 0 && Action < 4 ? "pozb"[Action] : '?';
    }
  }
  return Text;
}

std::string Expected( char i_Action )
{
  return i_Action == '-' ? std::string() : std::string( 1, i_Action );
}
} // namespace

TEST( Mapper, TheBaseNavigatesWithoutModifiersAndSelectsWithAltAlone )
{
  const VInteractionMapper Mapper;
  for ( int Buttons = 0; Buttons < 8; ++Buttons )
  {
    EXPECT_EQ( Actions( Mapper, Buttons, Qt::NoModifier ), Expected( NavigationOf( Buttons ) ) ) << Buttons;
    EXPECT_EQ( Actions( Mapper, Buttons, Qt::KeypadModifier ), Expected( NavigationOf( Buttons ) ) ) << Buttons;
    EXPECT_EQ( Actions( Mapper, Buttons, Qt::AltModifier ), Buttons ? "b" : "" ) << Buttons;
    for ( const Qt::KeyboardModifiers Modifiers :
          { Qt::KeyboardModifiers( Qt::ShiftModifier ), Qt::KeyboardModifiers( Qt::ControlModifier ),
            Qt::AltModifier | Qt::ShiftModifier, Qt::AltModifier | Qt::ControlModifier } )
    {
      EXPECT_EQ( Actions( Mapper, Buttons, Modifiers ), "" ) << Buttons;
    }
  }
}

TEST( Mapper, ThePreferenceSwapsNavigationAndSelection )
{
  const auto pMapper = ZEK::MakeShared< VHarrowInteractionMapper >( nullptr, nullptr );
  EXPECT_TRUE( pMapper->AltToSelect() );
  for ( const bool bFlag : { true, false, true } )
  {
    pMapper->SetAltToSelect( bFlag );
    for ( int Buttons = 0; Buttons < 8; ++Buttons )
    {
      // Shift and Control never stand in the way.
      for ( const Qt::KeyboardModifiers Others : { Qt::KeyboardModifiers(), Qt::KeyboardModifiers( Qt::ShiftModifier ),
                                                   Qt::ShiftModifier | Qt::ControlModifier } )
      {
        const std::string Navigating = Expected( NavigationOf( Buttons ) );
        const std::string Selecting = Buttons & Left ? "b" : "";
        EXPECT_EQ( Actions( *pMapper, Buttons, Others ), bFlag ? Navigating : Selecting ) << Buttons;
        EXPECT_EQ( Actions( *pMapper, Buttons, Others | Qt::AltModifier ), bFlag ? Selecting : Navigating ) << Buttons;
      }
    }
  }
}

TEST( Mapper, WithNoneInTheProcessEveryAnswerIsNo )
{
  SetInteractionMapper( nullptr );
  EXPECT_EQ( InteractionMapper(), nullptr );
  EXPECT_FALSE( IsInteraction( EInteractionOrbit, Left, 0 ) );
  const auto pMapper = std::make_shared< VInteractionMapper >();
  SetInteractionMapper( pMapper );
  EXPECT_EQ( InteractionMapper(), pMapper );
  EXPECT_TRUE( IsInteraction( EInteractionOrbit, Left, 0 ) );
  SetInteractionMapper( nullptr );
  EXPECT_FALSE( IsInteraction( EInteractionOrbit, Left, 0 ) );
}

#include <CoreGraphics/VHarrowInteractionMapper.h>

#include <QtCore/Qt>

#include <gtest/gtest.h>

using namespace CoreGraphics;

namespace
{
// What each set of held buttons (index: bits left 1, right 2, middle 4) asks for: p, o, z, b or nothing.
using VAsked = std::array< std::string, 8 >;
const VAsked Navigating = { "", "o", "z", "p", "", "p", "", "p" };
const VAsked Selecting = { "", "b", "", "b", "", "b", "", "b" };

VAsked Asked( const VInteractionMapper& i_rMapper, Qt::KeyboardModifiers i_Modifiers )
{
  VAsked Texts;
  for ( int Case = 0; Case < 8 * 6; ++Case )
  {
    const int Buttons = Case / 6, Action = Case % 6 - 1;
    if ( i_rMapper.IsAction( Action, Buttons, int( i_Modifiers.toInt() ) ) )
    {
      Texts[std::size_t( Buttons )] += Action >= 0 && Action < 4 ? "pozb"[Action] : '?';
    }
  }
  return Texts;
}
} // namespace

TEST( Mapper, AltSelectsOrElseNavigatesAsItIsPreferred )
{
  const Qt::KeyboardModifiers None, Shift( Qt::ShiftModifier ), Control( Qt::ControlModifier ), Alt( Qt::AltModifier );
  const VInteractionMapper Base;
  EXPECT_EQ( Asked( Base, None ), Navigating );
  EXPECT_EQ( Asked( Base, Qt::KeypadModifier ), Navigating );
  EXPECT_EQ( Asked( Base, Alt ), ( VAsked{ "", "b", "b", "b", "b", "b", "b", "b" } ) );
  for ( const Qt::KeyboardModifiers Others : { Shift, Control, Alt | Shift, Alt | Control } )
  {
    EXPECT_EQ( Asked( Base, Others ), VAsked{} );
  }
  const auto pMapper = ZEK::MakeShared< VHarrowInteractionMapper >( nullptr, nullptr );
  EXPECT_TRUE( pMapper->AltToSelect() );
  for ( const bool bFlag : { true, false, true } )
  {
    pMapper->SetAltToSelect( bFlag );
    // Shift and Control never stand in the way.
    for ( const Qt::KeyboardModifiers Others : { None, Shift, Shift | Control } )
    {
      EXPECT_EQ( Asked( *pMapper, Others ), bFlag ? Navigating : Selecting );
      EXPECT_EQ( Asked( *pMapper, Others | Alt ), bFlag ? Selecting : Navigating );
    }
  }
}

TEST( Mapper, WithNoneInTheProcessEveryAnswerIsNo )
{
  const auto pMapper = std::make_shared< VInteractionMapper >();
  for ( const bool bThere : { false, true, false } )
  {
    SetInteractionMapper( bThere ? pMapper : nullptr );
    EXPECT_EQ( InteractionMapper(), bThere ? pMapper : nullptr );
    EXPECT_EQ( IsInteraction( EInteractionOrbit, Qt::LeftButton, 0 ), bThere );
  }
}

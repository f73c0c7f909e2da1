#include <CoreGraphics/VHarrowInteractionMapper.h>
#include <Store/Store.h>
#include <TestSupport/LogGuard.h>

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

/// A service whose functions wait until the test runs them.
class VWaitingService final : public ZEK::IPostalService
{
public:
  void Post( std::function< void() > i_Function ) override { m_Functions.push_back( std::move( i_Function ) ); }
  std::size_t RunAll()
  {
    const auto Functions = std::exchange( m_Functions, {} );
    for ( const auto& rFunction : Functions )
    {
      rFunction();
    }
    return Functions.size();
  }

private:
  std::vector< std::function< void() > > m_Functions;
};

/// The mapper over a store without entries.
class HarrowMapper : public testing::Test
{
protected:
  template < typename TValue >
  void Set( const TValue& i_rValue )
  {
    ZEK::VStoreWriteScope Scope( *pStore );
    EXPECT_TRUE( Scope->SetValue( pEntry, ZEK::IO::MakeValue( i_rValue ) ).IsOk() );
  }
  void Remove()
  {
    ZEK::VStoreWriteScope Scope( *pStore );
    EXPECT_TRUE( Scope->RemoveEntry( pEntry ).IsOk() );
  }
  auto Make() { return ZEK::MakeShared< VHarrowInteractionMapper >( pPostal, pStore ); }

  const std::shared_ptr< VWaitingService > pPostal = std::make_shared< VWaitingService >();
  const std::shared_ptr< ZEK::IStore > pStore = Store::CreateStore( nullptr, 16 );
  Store::VStoreEntry* const pEntry = pStore->GetEntry( "Preferences/Core/AltToSelect" );
};
} // namespace

TEST( Mapper, TheBaseSelectsWithAltAlone )
{
  const VInteractionMapper Base;
  EXPECT_EQ( Asked( Base, {} ), Navigating );
  EXPECT_EQ( Asked( Base, Qt::KeypadModifier ), Navigating );
  EXPECT_EQ( Asked( Base, Qt::AltModifier ), ( VAsked{ "", "b", "b", "b", "b", "b", "b", "b" } ) );
  for ( const Qt::KeyboardModifiers Others :
        { Qt::KeyboardModifiers( Qt::ShiftModifier ), Qt::KeyboardModifiers( Qt::ControlModifier ),
          Qt::AltModifier | Qt::ShiftModifier, Qt::AltModifier | Qt::ControlModifier } )
  {
    EXPECT_EQ( Asked( Base, Others ), VAsked{} );
  }
}

TEST_F( HarrowMapper, AltSelectsOrElseNavigatesAsTheStoreSays )
{
  const auto pMapper = Make();
  const auto Check = [&]( bool i_bAltSelects )
  {
    EXPECT_EQ( pMapper->AltToSelect(), i_bAltSelects );
    // Shift and Control never stand in the way.
    for ( const Qt::KeyboardModifiers Others : { Qt::KeyboardModifiers(), Qt::KeyboardModifiers( Qt::ShiftModifier ),
                                                 Qt::ShiftModifier | Qt::ControlModifier } )
    {
      EXPECT_EQ( Asked( *pMapper, Others ), i_bAltSelects ? Navigating : Selecting );
      EXPECT_EQ( Asked( *pMapper, Others | Qt::AltModifier ), i_bAltSelects ? Selecting : Navigating );
    }
  };
  Check( true );
  for ( const bool bFlag : { false, true, false } )
  {
    Set( bFlag );
    EXPECT_NE( pMapper->AltToSelect(), bFlag ) << "it changes on its own thread";
    pPostal->RunAll();
    Check( bFlag );
  }
  // Behind by several changes it takes the newest once; a value that is equal is no change.
  Set( true );
  Set( false );
  Set( true );
  pPostal->RunAll();
  Check( true );
  Set( true );
  EXPECT_EQ( pPostal->RunAll(), 0u );
  Set( false );
  pPostal->RunAll();
  EXPECT_FALSE( Make()->AltToSelect() ) << "a new one begins with the value";
  // Without the entry the default holds again, and another type changes nothing.
  Remove();
  pPostal->RunAll();
  Check( true );
  TestSupport::ExpectFailureLine(
      "Failed getting value for store entry 'Preferences/Core/AltToSelect': the requested value type does not match "
      "the store value type." );
  Set( std::string( "no" ) );
  pPostal->RunAll();
  Check( true );
  EXPECT_FALSE( TestSupport::LogTexts( "Store", 6 ).empty() );
}

TEST_F( HarrowMapper, WithoutAPartnerTheFirstValueStaysAndLateNewsAreHarmless )
{
  EXPECT_TRUE( ZEK::MakeShared< VHarrowInteractionMapper >( pPostal, nullptr )->AltToSelect() );
  Set( false );
  const auto pAlone = ZEK::MakeShared< VHarrowInteractionMapper >( nullptr, pStore );
  EXPECT_FALSE( pAlone->AltToSelect() );
  auto pGone = Make();
  Set( true );
  EXPECT_FALSE( pAlone->AltToSelect() );
  // The delivery is on its way when the mapper ends; the store forgets it.
  pGone.reset();
  EXPECT_EQ( pPostal->RunAll(), 1u );
  EXPECT_EQ( pStore->HandlerCount(), 0u );
  Set( false );
  EXPECT_EQ( pPostal->RunAll(), 0u );
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

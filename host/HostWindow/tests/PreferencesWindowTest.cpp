#include <HostWindow/PreferencesWindow.h>

#include <HostServices/VPostalService.h>
#include <HostServices/VUserPreferences.h>

#include <Store/Store.h>
#include <TestSupport/Paths.h>
#include <ZEK/Serialiser.h>
#include <ZEK/StoreFlags.h>

#include <QtCore/QSet>
#include <QtTest/QTest>
#include <QtWidgets/QAbstractButton>
#include <QtWidgets/QAbstractSpinBox>
#include <QtWidgets/QApplication>
#include <QtWidgets/QComboBox>
#include <QtWidgets/QToolButton>

#include <gmock/gmock.h>

using namespace HostWindow;
using ZEK::IO::MakeValue;

namespace
{
constexpr const char* pAlt = "Preferences/Core/AltToSelect";
constexpr const char* pInterval = "Preferences/Core/AutoSaveIntervalSeconds";
constexpr const char* pFreeSpace = "Preferences/Core/WarnFreeSpaceOptical";
constexpr const char* pSkins = "Preferences/Core/Folders/FolderSkins";

class PreferencesWindow : public testing::Test
{
protected:
  void SetUp() override
  {
    ASSERT_TRUE( HostServices::DeclareUserPreferences( *m_pStore ).IsOk() );
    m_Window.show();
    ASSERT_TRUE( QTest::qWaitForWindowExposed( &m_Window ) );
    m_Window.activateWindow();
    ASSERT_TRUE( QTest::qWaitForWindowActive( &m_Window ) );
  }
  ZEK::IStoreReader::Entry At( const char* i_pPath ) { return m_pStore->GetEntry( i_pPath ); }
  ZEK::VTypedValue Get( const char* i_pPath )
  {
    const ZEK::VStoreReadScope Scope( *m_pStore );
    return Scope->VerifiedValue( At( i_pPath ) );
  }
  /// As somebody else does.
  template < typename T >
  void Put( const char* i_pPath, const T& i_rValue )
  {
    {
      const ZEK::VStoreWriteScope Scope( *m_pStore );
      ASSERT_TRUE( Scope->SetValue( At( i_pPath ), MakeValue( i_rValue ) ).IsOk() );
    }
    EXPECT_TRUE( m_pPostal->DrainForTest() );
  }
  QWidget* Field( const char* i_pPath ) { return m_Window.findChild< QWidget* >( i_pPath ); }
  template < typename T >
  T* In( const char* i_pPath )
  {
    return qobject_cast< T* >( Field( i_pPath )->focusProxy() );
  }
  QToolButton* Reset( const char* i_pPath )
  {
    return m_Window.findChild< QToolButton* >( QString( i_pPath ) + "/Reset" );
  }
  /// What stands below a field.
  QString Note( const char* i_pPath )
  {
    const auto* const pNote = m_Window.findChild< QLabel* >( QString( i_pPath ) + "/Note" );
    return pNote->isVisible() ? pNote->text() : QString();
  }
  /// Through the window system's side of the window, so that whatever lies there gets it.
  void Click( QWidget* i_pWidget, QPoint i_At )
  {
    m_Window.findChild< QScrollArea* >()->ensureWidgetVisible( i_pWidget );
    QTest::mouseClick( m_Window.windowHandle(), Qt::LeftButton, {}, i_pWidget->mapTo( &m_Window, i_At ) );
    EXPECT_TRUE( m_pPostal->DrainForTest() );
  }
  void Click( QWidget* i_pWidget ) { Click( i_pWidget, i_pWidget->rect().center() ); }
  void Press( Qt::Key i_Key, Qt::KeyboardModifiers i_Modifiers = {} )
  {
    QTest::keyClick( m_Window.windowHandle(), i_Key, i_Modifiers );
    EXPECT_TRUE( m_pPostal->DrainForTest() );
  }
  /// Over all that stands in the field that has the focus.
  void Type( const char* i_pText, Qt::Key i_Last = Qt::Key_Return )
  {
    Press( Qt::Key_A, Qt::ControlModifier );
    Press( Qt::Key_Backspace );
    for ( const char* pLetter = i_pText; *pLetter != 0; ++pLetter )
    {
      QTest::sendKeyEvent( QTest::Click, m_Window.windowHandle(), Qt::Key_unknown, QString( *pLetter ), {} );
    }
    Press( i_Last );
  }

  std::shared_ptr< HostServices::VPostalService > m_pPostal = std::make_shared< HostServices::VPostalService >();
  std::shared_ptr< ZEK::IStore > m_pStore = Store::CreateStore( m_pPostal, 64 );
  HostServices::VUndoStack m_Undo;
  HostServices::VPreferenceEditor m_Editor{ m_pStore, m_Undo };
  VPreferencesWindow m_Window{ m_Editor, m_Undo, m_pPostal };
};
} // namespace

TEST_F( PreferencesWindow, AClickOnACheckBoxHoldsAtOnceAndUndoBringsItBack )
{
  int Changes = 0;
  const auto pHandler = m_pStore->RegisterHandler( { { At( pAlt ) }, {} } );
  const auto Connection = pHandler->CreateProxy( ZEK::EChangeVerified, ZEK::IHandlerCallback::EveryDelivery )
                              .Connect(
                                  [&]( auto, auto )
                                  {
                                    ++Changes;
                                  },
                                  nullptr );
  auto* const pBox = In< QAbstractButton >( pAlt );
  ASSERT_TRUE( pBox && pBox->isChecked() && !Reset( pAlt )->isVisible() );
  Click( pBox, QPoint( 8, pBox->height() / 2 ) );
  EXPECT_EQ( Get( pAlt ), MakeValue( false ) );
  EXPECT_EQ( Changes, 1 ) << "what the window shows does not come back as an edit";
  EXPECT_EQ( m_Undo.Stack().undoText(), "Change Alt to select" );
  EXPECT_TRUE( Reset( pAlt )->isVisible() );
  Press( Qt::Key_Z, Qt::ControlModifier );
  EXPECT_EQ( Get( pAlt ), MakeValue( true ) );
  EXPECT_TRUE( pBox->isChecked() && !Reset( pAlt )->isVisible() );
  Press( Qt::Key_Z, Qt::ControlModifier | Qt::ShiftModifier );
  EXPECT_FALSE( pBox->isChecked() );
  Click( Reset( pAlt ) );
  EXPECT_EQ( Get( pAlt ), MakeValue( true ) );
  EXPECT_TRUE( pBox->isChecked() && pBox->hasFocus() ) << "the focus stays in the row";
  EXPECT_EQ( Changes, 4 );
}

TEST_F( PreferencesWindow, ASpinBoxMergesItsStepsAndRefusesWhatIsOutOfRange )
{
  auto* const pBox = In< QAbstractSpinBox >( pInterval );
  ASSERT_TRUE( pBox );
  Click( pBox, QPoint( 5, pBox->height() / 2 ) );
  for ( int i = 0; i < 3; ++i )
  {
    Press( Qt::Key_Up );
  }
  EXPECT_EQ( Get( pInterval ), MakeValue( 330u ) );
  EXPECT_EQ( m_Undo.Stack().count(), 1 );
  Press( Qt::Key_Z, Qt::ControlModifier );
  EXPECT_EQ( Get( pInterval ), MakeValue( 300u ) );
  EXPECT_EQ( pBox->text(), "300" );

  for ( const auto& [pText, pWhy] : { std::pair( "5", "from 10 to 3600" ),
                                      { "5000", "from 10 to 3600" },
                                      { "ten", "“ten”" },
                                      { "", "A number is needed" },
                                      { "-20", "“-20”" } } )
  {
    Type( pText );
    EXPECT_TRUE( Note( pInterval ).contains( pWhy ) ) << pText << ": " << Note( pInterval ).toStdString();
    EXPECT_EQ( pBox->text(), "300" );
  }
  EXPECT_EQ( Get( pInterval ), MakeValue( 300u ) );
  Type( "+060", Qt::Key_Tab );
  EXPECT_EQ( Get( pInterval ), MakeValue( 60u ) );
  EXPECT_EQ( pBox->text(), "60" );
  EXPECT_EQ( Note( pInterval ), "" );
  EXPECT_FALSE( pBox->hasFocus() );
  // Escape gives up the text, and only then the window.
  pBox->setFocus();
  Type( "7", Qt::Key_Escape );
  EXPECT_EQ( pBox->text(), "60" );
  EXPECT_TRUE( m_Window.isVisible() );
  Press( Qt::Key_Escape );
  EXPECT_FALSE( m_Window.isVisible() );
  EXPECT_EQ( Get( pInterval ), MakeValue( 60u ) );
}

TEST_F( PreferencesWindow, ChangesFromElsewhereAppearAndLeaveUnfinishedTextAlone )
{
  auto* const pLine = In< QLineEdit >( pSkins );
  auto* const pBox = In< QComboBox >( pFreeSpace );
  ASSERT_TRUE( pLine && pBox );
  EXPECT_EQ( pBox->currentText(), "Below 10 GiB" );
  Click( pLine );
  Type( "/half", Qt::Key_End );
  Put( pAlt, false );
  Put( pFreeSpace, 15u );
  EXPECT_FALSE( In< QAbstractButton >( pAlt )->isChecked() );
  EXPECT_EQ( pBox->currentText(), QString( "15%1GiB" ).arg( QChar( QChar::Nbsp ) ) );
  EXPECT_EQ( pLine->text(), "/half" );
  Put( pFreeSpace, 50u );
  EXPECT_EQ( pBox->currentText(), "Below 50 GiB" );
  EXPECT_EQ( pBox->count(), 7 ) << "a value that is no choice is no offer";
  Put( pSkins, std::string( "/other" ) );
  EXPECT_EQ( pLine->text(), "/other" );
  EXPECT_EQ( Note( pSkins ), "This folder is not there now." );
  Put( pInterval, 5u );
  EXPECT_TRUE( Note( pInterval ).contains( "from 10 to 3600" ) ) << "what stands there is named";
  EXPECT_EQ( m_Undo.Stack().count(), 0 ) << "they are nobody's step here";
  Type( "skins" );
  EXPECT_TRUE( Note( pSkins ).contains( "not a whole path" ) ) << Note( pSkins ).toStdString();
  EXPECT_EQ( pLine->text(), "/other" );

  // Another module declares a setting of its own, and takes it back.
  {
    const ZEK::VStoreWriteScope Scope( *m_pStore );
    (void)Scope->SetDefaultValue( At( "Preferences/Other/Gains" ), MakeValue( std::vector< double >{ 1, 0.5 } ) );
    Scope->SetPresentationText( At( "Preferences/Other/Gains" ), "Gains <b>& more</b>" );
  }
  EXPECT_TRUE( m_pPostal->DrainForTest() );
  EXPECT_TRUE( In< QLineEdit >( pSkins )->hasFocus() ) << "a page made anew keeps the focus";
  auto* const pGains = In< QLineEdit >( "Preferences/Other/Gains" );
  ASSERT_TRUE( pGains );
  EXPECT_EQ( pGains->text(), "[1,0.5]" );
  pGains->setFocus();
  Type( "[2,]" );
  EXPECT_TRUE( Note( "Preferences/Other/Gains" ).contains( "position 3" ) );
  Type( "[ 2, 4 ]" );
  EXPECT_EQ( Get( "Preferences/Other/Gains" ), MakeValue( std::vector< double >{ 2, 4 } ) );
  EXPECT_EQ( pGains->text(), "[2,4]" );
  {
    const ZEK::VStoreWriteScope Scope( *m_pStore );
    EXPECT_TRUE( Scope->RemoveEntry( At( "Preferences/Other" ) ).IsOk() );
  }
  EXPECT_TRUE( m_pPostal->DrainForTest() );
  EXPECT_EQ( Field( "Preferences/Other/Gains" ), nullptr );
  Press( Qt::Key_Z, Qt::ControlModifier );
  EXPECT_TRUE( m_Window.findChild< QLabel* >( "Message" )->text().contains( "Gains" ) );
}

TEST_F( PreferencesWindow, TheSearchLeavesWhatHasAllItsWords )
{
  auto* const pSearch = m_Window.findChild< QLineEdit* >( "Search" );
  EXPECT_TRUE( pSearch->hasFocus() );
  const auto Shown = [&]
  {
    QStringList Names;
    for ( const QWidget* const pWidget : m_Window.findChildren< QWidget* >() )
    {
      const QString Name = pWidget->objectName();
      if ( Name.startsWith( "Preferences/" ) && Name.count( '/' ) < 4 && !Name.contains( "/Reset" ) &&
           !Name.contains( "/Note" ) && pWidget->isVisible() )
      {
        Names << Name.section( '/', -1 );
      }
    }
    return Names;
  };
  EXPECT_EQ( Shown().size(), 20 );
  Type( "MESH props", Qt::Key_End );
  EXPECT_EQ( Shown(), QStringList( { "FolderPropMeshes" } ) );
  Type( "below 20", Qt::Key_End );
  EXPECT_EQ( Shown(), QStringList( { "WarnFreeSpaceOptical" } ) );
  Type( "nothing has this", Qt::Key_End );
  EXPECT_TRUE( m_Window.findChild< QLabel* >( "Nothing" )->isVisible() );
  Press( Qt::Key_Escape );
  EXPECT_EQ( Shown().size(), 20 );
  EXPECT_TRUE( m_Window.isVisible() );
}

TEST_F( PreferencesWindow, TheKeyboardReachesEverythingFromTheTopDown )
{
  Put( pAlt, false );
  QSet< const QWidget* > Seen;
  int Height = 0;
  const auto* const pPage = m_Window.findChild< QScrollArea* >()->widget();
  for ( int i = 0; i < 100 && !Seen.contains( QApplication::focusWidget() ); ++i )
  {
    const QWidget* const pFocus = QApplication::focusWidget();
    ASSERT_TRUE( pFocus );
    Seen.insert( pFocus );
    if ( pPage->isAncestorOf( pFocus ) )
    {
      const int Top = pFocus->mapTo( pPage, QPoint( 0, pFocus->height() / 2 ) ).y();
      EXPECT_GE( Top, Height - 5 ) << pFocus->accessibleName().toStdString();
      EXPECT_TRUE( m_Window.findChild< QScrollArea* >()->viewport()->rect().contains(
          pFocus->mapTo( m_Window.findChild< QScrollArea* >()->viewport(), pFocus->rect().center() ) ) )
          << pFocus->accessibleName().toStdString();
      Height = Top;
    }
    Press( Qt::Key_Tab );
  }
  // The search, 20 fields, a button of each folder, one that resets, and the one that closes.
  EXPECT_EQ( Seen.size(), 1 + 20 + 13 + 1 + 1 );
  // Each letter is used once: Alt with it goes to one place.
  QSet< QString > Letters;
  for ( const QWidget* const pWidget : m_Window.findChildren< QWidget* >() )
  {
    const QString Text = pWidget->property( "text" ).toString();
    const auto At = Text.indexOf( '&' );
    if ( At >= 0 && ( qobject_cast< const QAbstractButton* >( pWidget ) || pWidget->property( "buddy" ).isValid() ||
                      qobject_cast< const QLabel* >( pWidget ) ) )
    {
      EXPECT_FALSE( Letters.contains( Text.mid( At + 1, 1 ).toLower() ) ) << Text.toStdString();
      Letters.insert( Text.mid( At + 1, 1 ).toLower() );
    }
  }
  EXPECT_GE( Letters.size(), 19 ) << "the words of a few hold no letter that is left";
  Press( Qt::Key_A, Qt::AltModifier );
  EXPECT_TRUE( QTest::qWaitFor(
      [&]
      {
        return Get( pAlt ) == MakeValue( true );
      } ) );
}

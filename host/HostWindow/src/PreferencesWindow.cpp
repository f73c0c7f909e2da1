#include <HostWindow/PreferencesWindow.h>

#include "PreferenceRow.h"

#include <HostServices/VUserPreferences.h>

#include <QtCore/QSet>
#include <QtGui/QAction>
#include <QtGui/QKeyEvent>
#include <QtGui/QShortcut>
#include <QtWidgets/QApplication>
#include <QtWidgets/QGridLayout>
#include <QtWidgets/QHBoxLayout>
#include <QtWidgets/QPushButton>
#include <QtWidgets/QVBoxLayout>

namespace HostWindow
{
namespace
{
/// Gives each text a letter of its own, the first of a word where there is one to spare.
QString WithMnemonic( const QString& i_rText, QSet< QChar >& io_rUsed )
{
  for ( const bool bFirstOnly : { true, false } )
  {
    for ( qsizetype At = 0; At < i_rText.size(); ++At )
    {
      const QChar Letter = i_rText[At].toLower();
      const bool bFirst = At == 0 || i_rText[At - 1].isSpace();
      if ( Letter.isLetter() && ( bFirst || !bFirstOnly ) && !io_rUsed.contains( Letter ) )
      {
        io_rUsed.insert( Letter );
        const QString Before = i_rText.left( At ).replace( '&', "&&" );
        return Before + '&' + i_rText.mid( At ).replace( '&', "&&" );
      }
    }
  }
  return QString( i_rText ).replace( '&', "&&" );
}
} // namespace

/// What the scroll area shows, and from what it was made.
struct VPreferencesWindow::VPage
{
  /// A heading with the rows below it.
  struct VPart
  {
    QLabel* pTitle = nullptr;
    QLabel* pText = nullptr;
    std::vector< VPreferenceRow* > Rows;
  };

  std::vector< VPreferenceSection > Sections;
  std::vector< VPart > Parts;
};

VPreferencesWindow::VPreferencesWindow( HostServices::VPreferenceEditor& io_rEditor, HostServices::VUndoStack& io_rUndo,
                                        std::shared_ptr< ZEK::IPostalService > i_pPostal, QWidget* i_pParent )
  : QDialog( i_pParent )
  , m_rEditor( io_rEditor )
  , m_pPage( std::make_unique< VPage >() )
{
  setObjectName( "Preferences" );
  setWindowTitle( tr( "Preferences" ) );
  MakeParts();
  // The menu's own keys are those of the main window.
  QAction* const pUndo = io_rUndo.Stack().createUndoAction( this );
  pUndo->setShortcut( QKeySequence::Undo );
  QAction* const pRedo = io_rUndo.Stack().createRedoAction( this );
  pRedo->setShortcut( QKeySequence::Redo );
  addActions( { pUndo, pRedo } );
  Watch( std::move( i_pPostal ) );
  Refresh();
  resize( 680, 680 );
}

VPreferencesWindow::~VPreferencesWindow() = default;

void VPreferencesWindow::MakeParts()
{
  m_pSearch = new QLineEdit( this );
  m_pSearch->setObjectName( "Search" );
  m_pSearch->setPlaceholderText( tr( "Search preferences" ) );
  m_pSearch->setAccessibleName( m_pSearch->placeholderText() );
  m_pSearch->setClearButtonEnabled( true );
  connect( m_pSearch, &QLineEdit::textChanged, this, &VPreferencesWindow::Search );
  connect( new QShortcut( QKeySequence::Find, this ), &QShortcut::activated, this,
           [this]
           {
             m_pSearch->setFocus( Qt::ShortcutFocusReason );
             m_pSearch->selectAll();
           } );
  m_pScroll = new QScrollArea( this );
  m_pScroll->setWidgetResizable( true );
  m_pScroll->setFrameShape( QFrame::NoFrame );
  m_pScroll->setFocusPolicy( Qt::NoFocus );
  connect( qApp, &QApplication::focusChanged, this,
           [this]( QWidget*, QWidget* i_pNow )
           {
             if ( i_pNow && m_pScroll->widget() && m_pScroll->widget()->isAncestorOf( i_pNow ) )
             {
               m_pScroll->ensureWidgetVisible( i_pNow );
             }
           } );
  m_pNothing = new QLabel( this );
  m_pNothing->setObjectName( "Nothing" );
  m_pNothing->setAlignment( Qt::AlignCenter );
  m_pNothing->setWordWrap( true );
  m_pNothing->setTextFormat( Qt::PlainText );
  m_pNothing->hide();
  m_pMessage = new QLabel( this );
  m_pMessage->setObjectName( "Message" );
  m_pMessage->setWordWrap( true );
  m_pMessage->setTextFormat( Qt::PlainText );
  m_pClose = new QPushButton( tr( "&Close" ), this );
  m_pClose->setAutoDefault( false );
  connect( m_pClose, &QPushButton::clicked, this, &QDialog::close );

  auto* const pBottom = new QHBoxLayout;
  pBottom->addWidget( m_pMessage, 1 );
  pBottom->addWidget( m_pClose );
  auto* const pLayout = new QVBoxLayout( this );
  pLayout->addWidget( m_pSearch );
  pLayout->addWidget( m_pNothing, 1 );
  pLayout->addWidget( m_pScroll, 1 );
  pLayout->addLayout( pBottom );
}

void VPreferencesWindow::Watch( std::shared_ptr< ZEK::IPostalService > i_pPostal )
{
  // An entry's word covers all entries below it.
  ZEK::IStore& rStore = *m_rEditor.Store();
  m_StoreConnection = rStore.RegisterHandler( { { rStore.GetEntry( HostServices::PreferencesRoot ) }, {} } )
                          ->CreateProxy( ZEK::ChangeMask::All, ZEK::IHandlerCallback::LatestOnly )
                          .Connect(
                              [pThis = QPointer< VPreferencesWindow >( this )]( auto, auto )
                              {
                                if ( pThis && pThis->isVisible() )
                                {
                                  pThis->Refresh();
                                }
                              },
                              std::move( i_pPostal ) );
  m_FailedConnection = m_rEditor.Failed().Connect(
      [this]( const QString& i_rWhy )
      {
        m_pMessage->setText( i_rWhy );
      },
      nullptr );
}

void VPreferencesWindow::Refresh()
{
  std::vector< VPreferenceSection > Sections;
  {
    const ZEK::VStoreReadScope Scope( *m_rEditor.Store() );
    Sections = ReadPreferenceItems( *Scope, m_rEditor.Store()->GetEntry( HostServices::PreferencesRoot ) );
  }
  if ( Sections != m_pPage->Sections )
  {
    m_pPage->Sections = std::move( Sections );
    MakePage();
  }
  ShowValues();
}

void VPreferencesWindow::ShowValues()
{
  const ZEK::VStoreReadScope Scope( *m_rEditor.Store() );
  for ( const VPage::VPart& rPart : m_pPage->Parts )
  {
    for ( VPreferenceRow* const pRow : rPart.Rows )
    {
      pRow->Refresh( *Scope );
    }
  }
}

void VPreferencesWindow::MakePage()
{
  ZEK::IStoreReader::Entry pFocus = nullptr;
  for ( const VPage::VPart& rPart : m_pPage->Parts )
  {
    for ( const VPreferenceRow* const pRow : rPart.Rows )
    {
      pFocus = pRow->HasFocus() ? pRow->Item().pEntry : pFocus;
    }
  }
  m_pPage->Parts.clear();
  VPreferenceRow* pFocused = nullptr;
  auto* const pInside = new QWidget;
  auto* const pGrid = new QGridLayout( pInside );
  pGrid->setColumnStretch( 0, 2 );
  pGrid->setColumnStretch( 1, 3 );
  pGrid->setHorizontalSpacing( 12 );
  QSet< QChar > Used{ 'c' };
  for ( const VPreferenceSection& rSection : m_pPage->Sections )
  {
    VPage::VPart Part;
    Part.pTitle = new QLabel( rSection.Title, pInside );
    Part.pTitle->setTextFormat( Qt::PlainText );
    QFont Font = Part.pTitle->font();
    Font.setBold( true );
    Font.setPointSizeF( Font.pointSizeF() * 1.15 );
    Part.pTitle->setFont( Font );
    Part.pTitle->setContentsMargins( 0, m_pPage->Parts.empty() ? 0 : 14, 0, 2 );
    pGrid->addWidget( Part.pTitle, pGrid->rowCount(), 0, 1, 3 );
    if ( !rSection.Text.isEmpty() )
    {
      Part.pText = new QLabel( rSection.Text, pInside );
      Part.pText->setTextFormat( Qt::PlainText );
      Part.pText->setWordWrap( true );
      Part.pText->setForegroundRole( QPalette::PlaceholderText );
      pGrid->addWidget( Part.pText, pGrid->rowCount(), 0, 1, 3 );
    }
    for ( const VPreferenceItem& rItem : rSection.Items )
    {
      Part.Rows.push_back( new VPreferenceRow( rItem, WithMnemonic( rItem.Text, Used ), m_rEditor, *pGrid, pInside ) );
      connect( Part.Rows.back(), &VPreferenceRow::Changed, m_pMessage, &QLabel::clear );
      pFocused = rItem.pEntry == pFocus ? Part.Rows.back() : pFocused;
    }
    m_pPage->Parts.push_back( std::move( Part ) );
  }
  pGrid->setRowStretch( pGrid->rowCount(), 1 );
  m_pScroll->setWidget( pInside );
  MakeTabOrder();
  Search();
  if ( pFocused )
  {
    pFocused->TakeFocus();
  }
}

void VPreferencesWindow::MakeTabOrder()
{
  QWidget* pBefore = m_pSearch;
  const QList< QWidget* > Widgets = m_pScroll->widget()->findChildren< QWidget* >();
  for ( QWidget* const pWidget : Widgets )
  {
    // A spin box holds a line of its own that the box speaks for, and a combo box a window of its own.
    if ( ( pWidget->focusPolicy() & Qt::TabFocus ) != 0 && !pWidget->focusProxy() && pWidget->window() == window() )
    {
      setTabOrder( pBefore, pWidget );
      pBefore = pWidget;
    }
  }
  setTabOrder( pBefore, m_pClose );
}

void VPreferencesWindow::Search()
{
  const QString Wanted = m_pSearch->text().trimmed();
  bool bAny = false;
  for ( std::size_t i = 0; i < m_pPage->Parts.size(); ++i )
  {
    const VPage::VPart& rPart = m_pPage->Parts[i];
    bool bShown = false;
    for ( VPreferenceRow* const pRow : rPart.Rows )
    {
      const bool bMatches = MatchesSearch( m_pPage->Sections[i], pRow->Item(), Wanted );
      pRow->SetVisible( bMatches );
      bShown = bShown || bMatches;
    }
    rPart.pTitle->setVisible( bShown );
    if ( rPart.pText )
    {
      rPart.pText->setVisible( bShown );
    }
    bAny = bAny || bShown;
  }
  m_pNothing->setText( Wanted.isEmpty() ? tr( "There are no preferences." )
                                        : tr( "No preference has “%1” in it." ).arg( Wanted ) );
  m_pNothing->setVisible( !bAny );
  m_pScroll->setVisible( bAny );
}

void VPreferencesWindow::keyPressEvent( QKeyEvent* io_pEvent )
{
  if ( io_pEvent->key() != Qt::Key_Escape )
  {
    QDialog::keyPressEvent( io_pEvent );
    return;
  }
  // What is unfinished is given up first: text in a field, then the search, then the window.
  for ( const VPage::VPart& rPart : m_pPage->Parts )
  {
    for ( VPreferenceRow* const pRow : rPart.Rows )
    {
      if ( pRow->Revert() )
      {
        return;
      }
    }
  }
  if ( !m_pSearch->text().isEmpty() )
  {
    m_pSearch->clear();
    return;
  }
  QDialog::keyPressEvent( io_pEvent );
}

void VPreferencesWindow::changeEvent( QEvent* io_pEvent )
{
  QDialog::changeEvent( io_pEvent );
  if ( io_pEvent->type() == QEvent::PaletteChange )
  {
    // Icons and notes have colours of their own. Later, for the page is among those that hear of this now.
    QMetaObject::invokeMethod(
        this,
        [this]
        {
          MakePage();
          ShowValues();
        },
        Qt::QueuedConnection );
  }
}

void VPreferencesWindow::showEvent( QShowEvent* io_pEvent )
{
  Refresh();
  m_pMessage->clear();
  m_pSearch->setFocus( Qt::OtherFocusReason );
  QDialog::showEvent( io_pEvent );
}

} // namespace HostWindow

#include <HostWindow/Panels.h>

#include <QtCore/QDateTime>
#include <QtGui/QFontDatabase>
#include <QtWidgets/QHBoxLayout>
#include <QtWidgets/QPushButton>
#include <QtWidgets/QScrollBar>
#include <QtWidgets/QStyle>
#include <QtWidgets/QToolButton>
#include <QtWidgets/QVBoxLayout>

namespace HostWindow
{
namespace
{
constexpr int LogPaceMs = 250;
} // namespace

VMessageBar::VMessageBar( QWidget* i_pParent )
  : QToolBar( tr( "Messages" ), i_pParent )
{
  setObjectName( "MessageBar" );
  setMovable( false );
  toggleViewAction()->setVisible( false );
  m_pText = new QLabel( this );
  m_pText->setWordWrap( true );
  m_pText->setTextFormat( Qt::PlainText );
  m_pText->setTextInteractionFlags( Qt::TextSelectableByMouse );
  m_pText->setContentsMargins( 8, 3, 8, 3 );
  m_pText->setSizePolicy( QSizePolicy::Expanding, QSizePolicy::Preferred );
  // A wrapped text alone would ask for a narrow and high strip.
  m_pText->setMinimumWidth( 480 );
  addWidget( m_pText );
  QAction* pClose = addAction( style()->standardIcon( QStyle::SP_TitleBarCloseButton ), tr( "Close this message" ) );
  connect( pClose, &QAction::triggered, this, &QWidget::hide );
  hide();
}

void VMessageBar::ShowMessage( const QString& i_rText, bool i_bFailure )
{
  m_pText->setText( i_rText );
  setStyleSheet( i_bFailure ? "#MessageBar { background: #5a2a2a; } QLabel { color: #ffe2de; }"
                            : "#MessageBar { background: #4d4325; } QLabel { color: #fff3d0; }" );
  show();
}

VLogPanel::VLogPanel( std::shared_ptr< ZEK::VLogRing > i_pRing, QWidget* i_pParent )
  : QDockWidget( tr( "Log" ), i_pParent )
  , m_pRing( std::move( i_pRing ) )
{
  setObjectName( "LogPanel" );
  auto* pInside = new QWidget( this );
  auto* pLayout = new QVBoxLayout( pInside );
  pLayout->setContentsMargins( 4, 4, 4, 4 );
  m_pLevel = new QComboBox( pInside );
  m_pLevel->setToolTip( tr( "Which lines are shown" ) );
  m_pLevel->addItem( tr( "Failures" ), int( ZEK::ELogFailure ) );
  m_pLevel->addItem( tr( "Failures and warnings" ), int( ZEK::ELogWarning ) );
  m_pLevel->addItem( tr( "Everything" ), 9 );
  m_pLevel->setCurrentIndex( 1 );
  auto* pClear = new QPushButton( tr( "Clear" ), pInside );
  pClear->setToolTip( tr( "Forget the lines so far" ) );
  auto* pRow = new QHBoxLayout;
  pRow->addWidget( m_pLevel );
  pRow->addStretch( 1 );
  pRow->addWidget( pClear );
  m_pLines = new QPlainTextEdit( pInside );
  m_pLines->setReadOnly( true );
  m_pLines->setLineWrapMode( QPlainTextEdit::NoWrap );
  m_pLines->setFont( QFontDatabase::systemFont( QFontDatabase::FixedFont ) );
  pLayout->addLayout( pRow );
  pLayout->addWidget( m_pLines, 1 );
  setWidget( pInside );

  m_Timer.setInterval( LogPaceMs );
  connect( &m_Timer, &QTimer::timeout, this,
           [this]
           {
             Refresh( false );
           } );
  connect( m_pLevel, &QComboBox::currentIndexChanged, this,
           [this]
           {
             Refresh( true );
           } );
  connect( pClear, &QPushButton::clicked, this,
           [this]
           {
             m_pRing->Clear();
             Refresh( true );
           } );
  connect( this, &QDockWidget::visibilityChanged, this,
           [this]( bool i_bVisible )
           {
             i_bVisible ? m_Timer.start() : m_Timer.stop();
             Refresh( i_bVisible );
           } );
}

void VLogPanel::Refresh( bool i_bAlways )
{
  const std::size_t Count = m_pRing->Count();
  if ( Count == m_Shown && !i_bAlways )
  {
    return;
  }
  m_Shown = Count;
  const int Level = m_pLevel->currentData().toInt();
  QStringList Lines;
  for ( const ZEK::VLogLine& rLine : m_pRing->Lines() )
  {
    if ( rLine.Level <= Level )
    {
      const auto When = std::chrono::duration_cast< std::chrono::milliseconds >( rLine.When.time_since_epoch() );
      Lines << QString( "%1  %2  %3: %4" )
                   .arg( QDateTime::fromMSecsSinceEpoch( When.count() ).toString( "hh:mm:ss.zzz" ) )
                   .arg( rLine.Level )
                   .arg( QString::fromStdString( rLine.Category ), QString::fromStdString( rLine.Text ) );
    }
  }
  m_pLines->setPlainText( Lines.join( '\n' ) );
  m_pLines->verticalScrollBar()->setValue( m_pLines->verticalScrollBar()->maximum() );
}

} // namespace HostWindow

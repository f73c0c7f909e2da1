#include <HostWindow/TransportBar.h>

#include "Icons.h"

#include <QtCore/QSignalBlocker>

#include <cmath>
#include <limits>

namespace HostWindow
{
namespace
{
constexpr double Rates[] = { 0.1, 0.25, 0.5, 1, 2, 4 };
constexpr int LivePaceMs = 100;
} // namespace

QString TimeText( double i_Seconds )
{
  const auto Milliseconds = static_cast< qint64 >( std::llround( std::max( 0.0, i_Seconds ) * 1000 ) );
  return QString( "%1:%2.%3" )
      .arg( Milliseconds / 60000 )
      .arg( Milliseconds / 1000 % 60, 2, 10, QChar( '0' ) )
      .arg( Milliseconds % 1000, 3, 10, QChar( '0' ) );
}

VTransportBar::VTransportBar( VSession& i_rSession, QWidget* i_pParent )
  : QWidget( i_pParent )
  , m_rSession( i_rSession )
  , m_pLayout( new QHBoxLayout( this ) )
{
  m_pLayout->setContentsMargins( 6, 2, 6, 2 );
  m_pLayout->setSpacing( 2 );
  AddMoves();
  AddPosition();
  AddModes();

  const auto pPostal = m_rSession.Host().Postal();
  m_StateConnection = m_rSession.Clock().StateChanged().Connect(
      [this]
      {
        ShowState();
      },
      pPostal );
  m_FrameConnection = m_rSession.Clock().FrameChanged().Connect(
      [this]
      {
        ShowPosition();
      },
      pPostal );
  connect( &m_rSession, &VSession::SourceChanged, this, &VTransportBar::ShowState );
  m_LiveTimer.setInterval( LivePaceMs );
  connect( &m_LiveTimer, &QTimer::timeout, this, &VTransportBar::ShowPosition );
  ShowState();
}

QToolButton* VTransportBar::AddButton( const char* i_pName, const QString& i_rToolTip,
                                       std::function< void() > i_OnClick )
{
  auto* pButton = new QToolButton( this );
  pButton->setObjectName( i_pName );
  pButton->setToolTip( i_rToolTip );
  pButton->setAutoRaise( true );
  // The keys belong to the views.
  pButton->setFocusPolicy( Qt::NoFocus );
  connect( pButton, &QToolButton::clicked, this, std::move( i_OnClick ) );
  m_pLayout->addWidget( pButton );
  return pButton;
}

void VTransportBar::AddMoves()
{
  auto& rClock = m_rSession.Clock();
  const QColor Text = palette().color( QPalette::WindowText );
  const auto AddMove = [&]( const char* i_pName, EIcon i_Icon, const QString& i_rToolTip, std::function< void() > i_Do )
  {
    QToolButton* pButton = AddButton( i_pName, i_rToolTip, std::move( i_Do ) );
    pButton->setIcon( MakeIcon( i_Icon, Text ) );
    m_NeedRecording.push_back( pButton );
    return pButton;
  };
  AddMove( "First", EIcon::First, tr( "To the first frame" ),
           [&rClock]
           {
             rClock.SeekFrame( 0 );
           } );
  AddMove( "StepBack", EIcon::StepBack, tr( "One frame back (Left)" ),
           [this]
           {
             Step( -1 );
           } );
  m_pPlay = AddMove( "Play", EIcon::Play, tr( "Play or pause (Space)" ),
                     [this]
                     {
                       TogglePlay();
                     } );
  AddMove( "StepForward", EIcon::StepForward, tr( "One frame on (Right)" ),
           [this]
           {
             Step( 1 );
           } );
  AddMove( "Last", EIcon::Last, tr( "To the last frame" ),
           [&rClock]
           {
             rClock.SeekFrame( rClock.FrameCount() - 1 );
           } );
}

void VTransportBar::AddPosition()
{
  m_pSlider = new QSlider( Qt::Horizontal, this );
  m_pSlider->setObjectName( "Scrub" );
  m_pSlider->setToolTip( tr( "Drag to any frame" ) );
  m_pSlider->setFocusPolicy( Qt::NoFocus );
  m_pSlider->setTracking( true );
  connect( m_pSlider, &QSlider::valueChanged, this,
           [this]( int i_Frame )
           {
             m_rSession.Clock().SeekFrame( i_Frame );
           } );
  m_pLayout->addWidget( m_pSlider, 1 );
  m_NeedRecording.push_back( m_pSlider );

  m_pTime = new QLabel( this );
  m_pTime->setObjectName( "Time" );
  m_pTime->setToolTip( tr( "Time from the first frame" ) );
  m_pFrame = new QLabel( this );
  m_pFrame->setObjectName( "Frame" );
  m_pFrame->setToolTip( tr( "The number that the recording gives to the frame" ) );
  for ( QLabel* pLabel : { m_pTime, m_pFrame } )
  {
    pLabel->setContentsMargins( 8, 0, 8, 0 );
    pLabel->setMinimumWidth( pLabel->fontMetrics().horizontalAdvance( "00:00.000 / 00:00.000" ) );
    m_pLayout->addWidget( pLabel );
  }
}

void VTransportBar::AddModes()
{
  m_pRate = new QComboBox( this );
  m_pRate->setObjectName( "Rate" );
  m_pRate->setToolTip( tr( "Speed of playing" ) );
  m_pRate->setFocusPolicy( Qt::NoFocus );
  for ( const double Rate : Rates )
  {
    m_pRate->addItem( QString( "%1×" ).arg( Rate ), Rate );
  }
  m_pRate->setCurrentIndex( m_pRate->findData( 1.0 ) );
  connect( m_pRate, &QComboBox::currentIndexChanged, this,
           [this]
           {
             (void)m_rSession.Clock().SetRate( m_pRate->currentData().toDouble() );
           } );
  m_pLayout->addWidget( m_pRate );
  m_NeedRecording.push_back( m_pRate );

  m_pLoop = AddButton( "Loop", tr( "Begin again at the end (L)" ),
                       [this]
                       {
                         m_rSession.Clock().SetLoop( m_pLoop->isChecked() );
                       } );
  m_pLoop->setCheckable( true );
  m_pLoop->setIcon( MakeIcon( EIcon::Loop, palette().color( QPalette::WindowText ) ) );
  m_pLoop->setShortcut( Qt::Key_L );
  m_NeedRecording.push_back( m_pLoop );

  m_pLive = AddButton( "Live", tr( "Show the simulated capture, or the recording again" ),
                       [this]
                       {
                         if ( m_rSession.IsLive() )
                         {
                           m_rSession.GoPlayback();
                         }
                         else
                         {
                           m_rSession.GoLive();
                         }
                         ShowState();
                       } );
  m_pLive->setText( tr( "Live" ) );
  m_pLive->setToolButtonStyle( Qt::ToolButtonTextBesideIcon );
  m_pLive->setIcon( MakeIcon( EIcon::Live, QColor( 0xe0, 0x4f, 0x4f ) ) );
  m_pLive->setCheckable( true );
}

void VTransportBar::TogglePlay()
{
  auto& rClock = m_rSession.Clock();
  if ( m_rSession.IsLive() || !rClock.HasRecording() )
  {
    return;
  }
  const bool bAtEnd = rClock.Rate() > 0 && rClock.CurrentTick() >= rClock.RangeEnd();
  if ( !rClock.IsPlaying() && bAtEnd && !rClock.IsLooping() )
  {
    rClock.Seek( rClock.RangeBegin() );
  }
  rClock.TogglePlay();
}

void VTransportBar::Step( int i_Frames )
{
  if ( !m_rSession.IsLive() && m_rSession.Clock().HasRecording() )
  {
    m_rSession.Clock().Step( i_Frames );
  }
}

void VTransportBar::ShowState()
{
  const auto& rClock = m_rSession.Clock();
  const bool bRecording = !m_rSession.IsLive() && rClock.HasRecording();
  for ( QWidget* pWidget : m_NeedRecording )
  {
    pWidget->setEnabled( bRecording );
  }
  m_pPlay->setIcon(
      MakeIcon( rClock.IsPlaying() ? EIcon::Pause : EIcon::Play, palette().color( QPalette::WindowText ) ) );
  m_pLoop->setChecked( rClock.IsLooping() );
  m_pLive->setChecked( m_rSession.IsLive() );
  const QSignalBlocker Quiet( m_pSlider );
  const std::int64_t Last = std::max< std::int64_t >( 0, rClock.FrameCount() - 1 );
  m_pSlider->setRange( 0, static_cast< int >( std::min< std::int64_t >( Last, std::numeric_limits< int >::max() ) ) );
  m_pSlider->setPageStep( std::max( 1, m_pSlider->maximum() / 20 ) );
  if ( m_rSession.IsLive() )
  {
    m_LiveTimer.start();
  }
  else
  {
    m_LiveTimer.stop();
  }
  ShowPosition();
}

void VTransportBar::ShowPosition()
{
  const HostSources::IFrameSource* pSource = m_rSession.Source();
  const std::int64_t Frame = std::max< std::int64_t >( 0, m_rSession.ShownFrame() );
  if ( !pSource )
  {
    return;
  }
  const double Seconds = static_cast< double >( Frame ) / pSource->RateHz();
  if ( m_rSession.IsLive() )
  {
    m_pTime->setText( TimeText( Seconds ) );
    m_pFrame->setText( tr( "Frame %1" ).arg( Frame ) );
    return;
  }
  const QSignalBlocker Quiet( m_pSlider );
  m_pSlider->setValue( static_cast< int >( Frame ) );
  const double Last = static_cast< double >( pSource->FrameCount() - 1 ) / pSource->RateHz();
  m_pTime->setText( TimeText( Seconds ) + " / " + TimeText( Last ) );
  m_pFrame->setText(
      tr( "Frame %1 (%2 of %3)" ).arg( pSource->FrameNumber( Frame ) ).arg( Frame + 1 ).arg( pSource->FrameCount() ) );
}

} // namespace HostWindow

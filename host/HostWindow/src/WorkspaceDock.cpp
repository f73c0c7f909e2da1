#include <HostWindow/WorkspaceDock.h>

#include <HostServices/VStateJson.h>

#include <HostWindow/ViewAction.h>

#include <QtGui/QCloseEvent>
#include <QtWidgets/QComboBox>
#include <QtWidgets/QHBoxLayout>
#include <QtWidgets/QLabel>

namespace HostWindow
{
namespace
{
constexpr const char* pPrefix = "Window";
} // namespace

VWorkspaceDock::VWorkspaceDock( VSession& i_rSession, std::string i_Kind, QWidget* i_pParent )
  : QDockWidget( i_pParent )
  , m_rSession( i_rSession )
  , m_Kind( std::move( i_Kind ) )
  , m_pInside( new QWidget( this ) )
  , m_pLayout( new QVBoxLayout( m_pInside ) )
{
  m_pLayout->setContentsMargins( 0, 0, 0, 0 );
  m_pLayout->setSpacing( 0 );
  setWidget( m_pInside );
  Rebuild();
}

VWorkspaceDock::~VWorkspaceDock()
{
  DropContent();
}

void VWorkspaceDock::DropContent()
{
  if ( m_pContent )
  {
    m_pContent->hide();
    m_pContent->setParent( nullptr );
    m_pContent.reset();
  }
  delete m_pToolbar.data();
}

void VWorkspaceDock::Rebuild()
{
  const QJsonObject State = SaveState();
  const int ViewType = View().ViewType();
  DropContent();
  const auto pContext = m_rSession.Context();
  const auto pFactory = m_rSession.Host().Factories()->Find( m_Kind );
  m_ContextName = pContext->Name();
  setWindowTitle( QString::fromStdString( m_Kind ) + QStringLiteral( " – " ) +
                  QString::fromStdString( m_ContextName ) );
  m_pToolbar = new QWidget( m_pInside );
  auto* pTools = new QHBoxLayout( m_pToolbar );
  pTools->setContentsMargins( 4, 2, 4, 2 );
  pTools->setSpacing( 4 );
  if ( pFactory )
  {
    pFactory->Create( m_pContent, pContext, m_pToolbar );
  }
  pTools->addStretch( 1 );
  m_pLayout->addWidget( m_pToolbar );
  if ( !m_pContent )
  {
    m_pLayout->addWidget( new QLabel( tr( "This window could not be made." ), m_pInside ), 1, Qt::AlignCenter );
    return;
  }
  m_pContent->setMinimumSize( 160, 120 );
  m_pLayout->addWidget( m_pContent.get(), 1 );
  if ( QQuickWidget* pWidget = View().Widget() )
  {
    pWidget->installEventFilter( this );
  }
  RestoreState( State );
  if ( ViewType > 0 )
  {
    SetViewType( ViewType );
  }
}

void VWorkspaceDock::SetViewType( int i_Index )
{
  const auto Boxes = m_pToolbar ? m_pToolbar->findChildren< QComboBox* >() : QList< QComboBox* >();
  for ( QComboBox* pBox : Boxes )
  {
    if ( pBox->itemText( i_Index ) == ViewTypeNames()[i_Index] )
    {
      pBox->setCurrentIndex( i_Index );
      return;
    }
  }
  View().SetViewType( i_Index );
}

void VWorkspaceDock::SetSeen( bool i_bSeen )
{
  if ( m_pContent )
  {
    m_pContent->setVisible( i_bSeen );
  }
}

QJsonObject VWorkspaceDock::SaveState() const
{
  HostServices::VStateJsonWriter Writer;
  if ( auto* pPersist = dynamic_cast< HarrowPluginInterface::IHarrowWindowPersist* >( m_pContent.get() ) )
  {
    pPersist->SaveState( Writer, pPrefix );
  }
  return Writer.Object();
}

void VWorkspaceDock::RestoreState( const QJsonObject& i_rState )
{
  auto* pPersist = dynamic_cast< HarrowPluginInterface::IHarrowWindowPersist* >( m_pContent.get() );
  if ( pPersist && !i_rState.isEmpty() )
  {
    pPersist->RestoreState( HostServices::VStateJsonReader( i_rState ), pPrefix );
  }
}

void VWorkspaceDock::closeEvent( QCloseEvent* io_pEvent )
{
  QDockWidget::closeEvent( io_pEvent );
  emit Closed( this );
}

bool VWorkspaceDock::eventFilter( QObject* io_pObject, QEvent* io_pEvent )
{
  if ( io_pEvent->type() == QEvent::FocusIn || io_pEvent->type() == QEvent::MouseButtonPress )
  {
    emit Activated( this );
  }
  return QDockWidget::eventFilter( io_pObject, io_pEvent );
}

} // namespace HostWindow

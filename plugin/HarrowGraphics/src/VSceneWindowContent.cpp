#include <HarrowGraphics/VSceneWindowContent.h>

#include "SceneOptionsState.h"

#include <QtWidgets/QComboBox>
#include <QtWidgets/QVBoxLayout>

namespace HarrowGraphics
{

VSceneWindowContent::VSceneWindowContent( std::string i_Name, const QPointer< QWidget >& i_rpToolbar,
                                          VSceneWidgetArguments i_Arguments )
  : m_Name( std::move( i_Name ) )
  , m_Kind( i_Arguments.Kind )
  , m_pWidget( new VQMLSceneWidget( std::move( i_Arguments ) ) )
{
  setWindowTitle( QString::fromStdString( m_Name ) );
  auto* const pLayout = new QVBoxLayout( this );
  pLayout->setContentsMargins( 0, 0, 0, 0 );
  pLayout->addWidget( m_pWidget );
  setFocusProxy( m_pWidget );
  if ( i_rpToolbar && i_rpToolbar->layout() )
  {
    FillToolbar( *i_rpToolbar );
  }
}

VSceneWindowContent::~VSceneWindowContent()
{
  // The host owns the toolbar and may keep it; the tools go with the window.
  delete m_pCameraType.data();
}

void VSceneWindowContent::FillToolbar( QWidget& io_rToolbar )
{
  if ( m_Kind == EWindowKindCameras )
  {
    return;
  }
  m_pCameraType = new QComboBox( &io_rToolbar );
  m_pCameraType->setObjectName( "CameraType" );
  m_pCameraType->addItems( { "Perspective", "Front", "Back", "Left", "Right", "Top", "Bottom" } );
  m_pCameraType->setFocusPolicy( Qt::NoFocus );
  m_pCameraType->setToolTip( tr( "The direction that the scene is seen from" ) );
  connect( m_pCameraType, &QComboBox::currentIndexChanged, m_pWidget, &VQMLSceneWidget::OnCameraTypeChanged );
  io_rToolbar.layout()->addWidget( m_pCameraType );
}

void VSceneWindowContent::SaveState( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& i_rPrefix )
{
  if ( const auto* const pItem = m_pWidget->SceneItem() )
  {
    WriteOptions( io_rWriter, i_rPrefix + "Options", pItem->Options() );
  }
}

void VSceneWindowContent::RestoreState( const HarrowPluginInterface::IStateReader& i_rReader, const QString& i_rPrefix )
{
  auto* const pItem = m_pWidget->SceneItem();
  if ( !pItem )
  {
    return;
  }
  MoxelGraphics::VSceneOptions Options;
  Options.CameraView = m_Kind == EWindowKindCameras;
  Options.Show3DOverlay = m_Kind != EWindowKindCameras;
  ReadOptions( i_rReader, i_rPrefix + "Options", Options );
  pItem->SetOptions( Options );
}

bool VSceneWindowContent::ExecuteCommand( const std::string& i_rText )
{
  return m_pWidget->ExecuteCommand( i_rText );
}

} // namespace HarrowGraphics

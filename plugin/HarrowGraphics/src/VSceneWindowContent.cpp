#include <HarrowGraphics/VSceneWindowContent.h>

#include "SceneOptionsState.h"

#include <HarrowGraphics/VHarrowSubjectScene.h>
#include <MoxelGraphics/VCameraGrid.h>
#include <ZEK/Log.h>

#include <QtCore/QJsonDocument>
#include <QtCore/QJsonObject>
#include <QtCore/QSignalBlocker>
#include <QtWidgets/QComboBox>
#include <QtWidgets/QPushButton>
#include <QtWidgets/QVBoxLayout>

namespace HarrowGraphics
{
namespace
{
/// What the state names; `o_rValue` stays as it is when there is no such thing.
template < typename T >
void ReadValue( const HarrowPluginInterface::IStateReader& i_rReader, const QString& i_rName, T& o_rValue )
{
  QVariant Value;
  const ZEK::IResult Result = i_rReader.Read( i_rName, QMetaType::fromType< T >(), Value );
  if ( Result.IsOk() )
  {
    o_rValue = Value.value< T >();
  }
  else if ( Result != ZEK::IResult::NotFound )
  {
    static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "HarrowGraphics" );
    ZEK::Log( rCategory, ZEK::ELogWarning, "The saved value %1% is left out: %2%", i_rName.toStdString(),
              Result.Text() );
  }
}
} // namespace

VSceneWindowContent::VSceneWindowContent( std::string i_Name, const QPointer< QWidget >& i_rpToolbar,
                                          VSceneWidgetArguments i_Arguments )
  : m_Name( std::move( i_Name ) )
  , m_Kind( i_Arguments.Kind )
  , m_bChoosesPoses( ( i_Arguments.FeatureFlags & HarrowPluginInterface::EFeatureSubjects ) != 0 )
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
  for ( const QPointer< QWidget >& rpTool : m_Tools )
  {
    delete rpTool.data();
  }
}

void VSceneWindowContent::FillToolbar( QWidget& io_rToolbar )
{
  if ( m_Kind == EWindowKindCameras )
  {
    AddCameraTools( io_rToolbar );
  }
  else
  {
    AddCameraTypes( io_rToolbar );
  }
  if ( m_Kind == EWindowKindSubject && m_bChoosesPoses )
  {
    AddPoses( io_rToolbar );
  }
}

void VSceneWindowContent::AddPoses( QWidget& io_rToolbar )
{
  m_pPose = new QComboBox( &io_rToolbar );
  m_pPose->setObjectName( "Pose" );
  m_pPose->setFocusPolicy( Qt::NoFocus );
  m_pPose->setSizeAdjustPolicy( QComboBox::AdjustToContents );
  m_pPose->setToolTip( tr( "The pose that the subjects stand in" ) );
  connect( m_pPose.data(), &QComboBox::activated, m_pWidget,
           [this]( int i_Index )
           {
             m_pWidget->setPoseIndex( static_cast< uint >( i_Index ) );
           } );
  connect( m_pWidget, &VQMLSceneWidget::PoseIndexChanged, this, &VSceneWindowContent::ShowPoses );
  connect( m_pWidget->SubjectScene(), &VHarrowSubjectScene::PosesChanged, this, &VSceneWindowContent::ShowPoses );
  io_rToolbar.layout()->addWidget( m_pPose );
  m_Tools << m_pPose.data();
  ShowPoses();
}

void VSceneWindowContent::ShowPoses()
{
  if ( !m_pPose )
  {
    return;
  }
  const QStringList Poses = m_pWidget->SubjectScene()->PoseNames();
  QStringList Shown;
  for ( int Index = 0; Index < m_pPose->count(); ++Index )
  {
    Shown << m_pPose->itemText( Index );
  }
  if ( Shown != Poses )
  {
    m_pPose->clear();
    m_pPose->addItems( Poses );
  }
  m_pPose->setEnabled( !Poses.isEmpty() );
  const uint Pose = m_pWidget->poseIndex();
  m_pPose->setCurrentIndex( Pose < static_cast< uint >( Poses.size() ) ? static_cast< int >( Pose ) : -1 );
}

void VSceneWindowContent::AddCameraTypes( QWidget& io_rToolbar )
{
  auto* const pTypes = new QComboBox( &io_rToolbar );
  pTypes->setObjectName( "CameraType" );
  pTypes->addItems( { "Perspective", "Front", "Back", "Left", "Right", "Top", "Bottom" } );
  pTypes->setFocusPolicy( Qt::NoFocus );
  pTypes->setToolTip( tr( "The direction that the scene is seen from" ) );
  connect( pTypes, &QComboBox::currentIndexChanged, m_pWidget, &VQMLSceneWidget::OnCameraTypeChanged );
  io_rToolbar.layout()->addWidget( pTypes );
  m_Tools << pTypes;
}

QPushButton* VSceneWindowContent::AddButton( QWidget& io_rToolbar, const QString& i_rName, const QString& i_rText )
{
  auto* const pButton = new QPushButton( i_rText, &io_rToolbar );
  pButton->setObjectName( i_rName );
  pButton->setFocusPolicy( Qt::NoFocus );
  io_rToolbar.layout()->addWidget( pButton );
  m_Tools << pButton;
  return pButton;
}

void VSceneWindowContent::AddCameraTools( QWidget& io_rToolbar )
{
  QPushButton* const pReset = AddButton( io_rToolbar, "ResetZoom", tr( "Reset Zoom" ) );
  pReset->setToolTip( tr( "Show the whole image of every camera again" ) );
  connect( pReset, &QPushButton::clicked, m_pWidget, &VQMLSceneWidget::OnResetZoomClicked );
  m_pPin = AddButton( io_rToolbar, "PinCameras", tr( "Pin" ) );
  m_pPin->setToolTip( tr( "Pin Cameras" ) );
  m_pPin->setCheckable( true );
  connect( m_pPin, &QPushButton::toggled, m_pWidget, &VQMLSceneWidget::OnPinCamerasToggled );
  m_pMaskPaint = AddButton( io_rToolbar, "MaskPaint", tr( "Mask" ) );
  connect( m_pMaskPaint, &QPushButton::clicked, m_pWidget, &VQMLSceneWidget::OnMaskPaintClicked );
  m_pMaskErase = AddButton( io_rToolbar, "MaskErase", tr( "Unmask" ) );
  connect( m_pMaskErase, &QPushButton::clicked, m_pWidget, &VQMLSceneWidget::OnMaskEraseClicked );
  m_pMaskEraseAll = AddButton( io_rToolbar, "MaskEraseAll", tr( "Unmask All" ) );
  connect( m_pMaskEraseAll, &QPushButton::clicked, m_pWidget, &VQMLSceneWidget::OnMaskEraseAllClicked );
  connect( m_pWidget, &VQMLSceneWidget::CameraSelectionChanged, this, &VSceneWindowContent::UpdateMaskButtons );
  UpdateMaskButtons();
}

void VSceneWindowContent::UpdateMaskButtons()
{
  const bool bOne = m_pWidget->SelectedCameras().size() == 1;
  const QString Why = bOne ? QString() : tr( " (Mask editing disabled when multiple cameras selected)" );
  const auto Show = [&]( const QPointer< QPushButton >& i_rpButton, const QString& i_rText )
  {
    if ( i_rpButton )
    {
      i_rpButton->setEnabled( bOne );
      i_rpButton->setToolTip( i_rText + Why );
    }
  };
  Show( m_pMaskPaint, bOne ? tr( "Paint mask on selected area" ) : tr( "Paint mask on area" ) );
  Show( m_pMaskErase, bOne ? tr( "Erase mask on selected area" ) : tr( "Erase mask on area" ) );
  Show( m_pMaskEraseAll, tr( "Erase entire mask" ) );
}

void VSceneWindowContent::SaveState( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& i_rPrefix )
{
  if ( const auto* const pItem = m_pWidget->SceneItem() )
  {
    WriteOptions( io_rWriter, i_rPrefix + "Options", pItem->Options() );
  }
  if ( m_Kind == EWindowKindCameras )
  {
    SaveCameras( io_rWriter, i_rPrefix );
  }
  if ( m_Kind == EWindowKindSubject )
  {
    io_rWriter.Write( i_rPrefix + "PoseIndex", m_pWidget->poseIndex() );
  }
}

void VSceneWindowContent::SaveCameras( HarrowPluginInterface::IStateWriter& io_rWriter, const QString& i_rPrefix )
{
  const MoxelGraphics::VCameraGrid& rGrid = m_pWidget->CameraGrid();
  MoxelGraphics::VCameraGrid::VURNs Cameras;
  QStringList Tiles;
  const bool bPinned = rGrid.GetPinnedCameras( Cameras, Tiles );
  QStringList Selected = ( bPinned ? Cameras : rGrid.ShownCameras() ).values();
  Selected.sort();
  io_rWriter.Write( i_rPrefix + "Selected", Selected );
  io_rWriter.Write( i_rPrefix + "Pinned", bPinned );
  io_rWriter.Write(
      i_rPrefix + "Views",
      QString::fromUtf8(
          QJsonDocument( QJsonObject::fromVariantMap( rGrid.SaveViews() ) ).toJson( QJsonDocument::Compact ) ) );
}

void VSceneWindowContent::RestoreState( const HarrowPluginInterface::IStateReader& i_rReader, const QString& i_rPrefix )
{
  if ( m_Kind == EWindowKindCameras )
  {
    RestoreCameras( i_rReader, i_rPrefix );
  }
  if ( m_Kind == EWindowKindSubject )
  {
    uint Pose = m_pWidget->poseIndex();
    ReadValue( i_rReader, i_rPrefix + "PoseIndex", Pose );
    m_pWidget->setPoseIndex( Pose );
  }
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

void VSceneWindowContent::RestoreCameras( const HarrowPluginInterface::IStateReader& i_rReader,
                                          const QString& i_rPrefix )
{
  MoxelGraphics::VCameraGrid& rGrid = m_pWidget->CameraGrid();
  QStringList Selected;
  bool bPinned = false;
  QString Views;
  ReadValue( i_rReader, i_rPrefix + "Selected", Selected );
  ReadValue( i_rReader, i_rPrefix + "Pinned", bPinned );
  ReadValue( i_rReader, i_rPrefix + "Views", Views );
  const MoxelGraphics::VCameraGrid::VURNs Cameras( Selected.begin(), Selected.end() );
  if ( !bPinned )
  {
    rGrid.SetShownCameras( Cameras );
  }
  rGrid.SetPinnedCameras( Cameras, bPinned );
  if ( m_pPin )
  {
    const QSignalBlocker Blocker( *m_pPin );
    m_pPin->setChecked( bPinned );
  }
  rGrid.ResetViews();
  rGrid.RestoreViews( QJsonDocument::fromJson( Views.toUtf8() ).object().toVariantMap() );
}

bool VSceneWindowContent::ExecuteCommand( const std::string& i_rText )
{
  return m_pWidget->ExecuteCommand( i_rText );
}

} // namespace HarrowGraphics

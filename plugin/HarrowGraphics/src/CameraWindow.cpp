// What a scene widget does as the window of a context's cameras.

#include <HarrowGraphics/VQMLSceneWidget.h>

#include "CameraReport.h"

#include <Flow2Graphics/VFlowRenderCameraProvider.h>
#include <Flow2Graphics/VFlowScene.h>
#include <MoxelGraphics/VCameraGrid.h>
#include <MoxelGraphics/VCameraGridSelection.h>

namespace HarrowGraphics
{
namespace
{
constexpr std::uint8_t Masked = 0xFF;
constexpr std::uint8_t Unmasked = 0;
} // namespace

void VQMLSceneWidget::StartCameraWindow()
{
  if ( m_Arguments.pSelection )
  {
    m_pGridSelection = std::make_unique< MoxelGraphics::VCameraGridSelection >( m_pCameraGrid, m_Arguments.pSelection,
                                                                                m_Arguments.pPostal );
    m_pCameraSelection = m_Arguments.pSelection->ForKinds( { ZEK::ESelectDevice, ZEK::ESelectMaskCell } );
    m_SelectionConnection = m_pCameraSelection->Connect(
        [pSelf = QPointer( this )]
        {
          if ( pSelf )
          {
            emit pSelf->CameraSelectionChanged();
          }
        },
        m_Arguments.pPostal );
  }
  if ( m_Arguments.pActivityMode )
  {
    m_ActivityConnection = m_Arguments.pActivityMode->Changed().Connect(
        [pSelf = QPointer( this )]
        {
          if ( pSelf )
          {
            pSelf->OnActivityChanged();
          }
        },
        m_Arguments.pPostal );
    OnActivityChanged();
  }
}

void VQMLSceneWidget::OnActivityChanged()
{
  if ( m_pSceneItem )
  {
    m_pSceneItem->setOption( "CameraWandSmear", m_Arguments.pActivityMode->Name() == "Camera Calibration" );
  }
}

QStringList VQMLSceneWidget::SelectedCameras() const
{
  QStringList URNs;
  ZEK::VSelection Devices;
  if ( m_Arguments.pSelection )
  {
    m_Arguments.pSelection->Get( ZEK::ISelectionService::EPrimary, { ZEK::ESelectDevice }, Devices );
  }
  for ( const ZEK::VSelectionItem& rItem : Devices )
  {
    const QString URN = QString::fromStdString( rItem.Device );
    if ( m_pCameraGrid->HasCamera( URN ) )
    {
      URNs << URN;
    }
  }
  return URNs;
}

void VQMLSceneWidget::OnResetZoomClicked()
{
  m_pCameraGrid->ResetViews();
}

void VQMLSceneWidget::OnPinCamerasToggled( bool i_bChecked )
{
  m_pCameraGrid->PinTiles( i_bChecked );
}

void VQMLSceneWidget::PaintMask( std::uint8_t i_Value )
{
  const QStringList Cameras = SelectedCameras();
  if ( Cameras.size() != 1 || !m_Arguments.pWidgetService )
  {
    return;
  }
  const std::string URN = Cameras.front().toStdString();
  ZEK::VSelection Selected;
  m_Arguments.pSelection->Get( ZEK::ISelectionService::EPrimary, { ZEK::ESelectMaskCell }, Selected );
  std::vector< std::uint32_t > Cells;
  for ( const ZEK::VSelectionItem& rItem : Selected )
  {
    if ( rItem.Device == URN )
    {
      Cells.push_back( rItem.Sub );
    }
  }
  if ( !Cells.empty() )
  {
    m_Arguments.pWidgetService->SetMaskCells( URN, Cells, i_Value );
  }
}

void VQMLSceneWidget::OnMaskPaintClicked()
{
  PaintMask( Masked );
}

void VQMLSceneWidget::OnMaskEraseClicked()
{
  PaintMask( Unmasked );
}

void VQMLSceneWidget::OnMaskEraseAllClicked()
{
  const QStringList Cameras = SelectedCameras();
  if ( Cameras.size() == 1 && m_Arguments.pWidgetService )
  {
    m_Arguments.pWidgetService->ClearMask( Cameras.front().toStdString() );
  }
}

QVariantList VQMLSceneWidget::cameraReport() const
{
  const auto* const pScene = dynamic_cast< const Flow2Graphics::VFlowScene* >( m_Arguments.pScene.get() );
  const auto pCameras = pScene ? pScene->CameraProvider() : nullptr;
  if ( m_Arguments.Kind != EWindowKindCameras || !m_pSceneItem || !pCameras )
  {
    return {};
  }
  return CameraReport( *m_pCameraGrid, *pCameras, m_pSceneItem->Options() );
}

bool VQMLSceneWidget::ExecuteCameraCommand( const std::string& i_rText )
{
  if ( i_rText == "WorkspaceCamera:ResetZoom" )
  {
    OnResetZoomClicked();
    return true;
  }
  if ( i_rText == "WorkspaceCamera:EnableGreyscale" || i_rText == "WorkspaceCamera:DisableGreyscale" )
  {
    if ( m_pSceneItem )
    {
      m_pSceneItem->setOption( "CameraGreyscale", i_rText == "WorkspaceCamera:EnableGreyscale" );
    }
    return true;
  }
  if ( i_rText == "WorkspaceCamera:MaskPaint" )
  {
    OnMaskPaintClicked();
    return true;
  }
  if ( i_rText == "WorkspaceCamera:MaskErase" )
  {
    OnMaskEraseClicked();
    return true;
  }
  if ( i_rText == "WorkspaceCamera:MaskEraseAll" )
  {
    OnMaskEraseAllClicked();
    return true;
  }
  return false;
}

} // namespace HarrowGraphics

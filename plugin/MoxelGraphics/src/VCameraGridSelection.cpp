#include <MoxelGraphics/VCameraGridSelection.h>

namespace MoxelGraphics
{
namespace
{
ZEK::VSelectionItem DeviceItem( const QString& i_rURN )
{
  return { ZEK::ESelectDevice, i_rURN.toStdString(), 0, 0 };
}
} // namespace

VCameraGridSelection::VCameraGridSelection( std::shared_ptr< VCameraGrid > i_pGrid,
                                            std::shared_ptr< ZEK::ISelectionService > i_pSelection,
                                            const std::shared_ptr< ZEK::IPostalService >& i_rpPostal )
  : m_pGrid( std::move( i_pGrid ) )
  , m_pSelection( std::move( i_pSelection ) )
{
  if ( !m_pGrid || !m_pSelection )
  {
    return;
  }
  m_Connections.push_back( m_pSelection->ForKinds( { ZEK::ESelectDevice, ZEK::ESelectMaskCell } )
                               ->Connect(
                                   [this]
                                   {
                                     OnSelectionChanged();
                                   },
                                   i_rpPostal ) );
  m_Connections.push_back( m_pGrid->TileRequested().Connect(
      [this]( const QStringList& i_rURNs )
      {
        OnTilesRequested( i_rURNs );
      },
      nullptr ) );
  m_Signals.push_back( QObject::connect( m_pGrid.get(), &VCameraGrid::CamerasChanged, m_pGrid.get(),
                                         [this]
                                         {
                                           OnCamerasChanged();
                                         } ) );
  // Tiles that came back find out whether their devices are selected.
  m_Signals.push_back( QObject::connect( m_pGrid.get(), &VCameraGrid::modelReset, m_pGrid.get(),
                                         [this]
                                         {
                                           m_pGrid->SetSelectionItems( Devices() );
                                         } ) );
  OnSelectionChanged();
}

VCameraGridSelection::~VCameraGridSelection()
{
  for ( const QMetaObject::Connection& rSignal : m_Signals )
  {
    QObject::disconnect( rSignal );
  }
}

ZEK::VSelection VCameraGridSelection::Devices() const
{
  ZEK::VSelection Devices;
  m_pSelection->Get( ZEK::ISelectionService::EPrimary, { ZEK::ESelectDevice }, Devices );
  return Devices;
}

void VCameraGridSelection::OnSelectionChanged()
{
  const ZEK::VSelection Selected = Devices();
  VCameraGrid::VURNs Shown;
  for ( const ZEK::VSelectionItem& rItem : Selected )
  {
    if ( const QString URN = QString::fromStdString( rItem.Device ); m_pGrid->HasCamera( URN ) )
    {
      Shown.insert( URN );
    }
  }
  m_pGrid->SetShownCameras( Shown );
  m_pGrid->SetSelectionItems( Selected );
}

void VCameraGridSelection::OnCamerasChanged()
{
  // Without a selected device, what the window was restored with stays shown.
  if ( !Devices().empty() )
  {
    OnSelectionChanged();
  }
}

void VCameraGridSelection::OnTilesRequested( const QStringList& i_rURNs )
{
  ZEK::VSelection Selection = m_pSelection->Get( ZEK::ISelectionService::EPrimary );
  std::erase_if( Selection,
                 []( const ZEK::VSelectionItem& i_rItem )
                 {
                   return i_rItem.Kind == ZEK::ESelectDevice;
                 } );
  for ( const QString& rURN : i_rURNs )
  {
    Selection.push_back( DeviceItem( rURN ) );
  }
  m_pSelection->Set( ZEK::ISelectionService::EPrimary, std::move( Selection ) );
  // A selection that was so already announces nothing, and the grid may show something else.
  OnSelectionChanged();
}

} // namespace MoxelGraphics

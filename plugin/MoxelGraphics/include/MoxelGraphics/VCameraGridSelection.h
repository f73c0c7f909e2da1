#pragma once

#include <MoxelGraphics/VCameraGrid.h>

#include <ZEK/Selection.h>

#include <memory>
#include <vector>

namespace MoxelGraphics
{

/// Ties a grid to the selection, for as long as it lives: the selected cameras are the shown ones, none selected shows
/// all, and what a person asks of the grid becomes the selected cameras. Selected devices that are no cameras do not
/// count. Thread: GUI.
class VCameraGridSelection
{
public:
  /// With a null postal service the selection must change on the GUI thread alone.
  VCameraGridSelection( std::shared_ptr< VCameraGrid > i_pGrid, std::shared_ptr< ZEK::ISelectionService > i_pSelection,
                        const std::shared_ptr< ZEK::IPostalService >& i_rpPostal );
  ~VCameraGridSelection();
  VCameraGridSelection( const VCameraGridSelection& ) = delete;
  VCameraGridSelection& operator=( const VCameraGridSelection& ) = delete;

private:
  void OnSelectionChanged();
  void OnCamerasChanged();
  void OnTilesRequested( const QStringList& i_rURNs );
  /// The selected devices.
  ZEK::VSelection Devices() const;

  std::shared_ptr< VCameraGrid > m_pGrid;
  std::shared_ptr< ZEK::ISelectionService > m_pSelection;
  std::vector< ZEK::VConnection > m_Connections;
  std::vector< QMetaObject::Connection > m_Signals;
};

} // namespace MoxelGraphics

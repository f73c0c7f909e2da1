#pragma once

#include <MoxelGraphics/ICameraModelAdditionalDataSource.h>
#include <MoxelGraphics/VCameraDefinition.h>
#include <MoxelGraphics/VCameraTile.h>

#include <ZEK/Callback.h>
#include <ZEK/Selection.h>
#include <ZEK/Shared.h>

#include <QtCore/QAbstractListModel>
#include <QtCore/QHash>
#include <QtCore/QSet>
#include <QtCore/QSize>
#include <QtCore/QStringList>

#include <memory>
#include <vector>

class QKeyEvent;
class QMouseEvent;
class QWheelEvent;

namespace MoxelGraphics
{

/// Whether both name one device: its video may come under its name with "vi:" or "vf:" before it.
bool IsSameDevice( QStringView i_A, QStringView i_B );

/// Lays the cameras of a 2D view out as tiles of one frame, and remembers the zoom and pan of each. A list model with a
/// row a tile for documents; views draw from `Snapshot`.
///
/// Thread: GUI. What `Snapshot` gives may be read anywhere.
class VCameraGrid : public QAbstractListModel, public ZEK::VShared
{
  Q_OBJECT
  Q_PROPERTY( float aspectRatio READ AspectRatio NOTIFY AspectRatioChanged )
  Q_PROPERTY( int count READ Count NOTIFY CountChanged )

public:
  using VURNs = QSet< QString >;

  enum ERole
  {
    TileUserId = Qt::UserRole + 1, ///< decimal text
    TileType,                      ///< no value
    TileDisplayType,
    TileDeviceURN,
    TileRect, ///< QRectF, item units, y down
    TileVideo,
    TileVideoInput,    ///< the URN begins with "vi:"
    TileVideoFile,     ///< the URN begins with "vf:"
    TileSelectionItem, ///< a map of "kind", "device", "object", "sub"; no value when the device is not selected
    TileAdditionalData ///< a map; empty when nothing is known
  };
  Q_ENUM( ERole )

  /// `i_bSingleView`: tiles fill their cells; otherwise they begin with a margin.
  explicit VCameraGrid( bool i_bSingleView, QObject* i_pParent = nullptr );
  ~VCameraGrid() override;

  /// All cameras there are, in the order of their tiles. Those without a URN, and the second of one URN, have no tile.
  void SetCameras( std::vector< VCameraDefinition > i_Cameras );
  /// Those to show; none stands for all.
  void SetShownCameras( const VURNs& i_rShown );
  const VURNs& ShownCameras() const { return m_Shown; }
  /// While cameras are pinned they are shown in place of the shown ones. `i_bPinned` false forgets the set and lets the
  /// shown ones be shown again.
  void SetPinnedCameras( const VURNs& i_rPinned, bool i_bPinned = true );
  /// Pins the cameras of the present tiles, or lets them go.
  void PinTiles( bool i_bPinned );
  /// The pinned cameras and the URNs of the tiles; whether cameras are pinned.
  bool GetPinnedCameras( VURNs& o_rPinned, QStringList& o_rTiles ) const;
  /// Whether one of the cameras is that device, shown or not.
  bool HasCamera( const QString& i_rURN ) const;

  /// `i_bRotated`: images stand as their cameras are mounted; `i_bSnapped`: to quarter turns.
  void SetRotation( bool i_bRotated, bool i_bSnapped );
  /// Role 265: the devices among the items. Other kinds are passed over.
  void SetSelectionItems( const ZEK::VSelection& i_rSelection );
  /// Role 266. The source is asked for each tile now, and again whenever it changed; null ends that.
  void SetAdditionalDataSource( std::shared_ptr< ICameraModelAdditionalDataSource > i_pSource,
                                std::shared_ptr< ZEK::IPostalService > i_pPostal );

  /// The frame in device pixels, and how many of them an item unit has.
  void Resize( QSize i_Size, float i_PixelRatio );
  QSize FrameSize() const { return m_FrameSize; }
  float PixelRatio() const { return m_PixelRatio; }

  // Events are in item units with `i_Ratio` device pixels each. True when they meant something here.
  bool MousePress( const QMouseEvent& i_rEvent, double i_Ratio );
  bool MouseMove( const QMouseEvent& i_rEvent, double i_Ratio );
  /// Ends the gesture of that button.
  void MouseRelease( const QMouseEvent& i_rEvent );
  void EndGesture();
  bool Wheel( const QWheelEvent& i_rEvent, double i_Ratio );
  bool DoubleClick( const QMouseEvent& i_rEvent, double i_Ratio );
  bool KeyPress( const QKeyEvent& i_rEvent );

  /// The first tile that holds the point, in pixels of the frame from its top left; -1 when there is none.
  int TileAt( QPoint i_Point ) const;
  /// Of the only tile's image as it stands on screen; 1 unless there is exactly one.
  float AspectRatio() const;
  int Count() const { return static_cast< int >( m_Tiles.size() ); }
  const VCameraTiles& Tiles() const { return m_Tiles; }
  /// The tiles as they are now; the same object until one of them changes. Null without tiles.
  VCameraTilesRef Snapshot() const;

  /// Fires with the URNs of the cameras that a person wants to see; an empty list stands for all. Whoever listens calls
  /// `SetShownCameras`.
  ZEK::IMultiCallback< void( QStringList ) >& TileRequested() { return m_TileRequested; }

  /// Zoom and pan of each tile that is not as it began, by URN; ready for JSON.
  QVariantMap SaveViews() const;
  /// Takes what `SaveViews` gave; a camera that is not there yet gets its part when it comes. What is no such thing is
  /// passed over.
  void RestoreViews( const QVariantMap& i_rViews );

  int rowCount( const QModelIndex& i_rParent = {} ) const override;
  QVariant data( const QModelIndex& i_rIndex, int i_Role ) const override;
  QHash< int, QByteArray > roleNames() const override;

public slots:
  void ResetViews();

signals:
  void AspectRatioChanged();
  void CountChanged();
  /// Another list of cameras was set.
  void CamerasChanged();
  /// A tile's zoom or pan changed, or where it stands: what was drawn is out of date.
  void ViewsChanged();

private:
  struct VView
  {
    float Zoom, PanX, PanY;
  };

  VView DefaultView() const;
  bool IsShown( const QString& i_rURN ) const;
  VCameraTile MakeTile( const VCameraDefinition& i_rCamera );
  VCameraTiles MakeTiles();
  void Rebuild();
  void TakeInPlace( VCameraTiles i_Tiles );
  void TakeAnew( VCameraTiles i_Tiles );
  void ReadAdditionalData( bool i_bReport );
  void LayOut();
  void Report( const QList< int >& i_rRoles );
  void Touch();
  VCameraTile* Pressed();
  void Zoom( VCameraTile& io_rTile, int i_Way );
  void Pan( VCameraTile& io_rTile, QPoint i_Way );

  bool m_bSingleView;
  float m_PixelRatio = 1.0f;
  QSize m_FrameSize{ 0, 0 };
  std::vector< VCameraDefinition > m_Cameras;
  VCameraTiles m_Tiles;
  QHash< QString, int > m_Index; ///< of a tile by URN
  VURNs m_Shown;
  VURNs m_Pinned;
  bool m_bPinned = false;
  QHash< QString, ZEK::VSelectionItem > m_SelectionItems; ///< by the tile's URN
  QHash< QString, QVariantMap > m_AdditionalData;
  std::shared_ptr< ICameraModelAdditionalDataSource > m_pSource;
  ZEK::VConnection m_SourceConnection;
  QHash< QString, VView > m_Restored; ///< of cameras that did not come yet
  QPoint m_PressPoint;                ///< pixels of the frame, y down
  QString m_PressedURN;
  VView m_PressedView{};
  bool m_bZooming = false;
  bool m_bPanning = false;
  bool m_bRotated = false;
  bool m_bSnapped = false;
  ZEK::VMultiCallback< void( QStringList ) > m_TileRequested;
  mutable VCameraTilesRef m_pSnapshot; ///< null when out of date
};

} // namespace MoxelGraphics

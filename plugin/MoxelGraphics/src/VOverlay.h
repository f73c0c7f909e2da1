#pragma once

#include <ZEK/Selection.h>

#include <QtCore/QList>
#include <QtCore/QObject>
#include <QtCore/QSizeF>
#include <QtGui/QMatrix4x4>
#include <QtGui/QVector3D>

#include <cstdint>
#include <string>
#include <vector>

namespace CoreGraphics
{
struct VCameraFields;
}

namespace MoxelGraphics
{
class VMoxelScene;

/// A camera as a view's last frame showed it.
struct VOverlayCamera
{
  std::string DeviceURN;
  std::int32_t UserId = -1;
  QVector3D Position;
  bool bSelected = false;
  bool bPreselected = false;

  friend bool operator==( const VOverlayCamera&, const VOverlayCamera& ) = default;
};

/// A name tag as a view's last frame showed it.
struct VOverlaySubject
{
  ZEK::VSelectionItem Item;
  std::string Name;
  QVector3D Position;
  bool bCurrent = false;
  bool bSelected = false;

  friend bool operator==( const VOverlaySubject&, const VOverlaySubject& ) = default;
};

/// What documents draw over a view: collected from the scene where item and renderer meet, turned into objects of
/// the GUI thread afterwards.
class VOverlay
{
public:
  /// Reads the scene; true when something differs from the last time. Thread: render thread, GUI thread held.
  bool Collect( VMoxelScene& io_rScene, const CoreGraphics::VCameraFields& i_rCamera, QSizeF i_ItemSize );

  const std::vector< VOverlayCamera >& Cameras() const { return m_Cameras; }
  const std::vector< VOverlaySubject >& Subjects() const { return m_Subjects; }
  /// A camera is selected or lies under the pointer.
  bool IsCameraHeld() const { return m_bCameraHeld; }

private:
  /// All that places of cameras depend on.
  struct VSeen
  {
    const void* pScene = nullptr;
    std::uint64_t Cameras = 0, Selection = 0;
    QMatrix4x4 ToClip;
    QSizeF Size;

    friend bool operator==( const VSeen&, const VSeen& ) = default;
  };

  bool CamerasMoved( const VMoxelScene& i_rScene );
  void CollectSelection( const VMoxelScene& i_rScene );
  bool CollectCameras( VMoxelScene& io_rScene );
  bool CollectSubjects( VMoxelScene& io_rScene );
  QVector4D ToClip( const QVector3D& i_rPoint ) const;
  QPointF ToItem( const QVector4D& i_rClip ) const;

  std::vector< VOverlayCamera > m_Cameras;
  std::vector< VOverlaySubject > m_Subjects;
  std::vector< VOverlayCamera > m_NewCameras;
  std::vector< VOverlaySubject > m_NewSubjects;
  ZEK::VSelection m_Selected;
  ZEK::VSelection m_Preselected;
  std::uint64_t m_SelectionGeneration = 0;
  bool m_bCameraHeld = false;
  VSeen m_Seen;
  QMatrix4x4 m_View;
  QMatrix4x4 m_ToClip;
  QSizeF m_Size;
};

/// Brings the objects up to date with the records; objects of what stays are kept. True when one came or went.
bool UpdateCameraObjects( QList< QObject* >& io_rObjects, const std::vector< VOverlayCamera >& i_rCameras,
                          QObject& io_rParent );
bool UpdateSubjectObjects( QList< QObject* >& io_rObjects, std::vector< ZEK::VSelectionItem >& io_rKeys,
                           const std::vector< VOverlaySubject >& i_rSubjects, QObject& io_rParent );

} // namespace MoxelGraphics

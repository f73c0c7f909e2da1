#pragma once

#include <QtCore/QPoint>
#include <QtCore/QSize>
#include <QtGui/QMatrix4x4>
#include <QtGui/QVector3D>
#include <QtGui/QVector4D>

#include <span>

class QMouseEvent;
class QWheelEvent;

namespace CoreGraphics
{

class VRenderContext;

enum EViewType : int
{
  EViewPerspective = 0,
  EViewFront,
  EViewBack,
  EViewLeft,
  EViewRight,
  EViewTop,
  EViewBottom,
  ViewTypeCount
};

/// "Perspective", "Front", …; empty for a number that is no view type.
const char* ViewTypeName( int i_ViewType );

/// What a camera controller holds.
struct VCameraFields
{
  QMatrix4x4 projection;
  QMatrix4x4 view;
  QMatrix4x4 lockPose;
  float nearPlane = 1.0f;     ///< mm
  float farPlane = 100000.0f; ///< mm
  float fieldOfView = 45.0f;  ///< degrees, vertical
  float tilt = -60.0f;        ///< degrees, about X
  float azimuth = 45.0f;      ///< degrees, about Z
  float distance = 7000.0f;   ///< mm from the centre
  float orthoScale = 4.0f;    ///< mm per pixel
  QVector3D centre;           ///< mm; the point orbited
  QSize viewportSize{ 0, 0 }; ///< device pixels
  QPoint lastPosition;        ///< device pixels
  bool panning = false;
  bool orbiting = false;
  bool zooming = false;
  bool yUp = false;
  int viewType = EViewPerspective;
};

/// The free camera of a 3D view: its projection, its view, and the gesture under way. Owned by the view's item and
/// shared with its renderer. Thread: events on the GUI thread; `Step`, `Apply`, `SetSize` on the render thread.
class VCameraController
{
public:
  VCameraController() = default;
  virtual ~VCameraController() = default;

  /// Rebuilds the view matrix.
  virtual void Step();

  const VCameraFields& Fields() const { return m_Fields; }
  /// Device pixels.
  void SetSize( const QSize& i_rSize );
  void SetYUp( bool i_bYUp );
  int GetViewType() const { return m_Fields.viewType; }
  /// A number that is no view type changes nothing.
  void SetViewType( int i_ViewType );
  bool IsOrthographic() const { return m_Fields.viewType != EViewPerspective; }
  /// To the first pose, or to that of a view locked to an object. The height (y) of the centre is kept.
  void Reset( bool i_bLockedView );
  /// The pose that a perspective camera follows.
  void SetLockPose( const QMatrix4x4& i_rPose );

  /// `i_Ratio`: device pixels per item pixel.
  void OnMousePress( const QMouseEvent& i_rEvent, double i_Ratio );
  void OnMouseMove( const QMouseEvent& i_rEvent, double i_Ratio );
  void OnMouseRelease( const QMouseEvent& i_rEvent, double i_Ratio );
  void OnWheel( const QWheelEvent& i_rEvent );
  /// Takes a Qt::Key. True when the key means something here.
  bool OnKeyPress( int i_Key );

  /// Centres on spheres (x, y, z, radius); with `i_bFit` also moves so that all are seen. No spheres: no change.
  void SetFocusPoints( std::span< const QVector4D > i_Points, bool i_bFit );

  /// Gives projection, view, viewport and frame size to the context.
  void Apply( VRenderContext& io_rContext ) const;

private:
  QMatrix4x4 Rotation() const;
  void RebuildProjection();
  void FitOrthographic( std::span< const QVector4D > i_Points );
  void FitPerspective( std::span< const QVector4D > i_Points );

  VCameraFields m_Fields;
};

} // namespace CoreGraphics

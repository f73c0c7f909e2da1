#pragma once

#include <MoxelGraphics/ETracking.h>
#include <MoxelGraphics/VCameraTile.h>
#include <MoxelGraphics/VSceneOptions.h>
#include <MoxelGraphics/VSelectionRegistry.h>

#include <ZEK/Selection.h>

#include <QtCore/QElapsedTimer>
#include <QtCore/QPoint>
#include <QtCore/QRect>
#include <QtCore/QSize>
#include <QtCore/QString>
#include <QtCore/QVariantMap>
#include <QtGui/QVector4D>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

class QOpenGLFramebufferObject;
class QPainter;

namespace CoreGraphics
{
class VCameraController;
class VRenderContext;
} // namespace CoreGraphics

namespace MoxelGraphics
{
class VMoxelScene;

/// What a view asks of its next frame. Points are pixels of the frame from its top left.
struct VFrameInput
{
  bool bVisible = true;
  bool bReporting = false; ///< measure with glFinish after each stage
  VSceneOptions Options;
  VCameraTilesRef Tiles; ///< of a camera view; null: it shows nothing
  QPoint Pointer;
  QPoint BandStart;
  int PickMode = EPickNone;
  ZEK::ESelectionEdit Edit = ZEK::ESelectionEdit::Replace; ///< travels with the pick's result
  int PreselectColour = 0;                                 ///< 0 no modifier, 1 Shift, 2 Shift and Control, 3 Control
  float PixelRatio = 1.0f;
  ETracking Tracking = ETrackNone;
  ZEK::VSelection TrackedSelection;
  bool bFit = false; ///< move the camera so that the tracked selection fills the view
};

/// What the last pick found.
struct VPickResult
{
  std::uint64_t Serial = 0; ///< grows with each pick
  int Mode = -1;            ///< the pick mode of the frame that picked; -1 when the last frame did not
  ZEK::ESelectionEdit Edit = ZEK::ESelectionEdit::Replace;
  ZEK::VSelection Selection;
  std::vector< std::string > Labels;
  std::vector< std::uint32_t > Ids;
  int Layers = 0;
};

struct VFrameFigures
{
  double UpdateMs = 0; ///< bringing the render types up to date
  double SelectMs = 0;
  double HighlightMs = 0;
  double DrawMs = 0;
  std::uint64_t DrawCalls = 0; ///< of the whole frame
  std::uint64_t BytesUploaded = 0;
  std::uint64_t Frames = 0; ///< drawn since the start
};

/// Draws the frames of one view of a scene: the fixed sequence of picking, highlight mask, visible passes and
/// overlay. Runs in any current OpenGL context, with or without Qt Quick: one object per view, all calls with the
/// same context current. Thread: render thread.
class VSceneFrame
{
public:
  VSceneFrame( std::shared_ptr< VMoxelScene > i_pScene,
               std::shared_ptr< CoreGraphics::VCameraController > i_pController );
  ~VSceneFrame();

  /// A target for `Render` as the views have it: with depth, multisampled in a free view on desktop OpenGL where
  /// the device can do it. Null when the device refuses every form.
  static std::unique_ptr< QOpenGLFramebufferObject > MakeTarget( QSize i_Size, bool i_bMultisampled );

  /// Makes the off-screen targets for a frame of that size in device pixels. `Input` is read.
  void Resize( QSize i_Size );
  QSize Size() const { return m_Size; }
  VFrameInput& Input() { return m_Input; }
  const VFrameInput& Input() const { return m_Input; }

  /// Draws into the target, which is bound and has the size of `Resize`. The caller's OpenGL state is not kept.
  /// False when nothing was drawn: not visible, no size, or a context that the scene cannot be drawn in.
  bool Render( QOpenGLFramebufferObject& io_rTarget );

  const VPickResult& Result() const { return m_Result; }
  const VFrameFigures& Figures() const { return m_Figures; }
  /// Vendor, renderer, version, GLSL version, profile, width, height and samples; empty before the first frame.
  const QVariantMap& Gl() const { return m_Gl; }
  /// What a person should know about this view; empty when all is well.
  const QString& Notice() const { return m_Notice; }
  const std::shared_ptr< VMoxelScene >& Scene() const { return m_pScene; }
  CoreGraphics::VCameraController& Controller() { return *m_pController; }
  /// Null before the first frame.
  CoreGraphics::VRenderContext* Context() { return m_pContext.get(); }

private:
  bool Prepare();
  void Begin();
  void DrawVisible( QOpenGLFramebufferObject& io_rTarget );
  double Lap();
  void ReadGl( const QOpenGLFramebufferObject& i_rTarget );
  void UpdateCamera();
  /// Of a free view that looks through a camera: all of its image, in the middle of the frame.
  const QVector4D& ViewThroughCamera();
  void CollectPoints( const std::vector< VScenePoint >& i_rPoints );
  void SelectAndHighlight();
  bool IsBand() const;
  void PickPoint();
  int PickBand();
  int PickLayers( const QRect& i_rBand, const VCameraTile* i_pTile );
  void PickAnalytically( const QRect& i_rBand, const VCameraTile* i_pTile );
  bool Take( std::uint32_t i_Id );
  /// Of a camera view, one tile or nothing.
  void Draw( const QRect& i_rScissor, const VCameraTile* i_pTile );
  void Highlight();
  void DrawView();
  void DrawAllTiles();
  bool AreTilesAgain() const;
  /// Where a pick looks: the tile under a point, pixels from the top left; null when there is none.
  const VCameraTile* TileUnderPointer( QPoint i_Point ) const;
  void DrawTile( const VCameraTile& i_rTile, const QRect& i_rViewport, const QRect& i_rScissor );
  void PaintTiles( QPainter& io_rPainter );
  void PaintOverlay( const QOpenGLFramebufferObject& i_rTarget );

  std::shared_ptr< VMoxelScene > m_pScene;
  std::shared_ptr< CoreGraphics::VCameraController > m_pController;
  std::unique_ptr< CoreGraphics::VRenderContext > m_pContext;
  /// What the last walk through the tiles was about.
  struct VTileWalk
  {
    VCameraTilesRef Tiles;
    VSceneOptions Options;
    QSize Size;
    int RenderMode = -1;
    std::uint64_t Number = 0; ///< of the scene's walk
    std::uint64_t Updates = 0;
    bool bCollected = false; ///< nothing was drawn meanwhile
  };
  VTileWalk m_TileWalk;
  /// The camera that a free view last looked through, and how.
  struct VThrough
  {
    QString URN;
    std::uint64_t Cameras = 0; ///< generation of the scene's cameras
    QSize Size;
    bool bRotated = false, bSnapped = false;
    QVector4D View2D;
  };
  VThrough m_Through;
  std::unique_ptr< QOpenGLFramebufferObject > m_pSelectionTarget;
  std::unique_ptr< QOpenGLFramebufferObject > m_pOutlineTarget;
  VFrameInput m_Input;
  VPickResult m_Result;
  VFrameFigures m_Figures;
  QVariantMap m_Gl;
  QString m_Notice;
  QSize m_Size;
  bool m_bRefused = false;
  bool m_bAtHome = false; ///< the view has shown what the scene wants to be shown at first
  QRect m_DirtyMask;      ///< of the selection target, what is not known to be clear
  QElapsedTimer m_Clock;
  std::vector< std::uint32_t > m_Pixels;
  std::vector< std::uint32_t > m_Found; ///< in the order in which they were found
  std::vector< std::uint32_t > m_Analytic;
  std::vector< QVector4D > m_Points;
};

} // namespace MoxelGraphics

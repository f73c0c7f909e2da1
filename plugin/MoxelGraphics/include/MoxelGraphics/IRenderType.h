#pragma once

// Adding a kind of object to the 3D view
//
// 1. Here: a class VRenderThing deriving from IRenderType, one header and one source of that name. Its constructor
//    takes the scene's resources and keeps them; it fetches its programs by their names in the shader catalogue.
//    Data comes in through setters of its own, which know nothing of states and items.
// 2. In Flow2Graphics: VFlowRenderThing, deriving from VRenderThing and IFlowRenderType, whose update turns a state
//    into calls of those setters. It takes its selection ids there, in every update, from the scene's
//    VSelectionRegistry - one range for all its objects - and touches geometry only when a value id changed.
// 3. One line in the scene's creation list, at the place where it is to be drawn.
//
// What Render has to do: leave at once unless mode, pass and options concern it; UseProgram, and leave when it says
// false (a source that does not compile costs this type its draw and nothing else); SetRenderState; buffers; draw.
// In modes 1 and 2 the selection program of the pair writes ids, objects with id 0 or that IgnoreId names stay out,
// and in mode 2 a type with nothing selected or preselected does not touch OpenGL. Many equal objects are one
// buffer and one instanced draw: see VSphereHelper.h. Nothing is allocated in Render, neither memory nor ids.

#include <CoreGraphics/VRenderState.h>

#include <cstdint>
#include <vector>

class QPainter;
class QRect;

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{
struct VSceneOptions;

/// `VRenderContext`'s render mode: visible colours; every object writes its selection word, to be read back; selected
/// and preselected objects write theirs into the highlight mask.
using CoreGraphics::ERenderMode;
using CoreGraphics::ERenderModeHighlight;
using CoreGraphics::ERenderModeNormal;
using CoreGraphics::ERenderModeSelection;

enum ERenderPass : std::uint32_t
{
  ERenderPassOpaque = 0,
  ERenderPassTranslucent = 1,
  ERenderPassOverlay = 2 ///< after the depth buffer was cleared: on top of the world
};

/// One kind of object in a scene. Thread: render thread, with the view's context current.
class IRenderType
{
public:
  virtual ~IRenderType() = default;
  virtual void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                       std::uint32_t i_Pass ) = 0;
  /// Ends the tiles of a camera view: draws, for all of them at once and over each tile's world, what `Render` has only
  /// collected since the view was cleared. In `Render` the tile is the context's viewport, scissor and `View2D`, and
  /// the camera `VSceneOptions::OverlayCamera`. Viewport and scissor are the whole frame here, or what of it is looked
  /// at by a pick. With the scene's `TilesAgain` the tiles of the last call are drawn once more: nothing changed, so
  /// the view did not call `Render` for them.
  virtual void RenderTiles( CoreGraphics::VRenderContext& /*io_rContext*/, const VSceneOptions& /*i_rOptions*/ ) {}
  /// Text and 2D decoration on top of the finished frame. A type that overrides this overrides `WantsPaint` too.
  virtual void Paint( QPainter& /*io_rPainter*/, CoreGraphics::VRenderContext& /*io_rContext*/,
                      const VSceneOptions& /*i_rOptions*/ )
  {
  }
  /// Appends the ids of objects that a band takes by computation, apart from the pixels. `i_rRect` is in pixels of
  /// the context's frame, y up.
  virtual void PickInRect( CoreGraphics::VRenderContext& /*io_rContext*/, const VSceneOptions& /*i_rOptions*/,
                           const QRect& /*i_rRect*/, std::vector< std::uint32_t >& /*io_rIds*/ )
  {
  }
  /// Whether `Paint` has work in this frame; a frame in which nobody has is spared the painter.
  virtual bool WantsPaint( const VSceneOptions& /*i_rOptions*/ ) const { return false; }
};

} // namespace MoxelGraphics

#pragma once

// How render types draw many spheres: each owns a VSphereBatch per kind, fills it when its data change, and hands it
// to the scene's VSphereHelper in Render. One batch is one buffer write when it changed and one instanced draw; a
// batch that did not change touches no buffer, and a batch without anything selected is not drawn into the
// highlight mask at all. A pick draws only the spheres that reach into its window, gathered anew for each draw.

#include <MoxelGraphics/VSelectionRegistry.h>

#include <QtGui/QMatrix4x4>

#include <array>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>

class QRect;

namespace CoreGraphics
{
class VMesh;
class VRenderContext;
class VResources;
} // namespace CoreGraphics

namespace MoxelGraphics
{
class VMoxelScene;

/// How the spheres of a batch are sized in one draw.
struct VSphereSizing
{
  float FixedRadius = -1.0f; ///< mm; negative: each sphere's own
  float Scale = 1.0f;
  friend bool operator==( const VSphereSizing&, const VSphereSizing& ) = default;
};

class VPickWindow;

/// A sphere as a pick draws it.
struct VPickedSphere
{
  VScenePoint Sphere;
  std::uint32_t Flags = 0; ///< EInstanceFlag bits, and from bit 8 on how many ids were left out before it
};

/// How large spheres are on the screen.
struct VSphereExtent
{
  float Largest = 0;         ///< radius in pixels
  std::size_t FineCount = 0; ///< how many are large enough for the fine mesh
};

/// The spheres of one kind. Geometry, colours and selection are set apart, and each is taken to the GPU only after
/// it was set anew. Thread: render thread; OpenGL objects are made when it is first drawn.
class VSphereBatch
{
public:
  VSphereBatch();
  ~VSphereBatch();

  /// World positions and radii in mm. A sphere whose position is not finite is kept, so that indices hold, and is
  /// neither drawn nor picked; its radius is then negative. Colours and flags are kept while the count is the same.
  void SetSpheres( std::span< const VScenePoint > i_Spheres );
  /// One colour for all, red, green, blue, alpha, 0 to 1.
  void SetColour( const std::array< float, 4 >& i_rColour );
  /// A colour each, 0xAABBGGRR; as many as there are spheres, others are ignored.
  void SetColours( std::span< const std::uint32_t > i_Colours );
  /// The ids of the present state: sphere i has `i_FirstId` + i, or none of them when it is 0.
  /// `i_Flags` is empty, or holds for each sphere the bits of its word from EIdSelected up, shifted down by 21.
  void SetIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags );

  std::size_t Count() const { return m_Spheres.size(); }
  bool IsEmpty() const { return m_Spheres.empty(); }
  const std::vector< VScenePoint >& Spheres() const { return m_Spheres; }
  std::uint32_t FirstId() const { return m_FirstId; }
  /// Whether any sphere is selected or preselected.
  bool AnyMarked() const { return m_MarkedEnd > m_MarkedBegin; }

private:
  friend class VSphereHelper;
  struct VGl;

  /// What `Extent` found for a view; a still frame need not look at each sphere again.
  struct VSeen
  {
    QMatrix4x4 ViewProjection;
    float PixelsAtOne = 0;
    VSphereSizing Sizing;
    std::uint64_t Generation = 0;
    VSphereExtent Extent;
  };

  /// Takes spheres that all have numbers and a size; false, with the spheres half taken, when there are others.
  bool TakeOrdinary( std::span< const VScenePoint > i_Spheres );
  /// Below `i_Small` pixels an upper bound does.
  VSphereExtent Extent( CoreGraphics::VRenderContext& io_rContext, const VSphereSizing& i_rSizing, float i_Small );
  VSphereExtent MeasureEach( const QVector4D& i_rDepth, float i_PixelsAtOne, const VSphereSizing& i_rSizing ) const;
  /// Appends those of the spheres from `i_First` to `i_End` that reach into the window and are not ignored.
  VSphereExtent Gather( const VPickWindow& i_rWindow, const VSphereSizing& i_rSizing, const VMoxelScene& i_rScene,
                        std::uint32_t i_First, std::uint32_t i_End, std::vector< VPickedSphere >& io_rPicked ) const;
  bool UploadSpheres( const VSphereSizing& i_rSizing );
  bool UploadColours();
  bool UploadFlags();

  std::vector< VScenePoint > m_Spheres;
  std::vector< std::uint32_t > m_Colours; ///< empty: one colour
  std::array< float, 4 > m_Colour{ 1, 1, 1, 1 };
  std::vector< std::uint8_t > m_Flags; ///< as many as spheres, or empty: none set
  std::uint32_t m_FirstId = 0;
  std::uint32_t m_MarkedBegin = 0, m_MarkedEnd = 0; ///< all selected and preselected ones lie in between
  std::array< float, 3 > m_BoxMin{}, m_BoxMax{};
  float m_LargestRadius = 0;
  bool m_bOrdinary = false; ///< all are drawn, with the radius that they have
  std::uint64_t m_SpheresGeneration = 1;
  std::uint64_t m_ColoursGeneration = 1;
  std::uint64_t m_FlagsGeneration = 1;
  std::array< VSeen, 4 > m_Seen; ///< as many views may look at the scene in turn
  std::size_t m_NextSeen = 0;
  std::unique_ptr< VGl > m_pGl;
};

/// Draws batches of spheres, and knows what a band pick drew since the last clear so that the band can be tested
/// against it. One per scene; the scene makes a new one for each of its views, so nobody keeps it.
class VSphereHelper
{
public:
  explicit VSphereHelper( std::shared_ptr< CoreGraphics::VResources > i_pResources );
  ~VSphereHelper();

  /// The start of a view: nothing is drawn yet.
  void Clear();
  /// Whether draws in the selection mode are remembered for `PickInRect`: only a band pick wants that.
  void Remember( bool i_bOn );
  /// How many draws are remembered.
  std::size_t Remembered() const { return m_Drawn.size(); }
  /// Draws the batch as the context's render mode asks; in the selection mode only what reaches into its scissor.
  /// The batch must live until the next `Clear`.
  void Draw( CoreGraphics::VRenderContext& io_rContext, const VMoxelScene& i_rScene, VSphereBatch& io_rBatch,
             const VSphereSizing& i_rSizing );
  /// Appends the id of every remembered sphere whose centre lies in the rectangle, bounds included, unless it lies
  /// behind the eye. The rectangle is in pixels of the context's frame, y up, and the spheres stand in its viewport.
  void PickInRect( const CoreGraphics::VRenderContext& i_rContext, const QRect& i_rRect,
                   std::vector< std::uint32_t >& io_rIds ) const;

private:
  struct VGl;
  struct VDrawn
  {
    const VSphereBatch* pBatch = nullptr;
    QMatrix4x4 ViewProjection;
    VSphereSizing Sizing;
  };

  void DrawPicked( CoreGraphics::VRenderContext& io_rContext, const VMoxelScene& i_rScene, VSphereBatch& io_rBatch,
                   const VSphereSizing& i_rSizing );
  void DrawGathered( CoreGraphics::VRenderContext& io_rContext, std::uint32_t i_FirstId,
                     const VSphereExtent& i_rExtent );
  bool Feed( CoreGraphics::VRenderContext& io_rContext, VSphereBatch& io_rBatch, const VSphereSizing& i_rSizing,
             CoreGraphics::VMesh* i_pMesh, std::uint32_t i_First );

  std::shared_ptr< CoreGraphics::VResources > m_pResources;
  std::unique_ptr< VGl > m_pGl;
  bool m_bRemembering = false;
  std::vector< VDrawn > m_Drawn;
  std::vector< VPickedSphere > m_Picked;
};

} // namespace MoxelGraphics

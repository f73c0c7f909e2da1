#pragma once

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VCameraDefinition.h>
#include <MoxelGraphics/VSelectionRegistry.h>

#include <HarrowPluginInterface/IHarrowServices.h>
#include <ZEK/Callback.h>
#include <ZEK/Selection.h>
#include <ZEK/Shared.h>

#include <QtCore/QObject>
#include <QtCore/QString>
#include <QtCore/QVariantMap>

#include <array>
#include <atomic>
#include <cstdint>
#include <memory>
#include <mutex>
#include <span>
#include <string>
#include <unordered_map>
#include <vector>

class QPainter;
class QRect;

namespace CoreGraphics
{
class VRenderContext;
class VResources;
} // namespace CoreGraphics

namespace MoxelGraphics
{
struct VSceneOptions;
class VSphereHelper;

/// Draws what lies behind the world in a camera view; the answer says whether the world is to follow.
class IRenderBackdrop
{
public:
  virtual ~IRenderBackdrop() = default;
  virtual bool RenderBackdrop( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions ) = 0;
};

/// A function that the render thread runs whenever it brings the scene up to date, until `bDone` is set.
struct VRenderCallback
{
  std::function< void() > Function;
  std::atomic< bool > bDone{ false };
};

/// A name tag in the world.
struct VSceneLabel
{
  ZEK::VSelectionItem Item;
  std::array< float, 3 > Position{}; ///< mm
  bool bFlag = false;                ///< the item is the current one
  std::string Text;
};

/// Everything that is drawn in the views of one context: render types in the order of drawing, the selection table,
/// the sphere helper, and work that waits for the render thread.
///
/// Thread: made and destroyed on the GUI thread; everything else runs on the render thread, but for `MarkDirty`,
/// `AddRenderCallback`, `SetYUp`, `YUp`, `GetSelection` and `SelectCamera`, which any thread may call.
class VMoxelScene : public QObject, public ZEK::VShared
{
  Q_OBJECT
public:
  /// Each reference may be null: no override folders; nothing ever selected; no meshes; changes of the selection
  /// are made on the caller's thread. `i_bDeveloperMode` shows the scene's statistics in every view.
  VMoxelScene( std::shared_ptr< HarrowPluginInterface::IRenderResources > i_pRenderResources,
               std::shared_ptr< ZEK::ISelectionService > i_pSelectionService,
               std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > i_pMeshCache,
               std::shared_ptr< ZEK::IPostalService > i_pPostalService, bool i_bDeveloperMode );
  ~VMoxelScene() override;

  /// Runs in the first frame of every view. An override calls the base first, then makes its render types unless
  /// the render list holds some already. Only the sphere helper is replaced: fetch it at each use.
  virtual void Initialise( CoreGraphics::VRenderContext& io_rContext );
  /// Runs before a frame when `IsPending`; true when a callback ran. An override calls the base, then, when
  /// `TakeDirty` says true, brings its render types up to date; finding nothing to show it calls `MarkDirty` again.
  virtual bool ProcessPending();
  /// The spheres that bound a selection; those that nobody knows are left out. None in the base.
  virtual std::vector< VScenePoint > GetSelectionPositions( const ZEK::VSelection& i_rSelection );
  /// False unless the selection is one item that has a pose. False in the base.
  virtual bool GetSelectionPose( const ZEK::VSelection& i_rSelection, VScenePose& o_rPose );
  /// The items of ids of the present state, and the labels of those that have one. None in the base.
  virtual ZEK::VSelection ResolveIds( std::span< const std::uint32_t > i_Ids, std::vector< std::string >& o_rLabels );
  /// Empty unless exactly one camera is selected. Empty in the base.
  virtual QString GetSelectedCameraURN();
  /// Makes the named item the whole selection or preselection. Nothing in the base.
  virtual void SelectDevice( const QString& i_rName, bool i_bPreselect );
  /// Spheres that a free view shows all of at first, as soon as there are some. None in the base: views start alike.
  virtual std::vector< VScenePoint > HomePoints() { return {}; }
  /// What a view's report tells of the scene beside the frame. Thread: GUI. Nothing in the base.
  virtual QVariantMap SceneReport() { return {}; }

  // What a frame does, in the order of a frame.
  bool IsPending() const { return m_pFlags->bPending.load( std::memory_order_acquire ); }
  void SetIgnoredIds( std::span< const std::uint32_t > i_Ids );
  /// Adds to them; false when the id was among them.
  bool AddIgnoredId( std::uint32_t i_Id );
  /// What a render type asks before it draws an object: `i_Word` is the object's selection word.
  bool IgnoreId( std::uint32_t i_Word, int i_RenderMode ) const;
  /// What the running band pick has found already, in the order of finding.
  std::span< const std::uint32_t > IgnoredIds() const { return m_IgnoredIds; }
  bool IsIgnored( std::uint32_t i_Id ) const
  {
    const std::uint32_t Id = i_Id & EIdMask;
    return Id / IdsPerWord < m_IgnoredBits.size() && ( m_IgnoredBits[Id / IdsPerWord] >> Id % IdsPerWord & 1u ) != 0;
  }
  /// The start of a view; `i_rScissor` is all that it will touch, in pixels, y up.
  void Clear( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, const QRect& i_rScissor );
  void Clear( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );
  void DrawScene( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );
  void RenderPass( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, std::uint32_t i_Pass );
  /// After the last tile of a camera view: every type draws what it collected from them.
  void DrawTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );
  /// A view goes through its tiles. As long as its number is the one of the last walk, types hold what they collected.
  std::uint64_t BeginTileWalk() { return ++m_TileWalk; }
  std::uint64_t TileWalk() const { return m_TileWalk; }
  /// True in `DrawTiles` when the view did not go through its tiles because all is as it was: types then draw once more
  /// what they collected last.
  bool TilesAgain() const { return m_bTilesAgain; }
  void SetTilesAgain( bool i_bAgain ) { m_bTilesAgain = i_bAgain; }
  /// Grows each time the scene may have been brought up to date.
  std::uint64_t UpdateCount() const { return m_UpdateCount; }
  void DrawPost( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );
  bool WantsPaint( const VSceneOptions& i_rOptions ) const;
  void Paint( QPainter& io_rPainter, CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions );
  void PickInRect( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, const QRect& i_rRect,
                   std::vector< std::uint32_t >& io_rIds );

  /// Whether the highlight mask of the view that is being drawn shows anything. Set by the view, read by post types.
  bool IsHighlighted() const { return m_bHighlighted; }
  void SetHighlighted( bool i_bHighlighted ) { m_bHighlighted = i_bHighlighted; }

  /// Whether the frame is measured or kept: it shows at once what others come to by and by. Set by the view.
  bool IsSettled() const { return m_bSettled; }
  void SetSettled( bool i_bSettled ) { m_bSettled = i_bSettled; }

  /// What is selected now.
  ZEK::VSelection GetSelection() const;
  Q_INVOKABLE void SelectCamera( QString i_rDeviceURN, bool i_bPreselect );

  /// What the view shows is out of date: the next frame runs `ProcessPending` with the dirty flag set.
  void MarkDirty();
  void AddRenderCallback( std::shared_ptr< VRenderCallback > i_pCallback );
  void SetYUp( bool i_bYUp ) { m_bYUp.store( i_bYUp, std::memory_order_relaxed ); }
  bool YUp() const { return m_bYUp.load( std::memory_order_relaxed ); }

  /// Sorts and, when the list then differs from the one at hand, takes it and raises the generation. The second of one
  /// URN is left out.
  void SetCameraDefinitions( std::vector< VCameraDefinition > i_Definitions );
  const std::vector< VCameraDefinition >& CameraDefinitions() const { return m_CameraDefinitions; }
  std::uint64_t CameraGeneration() const { return m_CameraGeneration; }

  /// Adds a label under an id unless the id has one, at 100 mm above the higher of its position and `i_Top`.
  void AddLabel( int i_Id, const ZEK::VSelectionItem& i_rItem, const std::array< float, 3 >& i_rPosition, float i_Top,
                 bool i_bSecond, bool i_bFlag, const std::string& i_rText );
  void ClearLabels();
  /// Pointers into the scene, good until its next update: the first map's labels, and the second's with `i_bBoth`.
  std::vector< const VSceneLabel* > GetLabels( bool i_bBoth ) const;

  const std::shared_ptr< CoreGraphics::VResources >& Resources() const { return m_pResources; }
  VSelectionRegistry& Registry() { return *m_pRegistry; }
  const std::shared_ptr< VSelectionRegistry >& RegistryPtr() const { return m_pRegistry; }
  /// False when the context of the last `Initialise` does not share objects with the scene's first.
  bool CanDraw() const { return m_bCanDraw; }
  /// Null before the first `Initialise`.
  VSphereHelper* SphereHelper() const { return m_pSphereHelper.get(); }
  const std::shared_ptr< ZEK::ISelectionService >& SelectionService() const { return m_pSelectionService; }
  const std::shared_ptr< HarrowPluginInterface::VMeshSceneCache >& MeshCache() const { return m_pMeshCache; }
  const std::shared_ptr< ZEK::IPostalService >& PostalService() const { return m_pPostalService; }
  bool DeveloperMode() const { return m_bDeveloperMode; }

  bool event( QEvent* i_pEvent ) override;

signals:
  /// Emitted on the render thread after the render types took a new state.
  void Updated();

protected:
  /// True once after each `MarkDirty`.
  bool TakeDirty() { return m_pFlags->bDirty.exchange( false, std::memory_order_acq_rel ); }

  std::vector< std::shared_ptr< IRenderType > > m_RenderList;
  std::vector< std::shared_ptr< IRenderType > > m_PostList;
  std::shared_ptr< IRenderBackdrop > m_pBackdrop;

private:
  struct VFlags
  {
    std::atomic< bool > bPending{ true };
    std::atomic< bool > bDirty{ true };
    void Mark();
  };

  void PaintStatistics( QPainter& io_rPainter, const CoreGraphics::VRenderContext& i_rContext ) const;

  std::shared_ptr< CoreGraphics::VResources > m_pResources;
  std::unordered_map< int, VSceneLabel > m_Labels;
  std::unordered_map< int, VSceneLabel > m_SecondLabels;
  std::vector< VCameraDefinition > m_CameraDefinitions;
  std::uint64_t m_CameraGeneration = 0;
  std::shared_ptr< ZEK::ISelectionService > m_pSelectionService;
  std::shared_ptr< VSelectionRegistry > m_pRegistry;
  std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > m_pMeshCache;
  std::shared_ptr< ZEK::IPostalService > m_pPostalService;
  std::shared_ptr< VSphereHelper > m_pSphereHelper;
  bool m_bDeveloperMode = false;
  bool m_bCanDraw = false;
  bool m_bHighlighted = false;
  bool m_bSettled = false;
  bool m_bTilesAgain = false;
  std::uint64_t m_TileWalk = 0;
  std::uint64_t m_UpdateCount = 0;
  std::atomic< bool > m_bYUp{ false };
  static constexpr std::uint32_t IdsPerWord = 64;
  std::vector< std::uint32_t > m_IgnoredIds;
  std::vector< std::uint64_t > m_IgnoredBits; ///< a bit an id: every object asks for its own while a band draws
  std::uint64_t m_DrawsAtClear = 0;           ///< the context's draw calls when the depth was last cleared
  std::shared_ptr< VFlags > m_pFlags;
  std::mutex m_CallbackGuard;
  std::vector< std::shared_ptr< VRenderCallback > > m_Callbacks;
  std::vector< std::shared_ptr< VRenderCallback > > m_RunningCallbacks;
  std::vector< ZEK::VConnection > m_Connections;
};

} // namespace MoxelGraphics

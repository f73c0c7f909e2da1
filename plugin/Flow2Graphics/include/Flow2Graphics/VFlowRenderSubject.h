#pragma once

#include <Flow2Graphics/IFlowRenderType.h>
#include <Flow2Graphics/ISubjectSelectionMaker.h>
#include <Flow2Graphics/VSubjectMembers.h>

#include <atomic>
#include <memory>
#include <mutex>
#include <span>
#include <vector>

namespace ComputeSubject
{
class VComputeSubjectFK;
}

namespace Flow2Graphics
{

/// The reconstructions of a frame with the labels that say which markers they are.
struct VLabelledSet
{
  const CoreMoxelTypes::VReconstructionSet* pSet = nullptr; ///< null: the frame has no reconstructions
  const CoreMoxelTypes::VReconstructionLabelSet* pLabels = nullptr;
  bool bChanged = false; ///< since the frame before
};

/// One group of subjects, props, rigid objects or scene meshes: turns the items of a state into the lists that are
/// drawn.
///
/// Cost: the structure is made anew only when an item changed that says what an object is made of, and only then is
/// anything allocated; motion is written when a pose or a point changed. An unchanged frame costs comparisons.
///
/// Thread: render thread, but for `MarkDirty`.
class VFlowRenderSubject
{
public:
  explicit VFlowRenderSubject( std::unique_ptr< ISubjectSelectionMaker > i_pMaker );
  ~VFlowRenderSubject();
  VFlowRenderSubject( const VFlowRenderSubject& ) = delete;
  VFlowRenderSubject& operator=( const VFlowRenderSubject& ) = delete;

  /// The next update makes the structure anew, so that whoever draws asks for meshes again. Thread: any.
  void MarkDirty() { m_bRebuild.store( true, std::memory_order_release ); }
  bool IsMarkedDirty() const { return m_bRebuild.load( std::memory_order_acquire ); }
  /// The same if one of the group's objects has one of these names.
  void MarkDirty( const VSubjectChanges& i_rNames );

  /// Brings structure and poses up to date.
  void Take( const ZEK::IFlowState& i_rState );
  /// Places the markers, after `Take`.
  void PlaceMarkers( const VLabelledSet& i_rSet );
  /// Takes ids for all parts, and their flags. In every update of the registry.
  void GiveIds( MoxelGraphics::VSelectionRegistry& io_rRegistry );

  const MoxelGraphics::VSubjectGroup& Group() const { return m_Group; }
  /// Of the objects that are shown. Thread: any.
  std::vector< std::string > Names() const;
  /// By index in the set that the markers were last placed from: not 0 where a marker stands. Empty when none does.
  std::span< const std::uint8_t > Used() const { return m_Used; }
  /// By marker: the reconstruction that it is, by index in that set; `NoReconstruction` for one that is none. May be
  /// empty when none is any.
  std::span< const std::uint32_t > Reconstructions() const { return m_Reconstructions; }
  static constexpr std::uint32_t NoReconstruction = 0xFFFFFFFF;
  /// Whether the last `PlaceMarkers` looked at the labels again.
  bool WasPlaced() const { return m_bPlaced; }

private:
  struct VOwn;

  void Rebuild();
  void Append( std::size_t i_Slot, const VSubjectStructure& i_rStructure );
  void AppendMarkers( const VSubjectStructure& i_rStructure, MoxelGraphics::VSubjectRecord& io_rRecord );
  void AppendBones( const VSubjectStructure& i_rStructure, MoxelGraphics::VSubjectRecord& io_rRecord );
  void Move();
  void MoveBones( const VSubjectMotion& i_rMotion, VOwn& io_rOwn, MoxelGraphics::VSubjectRecord& io_rRecord );
  void PlaceByModel( bool i_bSet );
  void PlaceRecord( const VSubjectMotion& i_rMotion, VOwn& io_rOwn, const MoxelGraphics::VSubjectRecord& i_rRecord,
                    bool i_bSet );
  const VSubjectMotion& MotionOf( std::size_t i_Record );
  void PlaceByLabels( const VLabelledSet& i_rSet );
  void GiveFlags( const MoxelGraphics::VSelectionRegistry& i_rRegistry );
  bool FindFlags( const MoxelGraphics::VSelectionRegistry& i_rRegistry, const VSubjectMembers& i_rMembers,
                  std::vector< std::uint8_t >& io_rFlags );

  std::unique_ptr< ISubjectSelectionMaker > m_pMaker;
  Flow2TypesUtils::VTaggedCoreTypeExtractor m_Extractor;
  MoxelGraphics::VSubjectGroup m_Group;
  std::vector< VOwn > m_Own;               ///< by record
  std::vector< VSubjectMotion > m_Motions; ///< by record, while they are read
  VSubjectDirectory m_Directory;
  VSubjectMembers m_Records, m_Markers, m_Sticks, m_Bones;
  std::vector< float > m_Radii;                   ///< by marker; 0: none of its own
  std::vector< std::array< float, 3 > > m_Locals; ///< by marker, in an object that moves as one
  std::vector< std::uint32_t > m_Reconstructions; ///< by marker
  std::vector< std::uint8_t > m_Used, m_Flags;
  std::uint64_t m_MarksGeneration = 0, m_FlaggedStructure = 0;
  bool m_bMotionsRead = false; ///< since the last `Take`
  bool m_bMoved = false;       ///< the last `Take` changed poses or structure
  bool m_bHadSet = false;      ///< markers were last placed with a set
  bool m_bPlaced = false;
  std::atomic< bool > m_bRebuild{ true };
  mutable std::mutex m_NamesGuard;
  std::vector< std::string > m_Names;
};

} // namespace Flow2Graphics

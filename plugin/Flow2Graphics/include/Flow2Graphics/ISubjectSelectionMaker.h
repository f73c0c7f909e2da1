#pragma once

#include <CoreMoxelTypes/Subject.h>
#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>
#include <MoxelGraphics/VSubjectGroup.h>

#include <span>

namespace Flow2Graphics
{

/// What an object is made of, whatever its kind. Good while the state lives that it was read from.
struct VSubjectStructure
{
  std::uint32_t Id = 0;
  const std::string* pName = nullptr; ///< null or empty: the object's name in the state
  std::span< const CoreMoxelTypes::VMarker > Markers;
  std::span< const CoreMoxelTypes::VSegment > Segments;
  std::span< const std::pair< std::uint32_t, std::uint32_t > > Clusters; ///< segment and marker
  std::span< const CoreMoxelTypes::VStick > Sticks;
  std::span< const std::uint32_t > MarkerColours;      ///< one a marker, or empty
  std::span< const std::uint32_t > SegmentColours;     ///< taken when there is one a segment
  std::uint32_t Colour = 0;                            ///< 0: none of its own
  bool bOneBone = false;                               ///< without segments, yet all its markers move with one pose
  const CoreMoxelTypes::VSubject* pSkeleton = nullptr; ///< what the joint states move; null: nothing
  const std::string* pMesh = nullptr;
  float MeshScale = 1;
  bool bMeshByRoot = false;
};

/// Where an object is. Good while the state lives that it was read from.
struct VSubjectMotion
{
  const CoreMoxelTypes::Rigid* pRoot = nullptr; ///< of objects that move as one
  std::span< const CoreMoxelTypes::Rigid > Segments;
  std::span< const double > JointState;
  std::span< const CoreMoxelTypes::D3 > Solved; ///< by marker
  std::span< const std::uint8_t > Visible;      ///< by marker; empty: all are
  std::span< const float > Health;              ///< by segment, 0 to 1
  std::span< const CoreMoxelTypes::Rigid > MeshBones;
  double AnimationTime = 0;
};

/// Whether an object belongs in its group.
enum class ESubjectFit
{
  Shown,
  NotOfGroup,
  Hidden,       ///< by its settings
  ColoursDiffer ///< it has another number of marker colours than of markers
};

/// What one group of objects knows of its kind: which items its objects have, what these say, and which selection
/// items its objects and their parts are. Thread: render thread.
class ISubjectSelectionMaker
{
public:
  using VExtractor = Flow2TypesUtils::VTaggedCoreTypeExtractor;

  virtual ~ISubjectSelectionMaker() = default;
  /// Called once, before the extractor's first update.
  virtual void AddCaches( VExtractor& io_rExtractor ) const = 0;
  /// Whether the last update brought other objects, or others of the items that say what they are made of.
  virtual bool StructureChanged( const VExtractor& i_rExtractor ) const = 0;
  virtual bool MotionChanged( const VExtractor& i_rExtractor ) const = 0;
  /// The object in a slot of the extractor.
  virtual ESubjectFit Structure( const VExtractor& i_rExtractor, std::size_t i_Slot,
                                 VSubjectStructure& o_rStructure ) const = 0;
  virtual void Motion( const VExtractor& i_rExtractor, std::size_t i_Slot, VSubjectMotion& o_rMotion ) const = 0;

  /// The kinds of the object and of its bones; a bone of an object that moves as one is the object.
  virtual std::uint32_t ObjectKind() const = 0;
  virtual std::uint32_t BoneKind() const = 0;
  virtual const char* MeshCategory() const = 0;

  ZEK::VSelectionItem ObjectItem( std::uint32_t i_Id, const std::string& i_rName ) const
  {
    return { ObjectKind(), i_rName, i_Id, 0 };
  }
  ZEK::VSelectionItem MarkerItem( const MoxelGraphics::VSubjectRecord& i_rRecord, const std::string& i_rMarker,
                                  std::uint32_t i_Number ) const
  {
    return { ZEK::ESelectMarker, std::string( i_rRecord.Name ).append( ":" ).append( i_rMarker ), i_rRecord.Item.Object,
             i_Number };
  }
  ZEK::VSelectionItem BoneItem( const MoxelGraphics::VSubjectRecord& i_rRecord, const std::string& i_rBone,
                                std::uint32_t i_Number ) const
  {
    return BoneKind() != ZEK::ESelectSegment
               ? i_rRecord.Item
               : ZEK::VSelectionItem{ ZEK::ESelectSegment,
                                      std::string( i_rRecord.Name ).append( ":" ).append( i_rBone ),
                                      i_rRecord.Item.Object, i_Number };
  }
};

} // namespace Flow2Graphics

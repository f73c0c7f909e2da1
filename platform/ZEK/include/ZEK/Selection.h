#pragma once

#include <ZEK/Callback.h>
#include <ZEK/Export.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

namespace ZEK
{

/// What a selection item is.
enum ESelectionKind : std::uint32_t
{
  ESelectNone = 0,
  ESelectDevice = 1,         ///< a camera, a force plate or another device
  ESelectGreyscaleBlob = 2,  ///< sub: index of the blob in its camera
  ESelectCentroid = 3,       ///< sub: index of the centroid in its camera
  ESelectReconstruction = 5, ///< sub: index in the set of the frame
  ESelectMarker = 6,         ///< device: text «subject:marker»; object: subject id; sub: marker number
  ESelectSubject = 7,
  ESelectSegment = 8,
  ESelectStick = 9,
  ESelectRigidObject = 10,
  ESelectSceneMesh = 12,
  ESelectObjectManipulator = 27,
  ESelectMaskCell = 30, ///< sub: row-major index of the cell
  ESelectVolumeManipulator = 33
};

/// Names one thing that can be selected.
struct VSelectionItem
{
  std::uint32_t Kind = ESelectNone;
  std::string Device; ///< device URN or object name; empty where the kind has none
  std::uint64_t Object = 0;
  std::uint32_t Sub = 0;

  friend bool operator==( const VSelectionItem&, const VSelectionItem& ) = default;
  friend auto operator<=>( const VSelectionItem&, const VSelectionItem& ) = default;
};

/// True for the kinds whose sub-index counts members of one range of selection ids.
constexpr bool HasSubIndex( std::uint32_t i_Kind )
{
  return i_Kind == ESelectCentroid || i_Kind == ESelectMaskCell || i_Kind == ESelectReconstruction ||
         i_Kind == ESelectGreyscaleBlob;
}

/// Selected items in the order in which they were added, none twice; the last one is the current item.
using VSelection = std::vector< VSelectionItem >;

/// How a pick changes what is selected.
enum class ESelectionEdit
{
  Replace,
  Add,
  Toggle,
  Remove
};

/// `i_rFrom` changed by `i_rPicked`. An empty pick clears under `Replace` and changes nothing otherwise.
ZEK_API VSelection EditSelection( const VSelection& i_rFrom, const VSelection& i_rPicked, ESelectionEdit i_Edit );

/// The host's record of what is selected (primary) and what lies under the pointer (secondary).
///
/// Thread: `Get` from any thread; changes come on the GUI thread. A change that leaves a set equal fires nothing.
class ISelectionService
{
public:
  enum ESet
  {
    EPrimary,
    ESecondary
  };

  virtual ~ISelectionService() = default;
  virtual VSelection Get( ESet i_Set ) const = 0;
  /// The items of the given kinds; false when there is none.
  virtual bool Get( ESet i_Set, const std::vector< std::uint32_t >& i_rKinds, VSelection& o_rSelection ) const = 0;
  /// A number that grows with each distinct change of either set.
  virtual std::uint64_t Generation() const = 0;
  virtual void Set( ESet i_Set, VSelection i_Selection ) = 0;
  /// Fires once for each distinct change of either set in which an item of these kinds came or went. An empty list
  /// stands for all kinds. Items of other kinds that change leave it silent.
  virtual std::shared_ptr< IMultiCallback< void() > > ForKinds( const std::vector< std::uint32_t >& i_rKinds ) = 0;
  /// The item that a text of `Text` names; kind 0 when it names none.
  virtual VSelectionItem FromName( const std::string& i_rText ) const = 0;
  virtual std::string Text( const VSelectionItem& i_rItem ) const = 0;
};

} // namespace ZEK

#pragma once

#include <ZEK/Selection.h>

#include <atomic>
#include <map>
#include <mutex>

namespace HostServices
{

/// The record of what is selected and what lies under the pointer.
///
/// The text of a camera is its device URN as it stands. Every other item is written «@kind/object/sub/device», such
/// as "@marker/1/4/Walker:LFHD"; the device comes last and verbatim, so that any name survives the round trip.
class VSelectionService final : public ZEK::ISelectionService
{
public:
  ZEK::VSelection Get( ESet i_Set ) const override;
  bool Get( ESet i_Set, const std::vector< std::uint32_t >& i_rKinds, ZEK::VSelection& o_rSelection ) const override;
  std::uint64_t Generation() const override { return m_Generation.load( std::memory_order_acquire ); }
  /// Items without a kind are left out; of equal items the last one stays. Thread: GUI.
  void Set( ESet i_Set, ZEK::VSelection i_Selection ) override;
  std::shared_ptr< ZEK::IMultiCallback< void() > > ForKinds( const std::vector< std::uint32_t >& i_rKinds ) override;
  ZEK::VSelectionItem FromName( const std::string& i_rText ) const override;
  std::string Text( const ZEK::VSelectionItem& i_rItem ) const override;

  /// The item that was added to the primary set last; kind 0 when the set is empty. Thread: any.
  ZEK::VSelectionItem CurrentItem() const;
  /// Makes the item the only one of a set.
  void SetOnly( ESet i_Set, const ZEK::VSelectionItem& i_rItem ) { Set( i_Set, { i_rItem } ); }

private:
  using VSignal = ZEK::VMultiCallback< void() >;

  mutable std::mutex m_Guard;
  ZEK::VSelection m_Sets[2];
  std::map< std::vector< std::uint32_t >, std::shared_ptr< VSignal > > m_Signals; ///< by sorted kinds, kept for good
  std::atomic< std::uint64_t > m_Generation{ 1 };
};

/// Gives an item of kind 2, 3, 5 or 30 its index within its camera or its frame. False, and nothing is changed, for
/// an item of any other kind.
bool SetSubIndex( ZEK::VSelectionItem& io_rItem, std::uint32_t i_Index );
/// The same for one of the four kinds each; an item of another kind stays as it is.
bool SetCentroidIndex( ZEK::VSelectionItem& io_rItem, std::uint32_t i_Index );
bool SetMaskCellIndex( ZEK::VSelectionItem& io_rItem, std::uint32_t i_Index );
bool SetReconstructionIndex( ZEK::VSelectionItem& io_rItem, std::uint32_t i_Index );
bool SetGreyscaleBlobIndex( ZEK::VSelectionItem& io_rItem, std::uint32_t i_Index );

} // namespace HostServices

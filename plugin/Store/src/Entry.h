#pragma once

#include "PendingChildren.h"

#include <ZEK/EntryPath.h>
#include <ZEK/StoreReader.h>
#include <ZEK/TypedValue.h>

#include <atomic>
#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <type_traits>
#include <vector>

namespace Store
{

class VHandlerCallback;
using VHandlerList = std::vector< VHandlerCallback* >;

struct VEntryValues
{
  std::uint32_t m_Flags = 0; // first, so that a record has it in one cache line with the verified value
  ZEK::VTypedValue m_Verified;
  ZEK::VTypedValue m_Proposed;
  ZEK::VTypedValue m_Default;
};

struct VEntryPresentation
{
  ZEK::VTypedValue m_Minimum;
  ZEK::VTypedValue m_Maximum;
  std::vector< ZEK::VTypedValue > m_Choices;
  std::vector< std::string > m_ChoiceTexts;
  std::vector< std::string > m_ChoiceToolTips;
  std::string m_Text;
};

struct VEntryExtras
{
  std::optional< std::string > m_OptionalText;
  std::string m_Text1;
  std::string m_Text2;
  std::string m_Text3;
  std::uint32_t m_Number1 = 0;
  std::uint32_t m_Number2 = 0;
  std::string m_Attributes;
};

/// What is committed of an entry besides what lies in the entry itself.
struct VEntryState
{
  std::vector< VStoreEntry* > m_Children; ///< in child order
  std::unique_ptr< VEntryPresentation > m_pPresentation;
  std::unique_ptr< VEntryExtras > m_pExtras;
};

/// What the open write scope has written of an entry. Records are pooled and keep old contents: a field counts only
/// when the mask has its bit. Those with children only, as most parents, take one cache line, those with a verified
/// value only two.
struct alignas( 64 ) VEntryChange
{
  std::uint64_t m_Mask = 0;
  std::uint64_t m_Told = 0;  ///< by the merge so far
  std::uint32_t m_Place = 0; ///< in the pending children of the parent
  bool m_bParent = false;    ///< the pending children may not be empty
  bool m_bChoices = false;   ///< the three lists of choices may hold something
  bool m_bWasThere = false;  ///< before the merge
  VPendingChildren m_Children;
  const ZEK::IO::ISchema* m_pSchema = nullptr;
  VEntryValues m_Values;
  /// Made on first need and kept with the record: most records never have them, and are small.
  VEntryPresentation& Presentation() { return Made( m_pPresentation ); }
  VEntryExtras& Extras() { return Made( m_pExtras ); }

  std::unique_ptr< VEntryPresentation > m_pPresentation;
  std::unique_ptr< VEntryExtras > m_pExtras;

private:
  template < typename TGroup >
  static TGroup& Made( std::unique_ptr< TGroup >& io_rpGroup )
  {
    if ( !io_rpGroup )
    {
      io_rpGroup = std::make_unique< TGroup >();
    }
    return *io_rpGroup;
  }
};

/// A node of the tree. Made on first use of a path and kept as long as the store; it is there, for clients, when it
/// has a state.
///
/// Readers look at what is committed without a lock: it changes only while no reader of its generation is left. What a
/// commit looks at in every entry that it changes lies together, and so does what a read of a value needs.
class alignas( 64 ) VStoreEntry
{
public:
  VStoreEntry( ZEK::VEntryPath i_Path, VStoreEntry* i_pParent )
    : m_LeafKey( LeafKey( i_Path.LeafView() ) )
    , m_pParent( i_pParent )
    , m_Path( std::move( i_Path ) )
  {
  }
  /// Of what is committed, nothing stays. The by-handle handlers do.
  void EndState()
  {
    m_PatternHandlers = {};
    m_pSchema = nullptr;
    m_pState.reset();
    m_Values = {};
    m_Changes = {};
  }

  const std::uint64_t m_LeafKey; ///< orders most siblings without their names
  VStoreEntry* const m_pParent;  ///< null for the root only
  VHandlerList m_Handlers;       ///< those registered by handle; store mutex
  /// Those whose patterns match; found again when a state is made, empty without one. Store mutex.
  VHandlerList m_PatternHandlers;

  const ZEK::IO::ISchema* m_pSchema = nullptr; ///< committed; null until there is a typed value or a schema
  VEntryChange* m_pChange = nullptr;           ///< the thread of the write scope, or the store mutex
  std::unique_ptr< VEntryState > m_pState;     ///< null while the entry is not there
  VEntryValues m_Values;                       ///< committed; empty without a state
  ZEK::VChangeIds m_Changes;                   ///< committed; zeros without a state

  std::atomic< VStoreEntry* > m_pBucketLink{ nullptr };
  const ZEK::VEntryPath m_Path;
};

/// The groups of fields by type, so that one routine serves them all.
template < typename TGroup >
const TGroup& EmptyGroup()
{
  static const TGroup Empty{};
  return Empty;
}
inline const VEntryPresentation* CommittedGroup( const VEntryState& i_rState, const VEntryPresentation* )
{
  return i_rState.m_pPresentation.get();
}
inline const VEntryExtras* CommittedGroup( const VEntryState& i_rState, const VEntryExtras* )
{
  return i_rState.m_pExtras.get();
}
inline const VEntryValues& PendingGroup( const VEntryChange& i_rChange, const VEntryValues* )
{
  return i_rChange.m_Values;
}
inline const VEntryPresentation& PendingGroup( const VEntryChange& i_rChange, const VEntryPresentation* )
{
  return *i_rChange.m_pPresentation;
}
inline const VEntryExtras& PendingGroup( const VEntryChange& i_rChange, const VEntryExtras* )
{
  return *i_rChange.m_pExtras;
}

/// The committed fields of an entry, empty ones when it has none.
template < typename TGroup >
const TGroup& Committed( const VStoreEntry* i_pEntry )
{
  if constexpr ( std::is_same_v< TGroup, VEntryValues > )
  {
    return i_pEntry != nullptr ? i_pEntry->m_Values : EmptyGroup< TGroup >();
  }
  else if ( i_pEntry != nullptr && i_pEntry->m_pState )
  {
    const TGroup* const pGroup = CommittedGroup( *i_pEntry->m_pState, static_cast< const TGroup* >( nullptr ) );
    return pGroup != nullptr ? *pGroup : EmptyGroup< TGroup >();
  }
  return EmptyGroup< TGroup >();
}

} // namespace Store

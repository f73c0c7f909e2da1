#pragma once

#include <ZEK/EntryPath.h>
#include <ZEK/TypedId.h>
#include <ZEK/TypedValue.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace ZEK
{

class IStore;

/// The commits that last changed an entry, or anything below it; zeros for an entry that is not there.
struct VChangeIds
{
  ChangeId m_Verified;
  ChangeId m_Proposed;
  ChangeId m_Other; ///< anything except those two values
  ChangeId m_Child;
  ChangeId m_Descendant;
};

/// What a scope sees of the entries. In a write scope it shows the scope's own writes over the committed entries.
///
/// Thread: the one that opened the scope. References stay valid until the scope ends. Fields that are not there
/// read as empty; an entry that is not there, and a null handle, have none.
class IStoreReader
{
public:
  using Entry = ::Store::VStoreEntry*;

  virtual ~IStoreReader() = default;

  /// A store that is being destroyed is a broken precondition.
  virtual std::shared_ptr< IStore > GetSharedStore() const = 0;
  virtual IStore* GetStore() const = 0;

  /// The entries that are there and that the path names; a component `*` stands for every child.
  virtual std::vector< Entry > FindEntries( const VEntryPath& i_rPath ) const = 0;
  virtual bool HasChildren( Entry i_pEntry ) const = 0;
  virtual std::size_t ChildCount( Entry i_pEntry ) const = 0;
  /// Sorted by leaf name, byte-wise, equal leaf names by full path.
  virtual std::vector< Entry > Children( Entry i_pEntry ) const = 0;
  /// The first child of that name, or null.
  virtual Entry Child( Entry i_pEntry, const std::string& i_rName ) const = 0;
  virtual bool Exists( Entry i_pEntry ) const = 0;

  /// The verified or the proposed value is there.
  virtual bool HasValue( Entry i_pEntry ) const = 0;
  /// Void for an entry without a type; never null.
  virtual const IO::ISchema* Schema( Entry i_pEntry ) const = 0;
  virtual const VTypedValue& VerifiedValue( Entry i_pEntry ) const = 0;
  virtual const VTypedValue& ProposedValue( Entry i_pEntry ) const = 0;
  virtual const VTypedValue& DefaultValue( Entry i_pEntry ) const = 0;
  /// Bits of `EStoreFlags`.
  virtual std::uint32_t Flags( Entry i_pEntry ) const = 0;
  /// EVerifyRequired is set, and the verified and proposed values differ.
  virtual bool IsVerificationPending( Entry i_pEntry ) const = 0;

  virtual bool HasPresentation( Entry i_pEntry ) const = 0;
  virtual const VTypedValue& Minimum( Entry i_pEntry ) const = 0;
  virtual const VTypedValue& Maximum( Entry i_pEntry ) const = 0;
  virtual std::size_t ChoiceCount( Entry i_pEntry ) const = 0;
  virtual const std::vector< VTypedValue >& Choices( Entry i_pEntry ) const = 0;
  /// Empty while no choice has a text, else one for each choice.
  virtual const std::vector< std::string >& ChoiceTexts( Entry i_pEntry ) const = 0;
  /// Likewise.
  virtual const std::vector< std::string >& ChoiceToolTips( Entry i_pEntry ) const = 0;
  virtual const std::string& PresentationText( Entry i_pEntry ) const = 0;

  /// Any of the fields that follow is set, not empty, or not 0.
  virtual bool HasExtras( Entry i_pEntry ) const = 0;
  virtual const std::optional< std::string >& OptionalText( Entry i_pEntry ) const = 0;
  virtual const std::string& ExtraText1( Entry i_pEntry ) const = 0;
  virtual const std::string& ExtraText2( Entry i_pEntry ) const = 0;
  virtual const std::string& ExtraText3( Entry i_pEntry ) const = 0;
  virtual std::uint32_t ExtraNumber1( Entry i_pEntry ) const = 0;
  virtual std::uint32_t ExtraNumber2( Entry i_pEntry ) const = 0;
  virtual const std::string& Attributes( Entry i_pEntry ) const = 0;
  /// Bit 0: the entry has choices.
  virtual std::uint32_t Capabilities( Entry i_pEntry ) const = 0;

  /// The newest commit that the scope sees. A commit's own number reaches clients through callbacks.
  virtual ChangeId Generation() const = 0;
  virtual VChangeIds ChangeIds( Entry i_pEntry ) const = 0;
  /// Runs the function on this thread when its outermost scope has ended; functions run in order, and one may defer
  /// more.
  virtual void Defer( std::function< void() > i_Function ) const = 0;
};

} // namespace ZEK

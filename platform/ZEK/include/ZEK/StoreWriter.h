#pragma once

#include <ZEK/BitFlags.h>
#include <ZEK/EntryPath.h>
#include <ZEK/Result.h>
#include <ZEK/StoreFlags.h>
#include <ZEK/StoreReader.h>

#include <cstddef>
#include <cstdint>
#include <map>
#include <memory>
#include <string>

namespace ZEK
{

/// Writes within a write scope. Nothing is seen by others before the scope ends, and then all at once. Writing to
/// an entry makes it, and its parents.
///
/// The first value fixes the type of an entry. A value of another type changes nothing and gives `InvalidType`
/// with a line in the log category "Store"; an empty value of the Void type is always taken.
class IStoreWriter : public IStoreReader
{
public:
  using IStoreReader::GetSharedStore;
  using IStoreReader::GetStore;
  virtual std::shared_ptr< IStore > GetSharedStore() = 0;
  virtual IStore* GetStore() = 0;

  /// Also clears EUsingDefault, unless EVerifyRequired is set.
  virtual IResult SetVerifiedValue( Entry i_pEntry, VTypedValue i_Value ) = 0;
  /// Also clears EUsingDefault.
  virtual IResult SetProposedValue( Entry i_pEntry, VTypedValue i_Value ) = 0;
  /// The proposed value with EVerifyRequired, else the verified one. Also clears EUsingDefault.
  virtual IResult SetValue( Entry i_pEntry, VTypedValue i_Value ) = 0;
  /// An entry without a value takes it as its value too, and has EUsingDefault from then on. An entry that uses its
  /// default takes the new one as its value and counts as set.
  virtual IResult SetDefaultValue( Entry i_pEntry, VTypedValue i_Value ) = 0;
  virtual void SetFlag( Entry i_pEntry, std::uint32_t i_Flags ) = 0;
  virtual void ClearFlag( Entry i_pEntry, std::uint32_t i_Flags ) = 0;
  /// Bits of `EStoreFlags`; others are a broken precondition. Switching EVerifyRequired on an entry that is there
  /// swaps its verified and proposed values; setting EReadout empties its values, save those set in this scope.
  virtual void SetFlags( Entry i_pEntry, std::uint32_t i_Flags, bool i_bOn ) = 0;

  virtual IResult SetMinimum( Entry i_pEntry, VTypedValue i_Value ) = 0;
  virtual IResult SetMaximum( Entry i_pEntry, VTypedValue i_Value ) = 0;
  /// Text and tool tip may be empty.
  virtual IResult AddValueChoice( Entry i_pEntry, VTypedValue i_Value, std::string i_Text, std::string i_ToolTip ) = 0;
  /// `InvalidIndex` beyond the choices.
  virtual IResult RemoveValueChoice( Entry i_pEntry, std::size_t i_Index ) = 0;
  /// `OkButNoEffect` when there were none; then the entry is not made.
  virtual IResult ClearValueChoices( Entry i_pEntry ) = 0;
  /// `InvalidIndex` beyond the choices.
  virtual IResult SetChoiceToolTip( Entry i_pEntry, std::size_t i_Index, std::string i_Text ) = 0;
  virtual void SetPresentationText( Entry i_pEntry, std::string i_Text ) = 0;

  virtual void SetOptionalText( Entry i_pEntry, std::string i_Text ) = 0;
  virtual void ClearOptionalText( Entry i_pEntry ) = 0;
  virtual void SetExtraText1( Entry i_pEntry, std::string i_Text ) = 0;
  virtual void SetExtraText2( Entry i_pEntry, std::string i_Text ) = 0;
  virtual void SetExtraText3( Entry i_pEntry, std::string i_Text ) = 0;
  virtual void SetExtraNumber1( Entry i_pEntry, std::uint32_t i_Number ) = 0;
  virtual void SetExtraNumber2( Entry i_pEntry, std::uint32_t i_Number ) = 0;
  /// Kept as the text `{"name":value,…}`; attributes whose value has no text are left out.
  virtual void SetAttributes( Entry i_pEntry, const std::map< std::string, VTypedValue >& i_rAttributes ) = 0;
  virtual void SetAttributesText( Entry i_pEntry, std::string i_Text ) = 0;

  /// Removes the entry and all below it; `NotFound` when it is not there. Its handle stays valid.
  virtual IResult RemoveEntry( Entry i_pEntry ) = 0;
  /// What this scope sets of the entry is reported even when it is equal.
  virtual void Touch( Entry i_pEntry ) = 0;
  /// At the end of the scope the entries of the set and all below them report these flags; nothing for no flags.
  virtual void QueueChangeNotification( VEntryPatternSet i_Set, IBitFlags< EChangeFlags > i_Flags ) = 0;
  /// At the end of the scope those of the entries and all below them whose verification is pending report
  /// EVerificationNeeded.
  virtual void QueueVerificationCheck( VEntryPatternSet i_Set ) = 0;
  /// Gives an entry without a type one, for this scope; a new entry keeps it. `OkButNoEffect` when it has that type,
  /// `InvalidType` when it has another.
  virtual IResult SetSchema( Entry i_pEntry, const IO::ISchema* i_pSchema ) = 0;
};

} // namespace ZEK

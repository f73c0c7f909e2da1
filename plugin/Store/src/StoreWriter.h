#pragma once

#include "Entry.h"

#include <ZEK/StoreWriter.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace Store
{

class VStore;

/// Writes pending records, and shows them over the committed entries. One serves all write scopes of a store. A null
/// handle is `InvalidHandle`, or nothing at all where there is no result.
class VStoreWriter final : public ZEK::IStoreWriter
{
public:
  explicit VStoreWriter( VStore& i_rStore )
    : m_rStore( i_rStore )
  {
  }

  std::shared_ptr< ZEK::IStore > GetSharedStore() const override;
  ZEK::IStore* GetStore() const override;
  std::vector< Entry > FindEntries( const ZEK::VEntryPath& i_rPath ) const override;
  bool HasChildren( Entry i_pEntry ) const override;
  std::size_t ChildCount( Entry i_pEntry ) const override;
  std::vector< Entry > Children( Entry i_pEntry ) const override;
  Entry Child( Entry i_pEntry, const std::string& i_rName ) const override;
  bool Exists( Entry i_pEntry ) const override;

  bool HasValue( Entry i_pEntry ) const override;
  const ZEK::IO::ISchema* Schema( Entry i_pEntry ) const override;
  const ZEK::VTypedValue& VerifiedValue( Entry i_pEntry ) const override;
  const ZEK::VTypedValue& ProposedValue( Entry i_pEntry ) const override;
  const ZEK::VTypedValue& DefaultValue( Entry i_pEntry ) const override;
  std::uint32_t Flags( Entry i_pEntry ) const override;
  bool IsVerificationPending( Entry i_pEntry ) const override;

  bool HasPresentation( Entry i_pEntry ) const override;
  const ZEK::VTypedValue& Minimum( Entry i_pEntry ) const override;
  const ZEK::VTypedValue& Maximum( Entry i_pEntry ) const override;
  std::size_t ChoiceCount( Entry i_pEntry ) const override;
  const std::vector< ZEK::VTypedValue >& Choices( Entry i_pEntry ) const override;
  const std::vector< std::string >& ChoiceTexts( Entry i_pEntry ) const override;
  const std::vector< std::string >& ChoiceToolTips( Entry i_pEntry ) const override;
  const std::string& PresentationText( Entry i_pEntry ) const override;

  bool HasExtras( Entry i_pEntry ) const override;
  const std::optional< std::string >& OptionalText( Entry i_pEntry ) const override;
  const std::string& ExtraText1( Entry i_pEntry ) const override;
  const std::string& ExtraText2( Entry i_pEntry ) const override;
  const std::string& ExtraText3( Entry i_pEntry ) const override;
  std::uint32_t ExtraNumber1( Entry i_pEntry ) const override;
  std::uint32_t ExtraNumber2( Entry i_pEntry ) const override;
  const std::string& Attributes( Entry i_pEntry ) const override;
  std::uint32_t Capabilities( Entry i_pEntry ) const override;

  ZEK::ChangeId Generation() const override;
  ZEK::VChangeIds ChangeIds( Entry i_pEntry ) const override;
  void Defer( std::function< void() > i_Function ) const override;

  std::shared_ptr< ZEK::IStore > GetSharedStore() override;
  ZEK::IStore* GetStore() override;
  ZEK::IResult SetVerifiedValue( Entry i_pEntry, ZEK::VTypedValue i_Value ) override;
  ZEK::IResult SetProposedValue( Entry i_pEntry, ZEK::VTypedValue i_Value ) override;
  ZEK::IResult SetValue( Entry i_pEntry, ZEK::VTypedValue i_Value ) override;
  ZEK::IResult SetDefaultValue( Entry i_pEntry, ZEK::VTypedValue i_Value ) override;
  void SetFlag( Entry i_pEntry, std::uint32_t i_Flags ) override;
  void ClearFlag( Entry i_pEntry, std::uint32_t i_Flags ) override;
  void SetFlags( Entry i_pEntry, std::uint32_t i_Flags, bool i_bOn ) override;

  ZEK::IResult SetMinimum( Entry i_pEntry, ZEK::VTypedValue i_Value ) override;
  ZEK::IResult SetMaximum( Entry i_pEntry, ZEK::VTypedValue i_Value ) override;
  ZEK::IResult AddValueChoice( Entry i_pEntry, ZEK::VTypedValue i_Value, std::string i_Text,
                               std::string i_ToolTip ) override;
  ZEK::IResult RemoveValueChoice( Entry i_pEntry, std::size_t i_Index ) override;
  ZEK::IResult ClearValueChoices( Entry i_pEntry ) override;
  ZEK::IResult SetChoiceToolTip( Entry i_pEntry, std::size_t i_Index, std::string i_Text ) override;
  void SetPresentationText( Entry i_pEntry, std::string i_Text ) override;

  void SetOptionalText( Entry i_pEntry, std::string i_Text ) override;
  void ClearOptionalText( Entry i_pEntry ) override;
  void SetExtraText1( Entry i_pEntry, std::string i_Text ) override;
  void SetExtraText2( Entry i_pEntry, std::string i_Text ) override;
  void SetExtraText3( Entry i_pEntry, std::string i_Text ) override;
  void SetExtraNumber1( Entry i_pEntry, std::uint32_t i_Number ) override;
  void SetExtraNumber2( Entry i_pEntry, std::uint32_t i_Number ) override;
  void SetAttributes( Entry i_pEntry, const std::map< std::string, ZEK::VTypedValue >& i_rAttributes ) override;
  void SetAttributesText( Entry i_pEntry, std::string i_Text ) override;

  ZEK::IResult RemoveEntry( Entry i_pEntry ) override;
  void Touch( Entry i_pEntry ) override;
  void QueueChangeNotification( ZEK::VEntryPatternSet i_Set, ZEK::IBitFlags< ZEK::EChangeFlags > i_Flags ) override;
  void QueueVerificationCheck( ZEK::VEntryPatternSet i_Set ) override;
  ZEK::IResult SetSchema( Entry i_pEntry, const ZEK::IO::ISchema* i_pSchema ) override;

private:
  VEntryChange& Obtain( Entry i_pEntry );
  /// The record for a value that fits the entry, which then has the value's type; null with the message, whose place
  /// is the path, and the result when it does not.
  VEntryChange* ObtainFor( Entry i_pEntry, const ZEK::VTypedValue& i_rValue, const char* i_pMessage,
                           ZEK::IResult& o_rResult );
  void ClearUsingDefault( VEntryChange& io_rChange );
  void SwapValues( Entry i_pEntry );
  void EmptyForReadout( Entry i_pEntry, VEntryChange& io_rChange );
  void WarnReadoutAndVerify( Entry i_pEntry );
  void WarnReadoutDefault( Entry i_pEntry );
  void FillChoices( Entry i_pEntry, VEntryChange& io_rChange );
  template < typename T >
  void SetExtra( Entry i_pEntry, T VEntryExtras::*i_pField, std::uint64_t i_Bit, T i_Value );

  VStore& m_rStore;
};

} // namespace Store

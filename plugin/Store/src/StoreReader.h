#pragma once

#include "Entry.h"

#include <ZEK/StoreReader.h>

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace Store
{

class VStore;

/// Shows the committed entries. One serves all scopes of a store.
class VStoreReader final : public ZEK::IStoreReader
{
public:
  explicit VStoreReader( VStore& i_rStore )
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

private:
  VStore& m_rStore;
};

} // namespace Store

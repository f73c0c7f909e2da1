#include "StoreReader.h"

#include "ReadFields.h"
#include "Resolve.h"
#include "VStore.h"

#include <ZEK/DebugServices.h>

#include <exception>
#include <utility>

namespace Store
{

using namespace ZEK;

std::shared_ptr< IStore > VStoreReader::GetSharedStore() const
{
  std::shared_ptr< IStore > pStore = m_rStore.Self();
  if ( !DebugServices::Check( pStore != nullptr, "pStore", __FILE__, __LINE__ ) )
  {
    std::terminate();
  }
  return pStore;
}

IStore* VStoreReader::GetStore() const
{
  return &m_rStore;
}

std::vector< IStoreReader::Entry > VStoreReader::FindEntries( const VEntryPath& i_rPath ) const
{
  return FindCommitted( m_rStore.Table(), i_rPath );
}

bool VStoreReader::HasChildren( Entry i_pEntry ) const
{
  return VStoreReader::ChildCount( i_pEntry ) != 0;
}

std::size_t VStoreReader::ChildCount( Entry i_pEntry ) const
{
  return VStoreReader::Exists( i_pEntry ) ? i_pEntry->m_pState->m_Children.size() : 0;
}

std::vector< IStoreReader::Entry > VStoreReader::Children( Entry i_pEntry ) const
{
  return VStoreReader::Exists( i_pEntry ) ? i_pEntry->m_pState->m_Children : std::vector< Entry >();
}

IStoreReader::Entry VStoreReader::Child( Entry i_pEntry, const std::string& i_rName ) const
{
  if ( !VStoreReader::Exists( i_pEntry ) )
  {
    return nullptr;
  }
  const auto Found = FindChildren( i_pEntry->m_pState->m_Children, i_rName );
  return Found.empty() ? nullptr : Found.front();
}

bool VStoreReader::Exists( Entry i_pEntry ) const
{
  return i_pEntry != nullptr && i_pEntry->m_pState != nullptr;
}

const IO::ISchema* VStoreReader::Schema( Entry i_pEntry ) const
{
  const IO::ISchema* const pSchema = i_pEntry != nullptr ? i_pEntry->m_pSchema : nullptr;
  return pSchema != nullptr ? pSchema : IO::GetUniquePodSchema( IO::EType::Void );
}

std::uint32_t VStoreReader::Flags( Entry i_pEntry ) const
{
  return Committed< VEntryValues >( i_pEntry ).m_Flags;
}

const VTypedValue& VStoreReader::VerifiedValue( Entry i_pEntry ) const
{
  return Committed< VEntryValues >( i_pEntry ).m_Verified;
}

const VTypedValue& VStoreReader::ProposedValue( Entry i_pEntry ) const
{
  return Committed< VEntryValues >( i_pEntry ).m_Proposed;
}

const VTypedValue& VStoreReader::DefaultValue( Entry i_pEntry ) const
{
  return Committed< VEntryValues >( i_pEntry ).m_Default;
}

const VTypedValue& VStoreReader::Minimum( Entry i_pEntry ) const
{
  return Committed< VEntryPresentation >( i_pEntry ).m_Minimum;
}

const VTypedValue& VStoreReader::Maximum( Entry i_pEntry ) const
{
  return Committed< VEntryPresentation >( i_pEntry ).m_Maximum;
}

const std::vector< VTypedValue >& VStoreReader::Choices( Entry i_pEntry ) const
{
  return Committed< VEntryPresentation >( i_pEntry ).m_Choices;
}

const std::vector< std::string >& VStoreReader::ChoiceTexts( Entry i_pEntry ) const
{
  return Committed< VEntryPresentation >( i_pEntry ).m_ChoiceTexts;
}

const std::vector< std::string >& VStoreReader::ChoiceToolTips( Entry i_pEntry ) const
{
  return Committed< VEntryPresentation >( i_pEntry ).m_ChoiceToolTips;
}

const std::string& VStoreReader::PresentationText( Entry i_pEntry ) const
{
  return Committed< VEntryPresentation >( i_pEntry ).m_Text;
}

const std::optional< std::string >& VStoreReader::OptionalText( Entry i_pEntry ) const
{
  return Committed< VEntryExtras >( i_pEntry ).m_OptionalText;
}

const std::string& VStoreReader::ExtraText1( Entry i_pEntry ) const
{
  return Committed< VEntryExtras >( i_pEntry ).m_Text1;
}

const std::string& VStoreReader::ExtraText2( Entry i_pEntry ) const
{
  return Committed< VEntryExtras >( i_pEntry ).m_Text2;
}

const std::string& VStoreReader::ExtraText3( Entry i_pEntry ) const
{
  return Committed< VEntryExtras >( i_pEntry ).m_Text3;
}

std::uint32_t VStoreReader::ExtraNumber1( Entry i_pEntry ) const
{
  return Committed< VEntryExtras >( i_pEntry ).m_Number1;
}

std::uint32_t VStoreReader::ExtraNumber2( Entry i_pEntry ) const
{
  return Committed< VEntryExtras >( i_pEntry ).m_Number2;
}

const std::string& VStoreReader::Attributes( Entry i_pEntry ) const
{
  return Committed< VEntryExtras >( i_pEntry ).m_Attributes;
}

bool VStoreReader::HasValue( Entry i_pEntry ) const
{
  return ShowsValue( *this, i_pEntry );
}

bool VStoreReader::IsVerificationPending( Entry i_pEntry ) const
{
  return ShowsVerificationPending( *this, i_pEntry );
}

bool VStoreReader::HasPresentation( Entry i_pEntry ) const
{
  return ShowsPresentation( *this, i_pEntry );
}

bool VStoreReader::HasExtras( Entry i_pEntry ) const
{
  return ShowsExtras( *this, i_pEntry );
}

std::size_t VStoreReader::ChoiceCount( Entry i_pEntry ) const
{
  return VStoreReader::Choices( i_pEntry ).size();
}

std::uint32_t VStoreReader::Capabilities( Entry i_pEntry ) const
{
  return VStoreReader::Choices( i_pEntry ).empty() ? 0 : 1;
}

ChangeId VStoreReader::Generation() const
{
  return ChangeId( m_rStore.LastCommit() );
}

VChangeIds VStoreReader::ChangeIds( Entry i_pEntry ) const
{
  return i_pEntry != nullptr ? i_pEntry->m_Changes : VChangeIds();
}

void VStoreReader::Defer( std::function< void() > i_Function ) const
{
  m_rStore.Defer( std::move( i_Function ) );
}

} // namespace Store

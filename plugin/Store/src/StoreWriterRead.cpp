#include "StoreWriter.h"

#include "ReadFields.h"
#include "Resolve.h"
#include "VStore.h"

#include <algorithm>
#include <iterator>
#include <span>
#include <utility>

// The reading side: the scope's own writes over what is committed.

namespace Store
{

using namespace ZEK;

namespace
{
const std::vector< VStoreEntry* >& CommittedChildren( const VStoreEntry& i_rEntry )
{
  static const std::vector< VStoreEntry* > None;
  return i_rEntry.m_pState ? i_rEntry.m_pState->m_Children : None;
}

const std::vector< VPendingChild >& PendingChildren( const VStoreEntry& i_rEntry )
{
  static const std::vector< VPendingChild > None;
  return i_rEntry.m_pChange != nullptr ? i_rEntry.m_pChange->m_Children.Sorted() : None;
}

/// The first of those that the scope sees.
template < typename TChild >
VStoreEntry* FirstThere( std::span< const TChild > i_Children )
{
  for ( const TChild& rChild : i_Children )
  {
    if ( IsThere( *EntryOf( rChild ) ) )
    {
      return EntryOf( rChild );
    }
  }
  return nullptr;
}
} // namespace

std::shared_ptr< IStore > VStoreWriter::GetSharedStore() const
{
  return m_rStore.Reader().GetSharedStore();
}

IStore* VStoreWriter::GetStore() const
{
  return &m_rStore;
}

std::shared_ptr< IStore > VStoreWriter::GetSharedStore()
{
  return m_rStore.Reader().GetSharedStore();
}

IStore* VStoreWriter::GetStore()
{
  return &m_rStore;
}

std::vector< IStoreReader::Entry > VStoreWriter::FindEntries( const VEntryPath& i_rPath ) const
{
  return FindOverlaid( m_rStore.Table(), i_rPath );
}

bool VStoreWriter::HasChildren( Entry i_pEntry ) const
{
  return VStoreWriter::ChildCount( i_pEntry ) != 0;
}

std::size_t VStoreWriter::ChildCount( Entry i_pEntry ) const
{
  if ( i_pEntry == nullptr )
  {
    return 0;
  }
  std::size_t Count = CommittedChildren( *i_pEntry ).size();
  for ( const VPendingChild& rChild : PendingChildren( *i_pEntry ) )
  {
    if ( !IsThere( *rChild.m_pEntry ) )
    {
      --Count;
    }
    else if ( !rChild.m_pEntry->m_pState )
    {
      ++Count;
    }
  }
  return Count;
}

std::vector< IStoreReader::Entry > VStoreWriter::Children( Entry i_pEntry ) const
{
  std::vector< Entry > Kept;
  if ( i_pEntry == nullptr )
  {
    return Kept;
  }
  std::copy_if( CommittedChildren( *i_pEntry ).begin(), CommittedChildren( *i_pEntry ).end(),
                std::back_inserter( Kept ),
                []( const VStoreEntry* i_pChild )
                {
                  return !IsReplaced( *i_pChild );
                } );
  const auto Old = static_cast< std::ptrdiff_t >( Kept.size() );
  for ( const VPendingChild& rChild : PendingChildren( *i_pEntry ) )
  {
    if ( ( rChild.m_pEntry->m_pChange->m_Mask & EAdded ) != 0 )
    {
      Kept.push_back( rChild.m_pEntry );
    }
  }
  std::inplace_merge( Kept.begin(), Kept.begin() + Old, Kept.end(), ChildLess );
  return Kept;
}

IStoreReader::Entry VStoreWriter::Child( Entry i_pEntry, const std::string& i_rName ) const
{
  if ( i_pEntry == nullptr )
  {
    return nullptr;
  }
  VStoreEntry* const pPending = FirstThere( FindChildren( PendingChildren( *i_pEntry ), i_rName ) );
  VStoreEntry* const pOld = FirstThere( FindChildren( CommittedChildren( *i_pEntry ), i_rName ) );
  return pPending == nullptr || ( pOld != nullptr && ChildLess( pOld, pPending ) ) ? pOld : pPending;
}

bool VStoreWriter::Exists( Entry i_pEntry ) const
{
  return i_pEntry != nullptr && IsThere( *i_pEntry );
}

const IO::ISchema* VStoreWriter::Schema( Entry i_pEntry ) const
{
  return OverlaidSchema( i_pEntry );
}

std::uint32_t VStoreWriter::Flags( Entry i_pEntry ) const
{
  return OverlaidFlags( i_pEntry );
}

const VTypedValue& VStoreWriter::VerifiedValue( Entry i_pEntry ) const
{
  return Overlaid< VEntryValues >( i_pEntry, EChangeVerified ).m_Verified;
}

const VTypedValue& VStoreWriter::ProposedValue( Entry i_pEntry ) const
{
  return Overlaid< VEntryValues >( i_pEntry, EChangeProposed ).m_Proposed;
}

const VTypedValue& VStoreWriter::DefaultValue( Entry i_pEntry ) const
{
  return Overlaid< VEntryValues >( i_pEntry, EChangeDefault ).m_Default;
}

const VTypedValue& VStoreWriter::Minimum( Entry i_pEntry ) const
{
  return Overlaid< VEntryPresentation >( i_pEntry, EChangeMinimum ).m_Minimum;
}

const VTypedValue& VStoreWriter::Maximum( Entry i_pEntry ) const
{
  return Overlaid< VEntryPresentation >( i_pEntry, EChangeMaximum ).m_Maximum;
}

const std::vector< VTypedValue >& VStoreWriter::Choices( Entry i_pEntry ) const
{
  return Overlaid< VEntryPresentation >( i_pEntry, EChangeChoices ).m_Choices;
}

const std::vector< std::string >& VStoreWriter::ChoiceTexts( Entry i_pEntry ) const
{
  return Overlaid< VEntryPresentation >( i_pEntry, EChangeChoiceTexts ).m_ChoiceTexts;
}

const std::vector< std::string >& VStoreWriter::ChoiceToolTips( Entry i_pEntry ) const
{
  return Overlaid< VEntryPresentation >( i_pEntry, EChangeChoiceToolTips ).m_ChoiceToolTips;
}

const std::string& VStoreWriter::PresentationText( Entry i_pEntry ) const
{
  return Overlaid< VEntryPresentation >( i_pEntry, EChangePresentationText ).m_Text;
}

const std::optional< std::string >& VStoreWriter::OptionalText( Entry i_pEntry ) const
{
  return Overlaid< VEntryExtras >( i_pEntry, EChangeOptionalText ).m_OptionalText;
}

const std::string& VStoreWriter::ExtraText1( Entry i_pEntry ) const
{
  return Overlaid< VEntryExtras >( i_pEntry, EChangeExtraText1 ).m_Text1;
}

const std::string& VStoreWriter::ExtraText2( Entry i_pEntry ) const
{
  return Overlaid< VEntryExtras >( i_pEntry, EChangeExtraText2 ).m_Text2;
}

const std::string& VStoreWriter::ExtraText3( Entry i_pEntry ) const
{
  return Overlaid< VEntryExtras >( i_pEntry, EChangeExtraText3 ).m_Text3;
}

std::uint32_t VStoreWriter::ExtraNumber1( Entry i_pEntry ) const
{
  return Overlaid< VEntryExtras >( i_pEntry, EChangeExtraNumber1 ).m_Number1;
}

std::uint32_t VStoreWriter::ExtraNumber2( Entry i_pEntry ) const
{
  return Overlaid< VEntryExtras >( i_pEntry, EChangeExtraNumber2 ).m_Number2;
}

const std::string& VStoreWriter::Attributes( Entry i_pEntry ) const
{
  return Overlaid< VEntryExtras >( i_pEntry, EChangeAttributes ).m_Attributes;
}

bool VStoreWriter::HasValue( Entry i_pEntry ) const
{
  return ShowsValue( *this, i_pEntry );
}

bool VStoreWriter::IsVerificationPending( Entry i_pEntry ) const
{
  return ShowsVerificationPending( *this, i_pEntry );
}

bool VStoreWriter::HasPresentation( Entry i_pEntry ) const
{
  return ShowsPresentation( *this, i_pEntry );
}

bool VStoreWriter::HasExtras( Entry i_pEntry ) const
{
  return ShowsExtras( *this, i_pEntry );
}

std::size_t VStoreWriter::ChoiceCount( Entry i_pEntry ) const
{
  return VStoreWriter::Choices( i_pEntry ).size();
}

std::uint32_t VStoreWriter::Capabilities( Entry i_pEntry ) const
{
  return VStoreWriter::Choices( i_pEntry ).empty() ? 0 : 1;
}

ChangeId VStoreWriter::Generation() const
{
  return ChangeId( m_rStore.LastCommit() );
}

VChangeIds VStoreWriter::ChangeIds( Entry i_pEntry ) const
{
  return i_pEntry != nullptr ? i_pEntry->m_Changes : VChangeIds();
}

void VStoreWriter::Defer( std::function< void() > i_Function ) const
{
  m_rStore.Defer( std::move( i_Function ) );
}

} // namespace Store

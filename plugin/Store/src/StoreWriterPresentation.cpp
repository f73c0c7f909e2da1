#include "StoreLog.h"
#include "StoreWriter.h"
#include "VStore.h"

#include <ZEK/TypedValueText.h>

#include <algorithm>
#include <utility>

// Range, choices, texts and extras.

namespace Store
{

using namespace ZEK;

namespace
{
/// Texts stand index for index with the choices, or not at all while none was ever given.
void AddChoiceText( std::vector< std::string >& io_rTexts, std::size_t i_ChoiceCount, std::string&& i_rText,
                    std::uint64_t i_Bit, std::uint64_t& io_rMask )
{
  if ( !i_rText.empty() || !io_rTexts.empty() )
  {
    io_rTexts.resize( i_ChoiceCount );
    io_rTexts.back() = std::move( i_rText );
    io_rMask |= i_Bit;
  }
}

template < typename T >
void EraseAt( std::vector< T >& io_rList, std::size_t i_Index )
{
  if ( i_Index < io_rList.size() )
  {
    io_rList.erase( io_rList.begin() + static_cast< std::ptrdiff_t >( i_Index ) );
  }
}

void ClearIfAllEmpty( std::vector< std::string >& io_rTexts )
{
  if ( std::all_of( io_rTexts.begin(), io_rTexts.end(),
                    []( const std::string& i_rText )
                    {
                      return i_rText.empty();
                    } ) )
  {
    io_rTexts.clear();
  }
}

std::string Quoted( const std::string& i_rText )
{
  std::string Quoted = "\"";
  for ( const char Byte : i_rText )
  {
    switch ( Byte )
    {
    case '\t':
      Quoted += "\\t";
      break;
    case '\n':
      Quoted += "\\n";
      break;
    case '\r':
      Quoted += "\\r";
      break;
    case '"':
    case '\\':
      Quoted += '\\';
      [[fallthrough]];
    default:
      Quoted += Byte;
    }
  }
  return Quoted + '"';
}
} // namespace

IResult VStoreWriter::SetMinimum( Entry i_pEntry, VTypedValue i_Value )
{
  IResult Result;
  VEntryChange* const pChange = ObtainFor(
      i_pEntry, i_Value, "Failed to set '%1%' minimum value: the value type does not match the entry type.", Result );
  if ( pChange != nullptr )
  {
    pChange->Presentation().m_Minimum = std::move( i_Value );
    pChange->m_Mask |= EChangeMinimum;
  }
  return Result;
}

IResult VStoreWriter::SetMaximum( Entry i_pEntry, VTypedValue i_Value )
{
  IResult Result;
  VEntryChange* const pChange = ObtainFor(
      i_pEntry, i_Value, "Failed to set '%1%' maximum value: the value type does not match the entry type.", Result );
  if ( pChange != nullptr )
  {
    pChange->Presentation().m_Maximum = std::move( i_Value );
    pChange->m_Mask |= EChangeMaximum;
  }
  return Result;
}

void VStoreWriter::FillChoices( Entry i_pEntry, VEntryChange& io_rChange )
{
  const VEntryPresentation& rOld = Committed< VEntryPresentation >( i_pEntry );
  VEntryPresentation& rNew = io_rChange.Presentation();
  io_rChange.m_bChoices = true;
  const auto IsMissing = [&io_rChange]( std::uint64_t i_Bit )
  {
    return ( io_rChange.m_Mask & ( i_Bit | ChangeMask::Replaced ) ) == 0;
  };
  if ( IsMissing( EChangeChoices ) )
  {
    rNew.m_Choices = rOld.m_Choices;
  }
  if ( IsMissing( EChangeChoiceTexts ) )
  {
    rNew.m_ChoiceTexts = rOld.m_ChoiceTexts;
  }
  if ( IsMissing( EChangeChoiceToolTips ) )
  {
    rNew.m_ChoiceToolTips = rOld.m_ChoiceToolTips;
  }
}

IResult VStoreWriter::AddValueChoice( Entry i_pEntry, VTypedValue i_Value, std::string i_Text, std::string i_ToolTip )
{
  IResult Result;
  VEntryChange* const pChange = ObtainFor(
      i_pEntry, i_Value, "Failed to add '%1%' value choice: the value type does not match the entry type.", Result );
  if ( pChange != nullptr )
  {
    FillChoices( i_pEntry, *pChange );
    VEntryPresentation& rNew = pChange->Presentation();
    rNew.m_Choices.push_back( std::move( i_Value ) );
    pChange->m_Mask |= EChangeChoices;
    const std::size_t Count = rNew.m_Choices.size();
    AddChoiceText( rNew.m_ChoiceTexts, Count, std::move( i_Text ), EChangeChoiceTexts, pChange->m_Mask );
    AddChoiceText( rNew.m_ChoiceToolTips, Count, std::move( i_ToolTip ), EChangeChoiceToolTips, pChange->m_Mask );
  }
  return Result;
}

IResult VStoreWriter::RemoveValueChoice( Entry i_pEntry, std::size_t i_Index )
{
  if ( i_pEntry == nullptr )
  {
    return IResult::InvalidHandle;
  }
  if ( i_Index >= VStoreWriter::ChoiceCount( i_pEntry ) )
  {
    Log( StoreCategory(), ELogFailure, "Failed to remove '%1%' value choice: the choice index provided was invalid.",
         i_pEntry->m_Path.Text() );
    return IResult::InvalidIndex;
  }
  VEntryChange& rChange = Obtain( i_pEntry );
  FillChoices( i_pEntry, rChange );
  EraseAt( rChange.Presentation().m_Choices, i_Index );
  EraseAt( rChange.Presentation().m_ChoiceTexts, i_Index );
  EraseAt( rChange.Presentation().m_ChoiceToolTips, i_Index );
  ClearIfAllEmpty( rChange.Presentation().m_ChoiceTexts );
  ClearIfAllEmpty( rChange.Presentation().m_ChoiceToolTips );
  rChange.m_Mask |= EChangeChoices | EChangeChoiceTexts | EChangeChoiceToolTips;
  return IResult::Ok;
}

IResult VStoreWriter::ClearValueChoices( Entry i_pEntry )
{
  if ( i_pEntry == nullptr )
  {
    return IResult::InvalidHandle;
  }
  if ( VStoreWriter::ChoiceCount( i_pEntry ) == 0 )
  {
    return IResult::OkButNoEffect;
  }
  VEntryChange& rChange = Obtain( i_pEntry );
  rChange.Presentation().m_Choices.clear();
  rChange.Presentation().m_ChoiceTexts.clear();
  rChange.Presentation().m_ChoiceToolTips.clear();
  rChange.m_Mask |= EChangeChoices | EChangeChoiceTexts;
  if ( !Committed< VEntryPresentation >( i_pEntry ).m_ChoiceToolTips.empty() )
  {
    rChange.m_Mask |= EChangeChoiceToolTips;
  }
  return IResult::Ok;
}

IResult VStoreWriter::SetChoiceToolTip( Entry i_pEntry, std::size_t i_Index, std::string i_Text )
{
  if ( i_pEntry == nullptr )
  {
    return IResult::InvalidHandle;
  }
  const std::size_t Count = VStoreWriter::ChoiceCount( i_pEntry );
  if ( i_Index >= Count )
  {
    return IResult::InvalidIndex;
  }
  VEntryChange& rChange = Obtain( i_pEntry );
  FillChoices( i_pEntry, rChange );
  std::vector< std::string >& rToolTips = rChange.Presentation().m_ChoiceToolTips;
  rToolTips.resize( Count );
  rToolTips[i_Index] = std::move( i_Text );
  ClearIfAllEmpty( rToolTips );
  rChange.m_Mask |= EChangeChoiceToolTips;
  return IResult::Ok;
}

void VStoreWriter::SetPresentationText( Entry i_pEntry, std::string i_Text )
{
  if ( i_pEntry != nullptr )
  {
    VEntryChange& rChange = Obtain( i_pEntry );
    rChange.Presentation().m_Text = std::move( i_Text );
    rChange.m_Mask |= EChangePresentationText;
  }
}

template < typename T >
void VStoreWriter::SetExtra( Entry i_pEntry, T VEntryExtras::*i_pField, std::uint64_t i_Bit, T i_Value )
{
  if ( i_pEntry != nullptr )
  {
    VEntryChange& rChange = Obtain( i_pEntry );
    rChange.Extras().*i_pField = std::move( i_Value );
    rChange.m_Mask |= i_Bit;
  }
}

void VStoreWriter::SetOptionalText( Entry i_pEntry, std::string i_Text )
{
  SetExtra( i_pEntry, &VEntryExtras::m_OptionalText, EChangeOptionalText, std::optional( std::move( i_Text ) ) );
}

void VStoreWriter::ClearOptionalText( Entry i_pEntry )
{
  SetExtra( i_pEntry, &VEntryExtras::m_OptionalText, EChangeOptionalText, std::optional< std::string >() );
}

void VStoreWriter::SetExtraText1( Entry i_pEntry, std::string i_Text )
{
  SetExtra( i_pEntry, &VEntryExtras::m_Text1, EChangeExtraText1, std::move( i_Text ) );
}

void VStoreWriter::SetExtraText2( Entry i_pEntry, std::string i_Text )
{
  SetExtra( i_pEntry, &VEntryExtras::m_Text2, EChangeExtraText2, std::move( i_Text ) );
}

void VStoreWriter::SetExtraText3( Entry i_pEntry, std::string i_Text )
{
  SetExtra( i_pEntry, &VEntryExtras::m_Text3, EChangeExtraText3, std::move( i_Text ) );
}

void VStoreWriter::SetExtraNumber1( Entry i_pEntry, std::uint32_t i_Number )
{
  SetExtra( i_pEntry, &VEntryExtras::m_Number1, EChangeExtraNumber1, i_Number );
}

void VStoreWriter::SetExtraNumber2( Entry i_pEntry, std::uint32_t i_Number )
{
  SetExtra( i_pEntry, &VEntryExtras::m_Number2, EChangeExtraNumber2, i_Number );
}

void VStoreWriter::SetAttributes( Entry i_pEntry, const std::map< std::string, VTypedValue >& i_rAttributes )
{
  std::string Text = "{";
  std::string ValueText;
  for ( const auto& [rName, rValue] : i_rAttributes )
  {
    if ( rValue.m_pSchema != nullptr && IO::ValueToText( rValue, ValueText ) )
    {
      Text += Quoted( rName ) + ':' + ValueText + ',';
    }
  }
  if ( Text.size() > 1 )
  {
    Text.pop_back();
  }
  SetAttributesText( i_pEntry, Text + '}' );
}

void VStoreWriter::SetAttributesText( Entry i_pEntry, std::string i_Text )
{
  SetExtra( i_pEntry, &VEntryExtras::m_Attributes, EChangeAttributes, std::move( i_Text ) );
}

} // namespace Store

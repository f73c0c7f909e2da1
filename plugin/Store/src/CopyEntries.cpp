#include "StoreLog.h"

#include <Store/Store.h>
#include <ZEK/StoreFlags.h>

#include <vector>

namespace Store
{

using namespace ZEK;

namespace
{
using Entry = IStoreReader::Entry;

void Note( IResult i_New, IResult& io_rResult )
{
  if ( i_New.IsError() && io_rResult.IsOk() )
  {
    io_rResult = i_New;
  }
}

/// Values as they are, whatever the target has: switching flags moves values about, and setting them clears
/// EUsingDefault, so the order matters.
void CopyValues( const IStoreReader& i_rFrom, Entry i_pFrom, IStoreWriter& io_rTo, Entry i_pTo, IResult& io_rResult )
{
  const std::uint32_t Flags = i_rFrom.Flags( i_pFrom );
  io_rTo.SetFlags( i_pTo, EAllStoreFlags & ~Flags, false );
  io_rTo.SetFlags( i_pTo, Flags & ~std::uint32_t( EUsingDefault ), true );
  if ( i_rFrom.DefaultValue( i_pFrom ) != io_rTo.DefaultValue( i_pTo ) )
  {
    Note( io_rTo.SetDefaultValue( i_pTo, i_rFrom.DefaultValue( i_pFrom ) ), io_rResult );
  }
  Note( io_rTo.SetProposedValue( i_pTo, i_rFrom.ProposedValue( i_pFrom ) ), io_rResult );
  Note( io_rTo.SetVerifiedValue( i_pTo, i_rFrom.VerifiedValue( i_pFrom ) ), io_rResult );
  io_rTo.SetFlags( i_pTo, EUsingDefault, ( Flags & EUsingDefault ) != 0 );
}

void CopyPresentation( const IStoreReader& i_rFrom, Entry i_pFrom, IStoreWriter& io_rTo, Entry i_pTo,
                       IResult& io_rResult )
{
  if ( !i_rFrom.HasPresentation( i_pFrom ) && !io_rTo.HasPresentation( i_pTo ) )
  {
    return;
  }
  Note( io_rTo.SetMinimum( i_pTo, i_rFrom.Minimum( i_pFrom ) ), io_rResult );
  Note( io_rTo.SetMaximum( i_pTo, i_rFrom.Maximum( i_pFrom ) ), io_rResult );
  (void)io_rTo.ClearValueChoices( i_pTo );
  const auto At = []( const std::vector< std::string >& i_rTexts, std::size_t i_Index )
  {
    return i_Index < i_rTexts.size() ? i_rTexts[i_Index] : std::string();
  };
  for ( std::size_t Index = 0; Index < i_rFrom.ChoiceCount( i_pFrom ); ++Index )
  {
    Note( io_rTo.AddValueChoice( i_pTo, i_rFrom.Choices( i_pFrom )[Index], At( i_rFrom.ChoiceTexts( i_pFrom ), Index ),
                                 At( i_rFrom.ChoiceToolTips( i_pFrom ), Index ) ),
          io_rResult );
  }
  io_rTo.SetPresentationText( i_pTo, i_rFrom.PresentationText( i_pFrom ) );
}

void CopyExtras( const IStoreReader& i_rFrom, Entry i_pFrom, IStoreWriter& io_rTo, Entry i_pTo )
{
  if ( !i_rFrom.HasExtras( i_pFrom ) && !io_rTo.HasExtras( i_pTo ) )
  {
    return;
  }
  if ( i_rFrom.OptionalText( i_pFrom ) )
  {
    io_rTo.SetOptionalText( i_pTo, *i_rFrom.OptionalText( i_pFrom ) );
  }
  else
  {
    io_rTo.ClearOptionalText( i_pTo );
  }
  io_rTo.SetExtraText1( i_pTo, i_rFrom.ExtraText1( i_pFrom ) );
  io_rTo.SetExtraText2( i_pTo, i_rFrom.ExtraText2( i_pFrom ) );
  io_rTo.SetExtraText3( i_pTo, i_rFrom.ExtraText3( i_pFrom ) );
  io_rTo.SetExtraNumber1( i_pTo, i_rFrom.ExtraNumber1( i_pFrom ) );
  io_rTo.SetExtraNumber2( i_pTo, i_rFrom.ExtraNumber2( i_pFrom ) );
  io_rTo.SetAttributesText( i_pTo, i_rFrom.Attributes( i_pFrom ) );
}

void CopyEntry( const IStoreReader& i_rFrom, Entry i_pFrom, IStoreWriter& io_rTo, bool i_bPersistentOnly,
                IResult& io_rResult )
{
  const VEntryPath& rPath = i_rFrom.GetStore()->EntryPath( i_pFrom );
  if ( i_bPersistentOnly && ( i_rFrom.Flags( i_pFrom ) & EPersistent ) == 0 )
  {
    Log( StoreCategory(), ELogDetail, "Skipping non-persistable entry '%s'.", rPath.Text() );
    return;
  }
  const Entry pTo = io_rTo.GetStore()->GetEntry( rPath );
  const IResult Typed = io_rTo.SetSchema( pTo, i_rFrom.Schema( i_pFrom ) );
  Note( Typed, io_rResult );
  if ( Typed.IsOk() )
  {
    CopyValues( i_rFrom, i_pFrom, io_rTo, pTo, io_rResult );
    CopyPresentation( i_rFrom, i_pFrom, io_rTo, pTo, io_rResult );
    CopyExtras( i_rFrom, i_pFrom, io_rTo, pTo );
  }
}
} // namespace

IResult CopyEntries( const IStoreReader& i_rFrom, IStoreWriter& io_rTo, bool i_bPersistentOnly )
{
  IResult Result;
  const Entry pRoot = i_rFrom.GetStore()->GetRootEntry();
  std::vector< Entry > Left;
  if ( i_rFrom.Exists( pRoot ) )
  {
    Left.push_back( pRoot );
  }
  while ( !Left.empty() )
  {
    const Entry pEntry = Left.back();
    Left.pop_back();
    CopyEntry( i_rFrom, pEntry, io_rTo, i_bPersistentOnly, Result );
    const std::vector< Entry > Children = i_rFrom.Children( pEntry );
    Left.insert( Left.end(), Children.rbegin(), Children.rend() );
  }
  return Result;
}

} // namespace Store

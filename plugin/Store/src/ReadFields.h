#pragma once

#include <ZEK/StoreFlags.h>
#include <ZEK/StoreReader.h>

namespace Store
{

// What follows from the fields that a view shows. The view's operations are called by their own class, so that they
// are found when the program is built.

template < typename TView >
bool ShowsValue( const TView& i_rView, ZEK::IStoreReader::Entry i_pEntry )
{
  return !i_rView.VerifiedValue( i_pEntry ).IsEmpty() || !i_rView.ProposedValue( i_pEntry ).IsEmpty();
}

template < typename TView >
bool ShowsVerificationPending( const TView& i_rView, ZEK::IStoreReader::Entry i_pEntry )
{
  return ( i_rView.Flags( i_pEntry ) & ZEK::EVerifyRequired ) != 0 &&
         i_rView.VerifiedValue( i_pEntry ) != i_rView.ProposedValue( i_pEntry );
}

template < typename TView >
bool ShowsPresentation( const TView& i_rView, ZEK::IStoreReader::Entry i_pEntry )
{
  return !i_rView.Minimum( i_pEntry ).IsEmpty() || !i_rView.Maximum( i_pEntry ).IsEmpty() ||
         !i_rView.Choices( i_pEntry ).empty() || !i_rView.ChoiceTexts( i_pEntry ).empty() ||
         !i_rView.ChoiceToolTips( i_pEntry ).empty() || !i_rView.PresentationText( i_pEntry ).empty();
}

template < typename TView >
bool ShowsExtras( const TView& i_rView, ZEK::IStoreReader::Entry i_pEntry )
{
  return i_rView.OptionalText( i_pEntry ) || !i_rView.ExtraText1( i_pEntry ).empty() ||
         !i_rView.ExtraText2( i_pEntry ).empty() || !i_rView.ExtraText3( i_pEntry ).empty() ||
         i_rView.ExtraNumber1( i_pEntry ) != 0 || i_rView.ExtraNumber2( i_pEntry ) != 0 ||
         !i_rView.Attributes( i_pEntry ).empty();
}

} // namespace Store

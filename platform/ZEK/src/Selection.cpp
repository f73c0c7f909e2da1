#include <ZEK/Selection.h>

#include <algorithm>
#include <set>

namespace ZEK
{

VSelection EditSelection( const VSelection& i_rFrom, const VSelection& i_rPicked, ESelectionEdit i_Edit )
{
  if ( i_Edit == ESelectionEdit::Replace )
  {
    return EditSelection( {}, i_rPicked, ESelectionEdit::Add );
  }
  const std::set< VSelectionItem > Picked( i_rPicked.begin(), i_rPicked.end() );
  const std::set< VSelectionItem > Former( i_rFrom.begin(), i_rFrom.end() );
  // What is picked goes or comes back at the end, where the current item stands.
  VSelection Result;
  std::copy_if( i_rFrom.begin(), i_rFrom.end(), std::back_inserter( Result ),
                [&]( const VSelectionItem& i_rItem )
                {
                  return !Picked.contains( i_rItem );
                } );
  if ( i_Edit != ESelectionEdit::Remove )
  {
    std::set< VSelectionItem > Added;
    for ( const VSelectionItem& rItem : i_rPicked )
    {
      const bool bGoes = i_Edit == ESelectionEdit::Toggle && Former.contains( rItem );
      if ( !bGoes && Added.insert( rItem ).second )
      {
        Result.push_back( rItem );
      }
    }
  }
  return Result;
}

} // namespace ZEK

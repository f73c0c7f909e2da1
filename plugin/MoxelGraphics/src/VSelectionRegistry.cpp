#include <MoxelGraphics/VSelectionRegistry.h>

#include "Log.h"

#include <algorithm>
#include <bit>

namespace MoxelGraphics
{
namespace
{
constexpr std::uint32_t BothMarks = EIdSelected | EIdPreselected;
/// The first id whose upper bits, with both marks, reach what the outline takes for the current item.
constexpr std::uint32_t FirstLookalike = 0x40000;

std::size_t HashOf( const ZEK::VSelectionItem& i_rItem )
{
  constexpr std::size_t Spread = 0x9E3779B97F4A7C15;
  const std::size_t Number =
      ( std::size_t( i_rItem.Kind ) << 56 ) ^ ( std::size_t( i_rItem.Object ) << 32 ) ^ i_rItem.Sub;
  const std::size_t Mixed = ( Number ^ std::hash< std::string >()( i_rItem.Device ) ) * Spread;
  return Mixed ^ Mixed >> 32;
}

bool IsOfGreatNumbers( std::uint32_t i_Kind )
{
  return i_Kind == ZEK::ESelectGreyscaleBlob || i_Kind == ZEK::ESelectMaskCell;
}
} // namespace

template < typename TValue >
void VSelectionRegistry::VTable< TValue >::Clear()
{
  Count = 0;
  Order.clear();
  bSorted = true;
}

template < typename TValue >
void VSelectionRegistry::VTable< TValue >::Set( const ZEK::VSelectionItem& i_rItem, const TValue& i_rValue )
{
  if ( Count == Entries.size() )
  {
    Entries.emplace_back();
  }
  Entries[Count].Item = i_rItem;
  Entries[Count].Value = i_rValue;
  ++Count;
  bSorted = false;
}

template < typename TValue >
bool VSelectionRegistry::VTable< TValue >::Get( const ZEK::VSelectionItem& i_rItem, TValue& o_rValue ) const
{
  if ( !bSorted )
  {
    Order.resize( Count );
    for ( std::uint32_t Index = 0; Index < Count; ++Index )
    {
      Order[Index] = Index;
    }
    std::stable_sort( Order.begin(), Order.end(),
                      [&]( std::uint32_t i_Left, std::uint32_t i_Right )
                      {
                        return Entries[i_Left].Item < Entries[i_Right].Item;
                      } );
    bSorted = true;
  }
  // Of equal items the last one set counts.
  const auto Above = std::upper_bound( Order.begin(), Order.end(), i_rItem,
                                       [&]( const ZEK::VSelectionItem& i_rLeft, std::uint32_t i_Right )
                                       {
                                         return i_rLeft < Entries[i_Right].Item;
                                       } );
  if ( Above == Order.begin() || Entries[*( Above - 1 )].Item != i_rItem )
  {
    return false;
  }
  o_rValue = Entries[*( Above - 1 )].Value;
  return true;
}

VSelectionRegistry::VSelectionRegistry( std::shared_ptr< ZEK::ISelectionService > i_pService )
  : m_pService( std::move( i_pService ) )
{
  TakeMarks();
}

void VSelectionRegistry::Reset()
{
  m_NextId = 1;
  m_Ranges.clear();
  m_ItemCount = 0;
  m_LabelCount = 0;
  m_Positions.Clear();
  m_Poses.Clear();
  TakeMarks();
}

void VSelectionRegistry::TakeMarks()
{
  if ( !m_pService )
  {
    return;
  }
  // Read before the sets: a change in between is then seen as new next time.
  const std::uint64_t Generation = m_pService->Generation();
  if ( m_bMarksTaken && Generation == m_ServiceGeneration )
  {
    return;
  }
  m_bMarksTaken = true;
  m_ServiceGeneration = Generation;
  m_Marks.clear();
  const ZEK::VSelection Selection = m_pService->Get( ZEK::ISelectionService::EPrimary );
  for ( const ZEK::VSelectionItem& rItem : Selection )
  {
    m_Marks.push_back( { rItem, EIdSelected } );
  }
  if ( !m_Marks.empty() )
  {
    m_Marks.back().Flags |= EIdPrimary;
  }
  for ( const ZEK::VSelectionItem& rItem : m_pService->Get( ZEK::ISelectionService::ESecondary ) )
  {
    m_Marks.push_back( { rItem, EIdPreselected } );
  }
  std::stable_sort( m_Marks.begin(), m_Marks.end(),
                    []( const VMark& i_rLeft, const VMark& i_rRight )
                    {
                      return i_rLeft.Item < i_rRight.Item;
                    } );
  std::size_t Kept = 0;
  for ( std::size_t Index = 0; Index < m_Marks.size(); ++Index )
  {
    if ( Kept > 0 && m_Marks[Kept - 1].Item == m_Marks[Index].Item )
    {
      m_Marks[Kept - 1].Flags |= m_Marks[Index].Flags;
    }
    else
    {
      if ( Kept != Index )
      {
        m_Marks[Kept] = std::move( m_Marks[Index] );
      }
      ++Kept;
    }
  }
  m_Marks.resize( Kept );
  ++m_MarksGeneration;
}

bool VSelectionRegistry::Take( std::uint32_t i_Count, VRange*& o_rpRange )
{
  // The last id is EIdMask itself.
  if ( i_Count > EIdMask + 1 - m_NextId )
  {
    if ( !std::exchange( m_bRanOut, true ) )
    {
      ZEK::Log( LogCategory(), ZEK::ELogDetail, "Selection ids ran out: %1% more were asked for after %2%", i_Count,
                m_NextId - 1 );
    }
    return false;
  }
  if ( m_Ranges.empty() || m_Ranges.back().First != m_NextId )
  {
    m_Ranges.emplace_back();
  }
  o_rpRange = &m_Ranges.back();
  *o_rpRange = VRange{ m_NextId, i_Count, 0, nullptr };
  m_NextId += i_Count;
  return true;
}

std::uint32_t VSelectionRegistry::Allocate( const ZEK::VSelectionItem& i_rItem, std::uint32_t i_Count )
{
  VRange* pRange = nullptr;
  if ( !Take( i_Count, pRange ) )
  {
    return 0;
  }
  if ( m_ItemCount == m_Items.size() )
  {
    m_Items.emplace_back();
  }
  m_Items[m_ItemCount] = i_rItem;
  pRange->ItemIndex = static_cast< std::uint32_t >( m_ItemCount++ );
  WarnOfLookalikes( *pRange );
  return pRange->First;
}

std::uint32_t VSelectionRegistry::AllocateLabelled( const ZEK::VSelectionItem& i_rItem, std::uint32_t i_Count,
                                                    const std::string& i_rLabel )
{
  const std::uint32_t Id = Allocate( i_rItem, i_Count );
  if ( Id != 0 )
  {
    if ( m_LabelCount > 0 && m_Labels[m_LabelCount - 1].Id == Id )
    {
      --m_LabelCount;
    }
    if ( m_LabelCount == m_Labels.size() )
    {
      m_Labels.emplace_back();
    }
    m_Labels[m_LabelCount].Id = Id;
    m_Labels[m_LabelCount].Text = i_rLabel;
    ++m_LabelCount;
  }
  return Id;
}

std::uint32_t VSelectionRegistry::AllocateRange( std::uint32_t i_Count, const IRangeResolver& i_rResolver )
{
  VRange* pRange = nullptr;
  if ( !Take( i_Count, pRange ) )
  {
    return 0;
  }
  pRange->pResolver = &i_rResolver;
  WarnOfLookalikes( *pRange );
  return pRange->First;
}

bool VSelectionRegistry::FindIn( const VRange& i_rRange, const ZEK::VSelectionItem& i_rItem,
                                 std::uint32_t& o_rIndex ) const
{
  if ( i_rRange.pResolver )
  {
    return i_rRange.pResolver->FindIndex( i_rItem, o_rIndex ) && o_rIndex < i_rRange.Count;
  }
  ZEK::VSelectionItem Item = m_Items[i_rRange.ItemIndex];
  const bool bSub = ZEK::HasSubIndex( Item.Kind ) && i_rRange.Count > 1;
  o_rIndex = 0;
  if ( Item == i_rItem )
  {
    return true;
  }
  Item.Sub = i_rItem.Sub;
  o_rIndex = i_rItem.Sub;
  return bSub && Item == i_rItem && i_rItem.Sub < i_rRange.Count;
}

void VSelectionRegistry::WarnOfLookalikes( const VRange& i_rRange )
{
  if ( m_NextId <= FirstLookalike || m_bWarned )
  {
    return;
  }
  for ( const VMark& rMark : m_Marks )
  {
    std::uint32_t Index = 0;
    if ( ( rMark.Flags & BothMarks ) == BothMarks && !IsOfGreatNumbers( rMark.Item.Kind ) &&
         FindIn( i_rRange, rMark.Item, Index ) && i_rRange.First + Index >= FirstLookalike )
    {
      m_bWarned = true;
      ZEK::Log(
          LogCategory(), ZEK::ELogWarning,
          "Selection id %1% is so high that its object, both selected and preselected, looks like the current one",
          i_rRange.First + Index );
      return;
    }
  }
}

std::uint32_t VSelectionRegistry::Word( const ZEK::VSelectionItem& i_rItem )
{
  const std::uint32_t Id = Allocate( i_rItem );
  return Id == 0 ? 0 : Id | ( Flags( i_rItem ) & ( EIdSelected | EIdPreselected ) );
}

std::uint32_t VSelectionRegistry::Word( const ZEK::VSelectionItem& i_rItem, const std::string& i_rLabel,
                                        bool i_bPrimary )
{
  const std::uint32_t Id = AllocateLabelled( i_rItem, 1, i_rLabel );
  return Id == 0 ? 0 : Id | ( Flags( i_rItem ) & ( EIdSelected | EIdPreselected ) ) | ( i_bPrimary ? EIdPrimary : 0u );
}

std::array< float, 3 > VSelectionRegistry::Colour( const ZEK::VSelectionItem& i_rItem )
{
  return ColourOfWord( Word( i_rItem ) );
}

std::array< float, 3 > VSelectionRegistry::Colour( const ZEK::VSelectionItem& i_rItem, const std::string& i_rLabel,
                                                   bool i_bPrimary )
{
  return ColourOfWord( Word( i_rItem, i_rLabel, i_bPrimary ) );
}

std::array< float, 3 > VSelectionRegistry::ColourOfWord( std::uint32_t i_Word )
{
  constexpr float Part = 0.003921569f;
  return { static_cast< float >( i_Word & 0xFF ) * Part, static_cast< float >( ( i_Word >> 8 ) & 0xFF ) * Part,
           static_cast< float >( ( i_Word >> 16 ) & 0xFF ) * Part };
}

std::uint32_t VSelectionRegistry::Flags( const ZEK::VSelectionItem& i_rItem ) const
{
  if ( m_Marks.empty() )
  {
    return 0;
  }
  const auto Found = std::lower_bound( m_Marks.begin(), m_Marks.end(), i_rItem,
                                       []( const VMark& i_rLeft, const ZEK::VSelectionItem& i_rRight )
                                       {
                                         return i_rLeft.Item < i_rRight;
                                       } );
  return Found != m_Marks.end() && Found->Item == i_rItem ? Found->Flags : 0;
}

void VSelectionRegistry::SetPosition( const ZEK::VSelectionItem& i_rItem, const VScenePoint& i_rPoint )
{
  m_Positions.Set( i_rItem, i_rPoint );
}

void VSelectionRegistry::SetPose( const ZEK::VSelectionItem& i_rItem, const VScenePose& i_rPose )
{
  m_Poses.Set( i_rItem, i_rPose );
}

template < typename TAsk >
bool VSelectionRegistry::AskResolvers( const ZEK::VSelectionItem& i_rItem, TAsk i_Ask ) const
{
  return std::any_of( m_Ranges.begin(), m_Ranges.end(),
                      [&]( const VRange& i_rRange )
                      {
                        std::uint32_t Index = 0;
                        return i_rRange.pResolver && i_rRange.pResolver->FindIndex( i_rItem, Index ) &&
                               i_Ask( *i_rRange.pResolver, Index );
                      } );
}

bool VSelectionRegistry::GetPosition( const ZEK::VSelectionItem& i_rItem, VScenePoint& o_rPoint ) const
{
  return m_Positions.Get( i_rItem, o_rPoint ) ||
         AskResolvers( i_rItem,
                       [&]( const IRangeResolver& i_rResolver, std::uint32_t i_Index )
                       {
                         return i_rResolver.GetPoint( i_Index, o_rPoint );
                       } );
}

bool VSelectionRegistry::GetPose( const ZEK::VSelectionItem& i_rItem, VScenePose& o_rPose ) const
{
  return m_Poses.Get( i_rItem, o_rPose ) ||
         AskResolvers( i_rItem,
                       [&]( const IRangeResolver& i_rResolver, std::uint32_t i_Index )
                       {
                         return i_rResolver.GetPose( i_Index, o_rPose );
                       } );
}

const VSelectionRegistry::VRange* VSelectionRegistry::RangeOf( std::uint32_t i_Id ) const
{
  if ( i_Id == 0 || i_Id >= m_NextId )
  {
    return nullptr;
  }
  const auto Above = std::upper_bound( m_Ranges.begin(), m_Ranges.end(), i_Id,
                                       []( std::uint32_t i_Left, const VRange& i_rRight )
                                       {
                                         return i_Left < i_rRight.First;
                                       } );
  return Above == m_Ranges.begin() ? nullptr : &*( Above - 1 );
}

bool VSelectionRegistry::Resolve( std::uint32_t i_Id, ZEK::VSelectionItem& o_rItem ) const
{
  std::string Label;
  return Resolve( i_Id, o_rItem, Label );
}

bool VSelectionRegistry::Resolve( std::uint32_t i_Id, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const
{
  const std::uint32_t Id = i_Id & EIdMask;
  const VRange* pRange = RangeOf( Id );
  o_rLabel.clear();
  if ( !pRange )
  {
    return false;
  }
  const std::uint32_t Offset = Id - pRange->First;
  if ( pRange->pResolver )
  {
    return pRange->pResolver->ResolveIndex( Offset, o_rItem, o_rLabel );
  }
  o_rItem = m_Items[pRange->ItemIndex];
  if ( Offset > 0 && ZEK::HasSubIndex( o_rItem.Kind ) )
  {
    o_rItem.Sub = Offset;
  }
  const auto End = m_Labels.begin() + static_cast< std::ptrdiff_t >( m_LabelCount );
  const auto Found = std::lower_bound( m_Labels.begin(), End, Id,
                                       []( const VLabel& i_rLeft, std::uint32_t i_Right )
                                       {
                                         return i_rLeft.Id < i_Right;
                                       } );
  if ( Found != End && Found->Id == Id )
  {
    o_rLabel = Found->Text;
  }
  return true;
}

ZEK::VSelection VSelectionRegistry::ResolveAll( std::span< const std::uint32_t > i_Ids,
                                                std::vector< std::string >& io_rLabels ) const
{
  ZEK::VSelection Selection;
  Selection.reserve( i_Ids.size() );
  // Open addressing over the items that were taken: a band may hold thousands.
  std::vector< std::uint32_t > Slots( std::bit_ceil( i_Ids.size() * 2 + 1 ), 0 );
  const auto IsNew = [&]( const ZEK::VSelectionItem& i_rItem )
  {
    std::size_t Slot = HashOf( i_rItem );
    for ( ;; ++Slot )
    {
      std::uint32_t& rTaken = Slots[Slot & ( Slots.size() - 1 )];
      if ( rTaken == 0 )
      {
        rTaken = static_cast< std::uint32_t >( Selection.size() + 1 );
        return true;
      }
      if ( Selection[rTaken - 1] == i_rItem )
      {
        return false;
      }
    }
  };
  ZEK::VSelectionItem Item;
  std::string Label;
  for ( const std::uint32_t Id : i_Ids )
  {
    if ( !Resolve( Id, Item, Label ) )
    {
      continue;
    }
    if ( !Label.empty() )
    {
      io_rLabels.push_back( std::move( Label ) );
    }
    if ( IsNew( Item ) )
    {
      Selection.push_back( Item );
    }
  }
  return Selection;
}

std::uint32_t VSelectionRegistry::FindId( const ZEK::VSelectionItem& i_rItem ) const
{
  for ( const VRange& rRange : m_Ranges )
  {
    std::uint32_t Index = 0;
    if ( FindIn( rRange, i_rItem, Index ) )
    {
      return rRange.First + Index;
    }
  }
  return 0;
}

} // namespace MoxelGraphics

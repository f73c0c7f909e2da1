#include <ZEK/FlowTypes.h>

#include <algorithm>

namespace ZEK
{

bool FlowTimeMatches( EFlowTimeMatch i_Match, const VFlowTimeKey& i_rEntry, const VFlowTimeKey& i_rQuery )
{
  switch ( i_Match )
  {
  case EFlowTimeMatch::Equal:
    return i_rEntry == i_rQuery;
  case EFlowTimeMatch::Before:
    return i_rEntry < i_rQuery;
  case EFlowTimeMatch::BeforeOrAt:
    return i_rEntry <= i_rQuery;
  case EFlowTimeMatch::After:
    return i_rEntry > i_rQuery;
  case EFlowTimeMatch::AtOrAfter:
    return i_rEntry >= i_rQuery;
  case EFlowTimeMatch::Overlap:
    break;
  }
  // Lengths are compared as differences, so that a span up to the greatest number does not overflow a sum.
  const auto Length = []( const VFlowTimeKey& i_rKey )
  {
    return static_cast< std::uint64_t >( std::max< std::int64_t >( i_rKey.Span, 1 ) );
  };
  if ( i_rEntry.Clock != i_rQuery.Clock )
  {
    return false;
  }
  const auto EntryFrame = static_cast< std::uint64_t >( i_rEntry.Frame );
  const auto QueryFrame = static_cast< std::uint64_t >( i_rQuery.Frame );
  return i_rEntry.Frame <= i_rQuery.Frame ? QueryFrame - EntryFrame < Length( i_rEntry )
                                          : EntryFrame - QueryFrame < Length( i_rQuery );
}

} // namespace ZEK

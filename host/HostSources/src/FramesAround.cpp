#include "FramesAround.h"

#include <CoreMoxelTypes/FlowTypes.h>

#include <algorithm>

namespace HostSources
{
namespace
{
constexpr int RestAfterSlow = 30;

bool HasVideo( const ZEK::VFlowStateRef& i_rState )
{
  ZEK::VFlowItemRef Video;
  i_rState->FindItem( Video, ZEK::FlowTag< CoreMoxelTypes::FlowVideoFrame >, ZEK::EFlowTimeMatch::Overlap );
  return static_cast< bool >( Video );
}
} // namespace

VFramesAround::VFramesAround( std::int64_t i_Frames, VSourcePump::VTakeAround i_Take )
  : m_Frames( std::max< std::int64_t >( i_Frames, 0 ) )
  , m_Take( std::move( i_Take ) )
  , m_Slots( static_cast< std::size_t >( 2 * m_Frames + 1 ) )
{
  m_States.reserve( m_Slots.size() );
}

void VFramesAround::Forget()
{
  std::fill( m_Slots.begin(), m_Slots.end(), VSlot() );
  m_Rest = 0;
}

void VFramesAround::Shown( std::int64_t i_Index, const ZEK::VFlowStateRef& i_rState )
{
  if ( m_Frames == 0 )
  {
    return;
  }
  m_bVideo = HasVideo( i_rState );
  m_bUntold = !m_bVideo;
  m_Rest = std::max( m_Rest - 1, 0 );
  if ( !m_bVideo )
  {
    SlotOf( i_Index ) = { i_Index, i_rState };
  }
}

std::int64_t VFramesAround::Next( std::int64_t i_Shown, std::int64_t i_Count ) const
{
  if ( m_Frames == 0 || m_Rest > 0 || m_bVideo )
  {
    return -1;
  }
  const std::int64_t End = i_Count < 0 ? i_Shown + m_Frames + 1 : std::min( i_Shown + m_Frames + 1, i_Count );
  for ( std::int64_t Index = i_Shown + 1; Index < End; ++Index )
  {
    if ( SlotOf( Index ).Index != Index )
    {
      return Index;
    }
  }
  const std::int64_t First = std::max< std::int64_t >( i_Shown - m_Frames, 0 );
  for ( std::int64_t Index = i_Shown - 1; Index >= First; --Index )
  {
    if ( SlotOf( Index ).Index != Index )
    {
      return Index;
    }
  }
  return -1;
}

void VFramesAround::Made( std::int64_t i_Index, const ZEK::VFlowStateRef& i_rState, bool i_bSlow )
{
  SlotOf( i_Index ) = { i_Index, i_rState };
  m_bUntold = true;
  m_Rest = i_bSlow ? RestAfterSlow : 0;
}

ZEK::VFlowStateRef VFramesAround::Find( std::int64_t i_Index ) const
{
  return m_Frames > 0 && i_Index >= 0 && SlotOf( i_Index ).Index == i_Index ? SlotOf( i_Index ).State
                                                                            : ZEK::VFlowStateRef();
}

void VFramesAround::HandOver( std::int64_t i_Shown, bool i_bTell )
{
  m_bUntold = m_bUntold && !i_bTell;
  m_States.clear();
  for ( const VSlot& rSlot : m_Slots )
  {
    const bool bNear = rSlot.Index >= i_Shown - m_Frames && rSlot.Index <= i_Shown + m_Frames;
    if ( rSlot.State && bNear && rSlot.Index != i_Shown )
    {
      m_States.push_back( rSlot.State );
    }
  }
  if ( m_Take )
  {
    m_Take( m_States, i_bTell );
    m_States.clear();
  }
}

} // namespace HostSources

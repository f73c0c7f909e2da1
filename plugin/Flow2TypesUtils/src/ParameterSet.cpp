#include <Flow2TypesUtils/ParameterSet.h>

#include <CoreMoxelTypes/FlowTypes.h>

#include <cmath>

namespace Flow2Utils
{
namespace
{
/// NaN for what is no number.
struct VToFloat
{
  float operator()( double i_Value ) const { return static_cast< float >( i_Value ); }
  float operator()( std::int64_t i_Value ) const { return static_cast< float >( i_Value ); }
  float operator()( bool ) const { return std::nanf( "" ); }
  float operator()( const std::string& ) const { return std::nanf( "" ); }
};
} // namespace

VParameterSet::VParameterSet( std::span< const char* const > i_Names )
  : m_Names( i_Names.begin(), i_Names.end() )
  , m_Values( i_Names.size(), 0.0F )
  , m_New( i_Names.size(), 0.0F )
{
}

ZEK::IResult VParameterSet::Read( const ZEK::IFlowItem* i_pItem )
{
  if ( !i_pItem )
  {
    return ZEK::IResult::InvalidPointer;
  }
  const auto* pParameters = ZEK::FlowPayload< CoreMoxelTypes::VParametersItem >( i_pItem );
  if ( !pParameters )
  {
    return ZEK::IResult::InvalidType;
  }
  for ( std::size_t Index = 0; Index < m_Names.size(); ++Index )
  {
    const auto Found = pParameters->Values.find( m_Names[Index] );
    if ( Found == pParameters->Values.end() )
    {
      return ZEK::IResult::NotFound;
    }
    m_New[Index] = std::visit( VToFloat(), Found->second );
    if ( !std::isfinite( m_New[Index] ) )
    {
      return ZEK::IResult::InvalidValue;
    }
  }
  m_Values.swap( m_New );
  return ZEK::IResult::Ok;
}

ZEK::IFlowItem* FindParameters( const ZEK::IFlowState& i_rState, std::string_view i_Target )
{
  constexpr std::uint32_t Tag = ZEK::FlowTag< CoreMoxelTypes::FlowParametersItem >;
  ZEK::VFlowCursor It, End;
  i_rState.TagBegin( It, Tag, ZEK::EFlowTimeMatch::Overlap );
  i_rState.TagEnd( End, Tag, ZEK::EFlowTimeMatch::Overlap );
  for ( ; It != End; ++It )
  {
    std::string_view Target;
    if ( ZEK::FlowTimeMatches( ZEK::EFlowTimeMatch::Overlap, It->Key, i_rState.GetKey() ) &&
         It->pItem->Value().GetName( ZEK::EFlowNameTarget, Target ) && Target == i_Target )
    {
      return It->pItem;
    }
  }
  return nullptr;
}

} // namespace Flow2Utils

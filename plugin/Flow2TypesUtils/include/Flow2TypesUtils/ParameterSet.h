#pragma once

#include <ZEK/FlowState.h>
#include <ZEK/Result.h>

#include <span>
#include <string>
#include <vector>

namespace Flow2Utils
{

/// Float parameters by name, read from a parameter item.
class VParameterSet
{
public:
  /// All 0 at first.
  explicit VParameterSet( std::span< const char* const > i_Names );

  /// Takes every parameter from the item, or none: `InvalidPointer` without an item, `InvalidType` for an item of
  /// another kind, `NotFound` where a name is missing, `InvalidValue` where its value is no finite number.
  ZEK::IResult Read( const ZEK::IFlowItem* i_pItem );

  /// In the order of the names.
  std::span< const float > Values() const { return m_Values; }

private:
  std::vector< std::string > m_Names;
  std::vector< float > m_Values;
  std::vector< float > m_New;
};

/// The first item of kind 0x1 in the state that is addressed to the target; null when there is none.
ZEK::IFlowItem* FindParameters( const ZEK::IFlowState& i_rState, std::string_view i_Target );

} // namespace Flow2Utils

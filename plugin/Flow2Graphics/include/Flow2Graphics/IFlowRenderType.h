#pragma once

#include <ZEK/FlowState.h>

#include <string>
#include <vector>

namespace Flow2Graphics
{

/// The names of subjects whose drawing must be made anew although their items did not change.
using VSubjectChanges = std::vector< std::string >;

/// Takes from each frame of state what one kind of object needs. A type overrides exactly one of the operations.
///
/// The state is good for the call alone: what must outlive it is kept by references on items. Selection ids are taken
/// in every call; geometry is touched only when a value id changed. Thread: render thread.
class IFlowRenderType
{
public:
  virtual ~IFlowRenderType() = default;
  virtual void UpdateFromState( const ZEK::IFlowState& i_rState, const VSubjectChanges& /*i_rChanges*/ )
  {
    Update( i_rState );
  }
  virtual void Update( const ZEK::IFlowState& /*i_rState*/ ) {}
};

/// Whether `i_rNew` holds another value than `i_rHeld`: another object with another value id.
inline bool IsOtherValue( const ZEK::VFlowItemRef& i_rHeld, const ZEK::VFlowItemRef& i_rNew )
{
  if ( i_rHeld == i_rNew )
  {
    return false;
  }
  return !i_rHeld || !i_rNew || i_rHeld->Id() != i_rNew->Id();
}

} // namespace Flow2Graphics

#pragma once

#include <CoreGraphics/VInteractionMapper.h>

#include <ZEK/Callback.h>
#include <ZEK/Shared.h>

#include <memory>

namespace ZEK
{
class IStore;
}

namespace CoreGraphics
{

/// The mapper of the host: one preference swaps navigation and selection between the plain mouse and Alt.
/// Made through `ZEK::MakeShared`. Thread: GUI.
class VHarrowInteractionMapper : public VInteractionMapper, public ZEK::VShared
{
public:
  /// Both may be null; the preference then stays as `SetAltToSelect` leaves it.
  VHarrowInteractionMapper( std::shared_ptr< ZEK::IPostalService > i_pPostal, std::shared_ptr< ZEK::IStore > i_pStore );

  bool IsAction( int i_Action, int i_Buttons, int i_Modifiers ) const override;

  /// True, as at first: the plain mouse navigates and Alt selects. False: the other way round.
  bool AltToSelect() const { return m_bAltToSelect; }
  void SetAltToSelect( bool i_bOn ) { m_bAltToSelect = i_bOn; }

private:
  std::shared_ptr< ZEK::IStore > m_pStore;
  std::shared_ptr< ZEK::IPostalService > m_pPostal;
  bool m_bAltToSelect = true;
};

} // namespace CoreGraphics

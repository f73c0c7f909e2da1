#pragma once

#include <CoreGraphics/VInteractionMapper.h>

#include <ZEK/Callback.h>
#include <ZEK/CoreUserPreferences.h>
#include <ZEK/Shared.h>

#include <memory>

namespace CoreGraphics
{

/// The mapper of the host: one preference swaps navigation and selection between the plain mouse and Alt.
/// Made through `ZEK::MakeShared`. Thread: that of the postal service, the GUI thread.
class VHarrowInteractionMapper : public VInteractionMapper, public ZEK::VShared
{
public:
  /// Follows the preference of the store. Without a store its default holds, and without a postal service the value
  /// it has at the start.
  VHarrowInteractionMapper( std::shared_ptr< ZEK::IPostalService > i_pPostal, std::shared_ptr< ZEK::IStore > i_pStore );

  void Start() override;
  bool IsAction( int i_Action, int i_Buttons, int i_Modifiers ) const override;

  /// True, as at first: the plain mouse navigates and Alt selects. False: the other way round.
  bool AltToSelect() const { return m_bAltToSelect; }

private:
  ZEK::ICoreUserPreferencesLayout m_Preferences;
  std::shared_ptr< ZEK::IPostalService > m_pPostal;
  bool m_bAltToSelect = true;
  ZEK::VConnection m_Connection;
};

} // namespace CoreGraphics

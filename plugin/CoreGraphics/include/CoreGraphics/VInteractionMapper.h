#pragma once

#include <memory>

namespace CoreGraphics
{

/// What a mouse gesture in a 3D view can mean.
enum EInteraction : int
{
  EInteractionPan = 0,
  EInteractionOrbit = 1,
  EInteractionZoom = 2,
  EInteractionBand = 3
};

/// Decides which mouse buttons and modifiers mean which action. This one navigates with the plain mouse and selects
/// with Alt. Thread: GUI.
class VInteractionMapper
{
public:
  virtual ~VInteractionMapper() = default;
  /// Buttons and modifiers are the bits of Qt::MouseButtons and Qt::KeyboardModifiers that are down.
  virtual bool IsAction( int i_Action, int i_Buttons, int i_Modifiers ) const;
};

/// The one mapper of the process; null takes it away. Thread: GUI.
void SetInteractionMapper( std::shared_ptr< VInteractionMapper > i_pMapper );
std::shared_ptr< VInteractionMapper > InteractionMapper();
/// Asks the mapper of the process; false when there is none.
bool IsInteraction( int i_Action, int i_Buttons, int i_Modifiers );

} // namespace CoreGraphics

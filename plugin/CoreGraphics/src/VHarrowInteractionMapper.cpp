#include <CoreGraphics/VHarrowInteractionMapper.h>

#include <QtCore/Qt>

namespace CoreGraphics
{

VHarrowInteractionMapper::VHarrowInteractionMapper( std::shared_ptr< ZEK::IPostalService > i_pPostal,
                                                    std::shared_ptr< ZEK::IStore > i_pStore )
  : m_pStore( std::move( i_pStore ) )
  , m_pPostal( std::move( i_pPostal ) )
{
}

bool VHarrowInteractionMapper::IsAction( int i_Action, int i_Buttons, int i_Modifiers ) const
{
  const bool bLeft = i_Buttons & Qt::LeftButton;
  const bool bRight = i_Buttons & Qt::RightButton;
  const bool bMiddle = i_Buttons & Qt::MiddleButton;
  const bool bAlt = unsigned( i_Modifiers ) & Qt::AltModifier;
  const bool bNavigating = m_bAltToSelect != bAlt;
  switch ( i_Action )
  {
  case EInteractionPan:
    return bNavigating && bLeft && ( bRight || bMiddle );
  case EInteractionOrbit:
    return bNavigating && bLeft && !bRight && !bMiddle;
  case EInteractionZoom:
    return bNavigating && bRight && !bLeft && !bMiddle;
  case EInteractionBand:
    return !bNavigating && bLeft;
  default:
    return false;
  }
}

} // namespace CoreGraphics

#include <CoreGraphics/VHarrowInteractionMapper.h>

#include <QtCore/Qt>

namespace CoreGraphics
{

VHarrowInteractionMapper::VHarrowInteractionMapper( std::shared_ptr< ZEK::IPostalService > i_pPostal,
                                                    std::shared_ptr< ZEK::IStore > i_pStore )
  : m_Preferences( std::move( i_pStore ) )
  , m_pPostal( std::move( i_pPostal ) )
{
}

void VHarrowInteractionMapper::Start()
{
  if ( m_pPostal )
  {
    // Before the value is read: a change in between is told, and one before is read. Without the entry the default
    // holds.
    m_Connection = m_Preferences.AltToSelect().Connect(
        [pWeak = Weak( this )]( ZEK::IBitFlags< ZEK::EChangeFlags >, ZEK::ChangeId )
        {
          if ( const auto pSelf = pWeak.lock() )
          {
            (void)pSelf->m_Preferences.AltToSelect().Read( pSelf->m_bAltToSelect );
          }
        },
        m_pPostal, ZEK::EChangeVerified | ZEK::ERemoved );
  }
  (void)m_Preferences.AltToSelect().Read( m_bAltToSelect );
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

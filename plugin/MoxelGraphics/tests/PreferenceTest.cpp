#include "ItemFixture.h"

#include <CoreGraphics/VHarrowInteractionMapper.h>
#include <HostServices/VPostalService.h>
#include <Store/Store.h>

namespace MoxelGraphics
{
namespace
{
/// A view whose mapper follows the preferences of a store, on the queue of a host.
class VPreferredItem : public VItemTest
{
protected:
  VPreferredItem()
  {
    ZEK::VStoreWriteScope Scope( *pStore );
    EXPECT_TRUE( ZEK::DeclareCoreUserPreferences( *Scope ).IsOk() );
  }

  void SetAltToSelect( bool i_bOn )
  {
    ZEK::VStoreWriteScope Scope( *pStore );
    EXPECT_TRUE( Scope->SetValue( Layout.AltToSelect().Entry(), ZEK::IO::MakeValue( i_bOn ) ).IsOk() );
  }

  /// A band around a point; then it alone is selected and the camera as it was.
  void Band( std::uint32_t i_Point, Qt::KeyboardModifiers i_Modifiers )
  {
    const CoreGraphics::VCameraFields Before = Camera();
    const QPointF Half( 30, 30 );
    pWidget->Press( Place( i_Point ) - Half, i_Modifiers );
    pWidget->Drag( Place( i_Point ) + Half, i_Modifiers );
    EXPECT_TRUE( pWidget->Preselects( { Recon( i_Point ) } ) );
    pWidget->Release( Place( i_Point ) + Half, i_Modifiers );
    EXPECT_TRUE( pWidget->Selects( { Recon( i_Point ) } ) );
    EXPECT_EQ( Camera().azimuth, Before.azimuth );
    EXPECT_EQ( Camera().tilt, Before.tilt );
  }

  /// The same gesture where it navigates: the camera turns, there and back, and what is selected stays.
  void Orbit( std::uint32_t i_Point, Qt::KeyboardModifiers i_Modifiers )
  {
    const ZEK::VSelection Selected = pWidget->Selected();
    const float Azimuth = Camera().azimuth;
    const QPointF Half( 30, 30 ), From = Place( i_Point ) - Half;
    pWidget->Press( From, i_Modifiers );
    pWidget->Drag( From + 2 * Half, i_Modifiers );
    EXPECT_NE( Camera().azimuth, Azimuth );
    Frames( 2 );
    EXPECT_TRUE( pWidget->Preselected().empty() );
    pWidget->Drag( From, i_Modifiers );
    pWidget->Release( From, i_Modifiers );
    EXPECT_FALSE( pItem->IsPickPending() );
    EXPECT_EQ( Camera().azimuth, Azimuth );
    Frames( 2 );
    EXPECT_EQ( pWidget->Selected(), Selected );
  }

  /// A drag with the right button, which zooms or does nothing.
  bool Zooms( Qt::KeyboardModifiers i_Modifiers )
  {
    const float Distance = Camera().distance;
    pWidget->Mouse( QEvent::MouseButtonPress, Empty, Qt::RightButton, Qt::RightButton, i_Modifiers );
    pWidget->Mouse( QEvent::MouseMove, Empty + QPointF( 0, 20 ), Qt::NoButton, Qt::RightButton, i_Modifiers );
    const bool bMoved = Camera().distance != Distance;
    pWidget->Mouse( QEvent::MouseMove, Empty, Qt::NoButton, Qt::RightButton, i_Modifiers );
    pWidget->Mouse( QEvent::MouseButtonRelease, Empty, Qt::RightButton, Qt::NoButton, i_Modifiers );
    return bMoved;
  }

  void Follow()
  {
    CoreGraphics::SetInteractionMapper( ZEK::MakeShared< CoreGraphics::VHarrowInteractionMapper >( pPostal, pStore ) );
  }

  const std::shared_ptr< HostServices::VPostalService > pPostal = std::make_shared< HostServices::VPostalService >();
  const std::shared_ptr< ZEK::IStore > pStore = Store::CreateStore( pPostal, 64 );
  const ZEK::ICoreUserPreferencesLayout Layout{ pStore };
};
} // namespace

TEST_F( VPreferredItem, ThePreferenceSwapsNavigationAndSelectionFromTheNextEventOn )
{
  Follow();
  const Qt::KeyboardModifiers None, Alt( Qt::AltModifier );
  for ( const bool bAltSelects : { true, false, true } )
  {
    SCOPED_TRACE( bAltSelects );
    SetAltToSelect( bAltSelects );
    QCoreApplication::processEvents();
    const Qt::KeyboardModifiers Selecting = bAltSelects ? Alt : None, Navigating = bAltSelects ? None : Alt;
    pScene->Select( {} );
    Band( 2, Selecting );
    Orbit( 1, Navigating );
    Band( 1, Selecting );
    EXPECT_TRUE( Zooms( Navigating ) );
    EXPECT_FALSE( Zooms( Selecting ) );
  }
}

} // namespace MoxelGraphics

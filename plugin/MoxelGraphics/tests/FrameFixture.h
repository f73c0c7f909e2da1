#pragma once

#include "TestScene.h"

namespace MoxelGraphics
{

inline constexpr QRgb Background = 0xFF202020;
using VIds = std::vector< std::uint32_t >;

/// The greatest difference of a channel.
inline int Distance( QRgb i_A, QRgb i_B )
{
  return std::max( { std::abs( qRed( i_A ) - qRed( i_B ) ), std::abs( qGreen( i_A ) - qGreen( i_B ) ),
                     std::abs( qBlue( i_A ) - qBlue( i_B ) ) } );
}
/// Whether the pixel has the colour of an unlabelled point, in any light.
inline bool IsSphere( QRgb i_Pixel )
{
  const int Red = qRed( i_Pixel );
  return Red > qGreen( i_Pixel ) + 40 && Distance( i_Pixel, qRgb( Red, Red * 160 / 255, Red ) ) < 4;
}
inline QPoint Pixel( const VScenePoint& i_rPoint )
{
  return ScreenPoint( i_rPoint ).toPoint();
}

/// Frames of a scene in a context of their own.
template < typename TScene >
class VSceneTest : public testing::Test
{
protected:
  VSceneTest() { Show( std::make_shared< TScene >() ); }
  ~VSceneTest() override
  {
    Offscreen.MakeCurrent();
    pFrame.reset();
  }

  /// Goes on with another scene, in a view of its own.
  void Show( std::shared_ptr< TScene > i_pScene )
  {
    pScene = std::move( i_pScene );
    pFrame = std::make_unique< VSceneFrame >( pScene, std::make_shared< CoreGraphics::VCameraController >() );
    pFrame->Resize( Size );
  }
  VFrameInput& Input() { return pFrame->Input(); }
  VSceneOptions& Options() { return pFrame->Input().Options; }
  QImage Draw() { return Offscreen.Draw( *pFrame, Size ); }
  VIds Pick( QPoint i_Point, int i_Mode = EPickHover )
  {
    Input().PickMode = i_Mode;
    Input().Pointer = i_Point;
    Draw();
    EXPECT_EQ( pFrame->Result().Mode, i_Mode );
    return pFrame->Result().Ids;
  }
  VIds Band( QPoint i_Start, QPoint i_End )
  {
    Input().BandStart = i_Start;
    VIds Ids = Pick( i_End, EPickBandDone );
    std::sort( Ids.begin(), Ids.end() );
    return Ids;
  }

  VOffscreen Offscreen;
  std::shared_ptr< TScene > pScene;
  std::unique_ptr< VSceneFrame > pFrame;
};
using VFrameTest = VSceneTest< VTestScene >;

} // namespace MoxelGraphics

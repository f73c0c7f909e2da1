#pragma once

#include "TestScene.h"

namespace MoxelGraphics
{

inline constexpr QSize Size( 640, 360 );
inline constexpr QRgb Background = 0xFF202020;

/// One frame of a test scene in a context of its own.
class VFrameTest : public testing::Test
{
protected:
  VFrameTest()
  {
    InitShaders();
    pScene = std::make_shared< VTestScene >();
    pFrame = std::make_unique< VSceneFrame >( pScene, std::make_shared< CoreGraphics::VCameraController >() );
  }
  ~VFrameTest() override
  {
    Offscreen.MakeCurrent();
    pFrame.reset();
  }

  QImage Draw() { return Offscreen.Draw( *pFrame, Size ); }
  std::vector< std::uint32_t > Pick( QPoint i_Point, int i_Mode = EPickHover )
  {
    pFrame->Input().PickMode = i_Mode;
    pFrame->Input().Pointer = i_Point;
    Draw();
    EXPECT_EQ( pFrame->Result().Mode, i_Mode );
    return pFrame->Result().Ids;
  }
  std::vector< std::uint32_t > Band( QPoint i_Start, QPoint i_End )
  {
    pFrame->Input().BandStart = i_Start;
    auto Ids = Pick( i_End, EPickBandDone );
    std::sort( Ids.begin(), Ids.end() );
    return Ids;
  }

  VOffscreen Offscreen;
  std::shared_ptr< VTestScene > pScene;
  std::unique_ptr< VSceneFrame > pFrame;
};

inline int Distance( QRgb i_A, QRgb i_B )
{
  return std::max( { std::abs( qRed( i_A ) - qRed( i_B ) ), std::abs( qGreen( i_A ) - qGreen( i_B ) ),
                     std::abs( qBlue( i_A ) - qBlue( i_B ) ) } );
}

} // namespace MoxelGraphics

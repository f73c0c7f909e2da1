#pragma once

#include "SimulatedLens.h"
#include "SimulatedMarkers.h"

#include <CoreMoxelTypes/Camera.h>

#include <cstdint>
#include <memory>
#include <vector>

namespace HostSources::Simulation
{

inline constexpr double VideoRateHz = 30;
inline constexpr int PixelFormats = 10;

/// The bytes of video frames, which come back when the last holder of a frame lets go of it, from whatever thread.
class VVideoBuffers
{
public:
  VVideoBuffers();

  /// As many bytes as asked, with anything in them. Allocates only while more frames are held than ever before.
  std::shared_ptr< std::vector< CoreMoxelTypes::u8 > > Take( std::size_t i_Size );

private:
  struct VBuffer;
  struct VShelf;
  template < typename T >
  struct VWithin;

  std::shared_ptr< VShelf > m_pShelf;
};

/// Draws what a video camera sees: a lit stage, and the markers in the colours of those who wear them.
class VVideoPainter
{
public:
  static constexpr std::uint32_t Width = 320, Height = 256, Scale = 4; ///< a pixel is 4 by 4 of the sensor's

  VVideoPainter();
  void Paint( const VSensorView& i_rView, const std::vector< VStageMarker >& i_rMarkers );
  /// The picture last painted; video range and the rules of standard definition where there is chroma.
  void Pack( CoreMoxelTypes::EPixelFormat i_Format, CoreMoxelTypes::VVideoFrame& o_rFrame );

private:
  void Dot( double i_X, double i_Y, double i_Radius, std::uint32_t i_Colour );

  std::vector< CoreMoxelTypes::u8 > m_Stage, m_Picture; ///< R, G, B
  VVideoBuffers m_Buffers;
};

} // namespace HostSources::Simulation

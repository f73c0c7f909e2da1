#pragma once

#include <CoreMoxelTypes/Camera.h>

#include <cstdint>
#include <span>
#include <vector>

namespace HostSources::Simulation
{

/// The image of a marker on a sensor, px.
struct VDisc
{
  double x = 0, y = 0, Radius = 0;
  std::uint32_t Marker = 0; ///< index into the markers of the frame
};

/// Draws discs as spans of grey pixels.
class VDiscPainter
{
public:
  /// A pixel's grey value for a disc: bright within, falling to the threshold over the pixel at its rim.
  static constexpr int Threshold = 40;

  /// Adds one blob of discs that touch, and its edges where they are wanted.
  void Paint( std::span< const VDisc > i_Discs, std::uint32_t i_Width, std::uint32_t i_Height, std::int32_t i_Centroid,
              CoreMoxelTypes::VGreyscaleBlobSet& io_rBlobs, CoreMoxelTypes::VEdgePairSet* io_pEdges );

private:
  /// What of a row one disc, or several that meet there, cover.
  struct VSpan
  {
    int First = 0, Last = 0;
    float Left = 0, Right = 0; ///< of the rim, to a part of a pixel
  };
  static void PaintOne( const VDisc& i_rDisc, std::uint32_t i_Width, std::uint32_t i_Height,
                        CoreMoxelTypes::VGreyscaleBlobSet& io_rBlobs, CoreMoxelTypes::VEdgePairSet* io_pEdges );
  void PaintAll( std::span< const VDisc > i_Discs, std::uint32_t i_Width, std::uint32_t i_Height,
                 CoreMoxelTypes::VGreyscaleBlobSet& io_rBlobs, CoreMoxelTypes::VEdgePairSet* io_pEdges );
  void FindSpans( std::span< const VDisc > i_Discs, int i_Row, int i_Width );

  std::vector< VSpan > m_Spans;
};

} // namespace HostSources::Simulation

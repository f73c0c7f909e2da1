#pragma once

#include <ZEK/RenderCamera.h>

#include <cstdint>
#include <span>
#include <vector>

namespace MoxelGraphics
{

/// Where the columns and rows of one sensor are drawn so that those which showed grey lately fill the image.
class VGreyscaleStretch
{
public:
  /// One direction: of each column or row of the sensor, where its centre is drawn, 0 to 1.
  struct VAxis
  {
    std::vector< float > Places;
    std::vector< std::uint64_t > Seen; ///< the number of the last frame that had grey there; 0: none
    float Stretch = 1;                 ///< how wide one that had grey is drawn
  };

  /// Takes in one frame. Grey beyond the sensor counts for its outermost column or row.
  void Add( const ZEK::VGreyscaleData& i_rData, std::uint32_t i_Width, std::uint32_t i_Height );
  /// Makes the places anew. What had no grey for `i_History` frames, the present one counted, keeps `i_Factor` of its
  /// width, 0 to 1; other numbers count as the nearest that make sense. Nothing moves before there was any grey.
  void Place( int i_History, double i_Factor );

  const VAxis& Columns() const { return m_Columns; }
  const VAxis& Rows() const { return m_Rows; }

private:
  void Mark( VAxis& io_rAxis, float i_First, float i_Last ) const;
  void Place( VAxis& io_rAxis, std::uint64_t i_History, double i_Factor ) const;

  VAxis m_Columns, m_Rows;
  std::uint64_t m_Frame = 0;
};

} // namespace MoxelGraphics

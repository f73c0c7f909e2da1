#pragma once

#include "FFmpeg.h"
#include "VideoBuffers.h"

#include <CoreMoxelTypes/Camera.h>

namespace HostVideo
{

/// Makes frames that views know of decoded pictures: a copy where the picture's form is one of theirs, otherwise 4:2:0
/// of video range.
class VVideoConverter
{
public:
  explicit VVideoConverter( std::size_t i_MostFree )
    : m_Buffers( i_MostFree )
  {
  }

  /// `i_QuarterTurns` clockwise, 0 to 3. False for a picture that cannot be converted.
  bool Convert( const AVFrame& i_rPicture, int i_QuarterTurns, CoreMoxelTypes::VVideoFrame& o_rFrame );

private:
  /// What a scaler was made for.
  struct VScaled
  {
    int Width = 0, Height = 0;
    AVPixelFormat From = AV_PIX_FMT_NONE;
    bool bFullRange = false, bHighDefinition = false;

    friend bool operator==( const VScaled&, const VScaled& ) = default;
  };
  bool PrepareScaler( const VScaled& i_rFor );
  bool Scale( const AVFrame& i_rPicture, int i_QuarterTurns, CoreMoxelTypes::VVideoFrame& o_rFrame );

  VVideoBuffers m_Buffers;
  VFFmpegPtr< SwsContext > m_pScaler;
  VScaled m_ScalerFor;
};

} // namespace HostVideo

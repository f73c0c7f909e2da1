#pragma once

#include "C3dParameters.h"

#include <HostSources/VByteSource.h>
#include <HostSources/VRecording.h>

#include <cstdint>
#include <string>

namespace HostSources::C3d
{

/// Where in the file the frames lie and how they are written.
struct VLayout
{
  EForm Form = EForm::Intel;
  bool bFloat = false;
  double Scale = 1; ///< of the point words and residuals, in the file's unit; not negative
  std::size_t Points = 0;
  std::size_t Channels = 0;
  std::size_t PerFrame = 0; ///< analog samples a frame
  std::uint64_t DataOffset = 0;
  std::int64_t FirstFrame = 1;
  std::int64_t Promised = 0;   ///< frames that the file says it has
  std::int64_t FrameCount = 0; ///< of these the ones that are there, whole

  std::size_t WordSize() const { return bFloat ? 4 : 2; }
  std::size_t FrameWords() const { return 4 * Points + Channels * PerFrame; }
  std::size_t FrameBytes() const { return FrameWords() * WordSize(); }
};

/// The header block of a C3D file.
struct VHeader
{
  std::array< std::byte, 512 > Bytes{};
  EForm Form = EForm::Intel;

  /// Words are counted from 1, as in the format's own tables.
  std::uint16_t Word( std::size_t i_Word ) const { return LoadU16( Form, Bytes.data() + 2 * ( i_Word - 1 ) ); }
  float Float( std::size_t i_Word ) const { return LoadFloat( Form, Bytes.data() + 2 * ( i_Word - 1 ) ); }
};

/// Reads header and parameters and says where the data lie. The message is without the file's name.
ZEK::IResult ReadLayout( IByteSource& io_rSource, VHeader& o_rHeader, VParameters& o_rParameters, VLayout& o_rLayout,
                         VRecording& io_rRecording, std::string& o_rMessage );

} // namespace HostSources::C3d

#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

namespace C3dWriter
{

enum class EForm : std::uint8_t
{
  Intel = 84,
  Dec = 85,
  Mips = 86
};

/// One parameter: texts when `Texts` is not empty or `Type` is -1, else numbers.
struct VParameter
{
  std::string Group, Name;
  int Type = 2;
  std::vector< std::uint8_t > Dimensions;
  std::vector< double > Numbers;
  std::vector< std::string > Texts; ///< of equal length: the first dimension
};

/// What a C3D file is to hold; `Write` turns it into the bytes of one.
struct VFile
{
  EForm Form = EForm::Intel;
  bool bFloat = true;
  double Scale = 0.1;
  double Rate = 100;
  std::uint32_t FirstFrame = 1;
  std::size_t Points = 0;
  std::size_t Channels = 0;
  std::size_t PerFrame = 0;
  std::string Unit = "mm";
  std::vector< std::string > Labels; ///< written as LABELS, LABELS2, … of 255 each
  std::vector< VParameter > Extra;   ///< instead of the writer's own where group and name are the same
  /// The words of each frame as they stand in the file: four a point, then the analog ones.
  std::vector< std::vector< double > > Frames;
  /// The frame numbers of the header, where they are not to be the true ones.
  int HeaderFirst = -1, HeaderLast = -1;
  std::vector< std::pair< std::string, double > > HeaderEvents;
  bool bPointFrames = true; ///< whether POINT:FRAMES is there

  void SetParameter( VParameter i_Parameter ) { Extra.push_back( std::move( i_Parameter ) ); }
};

std::vector< std::byte > Write( const VFile& i_rFile );

/// The four bytes of a float in that form.
std::array< std::byte, 4 > FloatBytes( EForm i_Form, float i_Value );

} // namespace C3dWriter

#include "ReaderSupport.h"

#include "C3dParameters.h"

namespace HostSources
{
namespace
{
/// The bytes of the UTF-8 sequence that the text begins with; 0 when it begins with none.
std::size_t SequenceLength( std::string_view i_Text )
{
  const auto Byte = [&]( std::size_t i_Index )
  {
    return i_Index < i_Text.size() ? static_cast< unsigned char >( i_Text[i_Index] ) : 0u;
  };
  const unsigned First = Byte( 0 );
  if ( First < 0x80 )
  {
    return 1;
  }
  const std::size_t Length = First >= 0xF0 ? 4 : First >= 0xE0 ? 3 : 2;
  if ( First < 0xC2 || First > 0xF4 )
  {
    return 0;
  }
  for ( std::size_t Index = 1; Index < Length; ++Index )
  {
    if ( ( Byte( Index ) & 0xC0u ) != 0x80u )
    {
      return 0;
    }
  }
  const unsigned Second = Byte( 1 );
  const bool bWrong = ( First == 0xE0 && Second < 0xA0 ) || ( First == 0xED && Second > 0x9F ) ||
                      ( First == 0xF0 && Second < 0x90 ) || ( First == 0xF4 && Second > 0x8F );
  return bWrong ? 0 : Length;
}

bool IsUtf8( std::string_view i_Text )
{
  while ( !i_Text.empty() )
  {
    const std::size_t Length = SequenceLength( i_Text );
    if ( Length == 0 )
    {
      return false;
    }
    i_Text.remove_prefix( Length );
  }
  return true;
}
} // namespace

std::string ToUtf8( std::string_view i_Text )
{
  const bool bUtf8 = IsUtf8( i_Text );
  std::string Text;
  Text.reserve( i_Text.size() );
  for ( const char Character : i_Text )
  {
    const auto Byte = static_cast< unsigned char >( Character );
    if ( Byte < 0x20 || Byte == 0x7F )
    {
      Text += ' ';
    }
    else if ( Byte < 0x80 || bUtf8 )
    {
      Text += Character;
    }
    else
    {
      Text += static_cast< char >( 0xC0 | Byte >> 6 );
      Text += static_cast< char >( 0x80 | ( Byte & 0x3F ) );
    }
  }
  return Text;
}

bool IsUsableRate( double i_RateHz )
{
  return i_RateHz > 1.0 / 86400 && i_RateHz <= 1e6;
}

void TakeRate( double i_RateHz, VRecording& io_rRecording )
{
  constexpr double Year = 365.0 * 86400; // s
  io_rRecording.RateHz = i_RateHz;
  if ( !IsUsableRate( i_RateHz ) || io_rRecording.DurationSeconds() > Year )
  {
    io_rRecording.RateHz = 100;
    io_rRecording.Notes.emplace_back( "The file gives no usable frame rate; 100 Hz was taken." );
  }
}

void TakeUnit( const std::string& i_rUnit, VRecording& io_rRecording )
{
  struct VUnit
  {
    const char* pName;
    double Scale;
  };
  static constexpr VUnit Units[] = { { "mm", 1 }, { "cm", 10 }, { "m", 1000 }, { "in", 25.4 }, { "inch", 25.4 } };
  io_rRecording.Unit = i_rUnit;
  io_rRecording.UnitScale = 1;
  for ( const VUnit& rUnit : Units )
  {
    if ( C3d::SameName( rUnit.pName, i_rUnit ) )
    {
      io_rRecording.UnitScale = rUnit.Scale;
      return;
    }
  }
  io_rRecording.Unit = "mm";
  if ( !i_rUnit.empty() )
  {
    io_rRecording.Notes.push_back( "The unit of length \"" + i_rUnit + "\" is not known; millimetres were taken." );
  }
}

} // namespace HostSources

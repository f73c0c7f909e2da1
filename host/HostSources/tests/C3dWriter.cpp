#include "C3dWriter.h"

#include <algorithm>
#include <cmath>
#include <cstring>

namespace C3dWriter
{
namespace
{
class VBytes
{
public:
  explicit VBytes( EForm i_Form )
    : m_Form( i_Form )
  {
  }
  void U8( unsigned i_Value ) { m_Bytes.push_back( static_cast< std::byte >( i_Value ) ); }
  void U16( unsigned i_Value )
  {
    const unsigned Low = i_Value & 0xFF, High = i_Value >> 8 & 0xFF;
    U8( m_Form == EForm::Mips ? High : Low );
    U8( m_Form == EForm::Mips ? Low : High );
  }
  void I16( double i_Value )
  {
    U16( static_cast< unsigned >( static_cast< std::int64_t >( std::lround( i_Value ) ) ) );
  }
  void F32( double i_Value )
  {
    const auto Four = FloatBytes( m_Form, static_cast< float >( i_Value ) );
    m_Bytes.insert( m_Bytes.end(), Four.begin(), Four.end() );
  }
  void Text( const std::string& i_rText, std::size_t i_Length )
  {
    for ( std::size_t Index = 0; Index < i_Length; ++Index )
    {
      U8( Index < i_rText.size() ? static_cast< unsigned char >( i_rText[Index] ) : ' ' );
    }
  }
  void PadToBlock() { m_Bytes.resize( ( m_Bytes.size() + 511 ) / 512 * 512 ); }
  std::vector< std::byte >& Data() { return m_Bytes; }

private:
  EForm m_Form;
  std::vector< std::byte > m_Bytes;
};

void WriteData( const VParameter& i_rParameter, VBytes& io_rBytes )
{
  if ( i_rParameter.Type == -1 )
  {
    for ( const std::string& rText : i_rParameter.Texts )
    {
      io_rBytes.Text( rText, i_rParameter.Dimensions.empty() ? 1 : i_rParameter.Dimensions[0] );
    }
    return;
  }
  for ( const double Number : i_rParameter.Numbers )
  {
    i_rParameter.Type == 4   ? io_rBytes.F32( Number )
    : i_rParameter.Type == 2 ? io_rBytes.I16( Number )
                             : io_rBytes.U8( static_cast< unsigned >( Number ) );
  }
}

VParameter TextParameter( const std::string& i_rGroup, const std::string& i_rName, std::vector< std::string > i_Texts )
{
  std::size_t Length = 0;
  for ( const std::string& rText : i_Texts )
  {
    Length = std::max( Length, rText.size() );
  }
  return { i_rGroup, i_rName,
           -1,       { static_cast< std::uint8_t >( Length ), static_cast< std::uint8_t >( i_Texts.size() ) },
           {},       std::move( i_Texts ) };
}

std::vector< VParameter > AllParameters( const VFile& i_rFile )
{
  std::vector< VParameter > All = i_rFile.Extra;
  const auto Add = [&]( VParameter i_Parameter )
  {
    if ( std::none_of( All.begin(), All.end(),
                       [&]( const VParameter& i_rOther )
                       {
                         return i_rOther.Group == i_Parameter.Group && i_rOther.Name == i_Parameter.Name;
                       } ) )
    {
      All.push_back( std::move( i_Parameter ) );
    }
  };
  Add( { "POINT", "USED", 2, {}, { static_cast< double >( i_rFile.Points ) }, {} } );
  Add( { "POINT", "SCALE", 4, {}, { i_rFile.bFloat ? -i_rFile.Scale : i_rFile.Scale }, {} } );
  Add( { "POINT", "RATE", 4, {}, { i_rFile.Rate }, {} } );
  if ( i_rFile.bPointFrames )
  {
    Add( { "POINT", "FRAMES", 2, {}, { static_cast< double >( i_rFile.Frames.size() & 0xFFFF ) }, {} } );
  }
  Add( TextParameter( "POINT", "UNITS", { i_rFile.Unit } ) );
  for ( std::size_t Begin = 0, Part = 1; Begin < i_rFile.Labels.size(); Begin += 255, ++Part )
  {
    const auto First = i_rFile.Labels.begin() + static_cast< std::ptrdiff_t >( Begin );
    const auto Count = std::min< std::size_t >( 255, i_rFile.Labels.size() - Begin );
    Add( TextParameter( "POINT", Part == 1 ? "LABELS" : "LABELS" + std::to_string( Part ),
                        { First, First + static_cast< std::ptrdiff_t >( Count ) } ) );
  }
  if ( i_rFile.Channels > 0 )
  {
    Add( { "ANALOG", "USED", 2, {}, { static_cast< double >( i_rFile.Channels ) }, {} } );
  }
  return All;
}

void WriteParameters( const VFile& i_rFile, VBytes& io_rBytes )
{
  std::vector< std::string > Groups;
  const std::vector< VParameter > All = AllParameters( i_rFile );
  for ( const VParameter& rParameter : All )
  {
    auto Group = std::find( Groups.begin(), Groups.end(), rParameter.Group );
    if ( Group == Groups.end() )
    {
      Group = Groups.insert( Group, rParameter.Group );
      io_rBytes.U8( static_cast< unsigned >( rParameter.Group.size() ) );
      io_rBytes.U8( static_cast< unsigned >( -static_cast< int >( Groups.size() ) ) );
      io_rBytes.Text( rParameter.Group, rParameter.Group.size() );
      io_rBytes.U16( 3 );
      io_rBytes.U8( 0 );
    }
    io_rBytes.U8( static_cast< unsigned >( rParameter.Name.size() ) );
    io_rBytes.U8( static_cast< unsigned >( Group - Groups.begin() ) + 1 );
    io_rBytes.Text( rParameter.Name, rParameter.Name.size() );
    VBytes Body( i_rFile.Form );
    Body.U8( static_cast< unsigned >( rParameter.Type ) );
    Body.U8( static_cast< unsigned >( rParameter.Dimensions.size() ) );
    for ( const std::uint8_t Dimension : rParameter.Dimensions )
    {
      Body.U8( Dimension );
    }
    WriteData( rParameter, Body );
    Body.U8( 0 ); // no description
    io_rBytes.U16( static_cast< unsigned >( Body.Data().size() + 2 ) );
    io_rBytes.Data().insert( io_rBytes.Data().end(), Body.Data().begin(), Body.Data().end() );
  }
  io_rBytes.U8( 0 );
  io_rBytes.U8( 0 );
}

void WriteHeader( const VFile& i_rFile, std::size_t i_DataBlock, VBytes& io_rBytes )
{
  const auto Last = static_cast< std::uint32_t >( i_rFile.FirstFrame + i_rFile.Frames.size() - 1 );
  io_rBytes.U8( 2 );
  io_rBytes.U8( 0x50 );
  io_rBytes.U16( static_cast< unsigned >( i_rFile.Points ) );
  io_rBytes.U16( static_cast< unsigned >( i_rFile.Channels * i_rFile.PerFrame ) );
  io_rBytes.U16( i_rFile.HeaderFirst >= 0 ? static_cast< unsigned >( i_rFile.HeaderFirst ) : i_rFile.FirstFrame );
  io_rBytes.U16( i_rFile.HeaderLast >= 0 ? static_cast< unsigned >( i_rFile.HeaderLast ) : Last );
  io_rBytes.U16( 10 );
  io_rBytes.F32( i_rFile.bFloat ? -i_rFile.Scale : i_rFile.Scale );
  io_rBytes.U16( static_cast< unsigned >( i_DataBlock ) );
  io_rBytes.U16( static_cast< unsigned >( i_rFile.PerFrame ) );
  io_rBytes.F32( i_rFile.Rate );
  io_rBytes.Data().resize( 512 );
  if ( i_rFile.HeaderEvents.empty() )
  {
    return;
  }
  VBytes Events( i_rFile.Form );
  Events.U16( 12345 );
  Events.U16( static_cast< unsigned >( i_rFile.HeaderEvents.size() ) );
  Events.U16( 0 );
  for ( std::size_t Index = 0; Index < 18; ++Index )
  {
    Events.F32( Index < i_rFile.HeaderEvents.size() ? i_rFile.HeaderEvents[Index].second : 0 );
  }
  Events.Data().resize( Events.Data().size() + 20 );
  for ( const auto& rEvent : i_rFile.HeaderEvents )
  {
    Events.Text( rEvent.first, 4 );
  }
  std::copy( Events.Data().begin(), Events.Data().end(), io_rBytes.Data().begin() + 2 * 149 );
}
} // namespace

std::array< std::byte, 4 > FloatBytes( EForm i_Form, float i_Value )
{
  std::uint32_t Bits;
  std::memcpy( &Bits, &i_Value, sizeof( Bits ) );
  if ( i_Form == EForm::Dec )
  {
    // Four times the value has the exponent that the VAX form writes; its two words stand the other way round.
    const float Scaled = i_Value * 4;
    std::memcpy( &Bits, &Scaled, sizeof( Bits ) );
    Bits = Bits << 16 | Bits >> 16;
  }
  std::array< std::byte, 4 > Four;
  std::memcpy( Four.data(), &Bits, sizeof( Bits ) );
  if ( i_Form == EForm::Mips )
  {
    std::reverse( Four.begin(), Four.end() );
  }
  return Four;
}

std::vector< std::byte > Write( const VFile& i_rFile )
{
  VBytes Parameters( i_rFile.Form );
  WriteParameters( i_rFile, Parameters );
  const std::size_t Blocks = ( Parameters.Data().size() + 4 + 511 ) / 512;
  VBytes File( i_rFile.Form );
  WriteHeader( i_rFile, 2 + Blocks, File );
  File.U8( 1 );
  File.U8( 0x50 );
  File.U8( static_cast< unsigned >( std::min< std::size_t >( Blocks, 255 ) ) );
  File.U8( static_cast< unsigned >( i_rFile.Form ) );
  File.Data().insert( File.Data().end(), Parameters.Data().begin(), Parameters.Data().end() );
  File.PadToBlock();
  for ( const std::vector< double >& rFrame : i_rFile.Frames )
  {
    for ( const double Word : rFrame )
    {
      i_rFile.bFloat ? File.F32( Word ) : File.I16( Word );
    }
  }
  File.PadToBlock();
  return std::move( File.Data() );
}

} // namespace C3dWriter

#include "C3dParameters.h"

#include "ReaderSupport.h"

#include <algorithm>
#include <cmath>

namespace HostSources::C3d
{
namespace
{
/// Of groups, parameters and texts: a word counts no further.
constexpr std::size_t Most = 0xFFFF;

char Upper( char i_Character )
{
  return i_Character >= 'a' && i_Character <= 'z' ? static_cast< char >( i_Character - 'a' + 'A' ) : i_Character;
}

std::string Upper( std::string_view i_Text )
{
  std::string Text( i_Text );
  for ( char& rCharacter : Text )
  {
    rCharacter = Upper( rCharacter );
  }
  return Text;
}

std::size_t SignedMagnitude( std::byte i_Byte )
{
  const int Value = static_cast< std::int8_t >( i_Byte );
  return static_cast< std::size_t >( Value < 0 ? -Value : Value );
}
} // namespace

bool SameName( std::string_view i_A, std::string_view i_B )
{
  return std::equal( i_A.begin(), i_A.end(), i_B.begin(), i_B.end(),
                     []( char i_CharA, char i_CharB )
                     {
                       return Upper( i_CharA ) == Upper( i_CharB );
                     } );
}

std::size_t VParameters::ParseParameter( std::size_t i_Offset, VParameter& io_rParameter )
{
  if ( i_Offset + 2 > m_Section.size() )
  {
    return 0;
  }
  const std::size_t DimensionCount = std::to_integer< std::size_t >( m_Section[i_Offset + 1] );
  const std::size_t DataOffset = i_Offset + 2 + DimensionCount;
  if ( DataOffset > m_Section.size() )
  {
    return 0;
  }
  io_rParameter.Type = static_cast< std::int8_t >( m_Section[i_Offset] );
  io_rParameter.Dimensions = std::span( m_Section ).subspan( i_Offset + 2, DimensionCount );
  std::size_t Size = SignedMagnitude( m_Section[i_Offset] );
  for ( const std::byte Dimension : io_rParameter.Dimensions )
  {
    Size *= std::to_integer< std::size_t >( Dimension );
    if ( Size > m_Section.size() )
    {
      return 0;
    }
  }
  if ( Size > m_Section.size() - DataOffset )
  {
    return 0;
  }
  io_rParameter.Data = std::span( m_Section ).subspan( DataOffset, Size );
  return DataOffset + Size;
}

void VParameters::Parse( EForm i_Form, std::vector< std::byte > i_Section, std::uint64_t i_FileOffset,
                         std::vector< std::string >& io_rNotes )
{
  m_Form = i_Form;
  m_Section = std::move( i_Section );
  const auto* pText = reinterpret_cast< const char* >( m_Section.data() );
  std::size_t Position = 0;
  const auto Odd = [&]( const std::string& i_rWhat )
  {
    io_rNotes.push_back( "byte offset " + std::to_string( i_FileOffset + Position ) + ": " + i_rWhat +
                         "; the parameters from there on are left out" );
  };
  for ( std::size_t Count = 0; Position + 2 <= m_Section.size(); ++Count )
  {
    const std::size_t NameSize = SignedMagnitude( m_Section[Position] );
    const auto Id = static_cast< std::int8_t >( m_Section[Position + 1] );
    if ( NameSize == 0 )
    {
      return;
    }
    if ( Count >= Most )
    {
      return Odd( "expected no more than 65535 parameters" );
    }
    const std::size_t LinkOffset = Position + 2 + NameSize;
    if ( LinkOffset + 2 > m_Section.size() )
    {
      return Odd( "expected a parameter, found the end of the section" );
    }
    std::string Name = Upper( { pText + Position + 2, NameSize } );
    const std::size_t Link = LoadU16( m_Form, m_Section.data() + LinkOffset );
    if ( Id > 0 )
    {
      VParameter Parameter;
      if ( ParseParameter( LinkOffset + 2, Parameter ) == 0 )
      {
        return Odd( "expected a parameter whose data lie within the section" );
      }
      m_Parameters.try_emplace( { Id, std::move( Name ) }, Parameter );
    }
    else
    {
      auto& rIds = m_Groups[std::move( Name )];
      const auto GroupId = static_cast< std::int8_t >( Id == -128 ? 127 : -Id );
      if ( std::find( rIds.begin(), rIds.end(), GroupId ) == rIds.end() )
      {
        rIds.push_back( GroupId );
      }
    }
    if ( Link == 0 )
    {
      return;
    }
    if ( Link < 2 )
    {
      return Odd( "expected a link to the next parameter" );
    }
    Position = LinkOffset + Link;
  }
}

const VParameters::VParameter* VParameters::Find( std::string_view i_Group, std::string_view i_Name ) const
{
  const auto Group = m_Groups.find( Upper( i_Group ) );
  if ( Group == m_Groups.end() )
  {
    return nullptr;
  }
  const std::string Name = Upper( i_Name );
  for ( const std::int8_t Id : Group->second )
  {
    const auto Found = m_Parameters.find( { Id, Name } );
    if ( Found != m_Parameters.end() )
    {
      return &Found->second;
    }
  }
  return nullptr;
}

double VParameters::Number( const VParameter& i_rParameter, std::size_t i_Index, bool i_bUnsigned ) const
{
  if ( i_Index >= i_rParameter.Count() )
  {
    return std::nan( "" );
  }
  switch ( i_rParameter.Type )
  {
  case 1:
    return std::to_integer< int >( i_rParameter.Data[i_Index] );
  case 2:
  {
    const std::uint16_t Word = LoadU16( m_Form, i_rParameter.Data.data() + 2 * i_Index );
    return i_bUnsigned ? Word : static_cast< std::int16_t >( Word );
  }
  case 4:
    return LoadFloat( m_Form, i_rParameter.Data.data() + 4 * i_Index );
  default:
    return std::nan( "" );
  }
}

double VParameters::Number( std::string_view i_Group, std::string_view i_Name, double i_Default, std::size_t i_Index,
                            bool i_bUnsigned ) const
{
  const VParameter* pParameter = Find( i_Group, i_Name );
  const double Value = pParameter ? Number( *pParameter, i_Index, i_bUnsigned ) : std::nan( "" );
  return std::isfinite( Value ) ? Value : i_Default;
}

std::size_t VParameters::Count( std::string_view i_Group, std::string_view i_Name, std::size_t i_Default,
                                std::size_t i_Index ) const
{
  const double Value = Number( i_Group, i_Name, static_cast< double >( i_Default ), i_Index, true );
  return static_cast< std::size_t >( std::clamp( Value, 0.0, 65535.0 ) );
}

std::size_t VParameters::TextCount( const VParameter& i_rParameter )
{
  if ( i_rParameter.Type != -1 )
  {
    return 0;
  }
  // Entries of no length are still entries, but of these there may be more than the file has bytes: 255 at most count.
  std::size_t Count = 1;
  for ( std::size_t Index = 1; Index < i_rParameter.Dimensions.size(); ++Index )
  {
    Count = std::min( Count * i_rParameter.Dimension( Index ), Most );
  }
  return i_rParameter.Data.empty() ? std::min< std::size_t >( Count, 255 ) : Count;
}

std::string VParameters::TextAt( const VParameter& i_rParameter, std::size_t i_Index )
{
  const std::size_t Size = i_rParameter.Dimension( 0 );
  if ( i_rParameter.Type != -1 || ( i_Index + 1 ) * Size > i_rParameter.Data.size() )
  {
    return {};
  }
  std::string_view Text( reinterpret_cast< const char* >( i_rParameter.Data.data() ) + i_Index * Size, Size );
  Text = Text.substr( 0, Text.find( '\0' ) );
  const std::size_t First = Text.find_first_not_of( " \t" );
  if ( First == std::string_view::npos )
  {
    return {};
  }
  return ToUtf8( Text.substr( First, Text.find_last_not_of( " \t" ) + 1 - First ) );
}

std::string VParameters::Text( std::string_view i_Group, std::string_view i_Name, std::size_t i_Index ) const
{
  const VParameter* pParameter = Find( i_Group, i_Name );
  return pParameter ? TextAt( *pParameter, i_Index ) : std::string();
}

std::vector< std::string > VParameters::Texts( std::string_view i_Group, const std::string& i_rName ) const
{
  std::vector< std::string > All;
  const VParameter* pParameter = Find( i_Group, i_rName );
  for ( int Part = 2; pParameter; ++Part )
  {
    for ( std::size_t Index = 0, Count = TextCount( *pParameter ); Index < Count && All.size() < Most; ++Index )
    {
      All.push_back( TextAt( *pParameter, Index ) );
    }
    pParameter = Find( i_Group, i_rName + std::to_string( Part ) );
  }
  return All;
}

std::vector< double > VParameters::Numbers( std::string_view i_Group, const std::string& i_rName,
                                            bool i_bUnsigned ) const
{
  std::vector< double > All;
  const VParameter* pParameter = Find( i_Group, i_rName );
  for ( int Part = 2; pParameter; ++Part )
  {
    for ( std::size_t Index = 0, Count = pParameter->Count(); Index < Count; ++Index )
    {
      All.push_back( Number( *pParameter, Index, i_bUnsigned ) );
    }
    pParameter = Find( i_Group, i_rName + std::to_string( Part ) );
  }
  return All;
}

} // namespace HostSources::C3d

#pragma once

#include "C3dNumbers.h"

#include <cstddef>
#include <cstdint>
#include <map>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace HostSources::C3d
{

/// The parameter section of a C3D file. Values are looked up by group and name, case ignored; of two by the same name
/// the first counts.
class VParameters
{
public:
  struct VParameter
  {
    std::int8_t Type = 0; ///< -1 text, 1 byte, 2 integer, 4 float
    std::span< const std::byte > Dimensions;
    std::span< const std::byte > Data;

    std::size_t Dimension( std::size_t i_Index ) const
    {
      return i_Index < Dimensions.size() ? std::to_integer< std::size_t >( Dimensions[i_Index] ) : 1;
    }
    std::size_t Count() const
    {
      const auto Size = static_cast< std::size_t >( Type < 0 ? -Type : Type );
      return Size == 0 ? 0 : Data.size() / Size;
    }
  };

  /// Takes the section, without its first four bytes. What cannot be read, or is more than any file needs, ends the
  /// walk and is told in the notes.
  void Parse( EForm i_Form, std::vector< std::byte > i_Section, std::uint64_t i_FileOffset,
              std::vector< std::string >& io_rNotes );

  const VParameter* Find( std::string_view i_Group, std::string_view i_Name ) const;

  /// An integer or float value; `i_Default` where there is none. `i_bUnsigned`: integers are 0 to 65535.
  double Number( std::string_view i_Group, std::string_view i_Name, double i_Default, std::size_t i_Index = 0,
                 bool i_bUnsigned = false ) const;
  double Number( const VParameter& i_rParameter, std::size_t i_Index, bool i_bUnsigned ) const;
  /// A number from 0 to 65535 of whatever type; what lies outside is brought to the nearest of these.
  std::size_t Count( std::string_view i_Group, std::string_view i_Name, std::size_t i_Default,
                     std::size_t i_Index = 0 ) const;
  /// The text of a parameter, or of one of its entries; blanks and zeros at the end are dropped.
  std::string Text( std::string_view i_Group, std::string_view i_Name, std::size_t i_Index = 0 ) const;
  /// All texts of NAME, NAME2, NAME3 … in a row, as one parameter holds 255 at most; no more than there can be points.
  std::vector< std::string > Texts( std::string_view i_Group, const std::string& i_rName ) const;
  /// All numbers of NAME, NAME2, …
  std::vector< double > Numbers( std::string_view i_Group, const std::string& i_rName, bool i_bUnsigned = false ) const;

private:
  /// The number of texts in a parameter: the product of all dimensions but the first.
  static std::size_t TextCount( const VParameter& i_rParameter );
  static std::string TextAt( const VParameter& i_rParameter, std::size_t i_Index );
  std::size_t ParseParameter( std::size_t i_Offset, VParameter& io_rParameter );

  EForm m_Form = EForm::Intel;
  std::vector< std::byte > m_Section;
  // Names in upper case; several groups may bear one name.
  std::map< std::string, std::vector< std::int8_t >, std::less<> > m_Groups;
  std::map< std::pair< std::int8_t, std::string >, VParameter > m_Parameters;
};

/// Equal but for the case of ASCII letters.
bool SameName( std::string_view i_A, std::string_view i_B );

} // namespace HostSources::C3d

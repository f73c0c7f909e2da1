#include "FbxGuard.h"

#include <cstdint>
#include <cstring>
#include <optional>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace HostMeshes
{
namespace
{
constexpr std::size_t DeepestRecord = 64;
constexpr std::uint64_t LargestList = 512u << 20u; // bytes, unpacked
constexpr std::uint64_t LargestSum = 2048ull << 20u;
constexpr double MostPaths = 1e6;
constexpr std::size_t DeepestModel = 1000;

/// Which models hold which; model 0 is the whole scene.
class VModelTree
{
public:
  void AddModel( std::int64_t i_Id ) { m_Models.try_emplace( i_Id, Index() ); }
  void AddLink( std::int64_t i_Child, std::int64_t i_Parent ) { m_Links.emplace_back( i_Child, i_Parent ); }

  /// The importer walks from parent to child: it must come to an end, and soon.
  std::string FindFault()
  {
    AddModel( 0 );
    std::vector< std::vector< std::uint32_t > > Children( m_Models.size() );
    std::vector< std::uint32_t > Parents( m_Models.size() );
    for ( const auto& [Child, Parent] : m_Links )
    {
      const auto ItChild = m_Models.find( Child ), ItParent = m_Models.find( Parent );
      if ( ItChild != m_Models.end() && ItParent != m_Models.end() )
      {
        Children[ItParent->second].push_back( ItChild->second );
        ++Parents[ItChild->second];
      }
    }
    return Walk( Children, Parents );
  }

private:
  std::uint32_t Index() const { return static_cast< std::uint32_t >( m_Models.size() ); }

  static std::string Walk( const std::vector< std::vector< std::uint32_t > >& i_rChildren,
                           std::vector< std::uint32_t >& io_rParents )
  {
    std::vector< std::uint32_t > Ready;
    std::vector< double > Paths( i_rChildren.size(), 1.0 );
    std::vector< std::size_t > Depths( i_rChildren.size() );
    for ( std::uint32_t Model = 0; Model < io_rParents.size(); ++Model )
    {
      if ( io_rParents[Model] == 0 )
      {
        Ready.push_back( Model );
      }
      else
      {
        Paths[Model] = 0;
      }
    }
    double Sum = 0;
    for ( std::size_t Next = 0; Next < Ready.size(); ++Next )
    {
      const std::uint32_t Model = Ready[Next];
      Sum += Paths[Model];
      if ( Sum > MostPaths || Depths[Model] > DeepestModel )
      {
        return "its models hold one another too often or too deeply";
      }
      for ( const std::uint32_t Child : i_rChildren[Model] )
      {
        Paths[Child] += Paths[Model];
        Depths[Child] = std::max( Depths[Child], Depths[Model] + 1 );
        if ( --io_rParents[Child] == 0 )
        {
          Ready.push_back( Child );
        }
      }
    }
    return Ready.size() == i_rChildren.size() ? std::string() : "a model in it contains itself";
  }

  std::unordered_map< std::int64_t, std::uint32_t > m_Models;
  std::vector< std::pair< std::int64_t, std::int64_t > > m_Links;
};

/// The values of a record that matter here.
struct VValues
{
  std::string_view First; ///< its first, where that is a text
  std::vector< std::int64_t > Numbers;
};

void Note( std::string_view i_Name, const VValues& i_rValues, VModelTree& io_rTree )
{
  if ( i_Name == "Model" && !i_rValues.Numbers.empty() )
  {
    io_rTree.AddModel( i_rValues.Numbers[0] );
  }
  else if ( i_Name == "C" && i_rValues.First == "OO" && i_rValues.Numbers.size() >= 2 )
  {
    io_rTree.AddLink( i_rValues.Numbers[0], i_rValues.Numbers[1] );
  }
}

class VBinaryWalk
{
public:
  explicit VBinaryWalk( std::span< const std::byte > i_Bytes )
    : m_Bytes( i_Bytes )
    , m_bWide( Number( 23, 4 ).value_or( 0 ) >= 7500 )
  {
  }

  std::string FindFault()
  {
    std::vector< std::uint64_t > Ends{ m_Bytes.size() };
    const std::uint64_t Word = m_bWide ? 8 : 4;
    std::uint64_t At = 27;
    while ( !Ends.empty() )
    {
      if ( At >= Ends.back() )
      {
        Ends.pop_back();
        continue;
      }
      const auto End = Number( At, Word ), Count = Number( At + Word, Word ), Length = Number( At + 2 * Word, Word ),
                 Name = Number( At + 3 * Word, 1 );
      const std::uint64_t Begin = At + 3 * Word + 1;
      if ( !Name )
      {
        return Ends.size() == 1 ? m_Tree.FindFault() : "it is cut off";
      }
      if ( *End == 0 )
      {
        // The end of a list of records; after that of the file there is only a footer.
        At = Ends.size() == 1 ? m_Bytes.size() : Begin;
        continue;
      }
      const std::uint64_t Values = Begin + *Name;
      if ( *End > Ends.back() || *End < Begin || Values > *End || *Length > *End - Values )
      {
        return "a record in it reaches out of the one that holds it, or of the file";
      }
      if ( Ends.size() > DeepestRecord )
      {
        return "its records lie too deep in one another";
      }
      if ( !TakeValues( Text( Begin, *Name ), Values, Values + *Length, *Count ) )
      {
        return "a list in it is too long, or cut off";
      }
      At = Values + *Length;
      Ends.push_back( *End );
    }
    return m_Tree.FindFault();
  }

private:
  std::optional< std::uint64_t > Number( std::uint64_t i_At, std::uint64_t i_Size ) const
  {
    std::uint64_t Value = 0;
    if ( i_At > m_Bytes.size() || m_Bytes.size() - i_At < i_Size )
    {
      return std::nullopt;
    }
    std::memcpy( &Value, m_Bytes.data() + i_At, i_Size ); // little-endian, as the file
    return Value;
  }
  std::string_view Text( std::uint64_t i_At, std::uint64_t i_Length ) const
  {
    return { reinterpret_cast< const char* >( m_Bytes.data() ) + i_At, static_cast< std::size_t >( i_Length ) };
  }

  bool TakeValues( std::string_view i_Name, std::uint64_t i_At, std::uint64_t i_End, std::uint64_t i_Count )
  {
    VValues Values;
    for ( std::uint64_t Value = 0; Value < i_Count; ++Value )
    {
      if ( i_At >= i_End || !TakeValue( i_At, i_End, Value, Values ) )
      {
        return false;
      }
    }
    Note( i_Name, Values, m_Tree );
    return true;
  }

  bool TakeValue( std::uint64_t& io_rAt, std::uint64_t i_End, std::uint64_t i_Index, VValues& io_rValues )
  {
    const char Kind = Text( io_rAt++, 1 )[0];
    std::uint64_t Size = 0;
    switch ( Kind )
    {
    case 'C':
    case 'B':
      Size = 1;
      break;
    case 'Y':
      Size = 2;
      break;
    case 'I':
    case 'F':
      Size = 4;
      break;
    case 'D':
    case 'L':
      Size = 8;
      break;
    case 'S':
    case 'R':
      Size = 4 + Number( io_rAt, 4 ).value_or( ~0u );
      break;
    default:
      return TakeList( Kind, io_rAt, i_End );
    }
    if ( Size > i_End - io_rAt )
    {
      return false;
    }
    if ( Kind == 'L' && io_rValues.Numbers.size() < 2 )
    {
      io_rValues.Numbers.push_back( static_cast< std::int64_t >( *Number( io_rAt, 8 ) ) );
    }
    else if ( Kind == 'S' && i_Index == 0 )
    {
      io_rValues.First = Text( io_rAt + 4, Size - 4 );
    }
    io_rAt += Size;
    return true;
  }

  bool TakeList( char i_Kind, std::uint64_t& io_rAt, std::uint64_t i_End )
  {
    const auto Count = Number( io_rAt, 4 ), Packed = Number( io_rAt + 8, 4 );
    if ( std::string_view( "fdilbc" ).find( i_Kind ) == std::string_view::npos || !Packed || i_End - io_rAt < 12 ||
         *Packed > i_End - io_rAt - 12 )
    {
      return false;
    }
    const std::uint64_t Bytes = *Count * 8;
    m_Sum += Bytes;
    io_rAt += 12 + *Packed;
    return Bytes <= LargestList && m_Sum <= LargestSum;
  }

  std::span< const std::byte > m_Bytes;
  bool m_bWide;
  std::uint64_t m_Sum = 0;
  VModelTree m_Tree;
};

/// Goes through a text file: names that end in a colon, their values, and the braces around them.
class VTextWalk
{
public:
  explicit VTextWalk( std::string_view i_Text )
    : m_Text( i_Text )
  {
  }

  std::string FindFault()
  {
    std::size_t Depth = 0;
    for ( std::size_t At = 0; At < m_Text.size(); )
    {
      const char Sign = m_Text[At];
      if ( Sign == ';' )
      {
        At = m_Text.find( '\n', At );
        At = At == std::string_view::npos ? m_Text.size() : At;
      }
      else if ( Sign == '"' )
      {
        const std::size_t End = std::min( m_Text.find( '"', At + 1 ), m_Text.size() );
        TakeText( m_Text.substr( At + 1, End - At - 1 ) );
        At = End + 1;
      }
      else if ( Sign == '{' || Sign == '}' )
      {
        Flush();
        Depth = Sign == '{' ? Depth + 1 : Depth - std::min< std::size_t >( Depth, 1 );
        if ( Depth > DeepestRecord )
        {
          return "its records lie too deep in one another";
        }
        ++At;
      }
      else
      {
        At = TakeWord( At );
      }
    }
    Flush();
    return m_Tree.FindFault();
  }

private:
  std::size_t TakeWord( std::size_t i_At )
  {
    const std::size_t End = std::min( m_Text.find_first_of( " \t\r\n,;:\"{}", i_At ), m_Text.size() );
    if ( End == i_At )
    {
      return i_At + 1;
    }
    const std::string_view Word = m_Text.substr( i_At, End - i_At );
    if ( End < m_Text.size() && m_Text[End] == ':' )
    {
      Flush();
      m_Name = Word;
      return End + 1;
    }
    if ( m_Values.Numbers.size() < 2 && ( m_Name == "Model" || m_Name == "C" ) )
    {
      m_Values.Numbers.push_back( std::strtoll( std::string( Word.substr( 0, 24 ) ).c_str(), nullptr, 10 ) );
    }
    return End;
  }
  void TakeText( std::string_view i_Text )
  {
    if ( m_Values.First.empty() )
    {
      m_Values.First = i_Text;
    }
  }
  void Flush()
  {
    Note( m_Name, m_Values, m_Tree );
    m_Name = {};
    m_Values.First = {};
    m_Values.Numbers.clear();
  }

  std::string_view m_Text;
  std::string_view m_Name;
  VValues m_Values;
  VModelTree m_Tree;
};
} // namespace

std::string FindFbxFault( std::span< const std::byte > i_Bytes )
{
  const std::string_view Text( reinterpret_cast< const char* >( i_Bytes.data() ), i_Bytes.size() );
  return Text.starts_with( "Kaydara FBX Binary" ) ? VBinaryWalk( i_Bytes ).FindFault() : VTextWalk( Text ).FindFault();
}

} // namespace HostMeshes

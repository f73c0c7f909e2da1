#include "MeshBytes.h"

#include <cstring>
#include <stdexcept>
#include <type_traits>

namespace HostMeshes
{
namespace
{
using namespace HarrowPluginInterface;

constexpr std::uint32_t Mark = 0x314D5648; // "HVM1"

template < typename T >
struct VIsList : std::false_type
{
};
template < typename T >
struct VIsList< std::vector< T > > : std::true_type
{
};
template <>
struct VIsList< std::string > : std::true_type
{
};

/// Takes values of plain memory, and lists of them, one after the other.
class VWriter
{
public:
  template < typename T >
  void operator()( const T& i_rValue )
  {
    if constexpr ( VIsList< T >::value )
    {
      ( *this )( static_cast< std::uint64_t >( i_rValue.size() ) );
      if constexpr ( std::is_trivially_copyable_v< typename T::value_type > )
      {
        Add( i_rValue.data(), i_rValue.size() * sizeof( typename T::value_type ) );
      }
      else
      {
        for ( const auto& rItem : i_rValue )
        {
          ( *this )( rItem );
        }
      }
    }
    else if constexpr ( std::is_trivially_copyable_v< T > )
    {
      Add( &i_rValue, sizeof( T ) );
    }
    else
    {
      Visit( *this, i_rValue );
    }
  }
  std::vector< std::byte > Bytes;

private:
  void Add( const void* i_pData, std::size_t i_Size )
  {
    const auto* const pBytes = static_cast< const std::byte* >( i_pData );
    Bytes.insert( Bytes.end(), pBytes, pBytes + i_Size );
  }
};

class VReader
{
public:
  explicit VReader( std::span< const std::byte > i_Bytes )
    : Left( i_Bytes )
  {
  }
  template < typename T >
  void operator()( T& o_rValue )
  {
    if constexpr ( VIsList< T >::value )
    {
      std::uint64_t Count = 0;
      ( *this )( Count );
      using VItem = typename T::value_type;
      // An item takes a byte at the least.
      if ( Count > Left.size() / ( std::is_trivially_copyable_v< VItem > ? sizeof( VItem ) : 1 ) )
      {
        throw std::length_error( "a list is cut off" );
      }
      o_rValue.resize( static_cast< std::size_t >( Count ) );
      if constexpr ( std::is_trivially_copyable_v< VItem > )
      {
        Take( o_rValue.data(), o_rValue.size() * sizeof( VItem ) );
      }
      else
      {
        for ( auto& rItem : o_rValue )
        {
          ( *this )( rItem );
        }
      }
    }
    else if constexpr ( std::is_trivially_copyable_v< T > )
    {
      Take( &o_rValue, sizeof( T ) );
    }
    else
    {
      Visit( *this, o_rValue );
    }
  }
  std::span< const std::byte > Left;

private:
  void Take( void* o_pData, std::size_t i_Size )
  {
    if ( i_Size > Left.size() )
    {
      throw std::length_error( "a value is cut off" );
    }
    if ( i_Size > 0 )
    {
      std::memcpy( o_pData, Left.data(), i_Size );
    }
    Left = Left.subspan( i_Size );
  }
};

template < typename... TParts >
void VisitAll( auto& io_rVisitor, TParts&... i_rParts )
{
  ( io_rVisitor( i_rParts ), ... );
}

template < typename T, typename TPlain >
concept CIs = std::is_same_v< std::remove_const_t< T >, TPlain >;

/// One list of members for both ways.
template < typename T >
void Visit( auto& io_rVisitor, T& i_rValue )
{
  if constexpr ( CIs< T, VMeshNode > )
  {
    VisitAll( io_rVisitor, i_rValue.Name, i_rValue.Parent, i_rValue.Local );
  }
  else if constexpr ( CIs< T, VMeshBone > )
  {
    VisitAll( io_rVisitor, i_rValue.Name, i_rValue.Node, i_rValue.InverseBind );
  }
  else if constexpr ( CIs< T, VMeshSurface > )
  {
    VisitAll( io_rVisitor, i_rValue.Name, i_rValue.Positions, i_rValue.Normals, i_rValue.UVs, i_rValue.ControlPoints,
              i_rValue.Influences, i_rValue.Bone, i_rValue.Triangles, i_rValue.Material );
  }
  else if constexpr ( CIs< T, VMeshChannel > )
  {
    VisitAll( io_rVisitor, i_rValue.Node, i_rValue.Positions, i_rValue.Rotations, i_rValue.Scales );
  }
  else if constexpr ( CIs< T, VMeshAnimation > )
  {
    VisitAll( io_rVisitor, i_rValue.Name, i_rValue.Duration, i_rValue.Channels );
  }
  else if constexpr ( CIs< T, VMeshPicture > )
  {
    VisitAll( io_rVisitor, i_rValue.Width, i_rValue.Height, i_rValue.Pixels );
  }
  else if constexpr ( CIs< T, VMeshMaterial > )
  {
    VisitAll( io_rVisitor, i_rValue.Name, i_rValue.Colour, i_rValue.Specular, i_rValue.Emissive, i_rValue.Alpha,
              i_rValue.Shininess );
    VMeshPicture Picture = i_rValue.pPicture ? *i_rValue.pPicture : VMeshPicture();
    io_rVisitor( Picture );
    if constexpr ( !std::is_const_v< T > )
    {
      const std::size_t Bytes =
          4 * static_cast< std::size_t >( Picture.Width ) * static_cast< std::size_t >( Picture.Height );
      if ( Picture.Width > 0 && Picture.Height > 0 && Picture.Pixels.size() == Bytes )
      {
        i_rValue.pPicture = std::make_shared< VMeshPicture >( std::move( Picture ) );
      }
    }
  }
  else if constexpr ( CIs< T, VMeshScene > )
  {
    VisitAll( io_rVisitor, i_rValue.Name, i_rValue.MillimetresPerUnit, i_rValue.Nodes, i_rValue.Bones,
              i_rValue.Materials, i_rValue.Surfaces, i_rValue.Animations );
  }
  else
  {
    static_assert( CIs< T, VMeshOutcome > );
    VisitAll( io_rVisitor, i_rValue.bRead, i_rValue.Message, i_rValue.Mesh );
  }
}
} // namespace

std::vector< std::byte > PackOutcome( const VMeshOutcome& i_rOutcome )
{
  VWriter Writer;
  Writer( Mark );
  Writer( i_rOutcome );
  return std::move( Writer.Bytes );
}

bool UnpackOutcome( std::span< const std::byte > i_Bytes, VMeshOutcome& o_rOutcome )
{
  try
  {
    VReader Reader( i_Bytes );
    std::uint32_t Seen = 0;
    Reader( Seen );
    if ( Seen != Mark )
    {
      return false;
    }
    Reader( o_rOutcome );
    return Reader.Left.empty();
  }
  catch ( const std::exception& )
  {
    return false;
  }
}

} // namespace HostMeshes

#include <HostServices/VSelectionService.h>

#include <algorithm>
#include <charconv>
#include <iterator>
#include <set>
#include <string_view>

namespace HostServices
{
namespace
{
using ZEK::VSelection;
using ZEK::VSelectionItem;

struct VKindWord
{
  std::uint32_t Kind;
  std::string_view Word;
};

constexpr VKindWord KindWords[] = {
    { ZEK::ESelectDevice, "device" },
    { ZEK::ESelectGreyscaleBlob, "blob" },
    { ZEK::ESelectCentroid, "centroid" },
    { ZEK::ESelectReconstruction, "reconstruction" },
    { ZEK::ESelectMarker, "marker" },
    { ZEK::ESelectSubject, "subject" },
    { ZEK::ESelectSegment, "segment" },
    { ZEK::ESelectStick, "stick" },
    { ZEK::ESelectRigidObject, "object" },
    { ZEK::ESelectSceneMesh, "mesh" },
    { ZEK::ESelectObjectManipulator, "objectmanipulator" },
    { ZEK::ESelectMaskCell, "maskcell" },
    { ZEK::ESelectVolumeManipulator, "volumemanipulator" },
};
constexpr char Mark = '@';

template < typename T >
bool ParseNumber( std::string_view i_Text, T& o_rNumber )
{
  const auto [pEnd, Error] = std::from_chars( i_Text.data(), i_Text.data() + i_Text.size(), o_rNumber );
  return Error == std::errc() && pEnd == i_Text.data() + i_Text.size();
}

/// The text up to the next "/", which is taken off `io_rRest` too.
bool TakeField( std::string_view& io_rRest, std::string_view& o_rField )
{
  const auto End = io_rRest.find( '/' );
  if ( End == std::string_view::npos )
  {
    return false;
  }
  o_rField = io_rRest.substr( 0, End );
  io_rRest.remove_prefix( End + 1 );
  return true;
}

bool ParseKind( std::string_view i_Word, std::uint32_t& o_rKind )
{
  for ( const VKindWord& rEntry : KindWords )
  {
    if ( rEntry.Word == i_Word )
    {
      o_rKind = rEntry.Kind;
      return true;
    }
  }
  return ParseNumber( i_Word, o_rKind ) && o_rKind != ZEK::ESelectNone;
}

std::string KindText( std::uint32_t i_Kind )
{
  for ( const VKindWord& rEntry : KindWords )
  {
    if ( rEntry.Kind == i_Kind )
    {
      return std::string( rEntry.Word );
    }
  }
  return std::to_string( i_Kind );
}

VSelection Normalised( VSelection i_Selection )
{
  VSelection Result;
  std::set< VSelectionItem > Seen;
  for ( auto Item = i_Selection.rbegin(); Item != i_Selection.rend(); ++Item )
  {
    if ( Item->Kind != ZEK::ESelectNone && Seen.insert( *Item ).second )
    {
      Result.push_back( std::move( *Item ) );
    }
  }
  std::reverse( Result.begin(), Result.end() );
  return Result;
}

bool IsOf( const std::vector< std::uint32_t >& i_rSortedKinds, std::uint32_t i_Kind )
{
  return i_rSortedKinds.empty() || std::binary_search( i_rSortedKinds.begin(), i_rSortedKinds.end(), i_Kind );
}

/// Whether the items of these kinds, in their order, differ.
bool Differs( const VSelection& i_rA, const VSelection& i_rB, const std::vector< std::uint32_t >& i_rSortedKinds )
{
  auto A = i_rA.begin();
  auto B = i_rB.begin();
  for ( ;; )
  {
    const auto Skip = [&]( auto& io_rItem, const auto End )
    {
      while ( io_rItem != End && !IsOf( i_rSortedKinds, io_rItem->Kind ) )
      {
        ++io_rItem;
      }
    };
    Skip( A, i_rA.end() );
    Skip( B, i_rB.end() );
    if ( A == i_rA.end() || B == i_rB.end() )
    {
      return A != i_rA.end() || B != i_rB.end();
    }
    if ( *A++ != *B++ )
    {
      return true;
    }
  }
}

std::vector< std::uint32_t > Sorted( std::vector< std::uint32_t > i_Kinds )
{
  std::sort( i_Kinds.begin(), i_Kinds.end() );
  i_Kinds.erase( std::unique( i_Kinds.begin(), i_Kinds.end() ), i_Kinds.end() );
  return i_Kinds;
}

bool SetSubIndexOf( std::uint32_t i_Kind, VSelectionItem& io_rItem, std::uint32_t i_Index )
{
  return io_rItem.Kind == i_Kind && SetSubIndex( io_rItem, i_Index );
}
} // namespace

VSelection VSelectionService::Get( ESet i_Set ) const
{
  const std::lock_guard Lock( m_Guard );
  return m_Sets[i_Set == ESecondary];
}

bool VSelectionService::Get( ESet i_Set, const std::vector< std::uint32_t >& i_rKinds, VSelection& o_rSelection ) const
{
  o_rSelection.clear();
  const std::vector< std::uint32_t > Kinds = Sorted( i_rKinds );
  const std::lock_guard Lock( m_Guard );
  const VSelection& rSet = m_Sets[i_Set == ESecondary];
  std::copy_if( rSet.begin(), rSet.end(), std::back_inserter( o_rSelection ),
                [&]( const VSelectionItem& i_rItem )
                {
                  return IsOf( Kinds, i_rItem.Kind );
                } );
  return !o_rSelection.empty();
}

void VSelectionService::Set( ESet i_Set, VSelection i_Selection )
{
  i_Selection = Normalised( std::move( i_Selection ) );
  std::vector< std::shared_ptr< VSignal > > Fired;
  {
    const std::lock_guard Lock( m_Guard );
    VSelection& rSet = m_Sets[i_Set == ESecondary];
    if ( rSet == i_Selection )
    {
      return;
    }
    for ( const auto& [rKinds, rpSignal] : m_Signals )
    {
      if ( Differs( rSet, i_Selection, rKinds ) )
      {
        Fired.push_back( rpSignal );
      }
    }
    rSet = std::move( i_Selection );
    m_Generation.fetch_add( 1, std::memory_order_acq_rel );
  }
  for ( const auto& rpSignal : Fired )
  {
    rpSignal->Fire();
  }
}

std::shared_ptr< ZEK::IMultiCallback< void() > >
VSelectionService::ForKinds( const std::vector< std::uint32_t >& i_rKinds )
{
  const std::lock_guard Lock( m_Guard );
  auto& rpSignal = m_Signals[Sorted( i_rKinds )];
  if ( !rpSignal )
  {
    rpSignal = std::make_shared< VSignal >();
  }
  return rpSignal;
}

VSelectionItem VSelectionService::FromName( const std::string& i_rText ) const
{
  if ( i_rText.empty() )
  {
    return {};
  }
  if ( i_rText.front() != Mark )
  {
    return { .Kind = ZEK::ESelectDevice, .Device = i_rText };
  }
  VSelectionItem Item;
  std::string_view Rest = std::string_view( i_rText ).substr( 1 );
  std::string_view Kind;
  std::string_view Object;
  std::string_view Sub;
  const bool bNames = TakeField( Rest, Kind ) && TakeField( Rest, Object ) && TakeField( Rest, Sub ) &&
                      ParseKind( Kind, Item.Kind ) && ParseNumber( Object, Item.Object ) &&
                      ParseNumber( Sub, Item.Sub );
  if ( !bNames )
  {
    return {};
  }
  Item.Device = Rest;
  return Item;
}

std::string VSelectionService::Text( const VSelectionItem& i_rItem ) const
{
  if ( i_rItem.Kind == ZEK::ESelectNone )
  {
    return {};
  }
  const bool bPlain = i_rItem.Kind == ZEK::ESelectDevice && i_rItem.Object == 0 && i_rItem.Sub == 0 &&
                      !i_rItem.Device.empty() && i_rItem.Device.front() != Mark;
  if ( bPlain )
  {
    return i_rItem.Device;
  }
  return Mark + KindText( i_rItem.Kind ) + '/' + std::to_string( i_rItem.Object ) + '/' +
         std::to_string( i_rItem.Sub ) + '/' + i_rItem.Device;
}

VSelectionItem VSelectionService::CurrentItem() const
{
  const std::lock_guard Lock( m_Guard );
  return m_Sets[0].empty() ? VSelectionItem{} : m_Sets[0].back();
}

bool SetSubIndex( VSelectionItem& io_rItem, std::uint32_t i_Index )
{
  if ( !ZEK::HasSubIndex( io_rItem.Kind ) )
  {
    return false;
  }
  io_rItem.Sub = i_Index;
  return true;
}

bool SetCentroidIndex( VSelectionItem& io_rItem, std::uint32_t i_Index )
{
  return SetSubIndexOf( ZEK::ESelectCentroid, io_rItem, i_Index );
}

bool SetMaskCellIndex( VSelectionItem& io_rItem, std::uint32_t i_Index )
{
  return SetSubIndexOf( ZEK::ESelectMaskCell, io_rItem, i_Index );
}

bool SetReconstructionIndex( VSelectionItem& io_rItem, std::uint32_t i_Index )
{
  return SetSubIndexOf( ZEK::ESelectReconstruction, io_rItem, i_Index );
}

bool SetGreyscaleBlobIndex( VSelectionItem& io_rItem, std::uint32_t i_Index )
{
  return SetSubIndexOf( ZEK::ESelectGreyscaleBlob, io_rItem, i_Index );
}

} // namespace HostServices

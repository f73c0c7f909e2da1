#include "NameTable.h"

#include <algorithm>
#include <cstring>

namespace Flow2TypesUtils
{
namespace
{
/// Eight bytes at a time: names of devices are alike but for a few digits.
std::uint64_t HashOf( std::string_view i_Name )
{
  constexpr std::uint64_t Factor = 0x9e3779b97f4a7c15u;
  std::uint64_t Hash = i_Name.size() * Factor;
  const auto Mix = [&]( std::uint64_t i_Word )
  {
    Hash = ( std::rotl( Hash, 23 ) ^ i_Word ) * Factor;
  };
  std::size_t At = 0;
  for ( ; At + 8 <= i_Name.size(); At += 8 )
  {
    std::uint64_t Word = 0;
    std::memcpy( &Word, i_Name.data() + At, 8 );
    Mix( Word );
  }
  std::uint64_t Rest = 0;
  if ( At < i_Name.size() )
  {
    std::memcpy( &Rest, i_Name.data() + At, i_Name.size() - At );
  }
  Mix( Rest );
  return Hash;
}
} // namespace

void VNameTable::Clear()
{
  m_Rows.clear();
  m_Hashes.clear();
  m_Numbers.clear();
  std::fill( m_Buckets.begin(), m_Buckets.end(), 0 );
  std::fill( m_Numbered.begin(), m_Numbered.end(), VNumbered() );
}

VNameTable::VNumbered& VNameTable::Numbered( std::uint32_t i_Number )
{
  // Numbers are given out one after another, so their low bits spread best.
  return m_Numbered[i_Number & ( m_Numbered.size() - 1 )];
}

std::uint32_t VNameTable::RowOf( const ZEK::IFlowItem& i_rItem, std::uint32_t i_Selector )
{
  const std::uint32_t Number = i_rItem.NameNumber( i_Selector );
  if ( Number != 0 && !m_Numbered.empty() && Numbered( Number ).Number == Number )
  {
    return Numbered( Number ).Row;
  }
  std::string_view Name;
  if ( !i_rItem.Value().GetName( i_Selector, Name ) )
  {
    return None;
  }
  const std::uint32_t Row = RowOf( Name );
  if ( Number != 0 )
  {
    Numbered( Number ) = { Number, Row };
    m_Numbers[Row] = Number;
  }
  return Row;
}

bool VNameTable::IsRowOf( std::uint32_t i_Row, const ZEK::IFlowItem& i_rItem, std::uint32_t i_Selector )
{
  std::string_view Name;
  const bool bName = i_rItem.Value().GetName( i_Selector, Name );
  if ( !bName || i_Row == None || m_Rows[i_Row].Name != Name )
  {
    return !bName && i_Row == None;
  }
  m_Numbers[i_Row] = i_rItem.NameNumber( i_Selector );
  return true;
}

std::uint32_t VNameTable::RowOf( std::string_view i_Name )
{
  if ( m_Rows.size() * 2 >= m_Buckets.size() )
  {
    Grow();
  }
  const std::uint64_t Hash = HashOf( i_Name );
  const std::size_t Mask = m_Buckets.size() - 1;
  std::size_t Bucket = BucketOf( Hash );
  for ( ; m_Buckets[Bucket] != 0; Bucket = ( Bucket + 1 ) & Mask )
  {
    const std::uint32_t Found = m_Buckets[Bucket] - 1;
    if ( m_Hashes[Found] == Hash && m_Rows[Found].Name == i_Name )
    {
      return Found;
    }
  }
  m_Rows.push_back( { i_Name } );
  m_Hashes.push_back( Hash );
  m_Numbers.push_back( 0 );
  m_Buckets[Bucket] = static_cast< std::uint32_t >( m_Rows.size() );
  return m_Buckets[Bucket] - 1;
}

void VNameTable::Grow()
{
  m_Buckets.assign( std::max< std::size_t >( 64, m_Buckets.size() * 2 ), 0 );
  m_Numbered.assign( m_Buckets.size(), {} );
  const std::size_t Mask = m_Buckets.size() - 1;
  for ( std::size_t Row = 0; Row < m_Rows.size(); ++Row )
  {
    std::size_t Bucket = BucketOf( m_Hashes[Row] );
    while ( m_Buckets[Bucket] != 0 )
    {
      Bucket = ( Bucket + 1 ) & Mask;
    }
    m_Buckets[Bucket] = static_cast< std::uint32_t >( Row + 1 );
  }
}

void VNameTable::Number( std::uint32_t i_Needed, std::vector< std::string >& o_rNames )
{
  m_Order.clear();
  std::size_t Dropped = 0;
  for ( std::uint32_t Row = 0; Row < m_Rows.size(); ++Row )
  {
    if ( m_Rows[Row].HitCount == i_Needed )
    {
      m_Order.push_back( Row );
    }
    else
    {
      ++Dropped;
    }
  }
  std::sort( m_Order.begin(), m_Order.end(),
             [&]( std::uint32_t i_Left, std::uint32_t i_Right )
             {
               return m_Rows[i_Left].Name < m_Rows[i_Right].Name;
             } );
  o_rNames.resize( m_Order.size() );
  for ( std::uint32_t Index = 0; Index < m_Order.size(); ++Index )
  {
    VJoinRow& rRow = m_Rows[m_Order[Index]];
    o_rNames[Index].assign( rRow.Name );
    rRow.Name = o_rNames[Index];
    rRow.Index = Index;
  }
  m_Dropped.resize( std::max( Dropped, m_Dropped.size() ) );
  Dropped = 0;
  for ( VJoinRow& rRow : m_Rows )
  {
    if ( rRow.Index == VJoinRow::None )
    {
      m_Dropped[Dropped].assign( rRow.Name );
      rRow.Name = m_Dropped[Dropped++];
    }
  }
}

} // namespace Flow2TypesUtils

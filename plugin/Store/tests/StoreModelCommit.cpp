#include "StoreModel.h"

#include <algorithm>

namespace Store
{

using namespace ZEK;

namespace
{
constexpr std::uint64_t Bit( unsigned i_Bit )
{
  return std::uint64_t( 1 ) << i_Bit;
}
} // namespace

IResult VStoreModel::Remove( const std::string& i_rPath )
{
  if ( !Exists( i_rPath ) )
  {
    return IResult::NotFound;
  }
  const auto IsBelow = [&]( const std::string& i_rOther )
  {
    return i_rPath.empty() || i_rOther == i_rPath || i_rOther.starts_with( i_rPath + "/" );
  };
  for ( auto& [rPath, rNode] : m_Nodes )
  {
    if ( IsBelow( rPath ) && ( rNode.m_bOld || rPath == i_rPath ) )
    {
      VRecord& rRecord = Acquire( rPath );
      rRecord.m_Mask = ( rRecord.m_Mask & ( Bit( 47 ) | Bit( 48 ) ) ) | ERemoved | EForce;
      rRecord.m_pSchema = nullptr;
    }
  }
  for ( auto& [rPath, rNode] : m_Nodes )
  {
    if ( IsBelow( rPath ) && !rNode.m_bOld )
    {
      rNode.m_Record.reset();
    }
  }
  // Parents that were only on the way to it.
  for ( std::string Path = i_rPath; !m_Nodes.at( i_rPath ).m_bOld && !Path.empty(); )
  {
    Path = ParentOf( Path );
    const bool bHasBelow =
        std::any_of( m_Nodes.begin(), m_Nodes.end(),
                     [&]( const auto& i_rNode )
                     {
                       return !i_rNode.first.empty() && ParentOf( i_rNode.first ) == Path && i_rNode.second.m_Record;
                     } );
    std::optional< VRecord >& rRecord = m_Nodes.at( Path ).m_Record;
    if ( !rRecord || rRecord->m_Mask != 0 || bHasBelow )
    {
      break;
    }
    rRecord.reset();
  }
  return IResult::Ok;
}

bool VStoreModel::IsVerificationPending( const VNode& i_rNode ) const
{
  const auto Field = [&i_rNode]( unsigned i_Bit )
  {
    const auto It = i_rNode.m_Fields.find( i_Bit );
    return It != i_rNode.m_Fields.end() ? It->second : VModelField();
  };
  return i_rNode.m_bOld && ( i_rNode.m_Flags & EVerifyRequired ) != 0 && Field( 16 ) != Field( 17 );
}

void VStoreModel::Apply( VNode& io_rNode, const VRecord& i_rRecord, std::uint64_t i_Mask, std::uint64_t& io_rTold,
                         std::uint64_t i_Id )
{
  const bool bForce = ( i_Mask & EForce ) != 0;
  for ( const unsigned Field : FieldBits )
  {
    if ( ( i_Mask & Bit( Field ) ) != 0 )
    {
      const auto It = i_rRecord.m_Fields.find( Field );
      const VModelField New = It != i_rRecord.m_Fields.end() ? It->second : VModelField();
      VModelField& rOld = io_rNode.m_Fields[Field];
      io_rTold |= New != rOld || bForce ? Bit( Field ) : 0;
      io_rTold |= Field == 26 && New.empty() != rOld.empty() ? Bit( 39 ) : 0;
      rOld = New;
    }
  }
  if ( ( i_Mask & 0x703ff ) != 0 )
  {
    const auto Mask = static_cast< std::uint32_t >( i_Mask & 0x3ff );
    io_rTold |= bForce ? Mask : ( io_rNode.m_Flags ^ i_rRecord.m_Flags ) & Mask;
    io_rNode.m_Flags = ( io_rNode.m_Flags & ~Mask ) | ( i_rRecord.m_Flags & Mask );
    io_rTold |= ( io_rTold & 0x30010 ) != 0 && IsVerificationPending( io_rNode ) ? Bit( 55 ) : 0;
  }
  io_rTold |= i_Mask & ( Bit( 47 ) | Bit( 48 ) );
  const std::array< std::uint64_t, 5 > Stamped{ Bit( 16 ), Bit( 17 ), ~( Bit( 16 ) | Bit( 17 ) ), Bit( 50 ) | Bit( 53 ),
                                                Bit( 51 ) | Bit( 54 ) };
  for ( std::size_t Stamp = 0; Stamp < Stamped.size(); ++Stamp )
  {
    io_rNode.m_Stamps[Stamp] = ( io_rTold & Stamped[Stamp] ) != 0 ? i_Id : io_rNode.m_Stamps[Stamp];
  }
}

void VStoreModel::Merge( const std::string& i_rPath, VNode& io_rNode, std::uint64_t i_Id )
{
  const VRecord Record = *io_rNode.m_Record;
  io_rNode.m_Record.reset();
  std::uint64_t Told = 0;
  if ( ( Record.m_Mask & EAdded ) != 0 )
  {
    if ( io_rNode.m_bOld )
    {
      io_rNode.m_pSchema = nullptr;
      Apply( io_rNode, VRecord(), ~Record.m_Mask & 0xff3f0703ff, Told, i_Id );
      Told |= ( Record.m_Mask & Bit( 47 ) ) != 0 ? std::uint64_t( EAdded ) : 0;
    }
    else
    {
      io_rNode = VNode();
      io_rNode.m_bOld = true;
      Told |= EAdded;
    }
  }
  // Children were merged before.
  for ( const auto& [rPath, rChild] : m_Nodes )
  {
    if ( !rPath.empty() && ParentOf( rPath ) == i_rPath )
    {
      for ( unsigned Position = 0; Position < 56; ++Position )
      {
        const bool bMoves = Position == 49 || Position == 50 || Position == 52 || Position == 53;
        Told |= ( rChild.m_Told & Bit( Position ) ) != 0 ? Bit( Position + ( bMoves ? 1 : 0 ) ) : 0;
      }
    }
  }
  if ( ( Record.m_Mask & ERemoved ) != 0 )
  {
    Told |= ERemoved;
    io_rNode = VNode();
  }
  else
  {
    if ( Record.m_pSchema != nullptr && ( Record.m_Mask & 0x12000007070000 ) != 0 )
    {
      io_rNode.m_pSchema = Record.m_pSchema;
    }
    Apply( io_rNode, Record, Record.m_Mask, Told, i_Id );
  }
  io_rNode.m_Told = Told;
}

void VStoreModel::Commit( std::uint64_t i_Id )
{
  // From the longest path to the shortest, so that children come before their parents.
  std::vector< std::string > Order;
  for ( auto& [rPath, rNode] : m_Nodes )
  {
    rNode.m_Told = 0;
    Order.push_back( rPath );
  }
  std::stable_sort( Order.begin(), Order.end(),
                    []( const std::string& i_rA, const std::string& i_rB )
                    {
                      return i_rA.size() > i_rB.size();
                    } );
  for ( const std::string& rPath : Order )
  {
    VNode& rNode = m_Nodes.at( rPath );
    if ( rNode.m_Record )
    {
      Merge( rPath, rNode, i_Id );
    }
  }
}

std::size_t VStoreModel::RecordCount() const
{
  return static_cast< std::size_t >( std::count_if( m_Nodes.begin(), m_Nodes.end(),
                                                    []( const auto& i_rNode )
                                                    {
                                                      return i_rNode.second.m_Record.has_value();
                                                    } ) );
}

} // namespace Store

#include "StoreFill.h"

#include "DocumentKeys.h"
#include "LeafCodec.h"

#include <StoreIO/StoreJson.h>
#include <ZEK/StoreFlags.h>

#include <boost/format.hpp>

#include <algorithm>
#include <cstring>
#include <utility>

namespace StoreIO
{

using namespace ZEK;

namespace
{
/// The most characters that RapidJSON keeps in a value.
constexpr std::size_t ShortName = 13;
} // namespace

VStoreFill::VStoreFill( IStoreReader& i_rReader, rapidjson::Document::AllocatorType& io_rPool )
  : m_rReader( i_rReader )
  , m_rStore( *i_rReader.GetStore() )
  , m_Filled( &io_rPool, ParseStackBytes )
{
}

/// What the function tells the document, as a value.
template < typename TFill >
rapidjson::Value VStoreFill::Filled( const TFill& i_rFill )
{
  auto Generator = [&i_rFill]( rapidjson::Document& )
  {
    i_rFill();
    return true;
  };
  m_Filled.Populate( Generator );
  rapidjson::Value Value;
  m_Filled.rapidjson::Value::Swap( Value );
  return Value;
}

rapidjson::Value VStoreFill::Children( Entry i_pEntry )
{
  VOpen Top;
  Top.m_Children = m_rReader.Children( i_pEntry );
  if ( i_pEntry == m_rStore.GetRootEntry() )
  {
    const auto Versions = std::find_if( Top.m_Children.begin(), Top.m_Children.end(),
                                        [this]( Entry i_pChild )
                                        {
                                          return Name( i_pChild ) == LeafVersions;
                                        } );
    if ( Versions != Top.m_Children.end() )
    {
      std::rotate( Top.m_Children.begin(), Versions, Versions + 1 );
    }
  }
  return Filled(
      [&]
      {
        m_Filled.StartObject();
        m_Open.push_back( std::move( Top ) );
        FillOpen();
      } );
}

rapidjson::Value VStoreFill::Branch( Entry i_pEntry )
{
  std::vector< std::string_view > Names;
  std::string_view Left = m_rStore.EntryPath( i_pEntry ).Text();
  while ( !Left.empty() )
  {
    const std::size_t Leaf = Left.rfind( '/' ) + 1;
    Names.push_back( Left.substr( Leaf ) );
    Left = Left.substr( 0, Leaf == 0 ? 0 : Leaf - 1 );
  }
  if ( Names.empty() )
  {
    return Children( i_pEntry );
  }
  m_Above = Names.size();
  return Filled(
      [&]
      {
        m_Filled.StartObject();
        for ( ; Names.size() > 1; Names.pop_back() )
        {
          Key( Names.back() );
          m_Filled.StartObject();
          Key( KeyChildren );
          m_Filled.StartObject();
        }
        BeginNode( i_pEntry, Names.back() );
        FillOpen();
        for ( std::size_t Level = 1; Level < m_Above; ++Level )
        {
          m_Filled.EndObject( 1 );
          m_Filled.EndObject( 1 );
        }
        m_Filled.EndObject( 1 );
      } );
}

void VStoreFill::FillOpen()
{
  while ( !m_Open.empty() )
  {
    VOpen& rTop = m_Open.back();
    if ( rTop.m_Next < rTop.m_Children.size() )
    {
      const Entry pChild = rTop.m_Children[rTop.m_Next++];
      Prefetch( rTop );
      BeginNode( pChild, Name( pChild ) );
      continue;
    }
    m_Filled.EndObject( static_cast< rapidjson::SizeType >( rTop.m_Children.size() ) );
    if ( rTop.m_bInNode )
    {
      m_Filled.EndObject( rTop.m_Members + 1 );
    }
    m_Open.pop_back();
  }
}

/// Entries lie far apart: what the next ones will be asked for is on its way meanwhile.
void VStoreFill::Prefetch( const VOpen& i_rOpen ) const
{
  constexpr std::size_t EntryAhead = 4;
  constexpr std::size_t NameAhead = 2;
  const std::size_t Left = i_rOpen.m_Children.size() - i_rOpen.m_Next;
  if ( Left > EntryAhead )
  {
    const auto* const pEntry = reinterpret_cast< const char* >( i_rOpen.m_Children[i_rOpen.m_Next + EntryAhead] );
    __builtin_prefetch( pEntry );
    __builtin_prefetch( pEntry + 64 );
    __builtin_prefetch( pEntry + 128 );
    __builtin_prefetch( pEntry + 192 );
  }
  if ( Left > NameAhead )
  {
    __builtin_prefetch( Name( i_rOpen.m_Children[i_rOpen.m_Next + NameAhead] ).data() );
  }
}

/// The whole node of an entry without children; else the children are open.
void VStoreFill::BeginNode( Entry i_pEntry, std::string_view i_Name )
{
  // A short name lies in the value itself, so that writing need not go back to the store.
  m_Filled.Key( i_Name.data(), static_cast< rapidjson::SizeType >( i_Name.size() ), i_Name.size() <= ShortName );
  m_Filled.StartObject();
  if ( m_Above + m_Open.size() > MaximumComponents )
  {
    Fail( "Failed trying to write entry path '%1%', it has too many components.", i_pEntry );
    m_Filled.EndObject( 0 );
    return;
  }
  const rapidjson::SizeType Members = Values( i_pEntry );
  if ( !m_rReader.HasChildren( i_pEntry ) )
  {
    m_Filled.EndObject( Members );
    return;
  }
  Key( KeyChildren );
  m_Filled.StartObject();
  m_Open.push_back( { m_rReader.Children( i_pEntry ), 0, Members, true } );
}

/// The number of members that were told.
rapidjson::SizeType VStoreFill::Values( Entry i_pEntry )
{
  const VTypedValue& rVerified = m_rReader.VerifiedValue( i_pEntry );
  const VTypedValue& rProposed = m_rReader.ProposedValue( i_pEntry );
  if ( rVerified.IsEmpty() && rProposed.IsEmpty() )
  {
    return 0;
  }
  const IO::ISchema* const pSchema = m_rReader.Schema( i_pEntry );
  if ( pSchema->m_Type == IO::EType::Void )
  {
    Fail( "Failed trying to write the schema for entry path '%1%'", i_pEntry );
    return 0;
  }
  rapidjson::SizeType Members = 0;
  if ( !rProposed.IsEmpty() && ( m_rReader.Flags( i_pEntry ) & EVerifyRequired ) != 0 )
  {
    Members += Leaf( i_pEntry, rProposed, KeyValueProposed );
  }
  if ( !rVerified.IsEmpty() )
  {
    Members += Leaf( i_pEntry, rVerified, KeyValue );
  }
  if ( Members == 0 )
  {
    Fail( "Failed trying to write values for entry path '%1%', entry has no values set.", i_pEntry );
  }
  return Members + Schema( pSchema );
}

rapidjson::SizeType VStoreFill::Leaf( Entry i_pEntry, const VTypedValue& i_rValue, std::string_view i_Key )
{
  Key( i_Key );
  if ( !EncodeLeaf( i_rValue, m_Filled, m_Text ) )
  {
    m_Filled.Null();
    Fail( "Failed trying to write a value for entry path '%1%', it has no text.", i_pEntry );
  }
  return 1;
}

rapidjson::SizeType VStoreFill::Schema( const IO::ISchema* i_pSchema )
{
  if ( i_pSchema == IO::GetUniquePodSchema( i_pSchema->m_Type ) )
  {
    const char* const pName = IO::TypeName( i_pSchema->m_Type );
    Key( KeyType );
    m_Filled.String( pName, static_cast< rapidjson::SizeType >( std::strlen( pName ) ), false );
    return 1;
  }
  const auto [It, bNew] = m_Schemas.try_emplace( i_pSchema );
  if ( bNew )
  {
    It->second = ParseSchema( i_pSchema );
  }
  const rapidjson::Value& rMembers = It->second;
  for ( const auto& rMember : rMembers.GetObject() )
  {
    Key( { rMember.name.GetString(), rMember.name.GetStringLength() } );
    // Recurses as deep as a schema can be.
    rMember.value.Accept( m_Filled );
  }
  return rMembers.MemberCount();
}

/// With its text in the pool, so that copies of the value only refer to it.
rapidjson::Value VStoreFill::ParseSchema( const IO::ISchema* i_pSchema )
{
  const std::string Json = IO::SchemaToJson( i_pSchema );
  auto* const pText = static_cast< char* >( m_Filled.GetAllocator().Malloc( Json.size() + 1 ) );
  std::memcpy( pText, Json.c_str(), Json.size() + 1 );
  rapidjson::Document Parsed( &m_Filled.GetAllocator(), ParseStackBytes );
  Parsed.ParseInsitu< rapidjson::kParseIterativeFlag >( pText );
  rapidjson::Value Value;
  Parsed.rapidjson::Value::Swap( Value );
  return Value;
}

void VStoreFill::Fail( const char* i_pTemplate, Entry i_pEntry )
{
  m_Errors.push_back( ( boost::format( i_pTemplate ) % m_rStore.EntryPath( i_pEntry ).Text() ).str() );
}

void VStoreFill::Key( std::string_view i_Name )
{
  m_Filled.Key( i_Name.data(), static_cast< rapidjson::SizeType >( i_Name.size() ), false );
}

} // namespace StoreIO

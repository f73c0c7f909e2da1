// Settings to and from JSON: a document of 100 groups of 100 devices of 10 keys, about 5 MB, and beside each figure a
// floor that does with RapidJSON and a hash map the least that the task needs. A second group shows how costs grow.

#include <Store/Store.h>
#include <StoreIO/StoreJson.h>

#include <rapidjson/document.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>

#include <benchmark/benchmark.h>

#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

using namespace ZEK;

namespace
{
std::string Leaf( int i_Key, std::uint32_t i_Random )
{
  char Text[256] = {};
  switch ( i_Key % 4 )
  {
  case 0:
    std::snprintf( Text, sizeof( Text ), "{\"Value\":%d,\"Type\":\"Int32\"}", static_cast< int >( i_Random >> 4 ) );
    break;
  case 1:
    std::snprintf( Text, sizeof( Text ), "{\"Value\":%.9g,\"Type\":\"Float64\"}", i_Random / 1024.0 );
    break;
  case 2:
    std::snprintf( Text, sizeof( Text ), "{\"Value\":%s,\"Type\":\"Bool\"}",
                   ( i_Random & 256 ) != 0 ? "true" : "false" );
    break;
  default:
    std::snprintf( Text, sizeof( Text ), "{\"Value\":\"text %u of a setting\",\"Type\":\"String\"}", i_Random >> 8 );
  }
  return Text;
}

/// So many groups of 100 devices of 10 keys of mixed types.
std::string MakeText( int i_Groups )
{
  std::string Text = "{\"Version\":\"3.0\",\"Children\":{";
  std::uint32_t Random = 1;
  for ( int Group = 0; Group < i_Groups; ++Group )
  {
    char Name[64] = {};
    std::snprintf( Name, sizeof( Name ), "%s\"Group%02d\":{\"Children\":{", Group != 0 ? "," : "", Group );
    Text += Name;
    for ( int Device = 0; Device < 100; ++Device )
    {
      std::snprintf( Name, sizeof( Name ), "%s\"Device%03d\":{\"Children\":{", Device != 0 ? "," : "", Device );
      Text += Name;
      for ( int Key = 0; Key < 10; ++Key )
      {
        Random = Random * 1664525u + 1013904223u;
        std::snprintf( Name, sizeof( Name ), "%s\"Setting%d\":", Key != 0 ? "," : "", Key );
        Text += Name;
        Text += Leaf( Key, Random );
      }
      Text += "}}";
    }
    Text += "}}";
  }
  return Text + "}}";
}

const std::string& Text()
{
  static const std::string s_Text = MakeText( 100 );
  return s_Text;
}

std::shared_ptr< IStore > NewStore()
{
  return Store::CreateStore( nullptr, 131072 );
}

void Import( IStore& io_rStore, const std::string& i_rText )
{
  StoreIO::VStoreImporterJson Importer;
  const VStoreWriteScope Scope( io_rStore );
  if ( Importer.ReadText( i_rText ) != IResult::Ok || Importer.Import( *Scope ) != IResult::Ok )
  {
    std::abort();
  }
}

std::size_t Export( IStore& io_rStore )
{
  StoreIO::VStoreExporterJson Exporter;
  {
    const VStoreReadScope Scope( io_rStore );
    if ( Exporter.Export( *Scope ) != IResult::Ok )
    {
      std::abort();
    }
  }
  std::string Written;
  if ( Exporter.WriteText( Written ) != IResult::Ok )
  {
    std::abort();
  }
  return Written.size();
}

void ImportEach( benchmark::State& io_rState, const std::string& i_rText )
{
  for ( auto Turn : io_rState )
  {
    io_rState.PauseTiming();
    auto pStore = NewStore();
    io_rState.ResumeTiming();
    Import( *pStore, i_rText );
    io_rState.PauseTiming();
    pStore.reset();
    io_rState.ResumeTiming();
  }
}

void ImportNew( benchmark::State& io_rState )
{
  ImportEach( io_rState, Text() );
}

void ImportOver( benchmark::State& io_rState )
{
  const auto pStore = NewStore();
  Import( *pStore, Text() );
  for ( auto Turn : io_rState )
  {
    Import( *pStore, Text() );
  }
}

void ExportAll( benchmark::State& io_rState )
{
  const auto pStore = NewStore();
  Import( *pStore, Text() );
  for ( auto Turn : io_rState )
  {
    if ( Export( *pStore ) < Text().size() * 9 / 10 )
    {
      std::abort();
    }
  }
}

/// What a floor keeps of an entry.
struct VFloorEntry
{
  const char* m_pType = "";
  std::vector< unsigned char > m_Bytes;
  std::vector< VFloorEntry* > m_Children;
  std::string m_Leaf;
};
using VFloorMap = std::unordered_map< std::string, std::unique_ptr< VFloorEntry > >;

struct VFloor
{
  VFloorMap m_Map;
  VFloorEntry m_Root;

  static void SetBytes( VFloorEntry& o_rEntry, const rapidjson::Value& i_rValue )
  {
    const auto Put = [&]( const char* i_pType, const void* i_pBytes, std::size_t i_Size )
    {
      const auto* const pBytes = static_cast< const unsigned char* >( i_pBytes );
      o_rEntry.m_pType = i_pType;
      o_rEntry.m_Bytes.assign( pBytes, pBytes + i_Size );
    };
    if ( i_rValue.IsBool() )
    {
      const bool bValue = i_rValue.GetBool();
      Put( "Bool", &bValue, sizeof( bValue ) );
    }
    else if ( i_rValue.IsInt() )
    {
      const int Value = i_rValue.GetInt();
      Put( "Int32", &Value, sizeof( Value ) );
    }
    else if ( i_rValue.IsNumber() )
    {
      const double Value = i_rValue.GetDouble();
      Put( "Float64", &Value, sizeof( Value ) );
    }
    else
    {
      Put( "String", i_rValue.GetString(), i_rValue.GetStringLength() );
    }
  }

  void ImportChildren( VFloorEntry& io_rParent, std::string& io_rPath, const rapidjson::Value& i_rChildren )
  {
    for ( const auto& rMember : i_rChildren.GetObject() )
    {
      const std::size_t Cut = io_rPath.size();
      io_rPath.append( Cut != 0 ? "/" : "" );
      io_rPath.append( rMember.name.GetString(), rMember.name.GetStringLength() );
      auto& rpEntry = m_Map[io_rPath];
      if ( !rpEntry )
      {
        rpEntry = std::make_unique< VFloorEntry >();
        rpEntry->m_Leaf.assign( rMember.name.GetString(), rMember.name.GetStringLength() );
        io_rParent.m_Children.push_back( rpEntry.get() );
      }
      VFloorEntry& rEntry = *rpEntry;
      const auto Value = rMember.value.FindMember( "Value" );
      if ( Value != rMember.value.MemberEnd() )
      {
        SetBytes( rEntry, Value->value );
      }
      const auto Children = rMember.value.FindMember( "Children" );
      if ( Children != rMember.value.MemberEnd() )
      {
        ImportChildren( rEntry, io_rPath, Children->value );
      }
      io_rPath.resize( Cut );
    }
  }
  void Import( const std::string& i_rText )
  {
    rapidjson::Document Document;
    Document.Parse( i_rText.c_str(), i_rText.size() );
    std::string Path;
    ImportChildren( m_Root, Path, Document["Children"] );
  }

  static rapidjson::Value Node( const VFloorEntry& i_rEntry, rapidjson::Document::AllocatorType& io_rPool )
  {
    rapidjson::Value Made( rapidjson::kObjectType );
    if ( !i_rEntry.m_Bytes.empty() )
    {
      rapidjson::Value Value;
      const unsigned char* const pBytes = i_rEntry.m_Bytes.data();
      const std::string_view Type = i_rEntry.m_pType;
      int Whole = 0;
      double Number = 0;
      if ( Type == "Bool" )
      {
        Value.SetBool( *pBytes != 0 );
      }
      else if ( Type == "Int32" )
      {
        std::memcpy( &Whole, pBytes, sizeof( Whole ) );
        Value.SetInt( Whole );
      }
      else if ( Type == "Float64" )
      {
        std::memcpy( &Number, pBytes, sizeof( Number ) );
        Value.SetDouble( Number );
      }
      else
      {
        Value.SetString( reinterpret_cast< const char* >( pBytes ),
                         static_cast< rapidjson::SizeType >( i_rEntry.m_Bytes.size() ), io_rPool );
      }
      Made.AddMember( "Value", Value, io_rPool );
      Made.AddMember( "Type", rapidjson::StringRef( i_rEntry.m_pType ), io_rPool );
    }
    if ( !i_rEntry.m_Children.empty() )
    {
      Made.AddMember( "Children", Children( i_rEntry, io_rPool ), io_rPool );
    }
    return Made;
  }
  static rapidjson::Value Children( const VFloorEntry& i_rEntry, rapidjson::Document::AllocatorType& io_rPool )
  {
    rapidjson::Value Made( rapidjson::kObjectType );
    for ( const VFloorEntry* const pChild : i_rEntry.m_Children )
    {
      rapidjson::Value Name( pChild->m_Leaf.c_str(), static_cast< rapidjson::SizeType >( pChild->m_Leaf.size() ),
                             io_rPool );
      Made.AddMember( Name, Node( *pChild, io_rPool ), io_rPool );
    }
    return Made;
  }
  std::size_t Export() const
  {
    rapidjson::Document Document( rapidjson::kObjectType );
    Document.AddMember( "Version", "3.0", Document.GetAllocator() );
    Document.AddMember( "Children", Children( m_Root, Document.GetAllocator() ), Document.GetAllocator() );
    rapidjson::StringBuffer Buffer;
    rapidjson::Writer< rapidjson::StringBuffer > Writer( Buffer );
    Document.Accept( Writer );
    return Buffer.GetSize();
  }
};

void FloorImportNew( benchmark::State& io_rState )
{
  for ( auto Turn : io_rState )
  {
    io_rState.PauseTiming();
    auto pFloor = std::make_unique< VFloor >();
    io_rState.ResumeTiming();
    pFloor->Import( Text() );
    io_rState.PauseTiming();
    pFloor.reset();
    io_rState.ResumeTiming();
  }
}

void FloorImportOver( benchmark::State& io_rState )
{
  VFloor Floor;
  Floor.Import( Text() );
  for ( auto Turn : io_rState )
  {
    Floor.Import( Text() );
  }
}

void FloorExport( benchmark::State& io_rState )
{
  VFloor Floor;
  Floor.Import( Text() );
  for ( auto Turn : io_rState )
  {
    if ( Floor.Export() < Text().size() * 9 / 10 )
    {
      std::abort();
    }
  }
}

/// So many entries, without the floor: ten times the entries cost at most 15 times the time.
void Grow( benchmark::State& io_rState )
{
  const std::string Grown = MakeText( static_cast< int >( io_rState.range( 0 ) / 1000 ) );
  ImportEach( io_rState, Grown );
}

BENCHMARK( ImportNew )->Name( "storeio/import_new" )->Unit( benchmark::kMillisecond );
BENCHMARK( FloorImportNew )->Name( "storeio/floor/import_new" )->Unit( benchmark::kMillisecond );
BENCHMARK( ImportOver )->Name( "storeio/import_over" )->Unit( benchmark::kMillisecond );
BENCHMARK( FloorImportOver )->Name( "storeio/floor/import_over" )->Unit( benchmark::kMillisecond );
BENCHMARK( ExportAll )->Name( "storeio/export" )->Unit( benchmark::kMillisecond );
BENCHMARK( FloorExport )->Name( "storeio/floor/export" )->Unit( benchmark::kMillisecond );
BENCHMARK( Grow )->Name( "storeio/import_entries" )->Arg( 10000 )->Arg( 100000 )->Unit( benchmark::kMillisecond );
} // namespace

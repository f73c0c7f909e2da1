#include "FuzzRequire.h"

#include <Store/Store.h>
#include <StoreIO/CheckDocument.h>
#include <StoreIO/StoreJson.h>

#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

using namespace ZEK;
using FuzzCheck::Require;

namespace
{
std::shared_ptr< IStore > Imported( std::string_view i_Text, IResult& o_rResult )
{
  auto pStore = Store::CreateStore( nullptr, 64 );
  StoreIO::VStoreImporterJson Importer;
  o_rResult = Importer.ReadText( i_Text );
  Require( o_rResult.IsError() != Importer.ReadError().empty(), "a refused text has a reason" );
  if ( o_rResult.IsOk() )
  {
    const VStoreWriteScope Scope( *pStore );
    o_rResult = Importer.Import( *Scope );
  }
  return pStore;
}

std::string Exported( IStore& io_rStore )
{
  StoreIO::VStoreExporterJson Exporter;
  const VStoreReadScope Scope( io_rStore );
  Require( Exporter.Export( *Scope ) == IResult::Ok, "what was imported can be exported" );
  std::string Text;
  Require( Exporter.WriteText( Text ) == IResult::Ok, "what was imported can be written" );
  return Text;
}

/// Such an entry has the parent and the name of another, and comes back as that.
bool HasLeadingSlash( IStore& io_rStore )
{
  const VStoreReadScope Scope( io_rStore );
  for ( const IStoreReader::Entry pEntry : Scope->Children( io_rStore.GetRootEntry() ) )
  {
    if ( io_rStore.EntryPath( pEntry ).Text().starts_with( '/' ) )
    {
      return true;
    }
  }
  return false;
}
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  const std::string_view Text( reinterpret_cast< const char* >( i_pData ), i_Size );
  IResult Result;
  const auto pStore = Imported( Text, Result );
  std::vector< std::string > Errors;
  const IResult Checked = StoreIO::CheckDocument( Text, Errors );
  Require( Checked.IsError() == Result.IsError(), "the checker finds errors where an import does" );
  Require( ( Checked == IResult::Ok ) == Errors.empty(), "what is not right has a reason" );
  Require( Checked != IResult::Ok || Result == IResult::Ok, "what the checker finds right can be imported" );

  const std::string Once = Exported( *pStore );
  const auto pBack = Imported( Once, Result );
  Require( Result.IsOk(), "what was exported can be imported" );
  Require( HasLeadingSlash( *pStore ) || ( Result == IResult::Ok && Exported( *pBack ) == Once ),
           "a second round trip changes nothing" );
  return 0;
}

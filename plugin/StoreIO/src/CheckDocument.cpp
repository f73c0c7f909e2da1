#include "DocumentWalk.h"
#include "JsonText.h"

#include <StoreIO/CheckDocument.h>
#include <UtilsFileSystem/FileStreams.h>

#include <memory>

namespace StoreIO
{

using namespace ZEK;

namespace
{
IResult CheckRead( IResult i_Read, const VJsonText& i_rText, std::vector< std::string >& o_rErrors )
{
  if ( i_Read.IsError() )
  {
    o_rErrors.assign( 1, i_rText.Error() );
    return i_Read;
  }
  VDocumentWalk Walk( nullptr );
  const IResult Result = Walk.Run( i_rText.Root() );
  o_rErrors = Walk.Errors();
  return Result;
}
} // namespace

IResult CheckDocument( std::string_view i_Text, std::vector< std::string >& o_rErrors )
{
  VJsonText Text;
  return CheckRead( Text.ReadText( i_Text ), Text, o_rErrors );
}

IResult CheckDocumentFile( const std::string& i_rPath, std::vector< std::string >& o_rErrors )
{
  std::unique_ptr< UtilsFileSystem::VFileInputStream > pStream;
  const IResult Opened = UtilsFileSystem::OpenInputFileStream( i_rPath, pStream );
  if ( Opened.IsError() )
  {
    o_rErrors.assign( 1, Opened.Text() );
    return Opened;
  }
  VJsonText Text;
  return CheckRead( Text.ReadStream( *pStream ), Text, o_rErrors );
}

} // namespace StoreIO

#include "DocumentWalk.h"
#include "JsonText.h"
#include "StoreIOLog.h"

#include <StoreIO/StoreJson.h>
#include <UtilsFileSystem/FileStreams.h>
#include <UtilsFileSystem/ProtectedFileIO.h>

namespace StoreIO
{

using namespace ZEK;

struct VStoreImporterJson::VState
{
  VJsonText m_Text;
};

VStoreImporterJson::VStoreImporterJson()
  : m_pState( std::make_unique< VState >() )
{
}
VStoreImporterJson::~VStoreImporterJson() = default;
VStoreImporterJson::VStoreImporterJson( VStoreImporterJson&& ) noexcept = default;
VStoreImporterJson& VStoreImporterJson::operator=( VStoreImporterJson&& ) noexcept = default;

IResult VStoreImporterJson::ReadFile( const std::string& i_rPath )
{
  // For a load that ends before a file is read.
  m_pState->m_Text.Refuse( "The file cannot be read." );
  return UtilsFileSystem::ProtectedLoad(
      [this]( const std::string& i_rFound )
      {
        return ReadPlainFile( i_rFound );
      },
      i_rPath );
}

IResult VStoreImporterJson::ReadPlainFile( const std::string& i_rPath )
{
  std::unique_ptr< UtilsFileSystem::VFileInputStream > pStream;
  const IResult Opened = UtilsFileSystem::OpenInputFileStream( i_rPath, pStream );
  if ( Opened.IsError() )
  {
    m_pState->m_Text.Refuse( Opened.Text() );
    return Opened;
  }
  const IResult Result = ReadStream( *pStream );
  return Result == IResult::FileIOFailure && pStream->Result().IsError() ? pStream->Result() : Result;
}

IResult VStoreImporterJson::ReadStream( std::istream& io_rStream )
{
  return m_pState->m_Text.ReadStream( io_rStream );
}

IResult VStoreImporterJson::ReadText( std::string_view i_Text )
{
  return m_pState->m_Text.ReadText( i_Text );
}

const std::string& VStoreImporterJson::ReadError() const
{
  return m_pState->m_Text.Error();
}

IResult VStoreImporterJson::Import( IStoreWriter& io_rWriter )
{
  VDocumentWalk Walk( &io_rWriter );
  const IResult Result = Walk.Run( m_pState->m_Text.Root() );
  LogFailures( Walk.Errors() );
  return Result;
}

} // namespace StoreIO

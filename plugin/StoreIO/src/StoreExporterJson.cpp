#include "DocumentKeys.h"
#include "JsonText.h"
#include "JsonWriter.h"
#include "StoreFill.h"
#include "StoreIOLog.h"

#include <StoreIO/StoreJson.h>
#include <UtilsFileSystem/FileStreams.h>
#include <UtilsFileSystem/ProtectedFileIO.h>
#include <ZEK/TypedValueText.h>

#include <algorithm>
#include <ostream>
#include <utility>
#include <vector>

namespace StoreIO
{

using namespace ZEK;

namespace
{
bool IsOwn( const rapidjson::Value::Member& i_rMember )
{
  const std::string_view Name = TextOf( i_rMember.name );
  return Name == KeyVersion || Name == KeyChildren;
}

void SetMember( rapidjson::Document& io_rDocument, std::string_view i_Name, rapidjson::Value i_Value )
{
  if ( io_rDocument.HasMember( i_Name.data() ) )
  {
    io_rDocument[i_Name.data()] = std::move( i_Value );
    return;
  }
  const auto Size = static_cast< rapidjson::SizeType >( i_Name.size() );
  io_rDocument.AddMember( rapidjson::StringRef( i_Name.data(), Size ), i_Value, io_rDocument.GetAllocator() );
}
} // namespace

struct VStoreExporterJson::VState
{
  VState()
    : m_pPool( std::make_unique< VJsonPool >( PoolChunkBytes ) )
    , m_Document( m_pPool.get(), ParseStackBytes )
  {
  }

  bool HasOthers() const
  {
    return m_Document.IsObject() && !std::all_of( m_Document.MemberBegin(), m_Document.MemberEnd(), IsOwn );
  }

  /// `i_rChildren` makes the object that becomes the member "Children", or the document itself.
  template < typename TChildren >
  IResult Take( IStoreReader& i_rReader, bool i_bWhole, const TChildren& i_rChildren )
  {
    if ( !m_Document.IsObject() && !m_Document.IsNull() )
    {
      Log( LogCategory(), ELogFailure, "The Json document is not of type Object or Null" );
      return IResult::InvalidArgument;
    }
    // Members that stay lie in the pool.
    const bool bSamePool = i_bWhole && HasOthers();
    auto pPool = bSamePool ? nullptr : std::make_unique< VJsonPool >( PoolChunkBytes );
    VJsonPool& rPool = bSamePool ? *m_pPool : *pPool;
    VStoreFill Fill( i_rReader, rPool );
    rapidjson::Value Children = i_rChildren( Fill );
    if ( !Fill.Errors().empty() )
    {
      LogFailures( Fill.Errors() );
      return IResult::Failed;
    }
    if ( !bSamePool )
    {
      rapidjson::Document Fresh( rapidjson::kObjectType, pPool.get(), ParseStackBytes );
      m_Document.Swap( Fresh );
      m_pPool = std::move( pPool );
      m_Stores.clear();
    }
    if ( i_bWhole )
    {
      const std::string Version = IO::VersionToText( MaximumVersion );
      SetMember( m_Document, KeyVersion,
                 rapidjson::Value( Version.data(), static_cast< rapidjson::SizeType >( Version.size() ), *m_pPool ) );
      SetMember( m_Document, KeyChildren, std::move( Children ) );
    }
    else
    {
      m_Document.rapidjson::Value::Swap( Children );
    }
    if ( m_Stores.empty() || m_Stores.back().get() != i_rReader.GetStore() )
    {
      m_Stores.push_back( i_rReader.GetSharedStore() );
    }
    return IResult::Ok;
  }

  std::vector< std::shared_ptr< IStore > > m_Stores; ///< where the names lie
  std::unique_ptr< VJsonPool > m_pPool;
  rapidjson::Document m_Document;
};

VStoreExporterJson::VStoreExporterJson()
  : m_pState( std::make_unique< VState >() )
{
}
VStoreExporterJson::~VStoreExporterJson() = default;
VStoreExporterJson::VStoreExporterJson( VStoreExporterJson&& ) noexcept = default;
VStoreExporterJson& VStoreExporterJson::operator=( VStoreExporterJson&& ) noexcept = default;

IResult VStoreExporterJson::Export( IStoreReader& i_rReader )
{
  return m_pState->Take( i_rReader, true,
                         [&i_rReader]( VStoreFill& io_rFill )
                         {
                           return io_rFill.Children( i_rReader.GetStore()->GetRootEntry() );
                         } );
}

IResult VStoreExporterJson::ExportSubTree( IStoreReader& i_rReader, ::Store::VStoreEntry* i_pEntry )
{
  return m_pState->Take( i_rReader, false,
                         [i_pEntry]( VStoreFill& io_rFill )
                         {
                           return io_rFill.Children( i_pEntry );
                         } );
}

IResult VStoreExporterJson::ExportBranch( IStoreReader& i_rReader, ::Store::VStoreEntry* i_pEntry )
{
  if ( !i_rReader.Exists( i_pEntry ) )
  {
    return IResult::NotFound;
  }
  return m_pState->Take( i_rReader, true,
                         [i_pEntry]( VStoreFill& io_rFill )
                         {
                           return io_rFill.Branch( i_pEntry );
                         } );
}

rapidjson::Document& VStoreExporterJson::Document()
{
  return m_pState->m_Document;
}

IResult VStoreExporterJson::WriteStream( std::ostream& io_rStream ) const
{
  VJsonSink Sink( io_rStream );
  IResult Result = WriteJson( m_pState->m_Document, Sink );
  if ( Result.IsOk() && !io_rStream )
  {
    Result = IResult::FileIOFailure;
  }
  if ( Result.IsError() )
  {
    Log( LogCategory(), ELogFailure, "Error streaming document : %1%", Result.Text() );
  }
  return Result;
}

IResult VStoreExporterJson::WriteText( std::string& io_rText ) const
{
  VJsonSink Sink( io_rText );
  const IResult Result = WriteJson( m_pState->m_Document, Sink );
  if ( Result.IsError() )
  {
    Log( LogCategory(), ELogFailure, "Error streaming document : %1%", Result.Text() );
  }
  return Result;
}

IResult VStoreExporterJson::WritePlainFile( const std::string& i_rPath ) const
{
  std::unique_ptr< UtilsFileSystem::VFileOutputStream > pStream;
  const IResult Opened = UtilsFileSystem::OpenOutputFileStream( i_rPath, pStream );
  if ( Opened.IsError() )
  {
    return Opened;
  }
  const IResult Written = WriteStream( *pStream );
  // Closing tells what made the stream go bad.
  const IResult Closed = pStream->Close();
  return Closed.IsError() && ( Written.IsOk() || Written == IResult::FileIOFailure ) ? Closed : Written;
}

IResult VStoreExporterJson::WriteFile( const std::string& i_rPath, bool i_bOverwrite ) const
{
  const IResult Result = UtilsFileSystem::ProtectedSave(
      [this]( const std::string& i_rNew )
      {
        return WritePlainFile( i_rNew );
      },
      i_rPath, i_bOverwrite ? 1 : 0 );
  if ( Result.IsError() && ( i_bOverwrite || Result != IResult::AlreadyPresent ) )
  {
    Log( LogCategory(), ELogFailure, "Error writing document %1%: %2%", i_rPath, Result.Text() );
  }
  return Result;
}

} // namespace StoreIO

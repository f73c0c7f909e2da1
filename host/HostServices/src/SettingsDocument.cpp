#include "SettingsDocument.h"

#include <Store/Store.h>
#include <StoreIO/StoreJson.h>
#include <UtilsFileSystem/FileIO.h>
#include <UtilsFileSystem/FileStreams.h>
#include <UtilsFileSystem/ProtectedFileIO.h>
#include <ZEK/StoreFlags.h>

#include <QtCore/QDateTime>

#include <filesystem>

namespace HostServices
{

using ZEK::IResult;
using ZEK::IStoreReader;

namespace
{
/// About the number of settings to come.
constexpr std::size_t StoreBuckets = 1024;
constexpr int MostKept = 1000;

/// Calls the function with every entry that has a value.
template < typename TFunction >
void ForEachValue( const IStoreReader& i_rReader, const TFunction& i_rFunction )
{
  std::vector< IStoreReader::Entry > Left = i_rReader.Children( i_rReader.GetStore()->GetRootEntry() );
  while ( !Left.empty() )
  {
    const IStoreReader::Entry pEntry = Left.back();
    Left.pop_back();
    if ( i_rReader.HasValue( pEntry ) )
    {
      i_rFunction( pEntry );
    }
    const std::vector< IStoreReader::Entry > Children = i_rReader.Children( pEntry );
    Left.insert( Left.end(), Children.begin(), Children.end() );
  }
}

/// In one commit.
IResult ImportPersistent( StoreIO::VStoreImporterJson& io_rImporter, ZEK::IStore& i_rRead, ZEK::IStore& io_rStore )
{
  const ZEK::VStoreWriteScope Scope( io_rStore );
  if ( !Scope )
  {
    return IResult::NotPermitted;
  }
  const IResult Result = io_rImporter.Import( *Scope );
  const ZEK::VStoreReadScope Read( i_rRead );
  ForEachValue( *Read,
                [&]( IStoreReader::Entry i_pEntry )
                {
                  Scope->SetFlag( io_rStore.GetEntry( i_rRead.EntryPath( i_pEntry ) ), ZEK::EPersistent );
                } );
  return Result;
}

IResult WriteText( const std::string& i_rPath, const std::string& i_rText )
{
  std::unique_ptr< UtilsFileSystem::VFileOutputStream > pStream;
  const IResult Opened = UtilsFileSystem::OpenOutputFileStream( i_rPath, pStream );
  if ( Opened.IsError() )
  {
    return Opened;
  }
  pStream->write( i_rText.data(), static_cast< std::streamsize >( i_rText.size() ) );
  return pStream->Close();
}

IResult MoveAside( const std::string& i_rPath, const std::string& i_rKept )
{
  std::unique_ptr< UtilsFileSystem::VSaveLock > pLock;
  const IResult Locked = UtilsFileSystem::VSaveLock::Take( i_rPath, pLock );
  return Locked.IsError() ? Locked : UtilsFileSystem::MoveFile( i_rPath, i_rKept );
}

/// A protected save, so that the copy is on the disk before the first save replaces what it was made of.
IResult CopyAside( const std::string& i_rPath, const std::string& i_rKept )
{
  return UtilsFileSystem::ProtectedSave(
      [&i_rPath]( const std::string& i_rNew )
      {
        return UtilsFileSystem::CopyFile( i_rPath, i_rNew );
      },
      i_rKept, 0 );
}
} // namespace

IResult LoadSettings( const std::string& i_rPath, ZEK::IStore& io_rStore, std::shared_ptr< ZEK::IStore >& o_rpRead,
                      std::string& o_rWhy )
{
  StoreIO::VStoreImporterJson Importer;
  IResult Result = Importer.ReadFile( i_rPath );
  o_rWhy = Importer.ReadError();
  const std::shared_ptr< ZEK::IStore > pRead = ::Store::CreateStore( nullptr, StoreBuckets );
  if ( Result.IsOk() )
  {
    const ZEK::VStoreWriteScope Scope( *pRead );
    Result = Importer.Import( *Scope );
  }
  if ( Result.IsOk() )
  {
    const IResult Imported = ImportPersistent( Importer, *pRead, io_rStore );
    Result = Imported == IResult::Ok ? Result : Imported;
    o_rpRead = pRead;
  }
  o_rWhy = o_rWhy.empty() ? Result.Text() : o_rWhy;
  return Result;
}

bool HoldsAll( ZEK::IStore& i_rRead, ZEK::IStore& i_rStore )
{
  const ZEK::VStoreReadScope Read( i_rRead );
  const ZEK::VStoreReadScope Scope( i_rStore );
  bool bAll = true;
  ForEachValue( *Read,
                [&]( IStoreReader::Entry i_pEntry )
                {
                  const auto pOther = i_rStore.FindEntry( i_rRead.EntryPath( i_pEntry ) );
                  bAll = bAll && Scope->VerifiedValue( pOther ) == Read->VerifiedValue( i_pEntry ) &&
                         Scope->ProposedValue( pOther ) == Read->ProposedValue( i_pEntry );
                } );
  return bAll;
}

IResult SettingsText( ZEK::IStore& i_rStore, std::string& o_rText )
{
  const std::shared_ptr< ZEK::IStore > pCopy = ::Store::CreateStore( nullptr, StoreBuckets );
  IResult Result;
  {
    const ZEK::VStoreWriteScope Writer( *pCopy );
    const ZEK::VStoreReadScope Reader( i_rStore );
    Result = ::Store::CopyEntries( *Reader, *Writer, true );
  }
  StoreIO::VStoreExporterJson Exporter;
  if ( Result.IsOk() )
  {
    const ZEK::VStoreReadScope Reader( *pCopy );
    Result = Exporter.Export( *Reader );
  }
  o_rText.clear();
  return Result.IsOk() ? Exporter.WriteText( o_rText ) : Result;
}

IResult SaveSettingsText( const std::string& i_rPath, const std::string& i_rText )
{
  std::error_code Ignored;
  std::filesystem::create_directories( std::filesystem::path( i_rPath ).parent_path(), Ignored );
  return UtilsFileSystem::ProtectedSave(
      [&i_rText]( const std::string& i_rNew )
      {
        return WriteText( i_rNew, i_rText );
      },
      i_rPath, 1 );
}

IResult KeepAside( const std::string& i_rPath, bool i_bCopy, std::string& o_rKept )
{
  // Of a link it is the file behind it that is kept, beside itself.
  std::error_code Error;
  const std::filesystem::path File = std::filesystem::canonical( i_rPath, Error );
  if ( Error || !std::filesystem::is_regular_file( File, Error ) )
  {
    return IResult::NotPermitted;
  }
  std::string Stem = ( File.parent_path() / File.stem() ).string();
  Stem.append( QDateTime::currentDateTime().toString( QStringLiteral( "'.kept-'yyyyMMdd-HHmmss" ) ).toStdString() );
  IResult Result = IResult::AlreadyPresent;
  for ( int Number = 1; Result == IResult::AlreadyPresent && Number < MostKept; ++Number )
  {
    o_rKept = Stem;
    o_rKept.append( Number > 1 ? std::string( "-" ).append( std::to_string( Number ) ) : std::string() );
    o_rKept.append( File.extension().string() );
    Result = i_bCopy ? CopyAside( File.string(), o_rKept ) : MoveAside( File.string(), o_rKept );
  }
  return Result;
}

} // namespace HostServices

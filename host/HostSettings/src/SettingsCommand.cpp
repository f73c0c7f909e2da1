#include "SettingsValue.h"

#include <HostSettings/SettingsCommand.h>

#include <Store/Store.h>
#include <StoreIO/CheckDocument.h>
#include <StoreIO/StoreJson.h>
#include <UtilsFileSystem/ProtectedFileIO.h>
#include <ZEK/Store.h>
#include <ZEK/TypedValueText.h>

#include <memory>
#include <utility>

namespace HostSettings
{

using namespace ZEK;

namespace
{
using Entry = IStoreReader::Entry;

std::shared_ptr< IStore > MakeStore()
{
  return Store::CreateStore( nullptr, 4096 );
}

IResult ImportInto( StoreIO::VStoreImporterJson& io_rImporter, IStore& io_rStore )
{
  const VStoreWriteScope Scope( io_rStore );
  return io_rImporter.Import( *Scope );
}

/// The settings file as a store, and back. With a lock nobody else saves the file in between.
class VStoredSettings
{
public:
  explicit VStoredSettings( std::string i_Path )
    : m_Path( std::move( i_Path ) )
  {
  }

  IStore& Store() const { return *m_pStore; }

  IResult Load( std::vector< std::string >& o_rErrors )
  {
    StoreIO::VStoreImporterJson Importer;
    const auto Read = [&Importer]( const std::string& i_rFound )
    {
      return Importer.ReadPlainFile( i_rFound );
    };
    IResult Result = m_pLock ? UtilsFileSystem::ProtectedLoad( Read, m_Path, *m_pLock )
                             : UtilsFileSystem::ProtectedLoad( Read, m_Path );
    if ( Result.IsError() )
    {
      if ( !m_pLock || Result != IResult::FileNotFound )
      {
        o_rErrors.push_back( m_Path + ": " + ( Importer.ReadError().empty() ? Result.Text() : Importer.ReadError() ) );
      }
      return Result;
    }
    Result = ImportInto( Importer, *m_pStore );
    if ( Result == IResult::OkButPartial )
    {
      // Saved again, what the file says twice with different types would be lost.
      Result = m_pLock ? IResult::Conflict : IResult::Ok;
      o_rErrors.push_back( m_Path + ": some entries are given twice with different types" );
    }
    return Result;
  }
  /// To change it: no file is an empty one.
  IResult LoadLocked( std::vector< std::string >& o_rErrors )
  {
    const IResult Locked = UtilsFileSystem::VSaveLock::Take( m_Path, m_pLock );
    if ( Locked.IsError() )
    {
      return Locked;
    }
    const IResult Result = Load( o_rErrors );
    return Result == IResult::FileNotFound ? IResult( IResult::Ok ) : Result;
  }
  IResult Save() const
  {
    StoreIO::VStoreExporterJson Exporter;
    {
      const VStoreReadScope Scope( *m_pStore );
      const IResult Exported = Exporter.Export( *Scope );
      if ( Exported.IsError() )
      {
        return Exported;
      }
    }
    return UtilsFileSystem::ProtectedSave(
        [&Exporter]( const std::string& i_rNew )
        {
          return Exporter.WritePlainFile( i_rNew );
        },
        m_Path, 1, *m_pLock );
  }

private:
  std::string m_Path;
  std::shared_ptr< IStore > m_pStore = MakeStore();
  std::unique_ptr< UtilsFileSystem::VSaveLock > m_pLock;
};

IResult Import( const VSettingsCommand& i_rCommand, VSettingsOutcome& o_rOutcome )
{
  StoreIO::VStoreImporterJson Importer;
  IResult Result = Importer.ReadPlainFile( i_rCommand.m_File );
  if ( Result.IsError() )
  {
    o_rOutcome.m_Errors.push_back( i_rCommand.m_File + ": " + Importer.ReadError() );
    return Result;
  }
  // A first run shows whether all of it is good.
  Result = ImportInto( Importer, *MakeStore() );
  VStoredSettings File( i_rCommand.m_Store );
  if ( Result.IsOk() )
  {
    Result = File.LoadLocked( o_rOutcome.m_Errors );
  }
  if ( Result.IsError() )
  {
    return Result;
  }
  Result = ImportInto( Importer, File.Store() );
  const IResult Saved = Result.IsOk() ? File.Save() : Result;
  return Saved == IResult::Ok ? Result : Saved;
}

IResult Export( const VSettingsCommand& i_rCommand, VSettingsOutcome& o_rOutcome )
{
  VStoredSettings File( i_rCommand.m_Store );
  IResult Result = File.Load( o_rOutcome.m_Errors );
  StoreIO::VStoreExporterJson Exporter;
  if ( Result.IsOk() )
  {
    const VStoreReadScope Scope( File.Store() );
    Result = i_rCommand.m_Path.empty() ? Exporter.Export( *Scope )
                                       : Exporter.ExportBranch( *Scope, File.Store().FindEntry( i_rCommand.m_Path ) );
  }
  return Result.IsOk() ? Exporter.WriteFile( i_rCommand.m_File, true ) : Result;
}

/// The value that a program that reads settings would see, or else the one that waits.
const VTypedValue& ValueOf( const IStoreReader& i_rReader, Entry i_pEntry )
{
  const VTypedValue& rVerified = i_rReader.VerifiedValue( i_pEntry );
  return rVerified.IsEmpty() ? i_rReader.ProposedValue( i_pEntry ) : rVerified;
}

IResult Get( const VSettingsCommand& i_rCommand, VSettingsOutcome& o_rOutcome )
{
  VStoredSettings File( i_rCommand.m_Store );
  const IResult Loaded = File.Load( o_rOutcome.m_Errors );
  if ( Loaded.IsError() )
  {
    return Loaded;
  }
  const VStoreReadScope Scope( File.Store() );
  const Entry pEntry = File.Store().FindEntry( i_rCommand.m_Path );
  if ( !Scope->Exists( pEntry ) )
  {
    return IResult::NotFound;
  }
  if ( !BareText( ValueOf( *Scope, pEntry ), o_rOutcome.m_Output ) )
  {
    return IResult::NotSet;
  }
  o_rOutcome.m_Output += '\n';
  return IResult::Ok;
}

IResult List( const VSettingsCommand& i_rCommand, VSettingsOutcome& o_rOutcome )
{
  VStoredSettings File( i_rCommand.m_Store );
  const IResult Loaded = File.Load( o_rOutcome.m_Errors );
  if ( Loaded.IsError() )
  {
    return Loaded;
  }
  const VStoreReadScope Scope( File.Store() );
  const Entry pTop = File.Store().FindEntry( i_rCommand.m_Path );
  if ( !i_rCommand.m_Path.empty() && !Scope->Exists( pTop ) )
  {
    return IResult::NotFound;
  }
  std::string Text;
  std::vector< Entry > Left{ pTop };
  while ( !Left.empty() )
  {
    const Entry pEntry = Left.back();
    Left.pop_back();
    if ( IO::ValueToText( ValueOf( *Scope, pEntry ), Text ) )
    {
      o_rOutcome.m_Output.append( File.Store().EntryPath( pEntry ).Text() )
          .append( "\t" )
          .append( Text )
          .append( "\n" );
    }
    const std::vector< Entry > Children = Scope->Children( pEntry );
    Left.insert( Left.end(), Children.rbegin(), Children.rend() );
  }
  return IResult::Ok;
}

IResult SetValue( const VSettingsCommand& i_rCommand, IStore& io_rStore, VSettingsOutcome& o_rOutcome )
{
  const VStoreWriteScope Scope( io_rStore );
  const Entry pEntry = io_rStore.GetEntry( i_rCommand.m_Path );
  const IO::ISchema* pSchema = Scope->Schema( pEntry );
  if ( i_rCommand.m_Type )
  {
    pSchema = SchemaByName( *i_rCommand.m_Type );
  }
  else if ( pSchema->m_Type == IO::EType::Void )
  {
    pSchema = SchemaByForm( i_rCommand.m_Value );
  }
  if ( pSchema == nullptr )
  {
    o_rOutcome.m_Errors.push_back( "\"" + *i_rCommand.m_Type + "\" is no type" );
    return IResult::InvalidArgument;
  }
  VTypedValue Value;
  std::string Error;
  if ( !FromBareText( pSchema, i_rCommand.m_Value, Value, Error ) )
  {
    o_rOutcome.m_Errors.push_back( "\"" + i_rCommand.m_Value + "\" is no " + IO::TypeName( pSchema->m_Type ) + ": " +
                                   Error );
    return IResult::InvalidValue;
  }
  return Scope->SetValue( pEntry, std::move( Value ) );
}

IResult Set( const VSettingsCommand& i_rCommand, VSettingsOutcome& o_rOutcome )
{
  if ( i_rCommand.m_Path.empty() || i_rCommand.m_Path.front() == '/' )
  {
    return IResult::InvalidName;
  }
  VStoredSettings File( i_rCommand.m_Store );
  IResult Result = File.LoadLocked( o_rOutcome.m_Errors );
  if ( Result.IsOk() )
  {
    Result = SetValue( i_rCommand, File.Store(), o_rOutcome );
  }
  return Result.IsOk() ? File.Save() : Result;
}

IResult Run( const VSettingsCommand& i_rCommand, VSettingsOutcome& o_rOutcome )
{
  switch ( i_rCommand.m_Action )
  {
  case ESettingsAction::Import:
    return Import( i_rCommand, o_rOutcome );
  case ESettingsAction::Export:
    return Export( i_rCommand, o_rOutcome );
  case ESettingsAction::Get:
    return Get( i_rCommand, o_rOutcome );
  case ESettingsAction::Set:
    return Set( i_rCommand, o_rOutcome );
  case ESettingsAction::List:
    return List( i_rCommand, o_rOutcome );
  default:
    return StoreIO::CheckDocumentFile( i_rCommand.m_File, o_rOutcome.m_Errors );
  }
}
} // namespace

VSettingsOutcome RunSettings( const VSettingsCommand& i_rCommand )
{
  VSettingsOutcome Outcome;
  Outcome.m_Result = Run( i_rCommand, Outcome );
  const bool bTells = i_rCommand.m_Action == ESettingsAction::Get || i_rCommand.m_Action == ESettingsAction::List;
  if ( Outcome.m_Result.IsError() )
  {
    Outcome.m_Output.clear();
    Outcome.m_Errors.push_back( Outcome.m_Result.Text() );
  }
  else if ( !bTells )
  {
    Outcome.m_Output = Outcome.m_Result.Text() + "\n";
  }
  return Outcome;
}

} // namespace HostSettings

#include <HostServices/VPreferenceEditor.h>

#include <HostServices/PreferenceRules.h>

#include <ZEK/Log.h>
#include <ZEK/StoreFlags.h>

#include <QtCore/QCoreApplication>

namespace HostServices
{
namespace
{
using ZEK::IStoreReader;
using ZEK::VTypedValue;

QString Tr( const char* i_pText )
{
  return QCoreApplication::translate( "HostServices::VPreferenceEditor", i_pText );
}

/// What a step brings back.
struct VSetting
{
  VTypedValue Value;
  bool bDefault = false;
};

ZEK::IResult ApplyInScope( ZEK::IStore& io_rStore, IStoreReader::Entry i_pEntry, const VSetting& i_rSetting )
{
  const ZEK::VStoreWriteScope Scope( io_rStore );
  if ( !Scope )
  {
    return ZEK::IResult::NotPermitted;
  }
  // A write would make the entry anew, without what describes it; and the log need not say what a person is told.
  if ( !Scope->Exists( i_pEntry ) )
  {
    return ZEK::IResult::NotFound;
  }
  if ( Scope->Schema( i_pEntry ) != i_rSetting.Value.Schema() )
  {
    return ZEK::IResult::InvalidType;
  }
  const ZEK::IResult Result = Scope->SetValue( i_pEntry, i_rSetting.Value );
  if ( Result.IsOk() && i_rSetting.bDefault )
  {
    Scope->SetFlag( i_pEntry, ZEK::EUsingDefault );
  }
  return Result;
}

/// What a callback throws at the end of the scope must not reach the event loop; the change is made all the same.
ZEK::IResult Apply( ZEK::IStore& io_rStore, IStoreReader::Entry i_pEntry, const VSetting& i_rSetting )
{
  try
  {
    return ApplyInScope( io_rStore, i_pEntry, i_rSetting );
  }
  catch ( const std::exception& rError )
  {
    static const ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Preferences" );
    ZEK::Log( rCategory, ZEK::ELogFailure, "A change of %1% is made, but who was told of it failed: %2%",
              io_rStore.EntryPath( i_pEntry ).Text(), rError.what() );
    return ZEK::IResult::OkButPartial;
  }
}

QString StepText( const IStoreReader& i_rReader, IStoreReader::Entry i_pEntry )
{
  const std::string& rText = i_rReader.PresentationText( i_pEntry );
  const QString Text =
      QString::fromStdString( rText.empty() ? i_rReader.GetStore()->EntryPath( i_pEntry ).Leaf() : rText );
  return ( i_rReader.ExtraText2( i_pEntry ) == FolderKind ? Tr( "Change %1 folder" ) : Tr( "Change %1" ) ).arg( Text );
}
} // namespace

VPreferenceEditor::VPreferenceEditor( std::shared_ptr< ZEK::IStore > i_pStore, VUndoStack& io_rUndo )
  : m_pStore( std::move( i_pStore ) )
  , m_rUndo( io_rUndo )
  , m_pFailed( std::make_shared< ZEK::VMultiCallback< void( QString ) > >() )
{
}

ZEK::IResult VPreferenceEditor::Set( IStoreReader::Entry i_pEntry, VTypedValue i_Value, QString& o_rWhy,
                                     const QString& i_rMergeKey )
{
  VSetting Before;
  VSetting After{ std::move( i_Value ), false };
  QString Text;
  {
    const ZEK::VStoreReadScope Scope( *m_pStore );
    o_rWhy = WhyRefused( *Scope, i_pEntry, After.Value );
    if ( !o_rWhy.isEmpty() )
    {
      return !Scope->Exists( i_pEntry )                          ? ZEK::IResult::NotFound
             : After.Value.Schema() != Scope->Schema( i_pEntry ) ? ZEK::IResult::InvalidType
                                                                 : ZEK::IResult::InvalidValue;
    }
    Before = { EditedValue( *Scope, i_pEntry ), ( Scope->Flags( i_pEntry ) & ZEK::EUsingDefault ) != 0 };
    After.bDefault = After.Value == Scope->DefaultValue( i_pEntry );
    Text = StepText( *Scope, i_pEntry );
  }
  if ( After.Value == Before.Value )
  {
    return ZEK::IResult::OkButNoEffect;
  }
  const ZEK::IResult Result = Apply( *m_pStore, i_pEntry, After );
  if ( Result.IsError() )
  {
    o_rWhy = QString::fromStdString( Result.Text() );
    return Result;
  }
  const auto Step = [pStore = m_pStore, pFailed = m_pFailed, i_pEntry, Text]( const VSetting& i_rSetting )
  {
    return [=]
    {
      const ZEK::IResult Applied = Apply( *pStore, i_pEntry, i_rSetting );
      if ( Applied.IsError() )
      {
        pFailed->Fire(
            Tr( "“%1” cannot be undone or redone: %2" ).arg( Text, QString::fromStdString( Applied.Text() ) ) );
      }
    };
  };
  // The stack makes the change once more, which changes nothing.
  m_rUndo.Push( Text, Step( After ), Step( Before ), i_rMergeKey );
  return Result;
}

ZEK::IResult VPreferenceEditor::Reset( IStoreReader::Entry i_pEntry, QString& o_rWhy )
{
  VTypedValue Default;
  {
    const ZEK::VStoreReadScope Scope( *m_pStore );
    Default = Scope->DefaultValue( i_pEntry );
  }
  if ( Default.IsEmpty() )
  {
    o_rWhy = Tr( "This setting has no default." );
    return ZEK::IResult::NotSet;
  }
  return Set( i_pEntry, std::move( Default ), o_rWhy );
}

} // namespace HostServices

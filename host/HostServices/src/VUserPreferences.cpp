#include <HostServices/VUserPreferences.h>

#include <HostServices/PreferenceRules.h>

#include <ZEK/CoreUserPreferences.h>
#include <ZEK/Log.h>
#include <ZEK/StoreFlags.h>

#include <string_view>

namespace HostServices
{
namespace
{
using ZEK::IStoreReader;
using ZEK::IStoreWriter;
using ZEK::VTypedValue;
using ZEK::IO::MakeValue;

struct VChoice
{
  VTypedValue Value;
  const char* pText = "";
};

/// What people see of an entry.
struct VPresentation
{
  const char* pName = "";
  const char* pText = "";
  const char* pToolTip = "";
  const char* pUnit = "";
  VTypedValue Minimum = {};
  VTypedValue Maximum = {};
  std::uint32_t Step = 0;
  std::vector< VChoice > Choices = {};
};

std::vector< VChoice > FreeSpaceChoices()
{
  return { { MakeValue( std::uint32_t( 0 ) ), "Never" },          { MakeValue( std::uint32_t( 1 ) ), "Below 1 GiB" },
           { MakeValue( std::uint32_t( 5 ) ), "Below 5 GiB" },    { MakeValue( std::uint32_t( 10 ) ), "Below 10 GiB" },
           { MakeValue( std::uint32_t( 20 ) ), "Below 20 GiB" },  { MakeValue( std::uint32_t( 50 ) ), "Below 50 GiB" },
           { MakeValue( std::uint32_t( 100 ) ), "Below 100 GiB" } };
}

/// In the order in which people read them.
const std::vector< VPresentation >& CorePresentations()
{
  static const std::vector< VPresentation > Presentations{
      { "AltToSelect", "Alt to select",
        "On: dragging navigates, and dragging with Alt selects. Off: dragging selects, and dragging with Alt "
        "navigates." },
      { "EnableAutoContextSwitch", "Show a recording when it is opened",
        "On: the views turn from the live capture to a recording as soon as it has been read. Off: they stay live "
        "until "
        "the recording is asked for." },
      { "StartPlayingAutomatically", "Play a recording when it is shown",
        "On: a recording that is opened begins to play. Off: it stands at its first frame." },
      { "AutoSaveEnabled", "Automatic saving", "Unsaved work is kept from time to time, so that it can be recovered." },
      { "AutoSaveIntervalSeconds", "Automatic saving interval", "The time between two automatic savings.", "s",
        MakeValue( std::uint32_t( 10 ) ), MakeValue( std::uint32_t( 3600 ) ), 10 },
      { "AutoSaveAskBeforeRecovery", "Ask before recovery",
        "On: work that was kept by automatic saving is recovered only after a question. Off: it is recovered at "
        "once." },
      { "WarnFreeSpaceOptical",
        "Free disk space warning",
        "When less than this is left on the disk that takes captures of the optical system, a warning says so.",
        "GiB",
        {},
        {},
        0,
        FreeSpaceChoices() } };
  return Presentations;
}

const std::vector< VPresentation >& FolderPresentations()
{
  static const std::vector< VPresentation > Presentations{
      { "FolderSubjects", "Subjects", "Where subjects are looked for." },
      { "FolderSubjectCalTemplates", "Subject calibration templates", "Where templates for calibrating subjects lie." },
      { "FolderSkins", "Skins", "Where the skin meshes of subjects are looked for first." },
      { "FolderRetargets", "Retargets", "Where retargeting set-ups lie." },
      { "FolderRemarkableActions", "Remarkable actions", "Where descriptions of remarkable actions lie." },
      { "FolderProps", "Props", "Where props are looked for." },
      { "FolderClusters", "Clusters", "Where marker clusters are looked for." },
      { "FolderObjects", "Objects", "Where objects are looked for." },
      { "FolderSmartObjectTemplates", "Smart object templates", "Where templates of smart objects lie." },
      { "FolderPropMeshes", "Prop meshes", "Where the meshes of props are looked for first." },
      { "FolderCalibrationObjects", "Calibration objects", "Where descriptions of calibration objects lie." },
      { "FolderSceneMeshes", "Scene meshes", "Where the meshes of the scene are looked for first." },
      { "FolderTensorEngines", "Tensor engines", "Where engines for neural networks lie." } };
  return Presentations;
}

ZEK::VLogCategory& Category()
{
  static ZEK::VLogCategory& rCategory = ZEK::GlobalLog().Category( "Preferences" );
  return rCategory;
}

/// Takes out what stands in the way of the declared type.
void MakeRoom( IStoreWriter& io_rWriter, IStoreReader::Entry i_pEntry, const ZEK::VPreferenceDeclaration& i_rDeclared )
{
  const ZEK::IO::ISchema* const pSchema = io_rWriter.Schema( i_pEntry );
  if ( pSchema->m_Type != ZEK::IO::EType::Void && pSchema != i_rDeclared.m_Default.Schema() )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "Preference %1% is of type %2% instead of %3%; its default holds",
              i_rDeclared.m_Path.Text(), ZEK::IO::TypeName( pSchema->m_Type ),
              ZEK::IO::TypeName( i_rDeclared.m_Default.Schema()->m_Type ) );
    (void)io_rWriter.RemoveEntry( i_pEntry );
  }
}

ZEK::IResult Declare( IStoreWriter& io_rWriter, const ZEK::VPreferenceDeclaration& i_rDeclared )
{
  const IStoreReader::Entry pEntry = io_rWriter.GetStore()->GetEntry( i_rDeclared.m_Path );
  MakeRoom( io_rWriter, pEntry, i_rDeclared );
  const bool bDefault = ( io_rWriter.Flags( pEntry ) & ZEK::EUsingDefault ) != 0;
  const ZEK::IResult Result = io_rWriter.SetDefaultValue( pEntry, i_rDeclared.m_Default );
  // A default that was kept from an earlier run and is another one today would make the value count as set.
  io_rWriter.SetFlag( pEntry, ZEK::EPersistent );
  if ( bDefault )
  {
    io_rWriter.SetFlag( pEntry, ZEK::EUsingDefault );
  }
  return Result;
}

void Present( IStoreWriter& io_rWriter, IStoreReader::Entry i_pEntry, const VPresentation& i_rShown,
              std::uint32_t i_Place )
{
  io_rWriter.SetPresentationText( i_pEntry, i_rShown.pText );
  io_rWriter.SetOptionalText( i_pEntry, i_rShown.pToolTip );
  io_rWriter.SetExtraText1( i_pEntry, i_rShown.pUnit );
  io_rWriter.SetExtraNumber1( i_pEntry, i_Place );
  io_rWriter.SetExtraNumber2( i_pEntry, i_rShown.Step );
  (void)io_rWriter.SetMinimum( i_pEntry, i_rShown.Minimum );
  (void)io_rWriter.SetMaximum( i_pEntry, i_rShown.Maximum );
  (void)io_rWriter.ClearValueChoices( i_pEntry );
  for ( const VChoice& rChoice : i_rShown.Choices )
  {
    (void)io_rWriter.AddValueChoice( i_pEntry, rChoice.Value, rChoice.pText, {} );
  }
}

void PresentAll( IStoreWriter& io_rWriter, const ZEK::VEntryPath& i_rParent,
                 const std::vector< VPresentation >& i_rShown, const char* i_pKind )
{
  std::uint32_t Place = 0;
  for ( const VPresentation& rShown : i_rShown )
  {
    ZEK::VEntryPath Path;
    Path.AssignChild( i_rParent, rShown.pName );
    const IStoreReader::Entry pEntry = io_rWriter.GetStore()->GetEntry( Path );
    Present( io_rWriter, pEntry, rShown, ++Place );
    io_rWriter.SetExtraText2( pEntry, i_pKind );
  }
}

/// After the ranges are known. A choice is an offer: a number between two of them was set by hand and is kept.
void DropRefused( IStoreWriter& io_rWriter, const ZEK::VPreferenceDeclaration& i_rDeclared )
{
  const IStoreReader::Entry pEntry = io_rWriter.GetStore()->GetEntry( i_rDeclared.m_Path );
  const VTypedValue Value = EditedValue( io_rWriter, pEntry );
  const QString Why = io_rWriter.ChoiceCount( pEntry ) == 0 ? WhyRefused( io_rWriter, pEntry, Value ) : QString();
  if ( !Why.isEmpty() )
  {
    ZEK::Log( Category(), ZEK::ELogWarning, "Preference %1%: %2% Its default holds", i_rDeclared.m_Path.Text(),
              Why.toStdString() );
    (void)io_rWriter.SetValue( pEntry, i_rDeclared.m_Default );
    io_rWriter.SetFlag( pEntry, ZEK::EUsingDefault );
  }
}
} // namespace

ZEK::IResult DeclareUserPreferences( ZEK::IStore& io_rStore )
{
  const ZEK::VStoreWriteScope Scope( io_rStore );
  if ( !Scope )
  {
    return ZEK::IResult::NotPermitted;
  }
  ZEK::IResult Result = ZEK::IResult::Ok;
  for ( const ZEK::VPreferenceDeclaration& rDeclared : ZEK::CoreUserPreferences() )
  {
    const ZEK::IResult Declared = Declare( *Scope, rDeclared );
    Result = Result.IsError() ? Result : Declared;
  }
  const ZEK::VEntryPath Core = std::string( PreferencesRoot ).append( "/Core" );
  const ZEK::VEntryPath Folders = Core.Text() + "/Folders";
  Present( *Scope, io_rStore.GetEntry( Core ), { "", "General" }, 1 );
  Present( *Scope, io_rStore.GetEntry( Folders ), { "", "Folders", "An empty folder is the program's own." }, 2 );
  PresentAll( *Scope, Core, CorePresentations(), "" );
  PresentAll( *Scope, Folders, FolderPresentations(), FolderKind );
  for ( const ZEK::VPreferenceDeclaration& rDeclared : ZEK::CoreUserPreferences() )
  {
    DropRefused( *Scope, rDeclared );
  }
  return Result;
}

} // namespace HostServices

#include <HostSettings/SettingsCommand.h>
#include <HostSettings/SettingsLine.h>

#include <ZEK/Log.h>

#include <CLI/CLI.hpp>

#include <algorithm>
#include <filesystem>
#include <memory>
#include <ostream>
#include <sstream>
#include <string_view>
#include <utility>

namespace HostSettings
{
namespace
{
enum EExit : int
{
  EExitOk = 0,
  EExitUsage = 2,
  EExitFailure = 5
};

/// Stands in the line for a value that may look like an option.
constexpr const char* pHidden = "VALUE";

/// Takes the value of `set` out of the line: the second argument behind it that is no option of this command.
std::optional< std::string > HideValue( std::vector< std::string >& io_rArguments )
{
  auto It = std::find( io_rArguments.begin(), io_rArguments.end(), "set" );
  bool bPath = false;
  while ( It != io_rArguments.end() && ++It != io_rArguments.end() )
  {
    const std::string_view Argument = *It;
    if ( Argument == "--store" || Argument == "--type" )
    {
      It += It + 1 != io_rArguments.end() ? 1 : 0;
    }
    else if ( Argument.starts_with( "--store=" ) || Argument.starts_with( "--type=" ) || Argument == "--help" ||
              Argument == "-h" || Argument == "--" )
    {
      continue;
    }
    else if ( std::exchange( bPath, true ) )
    {
      return std::exchange( *It, pHidden );
    }
  }
  return {};
}

struct VLine
{
  VLine( CLI::App& io_rApp, VSettingsCommand& o_rCommand )
    : m_rCommand( o_rCommand )
  {
    io_rApp.require_subcommand( 1 );
    io_rApp.add_option( "--store", m_rCommand.m_Store, "The settings file to act on; else the user's" )
        ->type_name( "FILE" );
    CLI::App& rImport = Add( io_rApp, ESettingsAction::Import, "import", "Add and replace what a document names" );
    rImport.add_option( "file", m_rCommand.m_File, "The document" )->required();
    CLI::App& rExport = Add( io_rApp, ESettingsAction::Export, "export", "Write all settings to a document" );
    rExport.add_option( "file", m_rCommand.m_File, "The document; one that is there is replaced" )->required();
    rExport.add_option( "--path", m_rCommand.m_Path, "Only this entry and all below it" )->type_name( "PATH" );
    CLI::App& rGet = Add( io_rApp, ESettingsAction::Get, "get", "Print the value of an entry" );
    rGet.add_option( "path", m_rCommand.m_Path, "The entry" )->required();
    CLI::App& rSet = Add( io_rApp, ESettingsAction::Set, "set", "Set the value of an entry" );
    rSet.add_option( "path", m_rCommand.m_Path, "The entry" )->required();
    rSet.add_option( "value", m_rCommand.m_Value, "The value, as it stands" )->required();
    rSet.add_option(
            "--type", m_rCommand.m_Type,
            "A type such as UInt8, or a schema as JSON; else the entry's own, or one by the form of the value" )
        ->type_name( "TYPE" );
    CLI::App& rList = Add( io_rApp, ESettingsAction::List, "list", "Print entries and their values" );
    rList.add_option( "path", m_rCommand.m_Path, "Only this entry and all below it" );
    CLI::App& rCheck = Add( io_rApp, ESettingsAction::Check, "check", "Tell every fault of a document" );
    rCheck.add_option( "file", m_rCommand.m_File, "The document" )->required();
  }

  CLI::App& Add( CLI::App& io_rApp, ESettingsAction i_Action, const char* i_pName, const char* i_pHelp )
  {
    CLI::App& rAction = *io_rApp.add_subcommand( i_pName, i_pHelp );
    rAction.fallthrough();
    rAction.callback(
        [this, i_Action]
        {
          m_rCommand.m_Action = i_Action;
        } );
    return rAction;
  }

  VSettingsCommand& m_rCommand;
};

/// The log on stderr while the object lives.
class VLogToErrors
{
public:
  VLogToErrors() { ZEK::GlobalLog().AddSink( m_pSink ); }
  ~VLogToErrors() { ZEK::GlobalLog().RemoveSink( m_pSink ); }

private:
  std::shared_ptr< ZEK::ILogSink > m_pSink = std::make_shared< ZEK::VLogStderr >();
};

void TellError( std::ostream& o_rErrors, std::string i_Text )
{
  std::replace( i_Text.begin(), i_Text.end(), '\n', ' ' );
  o_rErrors << "harrow: " << i_Text << '\n';
}
} // namespace

int RunSettingsLine( const std::vector< std::string >& i_rArguments, const std::string& i_rDefaultStore,
                     std::ostream& o_rOutput, std::ostream& o_rErrors )
{
  CLI::App App( "Reads and changes settings while no window needs to be open.", "harrow settings" );
  VSettingsCommand Command;
  const VLine Line( App, Command );
  std::vector< std::string > Arguments = i_rArguments;
  const std::optional< std::string > Value = HideValue( Arguments );
  std::reverse( Arguments.begin(), Arguments.end() );
  try
  {
    App.parse( Arguments );
  }
  catch ( const CLI::ParseError& rError )
  {
    std::ostringstream Errors;
    const bool bGood = App.exit( rError, o_rOutput, Errors ) == 0;
    if ( !bGood )
    {
      TellError( o_rErrors, rError.what() );
    }
    return bGood ? EExitOk : EExitUsage;
  }
  Command.m_Value = Value.value_or( Command.m_Value );
  if ( Command.m_Store.empty() )
  {
    Command.m_Store = i_rDefaultStore;
    if ( Command.m_Action == ESettingsAction::Set || Command.m_Action == ESettingsAction::Import )
    {
      std::error_code Ignored;
      std::filesystem::create_directories( std::filesystem::path( i_rDefaultStore ).parent_path(), Ignored );
    }
  }
  const VLogToErrors LogToErrors;
  const VSettingsOutcome Outcome = RunSettings( Command );
  o_rOutput << Outcome.m_Output << std::flush;
  for ( const std::string& rError : Outcome.m_Errors )
  {
    TellError( o_rErrors, rError );
  }
  return Outcome.m_Result.IsOk() ? EExitOk : EExitFailure;
}

} // namespace HostSettings

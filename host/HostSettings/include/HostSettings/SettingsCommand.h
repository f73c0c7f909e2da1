#pragma once

#include <ZEK/Result.h>

#include <optional>
#include <string>
#include <vector>

namespace HostSettings
{

enum class ESettingsAction
{
  Import, ///< add and replace what a document names, all or nothing
  Export, ///< write a document, of all or of one branch
  Get,
  Set,
  List,
  Check ///< tell every fault of a document
};

struct VSettingsCommand
{
  ESettingsAction m_Action = ESettingsAction::List;
  std::string m_Store;                 ///< the settings file to act on
  std::string m_File;                  ///< Import, Export, Check
  std::string m_Path;                  ///< Get, Set; List and Export: empty for all
  std::string m_Value;                 ///< Set: as it stands
  std::optional< std::string > m_Type; ///< Set: a type's name or a schema's JSON; else the entry's own, or by the form
};

struct VSettingsOutcome
{
  ZEK::IResult m_Result;
  std::string m_Output;                ///< for stdout, lines ended
  std::vector< std::string > m_Errors; ///< for stderr, a line each
};

/// Acts on a settings file while no program needs to run. What goes wrong in a document is in the log, save for Check,
/// which tells all by itself.
///
/// Set and Import hold the right to save the file from reading it on, and leave it alone after a failure; one that
/// cannot be read whole is never written over. `NotFound` for a path that is not there, `NotSet` for an entry without
/// a value, `FileNotFound` when there is no settings file and the action needs one, `InvalidValue` for a text that is
/// no value of the type, `InvalidType` for another type than the entry has, `InvalidName` for a path that is empty or
/// begins with a '/', which no document can carry.
VSettingsOutcome RunSettings( const VSettingsCommand& i_rCommand );

} // namespace HostSettings

#pragma once

#include <ZEK/Export.h>
#include <ZEK/Preference.h>

#include <array>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <string>
#include <tuple>
#include <vector>

namespace ZEK
{

/// The folders an operator may choose, in the order of their entries.
enum class ECoreFolder : std::uint8_t
{
  Subjects,
  SubjectCalTemplates,
  Skins,
  Retargets,
  RemarkableActions,
  Props,
  Clusters,
  Objects,
  SmartObjectTemplates,
  PropMeshes,
  CalibrationObjects,
  SceneMeshes,
  TensorEngines
};
inline constexpr std::size_t CoreFolderCount = 13;

/// A named choice of what subjects show.
struct VSubjectViewPreset
{
  std::string m_Name;
  std::vector< std::string > m_EnabledSettings;
  friend bool operator==( const VSubjectViewPreset&, const VSubjectViewPreset& ) = default;
};
template <>
struct IO::VSerialiser< VSubjectViewPreset > : IO::VRecordSerialiser< VSubjectViewPreset >
{
  static constexpr const char* TypeName = "VSubjectViewPreset";
  static constexpr std::tuple Members{ Member( "Name", &VSubjectViewPreset::m_Name ),
                                       Member( "EnabledSettings", &VSubjectViewPreset::m_EnabledSettings ) };
};

/// All preferences that a host declares for its plug-ins, in the order of `ICoreUserPreferencesLayout`. Made on first
/// use, and then there for good. Thread: any.
ZEK_API const std::vector< VPreferenceDeclaration >& CoreUserPreferences();

/// Gives every one of them an entry: persistent, with its default, and with that as its value where it had none or
/// used an older default. Values that were set stay; doing it again changes nothing. The first failure: `InvalidType`
/// where an entry of another type is in the way, which stays as it is.
ZEK_API IResult DeclareCoreUserPreferences( IStoreWriter& io_rWriter );

/// Typed access to the preferences. Thread: one at a time. A null store is taken; then all defaults hold.
class ZEK_API ICoreUserPreferencesLayout
{
public:
  explicit ICoreUserPreferencesLayout( std::shared_ptr< IStore > i_pStore );
  ICoreUserPreferencesLayout( const ICoreUserPreferencesLayout& ) = delete;
  ICoreUserPreferencesLayout& operator=( const ICoreUserPreferencesLayout& ) = delete;

  /// True: the plain mouse navigates and Alt selects. False: the other way round.
  const VPreference< bool >& AltToSelect() const { return m_AltToSelect; }
  const VPreference< bool >& EnableAutoContextSwitch() const { return m_EnableAutoContextSwitch; }
  const VPreference< bool >& AutoSaveEnabled() const { return m_AutoSaveEnabled; }
  const VPreference< bool >& AutoSaveAskBeforeRecovery() const { return m_AutoSaveAskBeforeRecovery; }
  const VPreference< std::uint32_t >& AutoSaveIntervalSeconds() const { return m_AutoSaveIntervalSeconds; }
  const VPreference< bool >& StartPlayingAutomatically() const { return m_StartPlayingAutomatically; }
  /// In GiB.
  const VPreference< std::uint32_t >& WarnFreeSpaceOptical() const { return m_WarnFreeSpaceOptical; }
  /// Empty means that none is chosen.
  const VPreference< std::wstring >& Folder( ECoreFolder i_Folder ) const { return m_Folders[std::size_t( i_Folder )]; }
  const VPreference< std::vector< VSubjectViewPreset > >& SubjectViewPresets() const { return m_SubjectViewPresets; }

  const std::shared_ptr< IStore >& Store() const { return m_pStore; }

private:
  std::shared_ptr< IStore > m_pStore;
  VPreference< bool > m_AltToSelect;
  VPreference< bool > m_EnableAutoContextSwitch;
  VPreference< bool > m_AutoSaveEnabled;
  VPreference< bool > m_AutoSaveAskBeforeRecovery;
  VPreference< std::uint32_t > m_AutoSaveIntervalSeconds;
  VPreference< bool > m_StartPlayingAutomatically;
  VPreference< std::uint32_t > m_WarnFreeSpaceOptical;
  std::array< VPreference< std::wstring >, CoreFolderCount > m_Folders;
  VPreference< std::vector< VSubjectViewPreset > > m_SubjectViewPresets;
};

} // namespace ZEK

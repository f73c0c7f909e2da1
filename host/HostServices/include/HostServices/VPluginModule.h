#pragma once

#include <HarrowPluginInterface/IPlugin.h>

#include <ZEK/Result.h>

#include <filesystem>
#include <memory>
#include <string>
#include <vector>

namespace HostServices
{

class VHost;

/// The exit code of a program whose plug-in module cannot be used.
inline constexpr int ExitPluginUnusable = 3;
/// The revision of the plug-in that this host was built with; another one is taken with a warning.
inline constexpr std::uint64_t ExpectedPluginRevision = 155050;

/// One loaded plug-in module and the plug-in object in it.
///
/// The steps are `Load`, `RegisterTypes`, `CreateContent`, `Release`, `Destroy`; `Start` does the first three. A step
/// out of its turn gives `NotPermitted` and does nothing. After a failure `Error` holds a sentence for the user.
/// The code stays loaded for the life of the process, because QML types and static objects point into it.
/// Thread: GUI.
class VPluginModule
{
public:
  enum EStage
  {
    ENone,
    ELoaded,     ///< the exports are found and the plug-in object exists
    ERegistered, ///< its QML types are published
    EContent,    ///< its windows and commands are published
    EReleased
  };

  VPluginModule();
  /// Releases and destroys the plug-in object, if `Destroy` has not.
  ~VPluginModule();
  VPluginModule( const VPluginModule& ) = delete;
  VPluginModule& operator=( const VPluginModule& ) = delete;

  /// The places that are searched for a module file of that name, in order: beside the program in ../lib/harrow, the
  /// installation's library folder, and ../lib. The environment's HARROW_PLUGIN, if set, is the only one.
  static std::vector< std::filesystem::path > SearchPaths( const std::string& i_rFile = "HarrowPluginGraphics.mpm" );
  /// The first of `SearchPaths` that is a file; when none is, the first.
  static std::filesystem::path DefaultPath();

  /// `FileNotFound` for a missing file, `InvalidFormat` for one that is no library, `NotFound` when an export is
  /// missing (`Error` names it), `AllocationFailure` when no object was made, `FailedWithException`
  /// when making it threw.
  ZEK::IResult Load( const std::filesystem::path& i_rPath );
  ZEK::IResult RegisterTypes( VHost& i_rHost );
  ZEK::IResult CreateContent( VHost& i_rHost );
  ZEK::IResult Start( const std::filesystem::path& i_rPath, VHost& i_rHost );
  /// The windows must be closed before. Also drops what the plug-in published at the host.
  ZEK::IResult Release();
  ZEK::IResult Destroy();
  /// Takes the code out of the process: only for a module that registered no types, after `Destroy`.
  ZEK::IResult UnloadCode();

  EStage Stage() const;
  HarrowPluginInterface::IPlugin* Plugin() const;
  std::uint64_t Revision() const;
  /// The plug-in's display name, or the file's name when it has none.
  std::string DisplayName() const;
  std::filesystem::path Path() const;
  const std::string& Error() const;

private:
  struct VState;
  std::unique_ptr< VState > m_pState;
};

} // namespace HostServices

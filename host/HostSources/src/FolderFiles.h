#pragma once

#include <HostSources/CameraCalibrations.h>
#include <HostSources/VByteSource.h>

#include <ZEK/Result.h>

#include <filesystem>
#include <string>
#include <string_view>
#include <vector>

namespace HostSources
{

/// What lies in a folder, by name; links that lead nowhere and what is neither a plain file nor a folder are left out.
struct VFolderFiles
{
  std::vector< std::filesystem::path > Files, Folders;
};

ZEK::IResult ListFolder( const std::filesystem::path& i_rPath, VFolderFiles& o_rFiles, std::string& o_rMessage );

/// The suffix in lower case, with its dot.
std::string SuffixOf( const std::filesystem::path& i_rPath );
/// The last part of a path for a person to read, whether it ends in a slash or not.
std::string ShownName( const std::filesystem::path& i_rPath );

/// Reads a text as a whole; the view is good while the source is. Without a byte order mark.
ZEK::IResult ReadText( const std::filesystem::path& i_rPath, VFileSource& o_rSource, std::string_view& o_rText,
                       std::string& o_rMessage );

/// The first file of cameras by name in the folder, then in its parent. False when there is none; what was there but
/// could not be read stands in the notes.
bool FindCalibration( const std::filesystem::path& i_rFolder, VCameraCalibrations& o_rCalibrations,
                      std::vector< std::string >& io_rNotes );

} // namespace HostSources

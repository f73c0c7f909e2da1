#pragma once

#include "FolderFiles.h"

#include <HostSources/VProgress.h>
#include <HostSources/VRecording.h>

#include <cstdint>
#include <string>
#include <vector>

namespace HostSources
{

/// What the files of a folder tell of the cameras' images, before it is joined with anything.
struct VDetections
{
  struct VCamera
  {
    std::string Name;      ///< of the folder; empty where the file gives numbers
    std::int32_t Id = -1;  ///< -1: the file gives names
    VRecordingCamera Seen; ///< `Point` is an index into `Points`
  };

  std::string Form;                  ///< what was read, for people
  std::int64_t First = 0, Count = 0; ///< number of the first frame, and how many there are
  std::vector< VCamera > Cameras;
  std::vector< std::string > Points; ///< the names of what can be seen
  bool bPersons = false;             ///< whether several persons can be seen, without knowing who is who
  bool bRateKnown = false;           ///< whether the files told the recording's rate
  std::vector< std::string > Losses; ///< what could not be used, as sentences
};

/// Whether tables and rows for that many frames stay within reason for the bytes that were read.
bool IsReasonable( std::uint64_t i_Frames, std::uint64_t i_BytesPerFrame, std::uint64_t i_FileBytes );

/// Reads the CSV tables of a folder; `io_rRecording` gets points and rate where they are there. Nothing in
/// `o_rDetections` and `Ok` when there is no such table.
ZEK::IResult ReadDetectionTables( const VFolderFiles& i_rFiles, VDetections& o_rDetections, VRecording& io_rRecording,
                                  std::string& o_rMessage, const VProgress& i_rProgress );

/// Reads the folders of JSON files, one a camera; the same for none of them.
ZEK::IResult ReadDetectionFolders( const std::filesystem::path& i_rFolder, const VFolderFiles& i_rFiles,
                                   VDetections& o_rDetections, std::string& o_rMessage, const VProgress& i_rProgress );

} // namespace HostSources

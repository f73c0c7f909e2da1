#pragma once

#include "FolderFiles.h"

#include <HostSources/VProgress.h>
#include <HostSources/VRecording.h>

#include <cstdint>
#include <vector>

namespace HostSources
{

/// The video files of a folder and of the folders in it, and what a recording's cameras take of them.
class VFolderVideos
{
public:
  /// A file is a camera's by its name, or that of its folder: "cam01", "Trial_cam_01" and "Cam 1" are all the camera
  /// "cam_01". A file goes to the camera that it is most surely of. Each is read through once; one that cannot be used
  /// stands in the notes. False when it was stopped.
  bool Find( const VFolderFiles& i_rFiles, VRecording& io_rRecording, const VProgress& i_rProgress );
  /// The rate of the first video that has one; 0 without any.
  static double RateHz( const VRecording& i_rRecording );
  /// Tells which frame of each video belongs to which of the recording, once its rate is known. The cameras saw
  /// `i_Count` frames, the first of which has the number `i_First`.
  static void Match( std::int64_t i_First, std::int64_t i_Count, VRecording& io_rRecording );

private:
  struct VFile
  {
    std::filesystem::path Path;
    std::string Stem, Folder; ///< no folder for one that lies beside the rest
    bool bTaken = false;
  };
  void List( const VFolderFiles& i_rFiles );
  std::vector< VFile* > Assign();
  bool Scan( const VFile& i_rFile, VRecordingCamera& io_rCamera, const VProgress& i_rProgress );
  void TellRest();
  void Note( std::string i_Text ) { m_pRecording->Notes.push_back( std::move( i_Text ) ); }

  VRecording* m_pRecording = nullptr;
  std::vector< VFile > m_Files;
};

/// Letters and digits alone, in lower case: "cam_01" and "Cam01" are one camera.
std::string PlainName( const std::string& i_rName );

} // namespace HostSources

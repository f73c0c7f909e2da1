#pragma once

#include <HostSources/VProgress.h>
#include <HostSources/VReadOptions.h>
#include <HostSources/VRecording.h>

#include <ZEK/Result.h>

#include <filesystem>
#include <string>

namespace HostSources
{

/// Reads a folder that holds what cameras saw, and joins it with its 3D points and its calibration.
///
/// Detections are a table (CSV with sync_index, cam_id, keypoint_id, img_loc_x and img_loc_y) or a folder a camera with
/// a JSON file a frame (`people`, each with `pose_keypoints_2d`). Points are a table (x_coord, y_coord, z_coord;
/// metres) or the first TRC or C3D file by name. The calibration is sought in the folder, then in its parent; a camera
/// without one is there uncalibrated. Notes say what was taken.
///
/// Video files that lie in the folder, or in folders within it, go to the camera of their name, frame by frame where
/// there are as many frames as detections, otherwise by time.
///
/// Of several persons in the image, the one nearest to the projected points is taken for the subject.
/// Failures are those of `ReadRecording`; a folder without anything to read is `FileIOFailure`.
ZEK::IResult ReadFolder( const std::filesystem::path& i_rPath, VRecording& o_rRecording, std::string& o_rMessage,
                         const VProgress& i_rProgress = {}, const VReadOptions& i_rOptions = {} );

} // namespace HostSources

#pragma once

#include <HostSources/VProgress.h>
#include <HostSources/VRecording.h>

#include <ZEK/Result.h>

#include <cstddef>
#include <filesystem>
#include <span>
#include <string>

namespace HostSources
{

/// True for bytes that begin like a table of motion (.mot, .sto).
bool LooksLikeMotion( std::span< const std::byte > i_Bytes );

/// Finds the model whose joints a motion file moves: `i_rNamed` unless it is empty, else the model that lies beside the
/// file, of several the one with the file's name. `NotFound` without one; the message says so and begins with the
/// file's name.
ZEK::IResult FindModel( const std::filesystem::path& i_rMotion, const std::filesystem::path& i_rNamed,
                        std::filesystem::path& o_rModel, std::string& o_rMessage );

/// Reads a table of joint coordinates and the model (.osim, version 4) that they move as one skeleton; results and
/// messages as `ReadRecording` has them. The names are those of the files in messages.
///
/// Bodies stand where the model's joints put them. Coordinates that the model couples to others follow these; those
/// without a column stand at the model's default. The model's markers become those of the subject.
ZEK::IResult ReadMotion( std::span< const std::byte > i_Motion, const std::string& i_rName,
                         std::span< const std::byte > i_Model, const std::string& i_rModelName,
                         VRecording& o_rRecording, std::string& o_rMessage, const VProgress& i_rProgress = {} );

} // namespace HostSources

#pragma once

#include <HarrowPluginInterface/VMeshScene.h>
#include <ZEK/Result.h>

#include <cstddef>
#include <filesystem>
#include <span>
#include <string>

namespace HostMeshes
{

/// Larger files are refused.
constexpr std::uintmax_t LargestMeshFile = 128u << 20u;

/// Whether the name ends as that of a format that is read: ".fbx" or ".obj", in any case.
bool IsMeshName( const std::filesystem::path& i_rPath );

/// Reads a mesh file. FBX says how long its unit is; one of an OBJ file is a millimetre. What is broken in part is
/// mended or left out; a file with no triangle left is refused. On failure `o_rMesh` is empty and `o_rMessage` names
/// the file and says why. Pictures are read from the file itself or from its folder. Thread: any.
ZEK::IResult ReadMesh( const std::filesystem::path& i_rPath, HarrowPluginInterface::VMeshScene& o_rMesh,
                       std::string& o_rMessage );
/// The same from memory, without pictures or materials in other files. The name tells the format.
ZEK::IResult ReadMesh( std::span< const std::byte > i_Bytes, const std::string& i_rName,
                       HarrowPluginInterface::VMeshScene& o_rMesh, std::string& o_rMessage );

} // namespace HostMeshes

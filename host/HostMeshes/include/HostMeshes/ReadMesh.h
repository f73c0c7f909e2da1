#pragma once

#include <HarrowPluginInterface/VMeshScene.h>
#include <ZEK/Result.h>

#include <atomic>
#include <cstddef>
#include <cstdio>
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
/// mended or left out, and `o_rMessage` then says what; a file with no triangle left is refused. On failure `o_rMesh`
/// is empty and `o_rMessage` names the file and says why. A file made to do harm may end the process. Pictures are read
/// from the file itself or from its folder. Thread: any.
ZEK::IResult ReadMesh( const std::filesystem::path& i_rPath, HarrowPluginInterface::VMeshScene& o_rMesh,
                       std::string& o_rMessage );
/// The same from memory, without pictures or materials in other files. The name tells the format.
ZEK::IResult ReadMesh( std::span< const std::byte > i_Bytes, const std::string& i_rName,
                       HarrowPluginInterface::VMeshScene& o_rMesh, std::string& o_rMessage );

/// The same by a process of its own, the program "harrow-mesh-reader": nothing that is in a file ends this one.
/// That process is ended soon after `i_pStop`, where there is one, became true.
ZEK::IResult ReadMeshApart( const std::filesystem::path& i_rReader, const std::filesystem::path& i_rPath,
                            HarrowPluginInterface::VMeshScene& o_rMesh, std::string& o_rMessage,
                            const std::atomic< bool >* i_pStop = nullptr );
/// That program, where it lies beside the running one; else empty. Needs the application object.
std::filesystem::path FindMeshReader();
/// What that program does. The result is its exit code.
int RunMeshReader( const std::filesystem::path& i_rPath, std::FILE* io_pOutput );

} // namespace HostMeshes

#pragma once

#include <HarrowPluginInterface/VMeshScene.h>

#include <filesystem>

struct aiMaterial;
struct aiScene;

namespace HostMeshes
{

/// The picture of a material's colour: packed into the file, or lying in its folder. Null when there is none, or it
/// cannot be read.
std::shared_ptr< const HarrowPluginInterface::VMeshPicture >
ReadPicture( const aiScene& i_rScene, const aiMaterial& i_rMaterial, const std::filesystem::path& i_rFolder );

} // namespace HostMeshes

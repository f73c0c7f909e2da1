#pragma once

#include <HarrowPluginInterface/VMeshScene.h>

#include <memory>

namespace HostMeshes
{

/// The name under which the bone of skeletons is asked for.
inline constexpr const char* BoneMeshName = "tetra_stripe.fbx";

/// Two four-sided pyramids on one waist, along x from 0 to 1.
std::shared_ptr< const HarrowPluginInterface::VMeshScene > MakeBoneMesh();

} // namespace HostMeshes

#pragma once

#include <ZEK/Callback.h>
#include <ZEK/Shared.h>

#include <cstdint>
#include <memory>
#include <optional>
#include <string>
#include <vector>

namespace HarrowPluginInterface
{
class IHarrowPaths;
class VMeshSceneCache;
} // namespace HarrowPluginInterface
namespace ZEK
{
class IStore;
}

namespace HarrowPluginGraphics
{

/// The folders in which a mesh is looked for before the one that the operator chose. A kind without any is left
/// alone.
struct VMeshBaseFolders
{
  std::vector< std::wstring > m_Subjects;
  std::optional< std::wstring > m_Prop;
  std::optional< std::wstring > m_SceneMesh;
};

/// Which kinds there are depends on the bits of `EHarrowFeatureFlags`. Throws when a kind has no folder.
VMeshBaseFolders FindMeshBaseFolders( const HarrowPluginInterface::IHarrowPaths& i_rPaths, std::uint32_t i_Flags );

/// Keeps the search folders of the cache as the folder preferences say, as long as the result lives; they are set
/// before this returns. Throws `VStoreException` when the entry of a kind is not there or has no value; a later such
/// failure comes out of the posted function. Without a store no folder is chosen.
std::shared_ptr< ZEK::VShared >
WatchFolderPreferences( std::shared_ptr< ZEK::IStore > i_pStore, std::shared_ptr< ZEK::IPostalService > i_pPostal,
                        VMeshBaseFolders i_Bases,
                        std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > i_pMeshCache );

} // namespace HarrowPluginGraphics

#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

#include <atomic>
#include <mutex>

namespace HostServices
{

/// Where shader sources are looked for before the built-in ones, and the request to read them again.
class VRenderResources final : public HarrowPluginInterface::IRenderResources
{
public:
  explicit VRenderResources( std::vector< std::filesystem::path > i_OverrideFolders = {} );

  std::vector< std::filesystem::path > OverrideFolders() const override;
  std::uint64_t Generation() const override { return m_Generation.load( std::memory_order_acquire ); }
  void Reload() override;
  ZEK::IMultiCallback< void() >& ReloadRequested() override { return m_Requested; }

  /// Thread: any. Takes effect with the next `Reload`.
  void SetOverrideFolders( std::vector< std::filesystem::path > i_Folders );

private:
  mutable std::mutex m_Guard;
  std::vector< std::filesystem::path > m_Folders;
  std::atomic< std::uint64_t > m_Generation{ 1 };
  ZEK::VMultiCallback< void() > m_Requested;
};

} // namespace HostServices

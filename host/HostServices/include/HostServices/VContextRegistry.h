#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

#include <map>

namespace HostServices
{

/// The context of captured data that arrives now.
inline constexpr const char* LiveContextName = "Live";
/// The context of recordings.
inline constexpr const char* PlaybackContextName = "Playback";

/// The contexts that a window can be opened on: "Live", "Playback", and every other cache that the cache manager
/// has, under its own name. A context stays the same object. Thread: GUI.
class VContextRegistry final : public HarrowPluginInterface::IContextRegistry
{
public:
  explicit VContextRegistry( std::shared_ptr< ZEK::IFlowStateCacheManager > i_pManager );

  std::shared_ptr< HarrowPluginInterface::IStateCacheContext > Find( const std::string& i_rName ) const override;
  /// "Live", "Playback", then the other caches.
  std::vector< std::string > Names() const override;

  /// The writing ends, for the sources.
  const std::shared_ptr< ZEK::IFlowWritableStateCache >& LiveCache() const { return m_pLive; }
  const std::shared_ptr< ZEK::IFlowWritableStateCache >& PlaybackCache() const { return m_pPlayback; }

private:
  std::shared_ptr< ZEK::IFlowStateCacheManager > m_pManager;
  std::shared_ptr< ZEK::IFlowWritableStateCache > m_pLive;
  std::shared_ptr< ZEK::IFlowWritableStateCache > m_pPlayback;
  mutable std::map< std::string, std::shared_ptr< HarrowPluginInterface::IStateCacheContext > > m_Contexts;
};

} // namespace HostServices

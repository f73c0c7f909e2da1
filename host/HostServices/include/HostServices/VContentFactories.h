#pragma once

#include <HarrowPluginInterface/IWorkspaceContent.h>

namespace HostServices
{

/// The window kinds that were published, in the order of their publishing. Thread: GUI.
class VContentFactories final : public HarrowPluginInterface::IContentFactories
{
public:
  using VFactory = HarrowPluginInterface::IWorkspaceContentFactory;

  std::vector< std::string > Names() const override;
  /// A name that exists gets the new factory. An empty factory is refused with a log line of level 3.
  void AddFactory( const std::string& i_rName, std::shared_ptr< VFactory > i_pFactory ) override;

  /// Null when no kind has that name.
  std::shared_ptr< VFactory > Find( const std::string& i_rName ) const;
  ZEK::IMultiCallback< void() >& Changed() { return m_Changed; }
  /// Releases every factory, and with them what the plug-in keeps alive through them.
  void Clear();

private:
  std::vector< std::pair< std::string, std::shared_ptr< VFactory > > > m_Factories;
  ZEK::VMultiCallback< void() > m_Changed;
};

} // namespace HostServices

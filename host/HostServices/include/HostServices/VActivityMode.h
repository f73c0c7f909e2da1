#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

namespace HostServices
{

/// What the operator is doing, as a text. The host's menu offers `KnownNames`; any other text may be set too.
class VActivityMode final : public HarrowPluginInterface::IActivityMode
{
public:
  static std::vector< std::string > KnownNames();

  std::string Name() const override { return m_Name; }
  ZEK::IMultiCallback< void() >& Changed() override { return m_Changed; }
  /// An equal name fires nothing.
  void SetName( const std::string& i_rName );

private:
  std::string m_Name = "Live";
  ZEK::VMultiCallback< void() > m_Changed;
};

} // namespace HostServices

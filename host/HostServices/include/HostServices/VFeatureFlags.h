#pragma once

#include <HarrowPluginInterface/IHarrowServices.h>

#include <QtCore/QStringList>

#include <ZEK/Result.h>

namespace HostServices
{

/// The word of feature flags: one of two profiles, or a word of the user's own, whose profile name is "custom".
class VFeatureFlags final : public HarrowPluginInterface::IFeatureFlagSource
{
public:
  static constexpr std::uint32_t SubjectsProfile = 0x3501C; ///< bits 2, 3, 4, 12, 14, 16, 17
  static constexpr std::uint32_t ObjectsProfile = 0x01013;  ///< bits 0, 1, 4, 12

  static QStringList ProfileNames();

  QString ProfileName() const override;
  ZEK::IMultiCallback< void() >& FlagsChanged() override { return m_Changed; }
  void GetFlags( std::uint32_t& o_rFlags ) const override { o_rFlags = m_Flags; }

  std::uint32_t Flags() const { return m_Flags; }
  void SetFlags( std::uint32_t i_Flags );
  /// Takes a profile's name, or a word such as "0x3501c" or "217116". `InvalidValue` for any other text; the flags
  /// then stay.
  ZEK::IResult SetFromText( const QString& i_rText );

private:
  std::uint32_t m_Flags = SubjectsProfile;
  ZEK::VMultiCallback< void() > m_Changed;
};

} // namespace HostServices

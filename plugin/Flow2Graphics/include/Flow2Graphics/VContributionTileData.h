#pragma once

#include <Flow2Graphics/VContributions.h>

#include <MoxelGraphics/ICameraModelAdditionalDataSource.h>
#include <ZEK/Callback.h>

#include <memory>

namespace Flow2Graphics
{

/// Adds to what another source knows of a camera whether it sees the selection: "contributes" (true), "error" (px; left
/// out where it is not known) and "errorColor". Watches as long as it lives. Thread: GUI.
class VContributionTileData final : public MoxelGraphics::ICameraModelAdditionalDataSource
{
public:
  /// `i_pOther` may be null.
  VContributionTileData( std::shared_ptr< MoxelGraphics::ICameraModelAdditionalDataSource > i_pOther,
                         std::shared_ptr< VContributions > i_pContributions );
  ~VContributionTileData() override;

  QVariantMap AdditionalData( const QString& i_rURN ) const override;
  ZEK::IMultiCallbackPostal< void() >& Changed() override { return m_pChanged->Notifier; }

private:
  /// Outlives a call that is under way.
  struct VShared
  {
    ZEK::VMultiCallback< void() > Notifier;
  };
  std::shared_ptr< MoxelGraphics::ICameraModelAdditionalDataSource > m_pOther;
  std::shared_ptr< VContributions > m_pContributions;
  std::shared_ptr< VShared > m_pChanged = std::make_shared< VShared >();
  ZEK::VConnection m_OtherConnection;
  QMetaObject::Connection m_ContributionsConnection;
};

} // namespace Flow2Graphics

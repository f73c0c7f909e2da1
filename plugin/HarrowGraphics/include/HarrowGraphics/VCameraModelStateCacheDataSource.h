#pragma once

#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>
#include <HarrowPluginInterface/IHarrowServices.h>
#include <MoxelGraphics/VCameraGrid.h>
#include <ZEK/DispatchCollapser.h>
#include <ZEK/Shared.h>

#include <QtCore/QHash>
#include <QtCore/QTimer>
#include <QtCore/QVariantMap>

#include <vector>

namespace HarrowGraphics
{

/// What the newest state of a context says of the health of its cameras, for the overlays of camera tiles. Looks at
/// most ten times a second, and announces a change only when a value is another one. Thread: GUI.
class VCameraModelStateCacheDataSource : public MoxelGraphics::ICameraModelAdditionalDataSource, public ZEK::VShared
{
public:
  /// Without a cache nothing is known of any camera. `i_pTexts` may be null.
  VCameraModelStateCacheDataSource( std::shared_ptr< ZEK::IFlowStateCache > i_pCache,
                                    std::shared_ptr< ZEK::IPostalService > i_pPostal,
                                    std::shared_ptr< HarrowPluginInterface::ICameraDataSourceContext > i_pTexts );
  ~VCameraModelStateCacheDataSource() override;

  void Start() override;

  /// Empty for a camera that the state does not know.
  QVariantMap AdditionalData( const QString& i_rURN ) const override;
  ZEK::IMultiCallback< void() >& Changed() override { return m_Changed; }

private:
  void OnStates();
  void Look();
  bool TakeState( const ZEK::IFlowState& i_rState );

  std::shared_ptr< ZEK::IFlowStateCache > m_pCache;
  std::shared_ptr< ZEK::IPostalService > m_pPostal;
  std::shared_ptr< HarrowPluginInterface::ICameraDataSourceContext > m_pTexts;
  Flow2TypesUtils::VTaggedCoreTypeExtractor m_Extractor;
  QHash< QString, QVariantMap > m_Data;
  QTimer m_Rest; ///< runs while it is too early to look again
  bool m_bWaiting = false;
  std::unique_ptr< ZEK::VDispatchCollapser > m_pStates;
  ZEK::VMultiCallback< void() > m_Changed;
  std::vector< ZEK::VConnection > m_Connections;
};

} // namespace HarrowGraphics

#include <HarrowGraphics/VCameraModelStateCacheDataSource.h>

#include "CameraTileData.h"

#include <CoreMoxelTypes/FlowTypes.h>

#include <algorithm>
#include <array>

namespace HarrowGraphics
{
namespace
{
using namespace CoreMoxelTypes;
using Flow2TypesUtils::ETagRequirement;

constexpr int RestMilliseconds = 100;
constexpr std::uint32_t AllItemGroups = 31;
constexpr std::uint32_t NewestState = 2;

constexpr std::array< std::uint32_t, 7 > ValueTags{
    ZEK::FlowTag< FlowCameraSettings >,          ZEK::FlowTag< FlowCameraCalibration >,
    ZEK::FlowTag< FlowCameraCalibrationHealth >, ZEK::FlowTag< FlowCameraCalibrationDetails >,
    ZEK::FlowTag< FlowCameraPhysicalStatus >,    ZEK::FlowTag< FlowCameraPhysicalSensorData >,
    ZEK::FlowTag< FlowCameraWarnings > };
} // namespace

VCameraModelStateCacheDataSource::VCameraModelStateCacheDataSource(
    std::shared_ptr< ZEK::IFlowStateCache > i_pCache, std::shared_ptr< ZEK::IPostalService > i_pPostal,
    std::shared_ptr< HarrowPluginInterface::ICameraDataSourceContext > i_pTexts )
  : m_pCache( std::move( i_pCache ) )
  , m_pPostal( std::move( i_pPostal ) )
  , m_pTexts( std::move( i_pTexts ) )
{
  m_Extractor.AddCache< FlowCameraHardware >( ETagRequirement::Required );
  m_Extractor.AddCache< FlowCameraSettings >( ETagRequirement::Optional );
  m_Extractor.AddCache< FlowCameraCalibration >( ETagRequirement::Optional );
  m_Extractor.AddCache< FlowCameraCalibrationHealth >( ETagRequirement::Optional );
  m_Extractor.AddCache< FlowCameraCalibrationDetails >( ETagRequirement::Optional );
  m_Extractor.AddCache< FlowCameraPhysicalStatus >( ETagRequirement::Optional );
  m_Extractor.AddCache< FlowCameraPhysicalSensorData >( ETagRequirement::Optional );
  m_Extractor.AddCache< FlowCameraWarnings >( ETagRequirement::Optional );
  m_Rest.setSingleShot( true );
  m_Rest.setInterval( RestMilliseconds );
}

VCameraModelStateCacheDataSource::~VCameraModelStateCacheDataSource() = default;

void VCameraModelStateCacheDataSource::Start()
{
  if ( !m_pCache )
  {
    return;
  }
  QObject::connect( &m_Rest, &QTimer::timeout, &m_Rest,
                    [this]
                    {
                      if ( m_bWaiting )
                      {
                        Look();
                      }
                    } );
  m_pStates = std::make_unique< ZEK::VDispatchCollapser >(
      [pWeak = Weak( this )]
      {
        if ( const auto pSelf = pWeak.lock() )
        {
          pSelf->OnStates();
        }
      },
      m_pPostal );
  for ( auto* const pNotifier : { &m_pCache->StatesChanged(), &m_pCache->Notifier6() } )
  {
    m_Connections.push_back( pNotifier->Connect( m_pStates->Callback(), nullptr ) );
  }
  Look();
}

QVariantMap VCameraModelStateCacheDataSource::AdditionalData( const QString& i_rURN ) const
{
  return m_Data.value( i_rURN );
}

void VCameraModelStateCacheDataSource::OnStates()
{
  if ( m_Rest.isActive() )
  {
    m_bWaiting = true;
    return;
  }
  Look();
}

void VCameraModelStateCacheDataSource::Look()
{
  m_bWaiting = false;
  m_Rest.start();
  ZEK::VFlowStateRef State;
  m_pCache->Fetch( State, AllItemGroups, NewestState, 0 );
  // A cache that was emptied is about to get another state; what is known stays until then.
  if ( !State || State->ItemCount() == 0 )
  {
    return;
  }
  if ( TakeState( *State ) )
  {
    m_Changed.Fire();
  }
}

bool VCameraModelStateCacheDataSource::TakeState( const ZEK::IFlowState& i_rState )
{
  m_Extractor.Update( i_rState, ZEK::EFlowNameDevice, ZEK::EFlowTimeMatch::Overlap, i_rState.GetKey() );
  const bool bOther = m_Extractor.NamesChanged() || std::any_of( ValueTags.begin(), ValueTags.end(),
                                                                 [this]( std::uint32_t i_Tag )
                                                                 {
                                                                   return m_Extractor.Changed( i_Tag );
                                                                 } );
  if ( !bOther )
  {
    return false;
  }
  const auto& rSettings = m_Extractor.Values< FlowCameraSettings >();
  const auto& rCalibrations = m_Extractor.Values< FlowCameraCalibration >();
  const auto& rHealth = m_Extractor.Values< FlowCameraCalibrationHealth >();
  const auto& rDetails = m_Extractor.Values< FlowCameraCalibrationDetails >();
  const auto& rStatus = m_Extractor.Values< FlowCameraPhysicalStatus >();
  const auto& rSensors = m_Extractor.Values< FlowCameraPhysicalSensorData >();
  const auto& rWarnings = m_Extractor.Values< FlowCameraWarnings >();
  QHash< QString, QVariantMap > Data;
  const std::vector< std::string >& rNames = m_Extractor.Names();
  for ( std::size_t Slot = 0; Slot < rNames.size(); ++Slot )
  {
    const VCameraHealthItems Items{ rSettings[Slot], rCalibrations[Slot], rHealth[Slot],  rDetails[Slot],
                                    rStatus[Slot],   rSensors[Slot],      rWarnings[Slot] };
    Data.insert( QString::fromStdString( rNames[Slot] ), CameraTileData( Items, m_pTexts.get() ) );
  }
  const bool bChanged = Data != m_Data;
  m_Data.swap( Data );
  return bChanged;
}

} // namespace HarrowGraphics

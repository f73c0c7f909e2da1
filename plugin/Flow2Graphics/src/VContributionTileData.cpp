#include <Flow2Graphics/VContributionTileData.h>

#include <cmath>

namespace Flow2Graphics
{

VContributionTileData::VContributionTileData(
    std::shared_ptr< MoxelGraphics::ICameraModelAdditionalDataSource > i_pOther,
    std::shared_ptr< VContributions > i_pContributions )
  : m_pOther( std::move( i_pOther ) )
  , m_pContributions( std::move( i_pContributions ) )
{
  const auto Tell = [pWeak = std::weak_ptr( m_pChanged )]
  {
    if ( const auto pChanged = pWeak.lock() )
    {
      pChanged->Notifier.Fire();
    }
  };
  if ( m_pOther )
  {
    m_OtherConnection = m_pOther->Changed().Connect( Tell, nullptr );
  }
  m_ContributionsConnection =
      QObject::connect( m_pContributions.get(), &VContributions::Changed, m_pContributions.get(), Tell );
  m_pContributions->watch();
}

VContributionTileData::~VContributionTileData()
{
  QObject::disconnect( m_ContributionsConnection );
  m_pContributions->unwatch();
}

QVariantMap VContributionTileData::AdditionalData( const QString& i_rURN ) const
{
  QVariantMap Data = m_pOther ? m_pOther->AdditionalData( i_rURN ) : QVariantMap();
  double Error = 0;
  if ( m_pContributions->OfCamera( i_rURN.toStdString(), Error ) )
  {
    Data["contributes"] = true;
    Data["errorColor"] = QString( "#%1" ).arg( ReprojectionErrorColour( Error ), 6, 16, QLatin1Char( '0' ) );
    if ( !std::isnan( Error ) )
    {
      Data["error"] = Error;
    }
  }
  return Data;
}

} // namespace Flow2Graphics

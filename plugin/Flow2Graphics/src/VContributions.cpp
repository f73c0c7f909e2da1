#include <Flow2Graphics/VContributions.h>

#include <QtCore/QStringList>

#include <algorithm>
#include <cmath>

namespace Flow2Graphics
{
namespace
{
constexpr int RestMilliseconds = 100;

/// Two errors that are not known are the same.
bool SameError( double i_A, double i_B )
{
  return i_A == i_B || ( std::isnan( i_A ) && std::isnan( i_B ) );
}

QString ErrorText( const VContributionReport::VRow& i_rRow )
{
  switch ( i_rRow.State )
  {
  case EContribution::Uncalibrated:
    return VContributions::tr( "uncalibrated" );
  case EContribution::NotInImage:
    return VContributions::tr( "not in its image" );
  default:
    return VContributions::tr( "%1 px" ).arg( i_rRow.Error, 0, 'f', 2 );
  }
}

QVariantMap RowOf( const VContributionReport::VRow& i_rRow )
{
  QVariantMap Row{
      { "urn", QString::fromStdString( i_rRow.Camera ) },
      { "reconstruction", i_rRow.Reconstruction },
      { "id", i_rRow.Id },
      { "label", QString::fromStdString( i_rRow.Label ) },
      { "errorText", ErrorText( i_rRow ) },
      { "color", QString( "#%1" ).arg( ReprojectionErrorColour( i_rRow.Error ), 6, 16, QLatin1Char( '0' ) ) } };
  Row["error"] = i_rRow.State == EContribution::Measured ? QVariant( i_rRow.Error ) : QVariant();
  return Row;
}
} // namespace

bool VContributionReport::VRow::operator==( const VRow& i_rOther ) const
{
  return Camera == i_rOther.Camera && Label == i_rOther.Label && Reconstruction == i_rOther.Reconstruction &&
         Id == i_rOther.Id && State == i_rOther.State && SameError( Error, i_rOther.Error );
}

bool VContributionReport::VSeenBy::operator==( const VSeenBy& i_rOther ) const
{
  return Camera == i_rOther.Camera && SameError( Error, i_rOther.Error );
}

bool VContributionReport::operator==( const VContributionReport& i_rOther ) const
{
  return bOfCameras == i_rOther.bOfCameras && Selected == i_rOther.Selected && Cameras == i_rOther.Cameras &&
         SeenBy == i_rOther.SeenBy && Total == i_rOther.Total && Rows == i_rOther.Rows && Missing == i_rOther.Missing;
}

VContributions::VContributions( std::shared_ptr< ZEK::IPostalService > i_pPostal )
  : m_pPostal( std::move( i_pPostal ) )
{
  m_Rest.setSingleShot( true );
  m_Rest.setInterval( RestMilliseconds );
  connect( &m_Rest, &QTimer::timeout, this, &VContributions::Take );
}

QString VContributions::Summary() const
{
  QStringList Lines;
  if ( m_Shown.Selected > 0 && !m_Shown.bOfCameras )
  {
    Lines << tr( "Seen by %1 of %2 cameras" ).arg( m_Shown.SeenBy.size() ).arg( m_Shown.Cameras );
  }
  else if ( m_Shown.Selected > 0 )
  {
    Lines << tr( "Contributes to %1 reconstructions" ).arg( m_Shown.Total );
  }
  if ( !m_Shown.Rows.empty() && m_Shown.Total > m_Shown.Rows.size() )
  {
    Lines << tr( "The %1 greatest errors of %2" ).arg( m_Shown.Rows.size() ).arg( m_Shown.Total );
  }
  for ( const std::string& rText : m_Shown.Missing )
  {
    Lines << QString::fromStdString( rText );
  }
  return Lines.join( '\n' );
}

bool VContributions::OfCamera( const std::string& i_rURN, double& o_rError ) const
{
  const auto It = std::find_if( m_Shown.SeenBy.begin(), m_Shown.SeenBy.end(),
                                [&]( const VContributionReport::VSeenBy& i_rSeenBy )
                                {
                                  return i_rSeenBy.Camera == i_rURN;
                                } );
  o_rError = It == m_Shown.SeenBy.end() ? std::nan( "" ) : It->Error;
  return It != m_Shown.SeenBy.end();
}

void VContributions::watch()
{
  if ( m_Watchers.fetch_add( 1, std::memory_order_relaxed ) == 0 && m_OnWatched )
  {
    m_OnWatched();
  }
}

void VContributions::unwatch()
{
  m_Watchers.fetch_sub( 1, std::memory_order_relaxed );
}

void VContributions::watchRows()
{
  const bool bFirst = m_RowWatchers.fetch_add( 1, std::memory_order_relaxed ) == 0;
  watch();
  if ( bFirst && m_OnWatched )
  {
    m_OnWatched();
  }
}

void VContributions::unwatchRows()
{
  m_RowWatchers.fetch_sub( 1, std::memory_order_relaxed );
  unwatch();
}

void VContributions::Offer( const VContributionReport& i_rReport )
{
  {
    const std::lock_guard Lock( m_Guard );
    if ( m_Offered == i_rReport )
    {
      return;
    }
    m_Offered = i_rReport;
    m_bFresh = true;
    if ( m_pPostal && m_bPosted )
    {
      return;
    }
    m_bPosted = true;
  }
  if ( !m_pPostal )
  {
    Take();
    return;
  }
  m_pPostal->Post(
      [pWeak = weak_from_this()]
      {
        if ( const auto pSelf = pWeak.lock() )
        {
          pSelf->Arrive();
        }
      } );
}

void VContributions::Arrive()
{
  if ( !m_Rest.isActive() )
  {
    Take();
  }
}

void VContributions::Flush()
{
  Take();
}

void VContributions::Take()
{
  {
    const std::lock_guard Lock( m_Guard );
    m_bPosted = false;
    if ( !m_bFresh )
    {
      return;
    }
    m_bFresh = false;
    m_Shown = m_Offered;
  }
  m_Rows.clear();
  for ( const auto& rRow : m_Shown.Rows )
  {
    m_Rows.append( RowOf( rRow ) );
  }
  if ( m_pPostal )
  {
    m_Rest.start();
  }
  emit Changed();
}

} // namespace Flow2Graphics

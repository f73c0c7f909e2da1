#include <HostServices/VSaveSchedule.h>

#include <algorithm>

namespace HostServices
{

void VSaveSchedule::Changed( VTime i_Now )
{
  m_First = m_First.value_or( i_Now );
  m_Last = i_Now;
}

void VSaveSchedule::Begun()
{
  m_bRequested = false;
  m_First.reset();
  m_Last.reset();
  m_Retry.reset();
}

void VSaveSchedule::Ended( bool i_bSaved, VTime i_Now )
{
  if ( i_bSaved )
  {
    m_NextRetry = {};
    return;
  }
  m_NextRetry =
      m_NextRetry == VDuration{} ? m_Delays.AfterFailure : std::min( m_NextRetry * 2, m_Delays.AfterFailures );
  m_Retry = i_Now + m_NextRetry;
}

std::optional< VSaveSchedule::VTime > VSaveSchedule::Due() const
{
  if ( m_bRequested )
  {
    return VTime::min();
  }
  if ( !m_First )
  {
    return m_Retry;
  }
  const VTime Change = std::min( *m_Last + m_Delays.AfterChange, *m_First + m_Delays.AtMost );
  return m_Retry ? std::min( *m_Retry, Change ) : Change;
}

} // namespace HostServices

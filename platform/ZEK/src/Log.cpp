#include <ZEK/Log.h>

#include <algorithm>
#include <cstdio>
#include <ctime>

namespace ZEK
{

VLogCategory& VLog::Category( std::string_view i_Name )
{
  const std::lock_guard Lock( m_Guard );
  const auto It = std::find_if( m_Categories.begin(), m_Categories.end(),
                                [&]( const VLogCategory& i_rCategory )
                                {
                                  return i_rCategory.Name() == i_Name;
                                } );
  if ( It != m_Categories.end() )
  {
    return *It;
  }
  VLogCategory& rCategory = m_Categories.emplace_back( std::string( i_Name ) );
  rCategory.SetMaximumLevel( m_MaximumLevel );
  return rCategory;
}

void VLog::SetMaximumLevel( int i_Level )
{
  const std::lock_guard Lock( m_Guard );
  m_MaximumLevel = i_Level;
  for ( VLogCategory& rCategory : m_Categories )
  {
    rCategory.SetMaximumLevel( i_Level );
  }
}

void VLog::AddSink( std::shared_ptr< ILogSink > i_pSink )
{
  const std::lock_guard Lock( m_Guard );
  m_Sinks.push_back( std::move( i_pSink ) );
}

void VLog::RemoveSink( const std::shared_ptr< ILogSink >& i_rpSink )
{
  const std::lock_guard Lock( m_Guard );
  std::erase( m_Sinks, i_rpSink );
}

void VLog::Write( const VLogCategory& i_rCategory, int i_Level, std::string i_Text )
{
  const VLogLine Line{ std::chrono::system_clock::now(), i_rCategory.Name(), i_Level, std::move( i_Text ) };
  const std::lock_guard Lock( m_Guard );
  for ( const std::shared_ptr< ILogSink >& rpSink : m_Sinks )
  {
    rpSink->Take( Line );
  }
}

VLog& GlobalLog()
{
  // Never destroyed: categories are kept in statics whose order of destruction is not ours.
  static VLog* const pLog = new VLog;
  return *pLog;
}

void VLogStderr::Take( const VLogLine& i_rLine )
{
  const std::time_t Seconds = std::chrono::system_clock::to_time_t( i_rLine.When );
  std::tm Local{};
  localtime_r( &Seconds, &Local );
  char Time[16] = "";
  std::strftime( Time, sizeof( Time ), "%H:%M:%S", &Local );
  std::fprintf( stderr, "%s %s %d: %s\n", Time, i_rLine.Category.c_str(), i_rLine.Level, i_rLine.Text.c_str() );
}

void VLogRing::Take( const VLogLine& i_rLine )
{
  const std::lock_guard Lock( m_Guard );
  m_Lines.push_back( i_rLine );
  ++m_Count;
  if ( m_Lines.size() > m_Capacity )
  {
    m_Lines.pop_front();
  }
}

std::vector< VLogLine > VLogRing::Lines() const
{
  const std::lock_guard Lock( m_Guard );
  return { m_Lines.begin(), m_Lines.end() };
}

std::size_t VLogRing::Count() const
{
  const std::lock_guard Lock( m_Guard );
  return m_Count;
}

void VLogRing::Clear()
{
  const std::lock_guard Lock( m_Guard );
  m_Lines.clear();
}

} // namespace ZEK

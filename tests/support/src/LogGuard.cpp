#include <TestSupport/LogGuard.h>

#include <ZEK/DebugServices.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <mutex>

namespace TestSupport
{
namespace
{
std::shared_ptr< ZEK::VLogRing > Ring()
{
  static const auto pRing = std::make_shared< ZEK::VLogRing >( 10000 );
  return pRing;
}

std::vector< std::string >& Announced()
{
  static std::vector< std::string > Texts;
  return Texts;
}

class VLogListener : public testing::EmptyTestEventListener
{
  void OnTestStart( const testing::TestInfo& ) override
  {
    Ring()->Clear();
    Announced().clear();
  }
  void OnTestEnd( const testing::TestInfo& ) override
  {
    for ( const ZEK::VLogLine& rLine : Ring()->Lines() )
    {
      const auto& rAnnounced = Announced();
      if ( rLine.Level == ZEK::ELogFailure &&
           std::find( rAnnounced.begin(), rAnnounced.end(), rLine.Text ) == rAnnounced.end() )
      {
        ADD_FAILURE() << "unexpected failure in the log: " << rLine.Category << ": " << rLine.Text;
      }
    }
  }
};
} // namespace

std::vector< ZEK::VLogLine > LogLines()
{
  return Ring()->Lines();
}

std::vector< std::string > LogTexts( const std::string& i_rCategory, int i_Level )
{
  std::vector< std::string > Texts;
  for ( const ZEK::VLogLine& rLine : Ring()->Lines() )
  {
    if ( rLine.Category == i_rCategory && rLine.Level == i_Level )
    {
      Texts.push_back( rLine.Text );
    }
  }
  return Texts;
}

void ExpectFailureLine( const std::string& i_rText )
{
  Announced().push_back( i_rText );
}

struct VAssertRecorder::VState
{
  std::mutex Guard;
  std::vector< std::string > Expressions;
  DebugServices::AssertFailHandler Former;
};

VAssertRecorder::VAssertRecorder()
  : m_pState( std::make_shared< VState >() )
{
  m_pState->Former = DebugServices::SetAssertFailHandler(
      [pState = m_pState]( const char* i_pText, const char*, int )
      {
        const std::lock_guard Lock( pState->Guard );
        pState->Expressions.emplace_back( i_pText );
      } );
}

VAssertRecorder::~VAssertRecorder()
{
  DebugServices::SetAssertFailHandler( std::exchange( m_pState->Former, nullptr ) );
}

std::vector< std::string > VAssertRecorder::Expressions() const
{
  const std::lock_guard Lock( m_pState->Guard );
  return m_pState->Expressions;
}

void InstallLogGuard()
{
  ZEK::GlobalLog().SetMaximumLevel( ZEK::ELogDetail );
  ZEK::GlobalLog().AddSink( Ring() );
  testing::UnitTest::GetInstance()->listeners().Append( new VLogListener );
}

} // namespace TestSupport

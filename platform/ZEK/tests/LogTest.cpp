#include <TestSupport/LogGuard.h>

#include <ZEK/DebugServices.h>
#include <ZEK/Log.h>

#include <gtest/gtest.h>

using namespace ZEK;

namespace
{
struct VCounted
{
  mutable int* pCount;
};
std::ostream& operator<<( std::ostream& o_rStream, const VCounted& i_rCounted )
{
  ++*i_rCounted.pCount;
  return o_rStream;
}
} // namespace

TEST( VLog, ATextIsBuiltOnlyWhenItsLevelIsOn )
{
  VLogCategory& rCategory = GlobalLog().Category( "LogTest.Lazy" );
  int Count = 0;
  rCategory.SetMaximumLevel( ELogWarning );
  Log( rCategory, ELogDetail, "%1%", VCounted{ &Count } );
  EXPECT_EQ( Count, 0 );
  Log( rCategory, ELogWarning, "%1%", VCounted{ &Count } );
  EXPECT_EQ( Count, 1 );
  EXPECT_EQ( &GlobalLog().Category( "LogTest.Lazy" ), &rCategory );
}

TEST( VLog, ATemplateThatDoesNotFitGivesTheFallbackLine )
{
  VLogCategory& rCategory = GlobalLog().Category( "LogTest.Format" );
  Log( rCategory, ELogWarning, "%2% after %1%", "one", 2 );
  Log( rCategory, ELogWarning, "only %1%", 1, 2 );
  Log( rCategory, ELogWarning, "%1% and %2%", 1 );
  const std::vector< std::string > Expected{ "2 after one", "Cannot Format Log Message \"only %1%\"",
                                             "Cannot Format Log Message \"%1% and %2%\"" };
  EXPECT_EQ( TestSupport::LogTexts( "LogTest.Format", ELogWarning ), Expected );
}

TEST( VLog, TheRingKeepsTheNewestLinesAndCountsAll )
{
  VLogRing Ring( 2 );
  for ( const char* pText : { "a", "b", "c" } )
  {
    Ring.Take( { {}, "x", 3, pText } );
  }
  ASSERT_EQ( Ring.Lines().size(), 2u );
  EXPECT_EQ( Ring.Lines().front().Text, "b" );
  EXPECT_EQ( Ring.Count(), 3u );
}

TEST( DebugServices, AReplacedHandlerReceivesTheExpression )
{
  const TestSupport::VAssertRecorder Recorder;
  EXPECT_FALSE( DebugServices::Check( false, "It != m_ItemCacheMap.end()", __FILE__, __LINE__ ) );
  EXPECT_TRUE( DebugServices::Check( true, "never", __FILE__, __LINE__ ) );
  EXPECT_EQ( Recorder.Expressions(), std::vector< std::string >{ "It != m_ItemCacheMap.end()" } );
}

TEST( DebugServicesDeathTest, TheDefaultHandlerEndsTheProgramWithTheText )
{
  EXPECT_DEATH( DebugServices::CallAssertFailHandler( "pStateCacheContext", "File.cpp", 7 ),
                "Assertion failed: pStateCacheContext \\(File.cpp:7\\)" );
}

#include <TestSupport/LogGuard.h>

#include <gtest/gtest.h>

int main( int i_Count, char** i_ppArguments )
{
  testing::InitGoogleTest( &i_Count, i_ppArguments );
  TestSupport::InstallLogGuard();
  return RUN_ALL_TESTS();
}

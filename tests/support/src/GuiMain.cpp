#include <HarrowPluginInterface/GraphicsSetUp.h>
#include <TestSupport/LogGuard.h>

#include <QtWidgets/QApplication>

#include <gtest/gtest.h>

// The same surface and sharing that the host asks for, before the application object exists.
int main( int i_Count, char** i_ppArguments )
{
  testing::InitGoogleTest( &i_Count, i_ppArguments );
  HarrowPluginInterface::SetUpGraphics();
  QApplication Application( i_Count, i_ppArguments );
  TestSupport::InstallLogGuard();
  return RUN_ALL_TESTS();
}

#pragma once

#include <ZEK/Log.h>

#include <memory>
#include <string>
#include <vector>

namespace TestSupport
{

/// The lines that were logged since the current test began.
std::vector< ZEK::VLogLine > LogLines();

/// The texts of the lines of that category and level since the current test began.
std::vector< std::string > LogTexts( const std::string& i_rCategory, int i_Level );

/// Announces a line of level 2 that the current test provokes: without it, such a line fails the test.
void ExpectFailureLine( const std::string& i_rText );

/// Makes failed assertions be recorded, for one test, instead of ending the process.
class VAssertRecorder
{
public:
  VAssertRecorder();
  ~VAssertRecorder();
  std::vector< std::string > Expressions() const;

private:
  struct VState;
  std::shared_ptr< VState > m_pState;
};

/// Adds the listener behind the functions above to GoogleTest. Called by the mains.
void InstallLogGuard();

} // namespace TestSupport

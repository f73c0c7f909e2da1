#pragma once

#include <filesystem>

namespace TestSupport
{

/// The root of the sources, for test data that is kept in the project.
std::filesystem::path SourceDir();
/// The root of the build, where bin/ and lib/ lie.
std::filesystem::path BinaryDir();
/// The folder of real recordings beside the checkout; empty when it is not there. Override: HARROW_TEST_DATA.
std::filesystem::path RecordingsDir();

/// A folder of its own for a test, removed at the end.
class VTemporaryDir
{
public:
  VTemporaryDir();
  ~VTemporaryDir();
  const std::filesystem::path& Path() const { return m_Path; }

private:
  std::filesystem::path m_Path;
};

} // namespace TestSupport

/// Leaves a test with a clear line where the real recordings are absent.
#define HARROW_NEEDS_RECORDINGS()                                                                                      \
  if ( TestSupport::RecordingsDir().empty() )                                                                          \
  GTEST_SKIP() << "the real recordings are not here (set HARROW_TEST_DATA to their folder)"

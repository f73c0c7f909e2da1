set( HostSourcesReaderSources
  src/C3dLayout.cpp src/C3dNumbers.cpp src/C3dParameters.cpp src/ForcePlates.cpp src/Labels.cpp src/ReadRecording.cpp
  src/RecordingInfo.cpp src/RecordingSubjects.cpp src/Units.cpp src/UpAxis.cpp src/VByteSource.cpp src/VC3dReader.cpp
  src/VRecordingSource.cpp src/VTrcReader.cpp )
set( HostSourcesReaderTests
  tests/C3dDamageTest.cpp tests/C3dFormsTest.cpp tests/ForcePlateTest.cpp tests/ReadRecordingTest.cpp
  tests/RealC3dTest.cpp tests/RealTrcTest.cpp tests/RecordingSourceTest.cpp tests/TrcTest.cpp )

# Writes C3D files of every form, for tests, benchmarks and the fuzzers' first files.
if( HARROW_BUILD_TESTS OR HARROW_BUILD_BENCHMARKS )
  add_library( HostSourcesC3dWriter STATIC EXCLUDE_FROM_ALL tests/C3dWriter.cpp )
  target_include_directories( HostSourcesC3dWriter PUBLIC tests )
  target_link_libraries( HostSourcesC3dWriter PRIVATE HarrowFlags )
endif()

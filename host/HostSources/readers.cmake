set( HostSourcesReaderSources
  src/BvhSkeleton.cpp src/C3dLayout.cpp src/C3dNumbers.cpp src/C3dParameters.cpp src/ForcePlates.cpp src/Labels.cpp
  src/MotionText.cpp src/OsimFunction.cpp src/OsimJoint.cpp src/OsimModel.cpp src/OsimSkeleton.cpp
  src/ReaderSupport.cpp src/ReadRecording.cpp src/RecordingInfo.cpp src/RecordingInfoSkeletons.cpp
  src/RecordingSkeletons.cpp
  src/RecordingSubjects.cpp src/SkeletonMath.cpp src/UpAxis.cpp src/VBvhReader.cpp src/VByteSource.cpp src/VC3dReader.cpp
  src/VMotionReader.cpp src/VRecordingSource.cpp src/VTrcReader.cpp src/XmlTree.cpp )
set( HostSourcesReaderTests
  tests/BvhTest.cpp
  tests/C3dDamageTest.cpp tests/C3dFormsTest.cpp tests/ForcePlateTest.cpp tests/MotionTest.cpp
  tests/ReadRecordingTest.cpp
  tests/RealC3dTest.cpp tests/RealTrcTest.cpp tests/RecordingSourceTest.cpp tests/TrcTest.cpp )

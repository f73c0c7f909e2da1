set( HostSourcesSimulatedSources
  src/PerformerMesh.cpp src/SimulatedCameraItems.cpp src/SimulatedCameras.cpp src/SimulatedImage.cpp src/SimulatedLens.cpp
  src/SimulatedMarkers.cpp src/SimulatedObjects.cpp src/SimulatedStage.cpp src/SimulatedSubjects.cpp
  src/SimulatedVideo.cpp src/VSimulatedCapture.cpp src/SurfaceNet.cpp src/FramesAround.cpp src/VSourcePump.cpp src/Walker.cpp src/WalkerBody.cpp
  src/WalkerPose.cpp )
set( HostSourcesSimulatedTests tests/PerformerMeshTest.cpp
  tests/SimulatedCamerasTest.cpp tests/SimulatedCaptureTest.cpp tests/SimulatedSubjectsTest.cpp tests/SourcePumpTest.cpp )
set( HostSourcesSimulatedTestLinks ComputeSubjectFK )

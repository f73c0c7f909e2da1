set( HostSourcesSimulatedSources
  src/SimulatedCameraItems.cpp src/SimulatedCameras.cpp src/SimulatedImage.cpp src/SimulatedLens.cpp
  src/SimulatedMarkers.cpp src/SimulatedStage.cpp src/SimulatedVideo.cpp src/VSimulatedCapture.cpp src/VSourcePump.cpp src/Walker.cpp )
set( HostSourcesSimulatedTests tests/SimulatedCamerasTest.cpp tests/SimulatedCaptureTest.cpp tests/SourcePumpTest.cpp )

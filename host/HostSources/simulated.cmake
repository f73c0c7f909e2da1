set( HostSourcesSimulatedSources src/SimulatedStage.cpp src/VSimulatedCapture.cpp src/VSourcePump.cpp src/Walker.cpp )
set( HostSourcesSimulatedTests tests/SimulatedCaptureTest.cpp tests/SourcePumpTest.cpp )

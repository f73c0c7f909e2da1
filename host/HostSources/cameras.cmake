set( HostSourcesCameraSources
  src/CameraCalibrations.cpp src/CameraJson.cpp src/CameraReport.cpp src/CameraToml.cpp src/LensRefit.cpp
  src/PinholeCamera.cpp src/TomlText.cpp )
set( HostSourcesCameraTests tests/CameraCalibrationsTest.cpp )

set( HostSourcesFolderSources
  src/CameraWorld.cpp src/CsvTable.cpp src/DetectionFolders.cpp src/DetectionTables.cpp src/FolderFiles.cpp
  src/RecordingCameras.cpp src/VFolderReader.cpp )
set( HostSourcesFolderTests tests/FolderRecordingTest.cpp )

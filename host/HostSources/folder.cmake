set( HostSourcesFolderSources
  src/CameraWorld.cpp src/CsvTable.cpp src/DetectionFolders.cpp src/DetectionTables.cpp src/FolderFiles.cpp
  src/FolderVideos.cpp src/RecordingCameras.cpp src/RecordingVideos.cpp src/VFolderReader.cpp )
set( HostSourcesFolderTests tests/FolderRecordingTest.cpp tests/FolderVideoTest.cpp )

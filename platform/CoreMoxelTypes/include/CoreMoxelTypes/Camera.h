#pragma once

// What one camera is and sees. Items carry its URN under name selector 2.
// The number beside a structure is the tag of its items.

#include <CoreMoxelTypes/Basic.h>

namespace CoreMoxelTypes
{

/// 0x1000
struct VCameraHardware
{
  std::string Name, Type, DefaultDisplayType, UserDisplayType;
  u32 SensorWidth = 0, SensorHeight = 0;
  f64 PixelAspect = 1;
  bool Video = false;
  f32 MaxRateHz = 0;
};

/// 0x1001 keys read: Name, GammaCorrection, VideoSaturation, Connected, UserId; Enabled, Missing, Contributing,
/// SensorMode, AudioChannels; Threshold (0..255)
struct VCameraSettings
{
  std::map< std::string, VVariant > Values;
};

/// 0x100a
struct VCameraCalibration
{
  D3 Rotation;
  D3 Position; ///< mm
  f64 PrincipalPoint[2]{};
  u32 RadialModel = 0;
  std::vector< f64 > RadialParameters; ///< 1/px^2,1/px^4,1/px^6
  f64 DistortionCentre[2]{};
  f64 FocalLength = 0; ///< px
  f64 Skew = 0;        ///< px
  f64 AspectRatio = 1;
};

/// 0x100b
struct VCameraCalibrationHealth
{
  f64 AvgReprojectionError = 0; ///< px
  f32 Score = 0 /*0 good..1 bad*/, ScoreConfidence = 0;
  u32 NumResiduals = 0;
  f32 CentroidConnectionScore = 0, CentroidConnectionScoreConfidence = 0;
  bool IsBumped = false;
};

/// 0x102f
struct VCameraCalibrationDetails
{
  f32 StartedTemperature = 0, EndedTemperature = 0;
  bool TemperatureSteady = false;
  f64 WhenUtc = 0;
};

/// 0x102d
struct VCameraPhysicalStatus
{
  bool IsBumped = false;
  f32 RollDegrees = 0;
  u32 StatusBits = 0;
};

/// 0x102e
struct VCameraPhysicalSensorData
{
  f32 Temperature = 0;
  V3 Acceleration; ///< g
  f32 TemperatureTolerance = 5;
};

/// 0x1037 bits 0..7 in the order of the eight warning texts of the tile data
struct VDeviceWarnings
{
  u32 Flags = 0;
};

struct VCentroid
{
  f32 x = 0, y = 0, radius = 0; ///< px
  u32 Id = 0;
  u8 Generator = 0; ///< 0 greyscale fit,1 hardware,2 edge
  u8 Quality = 0;
  u16 Blob = 0;
};

/// 0x1003
struct VCentroidSet
{
  std::vector< VCentroid > Centroids;
};

/// 0xFFFFFFFF = none
struct VCentroidLabel
{
  u32 SubjectId = 0xFFFFFFFF, MarkerId = 0xFFFFFFFF;
};

/// 0x1022 by centroid index
struct VCentroidLabelSet
{
  std::vector< VCentroidLabel > Labels;
};

/// 0x100c by centroid index; -1 none
struct VCentroidAssignmentSet
{
  std::vector< i32 > Reconstruction;
};

/// span of one row; First = index into Pixels
struct VGreyscaleLine
{
  u16 x = 0, y = 0, length = 0;
  u32 First = 0;
};

struct VGreyscaleBlob
{
  u32 FirstLine = 0, LineCount = 0;
  i32 Centroid = -1;
};

/// 0x1005
struct VGreyscaleBlobSet
{
  bool Complete = false;                        ///< GetGreyscaleFlag
  V2 SensorOffset{ 0, 0 }, SensorScale{ 1, 1 }; // sensor = offset + scale*image
  std::vector< VGreyscaleBlob > Blobs;
  std::vector< VGreyscaleLine > Lines;
  std::vector< u8 > Pixels;
};

struct VEdgePair
{
  u16 y = 0;
  f32 Left = 0, Right = 0;
  u8 GreyLeft = 0, GreyRight = 0;
};

/// 0x1006
struct VEdgePairSet
{
  V2 SensorOffset{ 0, 0 }, SensorScale{ 1, 1 };
  std::vector< VEdgePair > Pairs;
};

/// 0x1002 row-major, 0xFF masked
struct VCameraMaskGrid
{
  u16 Columns = 0, Rows = 0, CellWidth = 0, CellHeight = 0; ///< px
  std::vector< u8 > Cells;
};

/// 0x1015
struct VCameraWand2d
{
  struct P
  {
    f32 x = 0, y = 0;
    i32 Frame = 0;
  };
  std::vector< P > Points;
};

enum class EPixelFormat : u32
{
  Luminance8,
  Luminance16,
  BayerRGGB8,
  BayerGRBG8,
  BayerGBRG8,
  BayerBGGR8,
  YUYV,
  UYVY,
  I420,
  NV12
};
/// 0x1007
struct VVideoFrame
{
  EPixelFormat Format = EPixelFormat::Luminance8;
  u32 Width = 0, Height = 0;
  u32 Stride[3]{};
  u32 Offset[3]{};
  u32 Flags = 0; ///< bit0 bottom-up, bit1 = GetVideoFlag
  V2 SensorOffset{ 0, 0 }, SensorScale{ 1, 1 };
  f64 PresentationTime = 0;
  std::shared_ptr< const std::vector< u8 > > Data;
};

/// 0x1026 (count of channels only)
struct VAudioFrame
{
  u32 Rate = 0, Channels = 0;
  std::vector< f32 > Samples;
};

/// 0x1058
struct VImageSet
{
  struct I
  {
    std::string Tag;
    u32 Width = 0, Height = 0, Components = 0;
    std::vector< u8 > Data;
  };
  std::vector< I > Images;
  std::vector< std::string > Identifiers;
};

} // namespace CoreMoxelTypes

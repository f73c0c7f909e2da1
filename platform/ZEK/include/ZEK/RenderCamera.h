#pragma once

#include <array>
#include <cstdint>
#include <memory>
#include <span>
#include <string>
#include <vector>

namespace CoreMoxelTypes
{
struct VImageSet;
struct VVideoFrame;
} // namespace CoreMoxelTypes
namespace ComputeCameraModel
{
struct VCameraModel;
}

namespace ZEK
{

/// A 4 by 4 matrix, column-major, as OpenGL takes it.
using VMatrix4 = std::array< float, 16 >;

/// How the centroids of a camera are coloured.
enum ECentroidColourScheme : std::uint32_t
{
  EColourConnection = 0, ///< by what the centroid was assigned to
  EColourGenerator = 1,  ///< by what found the centroid
  EColourMarker = 2      ///< by the marker that the centroid was labelled as
};

/// A centroid, or another dot, as programs draw it; px.
struct VCentroidVertex
{
  float X = 0, Y = 0, Radius = 0;
  std::uint32_t Colour = 0; ///< RGBA in memory
};

/// A run of spans of one grey blob, one span a row, without a gap between rows. The span of row y is line
/// `FirstLine` + y - `Top`. The box is in image pixels, its ends included.
struct VGreyscaleRecord
{
  std::uint16_t Left = 0, Top = 0, Right = 0, Bottom = 0;
  std::uint32_t FirstLine = 0;
  std::uint32_t Camera = 0; ///< number of the camera in its provider's list
};

/// A span of grey pixels in one row.
struct VGreyscaleSpan
{
  std::uint16_t X = 0, Length = 0;
  std::uint32_t FirstByte = 0; ///< of `VGreyscaleData::Pixels`
};

/// The grey blobs of a camera, ready to be written into one buffer.
struct VGreyscaleData
{
  std::vector< VGreyscaleRecord > Records;
  std::vector< std::uint32_t > Blobs; ///< by record: index of the blob in its camera
  std::vector< VGreyscaleSpan > Lines;
  std::span< const std::uint8_t > Pixels; ///< of the camera's item: good until the provider's next update
  /// From image to sensor pixels: x and y of the offset, then of the scale.
  std::array< float, 4 > OffsetScale{ 0, 0, 1, 1 };
};

/// Whoever keeps a buffer has it unchanged; one that nobody keeps is filled again in place.
template < typename T >
using VDrawBuffer = std::shared_ptr< const T >;
using VDrawWords = VDrawBuffer< std::vector< std::uint32_t > >;
using VDrawVertices = VDrawBuffer< std::vector< VCentroidVertex > >;

/// What a camera's own view draws its data from; nothing is null. Raw sensor pixels.
struct VCameraLists2D
{
  VDrawVertices pCentroids;
  VDrawWords pIds; ///< selection words, one a centroid
  VDrawBuffer< VGreyscaleData > pGreyscale;
  /// Another number: another content, among all cameras.
  std::uint64_t Generation = 0, IdGeneration = 0;
};

/// What the 3D view draws a camera's data from; nothing is null. Sensor pixels that are corrected for the lens, for the
/// programs that take them to the plane z = 1 of the frustum.
struct VCameraLists3D
{
  VDrawVertices pCentroids;
  VDrawVertices pGreyscale; ///< a vertex a span of grey pixels, of the grey in its middle
  std::uint64_t Generation = 0, IdGeneration = 0;
};

/// What views need to know of a camera beside its model.
struct VRenderCameraInfo
{
  bool bCalibrated = false; ///< else the model holds what it was last given, and nothing is drawn with it
  bool bVideo = false;
  bool bConnected = true;
  std::uint32_t SensorWidth = 0, SensorHeight = 0; ///< px
  double PixelAspect = 1;
  double ImageAspect = 1;
  float GammaCorrection = 1;
  float VideoSaturation = 1;
  std::int32_t UserId = -1;
  std::array< float, 3 > Position{}; ///< of the drawn body: 50 mm behind the optical centre
  std::string DisplayType;
  std::uint32_t Number = 0;          ///< in the provider's list
  std::uint32_t FirstCentroidId = 0; ///< selection ids in the present state; 0: nothing to pick
  std::uint32_t FirstBlobId = 0;
  std::int32_t ChangeCount = 0; ///< grows with each change of what stands here, of the name and of the model
};

/// One optical camera as the views need it. Thread: render thread.
class IRenderCamera
{
public:
  virtual ~IRenderCamera() = default;
  /// The device URN.
  virtual const std::string& GetName() const = 0;
  virtual const ComputeCameraModel::VCameraModel& GetModel() const = 0;
  /// The setting "Name".
  virtual const std::string& GetDisplayName() const = 0;
  /// Whether the newest grey blobs are complete.
  virtual bool GetGreyscaleFlag() const = 0;
  /// Bit 1 of the flags of the newest video frame.
  virtual bool GetVideoFlag() const = 0;
  /// Null when there is none; good until the provider's next update.
  virtual const CoreMoxelTypes::VVideoFrame* GetVideoFrame() const = 0;
  /// Null when there is none; good until the provider's next update. Another `o_rId`: another content.
  virtual const CoreMoxelTypes::VImageSet* GetImageSet( std::uint64_t& /*o_rId*/ ) const { return nullptr; }
  /// `i_Id` is the first selection id of the camera's centroids; 0: none can be picked. `o_rColours` has one colour a
  /// centroid after the scheme `i_Mode`. Grey blobs are listed with `i_bWide` only.
  virtual void GetDrawData2D( std::uint32_t i_Id, ECentroidColourScheme i_Mode, bool i_bWide, VCameraLists2D& o_rLists,
                              VDrawWords& o_rColours ) const = 0;
  /// Without a vertex for a camera that is not calibrated. `i_Colours` is the scheme of the vertices' colours.
  virtual void GetDrawData3D( VDrawWords& o_rIds, VCameraLists3D& o_rLists, ECentroidColourScheme i_Colours ) const = 0;
  virtual const VRenderCameraInfo& GetInfo() const = 0;
};

using VRenderCameraRef = std::shared_ptr< const IRenderCamera >;

/// The cameras of the present state. Thread: render thread.
class IRenderCameraProvider
{
public:
  virtual ~IRenderCameraProvider() = default;
  /// Empty for a name that is not there.
  virtual VRenderCameraRef GetCamera( const std::string& i_rName ) const = 0;
  /// In the order of the names' bytes; good until the next update.
  virtual const std::vector< VRenderCameraRef >& GetCameras() const = 0;
  /// As long as this is the same number, so is everything that the cameras give. 0: it has to be looked at each time.
  virtual std::uint64_t GetGeneration() const { return 0; }
};

} // namespace ZEK

#pragma once

#include <ComputeCameraModel/VRadialDistortion.h>
#include <CoreMoxelTypes/Camera.h>
#include <CoreMoxelTypes/Reconstruction.h>

#include <array>
#include <cstdint>
#include <limits>
#include <optional>
#include <span>
#include <vector>

namespace Flow2Graphics
{

/// From the world to a camera's raw image, in double precision. A plain value.
class VSensorProjection
{
public:
  /// Of no camera: projects nothing.
  VSensorProjection() = default;
  /// A calibration that views cannot use projects nothing.
  VSensorProjection( const CoreMoxelTypes::VCameraHardware& i_rHardware,
                     const CoreMoxelTypes::VCameraCalibration& i_rCalibration );

  bool IsUsable() const { return m_Lens.has_value(); }
  /// In sensor pixels, (0, 0) the centre of the first, wherever it lies. False for a place that is not in front of the
  /// camera, or that its lens does not bring to the image.
  bool Project( const CoreMoxelTypes::D3& i_rPlace, ComputeCameraModel::VImagePoint& o_rImage ) const;

private:
  std::array< CoreMoxelTypes::D3, 3 > m_Rows{}; ///< of the turn from the world to the camera
  CoreMoxelTypes::D3 m_Position;
  double m_Fx = 0, m_Fy = 0, m_Skew = 0, m_Px = 0, m_Py = 0;
  std::optional< ComputeCameraModel::VRadialDistortion > m_Lens;
};

enum class EContribution : std::uint32_t
{
  Measured,
  Uncalibrated, ///< the camera's centroid is assigned, but nothing tells where the camera stands
  NotInImage    ///< by its calibration the camera cannot see the place
};

/// One centroid that was assigned to a reconstruction.
struct VContribution
{
  std::uint32_t Camera = 0;         ///< index into the cameras
  std::uint32_t Centroid = 0;       ///< index into the camera's centroids
  std::uint32_t Reconstruction = 0; ///< index into the set
  EContribution State = EContribution::Uncalibrated;
  /// Between the centroid and the image of the reconstruction, in the raw image, px; a number where it was measured.
  double Error = std::numeric_limits< double >::quiet_NaN();
};

/// What a camera saw. Each of the three may be null.
struct VContributor
{
  const VSensorProjection* pProjection = nullptr;
  const CoreMoxelTypes::VCentroidSet* pCentroids = nullptr;
  const CoreMoxelTypes::VCentroidAssignmentSet* pAssignments = nullptr;
};

/// Appends the centroids of all cameras that were assigned to one reconstruction, by camera and centroid. An index off
/// the set has none.
void FindContributions( std::span< const VContributor > i_Cameras, const CoreMoxelTypes::VReconstructionSet& i_rSet,
                        std::uint32_t i_Reconstruction, std::vector< VContribution >& io_rFound );
/// Appends what one camera contributes to, by centroid. Assignments to what is not in the set are passed over.
void FindCameraContributions( std::span< const VContributor > i_Cameras,
                              const CoreMoxelTypes::VReconstructionSet& i_rSet, std::uint32_t i_Camera,
                              std::vector< VContribution >& io_rFound );

/// Of an error in px, 0xRRGGBB, on a scale that is the same everywhere: green at 0 px, yellow at 1 px, red from 3 px
/// on, mixed in between; grey for what is no number.
std::uint32_t ReprojectionErrorColour( double i_Error );

} // namespace Flow2Graphics

#pragma once

#include <MoxelGraphics/IRenderType.h>

#include <array>
#include <cstdint>
#include <memory>
#include <span>
#include <vector>

namespace CoreGraphics
{
class VResources;
}

namespace MoxelGraphics
{

/// The centroids of one camera that were assigned.
struct VCameraAssignments
{
  std::array< float, 3 > Centre{}; ///< of the camera's lens, in the world, mm
  std::uint32_t Selected = 0;      ///< not 0: the camera is selected
  std::vector< std::uint32_t >
      Indices; ///< of reconstructions, one a centroid; `NoReconstruction` for one that has none
};

/// A reconstruction that centroids are assigned to.
struct VAssignedReconstruction
{
  std::array< float, 3 > Position{}; ///< mm
  std::uint32_t Selected = 0;        ///< not 0: the reconstruction is selected
};

/// Lines from cameras to the reconstructions that their centroids were assigned to. `ContributionsType` says which:
/// those of selected reconstructions, of selected cameras, of either (of all while neither kind is selected), or those
/// between selected ones of both.
class VRenderCentroidAssignments : public IRenderType
{
public:
  static constexpr std::uint32_t NoReconstruction = 0xFFFFFFFF;

  explicit VRenderCentroidAssignments( std::shared_ptr< CoreGraphics::VResources > i_pResources );
  ~VRenderCentroidAssignments() override;

  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override;

  /// The records of all cameras, sized by whoever fills them. `SetReconstructions` ends the filling.
  std::vector< VCameraAssignments >& Cameras() { return m_Cameras; }
  /// An index past the reconstructions draws nothing, nor does a place that is not finite.
  void SetReconstructions( std::span< const VAssignedReconstruction > i_Reconstructions );
  /// The ends of the lines that a mode shows, two a line, x y z.
  std::span< const float > Lines( int i_ContributionsType );

protected:
  /// Called before lines are made or drawn, and not while there are none to show: the place to fill what has changed.
  virtual void FillRecords() {}

private:
  struct VGl;
  std::unique_ptr< VGl > m_pGl;
  std::vector< VCameraAssignments > m_Cameras;
  std::vector< VAssignedReconstruction > m_Reconstructions;
  std::vector< float > m_Lines;
  int m_LinesType = 0; ///< that `m_Lines` were made for
  std::uint64_t m_Generation = 1;
};

} // namespace MoxelGraphics

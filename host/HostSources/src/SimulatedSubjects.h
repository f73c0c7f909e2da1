#pragma once

#include "SimulatedItems.h"
#include "SimulatedMarkers.h"

#include <CoreMoxelTypes/FlowTypes.h>

#include <memory>
#include <string>
#include <vector>

namespace HostSources::Simulation
{

/// The mesh that performers wear, and that of the characters that they drive, by their names in the cache of meshes.
inline constexpr const char* PerformerSkin = "performer";
inline constexpr const char* CharacterSkin = "character";

/// The items of performers, of the prop and of the wand. The poses are those of the bodies that markers are on, so that
/// a solved marker is off the labelled one by what the skin moves and by the noise.
class VSimulatedSubjects
{
public:
  /// Keeps both.
  VSimulatedSubjects( const VSimulatedCaptureOptions& i_rOptions, const VMarkerStage& i_rStage );

  void AddSlowItems( VItemMaker& io_rMaker, std::vector< ZEK::VFlowItemRef >& io_rSlow ) const;
  /// Of the stage's markers, after their reconstructions were made.
  void AddFrame( double i_Seconds, const std::vector< VWalkerPose >& i_rPoses,
                 const std::vector< VStageMarker >& i_rMarkers, const CoreMoxelTypes::VReconstructionSet& i_rPoints,
                 VItemMaker& io_rMaker, ZEK::IFlowState& io_rState );

private:
  using VParameters = CoreMoxelTypes::VSubjectDynamicParameters;
  /// What the labels of one performer say in a frame.
  struct VSeen
  {
    std::array< D3, WalkerMarkers > Positions;
    std::array< CoreMoxelTypes::u8, WalkerMarkers > Visible;
    std::array< CoreMoxelTypes::u8, WalkerMarkers > Good; ///< visible, and not another's
  };
  /// One who is drawn in another manner too.
  struct VSecond
  {
    std::string Name;
    CoreMoxelTypes::VSubject Subject;
    VWalkerBody Body;
  };

  void AddPerformer( std::uint32_t i_Performer, VItemMaker& io_rMaker,
                     std::vector< ZEK::VFlowItemRef >& io_rSlow ) const;
  void AddObjects( VItemMaker& io_rMaker, std::vector< ZEK::VFlowItemRef >& io_rSlow ) const;
  void See( std::uint32_t i_Performer, const std::vector< VStageMarker >& i_rMarkers,
            const CoreMoxelTypes::VReconstructionSet& i_rPoints );
  void FillSeen( const CoreMoxelTypes::VSubject& i_rSubject, VParameters& io_rParameters ) const;
  void FillPose( const VSecond& i_rSecond, const VWalkerState& i_rState, VParameters& o_rParameters );
  void AddProp( double i_Seconds, VItemMaker& io_rMaker, ZEK::IFlowState& io_rState ) const;
  void AddWand( double i_Seconds, VItemMaker& io_rMaker, ZEK::IFlowState& io_rState ) const;

  const VSimulatedCaptureOptions& m_rOptions;
  const VMarkerStage& m_rStage;
  std::vector< std::string > m_Names;  ///< of the performers
  std::vector< VSecond > m_Solving;    ///< by performer, if that is on
  std::vector< VSecond > m_Characters; ///< by performer, if retargeting is on
  VSeen m_Seen;                        ///< of the performer being made
  std::vector< ComputeSubject::VRigidTransform > m_Bones;
};

} // namespace HostSources::Simulation

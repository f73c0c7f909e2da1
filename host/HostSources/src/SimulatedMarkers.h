#pragma once

#include "SimulatedObjects.h"

#include <HostSources/VSimulatedCapture.h>

#include <cstdint>
#include <vector>

namespace HostSources::Simulation
{

inline constexpr std::uint32_t NoSubject = 0xFFFFFFFF;
inline constexpr double MarkerRadius = 7; ///< mm

/// What a random number is for; keeps the streams apart.
enum EStream : std::uint64_t
{
  EStreamNoise = 1,
  EStreamGap,
  EStreamExtra,
  EStreamRays,
  EStreamSwap
};

/// A marker where it truly is, without the noise of a reconstruction.
struct VStageMarker
{
  D3 Position;
  D3 Outward; ///< away from the body that it sits on, length 1; (0, 0, 0) where nothing is in the way
  std::uint32_t Number = 0;
  std::uint32_t SubjectId = NoSubject, MarkerId = NoSubject; ///< of the label that it gets
  std::uint32_t Colour = 0xFFE8E8E8;                         ///< in a video
  bool bSwapped = false;                                     ///< the label is another marker's
  bool bLost = false;                                        ///< in a gap: it gives no reconstruction
  std::int32_t Reconstruction = -1;                          ///< set by whoever reconstructs
};

/// All markers of the capture at any time, and the people that most of them are on.
class VMarkerStage
{
public:
  explicit VMarkerStage( const VSimulatedCaptureOptions& i_rOptions );

  /// A performer's markers stand one after the other, the first performer's first. `o_pPoses`, if not null, has a place
  /// for each performer.
  void At( double i_Seconds, std::vector< VStageMarker >& o_rMarkers, VWalkerPose* o_pPoses = nullptr ) const;
  const std::vector< VWalkerStyle >& Styles() const { return m_Styles; }
  const VWalkerBody& Body( std::size_t i_Performer ) const { return m_Bodies[i_Performer]; }
  std::size_t MostMarkers() const;

private:
  bool IsInGap( std::uint32_t i_Number, double i_Seconds ) const;
  void AddPerformer( std::uint32_t i_Performer, double i_Seconds, const VWalkerPose& i_rPose,
                     std::vector< VStageMarker >& io_rMarkers ) const;
  void SwapLabels( std::uint32_t i_Performer, double i_Seconds, VStageMarker* io_pMarkers ) const;
  void AddObjects( double i_Seconds, std::vector< VStageMarker >& io_rMarkers ) const;
  void AddExtraPoints( double i_Seconds, std::vector< VStageMarker >& io_rMarkers ) const;

  const VSimulatedCaptureOptions& m_rOptions;
  const VHash m_Hash;
  std::vector< VWalkerStyle > m_Styles;
  std::vector< VWalkerBody > m_Bodies;
};

} // namespace HostSources::Simulation

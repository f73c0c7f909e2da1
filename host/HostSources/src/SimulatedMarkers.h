#pragma once

#include "Walker.h"

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
  EStreamRays
};

/// A marker where it truly is, without the noise of a reconstruction.
struct VStageMarker
{
  D3 Position;
  D3 Outward; ///< away from the body that it sits on, length 1; (0, 0, 0) where nothing is in the way
  std::uint32_t Number = 0;
  std::uint32_t SubjectId = NoSubject, MarkerId = NoSubject;
  bool bLost = false;               ///< in a gap: it gives no reconstruction
  std::int32_t Reconstruction = -1; ///< set by whoever reconstructs
};

/// All markers of the capture at any time.
class VMarkerStage
{
public:
  explicit VMarkerStage( const VSimulatedCaptureOptions& i_rOptions );

  void At( double i_Seconds, std::vector< VStageMarker >& o_rMarkers ) const;
  const std::vector< VWalkerStyle >& Styles() const { return m_Styles; }
  std::size_t MostMarkers() const;

private:
  bool IsInGap( std::uint32_t i_Number, double i_Seconds ) const;
  void AddPerformer( std::uint32_t i_Performer, double i_Seconds, std::vector< VStageMarker >& io_rMarkers ) const;
  void AddExtraPoints( double i_Seconds, std::vector< VStageMarker >& io_rMarkers ) const;

  const VSimulatedCaptureOptions& m_rOptions;
  const VHash m_Hash;
  std::vector< VWalkerStyle > m_Styles;
};

} // namespace HostSources::Simulation

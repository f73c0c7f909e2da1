#pragma once

#include "VItemPool.h"

#include <CoreMoxelTypes/FlowTypes.h>

#include <tuple>
#include <utility>

namespace HostFlow
{

/// The vectors of a frequent payload, which keep their room from one use to the next.
template < typename T >
inline constexpr auto KeptVectors = std::tuple();

template <>
inline constexpr auto
    KeptVectors< CoreMoxelTypes::VCentroidSet > = std::tuple( &CoreMoxelTypes::VCentroidSet::Centroids );
template <>
inline constexpr auto
    KeptVectors< CoreMoxelTypes::VCentroidLabelSet > = std::tuple( &CoreMoxelTypes::VCentroidLabelSet::Labels );
template <>
inline constexpr auto KeptVectors< CoreMoxelTypes::VCentroidAssignmentSet > =
    std::tuple( &CoreMoxelTypes::VCentroidAssignmentSet::Reconstruction );
template <>
inline constexpr auto
    KeptVectors< CoreMoxelTypes::VGreyscaleBlobSet > = std::tuple( &CoreMoxelTypes::VGreyscaleBlobSet::Blobs,
                                                                   &CoreMoxelTypes::VGreyscaleBlobSet::Lines,
                                                                   &CoreMoxelTypes::VGreyscaleBlobSet::Pixels );
template <>
inline constexpr auto KeptVectors< CoreMoxelTypes::VEdgePairSet > = std::tuple( &CoreMoxelTypes::VEdgePairSet::Pairs );
template <>
inline constexpr auto
    KeptVectors< CoreMoxelTypes::VCameraWand2d > = std::tuple( &CoreMoxelTypes::VCameraWand2d::Points );
template <>
inline constexpr auto KeptVectors< CoreMoxelTypes::VAudioFrame > = std::tuple( &CoreMoxelTypes::VAudioFrame::Samples );
template <>
inline constexpr auto
    KeptVectors< CoreMoxelTypes::VReconstructionSet > = std::tuple( &CoreMoxelTypes::VReconstructionSet::Items );
template <>
inline constexpr auto KeptVectors< CoreMoxelTypes::VReconstructionLabelSet > =
    std::tuple( &CoreMoxelTypes::VReconstructionLabelSet::Labels );
template <>
inline constexpr auto KeptVectors< CoreMoxelTypes::VReconstructionTrackSet > =
    std::tuple( &CoreMoxelTypes::VReconstructionTrackSet::Tracks );
template <>
inline constexpr auto KeptVectors< CoreMoxelTypes::VSubjectDynamicParameters > = std::tuple(
    &CoreMoxelTypes::VSubjectDynamicParameters::JointState, &CoreMoxelTypes::VSubjectDynamicParameters::Segments,
    &CoreMoxelTypes::VSubjectDynamicParameters::MarkerPositions,
    &CoreMoxelTypes::VSubjectDynamicParameters::MarkerVisible,
    &CoreMoxelTypes::VSubjectDynamicParameters::SegmentHealth );
template <>
inline constexpr auto
    KeptVectors< CoreMoxelTypes::VLabelledRotationSet > = std::tuple( &CoreMoxelTypes::VLabelledRotationSet::Items );
template <>
inline constexpr auto KeptVectors< CoreMoxelTypes::VRigidObjectDynamicParameters > =
    std::tuple( &CoreMoxelTypes::VRigidObjectDynamicParameters::MarkerVisible );
template <>
inline constexpr auto
    KeptVectors< CoreMoxelTypes::VDeviceSamples > = std::tuple( &CoreMoxelTypes::VDeviceSamples::Wrench );
template <>
inline constexpr auto KeptVectors< CoreMoxelTypes::VSceneMeshDynamicParameters > =
    std::tuple( &CoreMoxelTypes::VSceneMeshDynamicParameters::Bones );

/// Gives every field its first value.
template < typename T >
void ResetPayloadOf( T& io_rPayload )
{
  T Fresh;
  std::apply(
      [&]( auto... i_pVectors )
      {
        ( ( ( io_rPayload.*i_pVectors ).clear(), std::swap( Fresh.*i_pVectors, io_rPayload.*i_pVectors ) ), ... );
      },
      KeptVectors< T > );
  io_rPayload = std::move( Fresh );
}

template < typename T >
class VTypedItem final : public VPooledItem
{
public:
  explicit VTypedItem( VItemPool& i_rPool )
    : VPooledItem( i_rPool )
  {
    SetValue( *this );
  }

  const void* Payload() const override { return &m_Payload; }
  void* MutablePayload() override { return &m_Payload; }
  const std::type_info& PayloadType() const override { return typeid( T ); }

private:
  void ResetPayload() override { ResetPayloadOf( m_Payload ); }

  T m_Payload{};
};

} // namespace HostFlow

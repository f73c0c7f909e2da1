#pragma once

#include "VItemPool.h"

#include <CoreMoxelTypes/FlowTypes.h>

#include <utility>
#include <vector>

namespace HostFlow
{

/// Gives every field its first value; the vectors named keep their room.
template < typename T, typename... TMembers >
void ResetKeeping( T& io_rPayload, std::vector< TMembers > T::*... i_pMembers )
{
  T Fresh;
  ( ( ( io_rPayload.*i_pMembers ).clear(), std::swap( Fresh.*i_pMembers, io_rPayload.*i_pMembers ) ), ... );
  io_rPayload = std::move( Fresh );
}

template < typename T >
void ResetPayloadOf( T& io_rPayload )
{
  io_rPayload = T();
}

inline void ResetPayloadOf( CoreMoxelTypes::VCentroidSet& io_rPayload )
{
  io_rPayload.Centroids.clear();
}
inline void ResetPayloadOf( CoreMoxelTypes::VCentroidLabelSet& io_rPayload )
{
  io_rPayload.Labels.clear();
}
inline void ResetPayloadOf( CoreMoxelTypes::VCentroidAssignmentSet& io_rPayload )
{
  io_rPayload.Reconstruction.clear();
}
inline void ResetPayloadOf( CoreMoxelTypes::VGreyscaleBlobSet& io_rPayload )
{
  using T = CoreMoxelTypes::VGreyscaleBlobSet;
  ResetKeeping( io_rPayload, &T::Blobs, &T::Lines, &T::Pixels );
}
inline void ResetPayloadOf( CoreMoxelTypes::VEdgePairSet& io_rPayload )
{
  ResetKeeping( io_rPayload, &CoreMoxelTypes::VEdgePairSet::Pairs );
}
inline void ResetPayloadOf( CoreMoxelTypes::VCameraWand2d& io_rPayload )
{
  io_rPayload.Points.clear();
}
inline void ResetPayloadOf( CoreMoxelTypes::VAudioFrame& io_rPayload )
{
  ResetKeeping( io_rPayload, &CoreMoxelTypes::VAudioFrame::Samples );
}
inline void ResetPayloadOf( CoreMoxelTypes::VReconstructionSet& io_rPayload )
{
  io_rPayload.Items.clear();
}
inline void ResetPayloadOf( CoreMoxelTypes::VReconstructionLabelSet& io_rPayload )
{
  io_rPayload.Labels.clear();
}
inline void ResetPayloadOf( CoreMoxelTypes::VReconstructionTrackSet& io_rPayload )
{
  io_rPayload.Tracks.clear();
}
inline void ResetPayloadOf( CoreMoxelTypes::VSubjectDynamicParameters& io_rPayload )
{
  using T = CoreMoxelTypes::VSubjectDynamicParameters;
  ResetKeeping( io_rPayload, &T::JointState, &T::Segments, &T::MarkerPositions, &T::MarkerVisible, &T::SegmentHealth );
}
inline void ResetPayloadOf( CoreMoxelTypes::VLabelledRotationSet& io_rPayload )
{
  io_rPayload.Items.clear();
}
inline void ResetPayloadOf( CoreMoxelTypes::VRigidObjectDynamicParameters& io_rPayload )
{
  ResetKeeping( io_rPayload, &CoreMoxelTypes::VRigidObjectDynamicParameters::MarkerVisible );
}
inline void ResetPayloadOf( CoreMoxelTypes::VDeviceSamples& io_rPayload )
{
  ResetKeeping( io_rPayload, &CoreMoxelTypes::VDeviceSamples::Wrench );
}
inline void ResetPayloadOf( CoreMoxelTypes::VSceneMeshDynamicParameters& io_rPayload )
{
  ResetKeeping( io_rPayload, &CoreMoxelTypes::VSceneMeshDynamicParameters::Bones );
}

template < typename T >
class VTypedItem final : public VPooledItem
{
public:
  using VPooledItem::VPooledItem;

  const void* Payload() const override { return &m_Payload; }
  void* MutablePayload() override { return &m_Payload; }
  const std::type_info& PayloadType() const override { return typeid( T ); }

private:
  void ResetPayload() override { ResetPayloadOf( m_Payload ); }

  T m_Payload{};
};

} // namespace HostFlow

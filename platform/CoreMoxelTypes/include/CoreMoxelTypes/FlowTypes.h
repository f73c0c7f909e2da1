#pragma once

// One tag structure a kind of item. `ZEK::FlowValueType< CoreMoxelTypes::FlowSubject >` gives its descriptor and its
// core type. Several kinds share a core type, so the tag structure is the key, never the core type.

#include <CoreMoxelTypes/Camera.h>
#include <CoreMoxelTypes/Device.h>
#include <CoreMoxelTypes/Reconstruction.h>
#include <CoreMoxelTypes/Subject.h>

#include <ZEK/FlowState.h>

#include <tuple>

namespace CoreMoxelTypes
{

struct FlowParametersItem;
struct FlowCameraHardware;
struct FlowCameraSettings;
struct FlowCameraMaskGrid;
struct FlowCentroidSet;
struct FlowGreyscaleBlobSet;
struct FlowEdgePairSet;
struct FlowVideoFrame;
struct FlowCameraCalibration;
struct FlowCameraCalibrationHealth;
struct FlowCentroidAssignmentSet;
struct FlowReconstructionSet;
struct FlowReconstructionTrackSet;
struct FlowReconstructionLabelSet;
struct FlowSubjectDynamicParameters;
struct FlowSubject;
struct FlowSubjectApplicationData;
struct FlowCameraWand2d;
struct FlowGeometrySet;
struct FlowSubjectParametrised;
struct FlowSubjectForSolving;
struct FlowSubjectApplicationDataForSolving;
struct FlowSubjectDynamicParametersForSolving;
struct FlowReconstructionSetForSolving;
struct FlowReconstructionLabelSetForSolving;
struct FlowCentroidLabelSet;
struct FlowDevice;
struct FlowDeviceApplicationData;
struct FlowDeviceSamples;
struct FlowAudioFrame;
struct FlowSubjectSettings;
struct FlowWorldAxis;
struct FlowSubjectTemplate;
struct FlowSubjectParametrisedForSolving;
struct FlowCameraPhysicalStatus;
struct FlowCameraPhysicalSensorData;
struct FlowCameraCalibrationDetails;
struct FlowSubjectTemplateForSolving;
struct FlowVolumeProperties;
struct FlowLabelledRotationSet;
struct FlowRigidObjectDynamicParameters;
struct FlowRigidObject;
struct FlowRigidObjectApplicationData;
struct FlowCameraWarnings;
struct FlowSubjectForRetargeting;
struct FlowSubjectApplicationDataForRetargeting;
struct FlowSubjectDynamicParametersForRetargeting;
struct FlowSubjectTemplateForRetargeting;
struct FlowLabelledRotationSetForSolving;
struct FlowSmartObject;
struct FlowSceneMesh;
struct FlowSceneMeshApplicationData;
struct FlowSceneMeshDynamicParameters;
struct FlowSceneMeshSettings;
struct FlowImageSet;

/// Every kind, ascending by tag.
using VAllFlowTypes = std::tuple<
    FlowParametersItem*, FlowCameraHardware*, FlowCameraSettings*, FlowCameraMaskGrid*, FlowCentroidSet*,
    FlowGreyscaleBlobSet*, FlowEdgePairSet*, FlowVideoFrame*, FlowCameraCalibration*, FlowCameraCalibrationHealth*,
    FlowCentroidAssignmentSet*, FlowReconstructionSet*, FlowReconstructionTrackSet*, FlowReconstructionLabelSet*,
    FlowSubjectDynamicParameters*, FlowSubject*, FlowSubjectApplicationData*, FlowCameraWand2d*, FlowGeometrySet*,
    FlowSubjectParametrised*, FlowSubjectForSolving*, FlowSubjectApplicationDataForSolving*,
    FlowSubjectDynamicParametersForSolving*, FlowReconstructionSetForSolving*, FlowReconstructionLabelSetForSolving*,
    FlowCentroidLabelSet*, FlowDevice*, FlowDeviceApplicationData*, FlowDeviceSamples*, FlowAudioFrame*,
    FlowSubjectSettings*, FlowWorldAxis*, FlowSubjectTemplate*, FlowSubjectParametrisedForSolving*,
    FlowCameraPhysicalStatus*, FlowCameraPhysicalSensorData*, FlowCameraCalibrationDetails*,
    FlowSubjectTemplateForSolving*, FlowVolumeProperties*, FlowLabelledRotationSet*, FlowRigidObjectDynamicParameters*,
    FlowRigidObject*, FlowRigidObjectApplicationData*, FlowCameraWarnings*, FlowSubjectForRetargeting*,
    FlowSubjectApplicationDataForRetargeting*, FlowSubjectDynamicParametersForRetargeting*,
    FlowSubjectTemplateForRetargeting*, FlowLabelledRotationSetForSolving*, FlowSmartObject*, FlowSceneMesh*,
    FlowSceneMeshApplicationData*, FlowSceneMeshDynamicParameters*, FlowSceneMeshSettings*, FlowImageSet* >;

} // namespace CoreMoxelTypes

namespace ZEK
{

template <>
struct FlowValueType< CoreMoxelTypes::FlowParametersItem >
{
  using type = CoreMoxelTypes::VParametersItem;
  static constexpr VFlowItemType Descriptor{
      "FlowParametersItem", 0x1, 1, 0, 0, "Parameters that can be tagged and addressed to a particular target" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraHardware >
{
  using type = CoreMoxelTypes::VCameraHardware;
  static constexpr VFlowItemType Descriptor{ "FlowCameraHardware", 0x1000, 1, 0, 1, "CameraHardware Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraSettings >
{
  using type = CoreMoxelTypes::VCameraSettings;
  static constexpr VFlowItemType Descriptor{ "FlowCameraSettings", 0x1001, 1, 0, 0, "CameraSettings Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraMaskGrid >
{
  using type = CoreMoxelTypes::VCameraMaskGrid;
  static constexpr VFlowItemType Descriptor{ "FlowCameraMaskGrid", 0x1002, 1, 0, 0, "CameraMaskGrid Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCentroidSet >
{
  using type = CoreMoxelTypes::VCentroidSet;
  static constexpr VFlowItemType Descriptor{ "FlowCentroidSet", 0x1003, 2, 0, 0, "CentroidSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowGreyscaleBlobSet >
{
  using type = CoreMoxelTypes::VGreyscaleBlobSet;
  static constexpr VFlowItemType Descriptor{ "FlowGreyscaleBlobSet", 0x1005, 1, 0, 4, "GreyscaleBlobSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowEdgePairSet >
{
  using type = CoreMoxelTypes::VEdgePairSet;
  static constexpr VFlowItemType Descriptor{ "FlowEdgePairSet", 0x1006, 1, 0, 1, "EdgePairSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowVideoFrame >
{
  using type = CoreMoxelTypes::VVideoFrame;
  static constexpr VFlowItemType Descriptor{ "FlowVideoFrame", 0x1007, 3, 1, 5, "VideoFrame Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraCalibration >
{
  using type = CoreMoxelTypes::VCameraCalibration;
  static constexpr VFlowItemType Descriptor{ "FlowCameraCalibration", 0x100a, 1, 1, 0, "CameraCalibration Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraCalibrationHealth >
{
  using type = CoreMoxelTypes::VCameraCalibrationHealth;
  static constexpr VFlowItemType Descriptor{ "FlowCameraCalibrationHealth", 0x100b, 2, 0, 3,
                                             "CameraCalibrationHealth Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCentroidAssignmentSet >
{
  using type = CoreMoxelTypes::VCentroidAssignmentSet;
  static constexpr VFlowItemType Descriptor{ "FlowCentroidAssignmentSet", 0x100c, 1, 0, 0,
                                             "CentroidAssignmentSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowReconstructionSet >
{
  using type = CoreMoxelTypes::VReconstructionSet;
  static constexpr VFlowItemType Descriptor{ "FlowReconstructionSet", 0x100d, 1, 0, 0, "ReconstructionSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowReconstructionTrackSet >
{
  using type = CoreMoxelTypes::VReconstructionTrackSet;
  static constexpr VFlowItemType Descriptor{ "FlowReconstructionTrackSet", 0x100e, 1, 0, 0,
                                             "ReconstructionTrackSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowReconstructionLabelSet >
{
  using type = CoreMoxelTypes::VReconstructionLabelSet;
  static constexpr VFlowItemType Descriptor{ "FlowReconstructionLabelSet", 0x100f, 1, 0, 0,
                                             "ReconstructionLabelSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectDynamicParameters >
{
  using type = CoreMoxelTypes::VSubjectDynamicParameters;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectDynamicParameters", 0x1011, 1, 0, 0,
                                             "SubjectDynamicParameters Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubject >
{
  using type = CoreMoxelTypes::VSubject;
  static constexpr VFlowItemType Descriptor{ "FlowSubject", 0x1012, 1, 1, 2, "Subject Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectApplicationData >
{
  using type = CoreMoxelTypes::VSubjectApplicationData;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectApplicationData", 0x1013, 1, 0, 4,
                                             "SubjectApplicationData Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraWand2d >
{
  using type = CoreMoxelTypes::VCameraWand2d;
  static constexpr VFlowItemType Descriptor{ "FlowCameraWand2d", 0x1015, 2, 0, 2, "CameraWand2d Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowGeometrySet >
{
  using type = CoreMoxelTypes::VGeometrySet;
  static constexpr VFlowItemType Descriptor{ "FlowGeometrySet", 0x1018, 1, 0, 0, "GeometrySet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectParametrised >
{
  using type = CoreMoxelTypes::VSubjectParametrised;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectParametrised", 0x101a, 1, 1, 1, "SubjectParametrised Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectForSolving >
{
  using type = CoreMoxelTypes::VSubject;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectForSolving", 0x101b, 1, 1, 2, "Subject Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectApplicationDataForSolving >
{
  using type = CoreMoxelTypes::VSubjectApplicationData;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectApplicationDataForSolving", 0x101c, 1, 0, 4,
                                             "SubjectApplicationData Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectDynamicParametersForSolving >
{
  using type = CoreMoxelTypes::VSubjectDynamicParameters;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectDynamicParametersForSolving", 0x101d, 1, 0, 0,
                                             "SubjectDynamicParameters Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowReconstructionSetForSolving >
{
  using type = CoreMoxelTypes::VReconstructionSet;
  static constexpr VFlowItemType Descriptor{ "FlowReconstructionSetForSolving", 0x101e, 1, 0, 0,
                                             "ReconstructionSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowReconstructionLabelSetForSolving >
{
  using type = CoreMoxelTypes::VReconstructionLabelSet;
  static constexpr VFlowItemType Descriptor{ "FlowReconstructionLabelSetForSolving", 0x101f, 1, 0, 0,
                                             "ReconstructionLabelSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCentroidLabelSet >
{
  using type = CoreMoxelTypes::VCentroidLabelSet;
  static constexpr VFlowItemType Descriptor{ "FlowCentroidLabelSet", 0x1022, 1, 0, 0, "CentroidLabelSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowDevice >
{
  using type = CoreMoxelTypes::VDevice;
  static constexpr VFlowItemType Descriptor{ "FlowDevice", 0x1023, 2, 1, 2, "Device Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowDeviceApplicationData >
{
  using type = CoreMoxelTypes::VDeviceApplicationData;
  static constexpr VFlowItemType Descriptor{ "FlowDeviceApplicationData", 0x1024, 2, 0, 0,
                                             "DeviceApplicationData Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowDeviceSamples >
{
  using type = CoreMoxelTypes::VDeviceSamples;
  static constexpr VFlowItemType Descriptor{ "FlowDeviceSamples", 0x1025, 2, 0, 0, "DeviceSamples Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowAudioFrame >
{
  using type = CoreMoxelTypes::VAudioFrame;
  static constexpr VFlowItemType Descriptor{ "FlowAudioFrame", 0x1026, 1, 0, 2, "AudioFrame Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectSettings >
{
  using type = CoreMoxelTypes::VSubjectSettings;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectSettings", 0x1027, 1, 0, 6, "SubjectSettings Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowWorldAxis >
{
  using type = CoreMoxelTypes::VWorldAxis;
  static constexpr VFlowItemType Descriptor{ "FlowWorldAxis", 0x1029, 1, 0, 0, "WorldAxis Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectTemplate >
{
  using type = CoreMoxelTypes::VSubjectTemplate;
  static constexpr VFlowItemType Descriptor{
      "FlowSubjectTemplate", 0x102a, 1, 1, 1, "Uncalibrated subject template item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectParametrisedForSolving >
{
  using type = CoreMoxelTypes::VSubjectParametrised;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectParametrisedForSolving",        0x102c, 1, 1, 1,
                                             "SubjectParametrised for second solve item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraPhysicalStatus >
{
  using type = CoreMoxelTypes::VCameraPhysicalStatus;
  static constexpr VFlowItemType Descriptor{ "FlowCameraPhysicalStatus", 0x102d, 1, 0, 1, "CameraPhysicalStatus Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraPhysicalSensorData >
{
  using type = CoreMoxelTypes::VCameraPhysicalSensorData;
  static constexpr VFlowItemType Descriptor{ "FlowCameraPhysicalSensorData", 0x102e, 2, 0, 2,
                                             "CameraPhysicalSensorData Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraCalibrationDetails >
{
  using type = CoreMoxelTypes::VCameraCalibrationDetails;
  static constexpr VFlowItemType Descriptor{ "FlowCameraCalibrationDetails", 0x102f, 1, 0, 1,
                                             "CameraCalibrationDetails Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectTemplateForSolving >
{
  using type = CoreMoxelTypes::VSubjectTemplate;
  static constexpr VFlowItemType Descriptor{
      "FlowSubjectTemplateForSolving", 0x1030, 1, 1, 1, "Uncalibrated solving subject template item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowVolumeProperties >
{
  using type = CoreMoxelTypes::VVolumeProperties;
  static constexpr VFlowItemType Descriptor{ "FlowVolumeProperties", 0x1031, 1, 0, 0, "VolumeProperties Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowLabelledRotationSet >
{
  using type = CoreMoxelTypes::VLabelledRotationSet;
  static constexpr VFlowItemType Descriptor{ "FlowLabelledRotationSet", 0x1033, 1, 0, 0, "LabelledRotationSet Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowRigidObjectDynamicParameters >
{
  using type = CoreMoxelTypes::VRigidObjectDynamicParameters;
  static constexpr VFlowItemType Descriptor{ "FlowRigidObjectDynamicParameters", 0x1034, 1, 0, 0,
                                             "RigidObjectDynamicParameters Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowRigidObject >
{
  using type = CoreMoxelTypes::VRigidObject;
  static constexpr VFlowItemType Descriptor{ "FlowRigidObject", 0x1035, 1, 1, 2, "Rigid Object Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowRigidObjectApplicationData >
{
  using type = CoreMoxelTypes::VRigidObjectApplicationData;
  static constexpr VFlowItemType Descriptor{ "FlowRigidObjectApplicationData", 0x1036, 1, 0, 3,
                                             "RigidObjectApplicationData Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowCameraWarnings >
{
  using type = CoreMoxelTypes::VDeviceWarnings;
  static constexpr VFlowItemType Descriptor{ "FlowCameraWarnings", 0x1037, 1, 0, 0, "CameraWarnings Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectForRetargeting >
{
  using type = CoreMoxelTypes::VSubject;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectForRetargeting", 0x1038, 1, 1, 2,
                                             "SubjectForRetargeting Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectApplicationDataForRetargeting >
{
  using type = CoreMoxelTypes::VSubjectApplicationData;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectApplicationDataForRetargeting", 0x1039, 1, 0, 3,
                                             "SubjectApplicationDataForRetargeting Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectDynamicParametersForRetargeting >
{
  using type = CoreMoxelTypes::VSubjectDynamicParameters;
  static constexpr VFlowItemType Descriptor{ "FlowSubjectDynamicParametersForRetargeting", 0x103a, 1, 0, 0,
                                             "SubjectDynamicParametersForRetargeting Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSubjectTemplateForRetargeting >
{
  using type = CoreMoxelTypes::VSubjectTemplate;
  static constexpr VFlowItemType Descriptor{
      "FlowSubjectTemplateForRetargeting", 0x103c, 1, 1, 1, "Uncalibrated retargeting subject template item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowLabelledRotationSetForSolving >
{
  using type = CoreMoxelTypes::VLabelledRotationSet;
  static constexpr VFlowItemType Descriptor{ "FlowLabelledRotationSetForSolving", 0x1040, 1, 0, 0,
                                             "LabelledRotationSetForSolving Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSmartObject >
{
  using type = CoreMoxelTypes::VSmartObject;
  static constexpr VFlowItemType Descriptor{ "FlowSmartObject", 0x1044, 1, 0, 2, "Smart Object Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSceneMesh >
{
  using type = CoreMoxelTypes::VSceneMesh;
  static constexpr VFlowItemType Descriptor{ "FlowSceneMesh", 0x1050, 1, 0, 0, "SceneMesh Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSceneMeshApplicationData >
{
  using type = CoreMoxelTypes::VSceneMeshApplicationData;
  static constexpr VFlowItemType Descriptor{ "FlowSceneMeshApplicationData", 0x1051, 1, 0, 0,
                                             "SceneMeshApplicationData Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSceneMeshDynamicParameters >
{
  using type = CoreMoxelTypes::VSceneMeshDynamicParameters;
  static constexpr VFlowItemType Descriptor{ "FlowSceneMeshDynamicParameters", 0x1052, 1, 0, 0,
                                             "SceneMeshDynamicParameters Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowSceneMeshSettings >
{
  using type = CoreMoxelTypes::VSceneMeshSettings;
  static constexpr VFlowItemType Descriptor{ "FlowSceneMeshSettings",          0x1054, 1, 0, 6,
                                             "Scene Mesh SubjectSettings Item" };
};
template <>
struct FlowValueType< CoreMoxelTypes::FlowImageSet >
{
  using type = CoreMoxelTypes::VImageSet;
  static constexpr VFlowItemType Descriptor{ "FlowImageSet", 0x1058, 1, 0, 5, "ImageSet Item" };
};

/// The tag of a flow type.
template < typename TFlow >
inline constexpr std::uint32_t FlowTag = FlowValueType< TFlow >::Descriptor.Tag;

/// The descriptor of a tag, or null for a tag that nobody registered.
inline const VFlowItemType* FindFlowItemType( std::uint32_t i_Tag )
{
  const VFlowItemType* pFound = nullptr;
  [&]< typename... T >( std::tuple< T*... >* )
  {
    ( ( FlowTag< T > == i_Tag ? void( pFound = &FlowValueType< T >::Descriptor ) : void() ), ... );
  }( static_cast< CoreMoxelTypes::VAllFlowTypes* >( nullptr ) );
  return pFound;
}

} // namespace ZEK

#pragma once

#include <CoreMoxelTypes/FlowTypes.h>

#include <concepts>

namespace Flow2Graphics
{

// What the objects of each group are made of: the item that an object must have, and those that it may have. Every
// item carries the object's name under selector 3.

struct VFlowSubjectTypes
{
  using TObject = CoreMoxelTypes::FlowSubject;
  using TLooks = CoreMoxelTypes::FlowSubjectApplicationData;
  using TMotion = CoreMoxelTypes::FlowSubjectDynamicParameters;
  using TSettings = CoreMoxelTypes::FlowSubjectSettings;
  using TParametrised = CoreMoxelTypes::FlowSubjectParametrised;
  static constexpr bool bProps = false;
  static constexpr const char* MeshCategory = "Subject";
};

struct VFlowSubjectForSolvingTypes
{
  using TObject = CoreMoxelTypes::FlowSubjectForSolving;
  using TLooks = CoreMoxelTypes::FlowSubjectApplicationDataForSolving;
  using TMotion = CoreMoxelTypes::FlowSubjectDynamicParametersForSolving;
  using TParametrised = CoreMoxelTypes::FlowSubjectParametrisedForSolving;
  static constexpr const char* MeshCategory = "Subject";
};

struct VFlowSubjectForRetargetingTypes
{
  using TObject = CoreMoxelTypes::FlowSubjectForRetargeting;
  using TLooks = CoreMoxelTypes::FlowSubjectApplicationDataForRetargeting;
  using TMotion = CoreMoxelTypes::FlowSubjectDynamicParametersForRetargeting;
  static constexpr const char* MeshCategory = "Subject";
};

struct VFlowRigidObjectTypes
{
  using TObject = CoreMoxelTypes::FlowRigidObject;
  using TLooks = CoreMoxelTypes::FlowRigidObjectApplicationData;
  using TMotion = CoreMoxelTypes::FlowRigidObjectDynamicParameters;
  static constexpr const char* MeshCategory = "Prop";
};

/// Subjects whose settings say that they are props.
struct VFlowPropTypes : VFlowSubjectTypes
{
  static constexpr bool bProps = true;
  static constexpr const char* MeshCategory = "Prop";
};

struct VFlowSceneMeshTypes
{
  using TObject = CoreMoxelTypes::FlowSceneMesh;
  using TLooks = CoreMoxelTypes::FlowSceneMeshApplicationData;
  using TMotion = CoreMoxelTypes::FlowSceneMeshDynamicParameters;
  using TSettings = CoreMoxelTypes::FlowSceneMeshSettings;
  static constexpr const char* MeshCategory = "SceneMesh";
};

template < typename Types >
concept CHasSettings = requires
{
  typename Types::TSettings;
};
template < typename Types >
concept CHasParametrised = requires
{
  typename Types::TParametrised;
};
/// Whether the group's objects are subjects, as against rigid objects and scene meshes.
template < typename Types >
concept CIsSubject =
    std::same_as< typename ZEK::FlowValueType< typename Types::TObject >::type, CoreMoxelTypes::VSubject >;

} // namespace Flow2Graphics

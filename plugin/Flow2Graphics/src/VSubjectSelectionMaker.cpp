#include <Flow2Graphics/VSubjectSelectionMaker.h>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;
using Flow2TypesUtils::ETagRequirement;

template < typename TFlow >
const auto* ValueAt( const ISubjectSelectionMaker::VExtractor& i_rExtractor, std::size_t i_Slot )
{
  constexpr std::size_t Ahead = 4;
  const auto& rValues = i_rExtractor.Values< TFlow >();
  if ( i_Slot + Ahead < rValues.size() )
  {
    __builtin_prefetch( rValues[i_Slot + Ahead] ); // slots are asked for one after another
  }
  return i_Slot < rValues.size() ? rValues[i_Slot] : nullptr;
}

/// Colours are one a marker or the object is not for showing.
bool ReadLooks( const VSubjectApplicationData& i_rLooks, VSubjectStructure& io_rStructure )
{
  io_rStructure.MarkerColours = i_rLooks.MarkerColours;
  io_rStructure.SegmentColours = i_rLooks.SegmentColours;
  io_rStructure.Sticks = i_rLooks.Sticks;
  io_rStructure.pMesh = &i_rLooks.Skin;
  return i_rLooks.MarkerColours.size() == io_rStructure.Markers.size();
}

bool ReadLooks( const VRigidObjectApplicationData& i_rLooks, VSubjectStructure& io_rStructure )
{
  if ( i_rLooks.MarkerColours.size() == io_rStructure.Markers.size() )
  {
    io_rStructure.MarkerColours = i_rLooks.MarkerColours;
  }
  io_rStructure.Colour = i_rLooks.Colour;
  io_rStructure.Sticks = i_rLooks.Sticks;
  io_rStructure.pMesh = &i_rLooks.Mesh;
  return true;
}

bool ReadLooks( const VSceneMeshApplicationData& i_rLooks, VSubjectStructure& io_rStructure )
{
  io_rStructure.Colour = i_rLooks.Colour;
  return true;
}

void ReadObject( const VSubject& i_rSubject, VSubjectStructure& o_rStructure )
{
  o_rStructure.Id = i_rSubject.Id;
  o_rStructure.pName = &i_rSubject.Name;
  o_rStructure.Markers = i_rSubject.Markers;
  o_rStructure.Segments = i_rSubject.Segments;
  o_rStructure.Clusters = i_rSubject.Clusters;
  o_rStructure.pSkeleton = &i_rSubject;
}

void ReadObject( const VRigidObject& i_rObject, VSubjectStructure& o_rStructure )
{
  o_rStructure.Id = i_rObject.Id;
  o_rStructure.pName = &i_rObject.Name;
  o_rStructure.Markers = i_rObject.Markers;
  o_rStructure.bOneBone = true;
  o_rStructure.bMeshByRoot = true;
}

void ReadObject( const VSceneMesh& i_rMesh, VSubjectStructure& o_rStructure )
{
  o_rStructure.Id = i_rMesh.Id;
  o_rStructure.pMesh = &i_rMesh.File;
  o_rStructure.Colour = 0xFFFFFFFF;
  o_rStructure.bMeshByRoot = true;
}

bool IsEnabled( const VSubjectSettings& i_rSettings, VSubjectStructure& io_rStructure )
{
  io_rStructure.Colour = i_rSettings.Colour;
  return i_rSettings.Enabled;
}

bool IsEnabled( const VSceneMeshSettings& i_rSettings, VSubjectStructure& io_rStructure )
{
  io_rStructure.MeshScale = i_rSettings.Scale;
  return i_rSettings.Enabled;
}

void ReadMotion( const VSubjectDynamicParameters& i_rMotion, VSubjectMotion& o_rMotion )
{
  o_rMotion.Segments = i_rMotion.Segments;
  o_rMotion.JointState = i_rMotion.JointState;
  o_rMotion.Solved = i_rMotion.MarkerPositions;
  o_rMotion.Visible = i_rMotion.MarkerVisible;
  o_rMotion.Health = i_rMotion.SegmentHealth;
}

void ReadMotion( const VRigidObjectDynamicParameters& i_rMotion, VSubjectMotion& o_rMotion )
{
  o_rMotion.pRoot = i_rMotion.Tracked ? &i_rMotion.Pose : nullptr;
  o_rMotion.Visible = i_rMotion.MarkerVisible;
}

void ReadMotion( const VSceneMeshDynamicParameters& i_rMotion, VSubjectMotion& o_rMotion )
{
  o_rMotion.pRoot = &i_rMotion.Pose;
  o_rMotion.MeshBones = i_rMotion.Bones;
  o_rMotion.AnimationTime = i_rMotion.AnimationTime;
}
} // namespace

template < typename Types >
void VSubjectSelectionMaker< Types >::AddCaches( VExtractor& io_rExtractor ) const
{
  io_rExtractor.AddCache< typename Types::TObject >( ETagRequirement::Required );
  io_rExtractor.AddCache< typename Types::TLooks >( ETagRequirement::Optional );
  io_rExtractor.AddCache< typename Types::TMotion >( ETagRequirement::Optional );
  if constexpr ( CHasSettings< Types > )
  {
    io_rExtractor.AddCache< typename Types::TSettings >( ETagRequirement::Optional );
  }
  if constexpr ( CHasParametrised< Types > )
  {
    io_rExtractor.AddCache< typename Types::TParametrised >( ETagRequirement::Optional );
  }
}

template < typename Types >
bool VSubjectSelectionMaker< Types >::StructureChanged( const VExtractor& i_rExtractor ) const
{
  bool bChanged = i_rExtractor.NamesChanged() || i_rExtractor.Changed( ZEK::FlowTag< typename Types::TObject > ) ||
                  i_rExtractor.Changed( ZEK::FlowTag< typename Types::TLooks > );
  if constexpr ( CHasSettings< Types > )
  {
    bChanged = bChanged || i_rExtractor.Changed( ZEK::FlowTag< typename Types::TSettings > );
  }
  if constexpr ( CHasParametrised< Types > )
  {
    bChanged = bChanged || i_rExtractor.Changed( ZEK::FlowTag< typename Types::TParametrised > );
  }
  return bChanged;
}

template < typename Types >
bool VSubjectSelectionMaker< Types >::MotionChanged( const VExtractor& i_rExtractor ) const
{
  return i_rExtractor.Changed( ZEK::FlowTag< typename Types::TMotion > );
}

template < typename Types >
ESubjectFit VSubjectSelectionMaker< Types >::Structure( const VExtractor& i_rExtractor, std::size_t i_Slot,
                                                        VSubjectStructure& o_rStructure ) const
{
  o_rStructure = {};
  const auto* const pObject = ValueAt< typename Types::TObject >( i_rExtractor, i_Slot );
  if ( !pObject )
  {
    return ESubjectFit::NotOfGroup;
  }
  ReadObject( *pObject, o_rStructure );
  bool bEnabled = true;
  if constexpr ( CHasSettings< Types > )
  {
    const auto* const pSettings = ValueAt< typename Types::TSettings >( i_rExtractor, i_Slot );
    if constexpr ( CIsSubject< Types > )
    {
      if ( ( pSettings && pSettings->Kind == VSubjectSettings::Prop ) != Types::bProps )
      {
        return ESubjectFit::NotOfGroup;
      }
    }
    bEnabled = !pSettings || IsEnabled( *pSettings, o_rStructure );
  }
  if constexpr ( CHasParametrised< Types > )
  {
    // A subject that was only ever labelled has no bones of its own.
    const auto* const pParametrised = ValueAt< typename Types::TParametrised >( i_rExtractor, i_Slot );
    if ( pObject->Segments.empty() && pParametrised )
    {
      o_rStructure.Segments = pParametrised->Base.Segments;
      o_rStructure.pSkeleton = &pParametrised->Base;
    }
  }
  const auto* const pLooks = ValueAt< typename Types::TLooks >( i_rExtractor, i_Slot );
  if ( pLooks && !ReadLooks( *pLooks, o_rStructure ) )
  {
    return ESubjectFit::ColoursDiffer;
  }
  return bEnabled ? ESubjectFit::Shown : ESubjectFit::Hidden;
}

template < typename Types >
void VSubjectSelectionMaker< Types >::Motion( const VExtractor& i_rExtractor, std::size_t i_Slot,
                                              VSubjectMotion& o_rMotion ) const
{
  o_rMotion = {};
  if ( const auto* const pMotion = ValueAt< typename Types::TMotion >( i_rExtractor, i_Slot ) )
  {
    ReadMotion( *pMotion, o_rMotion );
  }
  else if constexpr ( std::same_as< Types, VFlowSceneMeshTypes > )
  {
    static constexpr Rigid AtOrigin;
    o_rMotion.pRoot = &AtOrigin; // what nothing moves stands where it was made
  }
}

template < typename Types >
std::uint32_t VSubjectSelectionMaker< Types >::ObjectKind() const
{
  if constexpr ( std::same_as< Types, VFlowRigidObjectTypes > )
  {
    return ZEK::ESelectRigidObject;
  }
  return CIsSubject< Types > ? ZEK::ESelectSubject : ZEK::ESelectSceneMesh;
}

template < typename Types >
std::uint32_t VSubjectSelectionMaker< Types >::BoneKind() const
{
  return CIsSubject< Types > ? std::uint32_t{ ZEK::ESelectSegment } : ObjectKind();
}

template class VSubjectSelectionMaker< VFlowSubjectTypes >;
template class VSubjectSelectionMaker< VFlowSubjectForSolvingTypes >;
template class VSubjectSelectionMaker< VFlowSubjectForRetargetingTypes >;
template class VSubjectSelectionMaker< VFlowRigidObjectTypes >;
template class VSubjectSelectionMaker< VFlowPropTypes >;
template class VSubjectSelectionMaker< VFlowSceneMeshTypes >;

} // namespace Flow2Graphics

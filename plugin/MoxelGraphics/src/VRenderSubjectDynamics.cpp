#include <MoxelGraphics/VRenderSubjectDynamics.h>

#include "SubjectInstances.h"
#include "SubjectMeshes.h"

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>
#include <MoxelGraphics/VSubjectGroup.h>
#include <MoxelGraphics/VSubjectSkins.h>

#include <CoreGraphics/VResources.h>
#include <HarrowPluginInterface/IHarrowServices.h>

#include <atomic>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

const std::string GeometryCategory = "Subject";
const std::string BoneMeshName = "tetra_stripe.fbx";

constexpr std::uint32_t HalfAlpha = 0x80;

const VVertexLayout BonesLayout( sizeof( VColumns ), 1, { { EAttributeModelTransform, 12, GL_FLOAT, false, 0 } } );
const VVertexLayout BoneColoursLayout( 4, 1, { { EAttributeSegmentColour, 4, GL_UNSIGNED_BYTE, true, 0 } } );

struct VWireVertex
{
  float X, Y, Z;
  std::uint32_t Colour;
};
const VVertexLayout WireLayout( sizeof( VWireVertex ), 0,
                                { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                  { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 12 } } );
struct VWire
{
  VWireVertex From, To;
};

/// A wire is a hint, and stays behind what it joins.
std::uint32_t Dimmed( std::uint32_t i_Colour )
{
  return ( i_Colour >> 1 & 0x7F7F7F ) | ( i_Colour & 0xFF000000 );
}

float Scale( const VSceneOptions& i_rOptions )
{
  const float Wanted = i_rOptions.ReconstructionScale;
  return Wanted > 0 && std::isfinite( Wanted ) ? Wanted : 1.0F;
}
} // namespace

struct VRenderSubjectDynamics::VGl
{
  explicit VGl( VMoxelScene& i_rScene )
    : Skins( i_rScene )
  {
  }
  void LoadLooks( VResources& io_rResources );

  VMesh Bone = MakeBoneMesh();
  std::unique_ptr< VMesh > pOtherBone; ///< from the mesh cache
  VMesh Axes = MakeAxesMesh();
  VMesh Sphere = MakeSphereMesh( 1 );
  VMesh FineSphere = MakeSphereMesh( 2 );
  VSubjectLook Bones, Joints, AxisLook, Covariances, Missing;
  VRenderState Blended = BlendedState();
  VRenderState WireState;
  std::shared_ptr< VShaderProgram > pWires;
  VUniform WireTransform{ "u_ModelTransform" };
  VGatheredInstances< VColumns > PickedColumns;
  VGatheredInstances< VScenePoint > PickedPlaces;
  VSubjectSkins Skins;
  std::shared_ptr< std::atomic< bool > > pMeshesChanged = std::make_shared< std::atomic< bool > >( true );
  ZEK::VConnection MeshesChanged;
  std::shared_ptr< const HarrowPluginInterface::VMeshScene > pBoneScene;
};

/// What is kept of a group.
struct VRenderSubjectDynamics::VGroupDraw
{
  explicit VGroupDraw( const VSubjectGroup& i_rGroup )
    : rGroup( i_rGroup )
  {
  }
  const VSubjectGroup& rGroup;
  VSubjectFlags MarkerFlags, BoneFlags;
  VKindState< VColumns > Bones, Axes, Origins, Covariances;
  VKindState< VScenePoint > Joints, Missing;
  std::array< VHeldInstances, 2 > BoneColours; ///< solid and half
  VHeldInstances Wires;
  std::uint64_t CountedMarkers = 0;
  std::size_t MissingCount = 0;
};

/// One group in one pass.
struct VRenderSubjectDynamics::VPass
{
  CoreGraphics::VRenderContext& rContext;
  const VSceneOptions& rOptions;
  const VDisplayRecord& rRecord;
  VGroupDraw& rDraw;
  VSubjectCounts& rCounts;
  std::size_t Group = 0;
  std::uint32_t Pass = 0;
  bool bTranslucentBones = false;
  bool bAny = false; ///< the group is shown and holds something
};

void VRenderSubjectDynamics::VGl::LoadLooks( VResources& io_rResources )
{
  const auto Load = [&]( VSubjectLook& o_rLook, const char* i_pVertex, const char* i_pFragment, VMesh& i_rMesh )
  {
    o_rLook.Programs.Load( io_rResources, i_pVertex, i_pFragment );
    o_rLook.pMesh = &i_rMesh;
    o_rLook.State = SolidState();
    o_rLook.pSeen = &SeenColumnsLayout();
    o_rLook.pPicked = &PickedColumnsLayout();
  };
  Load( Bones, "Segment", "Segment", Bone );
  Load( AxisLook, "Simple3DModelColour", "SimpleLighting", Axes );
  Load( Covariances, "NonUniformSphere", "Covariance", FineSphere );
  Load( Joints, "Target", "Colour", Sphere );
  Load( Missing, "MissingMarker", "MissingMarker", FineSphere );
  Joints.pMeshLayout = &SphereNormalLayout();
  for ( VSubjectLook* pLook : { &Joints, &Missing } )
  {
    pLook->pSeen = &SeenPlaceLayout();
    pLook->pPicked = &PickedPlaceLayout();
  }
  // A ghost hides nothing behind it.
  Missing.State = BlendedState();
  Missing.State.depthWrite = false;
  pWires = io_rResources.GetProgram( "Simple3DModelWireframe", "Colour" );
  WireState.depthFunction = EDepthLessOrEqual;
}

VRenderSubjectDynamics::VRenderSubjectDynamics( VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_pGl( std::make_unique< VGl >( i_rScene ) )
{
  m_pGl->LoadLooks( *i_rScene.Resources() );
  if ( const auto& rpCache = i_rScene.MeshCache() )
  {
    m_pGl->MeshesChanged = rpCache->Changed().Connect(
        [pChanged = m_pGl->pMeshesChanged]
        {
          pChanged->store( true, std::memory_order_release );
        },
        nullptr );
  }
}

VRenderSubjectDynamics::~VRenderSubjectDynamics() = default;

void VRenderSubjectDynamics::SetGroups( const VGroups& i_rGroups )
{
  for ( std::size_t Group = 0; Group < GroupCount; ++Group )
  {
    m_Groups[Group] = i_rGroups[Group] ? std::make_unique< VGroupDraw >( *i_rGroups[Group] ) : nullptr;
  }
}

const VDisplayRecord& VRenderSubjectDynamics::Record( const VSceneOptions& i_rOptions, std::size_t i_Group )
{
  switch ( i_Group )
  {
  case ESubjects:
    return i_rOptions.LabellingSubject;
  case ESolved:
    return i_rOptions.SolvingSubject;
  case ERetargeted:
    return i_rOptions.RetargetingSubject;
  case ESceneMeshes:
    return i_rOptions.SceneMesh;
  default:
    return i_rOptions.PropSubject;
  }
}

void VRenderSubjectDynamics::TakeBoneMesh()
{
  if ( !m_rScene.MeshCache() || !m_pGl->pMeshesChanged->exchange( false, std::memory_order_acq_rel ) )
  {
    return;
  }
  auto pScene = m_rScene.MeshCache()->Request( GeometryCategory, BoneMeshName );
  if ( pScene && pScene != m_pGl->pBoneScene )
  {
    m_pGl->pBoneScene = std::move( pScene );
    m_pGl->pOtherBone = MakeBoneMesh( *m_pGl->pBoneScene );
    m_pGl->Bones.pMesh = m_pGl->pOtherBone ? m_pGl->pOtherBone.get() : &m_pGl->Bone;
  }
}

void VRenderSubjectDynamics::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                     std::uint32_t i_Pass )
{
  TakeBoneMesh();
  // Bones of both kinds lie in each other: those that are labelled let the solved ones through.
  const auto Shows = [&]( EGroup i_Group )
  {
    const VDisplayRecord& rRecord = Record( i_rOptions, i_Group );
    return rRecord.Enabled && rRecord.Bones && m_Groups[i_Group] && !m_Groups[i_Group]->rGroup.Bones.empty();
  };
  const bool bBoth = Shows( ESubjects ) && Shows( ESolved );
  for ( std::size_t Group = 0; Group < GroupCount; ++Group )
  {
    if ( !m_Groups[Group] )
    {
      continue;
    }
    const VDisplayRecord& rRecord = Record( i_rOptions, Group );
    VGroupDraw& rDraw = *m_Groups[Group];
    const VPass Pass{ io_rContext,
                      i_rOptions,
                      rRecord,
                      rDraw,
                      m_Counts[Group],
                      Group,
                      i_Pass,
                      bBoth && Group == ESubjects,
                      rRecord.Enabled && !rDraw.rGroup.IsEmpty() };
    if ( io_rContext.RenderMode() == ERenderModeNormal )
    {
      RenderSeen( Pass );
    }
    else if ( Pass.bAny && i_Pass == ERenderPassOpaque )
    {
      RenderIds( Pass );
    }
    RenderSkins( Pass );
  }
}

void VRenderSubjectDynamics::RenderSeen( const VPass& i_rPass )
{
  const VDisplayRecord& rRecord = i_rPass.rRecord;
  VGroupDraw& rDraw = i_rPass.rDraw;
  const VSubjectGroup& rGroup = rDraw.rGroup;
  const VInstanceKey Moved{ rGroup.StructureGeneration, rGroup.PoseGeneration };
  const auto Draw = [&]( ESubjectKind i_Kind, bool i_bOn, VSubjectLook& io_rLook, auto& io_rState,
                         const auto& i_rShapes, const VInstanceKey& i_rKey, std::size_t i_Bound )
  {
    const bool bOn = i_rPass.bAny && i_bOn;
    i_rPass.rCounts.Set( i_Kind,
                         bOn ? DrawSeen( i_rPass.rContext, io_rLook, io_rState.Seen, i_rShapes, i_rKey, i_Bound ) : 0 );
  };
  const bool bBones = i_rPass.bAny && rRecord.Bones;
  if ( i_rPass.Pass == ( i_rPass.bTranslucentBones ? ERenderPassTranslucent : ERenderPassOpaque ) )
  {
    i_rPass.rCounts.Set( ESubjectBones, bBones ? DrawBones( i_rPass, i_rPass.bTranslucentBones ) : 0 );
  }
  VGl& rGl = *m_pGl;
  switch ( i_rPass.Pass )
  {
  case ERenderPassOpaque:
    Draw( ESubjectJoints, rRecord.Joints, rGl.Joints, rDraw.Joints, VJointShapes{ rGroup, rDraw.BoneFlags }, Moved,
          rGroup.Poses.size() );
    Draw( ESubjectOrigins, rRecord.Origins, rGl.AxisLook, rDraw.Origins, VOriginShapes{ rGroup }, Moved,
          rGroup.Records.size() );
    Draw( ESubjectAxes, rRecord.Axes, rGl.AxisLook, rDraw.Axes, VAxisShapes{ rGroup, rDraw.BoneFlags }, Moved,
          rGroup.Poses.size() );
    i_rPass.rCounts.Set( ESubjectWires, i_rPass.bAny && rRecord.Clusters ? DrawWires( i_rPass ) : 0 );
    Draw( ESubjectCovariances, rRecord.TargetCovariances, rGl.Covariances, rDraw.Covariances,
          VCovarianceShapes{ rGroup, rDraw.MarkerFlags }, Moved, rGroup.Targets.size() );
    break;
  case ERenderPassTranslucent:
  {
    const VMissingShapes Shapes{ rGroup, rDraw.MarkerFlags, i_rPass.rOptions.MarkerRadius, Scale( i_rPass.rOptions ) };
    // Few markers of many are missing: their number is counted first, and no more is written.
    if ( rDraw.CountedMarkers != rGroup.MarkerGeneration && rRecord.MissingMarkers )
    {
      rDraw.CountedMarkers = rGroup.MarkerGeneration;
      rDraw.MissingCount = Shapes.Missing();
    }
    Draw( ESubjectMissingMarkers, rRecord.MissingMarkers, rGl.Missing, rDraw.Missing, Shapes, Shapes.Key(),
          rDraw.MissingCount );
    break;
  }
  default:
    // Through the skin, and over it.
    if ( bBones && rRecord.SkinXRay && i_rPass.rOptions.Show3DOverlay )
    {
      DrawBones( i_rPass, true );
    }
  }
}

void VRenderSubjectDynamics::RenderIds( const VPass& i_rPass )
{
  VGl& rGl = *m_pGl;
  VGroupDraw& rDraw = i_rPass.rDraw;
  const VDisplayRecord& rRecord = i_rPass.rRecord;
  const VSubjectGroup& rGroup = rDraw.rGroup;
  const bool bCurrent = i_rPass.rOptions.HighlightCurrentSubject;
  rDraw.MarkerFlags.Update( rGroup, rGroup.MarkerIds, rGroup.Markers.size(), &VSubjectRecord::Markers, bCurrent );
  rDraw.BoneFlags.Update( rGroup, rGroup.BoneIds, rGroup.Bones.size(), &VSubjectRecord::Bones, bCurrent );
  const auto Draw = [&]( bool i_bOn, VSubjectLook& io_rLook, auto& io_rState, auto& io_rPicked, const auto& i_rShapes,
                         std::uint64_t i_Moved, std::uint64_t i_Marks )
  {
    if ( i_bOn )
    {
      DrawMarked( i_rPass.rContext, m_rScene, io_rLook, io_rState, io_rPicked, i_rShapes,
                  { rGroup.StructureGeneration, i_Moved, i_Marks } );
    }
  };
  const std::uint64_t Posed = rGroup.PoseGeneration, BoneMarks = rDraw.BoneFlags.Generation(),
                      MarkerMarks = rDraw.MarkerFlags.Generation();
  Draw( rRecord.Bones, rGl.Bones, rDraw.Bones, rGl.PickedColumns, VBoneShapes{ rGroup, rDraw.BoneFlags }, Posed,
        BoneMarks );
  Draw( rRecord.Joints, rGl.Joints, rDraw.Joints, rGl.PickedPlaces, VJointShapes{ rGroup, rDraw.BoneFlags }, Posed,
        BoneMarks );
  Draw( rRecord.Axes, rGl.AxisLook, rDraw.Axes, rGl.PickedColumns, VAxisShapes{ rGroup, rDraw.BoneFlags }, Posed,
        BoneMarks );
  Draw( rRecord.Origins, rGl.AxisLook, rDraw.Origins, rGl.PickedColumns, VOriginShapes{ rGroup, bCurrent }, Posed,
        2 * rGroup.RecordGeneration + ( bCurrent ? 1 : 0 ) );
  Draw( rRecord.TargetCovariances, rGl.Covariances, rDraw.Covariances, rGl.PickedColumns,
        VCovarianceShapes{ rGroup, rDraw.MarkerFlags }, Posed, MarkerMarks );
  const VMissingShapes Missing{ rGroup, rDraw.MarkerFlags, i_rPass.rOptions.MarkerRadius, Scale( i_rPass.rOptions ) };
  if ( rRecord.MissingMarkers )
  {
    VInstanceKey Key = Missing.Key();
    Key[3] = MarkerMarks;
    DrawMarked( i_rPass.rContext, m_rScene, rGl.Missing, rDraw.Missing, rGl.PickedPlaces, Missing, Key );
  }
}

void VRenderSubjectDynamics::RenderSkins( const VPass& i_rPass )
{
  const VDisplayRecord& rRecord = i_rPass.rRecord;
  const bool bVisible = i_rPass.rContext.RenderMode() == ERenderModeNormal;
  const bool bSkin = i_rPass.bAny && rRecord.Skin, bXRay = i_rPass.bAny && rRecord.SkinXRay;
  VSubjectSkins& rSkins = m_pGl->Skins;
  if ( i_rPass.Pass == ERenderPassOpaque )
  {
    if ( bSkin )
    {
      rSkins.Draw( i_rPass.rContext, i_rPass.rDraw.rGroup, i_rPass.Group, false,
                   i_rPass.rOptions.HighlightCurrentSubject );
    }
    if ( bVisible )
    {
      i_rPass.rCounts.Set( ESubjectSkins, bSkin ? rSkins.Counts( i_rPass.Group ).Drawn : 0 );
    }
  }
  // A pointer reaches through what is only shone through.
  if ( i_rPass.Pass == ERenderPassTranslucent && bXRay && ( bVisible || !bSkin ) &&
       i_rPass.rContext.RenderMode() != ERenderModeSelection )
  {
    rSkins.Draw( i_rPass.rContext, i_rPass.rDraw.rGroup, i_rPass.Group, true,
                 i_rPass.rOptions.HighlightCurrentSubject );
    if ( bVisible )
    {
      i_rPass.rCounts.Set( ESubjectSkins, rSkins.Counts( i_rPass.Group ).Drawn );
    }
  }
}

std::size_t VRenderSubjectDynamics::DrawBones( const VPass& i_rPass, bool i_bTranslucent )
{
  VGroupDraw& rDraw = i_rPass.rDraw;
  VSubjectLook& rLook = m_pGl->Bones;
  const VSubjectGroup& rGroup = rDraw.rGroup;
  const VBoneShapes Shapes{ rGroup, rDraw.BoneFlags };
  const std::size_t Count = Shapes.Count();
  VHeldInstances& rBones = rDraw.Bones.Seen;
  VHeldInstances& rColours = rDraw.BoneColours[i_bTranslucent ? 1 : 0];
  const bool bFed = rBones.Feed< VColumns >( { rGroup.StructureGeneration, rGroup.PoseGeneration }, Count,
                                             [&]( VColumns* o_pColumns )
                                             {
                                               std::size_t Shown = 0;
                                               for ( std::size_t Index = 0; Index < Count; ++Index )
                                               {
                                                 const bool bShown = Shapes.Make( Index, o_pColumns[Index] );
                                                 if ( !bShown )
                                                 {
                                                   o_pColumns[Index] = NowhereColumns;
                                                 }
                                                 Shown += bShown ? 1 : 0;
                                               }
                                               return VFilled{ Count, Shown };
                                             } );
  if ( !bFed || rBones.Shown() == 0 ||
       !rColours.Feed< std::uint32_t >( { rGroup.StructureGeneration, Count }, Count,
                                        [&]( std::uint32_t* o_pColours )
                                        {
                                          for ( std::size_t Index = 0; Index < Count; ++Index )
                                          {
                                            const std::uint32_t Colour = rGroup.Bones[Index].Colour;
                                            o_pColours[Index] = i_bTranslucent ? ( Colour & 0xFFFFFF ) | HalfAlpha << 24
                                                                               : Colour | 0xFF000000;
                                          }
                                          return VFilled{ Count, Count };
                                        } ) )
  {
    return 0;
  }
  const VVertexStream Streams[] = {
      rLook.MeshStream(), { &rBones.Buffer(), &BonesLayout, 0 }, { &rColours.Buffer(), &BoneColoursLayout, 0 } };
  if ( !rLook.Programs.Use( i_rPass.rContext, 0 ) || !i_rPass.rContext.SetVertexStreams( Streams ) )
  {
    return 0;
  }
  i_rPass.rContext.SetRenderState( i_bTranslucent ? m_pGl->Blended : rLook.State );
  i_rPass.rContext.DrawElementsInstanced( GL_TRIANGLES, *rLook.pMesh, static_cast< int >( rBones.Count() ) );
  return rBones.Shown();
}

std::size_t VRenderSubjectDynamics::DrawWires( const VPass& i_rPass )
{
  VGroupDraw& rDraw = i_rPass.rDraw;
  const VSubjectGroup& rGroup = rDraw.rGroup;
  const bool bFed = rDraw.Wires.Feed< VWire >(
      { rGroup.StructureGeneration, rGroup.PoseGeneration, rGroup.MarkerGeneration }, rGroup.Wires.size(),
      [&]( VWire* o_pWires )
      {
        std::size_t Count = 0;
        for ( const VSubjectWire& rWire : rGroup.Wires )
        {
          if ( rWire.Bone >= std::min( rGroup.Poses.size(), rGroup.Bones.size() ) ||
               rWire.Marker >= rGroup.Markers.size() || !IsPlace( rGroup.Markers[rWire.Marker] ) ||
               !IsPose( rGroup.Poses[rWire.Bone] ) )
          {
            continue;
          }
          const VBonePose& rPose = rGroup.Poses[rWire.Bone];
          const VScenePoint& rTo = rGroup.Markers[rWire.Marker];
          o_pWires[Count++] = {
              { rPose[3], rPose[7], rPose[11], Dimmed( rGroup.Bones[rWire.Bone].Colour | 0xFF000000 ) },
              { rTo.X, rTo.Y, rTo.Z, Dimmed( MarkerColour( rGroup, rWire.Marker ) | 0xFF000000 ) } };
        }
        return VFilled{ Count, Count };
      } );
  if ( !bFed || rDraw.Wires.Count() == 0 || !i_rPass.rContext.UseProgram( m_pGl->pWires ) ||
       !i_rPass.rContext.SetVertexBuffer( { &rDraw.Wires.Buffer(), &WireLayout, 0 } ) )
  {
    return 0;
  }
  m_pGl->WireTransform.Set( *m_pGl->pWires, QMatrix4x4() );
  i_rPass.rContext.SetRenderState( m_pGl->WireState );
  i_rPass.rContext.DrawArrays( GL_LINES, static_cast< int >( 2 * rDraw.Wires.Count() ) );
  return rDraw.Wires.Shown();
}

} // namespace MoxelGraphics

#include <MoxelGraphics/VRenderSubjectMarkers.h>

#include "SubjectInstances.h"
#include "SubjectMeshes.h"
#include "VSphereBatchGl.h"

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>
#include <MoxelGraphics/VSphereHelper.h>
#include <MoxelGraphics/VSubjectGroup.h>

#include <CoreGraphics/VResources.h>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

/// Sticks thinner than this, nearly all of them, are lines.
constexpr float ThinPixels = 1.5F;
/// One stick in so many may be thicker.
constexpr std::size_t ThickShare = 16;
/// A round stick in the distance is no thinner than this.
constexpr float SmallestStickPixels = 0.6F; // radius
/// A pointer at a marker means the marker, not the stick that comes out of it towards the eye.
constexpr float PickRetreat = 6.0F; // radii of the stick

struct VStickColours
{
  std::uint32_t A, B;
};
const VVertexLayout EndsLayout( sizeof( VEnds ), 1,
                                { { EAttributeStickA, 3, GL_FLOAT, false, 0 },
                                  { EAttributeStickB, 3, GL_FLOAT, false, 12 } } );
const VVertexLayout ColoursLayout( sizeof( VStickColours ), 1,
                                   { { EAttributeStickColourA, 4, GL_UNSIGNED_BYTE, true, 0 },
                                     { EAttributeStickColourB, 4, GL_UNSIGNED_BYTE, true, 4 } } );
// The same buffers, two vertices a stick.
const VVertexLayout LineLayout( sizeof( VEnds ) / 2, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 } } );
const VVertexLayout LineColourLayout( 4, 0, { { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 0 } } );

VSphereSizing Sizing( const VSceneOptions& i_rOptions )
{
  const float Scale = i_rOptions.ReconstructionScale;
  return { i_rOptions.MarkerRadius ? -1.0F : MarkerRadius, Scale > 0 && std::isfinite( Scale ) ? Scale : 1.0F };
}
} // namespace

struct VRenderSubjectMarkers::VGl
{
  VMesh Sphere = MakeSphereMesh( 1 );
  VMesh Stick = MakeStickMesh(), StickLine = MakeStickLine();
  VSubjectLook Targets;
  VSubjectLook Sticks, ThinSticks; ///< the thin ones are for picks
  std::shared_ptr< VShaderProgram > pLines;
  VRenderState LineState;
  VUniform StickWidth{ "u_StickRadius" };
  VUniform SmallestRadius{ "u_SmallestRadius" };
  VUniform Retreat{ "u_Retreat" };
  VGatheredInstances< VScenePoint > PickedTargets;
  VGatheredInstances< VEnds > PickedSticks;
};

/// What is kept of a group.
struct VRenderSubjectMarkers::VGroupDraw
{
  explicit VGroupDraw( const VSubjectGroup& i_rGroup )
    : rGroup( i_rGroup )
  {
  }
  void TakeMarkers( bool i_bHighlightCurrent );
  bool FeedSticks( bool i_bDuringGaps );
  bool AreSticksThin( VRenderContext& io_rContext );

  /// Whether sticks were thin in a view; a still frame need not look again.
  struct VThin
  {
    QMatrix4x4 ViewProjection;
    float PixelsAtOne = 0;
    std::uint64_t Generation = 0;
    bool bThin = false;
  };

  const VSubjectGroup& rGroup;
  VSphereBatch Markers;
  std::vector< std::uint32_t > Colours;
  std::uint64_t TakenMarkers = 0, TakenStructure = 0, TakenFlags = 0; ///< generations in the batch
  std::size_t MarkersShown = 0;
  VSubjectFlags MarkerFlags, StickFlags;
  VKindState< VScenePoint > Targets;
  VKindState< VEnds > Sticks;
  VHeldInstances StickColours;
  std::array< VThin, 4 > Thin;
  std::size_t NextThin = 0;
};

VRenderSubjectMarkers::VRenderSubjectMarkers( VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_pGl( std::make_unique< VGl >() )
{
  VResources& rResources = *i_rScene.Resources();
  VGl& rGl = *m_pGl;
  rGl.Targets.Programs.Load( rResources, "Target", "SimpleLighting" );
  rGl.Targets.pMesh = &rGl.Sphere;
  rGl.Targets.pMeshLayout = &SphereNormalLayout();
  rGl.Targets.pSeen = &SeenPlaceLayout();
  rGl.Targets.pPicked = &PickedPlaceLayout();
  rGl.Targets.State = SolidState();
  rGl.Sticks.Programs.Load( rResources, "StickBetween", "Colour" );
  rGl.Sticks.pMesh = &rGl.Stick;
  rGl.Sticks.pPicked = &PickedEndsLayout();
  rGl.Sticks.State = SolidState();
  rGl.ThinSticks.Programs.Load( rResources, "StickBetween", "Colour" );
  rGl.ThinSticks.pMesh = &rGl.StickLine;
  rGl.ThinSticks.Mode = GL_LINES;
  rGl.ThinSticks.pPicked = &PickedEndsLayout();
  rGl.ThinSticks.State = SolidState();
  rGl.pLines = rResources.GetProgram( "Simple3DVertexColour", "Colour" );
  rGl.LineState.depthFunction = EDepthLessOrEqual;
}

VRenderSubjectMarkers::~VRenderSubjectMarkers() = default;

void VRenderSubjectMarkers::SetGroups( const VGroups& i_rGroups )
{
  for ( std::size_t Group = 0; Group < GroupCount; ++Group )
  {
    m_Groups[Group] = i_rGroups[Group] ? std::make_unique< VGroupDraw >( *i_rGroups[Group] ) : nullptr;
  }
}

const VDisplayRecord& VRenderSubjectMarkers::Record( const VSceneOptions& i_rOptions, std::size_t i_Group )
{
  return i_Group == ESubjects ? i_rOptions.LabellingSubject
         : i_Group == ESolved ? i_rOptions.SolvingSubject
                              : i_rOptions.PropSubject;
}

void VRenderSubjectMarkers::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                    std::uint32_t i_Pass )
{
  if ( i_Pass != ERenderPassOpaque )
  {
    return;
  }
  for ( std::size_t Group = 0; Group < GroupCount; ++Group )
  {
    if ( m_Groups[Group] )
    {
      RenderGroup( io_rContext, i_rOptions, Group );
    }
  }
}

void VRenderSubjectMarkers::RenderGroup( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                                         std::size_t i_Group )
{
  VGroupDraw& rDraw = *m_Groups[i_Group];
  const VDisplayRecord& rRecord = Record( i_rOptions, i_Group );
  const bool bVisible = io_rContext.RenderMode() == ERenderModeNormal;
  const bool bAny = rRecord.Enabled && !rDraw.rGroup.IsEmpty();
  const bool bMarkers = bAny && rRecord.Markers, bTargets = bAny && rRecord.Targets, bSticks = bAny && rRecord.Sticks;
  const auto Count = [&]( ESubjectKind i_Kind, std::size_t i_Count )
  {
    if ( bVisible )
    {
      m_Counts[i_Group].Set( i_Kind, i_Count );
    }
  };
  if ( bMarkers )
  {
    rDraw.TakeMarkers( i_rOptions.HighlightCurrentSubject );
    if ( VSphereHelper* pHelper = m_rScene.SphereHelper() )
    {
      pHelper->Draw( io_rContext, m_rScene, rDraw.Markers, Sizing( i_rOptions ) );
    }
  }
  Count( ESubjectMarkers, bMarkers ? rDraw.MarkersShown : 0 );
  Count( ESubjectTargets, bTargets ? RenderTargets( io_rContext, i_rOptions, rDraw ) : 0 );
  Count( ESubjectSticks, bSticks ? RenderSticks( io_rContext, i_rOptions, rDraw, rRecord.SticksDuringGaps ) : 0 );
}

void VRenderSubjectMarkers::VGroupDraw::TakeMarkers( bool i_bHighlightCurrent )
{
  if ( TakenMarkers != rGroup.MarkerGeneration )
  {
    TakenMarkers = rGroup.MarkerGeneration;
    // The batch forgets what it has of others when the count is another.
    TakenStructure = Markers.Count() == rGroup.Markers.size() ? TakenStructure : 0;
    TakenFlags = Markers.Count() == rGroup.Markers.size() ? TakenFlags : 0;
    Markers.SetSpheres( rGroup.Markers );
    MarkersShown = 0;
    for ( const VScenePoint& rSphere : Markers.Spheres() )
    {
      MarkersShown += rSphere.Radius >= 0 ? 1 : 0;
    }
  }
  if ( TakenStructure != rGroup.StructureGeneration )
  {
    TakenStructure = rGroup.StructureGeneration;
    Colours = rGroup.MarkerColours;
    Colours.resize( Markers.Count(), 0xFFFFFFFF );
    Markers.SetColours( Colours );
  }
  MarkerFlags.Update( rGroup, rGroup.MarkerIds, Markers.Count(), &VSubjectRecord::Markers, i_bHighlightCurrent );
  if ( TakenFlags != MarkerFlags.Generation() )
  {
    TakenFlags = MarkerFlags.Generation();
    Markers.SetIds( MarkerFlags.First(), MarkerFlags.All() );
  }
}

std::size_t VRenderSubjectMarkers::RenderTargets( CoreGraphics::VRenderContext& io_rContext,
                                                  const VSceneOptions& i_rOptions, VGroupDraw& io_rDraw )
{
  const VSubjectGroup& rGroup = io_rDraw.rGroup;
  const VTargetShapes Shapes{ rGroup, io_rDraw.MarkerFlags };
  if ( io_rContext.RenderMode() == ERenderModeNormal )
  {
    return DrawSeen( io_rContext, m_pGl->Targets, io_rDraw.Targets.Seen, Shapes,
                     { rGroup.StructureGeneration, rGroup.PoseGeneration }, Shapes.Count() );
  }
  io_rDraw.MarkerFlags.Update( rGroup, rGroup.MarkerIds, rGroup.Markers.size(), &VSubjectRecord::Markers,
                               i_rOptions.HighlightCurrentSubject );
  DrawMarked( io_rContext, m_rScene, m_pGl->Targets, io_rDraw.Targets, m_pGl->PickedTargets, Shapes,
              { rGroup.StructureGeneration, rGroup.PoseGeneration, io_rDraw.MarkerFlags.Generation() } );
  return 0;
}

std::size_t VRenderSubjectMarkers::RenderSticks( CoreGraphics::VRenderContext& io_rContext,
                                                 const VSceneOptions& i_rOptions, VGroupDraw& io_rDraw,
                                                 bool i_bDuringGaps )
{
  VGl& rGl = *m_pGl;
  const VSubjectGroup& rGroup = io_rDraw.rGroup;
  if ( io_rContext.RenderMode() == ERenderModeNormal )
  {
    if ( !io_rDraw.FeedSticks( i_bDuringGaps ) || io_rDraw.Sticks.Seen.Shown() == 0 )
    {
      return 0;
    }
    io_rDraw.AreSticksThin( io_rContext ) ? DrawLines( io_rContext, io_rDraw ) : DrawRound( io_rContext, io_rDraw );
    return io_rDraw.Sticks.Seen.Shown();
  }
  io_rDraw.StickFlags.Update( rGroup, rGroup.StickIds, rGroup.Sticks.size(), &VSubjectRecord::Sticks,
                              i_rOptions.HighlightCurrentSubject );
  const VStickShapes Shapes{ rGroup, io_rDraw.StickFlags, i_bDuringGaps };
  // A pick looks for thin ones as they are seen: a band full of them is a matter of pixels.
  const bool bThin = io_rContext.RenderMode() == ERenderModeSelection && io_rDraw.AreSticksThin( io_rContext );
  DrawMarked( io_rContext, m_rScene, bThin ? rGl.ThinSticks : rGl.Sticks, io_rDraw.Sticks, rGl.PickedSticks, Shapes,
              { rGroup.StructureGeneration, rGroup.MarkerGeneration, io_rDraw.StickFlags.Generation(),
                i_bDuringGaps ? 1U : 0U },
              [&]( VShaderProgram& io_rProgram )
              {
                rGl.StickWidth.Set( io_rProgram, StickRadius );
                rGl.SmallestRadius.Set( io_rProgram, SmallestPixels );
                rGl.Retreat.Set( io_rProgram, io_rContext.RenderMode() == ERenderModeSelection ? PickRetreat : 0.0F );
              } );
  return 0;
}

bool VRenderSubjectMarkers::VGroupDraw::FeedSticks( bool i_bDuringGaps )
{
  const VStickShapes Shapes{ rGroup, StickFlags, i_bDuringGaps };
  const std::size_t Count = rGroup.Sticks.size();
  const bool bEnds = Sticks.Seen.Feed< VEnds >(
      { rGroup.StructureGeneration, rGroup.MarkerGeneration, i_bDuringGaps ? 1U : 0U }, Count,
      [&]( VEnds* o_pEnds )
      {
        std::size_t Shown = 0;
        for ( std::size_t Index = 0; Index < Count; ++Index )
        {
          const bool bShown = Shapes.MakeWhole( Index, o_pEnds[Index] ) || Shapes.Make( Index, o_pEnds[Index] );
          if ( !bShown )
          {
            o_pEnds[Index] = NowhereEnds;
          }
          Shown += bShown ? 1 : 0;
        }
        return VFilled{ Count, Shown };
      } );
  return bEnds && StickColours.Feed< VStickColours >( { rGroup.StructureGeneration }, Count,
                                                      [&]( VStickColours* o_pColours )
                                                      {
                                                        for ( const VSubjectStick& rStick : rGroup.Sticks )
                                                        {
                                                          *o_pColours++ = { rStick.ColourA, rStick.ColourB };
                                                        }
                                                        return VFilled{ Count, Count };
                                                      } );
}

bool VRenderSubjectMarkers::VGroupDraw::AreSticksThin( CoreGraphics::VRenderContext& io_rContext )
{
  const float AtOne = PixelsAtOne( io_rContext );
  const float ThinFrom = 2 * StickRadius * AtOne / ThinPixels;
  if ( io_rContext.Projection()( 3, 3 ) != 0.0F )
  {
    return ThinFrom < 1;
  }
  const QMatrix4x4& rViewProjection = io_rContext.ViewProjection();
  for ( const VThin& rThin : Thin )
  {
    if ( rThin.Generation == rGroup.MarkerGeneration && rThin.PixelsAtOne == AtOne &&
         rThin.ViewProjection == rViewProjection )
    {
      return rThin.bThin;
    }
  }
  // Every third marker tells enough of how far away sticks are.
  constexpr std::size_t Step = 3;
  const QVector4D Depth = rViewProjection.row( 3 );
  std::size_t Near = 0;
  for ( std::size_t Index = 0; Index < rGroup.Markers.size(); Index += Step )
  {
    const VScenePoint& rPoint = rGroup.Markers[Index];
    const float Distance = Depth.x() * rPoint.X + Depth.y() * rPoint.Y + Depth.z() * rPoint.Z + Depth.w();
    Near += Distance > 0 && Distance < ThinFrom ? 1 : 0;
  }
  VThin& rThin = Thin[NextThin];
  NextThin = ( NextThin + 1 ) % Thin.size();
  rThin = { rViewProjection, AtOne, rGroup.MarkerGeneration, Near * Step * ThickShare <= rGroup.Markers.size() };
  return rThin.bThin;
}

void VRenderSubjectMarkers::DrawLines( CoreGraphics::VRenderContext& io_rContext, VGroupDraw& io_rDraw )
{
  const VVertexStream Streams[] = { { &io_rDraw.Sticks.Seen.Buffer(), &LineLayout, 0 },
                                    { &io_rDraw.StickColours.Buffer(), &LineColourLayout, 0 } };
  if ( io_rContext.UseProgram( m_pGl->pLines ) && io_rContext.SetVertexStreams( Streams ) )
  {
    io_rContext.SetRenderState( m_pGl->LineState );
    io_rContext.DrawArrays( GL_LINES, static_cast< int >( 2 * io_rDraw.Sticks.Seen.Count() ) );
  }
}

void VRenderSubjectMarkers::DrawRound( CoreGraphics::VRenderContext& io_rContext, VGroupDraw& io_rDraw )
{
  VSubjectLook& rLook = m_pGl->Sticks;
  const VVertexStream Streams[] = { rLook.MeshStream(),
                                    { &io_rDraw.Sticks.Seen.Buffer(), &EndsLayout, 0 },
                                    { &io_rDraw.StickColours.Buffer(), &ColoursLayout, 0 } };
  if ( !rLook.Programs.Use( io_rContext, 0 ) || !io_rContext.SetVertexStreams( Streams ) )
  {
    return;
  }
  m_pGl->StickWidth.Set( *rLook.Programs.Current(), StickRadius );
  m_pGl->SmallestRadius.Set( *rLook.Programs.Current(), SmallestStickPixels );
  m_pGl->Retreat.Set( *rLook.Programs.Current(), 0.0F );
  io_rContext.SetRenderState( rLook.State );
  io_rContext.DrawElementsInstanced( GL_TRIANGLES, *rLook.pMesh, static_cast< int >( io_rDraw.Sticks.Seen.Count() ) );
}

} // namespace MoxelGraphics

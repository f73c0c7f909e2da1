#include <Flow2Graphics/VFlowRenderGeometry.h>

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>
#include <CoreMoxelTypes/FlowTypes.h>

#include <cmath>
#include <span>

namespace Flow2Graphics
{
namespace
{
using namespace CoreGraphics;
using CoreMoxelTypes::V3;
using CoreMoxelTypes::VGeometrySet;

constexpr std::uint32_t Tag = ZEK::FlowTag< CoreMoxelTypes::FlowGeometrySet >;
constexpr float PointRadius = 5.0F; // mm
constexpr std::uint32_t ColourMask = 0x00FFFFFF;
constexpr std::uint32_t Opaque = 0xFF000000;
constexpr std::uint32_t Translucent = 0x50000000;

static_assert( sizeof( VFlowRenderGeometry::VCorner ) == 16 );
const VVertexLayout CornerLayout( 16, 0,
                                  { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                    { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 12 } } );

bool IsPlace( const V3& i_rPlace )
{
  return std::isfinite( i_rPlace.x + i_rPlace.y + i_rPlace.z );
}

/// Calls back for each entry that holds for the state.
template < typename TVisit >
void Visit( const ZEK::IFlowState& i_rState, TVisit i_Visit )
{
  ZEK::VFlowCursor Entry, End;
  i_rState.TagBegin( Entry, Tag, ZEK::EFlowTimeMatch::Overlap );
  i_rState.TagEnd( End, Tag, ZEK::EFlowTimeMatch::Overlap );
  for ( ; Entry != End; ++Entry )
  {
    if ( ZEK::FlowTimeMatches( ZEK::EFlowTimeMatch::Overlap, Entry->Key, i_rState.GetKey() ) )
    {
      i_Visit( Entry->pItem );
    }
  }
}

/// Whole lines or triangles of a set, by its indices.
void AppendShapes( const VGeometrySet& i_rSet, std::span< const std::uint32_t > i_Indices, std::size_t i_Corners,
                   std::uint32_t i_Colour, std::vector< VFlowRenderGeometry::VCorner >& io_rCorners )
{
  for ( std::size_t First = 0; First + i_Corners <= i_Indices.size(); First += i_Corners )
  {
    const std::span< const std::uint32_t > Shape = i_Indices.subspan( First, i_Corners );
    if ( std::all_of( Shape.begin(), Shape.end(),
                      [&]( std::uint32_t i_Index )
                      {
                        return i_Index < i_rSet.Points.size() && IsPlace( i_rSet.Points[i_Index] );
                      } ) )
    {
      for ( const std::uint32_t Index : Shape )
      {
        const V3& rPoint = i_rSet.Points[Index];
        io_rCorners.push_back( { { rPoint.x, rPoint.y, rPoint.z }, i_Colour } );
      }
    }
  }
}
} // namespace

struct VFlowRenderGeometry::VGl
{
  struct VShapes
  {
    VDynamicBuffer Buffer;
    std::uint64_t Held = 0; ///< generation in the buffer, 0 for nothing
    VRenderState State;
  };
  std::shared_ptr< VShaderProgram > pProgram;
  VShapes Lines, Triangles;

  void Draw( VRenderContext& io_rContext, VShapes& io_rShapes, const std::vector< VCorner >& i_rCorners,
             std::uint64_t i_Generation, GLenum i_Mode )
  {
    if ( i_rCorners.empty() )
    {
      return;
    }
    if ( io_rShapes.Held != i_Generation || !io_rShapes.Buffer.Bind() )
    {
      io_rShapes.Held = io_rShapes.Buffer.Write( std::span( i_rCorners ) ) ? i_Generation : 0;
    }
    if ( io_rShapes.Held == 0 || !io_rContext.UseProgram( pProgram ) ||
         !io_rContext.SetVertexBuffer( { &io_rShapes.Buffer, &CornerLayout, 0 } ) )
    {
      return;
    }
    io_rContext.SetRenderState( io_rShapes.State );
    io_rContext.DrawArrays( i_Mode, static_cast< int >( i_rCorners.size() ) );
  }
};

VFlowRenderGeometry::VFlowRenderGeometry( MoxelGraphics::VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_pGl( std::make_unique< VGl >() )
{
  m_pGl->pProgram = i_rScene.Resources()->GetProgram( "Simple3DVertexColour", "Colour" );
  m_pGl->Lines.State.depthFunction = EDepthLessOrEqual;
  m_pGl->Triangles.State.depthFunction = EDepthLessOrEqual;
  m_pGl->Triangles.State.colourBlend = EColourBlendAlpha;
  m_pGl->Triangles.State.depthWrite = false;
  m_pGl->Triangles.State.cullMode = ECullNone;
}

VFlowRenderGeometry::~VFlowRenderGeometry() = default;

void VFlowRenderGeometry::Update( const ZEK::IFlowState& i_rState )
{
  if ( IsAsHeld( i_rState ) )
  {
    return;
  }
  m_Held.clear();
  m_Sets.clear();
  Visit( i_rState,
         [&]( ZEK::IFlowItem* i_pItem )
         {
           m_Held.emplace_back( i_pItem );
           std::string_view Name;
           i_pItem->Value().GetName( ZEK::EFlowNameDevice, Name );
           m_Sets[std::string( Name )] = m_Held.back();
         } );
  Rebuild();
}

bool VFlowRenderGeometry::IsAsHeld( const ZEK::IFlowState& i_rState ) const
{
  std::size_t Index = 0;
  bool bSame = true;
  Visit( i_rState,
         [&]( ZEK::IFlowItem* i_pItem )
         {
           bSame = bSame && Index < m_Held.size() &&
                   ( m_Held[Index].Get() == i_pItem || m_Held[Index]->Id() == i_pItem->Id() );
           ++Index;
         } );
  return bSame && Index == m_Held.size();
}

void VFlowRenderGeometry::Rebuild()
{
  m_Places.clear();
  m_Colours.clear();
  m_Lines.clear();
  m_Triangles.clear();
  for ( const auto& [rName, rItem] : m_Sets )
  {
    if ( const auto* const pSet = ZEK::FlowPayload< VGeometrySet >( rItem.Get() ) )
    {
      Append( *pSet );
    }
  }
  m_Points.SetSpheres( m_Places );
  m_Points.SetColours( m_Colours );
  ++m_Generation;
}

void VFlowRenderGeometry::Append( const VGeometrySet& i_rSet )
{
  const std::uint32_t Colour = i_rSet.Colour & ColourMask;
  for ( const V3& rPoint : i_rSet.Points )
  {
    m_Places.push_back( { rPoint.x, rPoint.y, rPoint.z, PointRadius } );
    m_Colours.push_back( Colour | Opaque );
  }
  AppendShapes( i_rSet, i_rSet.Lines, 2, Colour | Opaque, m_Lines );
  AppendShapes( i_rSet, i_rSet.Triangles, 3, Colour | Translucent, m_Triangles );
}

void VFlowRenderGeometry::Render( CoreGraphics::VRenderContext& io_rContext, const MoxelGraphics::VSceneOptions&,
                                  std::uint32_t i_Pass )
{
  if ( io_rContext.RenderMode() != MoxelGraphics::ERenderModeNormal )
  {
    return;
  }
  if ( i_Pass == MoxelGraphics::ERenderPassTranslucent )
  {
    m_pGl->Draw( io_rContext, m_pGl->Triangles, m_Triangles, m_Generation, GL_TRIANGLES );
  }
  else if ( i_Pass == MoxelGraphics::ERenderPassOpaque )
  {
    MoxelGraphics::VSphereHelper* const pHelper = m_rScene.SphereHelper();
    if ( pHelper && !m_Points.IsEmpty() )
    {
      pHelper->Draw( io_rContext, m_rScene, m_Points, {} );
    }
    m_pGl->Draw( io_rContext, m_pGl->Lines, m_Lines, m_Generation, GL_LINES );
  }
}

} // namespace Flow2Graphics

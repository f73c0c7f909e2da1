#include <MoxelGraphics/VRenderForcePlates.h>

#include "BuiltInMeshes.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VProgramPair.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

constexpr float SmallestForce = 25.0F; // N
constexpr float LargestForce = 1e6F;   // N; more is no reading
constexpr float LengthOfNewton = 0.5F; // mm
constexpr float ArrowRadius = 10.0F;   // mm
constexpr double LargestPlace = 1e9;   // mm
constexpr double SmallestArea = 1.0;   // mm^2
constexpr std::uint32_t ArrowColour = 0xFF8080FF;

static_assert( sizeof( VForcePlate ) == 68 );
const VVertexLayout InstanceLayout( sizeof( VForcePlate ), 1,
                                    { { EAttributeModelTransform, 16, GL_FLOAT, false, 0 },
                                      { EAttributeModelColour, 4, GL_UNSIGNED_BYTE, true, 64 } } );
const VVertexLayout FlagsLayout( 1, 1, { { EAttributeInstanceFlags, 1, GL_UNSIGNED_BYTE, false, 0 } } );

QVector3D ToVector( const std::array< float, 3 >& i_rValue )
{
  return { i_rValue[0], i_rValue[1], i_rValue[2] };
}

bool IsPlace( const std::array< float, 3 >& i_rPlace )
{
  return std::all_of( i_rPlace.begin(), i_rPlace.end(),
                      []( float i_Value )
                      {
                        return std::abs( i_Value ) < static_cast< float >( LargestPlace );
                      } );
}

/// Whether the load is one that shows, by its force and by its place.
bool IsShown( const VPlateLoad& i_rLoad )
{
  const float Force = ToVector( i_rLoad.Force ).length();
  return Force > SmallestForce && Force < LargestForce && IsPlace( i_rLoad.Centre );
}

struct VColumns
{
  std::array< float, 16 > Model{};

  template < typename TVector >
  void Set( std::size_t i_Column, const TVector& i_rValue )
  {
    for ( std::size_t Row = 0; Row < 3; ++Row )
    {
      Model[i_Column * 4 + Row] = static_cast< float >( i_rValue[Row] );
    }
  }
};

QVector4D ColourOf( std::uint32_t i_Colour )
{
  const auto Part = [&]( int i_Shift )
  {
    return static_cast< float >( i_Colour >> i_Shift & 0xFF ) / 255.0F;
  };
  return { Part( 0 ), Part( 8 ), Part( 16 ), Part( 24 ) };
}

VRenderState BodyState()
{
  VRenderState State;
  State.cullMode = ECullBack;
  State.depthFunction = EDepthLessOrEqual;
  return State;
}
} // namespace

struct VRenderForcePlates::VGl
{
  VInstancedProgramPair Plates;
  VInstancedProgramPair Arrows;
  VProgramPair Loaded;
  VMesh Box = MakeBoxMesh();
  VMesh Arrow = MakeArrowMesh();
  VRenderState State = BodyState();
  VDynamicBuffer PlateBuffer, ArrowBuffer, FlagsBuffer;
  std::uint64_t PlatesHeld = 0, ArrowsHeld = 0, FlagsHeld = 0; ///< generations in the buffers, 0 for nothing
  VUniform Force{ "u_Force" };
  VUniform LoadedForce{ "u_Force" };
  VUniform Centre{ "u_CentreOfPressure" };
  VUniform Transform{ "u_ModelTransform" };
  VUniform Colour{ "u_ModelColour" };

  /// Fills a buffer unless it holds that generation. A second try is for buffers that died with their windows.
  template < typename T >
  static bool Feed( VDynamicBuffer& io_rBuffer, const std::vector< T >& i_rValues, std::uint64_t i_Generation,
                    std::uint64_t& io_rHeld )
  {
    if ( io_rHeld != i_Generation || !io_rBuffer.Bind() )
    {
      io_rHeld = io_rBuffer.Write( std::span( i_rValues ) ) ? i_Generation : 0;
    }
    return io_rHeld != 0;
  }
};

VRenderForcePlates::VRenderForcePlates( VMoxelScene& i_rScene )
  : m_rScene( i_rScene )
  , m_pGl( std::make_unique< VGl >() )
{
  VResources& rResources = *i_rScene.Resources();
  m_pGl->Plates.Load( rResources, "ForcePlate", "ForcePlate" );
  m_pGl->Loaded.Load( rResources, "ForcePlate", "ForcePlate" );
  m_pGl->Arrows.Load( rResources, "ForcePlate", "SimpleLighting" );
}

VRenderForcePlates::~VRenderForcePlates() = default;

bool VRenderForcePlates::MakeModel( const std::array< std::array< double, 3 >, 4 >& i_rCorners, double i_Thickness,
                                    bool i_bYUp, std::array< float, 16 >& o_rModel )
{
  using VVector = std::array< double, 3 >;
  VVector X{}, Y{}, Middle{};
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    const double A = i_rCorners[0][Axis], B = i_rCorners[1][Axis], C = i_rCorners[2][Axis], D = i_rCorners[3][Axis];
    const double Largest =
        std::max( std::max( std::abs( A ), std::abs( B ) ), std::max( std::abs( C ), std::abs( D ) ) );
    // A sum with a NaN is one: no comparison with it holds.
    if ( !( Largest < LargestPlace ) || std::isnan( A + B + C + D ) )
    {
      return false;
    }
    X[Axis] = 0.5 * ( A + D - B - C );
    Y[Axis] = 0.5 * ( A + B - C - D );
    Middle[Axis] = 0.25 * ( A + B + C + D );
  }
  VVector Z{ X[1] * Y[2] - X[2] * Y[1], X[2] * Y[0] - X[0] * Y[2], X[0] * Y[1] - X[1] * Y[0] };
  const double Area = std::sqrt( Z[0] * Z[0] + Z[1] * Z[1] + Z[2] * Z[2] );
  if ( !( Area > SmallestArea ) )
  {
    return false;
  }
  // A square is the same with an axis turned round: turn one where the corners run the other way about.
  const bool bDown = Z[i_bYUp ? 1 : 2] < 0;
  const double Thickness = i_Thickness > 0 && i_Thickness < LargestPlace ? i_Thickness : 1.0;
  VColumns Columns;
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    Y[Axis] = bDown ? -Y[Axis] : Y[Axis];
    Z[Axis] *= ( bDown ? -Thickness : Thickness ) / Area;
    Middle[Axis] -= 0.5 * Z[Axis];
  }
  Columns.Set( 0, X );
  Columns.Set( 1, Y );
  Columns.Set( 2, Z );
  Columns.Set( 3, Middle );
  Columns.Model[15] = 1;
  o_rModel = Columns.Model;
  return true;
}

bool VRenderForcePlates::MakeArrow( const VPlateLoad& i_rLoad, std::array< float, 16 >& o_rModel )
{
  if ( !IsShown( i_rLoad ) )
  {
    return false;
  }
  const QVector3D Force = ToVector( i_rLoad.Force );
  const QVector3D Along = Force.normalized();
  const bool bFlat = std::abs( Along.z() ) < 0.7F;
  const QVector3D X =
      QVector3D::crossProduct( bFlat ? QVector3D( 0, 0, 1 ) : QVector3D( 1, 0, 0 ), Along ).normalized();
  VColumns Columns;
  Columns.Set( 0, ArrowRadius * X );
  Columns.Set( 1, ArrowRadius * QVector3D::crossProduct( Along, X ) );
  Columns.Set( 2, LengthOfNewton * Force );
  Columns.Set( 3, i_rLoad.Centre );
  Columns.Model[15] = 1;
  o_rModel = Columns.Model;
  return true;
}

void VRenderForcePlates::SetPlates( std::span< const VForcePlate > i_Plates )
{
  if ( i_Plates.size() != m_Plates.size() )
  {
    m_Flags.clear();
    m_bMarked = m_bFlagged = false;
    m_FirstId = 0;
    ++m_FlagsGeneration;
    m_Loads.assign( i_Plates.size(), {} );
    m_Arrows.clear();
    ++m_ArrowsGeneration;
  }
  m_Plates.assign( i_Plates.begin(), i_Plates.end() );
  ++m_PlatesGeneration;
}

void VRenderForcePlates::SetLoads( std::span< const VPlateLoad > i_Loads )
{
  if ( i_Loads.size() != m_Plates.size() )
  {
    return;
  }
  m_Arrows.clear();
  for ( std::size_t Index = 0; Index < i_Loads.size(); ++Index )
  {
    VForcePlate Arrow;
    Arrow.Colour = ArrowColour;
    const bool bShown = MakeArrow( i_Loads[Index], Arrow.Model );
    m_Loads[Index] = bShown ? i_Loads[Index] : VPlateLoad{};
    if ( bShown )
    {
      m_Arrows.push_back( Arrow );
    }
  }
  ++m_ArrowsGeneration;
}

void VRenderForcePlates::SetIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags )
{
  m_FirstId = i_FirstId;
  const auto Flags = i_Flags.size() == m_Plates.size() ? i_Flags : i_Flags.first( 0 );
  const bool bSame =
      Flags.empty() ? !m_bFlagged : std::equal( Flags.begin(), Flags.end(), m_Flags.begin(), m_Flags.end() );
  if ( bSame && m_Flags.size() == m_Plates.size() )
  {
    return;
  }
  m_bFlagged = !Flags.empty();
  m_Flags.assign( m_Plates.size(), 0 );
  std::copy( Flags.begin(), Flags.end(), m_Flags.begin() );
  m_bMarked = std::any_of( m_Flags.begin(), m_Flags.end(),
                           []( std::uint8_t i_Flag )
                           {
                             return ( i_Flag & ( EInstanceSelected | EInstancePreselected ) ) != 0;
                           } );
  ++m_FlagsGeneration;
}

void VRenderForcePlates::Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions&, std::uint32_t i_Pass )
{
  if ( i_Pass != ERenderPassOpaque || m_Plates.empty() )
  {
    return;
  }
  if ( io_rContext.RenderMode() == ERenderModeNormal )
  {
    RenderVisible( io_rContext );
  }
  else if ( m_FirstId != 0 && ( io_rContext.RenderMode() == ERenderModeSelection || m_bMarked ) )
  {
    RenderIds( io_rContext );
  }
}

void VRenderForcePlates::RenderVisible( CoreGraphics::VRenderContext& io_rContext )
{
  std::size_t First = 0;
  for ( std::size_t Index = 0; Index < m_Plates.size(); ++Index )
  {
    if ( IsShown( m_Loads[Index] ) )
    {
      RenderUnloaded( io_rContext, First, Index );
      RenderLoaded( io_rContext, Index );
      First = Index + 1;
    }
  }
  RenderUnloaded( io_rContext, First, m_Plates.size() );
  RenderArrows( io_rContext );
}

void VRenderForcePlates::RenderLoaded( CoreGraphics::VRenderContext& io_rContext, std::size_t i_Plate )
{
  VGl& rGl = *m_pGl;
  if ( !rGl.Loaded.Use( io_rContext ) || !io_rContext.SetVertexBuffer( rGl.Box.Stream() ) )
  {
    return;
  }
  VShaderProgram& rProgram = *rGl.Loaded.Current();
  io_rContext.SetRenderState( rGl.State );
  // The constructor reads rows.
  rGl.Transform.Set( rProgram, QMatrix4x4( m_Plates[i_Plate].Model.data() ).transposed() );
  rGl.Colour.Set( rProgram, ColourOf( m_Plates[i_Plate].Colour ) );
  rGl.LoadedForce.Set( rProgram, ToVector( m_Loads[i_Plate].Force ) );
  rGl.Centre.Set( rProgram, ToVector( m_Loads[i_Plate].Centre ) );
  io_rContext.DrawElements( GL_TRIANGLES, rGl.Box );
}

void VRenderForcePlates::RenderUnloaded( CoreGraphics::VRenderContext& io_rContext, std::size_t i_First,
                                         std::size_t i_End )
{
  VGl& rGl = *m_pGl;
  if ( i_First == i_End || !rGl.Plates.Use( io_rContext, m_FirstId ) ||
       !VGl::Feed( rGl.PlateBuffer, m_Plates, m_PlatesGeneration, rGl.PlatesHeld ) )
  {
    return;
  }
  const VVertexStream Streams[] = { rGl.Box.Stream(),
                                    { &rGl.PlateBuffer, &InstanceLayout, i_First * sizeof( VForcePlate ) } };
  if ( io_rContext.SetVertexStreams( Streams ) )
  {
    io_rContext.SetRenderState( rGl.State );
    rGl.Force.Set( *rGl.Plates.Current(), QVector3D() );
    io_rContext.DrawElementsInstanced( GL_TRIANGLES, rGl.Box, static_cast< int >( i_End - i_First ) );
  }
}

void VRenderForcePlates::RenderArrows( CoreGraphics::VRenderContext& io_rContext )
{
  VGl& rGl = *m_pGl;
  if ( m_Arrows.empty() || !rGl.Arrows.Use( io_rContext, 0 ) ||
       !VGl::Feed( rGl.ArrowBuffer, m_Arrows, m_ArrowsGeneration, rGl.ArrowsHeld ) )
  {
    return;
  }
  const VVertexStream Streams[] = { rGl.Arrow.Stream(), { &rGl.ArrowBuffer, &InstanceLayout, 0 } };
  if ( io_rContext.SetVertexStreams( Streams ) )
  {
    io_rContext.SetRenderState( rGl.State );
    io_rContext.DrawElementsInstanced( GL_TRIANGLES, rGl.Arrow, static_cast< int >( m_Arrows.size() ) );
  }
}

void VRenderForcePlates::RenderIds( CoreGraphics::VRenderContext& io_rContext )
{
  VGl& rGl = *m_pGl;
  const bool bHiding = io_rContext.RenderMode() == ERenderModeSelection && !m_rScene.IgnoredIds().empty();
  if ( bHiding )
  {
    for ( std::uint32_t Index = 0; Index < m_Flags.size(); ++Index )
    {
      const bool bHidden = m_rScene.IgnoreId( m_FirstId + Index, ERenderModeSelection );
      m_Flags[Index] =
          static_cast< std::uint8_t >( ( m_Flags[Index] & ~EInstanceHidden ) | ( bHidden ? EInstanceHidden : 0 ) );
    }
    ++m_FlagsGeneration;
  }
  const bool bFed = VGl::Feed( rGl.PlateBuffer, m_Plates, m_PlatesGeneration, rGl.PlatesHeld ) &&
                    VGl::Feed( rGl.FlagsBuffer, m_Flags, m_FlagsGeneration, rGl.FlagsHeld );
  if ( bHiding )
  {
    for ( std::uint8_t& rFlags : m_Flags )
    {
      rFlags = static_cast< std::uint8_t >( rFlags & ~EInstanceHidden );
    }
    ++m_FlagsGeneration;
  }
  const VVertexStream Streams[] = {
      rGl.Box.Stream(), { &rGl.PlateBuffer, &InstanceLayout, 0 }, { &rGl.FlagsBuffer, &FlagsLayout, 0 } };
  if ( bFed && rGl.Plates.Use( io_rContext, m_FirstId ) && io_rContext.SetVertexStreams( Streams ) )
  {
    io_rContext.SetRenderState( rGl.State );
    io_rContext.DrawElementsInstanced( GL_TRIANGLES, rGl.Box, static_cast< int >( m_Plates.size() ) );
  }
}

} // namespace MoxelGraphics

#include "VPickWindow.h"
#include "VSphereBatchGl.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VRenderContext.h>

#include <bit>
#include <cmath>
#include <cstring>

namespace MoxelGraphics
{
namespace
{
constexpr std::uint32_t FlagShift = 21;
constexpr std::uint32_t SkippedShift = 8;
constexpr std::uint8_t MarkedFlags = CoreGraphics::EInstanceSelected | CoreGraphics::EInstancePreselected;

static_assert( EIdSelected >> FlagShift == CoreGraphics::EInstanceSelected &&
               EIdPreselected >> FlagShift == CoreGraphics::EInstancePreselected &&
               EIdPrimary >> FlagShift == CoreGraphics::EInstancePrimary );

/// Walks over all spheres are written in blocks without branches, which the compiler turns into vector code.
constexpr std::size_t Lanes = 8;

constexpr VScenePoint Nowhere{ 1e18f, 1e18f, 1e18f, 0 };

/// A sphere in one register.
using VFour = float __attribute__( ( vector_size( 16 ) ) );
static_assert( sizeof( VFour ) == sizeof( VScenePoint ) );

constexpr VFour Four( float i_Value )
{
  return VFour{ i_Value, i_Value, i_Value, i_Value };
}

bool IsFinite( float i_Value )
{
  return i_Value - i_Value == 0.0f;
}
} // namespace

float PixelsAtOne( CoreGraphics::VRenderContext& io_rContext )
{
  // Half the frame's height, over what the projection maps to it at distance 1.
  return io_rContext.Projection()( 1, 1 ) * 0.5f * static_cast< float >( io_rContext.Viewport().height() );
}

VSphereBatch::VSphereBatch() = default;
VSphereBatch::~VSphereBatch() = default;

void VSphereBatch::SetSpheres( std::span< const VScenePoint > i_Spheres )
{
  if ( i_Spheres.size() != m_Spheres.size() )
  {
    m_Flags.clear();
    m_MarkedBegin = m_MarkedEnd = 0;
    m_FirstId = 0;
    m_Colours.clear();
    ++m_FlagsGeneration;
    ++m_ColoursGeneration;
  }
  m_Spheres.resize( i_Spheres.size() );
  ++m_SpheresGeneration;
  if ( TakeOrdinary( i_Spheres ) )
  {
    return;
  }
  m_BoxMin.fill( std::numeric_limits< float >::max() );
  m_BoxMax.fill( std::numeric_limits< float >::lowest() );
  m_LargestRadius = 0;
  for ( std::size_t Index = 0; Index < i_Spheres.size(); ++Index )
  {
    const VScenePoint& rNew = i_Spheres[Index];
    VScenePoint& rSphere = m_Spheres[Index];
    if ( !IsFinite( rNew.X ) || !IsFinite( rNew.Y ) || !IsFinite( rNew.Z ) )
    {
      rSphere = { 0, 0, 0, -1 };
      continue;
    }
    rSphere = { rNew.X, rNew.Y, rNew.Z, IsFinite( rNew.Radius ) ? std::max( rNew.Radius, 0.0f ) : 0.0f };
    m_BoxMin = { std::min( m_BoxMin[0], rNew.X ), std::min( m_BoxMin[1], rNew.Y ), std::min( m_BoxMin[2], rNew.Z ) };
    m_BoxMax = { std::max( m_BoxMax[0], rNew.X ), std::max( m_BoxMax[1], rNew.Y ), std::max( m_BoxMax[2], rNew.Z ) };
    m_LargestRadius = std::max( m_LargestRadius, rSphere.Radius );
  }
}

bool VSphereBatch::TakeOrdinary( std::span< const VScenePoint > i_Spheres )
{
  VFour Least = Four( std::numeric_limits< float >::max() ), Most = Four( std::numeric_limits< float >::lowest() );
  VFour Excess = Four( 0 ); // 0 for numbers, else NaN
  for ( std::size_t Index = 0; Index < i_Spheres.size(); ++Index )
  {
    const auto Sphere = std::bit_cast< VFour >( i_Spheres[Index] );
    Least = Sphere < Least ? Sphere : Least;
    Most = Sphere > Most ? Sphere : Most;
    Excess += Sphere - Sphere;
    m_Spheres[Index] = i_Spheres[Index];
  }
  const bool bNumbers = Excess[0] == 0 && Excess[1] == 0 && Excess[2] == 0 && Excess[3] == 0;
  m_bOrdinary = bNumbers && Least[3] > 0 && Most[3] < LargestSize;
  m_BoxMin = { Least[0], Least[1], Least[2] };
  m_BoxMax = { Most[0], Most[1], Most[2] };
  m_LargestRadius = std::max( Most[3], 0.0f );
  return m_bOrdinary;
}

void VSphereBatch::SetColour( const std::array< float, 4 >& i_rColour )
{
  if ( !m_Colours.empty() || i_rColour != m_Colour )
  {
    m_Colours.clear();
    m_Colour = i_rColour;
    ++m_ColoursGeneration;
  }
}

void VSphereBatch::SetColours( std::span< const std::uint32_t > i_Colours )
{
  if ( i_Colours.size() == m_Spheres.size() &&
       !std::equal( i_Colours.begin(), i_Colours.end(), m_Colours.begin(), m_Colours.end() ) )
  {
    m_Colours.assign( i_Colours.begin(), i_Colours.end() );
    ++m_ColoursGeneration;
  }
}

void VSphereBatch::SetIds( std::uint32_t i_FirstId, std::span< const std::uint8_t > i_Flags )
{
  m_FirstId = i_FirstId;
  const std::span< const std::uint8_t > Flags = i_Flags.size() == m_Spheres.size() ? i_Flags : i_Flags.first( 0 );
  if ( std::equal( Flags.begin(), Flags.end(), m_Flags.begin(), m_Flags.end() ) )
  {
    return;
  }
  m_Flags.assign( Flags.begin(), Flags.end() );
  ++m_FlagsGeneration;
  m_MarkedBegin = m_MarkedEnd = 0;
  for ( std::uint32_t Index = 0; Index < m_Flags.size(); ++Index )
  {
    if ( ( m_Flags[Index] & MarkedFlags ) != 0 )
    {
      m_MarkedBegin = m_MarkedEnd == 0 ? Index : m_MarkedBegin;
      m_MarkedEnd = Index + 1;
    }
  }
}

VSphereExtent VSphereBatch::Extent( CoreGraphics::VRenderContext& io_rContext, const VSphereSizing& i_rSizing,
                                    float i_Small )
{
  const float Largest = ( i_rSizing.FixedRadius < 0 ? m_LargestRadius : i_rSizing.FixedRadius ) * i_rSizing.Scale;
  const float AtOne = PixelsAtOne( io_rContext );
  if ( io_rContext.Projection()( 3, 3 ) != 0.0f )
  {
    const float Pixels = Largest * AtOne;
    return { Pixels, Pixels >= FinePixels ? m_Spheres.size() : 0 };
  }
  const QVector3D Eye = io_rContext.CameraPosition();
  float Square = 0;
  for ( int Axis = 0; Axis < 3; ++Axis )
  {
    const auto Index = static_cast< std::size_t >( Axis );
    const float Gap = std::max( { m_BoxMin[Index] - Eye[Axis], Eye[Axis] - m_BoxMax[Index], 0.0f } );
    Square += Gap * Gap;
  }
  const float AtMost = Largest * AtOne / std::max( std::sqrt( Square ), 1e-3f );
  if ( AtMost < i_Small )
  {
    return { AtMost, 0 };
  }
  // The box may reach to the eye where no sphere does: look at each.
  const QMatrix4x4& rViewProjection = io_rContext.ViewProjection();
  for ( const VSeen& rSeen : m_Seen )
  {
    if ( rSeen.Generation == m_SpheresGeneration && rSeen.PixelsAtOne == AtOne && rSeen.Sizing == i_rSizing &&
         rSeen.ViewProjection == rViewProjection )
    {
      return rSeen.Extent;
    }
  }
  VSeen& rSeen = m_Seen[m_NextSeen];
  m_NextSeen = ( m_NextSeen + 1 ) % m_Seen.size();
  rSeen = { rViewProjection, AtOne, i_rSizing, m_SpheresGeneration,
            MeasureEach( rViewProjection.row( 3 ), AtOne, i_rSizing ) };
  return rSeen.Extent;
}

VSphereExtent VSphereBatch::MeasureEach( const QVector4D& i_rDepth, float i_PixelsAtOne,
                                         const VSphereSizing& i_rSizing ) const
{
  const float X = i_rDepth.x(), Y = i_rDepth.y(), Z = i_rDepth.z(), W = i_rDepth.w();
  std::array< float, Lanes > Largest{};
  std::array< std::uint32_t, Lanes > Fine{};
  const auto Measure = [&]( const VScenePoint& i_rSphere, std::size_t i_Lane )
  {
    const float Away = X * i_rSphere.X + Y * i_rSphere.Y + Z * i_rSphere.Z + W;
    const float Size = SizeOf( i_rSphere, i_rSizing );
    const float Near = Size * i_PixelsAtOne / std::max( Away, 1.0f );
    const float Pixels = Away + Size > 0 ? Near : 0.0f;
    Largest[i_Lane] = std::max( Largest[i_Lane], Pixels );
    Fine[i_Lane] += Pixels >= FinePixels ? 1u : 0u;
  };
  const std::size_t Blocks = m_Spheres.size() / Lanes * Lanes;
  for ( std::size_t First = 0; First < Blocks; First += Lanes )
  {
    for ( std::size_t Lane = 0; Lane < Lanes; ++Lane )
    {
      Measure( m_Spheres[First + Lane], Lane );
    }
  }
  for ( std::size_t Index = Blocks; Index < m_Spheres.size(); ++Index )
  {
    Measure( m_Spheres[Index], 0 );
  }
  VSphereExtent Result;
  for ( std::size_t Lane = 0; Lane < Lanes; ++Lane )
  {
    Result.Largest = std::max( Result.Largest, Largest[Lane] );
    Result.FineCount += Fine[Lane];
  }
  return Result;
}

VSphereExtent VSphereBatch::Gather( const VPickWindow& i_rWindow, const VSphereSizing& i_rSizing,
                                    const VMoxelScene& i_rScene, std::uint32_t i_First, std::uint32_t i_End,
                                    std::vector< VPickedSphere >& io_rPicked ) const
{
  VSphereExtent Extent;
  for ( std::uint32_t Index = i_First; Index < i_End; ++Index )
  {
    const VScenePoint& rSphere = m_Spheres[Index];
    const float Size = SizeOf( rSphere, i_rSizing );
    const float Depth = i_rWindow.Depth( rSphere.X, rSphere.Y, rSphere.Z );
    if ( !( Size > 0 ) || !i_rWindow.Meets( rSphere.X, rSphere.Y, rSphere.Z, i_rWindow.Drawn( Size, Depth ) ) ||
         i_rScene.IsIgnored( m_FirstId + Index ) )
    {
      continue;
    }
    const auto Skipped = Index - i_First - static_cast< std::uint32_t >( io_rPicked.size() );
    io_rPicked.push_back( { { rSphere.X, rSphere.Y, rSphere.Z, Size },
                            ( m_Flags.empty() ? 0u : m_Flags[Index] ) | Skipped << SkippedShift } );
    const float Pixels = Size * i_rWindow.PixelsAtOne() / std::max( Depth, 1.0f );
    Extent.Largest = std::max( Extent.Largest, Pixels );
    Extent.FineCount += Pixels >= FinePixels ? 1 : 0;
  }
  return Extent;
}

bool VSphereBatch::UploadSpheres( const VSphereSizing& i_rSizing )
{
  if ( m_pGl->SpheresGeneration == m_SpheresGeneration && m_pGl->Sizing == i_rSizing )
  {
    return true;
  }
  auto* pInstance = static_cast< VScenePoint* >( m_pGl->Spheres.Map( m_Spheres.size() * sizeof( VScenePoint ) ) );
  if ( !pInstance )
  {
    return false;
  }
  if ( m_bOrdinary && i_rSizing == VSphereSizing() )
  {
    std::memcpy( pInstance, m_Spheres.data(), m_Spheres.size() * sizeof( VScenePoint ) );
  }
  else
  {
    for ( const VScenePoint& rSphere : m_Spheres )
    {
      // What is not drawn stands where no view reaches: a point would show there even without a size.
      const float Size = SizeOf( rSphere, i_rSizing );
      *pInstance++ = Size > 0 ? VScenePoint{ rSphere.X, rSphere.Y, rSphere.Z, Size } : Nowhere;
    }
  }
  m_pGl->Sizing = i_rSizing;
  m_pGl->SpheresGeneration = m_pGl->Spheres.Unmap() ? m_SpheresGeneration : 0;
  return m_pGl->SpheresGeneration != 0;
}

bool VSphereBatch::UploadColours()
{
  if ( m_Colours.empty() || m_pGl->ColoursGeneration == m_ColoursGeneration )
  {
    return true;
  }
  m_pGl->ColoursGeneration = m_pGl->Colours.Write( std::span( m_Colours ) ) ? m_ColoursGeneration : 0;
  return m_pGl->ColoursGeneration != 0;
}

bool VSphereBatch::UploadFlags()
{
  if ( m_pGl->FlagsGeneration == m_FlagsGeneration )
  {
    return true;
  }
  auto* pFlags = static_cast< std::uint8_t* >( m_pGl->Flags.Map( m_Spheres.size() ) );
  if ( !pFlags )
  {
    return false;
  }
  m_Flags.empty() ? std::fill_n( pFlags, m_Spheres.size(), std::uint8_t( 0 ) )
                  : std::copy( m_Flags.begin(), m_Flags.end(), pFlags );
  m_pGl->FlagsGeneration = m_pGl->Flags.Unmap() ? m_FlagsGeneration : 0;
  return m_pGl->FlagsGeneration != 0;
}

} // namespace MoxelGraphics

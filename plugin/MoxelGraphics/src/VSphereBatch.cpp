#include "VSphereBatchGl.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VRenderContext.h>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
constexpr std::uint32_t FlagShift = 21;
constexpr std::uint8_t MarkedFlags = CoreGraphics::EInstanceSelected | CoreGraphics::EInstancePreselected;

static_assert( EIdSelected >> FlagShift == CoreGraphics::EInstanceSelected &&
               EIdPreselected >> FlagShift == CoreGraphics::EInstancePreselected &&
               EIdPrimary >> FlagShift == CoreGraphics::EInstancePrimary );

bool IsPlace( const VScenePoint& i_rPoint )
{
  return std::isfinite( i_rPoint.X ) && std::isfinite( i_rPoint.Y ) && std::isfinite( i_rPoint.Z );
}
} // namespace

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
  m_Spheres.assign( i_Spheres.begin(), i_Spheres.end() );
  MeasureBox();
  ++m_SpheresGeneration;
}

void VSphereBatch::MeasureBox()
{
  m_BoxMin.fill( std::numeric_limits< float >::max() );
  m_BoxMax.fill( std::numeric_limits< float >::lowest() );
  m_LargestRadius = 0;
  for ( const VScenePoint& rSphere : m_Spheres )
  {
    if ( IsPlace( rSphere ) )
    {
      const std::array< float, 3 > Place{ rSphere.X, rSphere.Y, rSphere.Z };
      for ( std::size_t Axis = 0; Axis < 3; ++Axis )
      {
        m_BoxMin[Axis] = std::min( m_BoxMin[Axis], Place[Axis] );
        m_BoxMax[Axis] = std::max( m_BoxMax[Axis], Place[Axis] );
      }
      m_LargestRadius = std::max( m_LargestRadius, rSphere.Radius );
    }
  }
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

float VSphereBatch::Radius( const VScenePoint& i_rSphere, const VSphereSizing& i_rSizing ) const
{
  const float Own = i_rSizing.FixedRadius < 0 ? i_rSphere.Radius : i_rSizing.FixedRadius;
  return std::isfinite( Own ) && Own > 0 && IsPlace( i_rSphere ) ? Own * i_rSizing.Scale : 0.0f;
}

VSphereBatch::VExtent VSphereBatch::Extent( CoreGraphics::VRenderContext& io_rContext,
                                            const VSphereSizing& i_rSizing ) const
{
  const float Largest = ( i_rSizing.FixedRadius < 0 ? m_LargestRadius : i_rSizing.FixedRadius ) * i_rSizing.Scale;
  const QMatrix4x4& rProjection = io_rContext.Projection();
  // Half the frame's height, over what the projection maps to it at distance 1.
  const float PixelsAtOne = rProjection( 1, 1 ) * 0.5f * static_cast< float >( io_rContext.Viewport().height() );
  if ( rProjection( 3, 3 ) != 0.0f )
  {
    const float Pixels = Largest * PixelsAtOne;
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
  const float AtMost = Largest * PixelsAtOne / std::max( std::sqrt( Square ), 1e-3f );
  if ( AtMost < CoarsePixels )
  {
    return { AtMost, 0 };
  }
  // The box may reach to the eye where no sphere does: look at each.
  const QVector4D Depth = io_rContext.ViewProjection().row( 3 );
  VExtent Result;
  for ( const VScenePoint& rSphere : m_Spheres )
  {
    const float Away = Depth.x() * rSphere.X + Depth.y() * rSphere.Y + Depth.z() * rSphere.Z + Depth.w();
    const float Size = Radius( rSphere, i_rSizing );
    const float Pixels = Away + Size > 0 ? Size * PixelsAtOne / std::max( Away, 1.0f ) : 0.0f;
    Result.Largest = std::max( Result.Largest, Pixels );
    Result.FineCount += Pixels >= FinePixels ? 1 : 0;
  }
  return Result;
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
  for ( const VScenePoint& rSphere : m_Spheres )
  {
    const float Size = Radius( rSphere, i_rSizing );
    // A sphere without size has no area, wherever its place.
    *pInstance++ = Size > 0 ? VScenePoint{ rSphere.X, rSphere.Y, rSphere.Z, Size } : VScenePoint{};
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

bool VSphereBatch::UploadFlags( const VMoxelScene& i_rScene, bool i_bIgnoring )
{
  const std::uint64_t Ignored = i_bIgnoring ? i_rScene.IgnoredGeneration() : 0;
  if ( m_pGl->FlagsGeneration == m_FlagsGeneration && m_pGl->Ignored == Ignored &&
       ( Ignored == 0 || m_pGl->IgnoredFirstId == m_FirstId ) )
  {
    return true;
  }
  auto* pFlags = static_cast< std::uint8_t* >( m_pGl->Flags.Map( m_Spheres.size() ) );
  if ( !pFlags )
  {
    return false;
  }
  for ( std::size_t Index = 0; Index < m_Spheres.size(); ++Index )
  {
    const bool bHidden =
        i_bIgnoring && i_rScene.IgnoredIds().contains( m_FirstId + static_cast< std::uint32_t >( Index ) );
    pFlags[Index] = static_cast< std::uint8_t >( ( m_Flags.empty() ? 0 : m_Flags[Index] ) |
                                                 ( bHidden ? CoreGraphics::EInstanceHidden : 0 ) );
  }
  m_pGl->Ignored = Ignored;
  m_pGl->IgnoredFirstId = m_FirstId;
  m_pGl->FlagsGeneration = m_pGl->Flags.Unmap() ? m_FlagsGeneration : 0;
  return m_pGl->FlagsGeneration != 0;
}

} // namespace MoxelGraphics

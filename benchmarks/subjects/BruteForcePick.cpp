#include "BruteForcePick.h"

#include <CoreGraphics/VRenderContext.h>
#include <CoreMoxelTypes/FlowTypes.h>

#include <QtOpenGL/QOpenGLFramebufferObject>

#include <algorithm>

namespace SubjectsBench
{
namespace
{
using MoxelGraphics::VSceneOptions;

/// What is drawn when all ids but one are ignored.
class VWalk
{
public:
  VWalk( VStandardView& io_rView, const QRect& i_rBand )
    : m_rView( io_rView )
    , m_rContext( *io_rView.Frame.Context() )
    , m_Band( i_rBand.x() / 2, ( Height - i_rBand.y() - i_rBand.height() ) / 2, i_rBand.width() / 2,
              i_rBand.height() / 2 )
    , m_Target( Width, Height, QOpenGLFramebufferObject::Depth )
    , m_Pixels( static_cast< std::size_t >( m_Band.width() * m_Band.height() ) )
  {
    m_Ignored.reserve( io_rView.pScene->Registry().NextId() );
    for ( std::uint32_t Id = 2; Id < io_rView.pScene->Registry().NextId(); ++Id )
    {
      m_Ignored.push_back( Id );
    }
    m_rContext.ResetState();
    m_rContext.SetRenderMode( CoreGraphics::ERenderModeSelection );
    m_rContext.SetFrameSize( { Width / 2, Height / 2 } );
    m_rContext.SetViewport( { 0, 0, Width / 2, Height / 2 } );
    m_rContext.BindFramebuffer( &m_Target );
  }
  ~VWalk()
  {
    m_rView.pScene->SetIgnoredIds( {} );
    m_rContext.SetRenderMode( CoreGraphics::ERenderModeNormal );
    m_rContext.SetFrameSize( { Width, Height } );
    m_rContext.BindFramebuffer( nullptr );
  }

  bool IsSeen( std::uint32_t i_Id )
  {
    // Ids are ignored in ascending order, the place of the one that is not taken by the first.
    if ( i_Id > 1 )
    {
      m_Ignored[i_Id - 2] = i_Id - 1;
    }
    m_rView.pScene->SetIgnoredIds( m_Ignored );
    m_rView.pScene->Clear( m_rContext, m_rView.Frame.Input().Options, m_Band );
    m_rView.pScene->DrawScene( m_rContext, m_rView.Frame.Input().Options );
    m_rContext.ReadPixels( m_Band, m_Pixels.data(), GL_RGBA );
    return std::any_of( m_Pixels.begin(), m_Pixels.end(),
                        [&]( std::uint32_t i_Pixel )
                        {
                          return ( i_Pixel & MoxelGraphics::EIdMask ) == i_Id;
                        } );
  }

private:
  VStandardView& m_rView;
  CoreGraphics::VRenderContext& m_rContext;
  const QRect m_Band; ///< at half the size, y up
  QOpenGLFramebufferObject m_Target;
  std::vector< std::uint32_t > m_Pixels;
  std::vector< std::uint32_t > m_Ignored;
};

bool IsCentreIn( const MoxelGraphics::VScenePoint& i_rPoint, const QMatrix4x4& i_rViewProjection, const QRect& i_rBand )
{
  const QVector4D Clip = i_rViewProjection * QVector4D( i_rPoint.X, i_rPoint.Y, i_rPoint.Z, 1 );
  const float X = ( Clip.x() / Clip.w() + 1 ) * Width / 2, Y = ( 1 - Clip.y() / Clip.w() ) * Height / 2;
  const auto Lies = []( float i_Value, int i_First, int i_Length )
  {
    return i_Value >= static_cast< float >( i_First ) && i_Value <= static_cast< float >( i_First + i_Length );
  };
  return Clip.w() > 0 && Lies( X, i_rBand.x(), i_rBand.width() ) && Lies( Y, i_rBand.y(), i_rBand.height() );
}
} // namespace

std::vector< std::uint32_t > WalkBand( VStandardView& io_rView, const QRect& i_rBand )
{
  const MoxelGraphics::VSelectionRegistry& rRegistry = io_rView.pScene->Registry();
  const QMatrix4x4 ViewProjection = io_rView.Frame.Context()->ViewProjection();
  VWalk Walk( io_rView, i_rBand );
  std::vector< std::uint32_t > Found;
  ZEK::VSelectionItem Item;
  for ( std::uint32_t Id = 1; Id < rRegistry.NextId(); ++Id )
  {
    MoxelGraphics::VScenePoint Point;
    const bool bSphere = rRegistry.Resolve( Id, Item ) &&
                         ( Item.Kind == ZEK::ESelectReconstruction || Item.Kind == ZEK::ESelectMarker ) &&
                         rRegistry.GetPosition( Item, Point );
    if ( Walk.IsSeen( Id ) || ( bSphere && IsCentreIn( Point, ViewProjection, i_rBand ) ) )
    {
      Found.push_back( Id );
    }
  }
  return Found;
}

} // namespace SubjectsBench

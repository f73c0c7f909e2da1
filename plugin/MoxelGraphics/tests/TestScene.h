#pragma once

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VRenderAxis.h>
#include <MoxelGraphics/VRenderFloorGrid.h>
#include <MoxelGraphics/VRenderOutlines.h>
#include <MoxelGraphics/VRenderReconstructions.h>
#include <MoxelGraphics/VSceneFrame.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/ShaderResources.h>
#include <CoreGraphics/VCameraController.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <QtGui/QImage>
#include <QtGui/QOffscreenSurface>
#include <QtGui/QOpenGLContext>
#include <QtOpenGL/QOpenGLFramebufferObject>

#include <gtest/gtest.h>

#include <atomic>
#include <cmath>
#include <mutex>

namespace MoxelGraphics
{

class VTestSelection final : public ZEK::ISelectionService
{
public:
  ZEK::VSelection Get( ESet i_Set ) const override
  {
    const std::lock_guard Lock( m_Guard );
    return m_Sets[i_Set];
  }
  bool Get( ESet i_Set, const std::vector< std::uint32_t >& i_rKinds, ZEK::VSelection& o_rSelection ) const override
  {
    o_rSelection = Get( i_Set );
    std::erase_if( o_rSelection,
                   [&]( const ZEK::VSelectionItem& i_rItem )
                   {
                     return std::find( i_rKinds.begin(), i_rKinds.end(), i_rItem.Kind ) == i_rKinds.end();
                   } );
    return !o_rSelection.empty();
  }
  std::uint64_t Generation() const override { return m_Generation; }
  void Set( ESet i_Set, ZEK::VSelection i_Selection ) override
  {
    {
      const std::lock_guard Lock( m_Guard );
      if ( m_Sets[i_Set] == i_Selection )
      {
        return;
      }
      m_Sets[i_Set] = std::move( i_Selection );
      ++m_Generation;
    }
    m_pChanged->Fire();
  }
  std::shared_ptr< ZEK::IMultiCallback< void() > > ForKinds( const std::vector< std::uint32_t >& ) override
  {
    return m_pChanged;
  }
  ZEK::VSelectionItem FromName( const std::string& ) const override { return {}; }
  std::string Text( const ZEK::VSelectionItem& i_rItem ) const override { return i_rItem.Device; }

private:
  mutable std::mutex m_Guard;
  ZEK::VSelection m_Sets[2];
  std::atomic< std::uint64_t > m_Generation{ 1 };
  std::shared_ptr< ZEK::VMultiCallback< void() > > m_pChanged = std::make_shared< ZEK::VMultiCallback< void() > >();
};

inline ZEK::VSelectionItem Recon( std::uint32_t i_Index )
{
  return { ZEK::ESelectReconstruction, {}, 0, i_Index };
}

/// Members of a set of points, labelled "point <index>".
class VTestPoints final : public IRangeResolver
{
public:
  bool ResolveIndex( std::uint32_t i_Index, ZEK::VSelectionItem& o_rItem, std::string& o_rLabel ) const override
  {
    ++Asked;
    o_rItem = Recon( i_Index );
    o_rLabel = "point " + std::to_string( i_Index );
    return i_Index < Points.size();
  }
  bool FindIndex( const ZEK::VSelectionItem& i_rItem, std::uint32_t& o_rIndex ) const override
  {
    o_rIndex = i_rItem.Sub;
    return i_rItem.Kind == ZEK::ESelectReconstruction && i_rItem.Sub < Points.size();
  }
  bool GetPoint( std::uint32_t i_Index, VScenePoint& o_rPoint ) const override
  {
    o_rPoint = Points[i_Index];
    return true;
  }

  std::vector< VScenePoint > Points;
  mutable std::atomic< int > Asked{ 0 };
};

/// Single pixels of the frame, y up: each bears an id in the selection mode, the last of equal places on top.
class VTestPixels final : public IRenderType
{
public:
  struct VPixel
  {
    int X, Y;
    std::uint32_t Id;
  };
  explicit VTestPixels( const VMoxelScene& i_rScene )
    : m_rScene( i_rScene )
  {
  }
  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions&, std::uint32_t i_Pass ) override
  {
    const bool bPicking = io_rContext.RenderMode() == ERenderModeSelection;
    if ( i_Pass != ERenderPassOpaque || !bPicking )
    {
      return;
    }
    const QRect Window = io_rContext.Scissor();
    for ( const VPixel& rPixel : Pixels )
    {
      if ( Window.contains( rPixel.X, rPixel.Y ) && !m_rScene.IgnoreId( rPixel.Id, ERenderModeSelection ) )
      {
        io_rContext.SetScissor( { rPixel.X, rPixel.Y, 1, 1 } );
        io_rContext.SetClearColour(
            QColor( rPixel.Id & 0xFF, ( rPixel.Id >> 8 ) & 0xFF, ( rPixel.Id >> 16 ) & 0xFF, 1 ) );
        io_rContext.Clear( true, false );
      }
    }
    io_rContext.SetScissor( Window );
  }
  std::vector< VPixel > Pixels;

private:
  const VMoxelScene& m_rScene;
};

/// A red square of 20 pixels in the lower left corner of the frame.
class VTestCorner final : public IRenderType
{
public:
  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions&, std::uint32_t i_Pass ) override
  {
    if ( i_Pass == ERenderPassOverlay && io_rContext.RenderMode() == ERenderModeNormal && bShown )
    {
      const QRect Window = io_rContext.Scissor();
      io_rContext.SetScissor( { 0, 0, 20, 20 } );
      io_rContext.SetClearColour( Qt::red );
      io_rContext.Clear( true, false );
      io_rContext.SetScissor( Window );
    }
  }
  bool bShown = false;
};

/// A scene of points on a floor. Points are set on the GUI thread before the first frame, or with `Change`.
class VTestScene : public VMoxelScene
{
public:
  explicit VTestScene( std::shared_ptr< HarrowPluginInterface::IRenderResources > i_pResources = nullptr )
    : VTestScene( std::move( i_pResources ), std::make_shared< VTestSelection >() )
  {
  }
  VTestScene( std::shared_ptr< HarrowPluginInterface::IRenderResources > i_pResources,
              std::shared_ptr< VTestSelection > i_pSelection )
    : VMoxelScene( std::move( i_pResources ), i_pSelection, nullptr, nullptr, false )
    , pSelection( std::move( i_pSelection ) )
    , pCorner( std::make_shared< VTestCorner >() )
    , pPixels( std::make_shared< VTestPixels >( *this ) )
  {
  }

  void Initialise( CoreGraphics::VRenderContext& io_rContext ) override
  {
    VMoxelScene::Initialise( io_rContext );
    ++Initialised;
    if ( m_RenderList.empty() && CanDraw() )
    {
      pFloor = std::make_shared< VRenderFloorGrid >( Resources() );
      pRecons = std::make_shared< VRenderReconstructions >( *this );
      m_RenderList = { pFloor, pRecons, pPixels, pCorner, std::make_shared< VRenderAxis >( Resources() ) };
      pOutlines = std::make_shared< VRenderOutlines >( *this );
      m_PostList.push_back( pOutlines );
    }
  }
  bool ProcessPending() override
  {
    const bool bRan = VMoxelScene::ProcessPending();
    if ( TakeDirty() && pRecons )
    {
      const std::lock_guard Lock( m_Guard );
      Take();
    }
    return bRan;
  }
  ZEK::VSelection ResolveIds( std::span< const std::uint32_t > i_Ids, std::vector< std::string >& o_rLabels ) override
  {
    return Registry().ResolveAll( i_Ids, o_rLabels );
  }
  std::vector< VScenePoint > GetSelectionPositions( const ZEK::VSelection& i_rSelection ) override
  {
    std::vector< VScenePoint > Points;
    for ( const ZEK::VSelectionItem& rItem : i_rSelection )
    {
      VScenePoint Point;
      if ( Registry().GetPosition( rItem, Point ) )
      {
        Points.push_back( Point );
      }
    }
    return Points;
  }

  void Change( std::vector< VScenePoint > i_Points )
  {
    {
      const std::lock_guard Lock( m_Guard );
      m_NewPoints = std::move( i_Points );
      m_bNew = true;
    }
    MarkDirty();
  }

  std::shared_ptr< VTestSelection > pSelection;
  std::shared_ptr< VTestCorner > pCorner;
  std::shared_ptr< VTestPixels > pPixels;
  std::shared_ptr< VRenderFloorGrid > pFloor;
  std::shared_ptr< VRenderReconstructions > pRecons;
  std::shared_ptr< VRenderOutlines > pOutlines;
  VTestPoints Resolver;
  std::function< void() > BeforePoints; ///< runs after the registry's reset
  std::atomic< int > Initialised{ 0 };

private:
  void Take()
  {
    if ( m_bNew )
    {
      Resolver.Points = m_NewPoints;
      m_bNew = false;
      pRecons->SetReconstructions( Resolver.Points );
    }
    Registry().Reset();
    if ( BeforePoints )
    {
      BeforePoints();
    }
    m_Flags.assign( Resolver.Points.size(), 0 );
    for ( const VSelectionRegistry::VMark& rMark : Registry().Marks() )
    {
      if ( rMark.Item.Kind == ZEK::ESelectReconstruction && rMark.Item.Sub < m_Flags.size() )
      {
        m_Flags[rMark.Item.Sub] = static_cast< std::uint8_t >( rMark.Flags >> 21 );
      }
    }
    const auto Count = static_cast< std::uint32_t >( m_Flags.size() );
    pRecons->SetReconstructionIds( Registry().AllocateRange( Count, Resolver ), m_Flags );
  }

  std::mutex m_Guard;
  std::vector< VScenePoint > m_NewPoints;
  bool m_bNew = false;
  std::vector< std::uint8_t > m_Flags;
};

/// A context of its own, shared with everybody's, and one frame in it.
class VOffscreen
{
public:
  explicit VOffscreen( bool i_bShared = true, const QSurfaceFormat& i_rFormat = QSurfaceFormat::defaultFormat() )
  {
    m_Surface.setFormat( i_rFormat );
    m_Context.setFormat( i_rFormat );
    m_Surface.create();
    if ( i_bShared )
    {
      m_Context.setShareContext( QOpenGLContext::globalShareContext() );
    }
    m_Context.create();
    MakeCurrent();
  }
  bool IsES() const { return m_Context.isOpenGLES(); }
  QSurfaceFormat Format() const { return m_Context.format(); }
  void MakeCurrent() { ASSERT_TRUE( m_Context.makeCurrent( &m_Surface ) ); }

  /// Draws one frame without multisampling and gives what is to be seen.
  QImage Draw( VSceneFrame& io_rFrame, QSize i_Size )
  {
    if ( !m_pTarget || m_pTarget->size() != i_Size )
    {
      m_pTarget = VSceneFrame::MakeTarget( i_Size, false );
      io_rFrame.Resize( i_Size );
    }
    m_pTarget->bind();
    bDrawn = io_rFrame.Render( *m_pTarget );
    return m_pTarget->toImage();
  }
  bool bDrawn = false;

private:
  QOffscreenSurface m_Surface;
  QOpenGLContext m_Context;
  std::unique_ptr< QOpenGLFramebufferObject > m_pTarget;
};

/// Where the first pose of the camera shows a point, in pixels from the top left. Written out, so that it does not
/// lean on the matrices that draw.
inline QPointF ScreenPoint( const VScenePoint& i_rPoint, QSizeF i_Size )
{
  const double Degree = std::acos( -1.0 ) / 180.0;
  const double Azimuth = 45 * Degree, Tilt = -60 * Degree;
  const double X = std::cos( Azimuth ) * i_rPoint.X - std::sin( Azimuth ) * i_rPoint.Y;
  const double Y = std::sin( Azimuth ) * i_rPoint.X + std::cos( Azimuth ) * i_rPoint.Y;
  const double Up = std::cos( Tilt ) * Y - std::sin( Tilt ) * i_rPoint.Z;
  const double Away = 7000 - ( std::sin( Tilt ) * Y + std::cos( Tilt ) * i_rPoint.Z );
  const double Pixels = i_Size.height() / 2 / std::tan( 22.5 * Degree );
  return { i_Size.width() / 2 + X / Away * Pixels, i_Size.height() / 2 - Up / Away * Pixels };
}

inline void InitShaders()
{
  CoreGraphics::InitBasicShaderResources();
  CoreGraphics::InitSceneShaderResources();
}

} // namespace MoxelGraphics

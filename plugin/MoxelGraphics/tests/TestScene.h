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
#include <HostServices/VSelectionService.h>

#include <QtCore/QThread>
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

inline constexpr QSize Size( 640, 360 );

inline void InitShaders()
{
  CoreGraphics::InitBasicShaderResources();
  CoreGraphics::InitSceneShaderResources();
}

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

/// Draws what its function draws.
class VTestDraw final : public IRenderType
{
public:
  using VFunction = std::function< void( CoreGraphics::VRenderContext&, const VSceneOptions&, std::uint32_t ) >;
  void Render( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
               std::uint32_t i_Pass ) override
  {
    if ( Function )
    {
      Function( io_rContext, i_rOptions, i_Pass );
    }
  }
  VFunction Function;
};

/// Fills a rectangle of the frame, y up.
inline void Fill( CoreGraphics::VRenderContext& io_rContext, const QRect& i_rRect, const QColor& i_rColour )
{
  const QRect Window = io_rContext.Scissor();
  io_rContext.SetScissor( i_rRect );
  io_rContext.SetClearColour( i_rColour );
  io_rContext.Clear( true, false );
  io_rContext.SetScissor( Window );
}

/// A red square of 20 pixels in the lower left corner of the frame.
inline void DrawCorner( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions&, std::uint32_t i_Pass )
{
  if ( i_Pass == ERenderPassOverlay && io_rContext.RenderMode() == ERenderModeNormal )
  {
    Fill( io_rContext, { 0, 0, 20, 20 }, Qt::red );
  }
}

/// A scene of points on a floor. Points are set on the GUI thread before the first frame, or with `Change`.
class VTestScene : public VMoxelScene
{
public:
  /// A pixel of the frame, y up, that bears an id in the selection mode; the last of equal places is on top.
  struct VPixel
  {
    int X, Y;
    std::uint32_t Id;
  };

  explicit VTestScene( std::shared_ptr< HarrowPluginInterface::IRenderResources > i_pResources = nullptr )
    : VMoxelScene( std::move( i_pResources ), std::make_shared< HostServices::VSelectionService >(), nullptr, nullptr,
                   false )
    , pSelection( SelectionService() )
  {
  }

  void Initialise( CoreGraphics::VRenderContext& io_rContext ) override
  {
    VMoxelScene::Initialise( io_rContext );
    ++Initialised;
    if ( m_RenderList.empty() && CanDraw() )
    {
      const auto pPixels = std::make_shared< VTestDraw >();
      pPixels->Function = [this]( CoreGraphics::VRenderContext& io_rOn, const VSceneOptions&, std::uint32_t i_Pass )
      {
        DrawPixels( io_rOn, i_Pass );
      };
      pRecons = std::make_shared< VRenderReconstructions >( *this );
      m_RenderList = { std::make_shared< VRenderFloorGrid >( Resources() ), pRecons, pPixels, pExtra,
                       std::make_shared< VRenderAxis >( Resources() ) };
      pOutlines = std::make_shared< VRenderOutlines >( *this );
      m_PostList = { pOutlines, pPost };
    }
  }
  bool ProcessPending() override
  {
    pThread = QThread::currentThread();
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
  void Select( ZEK::VSelection i_Items ) { pSelection->Set( ZEK::ISelectionService::EPrimary, std::move( i_Items ) ); }
  void Preselect( ZEK::VSelection i_Items )
  {
    pSelection->Set( ZEK::ISelectionService::ESecondary, std::move( i_Items ) );
  }

  const std::shared_ptr< ZEK::ISelectionService > pSelection;
  const std::shared_ptr< VTestDraw > pExtra = std::make_shared< VTestDraw >(); ///< with the world
  const std::shared_ptr< VTestDraw > pPost = std::make_shared< VTestDraw >();  ///< after the outlines
  std::shared_ptr< VRenderReconstructions > pRecons;
  std::shared_ptr< VRenderOutlines > pOutlines;
  std::vector< VPixel > Pixels;
  VTestPoints Resolver;
  std::function< void() > BeforePoints; ///< runs after the registry's reset
  std::atomic< int > Initialised{ 0 };
  std::atomic< QThread* > pThread{ nullptr }; ///< on which the scene was last brought up to date

private:
  void DrawPixels( CoreGraphics::VRenderContext& io_rContext, std::uint32_t i_Pass ) const
  {
    if ( i_Pass != ERenderPassOpaque || io_rContext.RenderMode() != ERenderModeSelection )
    {
      return;
    }
    for ( const auto& [X, Y, Id] : Pixels )
    {
      if ( io_rContext.Scissor().contains( X, Y ) && !IgnoreId( Id, ERenderModeSelection ) )
      {
        Fill( io_rContext, { X, Y, 1, 1 }, QColor( Id & 0xFF, ( Id >> 8 ) & 0xFF, ( Id >> 16 ) & 0xFF, 1 ) );
      }
    }
  }
  void Take()
  {
    if ( std::exchange( m_bNew, false ) )
    {
      Resolver.Points = m_NewPoints;
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

/// A context of its own, shared with everybody's, and the frame that is drawn in it.
class VOffscreen
{
public:
  explicit VOffscreen( bool i_bShared = true, const QSurfaceFormat& i_rFormat = QSurfaceFormat::defaultFormat() )
  {
    InitShaders();
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
  void MakeCurrent() { ASSERT_TRUE( m_Context.makeCurrent( &m_Surface ) ); }
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
inline QPointF ScreenPoint( const VScenePoint& i_rPoint, QSizeF i_Size = Size )
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

} // namespace MoxelGraphics

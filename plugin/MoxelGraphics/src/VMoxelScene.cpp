#include <MoxelGraphics/VMoxelScene.h>

#include "HandOver.h"
#include "VGlobalContext.h"

#include <MoxelGraphics/VSceneOptions.h>
#include <MoxelGraphics/VSphereHelper.h>

#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <QtGui/QPainter>

#include <unordered_set>

namespace MoxelGraphics
{

void VMoxelScene::VFlags::Mark()
{
  bDirty.store( true, std::memory_order_release );
  bPending.store( true, std::memory_order_release );
}

VMoxelScene::VMoxelScene( std::shared_ptr< HarrowPluginInterface::IRenderResources > i_pRenderResources,
                          std::shared_ptr< ZEK::ISelectionService > i_pSelectionService,
                          std::shared_ptr< HarrowPluginInterface::VMeshSceneCache > i_pMeshCache,
                          std::shared_ptr< ZEK::IPostalService > i_pPostalService, bool i_bDeveloperMode )
  : m_pResources( std::make_shared< CoreGraphics::VResources >( std::move( i_pRenderResources ) ) )
  , m_pSelectionService( std::move( i_pSelectionService ) )
  , m_pRegistry( std::make_shared< VSelectionRegistry >( m_pSelectionService ) )
  , m_pMeshCache( std::move( i_pMeshCache ) )
  , m_pPostalService( std::move( i_pPostalService ) )
  , m_bDeveloperMode( i_bDeveloperMode )
  , m_pFlags( std::make_shared< VFlags >() )
{
  // Both fire on threads of their own; the flags outlive the scene, so a late call does no harm.
  const auto Mark = [pFlags = m_pFlags]
  {
    pFlags->Mark();
  };
  if ( m_pSelectionService )
  {
    m_Connections.push_back( m_pSelectionService->ForKinds( {} )->Connect( Mark, nullptr ) );
  }
  if ( m_pMeshCache )
  {
    m_Connections.push_back( m_pMeshCache->Changed().Connect( Mark, nullptr ) );
  }
}

VMoxelScene::~VMoxelScene()
{
  const VGlobalContext Current;
  m_Connections.clear();
  m_PostList.clear();
  m_pBackdrop.reset();
  m_RenderList.clear();
  m_pSphereHelper.reset();
}

bool VMoxelScene::event( QEvent* i_pEvent )
{
  // A view that ended on its own thread hands its reference back in an event.
  TakeOver( this );
  return QObject::event( i_pEvent );
}

void VMoxelScene::Initialise( CoreGraphics::VRenderContext& )
{
  m_bCanDraw = m_pResources->Prepare();
  if ( m_bCanDraw )
  {
    m_pSphereHelper = std::make_shared< VSphereHelper >( m_pResources );
  }
}

bool VMoxelScene::ProcessPending()
{
  m_pFlags->bPending.store( false, std::memory_order_release );
  ++m_UpdateCount;
  {
    const std::lock_guard Lock( m_CallbackGuard );
    m_RunningCallbacks.assign( m_Callbacks.begin(), m_Callbacks.end() );
  }
  for ( const auto& rpCallback : m_RunningCallbacks )
  {
    rpCallback->Function();
  }
  const bool bRan = !m_RunningCallbacks.empty();
  if ( bRan )
  {
    m_RunningCallbacks.clear();
    const std::lock_guard Lock( m_CallbackGuard );
    std::erase_if( m_Callbacks,
                   []( const auto& i_rpCallback )
                   {
                     return i_rpCallback->bDone.load();
                   } );
  }
  return bRan;
}

std::vector< VScenePoint > VMoxelScene::GetSelectionPositions( const ZEK::VSelection& )
{
  return {};
}

bool VMoxelScene::GetSelectionPose( const ZEK::VSelection&, VScenePose& )
{
  return false;
}

ZEK::VSelection VMoxelScene::ResolveIds( std::span< const std::uint32_t >, std::vector< std::string >& )
{
  return {};
}

QString VMoxelScene::GetSelectedCameraURN()
{
  return {};
}

void VMoxelScene::SelectDevice( const QString&, bool ) {}

void VMoxelScene::SetIgnoredIds( std::span< const std::uint32_t > i_Ids )
{
  for ( const std::uint32_t Id : m_IgnoredIds )
  {
    m_IgnoredBits[Id / IdsPerWord] = 0;
  }
  m_IgnoredIds.clear();
  for ( const std::uint32_t Id : i_Ids )
  {
    AddIgnoredId( Id );
  }
}

bool VMoxelScene::AddIgnoredId( std::uint32_t i_Id )
{
  const std::uint32_t Id = i_Id & EIdMask;
  if ( IsIgnored( Id ) )
  {
    return false;
  }
  if ( Id / IdsPerWord >= m_IgnoredBits.size() )
  {
    m_IgnoredBits.resize( Id / IdsPerWord + 1, 0 );
  }
  m_IgnoredBits[Id / IdsPerWord] |= std::uint64_t( 1 ) << Id % IdsPerWord;
  m_IgnoredIds.push_back( Id );
  return true;
}

bool VMoxelScene::IgnoreId( std::uint32_t i_Word, int i_RenderMode ) const
{
  switch ( i_RenderMode )
  {
  case ERenderModeSelection:
    return IsIgnored( i_Word );
  case ERenderModeHighlight:
    return ( i_Word & ( EIdSelected | EIdPreselected ) ) == 0;
  default:
    return false;
  }
}

void VMoxelScene::Clear( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  Clear( io_rContext, i_rOptions, QRect( QPoint( 0, 0 ), io_rContext.FrameSize() ) );
}

void VMoxelScene::Clear( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                         const QRect& i_rScissor )
{
  io_rContext.SetScissor( i_rScissor );
  const bool bBackground = io_rContext.RenderMode() == ERenderModeNormal && i_rOptions.OverlayCamera.isEmpty();
  const QRgb Background = static_cast< QRgb >( i_rOptions.BackgroundColorRGB );
  io_rContext.SetClearColour( bBackground ? QColor( qRed( Background ), qGreen( Background ), qBlue( Background ) )
                                          : QColor( 0, 0, 0, 0 ) );
  io_rContext.Clear( true, true );
  m_DrawsAtClear = io_rContext.DrawCalls();
  if ( m_pSphereHelper )
  {
    m_pSphereHelper->Clear();
  }
}

void VMoxelScene::DrawScene( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  const bool bWorld =
      !m_pBackdrop || i_rOptions.OverlayCamera.isEmpty() || m_pBackdrop->RenderBackdrop( io_rContext, i_rOptions );
  if ( i_rOptions.Show3DOverlay && bWorld )
  {
    RenderPass( io_rContext, i_rOptions, ERenderPassOpaque );
    RenderPass( io_rContext, i_rOptions, ERenderPassTranslucent );
  }
  // Depth that nothing drew into is clear already: most picks look at a window that shows nothing.
  if ( io_rContext.DrawCalls() != m_DrawsAtClear )
  {
    io_rContext.Clear( false, true );
  }
  RenderPass( io_rContext, i_rOptions, ERenderPassOverlay );
}

void VMoxelScene::RenderPass( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                              std::uint32_t i_Pass )
{
  io_rContext.CheckErrors();
  for ( const auto& rpType : m_RenderList )
  {
    rpType->Render( io_rContext, i_rOptions, i_Pass );
  }
  io_rContext.CheckErrors();
}

void VMoxelScene::DrawTiles( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  io_rContext.CheckErrors();
  for ( const auto& rpType : m_RenderList )
  {
    rpType->RenderTiles( io_rContext, i_rOptions );
  }
  io_rContext.CheckErrors();
}

void VMoxelScene::DrawPost( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions )
{
  io_rContext.CheckErrors();
  const QRect Frame( QPoint( 0, 0 ), io_rContext.FrameSize() );
  io_rContext.SetViewport( Frame );
  io_rContext.SetScissor( Frame );
  for ( const auto& rpType : m_PostList )
  {
    rpType->Render( io_rContext, i_rOptions, ERenderPassOverlay );
  }
  io_rContext.CheckErrors();
}

bool VMoxelScene::WantsPaint( const VSceneOptions& i_rOptions ) const
{
  return m_bDeveloperMode || std::any_of( m_RenderList.begin(), m_RenderList.end(),
                                          [&]( const auto& i_rpType )
                                          {
                                            return i_rpType->WantsPaint( i_rOptions );
                                          } );
}

void VMoxelScene::Paint( QPainter& io_rPainter, CoreGraphics::VRenderContext& io_rContext,
                         const VSceneOptions& i_rOptions )
{
  for ( const auto& rpType : m_RenderList )
  {
    if ( rpType->WantsPaint( i_rOptions ) )
    {
      rpType->Paint( io_rPainter, io_rContext, i_rOptions );
    }
  }
  if ( m_bDeveloperMode && i_rOptions.OverlayCamera.isEmpty() )
  {
    PaintStatistics( io_rPainter, io_rContext );
  }
}

void VMoxelScene::PaintStatistics( QPainter& io_rPainter, const CoreGraphics::VRenderContext& i_rContext ) const
{
  QFont Font = io_rPainter.font();
  Font.setPixelSize( static_cast< int >( 12 * i_rContext.PixelRatio() ) );
  io_rPainter.setFont( Font );
  io_rPainter.setPen( QColor( 200, 200, 200 ) );
  const int Margin = static_cast< int >( 8 * i_rContext.PixelRatio() );
  io_rPainter.drawText( QPoint( Margin, i_rContext.FrameSize().height() - Margin ),
                        QStringLiteral( "%1 render types, %2 ids, %3 draws" )
                            .arg( m_RenderList.size() + m_PostList.size() )
                            .arg( m_pRegistry->NextId() - 1 )
                            .arg( i_rContext.DrawCalls() ) );
}

void VMoxelScene::PickInRect( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                              const QRect& i_rRect, std::vector< std::uint32_t >& io_rIds )
{
  for ( const auto& rpType : m_RenderList )
  {
    rpType->PickInRect( io_rContext, i_rOptions, i_rRect, io_rIds );
  }
  if ( m_pSphereHelper )
  {
    m_pSphereHelper->PickInRect( io_rContext, i_rRect, io_rIds );
  }
}

ZEK::VSelection VMoxelScene::GetSelection() const
{
  return m_pSelectionService ? m_pSelectionService->Get( ZEK::ISelectionService::EPrimary ) : ZEK::VSelection();
}

void VMoxelScene::SelectCamera( QString i_rDeviceURN, bool i_bPreselect )
{
  SelectDevice( i_rDeviceURN, i_bPreselect );
}

void VMoxelScene::MarkDirty()
{
  m_pFlags->Mark();
}

void VMoxelScene::AddRenderCallback( std::shared_ptr< VRenderCallback > i_pCallback )
{
  {
    const std::lock_guard Lock( m_CallbackGuard );
    m_Callbacks.push_back( std::move( i_pCallback ) );
  }
  m_pFlags->bPending.store( true, std::memory_order_release );
}

void VMoxelScene::SetCameraDefinitions( std::vector< VCameraDefinition > i_Definitions )
{
  std::stable_sort( i_Definitions.begin(), i_Definitions.end(), StandsBefore );
  std::unordered_set< std::string > Met;
  std::erase_if( i_Definitions,
                 [&Met]( const VCameraDefinition& i_rDefinition )
                 {
                   return !Met.insert( i_rDefinition.DeviceURN ).second;
                 } );
  if ( i_Definitions != m_CameraDefinitions )
  {
    m_CameraDefinitions = std::move( i_Definitions );
    ++m_CameraGeneration;
  }
}

void VMoxelScene::AddLabel( int i_Id, const ZEK::VSelectionItem& i_rItem, const std::array< float, 3 >& i_rPosition,
                            float i_Top, bool i_bSecond, bool i_bFlag, const std::string& i_rText )
{
  const auto [Place, bNew] = ( i_bSecond ? m_SecondLabels : m_Labels ).try_emplace( i_Id );
  if ( !bNew )
  {
    return;
  }
  Place->second = { i_rItem, i_rPosition, i_bFlag, i_rText };
  float& rHeight = Place->second.Position[YUp() ? 1 : 2];
  rHeight = std::max( rHeight, i_Top ) + 100.0f;
}

void VMoxelScene::ClearLabels()
{
  m_Labels.clear();
  m_SecondLabels.clear();
}

std::vector< const VSceneLabel* > VMoxelScene::GetLabels( bool i_bBoth ) const
{
  std::vector< const VSceneLabel* > Labels;
  for ( const auto& rEntry : m_Labels )
  {
    Labels.push_back( &rEntry.second );
  }
  for ( const auto& rEntry : m_SecondLabels )
  {
    if ( i_bBoth )
    {
      Labels.push_back( &rEntry.second );
    }
  }
  return Labels;
}

} // namespace MoxelGraphics

#include "VTileBatch.h"

#include <MoxelGraphics/VMoxelScene.h>
#include <MoxelGraphics/VSceneOptions.h>

#include <CoreGraphics/VRenderContext.h>

#include <algorithm>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
/// A row that places everything out of sight.
constexpr std::array< float, 8 > Nowhere{ 0, 0, 0, 0, 0, 0, 8, 8 };

float Single( double i_Value )
{
  return static_cast< float >( i_Value );
}
} // namespace

VTileBatch::VTileBatch( std::shared_ptr< const ZEK::IRenderCameraProvider > i_pProvider, bool i_bGreyscale )
  : m_pProvider( std::move( i_pProvider ) )
  , m_bGreyscale( i_bGreyscale )
{
}

VTileBatch::~VTileBatch() = default;

void VTileBatch::Collect( const CoreGraphics::VRenderContext& i_rContext, const VSceneOptions& i_rOptions )
{
  if ( m_Collected == m_Tiles.size() )
  {
    m_Tiles.emplace_back();
  }
  VTile& rTile = m_Tiles[m_Collected++];
  if ( !SameText( rTile.Camera, i_rOptions.OverlayCamera ) )
  {
    rTile.Camera = i_rOptions.OverlayCamera;
  }
  rTile.View2D = i_rContext.View2D();
  rTile.Rect = i_rContext.Viewport();
}

void VTileBatch::Invalidate()
{
  for ( const auto& rpSet : m_Sets )
  {
    rpSet->Serial = 0;
  }
  for ( const auto& rpView : m_Views )
  {
    rpView->SetSerial = 0;
    rpView->Rows.clear();
  }
}

bool VTileBatch::SamePlace( const VTile& i_rA, const VTile& i_rB )
{
  // Exactly: a view that moved by a hair has moved.
  const QVector4D &rA = i_rA.View2D, &rB = i_rB.View2D;
  return i_rA.Rect == i_rB.Rect && rA.x() == rB.x() && rA.y() == rB.y() && rA.z() == rB.z() && rA.w() == rB.w();
}

bool VTileBatch::SameTiles( const VView& i_rView ) const
{
  if ( i_rView.Tiles.size() != m_Collected )
  {
    return false;
  }
  for ( std::size_t Index = 0; Index < m_Collected; ++Index )
  {
    if ( !SameText( i_rView.Tiles[Index].Camera, m_Tiles[Index].Camera ) )
    {
      return false;
    }
  }
  return true;
}

VTileBatch::VView& VTileBatch::FindView( bool& o_rbSame )
{
  VView* pOldest = nullptr;
  for ( const auto& rpView : m_Views )
  {
    if ( SameTiles( *rpView ) )
    {
      o_rbSame = std::equal( rpView->Tiles.begin(), rpView->Tiles.end(), m_Tiles.begin(), SamePlace );
      if ( !o_rbSame )
      {
        std::copy_n( m_Tiles.begin(), m_Collected, rpView->Tiles.begin() );
      }
      return *rpView;
    }
    pOldest = pOldest && pOldest->Used <= rpView->Used ? pOldest : rpView.get();
  }
  o_rbSame = false;
  if ( m_Views.size() < MostViews )
  {
    pOldest = m_Views.emplace_back( std::make_unique< VView >() ).get();
  }
  pOldest->Tiles.assign( m_Tiles.begin(), m_Tiles.begin() + static_cast< std::ptrdiff_t >( m_Collected ) );
  pOldest->Names.resize( m_Collected );
  for ( std::size_t Index = 0; Index < m_Collected; ++Index )
  {
    pOldest->Names[Index] = m_Tiles[Index].Camera.toStdString();
  }
  pOldest->Slots.assign( m_Collected, NoSlot );
  pOldest->SetSerial = 0;
  return *pOldest;
}

bool VTileBatch::Prepare( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions, VDraw& o_rDraw )
{
  m_Last = m_Collected;
  if ( m_Collected == 0 )
  {
    return false;
  }
  const VKey Key{ m_pProvider->GetGeneration(), io_rContext.Viewport(),       i_rOptions.CentroidColourScheme,
                  Distort2D( i_rOptions ),      i_rOptions.CameraShowRotated, i_rOptions.CameraSnap90Degrees };
  bool bSame = false;
  VView& rView = FindView( bSame );
  rView.Used = ++m_Clock;
  m_Collected = 0;
  const bool bSetStands = rView.Set >= 0 && rView.SetSerial != 0 &&
                          m_Sets[static_cast< std::size_t >( rView.Set )]->Serial == rView.SetSerial;
  if ( !( bSame && bSetStands && Key.Provider != 0 && rView.Key == Key ) )
  {
    rView.Key = Key;
    const bool bGood = FindLists( rView, i_rOptions ) && ( FindSet( rView ) || WriteSet( io_rContext, rView ) ) &&
                       WriteTable( io_rContext, i_rOptions, rView );
    // Who keeps a list keeps its camera from filling it again in place.
    m_Lists.clear();
    m_Cameras.clear();
    m_Colours.reset();
    if ( !bGood )
    {
      rView.SetSerial = 0;
      return false;
    }
  }
  VTileSet& rSet = *m_Sets[static_cast< std::size_t >( rView.Set )];
  rSet.Used = m_Clock;
  o_rDraw = rView.Draw;
  o_rDraw.pSet = &rSet;
  o_rDraw.pTable = &rView.Table;
  return o_rDraw.End > o_rDraw.First;
}

bool VTileBatch::FindLists( VView& io_rView, const VSceneOptions& i_rOptions )
{
  bool bAny = false;
  m_Lists.resize( io_rView.Tiles.size() );
  m_Cameras.resize( io_rView.Tiles.size() );
  for ( std::size_t Index = 0; Index < io_rView.Tiles.size(); ++Index )
  {
    m_Cameras[Index] = m_pProvider->GetCamera( io_rView.Names[Index] );
    if ( const ZEK::IRenderCamera* const pCamera = m_Cameras[Index].get() )
    {
      pCamera->GetDrawData2D( pCamera->GetInfo().FirstCentroidId,
                              static_cast< ZEK::ECentroidColourScheme >( i_rOptions.CentroidColourScheme ),
                              m_bGreyscale, m_Lists[Index], m_Colours );
      bAny = true;
    }
  }
  return bAny;
}

bool VTileBatch::Matches( VView& io_rView, const VTileSet& i_rSet ) const
{
  if ( i_rSet.Serial == 0 )
  {
    return false;
  }
  for ( std::size_t Index = 0; Index < io_rView.Tiles.size(); ++Index )
  {
    std::uint32_t& rSlot = io_rView.Slots[Index];
    if ( !m_Cameras[Index] )
    {
      rSlot = NoSlot;
      continue;
    }
    const std::string& rName = io_rView.Names[Index];
    if ( rSlot >= i_rSet.SlotCount || i_rSet.Slots[rSlot].Name != rName )
    {
      const auto End = i_rSet.Slots.begin() + static_cast< std::ptrdiff_t >( i_rSet.SlotCount );
      const auto It = std::find_if( i_rSet.Slots.begin(), End,
                                    [&]( const VTileSlot& i_rSlot )
                                    {
                                      return i_rSlot.Name == rName;
                                    } );
      rSlot = It == End ? NoSlot : static_cast< std::uint32_t >( It - i_rSet.Slots.begin() );
    }
    if ( rSlot == NoSlot || i_rSet.Slots[rSlot].Generation != m_Lists[Index].Generation )
    {
      return false;
    }
  }
  return true;
}

bool VTileBatch::FindSet( VView& io_rView )
{
  const int Own = io_rView.Set;
  const auto Take = [&]( int i_Set )
  {
    const VTileSet& rSet = *m_Sets[static_cast< std::size_t >( i_Set )];
    if ( !Matches( io_rView, rSet ) )
    {
      return false;
    }
    io_rView.Set = i_Set;
    io_rView.SetSerial = rSet.Serial;
    return true;
  };
  if ( Own >= 0 && Take( Own ) )
  {
    return true;
  }
  for ( int Set = 0; Set < static_cast< int >( m_Sets.size() ); ++Set )
  {
    if ( Set != Own && Take( Set ) )
    {
      return true;
    }
  }
  return false;
}

VTileSet& VTileBatch::SetToWrite( VView& io_rView )
{
  // A view that drew from a larger one's set leaves it to that one: what the larger one writes next is then like what
  // it wrote last, and parts of it stay.
  if ( io_rView.Set < 0 || m_Sets[static_cast< std::size_t >( io_rView.Set )]->SlotCount > io_rView.Tiles.size() )
  {
    if ( m_Sets.size() < MostSets )
    {
      m_Sets.push_back( MakeSet() );
    }
    const auto Oldest = std::min_element( m_Sets.begin(), m_Sets.end(),
                                          []( const auto& i_rpA, const auto& i_rpB )
                                          {
                                            return i_rpA->Used < i_rpB->Used;
                                          } );
    io_rView.Set = static_cast< int >( Oldest - m_Sets.begin() );
  }
  return *m_Sets[static_cast< std::size_t >( io_rView.Set )];
}

bool VTileBatch::WriteSet( CoreGraphics::VRenderContext& io_rContext, VView& io_rView )
{
  VTileSet& rSet = SetToWrite( io_rView );
  std::size_t Count = 0;
  for ( std::size_t Index = 0; Index < io_rView.Tiles.size(); ++Index )
  {
    io_rView.Slots[Index] = NoSlot;
    if ( !m_Cameras[Index] )
    {
      continue;
    }
    if ( Count == rSet.Slots.size() )
    {
      rSet.Slots.emplace_back();
    }
    VTileSlot& rSlot = rSet.Slots[Count];
    rSlot.Name = io_rView.Names[Index];
    rSlot.Generation = m_Lists[Index].Generation;
    io_rView.Slots[Index] = static_cast< std::uint32_t >( Count );
    if ( Index != Count )
    {
      m_Lists[Count] = std::move( m_Lists[Index] );
    }
    ++Count;
  }
  rSet.SlotCount = Count;
  rSet.Serial = 0;
  if ( !Write( io_rContext, rSet, std::span( m_Lists ).first( Count ) ) )
  {
    return false;
  }
  rSet.Serial = ++m_Serial;
  io_rView.SetSerial = rSet.Serial;
  return true;
}

bool VTileBatch::WriteTable( CoreGraphics::VRenderContext& io_rContext, const VSceneOptions& i_rOptions,
                             VView& io_rView )
{
  const VTileSet& rSet = *m_Sets[static_cast< std::size_t >( io_rView.Set )];
  m_NewRows.assign( rSet.SlotCount * RowFloats, 0.0f );
  for ( std::size_t Slot = 0; Slot < rSet.SlotCount; ++Slot )
  {
    std::copy( Nowhere.begin(), Nowhere.end(), m_NewRows.begin() + static_cast< std::ptrdiff_t >( Slot * RowFloats ) );
  }
  io_rView.Draw = { nullptr, nullptr, 0xFFFFFFFF, 0, 0xFFFFFFFF, 0, false };
  for ( std::size_t Index = 0; Index < io_rView.Tiles.size(); ++Index )
  {
    if ( io_rView.Slots[Index] != NoSlot )
    {
      Place( io_rView, rSet, Index, i_rOptions );
    }
  }
  if ( m_NewRows == io_rView.Rows && io_rView.Table.Bind( io_rContext, 0 ) )
  {
    return true;
  }
  io_rView.Rows.clear();
  const std::size_t Bytes = m_NewRows.size() * sizeof( float );
  void* const pTexels = io_rView.Table.Map( io_rContext, Bytes, false );
  if ( !pTexels )
  {
    return false;
  }
  std::copy( m_NewRows.begin(), m_NewRows.end(), static_cast< float* >( pTexels ) );
  if ( !io_rView.Table.Unmap( io_rContext ) )
  {
    return false;
  }
  io_rView.Rows.assign( m_NewRows.begin(), m_NewRows.end() );
  return true;
}

void VTileBatch::Place( VView& io_rView, const VTileSet& i_rSet, std::size_t i_Tile, const VSceneOptions& i_rOptions )
{
  const VTile& rTile = io_rView.Tiles[i_Tile];
  const VTileSlot& rSlot = i_rSet.Slots[io_rView.Slots[i_Tile]];
  if ( rSlot.Count == 0 )
  {
    return;
  }
  const VSensorView View = MakeSensorView( *m_Cameras[i_Tile], i_rOptions, rTile.View2D );
  const double W = static_cast< double >( View.SensorSize[0] ), H = static_cast< double >( View.SensorSize[1] );
  const QRect& rFrame = io_rView.Key.Frame;
  const double FrameW = std::max( rFrame.width(), 1 ), FrameH = std::max( rFrame.height(), 1 );
  const QVector4D& rView2D = rTile.View2D;
  // From sensor pixels behind the lens to the frame, about the place that stands in the middle of the tile: all that
  // the program adds up is small there, however far the view is zoomed in.
  const double Sx = 2 * static_cast< double >( rView2D.x() ) / W * rTile.Rect.width() / FrameW;
  const double Sy = -2 * static_cast< double >( rView2D.y() ) / H * rTile.Rect.height() / FrameH;
  const auto& rTurn = View.Rotation;
  const std::array< double, 4 > Turn{ Sx * rTurn[0], Sx * rTurn[1], Sy * rTurn[2], Sy * rTurn[3] };
  const double Ox = W * static_cast< double >( rView2D.z() ) - View.RotationCentre[0];
  const double Oy = H * static_cast< double >( rView2D.w() ) - View.RotationCentre[1];
  const auto& rBack = View.RotationInverse;
  const double MiddleX = rBack[0] * Ox + rBack[1] * Oy + View.RotationCentre[0] - 0.5;
  const double MiddleY = rBack[2] * Ox + rBack[3] * Oy + View.RotationCentre[1] - 0.5;
  const double CentreX = ( 2.0 * ( rTile.Rect.x() - rFrame.x() ) + rTile.Rect.width() ) / FrameW - 1;
  const double CentreY = ( 2.0 * ( rTile.Rect.y() - rFrame.y() ) + rTile.Rect.height() ) / FrameH - 1;
  const float Width = 2.0f * static_cast< float >( rTile.Rect.width() ) * rView2D.x() / View.SensorSize[0];
  const double PixelsX = std::hypot( Turn[0] * FrameW, Turn[2] * FrameH ) / 2 * std::abs( rSlot.Image[2] );
  const double PixelsY = std::hypot( Turn[1] * FrameW, Turn[3] * FrameH ) / 2 * std::abs( rSlot.Image[3] );
  const float X = static_cast< float >( rTile.Rect.x() ), Y = static_cast< float >( rTile.Rect.y() );
  const std::array< float, 24 > Row{ Single( Turn[0] ),
                                     Single( Turn[1] ),
                                     Single( Turn[2] ),
                                     Single( Turn[3] ),
                                     Single( MiddleX ),
                                     Single( MiddleY ),
                                     Single( CentreX ),
                                     Single( CentreY ),
                                     View.DistortionCentre[0],
                                     View.DistortionCentre[1],
                                     View.DistortionParameters[0],
                                     View.DistortionParameters[1],
                                     View.DistortionParameters[2],
                                     Width,
                                     Single( 0.5 / std::max( PixelsX, 1e-6 ) ),
                                     Single( 0.5 / std::max( PixelsY, 1e-6 ) ),
                                     X,
                                     Y,
                                     X + static_cast< float >( rTile.Rect.width() ),
                                     Y + static_cast< float >( rTile.Rect.height() ),
                                     rSlot.Image[0],
                                     rSlot.Image[1],
                                     rSlot.Image[2],
                                     rSlot.Image[3] };
  const std::size_t First = io_rView.Slots[i_Tile] * RowFloats;
  std::copy( Row.begin(), Row.end(), m_NewRows.begin() + static_cast< std::ptrdiff_t >( First ) );
  VDraw& rDraw = io_rView.Draw;
  const std::uint32_t End = rSlot.First + rSlot.Count;
  rDraw.First = std::min( rDraw.First, rSlot.First );
  rDraw.End = std::max( rDraw.End, End );
  rDraw.bSmall = true;
  if ( rSlot.Largest * Width >= LargePixels )
  {
    rDraw.LargeFirst = std::min( rDraw.LargeFirst, rSlot.First );
    rDraw.LargeEnd = std::max( rDraw.LargeEnd, End );
  }
}

VUnitSquare::VUnitSquare()
{
  static constexpr std::array< float, 8 > Corners{ 0, 0, 1, 0, 0, 1, 1, 1 };
  m_Corners.SetContents( std::span( Corners ) );
}

CoreGraphics::VVertexStream VUnitSquare::Stream()
{
  using namespace CoreGraphics;
  static const VVertexLayout Layout( 8, 0, { { EAttributeUV, 2, GL_FLOAT, false, 0 } } );
  return { &m_Corners, &Layout, 0 };
}

bool SameText( const QString& i_rA, const QString& i_rB )
{
  return ( i_rA.constData() == i_rB.constData() && i_rA.size() == i_rB.size() ) || i_rA == i_rB;
}

bool HasMarks( VMoxelScene& i_rScene, std::uint32_t i_Kind )
{
  const auto Marks = i_rScene.Registry().Marks();
  return std::any_of( Marks.begin(), Marks.end(),
                      [i_Kind]( const VSelectionRegistry::VMark& i_rMark )
                      {
                        return i_rMark.Item.Kind == i_Kind;
                      } );
}

} // namespace MoxelGraphics

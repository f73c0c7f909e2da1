#include "CameraGridSetup.h"

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>

#include <algorithm>
#include <random>

namespace CameraGridBench
{
namespace
{
using namespace CoreMoxelTypes;

class VFrames
{
public:
  explicit VFrames( const VWorkload& i_rWorkload )
    : m_rWorkload( i_rWorkload )
  {
    for ( int Camera = 0; Camera < i_rWorkload.Cameras; ++Camera )
    {
      VCameraHardware Hardware;
      Hardware.SensorWidth = SensorWidth;
      Hardware.SensorHeight = SensorHeight;
      m_Slow.push_back( Item< FlowCameraHardware >( std::move( Hardware ), CameraName( Camera ) ) );
      if ( i_rWorkload.bLens )
      {
        m_Slow.push_back( Item< FlowCameraCalibration >( Calibration( Camera ), CameraName( Camera ) ) );
      }
    }
  }
  ZEK::VFlowStateRef Make( int i_Frame )
  {
    ZEK::VFlowStateRef State;
    (void)m_Factory->CreateState( State, { i_Frame, 1, 1 }, {}, {} );
    for ( const ZEK::VFlowItemRef& rItem : m_Slow )
    {
      State->AddItem( rItem );
    }
    for ( int Camera = 0; Camera < m_rWorkload.Cameras; ++Camera )
    {
      State->AddItem( Item< FlowCentroidSet >( Centroids(), CameraName( Camera ) ) );
      State->AddItem( Item< FlowGreyscaleBlobSet >( Blobs(), CameraName( Camera ) ) );
    }
    return State;
  }

private:
  template < typename TFlow >
  ZEK::VFlowItemRef Item( typename ZEK::FlowValueType< TFlow >::type i_Value, const std::string& i_rName )
  {
    ZEK::IResult Status;
    ZEK::VFlowItemRef New;
    m_Store->CreateItem( Status, ZEK::FlowValueType< TFlow >::Descriptor, New );
    *ZEK::FlowMutablePayload< typename ZEK::FlowValueType< TFlow >::type >( New.Get() ) = std::move( i_Value );
    New->MutableValue().SetName( ZEK::EFlowNameDevice, i_rName );
    return New;
  }
  int Below( int i_Limit ) { return static_cast< int >( m_Random() % static_cast< std::uint32_t >( i_Limit ) ); }
  float Sixteenths( int i_Limit ) { return static_cast< float >( Below( i_Limit * 16 ) ) / 16; }

  static VCameraCalibration Calibration( int i_Camera )
  {
    VCameraCalibration Value;
    Value.FocalLength = 1400;
    Value.Rotation = { 1.4, 0.01 * i_Camera, 0 };
    Value.RadialParameters = { -1e-7, 2e-14 };
    Value.DistortionCentre[0] = Value.PrincipalPoint[0] = SensorWidth / 2;
    Value.DistortionCentre[1] = Value.PrincipalPoint[1] = SensorHeight / 2;
    return Value;
  }
  VCentroidSet Centroids()
  {
    VCentroidSet Set;
    for ( int Index = 0; Index < m_rWorkload.Centroids; ++Index )
    {
      const float X = Sixteenths( SensorWidth ), Y = Sixteenths( SensorHeight );
      Set.Centroids.push_back( { X, Y, 1 + Sixteenths( 7 ) } );
    }
    return Set;
  }
  VGreyscaleBlobSet Blobs()
  {
    VGreyscaleBlobSet Set;
    for ( int Blob = 0; Blob < m_rWorkload.Blobs; ++Blob )
    {
      const int W = 1 + Below( 128 ), H = 1 + Below( 128 );
      const int X = Below( SensorWidth - W + 1 ), Y = Below( SensorHeight - H + 1 );
      Set.Blobs.push_back( { static_cast< u32 >( Set.Lines.size() ), static_cast< u32 >( H ) } );
      for ( int Row = 0; Row < H; ++Row )
      {
        Set.Lines.push_back( { static_cast< u16 >( X ), static_cast< u16 >( Y + Row ), static_cast< u16 >( W ),
                               static_cast< u32 >( Set.Pixels.size() ) } );
        for ( int Column = 0; Column < W; ++Column )
        {
          Set.Pixels.push_back( static_cast< u8 >( m_Random() >> 24 ) );
        }
      }
    }
    return Set;
  }

  const VWorkload& m_rWorkload;
  ZEK::VFlowStateFactoryRef m_Factory = HostFlow::MakeStateFactory();
  ZEK::VFlowStoreRef m_Store = HostFlow::MakeItemStore();
  std::vector< ZEK::VFlowItemRef > m_Slow;
  std::mt19937 m_Random{ 42 };
};

/// The rows of cells of the frame in which so many images waste the least.
int BestRows( int i_Count )
{
  constexpr double Aspect = static_cast< double >( SensorWidth ) / SensorHeight;
  double Best = 0;
  int Rows = 1;
  for ( int Try = 1; Try <= i_Count; ++Try )
  {
    const int Columns = ( i_Count + Try - 1 ) / Try;
    const double Cell = static_cast< double >( Width / Columns ) / std::max( 1, Height / Try );
    const double Score = i_Count * std::min( Cell, Aspect ) / std::max( Cell, Aspect ) / ( Columns * Try );
    if ( Columns * Try - i_Count != Columns && Score > Best )
    {
      Best = Score;
      Rows = Try;
    }
  }
  return Rows;
}
} // namespace

std::string CameraName( int i_Camera )
{
  return std::string( "camera-" ).append( std::to_string( 1000 + i_Camera ) );
}

MoxelGraphics::VCameraTilesRef MakeTiles( int i_Cameras )
{
  const int Rows = BestRows( i_Cameras ), Columns = ( i_Cameras + Rows - 1 ) / Rows;
  const int W = Width / Columns, H = Height / Rows;
  const double Cell = static_cast< double >( W ) / H, Aspect = static_cast< double >( SensorWidth ) / SensorHeight;
  auto pTiles = std::make_shared< MoxelGraphics::VCameraTiles >();
  for ( int Index = 0; Index < i_Cameras; ++Index )
  {
    MoxelGraphics::VCameraTile Tile;
    Tile.DeviceURN = QString::fromStdString( CameraName( Index ) );
    Tile.ImageWidth = SensorWidth;
    Tile.ImageHeight = SensorHeight;
    Tile.Rect = Tile.Viewport = QRect( Index % Columns * W, ( Rows - 1 - Index / Columns ) * H, W, H );
    Tile.ScaleX = static_cast< float >( std::min( 1.0, Aspect / Cell ) );
    Tile.ScaleY = static_cast< float >( std::min( 1.0, Cell / Aspect ) );
    pTiles->push_back( Tile );
  }
  return pTiles;
}

VCameraScene::VCameraScene( const VWorkload& i_rWorkload )
  : VFlowScene( nullptr, nullptr, nullptr, nullptr, false )
{
  VFrames Frames( i_rWorkload );
  for ( int Frame = 0; Frame < FrameCount; ++Frame )
  {
    m_States.push_back( Frames.Make( Frame ) );
  }
}

} // namespace CameraGridBench

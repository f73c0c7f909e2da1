#include "TestCamera.h"

#include <CoreVideoUtils/VideoTestPattern.h>

#include <algorithm>
#include <cmath>
#include <utility>

using namespace CoreMoxelTypes;

namespace Flow2Graphics
{
namespace
{
constexpr int DiscRadius = 40; // px
constexpr int DiscX = VTestCamera::SensorWidth / 2, DiscY = VTestCamera::SensorHeight / 2;

/// Half the length of the disc's row at that distance from its centre.
int HalfRow( int i_Row )
{
  return static_cast< int >( std::sqrt( static_cast< double >( DiscRadius * DiscRadius - i_Row * i_Row ) ) );
}

void Fill( VCameraHardware& o_rHardware, const std::string& i_rName )
{
  o_rHardware.Name = i_rName;
  o_rHardware.Type = o_rHardware.DefaultDisplayType = "Test Camera";
  o_rHardware.SensorWidth = VTestCamera::SensorWidth;
  o_rHardware.SensorHeight = VTestCamera::SensorHeight;
  o_rHardware.MaxRateHz = 120;
}

void Fill( VCentroidSet& o_rSet )
{
  constexpr std::uint32_t Step = 80; // px
  for ( std::uint32_t y = Step / 2; y < VTestCamera::SensorHeight; y += Step )
  {
    for ( std::uint32_t x = Step / 2; x < VTestCamera::SensorWidth; x += Step )
    {
      VCentroid Centroid;
      Centroid.x = static_cast< f32 >( x );
      Centroid.y = static_cast< f32 >( y );
      Centroid.radius = 2 + static_cast< f32 >( x / Step ); // growing to the right
      Centroid.Id = static_cast< u32 >( o_rSet.Centroids.size() );
      o_rSet.Centroids.push_back( Centroid );
    }
  }
}

void Fill( VGreyscaleBlobSet& o_rSet )
{
  for ( int Row = -DiscRadius; Row <= DiscRadius; ++Row )
  {
    const int Half = HalfRow( Row );
    VGreyscaleLine Line;
    Line.x = static_cast< u16 >( DiscX - Half );
    Line.y = static_cast< u16 >( DiscY + Row );
    Line.length = static_cast< u16 >( 2 * Half + 1 );
    Line.First = static_cast< u32 >( o_rSet.Pixels.size() );
    o_rSet.Lines.push_back( Line );
    for ( int Column = -Half; Column <= Half; ++Column )
    {
      const double Distance = std::hypot( Row, Column ) / DiscRadius;
      o_rSet.Pixels.push_back( static_cast< u8 >( std::lround( 255 - 215 * std::min( Distance, 1.0 ) ) ) );
    }
  }
  o_rSet.Blobs.push_back( { 0, static_cast< u32 >( o_rSet.Lines.size() ), -1 } );
  o_rSet.Complete = true;
}

void Fill( VEdgePairSet& o_rSet )
{
  for ( int Row = -DiscRadius; Row <= DiscRadius; ++Row )
  {
    const auto Half = static_cast< f32 >( HalfRow( Row ) );
    o_rSet.Pairs.push_back( { static_cast< u16 >( DiscY + Row ), DiscX - Half, DiscX + Half, 40, 40 } );
  }
}

void Fill( VCameraMaskGrid& o_rMask )
{
  o_rMask.CellWidth = o_rMask.CellHeight = 40;
  o_rMask.Columns = VTestCamera::SensorWidth / 40;
  o_rMask.Rows = VTestCamera::SensorHeight / 40;
  for ( int Row = 0; Row < o_rMask.Rows; ++Row )
  {
    for ( int Column = 0; Column < o_rMask.Columns; ++Column )
    {
      const bool bCorner =
          std::min( Row, o_rMask.Rows - 1 - Row ) < 2 && std::min( Column, o_rMask.Columns - 1 - Column ) < 2;
      o_rMask.Cells.push_back( bCorner ? 0xff : 0 );
    }
  }
}

void Fill( VImageSet& o_rSet )
{
  static const VImageSet::I Image = CoreVideoUtils::ColourBars( 160, 90 ); // the same for every camera
  o_rSet.Images.push_back( Image );
  o_rSet.Identifiers = { "m:123", "s:456" };
}

template < typename TFlow, typename... TArguments >
bool AddStatic( ZEK::IResult& io_rStatus, VTestCamera& io_rCamera, ZEK::IFlowStoreHandle& io_rStore,
                const TArguments&... i_rArguments )
{
  ZEK::VFlowItemRef Item;
  io_rStatus = MakeTestItem< TFlow >( Item, io_rStore, io_rCamera.Name );
  if ( io_rStatus.IsOk() )
  {
    Fill( TestPayload< TFlow >( *Item ), i_rArguments... );
    io_rCamera.StaticItems.push_back( std::move( Item ) );
  }
  return io_rStatus.IsOk();
}
} // namespace

ZEK::IResult MakeTestCamera( VTestCamera& o_rCamera, ZEK::IFlowStoreHandle& io_rStore, std::string i_Name )
{
  o_rCamera = { std::move( i_Name ), {} };
  ZEK::IResult Status;
  // Each only after the one before it could be made.
  (void)( AddStatic< FlowCameraHardware >( Status, o_rCamera, io_rStore, o_rCamera.Name ) &&
          AddStatic< FlowCentroidSet >( Status, o_rCamera, io_rStore ) &&
          AddStatic< FlowGreyscaleBlobSet >( Status, o_rCamera, io_rStore ) &&
          AddStatic< FlowEdgePairSet >( Status, o_rCamera, io_rStore ) &&
          AddStatic< FlowCameraMaskGrid >( Status, o_rCamera, io_rStore ) &&
          AddStatic< FlowImageSet >( Status, o_rCamera, io_rStore ) );
  return Status;
}

} // namespace Flow2Graphics

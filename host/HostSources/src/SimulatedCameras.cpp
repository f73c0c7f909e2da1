#include "SimulatedCameras.h"

#include "SimulatedStage.h"

#include <algorithm>
#include <cmath>
#include <numeric>

using namespace CoreMoxelTypes;
using namespace ZEK;

namespace HostSources::Simulation
{
namespace
{

constexpr std::size_t MostMasked = 3; // cameras opposite whose lamps are masked
constexpr double LampRadius = 12;     // px
constexpr double Hidden = -0.7;       // cosine below which a body stands between
constexpr double SmallDisc = 1.2;     // px
constexpr std::uint32_t None = 0xFFFFFFFF;
constexpr std::uint32_t Dark = FaultBit( ESimulatedFault::Missing ) | FaultBit( ESimulatedFault::Disconnected ) |
                               FaultBit( ESimulatedFault::Disabled );
constexpr std::uint32_t Unfit = FaultBit( ESimulatedFault::Bumped ) | FaultBit( ESimulatedFault::Uncalibrated ) |
                                FaultBit( ESimulatedFault::NotContributing );
constexpr std::size_t CommonRows = 6;
constexpr std::uint64_t FramesOfFormat = 60;

/// The camera as it stands, which after a bump is not as it was calibrated.
VCameraCalibration Standing( VCameraCalibration i_Calibration, std::uint32_t i_Faults )
{
  if ( i_Faults & FaultBit( ESimulatedFault::Bumped ) )
  {
    i_Calibration.Rotation = i_Calibration.Rotation * 1.01;
    i_Calibration.Position.z -= 15;
  }
  return i_Calibration;
}

} // namespace

struct VSimulatedCameras::VFrameSets
{
  VCentroidSet* pCentroids = nullptr;
  VCentroidLabelSet* pLabels = nullptr;
  VCentroidAssignmentSet* pAssignments = nullptr;
  VGreyscaleBlobSet* pBlobs = nullptr; ///< null where the camera gives none
  VEdgePairSet* pEdges = nullptr;      ///< as before
};

VSimulatedCameras::VSimulatedCameras( const VSimulatedCaptureOptions& i_rOptions )
  : m_rOptions( i_rOptions )
{
  m_Cameras.reserve( i_rOptions.Cameras );
  for ( std::uint32_t Camera = 0; Camera < i_rOptions.Cameras; ++Camera )
  {
    VCameraHardware Hardware;
    VCameraCalibration Calibration;
    FillCamera( Camera, i_rOptions.Cameras, i_rOptions.RateHz, Hardware, Calibration );
    std::uint32_t Faults = 0;
    for ( const VSimulatedFault& rFault : i_rOptions.Faults )
    {
      Faults |= rFault.Camera == Camera ? FaultBit( rFault.Fault ) : 0;
    }
    Hardware.Video = Camera >= i_rOptions.Cameras - i_rOptions.VideoCameras;
    const VSensorView View( Hardware, Standing( Calibration, Faults ) );
    m_Cameras.push_back( { Hardware.Name,
                           Hardware,
                           Calibration,
                           View,
                           Faults,
                           Hardware.Video,
                           !Hardware.Video && Camera % 4 == 3,
                           {},
                           {} } );
  }
  for ( VCamera& rCamera : m_Cameras )
  {
    MakeMask( rCamera );
  }
}

/// The lamps of other cameras shine brighter than any marker.
void VSimulatedCameras::MakeMask( VCamera& io_rCamera ) const
{
  if ( io_rCamera.bVideo )
  {
    return;
  }
  const std::uint32_t Columns = io_rCamera.Hardware.SensorWidth / CellSize;
  const std::uint32_t Rows = io_rCamera.Hardware.SensorHeight / CellSize;
  io_rCamera.Mask.assign( std::size_t{ Columns } * Rows, 0 );
  std::size_t Masked = 0;
  for ( const VCamera& rOther : m_Cameras )
  {
    VSensorPoint Lamp;
    if ( Masked == MostMasked || !io_rCamera.View.Project( rOther.View.Position(), Lamp ) )
    {
      continue;
    }
    ++Masked;
    const auto Cell = []( double i_Place, std::uint32_t i_Count )
    {
      return static_cast< std::uint32_t >( std::clamp( ( i_Place + 0.5 ) / CellSize, 0.0, i_Count - 1.0 ) );
    };
    for ( std::uint32_t Row = Cell( Lamp.y - LampRadius, Rows ); Row <= Cell( Lamp.y + LampRadius, Rows ); ++Row )
    {
      const std::uint32_t First = Cell( Lamp.x - LampRadius, Columns ), Last = Cell( Lamp.x + LampRadius, Columns );
      std::fill_n( io_rCamera.Mask.begin() + static_cast< std::ptrdiff_t >( Row * Columns + First ), Last - First + 1,
                   u8{ 0xFF } );
    }
  }
}

void VSimulatedCameras::See( const VCamera& i_rCamera, const std::vector< VStageMarker >& i_rMarkers )
{
  m_Discs.clear();
  const std::size_t Columns = i_rCamera.Hardware.SensorWidth / CellSize;
  for ( std::uint32_t Index = 0; Index < i_rMarkers.size(); ++Index )
  {
    const VStageMarker& rMarker = i_rMarkers[Index];
    const D3 Way = i_rCamera.View.Position() - rMarker.Position;
    VSensorPoint Point;
    if ( Dot( rMarker.Outward, Way ) < Hidden * Length( Way ) || !i_rCamera.View.Project( rMarker.Position, Point ) )
    {
      continue;
    }
    const auto Column = static_cast< std::size_t >( ( Point.x + 0.5 ) / CellSize );
    const auto Row = static_cast< std::size_t >( ( Point.y + 0.5 ) / CellSize );
    if ( i_rCamera.Mask[Row * Columns + Column] == 0 )
    {
      m_Discs.push_back( { Point.x, Point.y, std::max( MarkerRadius * Point.Scale, 0.5 ), Index } );
    }
  }
  // As a sensor is read.
  std::sort( m_Discs.begin(), m_Discs.end(),
             []( const VDisc& i_rA, const VDisc& i_rB )
             {
               return i_rA.y < i_rB.y || ( i_rA.y == i_rB.y && i_rA.Marker < i_rB.Marker );
             } );
}

/// Gives each disc the first of those that it hangs together with, and chains them by row.
void VSimulatedCameras::Group()
{
  m_Parents.resize( m_Discs.size() );
  std::iota( m_Parents.begin(), m_Parents.end(), 0u );
  const auto Root = [&]( std::uint32_t i_Disc )
  {
    while ( m_Parents[i_Disc] != i_Disc )
    {
      i_Disc = m_Parents[i_Disc] = m_Parents[m_Parents[i_Disc]];
    }
    return i_Disc;
  };
  double Largest = 0;
  for ( const VDisc& rDisc : m_Discs )
  {
    Largest = std::max( Largest, rDisc.Radius );
  }
  for ( std::uint32_t A = 0; A < m_Discs.size(); ++A )
  {
    // A pixel between two rims joins them.
    for ( std::uint32_t B = A + 1; B < m_Discs.size() && m_Discs[B].y - m_Discs[A].y < m_Discs[A].Radius + Largest + 1;
          ++B )
    {
      const double X = m_Discs[B].x - m_Discs[A].x, Y = m_Discs[B].y - m_Discs[A].y;
      const double Reach = m_Discs[A].Radius + m_Discs[B].Radius + 1;
      if ( X * X + Y * Y < Reach * Reach )
      {
        const std::uint32_t RootA = Root( A ), RootB = Root( B );
        m_Parents[std::max( RootA, RootB )] = std::min( RootA, RootB );
      }
    }
  }
  m_Next.assign( m_Discs.size(), None );
  m_Last.resize( m_Discs.size() );
  for ( std::uint32_t Disc = 0; Disc < m_Discs.size(); ++Disc )
  {
    const std::uint32_t First = m_Parents[Disc] = Root( Disc );
    if ( First != Disc )
    {
      m_Next[m_Last[First]] = Disc;
    }
    m_Last[First] = Disc;
  }
}

void VSimulatedCameras::AddCentroid( const VCamera& i_rCamera, std::uint32_t i_First,
                                     const std::vector< VStageMarker >& i_rMarkers, VFrameSets& io_rSets,
                                     VReconstructionSet& io_rPoints )
{
  m_Members.clear();
  VDisc Whole;
  std::uint32_t Nearest = i_First;
  double Area = 0;
  for ( std::uint32_t Disc = i_First; Disc != None; Disc = m_Next[Disc] )
  {
    const VDisc& rDisc = m_Discs[Disc];
    const double Weight = rDisc.Radius * rDisc.Radius;
    m_Members.push_back( rDisc );
    Whole.x += rDisc.x * Weight;
    Whole.y += rDisc.y * Weight;
    Area += Weight;
    Nearest = rDisc.Radius > m_Discs[Nearest].Radius ? Disc : Nearest;
  }
  const bool bMerged = m_Members.size() > 1;
  VCentroid Centroid;
  Centroid.x = static_cast< f32 >( Whole.x / Area );
  Centroid.y = static_cast< f32 >( Whole.y / Area );
  Centroid.radius = static_cast< f32 >( std::sqrt( Area ) );
  Centroid.Id = static_cast< u32 >( io_rSets.pCentroids->Centroids.size() );
  Centroid.Generator = Centroid.radius < SmallDisc ? 1 : i_rCamera.bEdges ? 2 : 0;
  Centroid.Quality = bMerged ? 120 : 250;
  Centroid.Blob = static_cast< u16 >( Centroid.Id );
  if ( !bMerged )
  {
    Centroid.x = static_cast< f32 >( m_Discs[i_First].x );
    Centroid.y = static_cast< f32 >( m_Discs[i_First].y );
    Centroid.radius = static_cast< f32 >( m_Discs[i_First].Radius );
  }
  if ( io_rSets.pBlobs )
  {
    m_Painter.Paint( m_Members, i_rCamera.Hardware.SensorWidth, i_rCamera.Hardware.SensorHeight,
                     static_cast< std::int32_t >( Centroid.Id ), *io_rSets.pBlobs, io_rSets.pEdges );
  }
  const VStageMarker& rMarker = i_rMarkers[m_Discs[Nearest].Marker];
  const bool bFits = ( i_rCamera.Faults & Unfit ) == 0 && rMarker.Reconstruction >= 0;
  io_rSets.pCentroids->Centroids.push_back( Centroid );
  io_rSets.pAssignments->Reconstruction.push_back( bFits ? rMarker.Reconstruction : -1 );
  io_rSets.pLabels->Labels.push_back( bFits ? VCentroidLabel{ rMarker.SubjectId, rMarker.MarkerId }
                                            : VCentroidLabel{} );
  if ( bFits )
  {
    ++io_rPoints.Items[static_cast< std::size_t >( rMarker.Reconstruction )].Rays;
  }
}

void VSimulatedCameras::AddFrame( const std::vector< VStageMarker >& i_rMarkers, VItemMaker& io_rMaker,
                                  IFlowState& io_rState, VReconstructionSet& io_rPoints )
{
  for ( VReconstruction& rPoint : io_rPoints.Items )
  {
    rPoint.Rays = 0;
  }
  for ( const VCamera& rCamera : m_Cameras )
  {
    if ( rCamera.bVideo || ( rCamera.Faults & Dark ) != 0 )
    {
      continue;
    }
    VFlowItemRef Items[5];
    VFrameSets Sets;
    Sets.pCentroids = io_rMaker.MakeNamed< FlowCentroidSet >( Items[0], EFlowNameDevice, rCamera.Name );
    Sets.pLabels = io_rMaker.MakeNamed< FlowCentroidLabelSet >( Items[1], EFlowNameDevice, rCamera.Name );
    Sets.pAssignments = io_rMaker.MakeNamed< FlowCentroidAssignmentSet >( Items[2], EFlowNameDevice, rCamera.Name );
    if ( m_rOptions.bGreyscale )
    {
      Sets.pBlobs = io_rMaker.MakeNamed< FlowGreyscaleBlobSet >( Items[3], EFlowNameDevice, rCamera.Name );
    }
    if ( m_rOptions.bGreyscale && rCamera.bEdges )
    {
      Sets.pEdges = io_rMaker.MakeNamed< FlowEdgePairSet >( Items[4], EFlowNameDevice, rCamera.Name );
    }
    if ( io_rMaker.Failure().IsError() )
    {
      return;
    }
    See( rCamera, i_rMarkers );
    Group();
    Sets.pCentroids->Centroids.reserve( i_rMarkers.size() );
    Sets.pLabels->Labels.reserve( i_rMarkers.size() );
    Sets.pAssignments->Reconstruction.reserve( i_rMarkers.size() );
    if ( Sets.pBlobs )
    {
      // Room for common discs, so that later frames seldom need more.
      Sets.pBlobs->Blobs.reserve( i_rMarkers.size() );
      Sets.pBlobs->Lines.reserve( i_rMarkers.size() * CommonRows );
      Sets.pBlobs->Pixels.reserve( i_rMarkers.size() * CommonRows * CommonRows );
      Sets.pBlobs->Complete = true;
    }
    for ( std::uint32_t Disc = 0; Disc < m_Discs.size(); ++Disc )
    {
      if ( m_Parents[Disc] == Disc )
      {
        AddCentroid( rCamera, Disc, i_rMarkers, Sets, io_rPoints );
      }
    }
    for ( const VFlowItemRef& rItem : Items )
    {
      if ( rItem )
      {
        io_rState.AddItem( rItem );
      }
    }
  }
}

void VSimulatedCameras::AddVideo( const VMarkerStage& i_rStage, double i_Seconds, VItemMaker& io_rMaker,
                                  IFlowState& io_rState )
{
  if ( m_rOptions.VideoCameras == 0 )
  {
    return;
  }
  // A little more, so that what falls on a frame is not before it.
  const auto Number = static_cast< std::int64_t >( std::floor( i_Seconds * VideoRateHz + 1e-6 ) );
  const double Seconds = static_cast< double >( Number ) / VideoRateHz;
  const bool bNew = Number != m_VideoNumber;
  if ( bNew )
  {
    i_rStage.At( Seconds, m_VideoMarkers );
    m_VideoNumber = -1; // until all are made
  }
  for ( std::size_t Index = m_Cameras.size() - m_rOptions.VideoCameras; Index < m_Cameras.size(); ++Index )
  {
    VCamera& rCamera = m_Cameras[Index];
    if ( ( rCamera.Faults & Dark ) != 0 )
    {
      continue;
    }
    if ( bNew )
    {
      auto* const pFrame = io_rMaker.MakeNamed< FlowVideoFrame >( rCamera.Video, EFlowNameDevice, rCamera.Name );
      if ( !pFrame )
      {
        return;
      }
      const auto Turn = static_cast< std::uint64_t >( Number ) / FramesOfFormat + 5 * Index;
      m_VideoPainter.Paint( rCamera.View, m_VideoMarkers );
      m_VideoPainter.Pack( m_rOptions.VideoFormat.value_or( static_cast< EPixelFormat >( Turn % PixelFormats ) ),
                           *pFrame );
      pFrame->PresentationTime = Seconds;
    }
    io_rState.AddItem( rCamera.Video );
  }
  m_VideoNumber = Number;
}

} // namespace HostSources::Simulation

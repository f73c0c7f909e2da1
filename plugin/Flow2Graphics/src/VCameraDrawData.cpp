#include "VCameraDrawData.h"

#include <CoreMoxelTypes/Camera.h>

#include <algorithm>
#include <atomic>

namespace Flow2Graphics
{
namespace
{
using namespace CoreMoxelTypes;
using ZEK::VCentroidVertex;
using ZEK::VGreyscaleData;

constexpr std::uint32_t PlainColour = 0xFFE0E0E0;
constexpr std::uint32_t UnassignedColour = 0xFF5050FF;
constexpr std::uint32_t AssignedColour = 0xFFFFB040;
constexpr std::uint32_t LabelledColour = 0xFF60D060;
constexpr std::uint32_t UnlabelledColour = 0xFF909090;
constexpr std::array< std::uint32_t, 3 > GeneratorColours{ 0xFFE0E0E0, 0xFF4CC9F2, 0xFFE08BD7 };

std::uint64_t NextGeneration()
{
  static std::atomic< std::uint64_t > Last{ 0 };
  return ++Last;
}

std::uint32_t Grey( std::uint8_t i_Value )
{
  return 0xFF000000u | i_Value * 0x010101u;
}

/// As the programs correct a point on the sensor.
struct VCorrection
{
  const ComputeCameraModel::VCameraModel& rModel;

  void Apply( float& io_rX, float& io_rY ) const
  {
    const auto& [CentreX, CentreY] = rModel.DistortionCentre;
    const auto& [K1, K2, K3] = rModel.DistortionParameters;
    if ( CentreX == 0 && CentreY == 0 )
    {
      return;
    }
    const float X = io_rX - CentreX, Y = io_rY - CentreY, D = X * X + Y * Y;
    const float Factor = 1 + D * ( K1 + D * ( K2 + D * K3 ) );
    io_rX = CentreX + X * Factor;
    io_rY = CentreY + Y * Factor;
  }
};

/// Whether a line's pixels are there, and its columns are numbers that a span can hold.
bool IsThere( const VGreyscaleBlobSet& i_rSet, const VGreyscaleLine& i_rLine )
{
  return std::uint64_t{ i_rLine.First } + i_rLine.length <= i_rSet.Pixels.size() && i_rLine.length > 0 &&
         i_rLine.x + i_rLine.length <= 0x10000;
}

/// Calls back with each blob that has lines; with no more lines than the set has, so that blobs which share lines are
/// no burden.
template < typename TTake >
void ForEachBlob( const VGreyscaleBlobSet& i_rSet, TTake&& i_rTake )
{
  std::size_t Left = i_rSet.Lines.size();
  for ( std::size_t Blob = 0; Blob < i_rSet.Blobs.size(); ++Blob )
  {
    const VGreyscaleBlob& rBlob = i_rSet.Blobs[Blob];
    const std::size_t First = std::min< std::size_t >( rBlob.FirstLine, i_rSet.Lines.size() );
    const std::size_t Count = std::min( { std::size_t{ rBlob.LineCount }, i_rSet.Lines.size() - First, Left } );
    Left -= Count;
    if ( Count > 0 )
    {
      i_rTake( static_cast< std::uint32_t >( Blob ), std::span( i_rSet.Lines ).subspan( First, Count ) );
    }
  }
}

/// Calls back with each line of the set's blobs whose pixels are there.
template < typename TTake >
void ForEachLine( const VGreyscaleBlobSet& i_rSet, TTake&& i_rTake )
{
  ForEachBlob( i_rSet,
               [&]( std::uint32_t, std::span< const VGreyscaleLine > i_Lines )
               {
                 for ( const VGreyscaleLine& rLine : i_Lines )
                 {
                   if ( IsThere( i_rSet, rLine ) )
                   {
                     i_rTake( rLine );
                   }
                 }
               } );
}

/// Lists the lines of one blob, which are all in the set, when their pixels are there and they follow one another row
/// by row, as they do unless something is wrong; false, with nothing listed, when not. Without a branch in the loop.
bool ListWholeBlob( const VGreyscaleBlobSet& i_rSet, std::uint32_t i_Blob, std::span< const VGreyscaleLine > i_Lines,
                    std::uint32_t i_Camera, std::size_t& io_rCount, VGreyscaleData& io_rData )
{
  const std::uint64_t PixelCount = i_rSet.Pixels.size();
  const std::uint32_t Top = i_Lines.front().y;
  ZEK::VGreyscaleSpan* const pSpan = io_rData.Lines.data() + io_rCount;
  std::uint32_t Left = 0xFFFF, Right = 0;
  bool bWrong = false;
  for ( std::size_t Index = 0; Index < i_Lines.size(); ++Index )
  {
    const VGreyscaleLine& rLine = i_Lines[Index];
    const std::uint32_t End = std::uint32_t{ rLine.x } + rLine.length;
    bWrong |= ( std::uint64_t{ rLine.First } + rLine.length > PixelCount ) | ( rLine.length == 0 ) | ( End > 0x10000 ) |
              ( rLine.y != Top + Index );
    Left = std::min< std::uint32_t >( Left, rLine.x );
    Right = std::max( Right, End );
    pSpan[Index] = { rLine.x, rLine.length, rLine.First };
  }
  if ( bWrong )
  {
    return false;
  }
  io_rData.Records.push_back( { static_cast< std::uint16_t >( Left ), static_cast< std::uint16_t >( Top ),
                                static_cast< std::uint16_t >( Right - 1 ), i_Lines.back().y,
                                static_cast< std::uint32_t >( io_rCount ), i_Camera } );
  io_rData.Blobs.push_back( i_Blob );
  io_rCount += i_Lines.size();
  return true;
}

/// The same for any blob: lines without pixels are left out, and each run of rows is a record of its own.
void ListParts( const VGreyscaleBlobSet& i_rSet, std::uint32_t i_Blob, std::span< const VGreyscaleLine > i_Lines,
                std::uint32_t i_Camera, std::size_t& io_rCount, VGreyscaleData& io_rData )
{
  bool bFirst = true;
  for ( const VGreyscaleLine& rLine : i_Lines )
  {
    if ( !IsThere( i_rSet, rLine ) )
    {
      continue;
    }
    const auto Right = static_cast< std::uint16_t >( rLine.x + rLine.length - 1 );
    if ( bFirst || io_rData.Records.back().Bottom + 1 != rLine.y )
    {
      io_rData.Records.push_back(
          { rLine.x, rLine.y, Right, rLine.y, static_cast< std::uint32_t >( io_rCount ), i_Camera } );
      io_rData.Blobs.push_back( i_Blob );
      bFirst = false;
    }
    ZEK::VGreyscaleRecord& rRecord = io_rData.Records.back();
    rRecord.Left = std::min( rRecord.Left, rLine.x );
    rRecord.Right = std::max( rRecord.Right, Right );
    rRecord.Bottom = rLine.y;
    io_rData.Lines[io_rCount++] = { rLine.x, rLine.length, rLine.First };
  }
}

void ListLines( const VGreyscaleBlobSet& i_rSet, std::uint32_t i_Camera, VGreyscaleData& io_rData )
{
  // What stands there from before is written over: clearing it first would cost as much again.
  io_rData.Lines.resize( i_rSet.Lines.size() );
  std::size_t Count = 0;
  ForEachBlob( i_rSet,
               [&]( std::uint32_t i_Blob, std::span< const VGreyscaleLine > i_Lines )
               {
                 if ( !ListWholeBlob( i_rSet, i_Blob, i_Lines, i_Camera, Count, io_rData ) )
                 {
                   ListParts( i_rSet, i_Blob, i_Lines, i_Camera, Count, io_rData );
                 }
               } );
  io_rData.Lines.resize( Count );
}

/// The items of the frame that colours are made of, one lookup for all centroids.
template < typename T >
const T* ElementAt( const std::vector< T >* i_pValues, std::size_t i_Index )
{
  return i_pValues && i_Index < i_pValues->size() ? &( *i_pValues )[i_Index] : nullptr;
}
} // namespace

void VCameraDrawData::ColoursChanged()
{
  m_Stale.set( EColours );
  m_Stale.set( ECentroids2D );
  m_Stale.set( ECentroids3D );
}

void VCameraDrawData::BlobsChanged()
{
  m_Stale.set( EGreyscale2D );
  m_Stale.set( EGreyscale3D );
}

void VCameraDrawData::ModelChanged()
{
  m_Stale.set( ECentroids3D );
  m_Stale.set( EGreyscale3D );
}

template < typename T >
T& VCameraDrawData::Refill( std::shared_ptr< T >& io_rpBuffer )
{
  if ( !io_rpBuffer || io_rpBuffer.use_count() > 1 )
  {
    io_rpBuffer = std::make_shared< T >();
  }
  return *io_rpBuffer;
}

void VCameraDrawData::MakeIds( const VSource& i_rSource, std::uint32_t i_FirstId )
{
  if ( !m_Stale[EIds] && m_FirstId == i_FirstId )
  {
    return;
  }
  m_FirstId = i_FirstId;
  m_Stale.reset( EIds );
  m_IdGeneration = NextGeneration();
  std::vector< std::uint32_t >& rIds = Refill( m_pIds );
  rIds.resize( i_rSource.rCamera.CentroidCount() );
  for ( std::size_t Centroid = 0; Centroid < rIds.size(); ++Centroid )
  {
    rIds[Centroid] = i_FirstId == 0 ? 0 : i_FirstId + static_cast< std::uint32_t >( Centroid );
  }
  for ( const VCameraMarks::VMember& rMember : i_rSource.rMarks.Centroids )
  {
    if ( rMember.Sub < rIds.size() )
    {
      rIds[rMember.Sub] |= rMember.Flags;
    }
  }
}

void VCameraDrawData::MakeColours( const VSource& i_rSource, ZEK::ECentroidColourScheme i_Scheme )
{
  // The label tables are shared by all cameras and have no other way to tell.
  if ( m_ColoursGeneration != m_pColours->Generation || m_Scheme != i_Scheme )
  {
    m_ColoursGeneration = m_pColours->Generation;
    m_Scheme = i_Scheme;
    ColoursChanged();
  }
  if ( !m_Stale[EColours] )
  {
    return;
  }
  m_Stale.reset( EColours );
  std::vector< std::uint32_t >& rColours = Refill( m_pColourWords );
  const VFlowRenderCamera& rCamera = i_rSource.rCamera;
  rColours.resize( rCamera.CentroidCount() );
  const auto* const pAssignments = rCamera.Value< VCentroidAssignmentSet >( ECameraCentroidAssignments );
  const auto* const pLabels = rCamera.Value< VCentroidLabelSet >( ECameraCentroidLabels );
  const auto* const pSet = rCamera.Value< VCentroidSet >( ECameraCentroids );
  if ( i_Scheme == ZEK::EColourConnection && !pAssignments )
  {
    std::fill( rColours.begin(), rColours.end(), PlainColour );
    return;
  }
  for ( std::size_t Centroid = 0; Centroid < rColours.size(); ++Centroid )
  {
    std::uint32_t& rColour = rColours[Centroid];
    if ( i_Scheme == ZEK::EColourGenerator )
    {
      const std::size_t Generator = pSet->Centroids[Centroid].Generator;
      rColour = GeneratorColours[std::min( Generator, GeneratorColours.size() - 1 )];
    }
    else if ( i_Scheme == ZEK::EColourMarker )
    {
      const auto* const pLabel = ElementAt( pLabels ? &pLabels->Labels : nullptr, Centroid );
      rColour = UnlabelledColour;
      (void)( pLabel && m_pColours->FindColour( pLabel->SubjectId, pLabel->MarkerId, rColour ) );
    }
    else
    {
      const auto* const pReconstruction = ElementAt( pAssignments ? &pAssignments->Reconstruction : nullptr, Centroid );
      rColour = !pReconstruction || *pReconstruction < 0     ? UnassignedColour
                : m_pColours->IsLabelled( *pReconstruction ) ? LabelledColour
                                                             : AssignedColour;
    }
  }
}

void VCameraDrawData::MakeVertices( const VSource& i_rSource, bool i_b3D )
{
  const EBuffer Buffer = i_b3D ? ECentroids3D : ECentroids2D;
  if ( !m_Stale[Buffer] )
  {
    return;
  }
  m_Stale.reset( Buffer );
  ( i_b3D ? m_Generation3D : m_Generation2D ) = NextGeneration();
  std::vector< VCentroidVertex >& rVertices = Refill( i_b3D ? m_pCentroids3D : m_pCentroids2D );
  rVertices.clear();
  const VFlowRenderCamera& rCamera = i_rSource.rCamera;
  if ( i_b3D && !rCamera.GetInfo().bCalibrated )
  {
    return;
  }
  const auto* const pSet = rCamera.Value< VCentroidSet >( ECameraCentroids );
  if ( !pSet )
  {
    return;
  }
  const std::vector< std::uint32_t >& rColours = *m_pColourWords;
  rVertices.resize( pSet->Centroids.size() );
  for ( std::size_t Index = 0; Index < rVertices.size(); ++Index )
  {
    const VCentroid& rCentroid = pSet->Centroids[Index];
    rVertices[Index] = { rCentroid.x, rCentroid.y, rCentroid.radius, rColours[Index] };
  }
  if ( i_b3D )
  {
    const VCorrection Correction{ rCamera.GetModel() };
    for ( VCentroidVertex& rVertex : rVertices )
    {
      Correction.Apply( rVertex.X, rVertex.Y );
    }
  }
}

void VCameraDrawData::MakeGreyscale( const VSource& i_rSource )
{
  if ( !m_Stale[EGreyscale2D] )
  {
    return;
  }
  m_Stale.reset( EGreyscale2D );
  m_Generation2D = NextGeneration();
  VGreyscaleData& rData = Refill( m_pGreyscale2D );
  rData.Records.clear();
  rData.Blobs.clear();
  rData.Pixels = {};
  if ( const auto* const pSet = i_rSource.rCamera.Value< VGreyscaleBlobSet >( ECameraGreyscaleBlobs ) )
  {
    rData.Pixels = pSet->Pixels;
    rData.OffsetScale = { pSet->SensorOffset.x, pSet->SensorOffset.y, pSet->SensorScale.x, pSet->SensorScale.y };
    ListLines( *pSet, i_rSource.rCamera.GetInfo().Number, rData );
  }
  else
  {
    rData.Lines.clear();
  }
}

void VCameraDrawData::MakeGreyscale3D( const VSource& i_rSource )
{
  if ( !m_Stale[EGreyscale3D] )
  {
    return;
  }
  m_Stale.reset( EGreyscale3D );
  m_Generation3D = NextGeneration();
  std::vector< VCentroidVertex >& rVertices = Refill( m_pGreyscale3D );
  rVertices.clear();
  const auto* const pSet = i_rSource.rCamera.Value< VGreyscaleBlobSet >( ECameraGreyscaleBlobs );
  if ( !pSet || !i_rSource.rCamera.GetInfo().bCalibrated )
  {
    return;
  }
  const VCorrection Correction{ i_rSource.rCamera.GetModel() };
  ForEachLine( *pSet,
               [&]( const VGreyscaleLine& i_rLine )
               {
                 const float Half = 0.5F * static_cast< float >( i_rLine.length );
                 VCentroidVertex Vertex{
                     pSet->SensorOffset.x + pSet->SensorScale.x * ( static_cast< float >( i_rLine.x ) + Half - 0.5F ),
                     pSet->SensorOffset.y + pSet->SensorScale.y * static_cast< float >( i_rLine.y ),
                     pSet->SensorScale.x * Half, Grey( pSet->Pixels[i_rLine.First + i_rLine.length / 2u] ) };
                 Correction.Apply( Vertex.X, Vertex.Y );
                 rVertices.push_back( Vertex );
               } );
}

void VCameraDrawData::Get2D( const VSource& i_rSource, std::uint32_t i_FirstId, ZEK::ECentroidColourScheme i_Scheme,
                             bool i_bGreyscale, ZEK::VCameraLists2D& o_rLists, ZEK::VDrawWords& o_rColours )
{
  // What the caller still holds of the last frame is not to count.
  o_rLists = {};
  o_rColours.reset();
  MakeIds( i_rSource, i_FirstId );
  MakeColours( i_rSource, i_Scheme );
  MakeVertices( i_rSource, false );
  static const ZEK::VDrawBuffer< VGreyscaleData > NoGreyscale = std::make_shared< VGreyscaleData >();
  if ( i_bGreyscale )
  {
    MakeGreyscale( i_rSource );
  }
  o_rLists = { m_pCentroids2D, m_pIds, i_bGreyscale ? m_pGreyscale2D : NoGreyscale, m_Generation2D, m_IdGeneration };
  o_rColours = m_pColourWords;
}

void VCameraDrawData::Get3D( const VSource& i_rSource, ZEK::ECentroidColourScheme i_Scheme, ZEK::VDrawWords& o_rIds,
                             ZEK::VCameraLists3D& o_rLists )
{
  o_rLists = {};
  o_rIds.reset();
  MakeIds( i_rSource, i_rSource.rCamera.GetInfo().FirstCentroidId );
  MakeColours( i_rSource, i_Scheme );
  MakeVertices( i_rSource, true );
  MakeGreyscale3D( i_rSource );
  o_rIds = m_pIds;
  o_rLists = { m_pCentroids3D, m_pGreyscale3D, m_Generation3D, m_IdGeneration };
}

} // namespace Flow2Graphics

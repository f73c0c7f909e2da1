#pragma once

#include <Flow2Graphics/VFlowRenderCamera.h>

#include <CoreMoxelTypes/Camera.h>

#include <bitset>

namespace Flow2Graphics
{

/// The six buffers that a camera's data are drawn from, each made when somebody asks and then kept until what it is
/// made of changes. A buffer that nobody else holds is filled again in place.
class VCameraDrawData
{
public:
  explicit VCameraDrawData( std::shared_ptr< const VCameraColours > i_pColours )
    : m_pColours( std::move( i_pColours ) )
  {
  }

  // What changed since a buffer was made.
  void CentroidsChanged() { m_Stale.set(); }
  void ColoursChanged();
  void MarksChanged() { m_Stale.set( EIds ); }
  void BlobsChanged();
  void ModelChanged();

  /// What the buffers are made of.
  struct VSource
  {
    const VFlowRenderCamera& rCamera;
    const VCameraMarks& rMarks;
  };
  void Get2D( const VSource& i_rSource, std::uint32_t i_FirstId, ZEK::ECentroidColourScheme i_Scheme, bool i_bGreyscale,
              ZEK::VCameraLists2D& o_rLists, ZEK::VDrawWords& o_rColours );
  void Get3D( const VSource& i_rSource, ZEK::ECentroidColourScheme i_Scheme, ZEK::VDrawWords& o_rIds,
              ZEK::VCameraLists3D& o_rLists );

private:
  enum EBuffer
  {
    ECentroids2D,
    EIds,
    EColours,
    EGreyscale2D,
    ECentroids3D,
    EGreyscale3D,
    EBufferCount
  };
  template < typename T >
  T& Refill( std::shared_ptr< T >& io_rpBuffer );
  void MakeIds( const VSource& i_rSource, std::uint32_t i_FirstId );
  void MakeColours( const VSource& i_rSource, ZEK::ECentroidColourScheme i_Scheme );
  void MakeVertices( const VSource& i_rSource, bool i_b3D );
  void MakeGreyscale( const VSource& i_rSource );
  void MakeGreyscale3D( const VSource& i_rSource );

  std::shared_ptr< const VCameraColours > m_pColours;
  std::shared_ptr< std::vector< ZEK::VCentroidVertex > > m_pCentroids2D, m_pCentroids3D, m_pGreyscale3D;
  std::shared_ptr< std::vector< std::uint32_t > > m_pIds, m_pColourWords;
  std::shared_ptr< ZEK::VGreyscaleData > m_pGreyscale2D;
  std::bitset< EBufferCount > m_Stale = std::bitset< EBufferCount >().set();
  std::uint32_t m_FirstId = 0;
  ZEK::ECentroidColourScheme m_Scheme = ZEK::EColourConnection;
  std::uint64_t m_ColoursGeneration = 0;
  std::uint64_t m_Generation2D = 0, m_Generation3D = 0, m_IdGeneration = 0;
};

} // namespace Flow2Graphics

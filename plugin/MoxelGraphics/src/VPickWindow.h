#pragma once

#include <MoxelGraphics/VSelectionRegistry.h>

#include <QtGui/QVector4D>

#include <algorithm>
#include <array>
#include <span>

namespace CoreGraphics
{
class VRenderContext;
}

namespace MoxelGraphics
{

/// The part of the world that a pick's scissor shows: four planes through the eye that look inwards.
class VPickWindow
{
public:
  explicit VPickWindow( CoreGraphics::VRenderContext& io_rContext );

  /// How far in front of the eye a point lies, as clip w has it.
  float Depth( float i_X, float i_Y, float i_Z ) const { return At( m_Depth, i_X, i_Y, i_Z ); }
  /// The radius with which a sphere at that depth is drawn.
  float Drawn( float i_Size, float i_Depth ) const
  {
    return std::max( i_Size, m_Smallest * std::max( i_Depth, 0.0f ) );
  }
  bool Meets( float i_X, float i_Y, float i_Z, float i_Radius ) const
  {
    return At( m_Planes[0], i_X, i_Y, i_Z ) >= -i_Radius && At( m_Planes[1], i_X, i_Y, i_Z ) >= -i_Radius &&
           At( m_Planes[2], i_X, i_Y, i_Z ) >= -i_Radius && At( m_Planes[3], i_X, i_Y, i_Z ) >= -i_Radius;
  }
  /// Whether a stick does that runs from one sphere to another; sure to say yes when it does.
  bool MeetsLine( const VScenePoint& i_rA, const VScenePoint& i_rB ) const
  {
    const auto Reach = [&]( const VScenePoint& i_rEnd )
    {
      return Drawn( i_rEnd.Radius, Depth( i_rEnd.X, i_rEnd.Y, i_rEnd.Z ) );
    };
    const float Radius = std::max( Reach( i_rA ), Reach( i_rB ) );
    const auto Inside = [&]( const QVector4D& i_rPlane )
    {
      return std::max( At( i_rPlane, i_rA.X, i_rA.Y, i_rA.Z ), At( i_rPlane, i_rB.X, i_rB.Y, i_rB.Z ) ) >= -Radius;
    };
    return Inside( m_Planes[0] ) && Inside( m_Planes[1] ) && Inside( m_Planes[2] ) && Inside( m_Planes[3] );
  }
  /// Whether something does that lies between points, each with a radius; sure to say yes when it does.
  bool MeetsHull( std::span< const VScenePoint > i_Points ) const
  {
    return std::all_of( m_Planes.begin(), m_Planes.end(),
                        [&]( const QVector4D& i_rPlane )
                        {
                          return std::any_of( i_Points.begin(), i_Points.end(),
                                              [&]( const VScenePoint& i_rPoint )
                                              {
                                                return At( i_rPlane, i_rPoint.X, i_rPoint.Y, i_rPoint.Z ) >=
                                                       -i_rPoint.Radius;
                                              } );
                        } );
  }
  float PixelsAtOne() const { return m_PixelsAtOne; }

private:
  static float At( const QVector4D& i_rPlane, float i_X, float i_Y, float i_Z )
  {
    return i_rPlane.x() * i_X + i_rPlane.y() * i_Y + i_rPlane.z() * i_Z + i_rPlane.w();
  }

  std::array< QVector4D, 4 > m_Planes;
  QVector4D m_Depth;
  float m_PixelsAtOne = 0;
  float m_Smallest = 0; ///< radius, for each mm of depth
};

} // namespace MoxelGraphics

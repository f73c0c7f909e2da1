#include "SurfaceNet.h"

#include <algorithm>
#include <cstddef>

namespace HostSources::Simulation
{
namespace
{

constexpr std::uint32_t NoVertex = 0xFFFFFFFF;

class VNet
{
public:
  VNet( const std::function< double( const D3& ) >& i_rField, const D3& i_rLeast, const D3& i_rMost, double i_Cell )
    : m_rField( i_rField )
    , m_Least( i_rLeast )
    , m_Cell( i_Cell )
  {
    const D3 Size = i_rMost - i_rLeast;
    const double Sizes[3] = { Size.x, Size.y, Size.z };
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      m_Corners[Axis] = static_cast< std::size_t >( std::ceil( Sizes[Axis] / i_Cell ) ) + 1;
    }
    m_Steps = { 1, m_Corners[0], m_Corners[0] * m_Corners[1] };
    m_Values.reserve( m_Steps[2] * m_Corners[2] );
    for ( std::size_t Z = 0; Z < m_Corners[2]; ++Z )
    {
      for ( std::size_t Y = 0; Y < m_Corners[1]; ++Y )
      {
        // Far outside, the next corners of the row are outside too, however the field falls.
        double Value = 0;
        std::size_t Skipped = 0;
        for ( std::size_t X = 0; X < m_Corners[0]; ++X )
        {
          if ( Skipped == 0 )
          {
            Value = m_rField( CornerAt( X, Y, Z ) );
            Skipped = static_cast< std::size_t >( std::max( Value / ( 1.2 * m_Cell ), 1.0 ) );
          }
          --Skipped;
          m_Values.push_back( Value );
        }
      }
    }
    m_Vertices.assign( m_Values.size(), NoVertex );
  }

  VSurface Make()
  {
    ForEachCell(
        [this]( std::size_t i_X, std::size_t i_Y, std::size_t i_Z, std::size_t i_Corner )
        {
          AddVertex( i_X, i_Y, i_Z, i_Corner );
        } );
    ForEachCell(
        [this]( std::size_t i_X, std::size_t i_Y, std::size_t i_Z, std::size_t i_Corner )
        {
          // The four cells about each edge that starts at the cell's first corner; none is missing within the box.
          const std::size_t Places[3] = { i_X, i_Y, i_Z };
          for ( int Axis = 0; Axis < 3; ++Axis )
          {
            const int Next = ( Axis + 1 ) % 3, Last = ( Axis + 2 ) % 3;
            if ( Places[Next] > 0 && Places[Last] > 0 )
            {
              AddQuad( i_Corner, m_Steps[static_cast< std::size_t >( Axis )],
                       m_Steps[static_cast< std::size_t >( Next )], m_Steps[static_cast< std::size_t >( Last )] );
            }
          }
        } );
    return std::move( m_Surface );
  }

private:
  D3 CornerAt( std::size_t i_X, std::size_t i_Y, std::size_t i_Z ) const
  {
    return m_Least +
           D3{ static_cast< double >( i_X ), static_cast< double >( i_Y ), static_cast< double >( i_Z ) } * m_Cell;
  }

  template < typename TDo >
  void ForEachCell( TDo&& i_Do )
  {
    for ( std::size_t Z = 0; Z + 1 < m_Corners[2]; ++Z )
    {
      for ( std::size_t Y = 0; Y + 1 < m_Corners[1]; ++Y )
      {
        for ( std::size_t X = 0; X + 1 < m_Corners[0]; ++X )
        {
          i_Do( X, Y, Z, X + Y * m_Steps[1] + Z * m_Steps[2] );
        }
      }
    }
  }

  D3 Slope( const D3& i_rPoint ) const
  {
    constexpr double Step = 0.5;
    const auto Along = [&]( const D3& i_rWay )
    {
      return m_rField( i_rPoint + i_rWay ) - m_rField( i_rPoint - i_rWay );
    };
    return D3{ Along( { Step, 0, 0 } ), Along( { 0, Step, 0 } ), Along( { 0, 0, Step } ) } * ( 0.5 / Step );
  }

  /// In the middle of where the surface crosses the cell's edges, then brought onto it.
  void AddVertex( std::size_t i_X, std::size_t i_Y, std::size_t i_Z, std::size_t i_Corner )
  {
    D3 Sum;
    int Crossings = 0;
    for ( std::size_t Corner = 0; Corner < 8; ++Corner )
    {
      for ( std::size_t Axis = 0; Axis < 3; ++Axis )
      {
        if ( Corner >> Axis & 1 )
        {
          continue;
        }
        const double From = ValueAt( i_Corner, Corner ), To = ValueAt( i_Corner, Corner | std::size_t{ 1 } << Axis );
        if ( ( From < 0 ) != ( To < 0 ) )
        {
          double Place[3] = { static_cast< double >( Corner & 1 ), static_cast< double >( Corner >> 1 & 1 ),
                              static_cast< double >( Corner >> 2 & 1 ) };
          Place[Axis] = From / ( From - To );
          Sum = Sum + D3{ Place[0], Place[1], Place[2] };
          ++Crossings;
        }
      }
    }
    if ( Crossings == 0 )
    {
      return;
    }
    D3 Point = CornerAt( i_X, i_Y, i_Z ) + Sum * ( m_Cell / Crossings );
    D3 Outward = Slope( Point );
    for ( int Round = 0; Round < 2; ++Round )
    {
      const double Steep = std::max( Dot( Outward, Outward ), 0.1 );
      const double Way = std::clamp( m_rField( Point ) / Steep, -m_Cell / 2, m_Cell / 2 );
      Point = Point - Outward * Way;
      Outward = Slope( Point );
    }
    m_Vertices[i_Corner] = static_cast< std::uint32_t >( m_Surface.Positions.size() );
    m_Surface.Positions.push_back( Point );
    m_Surface.Normals.push_back( Length( Outward ) > 1e-6 ? Unit( Outward ) : D3{ 0, 0, 1 } );
  }

  double ValueAt( std::size_t i_Corner, std::size_t i_Which ) const
  {
    return m_Values[i_Corner + ( i_Which & 1 ) + ( i_Which >> 1 & 1 ) * m_Steps[1] + ( i_Which >> 2 & 1 ) * m_Steps[2]];
  }

  void AddQuad( std::size_t i_Corner, std::size_t i_Along, std::size_t i_Next, std::size_t i_Last )
  {
    const bool bFrom = m_Values[i_Corner] < 0, bTo = m_Values[i_Corner + i_Along] < 0;
    if ( bFrom == bTo )
    {
      return;
    }
    std::array< std::uint32_t, 4 > Quad = { m_Vertices[i_Corner - i_Next - i_Last], m_Vertices[i_Corner - i_Last],
                                            m_Vertices[i_Corner], m_Vertices[i_Corner - i_Next] };
    if ( bTo )
    {
      std::swap( Quad[1], Quad[3] );
    }
    // Along the shorter diagonal.
    const auto& rPlaces = m_Surface.Positions;
    const bool bOther = Length( rPlaces[Quad[1]] - rPlaces[Quad[3]] ) < Length( rPlaces[Quad[0]] - rPlaces[Quad[2]] );
    const std::size_t Turn = bOther ? 1 : 0;
    for ( const std::size_t Corner : { 0, 1, 2, 0, 2, 3 } )
    {
      m_Surface.Triangles.push_back( Quad[( Corner + Turn ) % 4] );
    }
  }

  const std::function< double( const D3& ) >& m_rField;
  const D3 m_Least;
  const double m_Cell;
  std::array< std::size_t, 3 > m_Corners{}, m_Steps{};
  std::vector< double > m_Values;
  std::vector< std::uint32_t > m_Vertices; ///< of the cell that starts at a corner
  VSurface m_Surface;
};

} // namespace

VSurface SurfaceOf( const std::function< double( const D3& ) >& i_rField, const D3& i_rLeast, const D3& i_rMost,
                    double i_Cell )
{
  return VNet( i_rField, i_rLeast, i_rMost, i_Cell ).Make();
}

} // namespace HostSources::Simulation

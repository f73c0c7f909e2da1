#include "CameraMeshes.h"

#include <QtGui/QVector2D>
#include <QtGui/QVector3D>

#include <array>
#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

constexpr float Radius = 40.0F;  // mm, of the program's cylinder
constexpr float Length = 100.0F; // mm
constexpr std::uint32_t Sides = 12;

struct VBodyVertex
{
  QVector3D Position;
  QVector3D Normal;
};
static_assert( sizeof( VBodyVertex ) == 24 );

const VVertexLayout BodyLayout( sizeof( VBodyVertex ), 0,
                                { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                  { EAttributeNormal, 3, GL_FLOAT, false, 12 } } );

/// Builds in mm, x right, y down, z towards what the camera sees, the lens at the origin.
struct VBodyMaker
{
  std::vector< VBodyVertex > Vertices;
  std::vector< std::uint32_t > Indices;

  void Add( const QVector3D& i_rPlace, const QVector3D& i_rNormal )
  {
    Vertices.push_back(
        { { i_rPlace.x() / Radius, i_rPlace.y() / Radius, ( i_rPlace.z() + Length ) / Length }, i_rNormal } );
  }
  /// A flat face, its corners counter-clockwise from outside.
  void Face( std::initializer_list< QVector3D > i_Corners )
  {
    const QVector3D* const pCorner = i_Corners.begin();
    const QVector3D Normal = QVector3D::normal( pCorner[0], pCorner[1], pCorner[2] );
    const auto First = static_cast< std::uint32_t >( Vertices.size() );
    for ( const QVector3D& rCorner : i_Corners )
    {
      Add( rCorner, Normal );
    }
    for ( std::uint32_t Corner = 2; Corner < i_Corners.size(); ++Corner )
    {
      Indices.insert( Indices.end(), { First, First + Corner - 1, First + Corner } );
    }
  }
  /// The sides between two outlines of as many corners, each at its height.
  template < std::size_t N >
  void Wall( const std::array< QVector2D, N >& i_rOutline, float i_FromScale, float i_FromZ, float i_ToScale,
             float i_ToZ )
  {
    for ( std::size_t Corner = 0; Corner < N; ++Corner )
    {
      const QVector2D A = i_rOutline[Corner], B = i_rOutline[( Corner + 1 ) % N];
      Face( { { A * i_FromScale, i_FromZ },
              { B * i_FromScale, i_FromZ },
              { B * i_ToScale, i_ToZ },
              { A * i_ToScale, i_ToZ } } );
    }
  }
  /// The surface that a line from (radius, z) to another sweeps about z; rising lines face outwards.
  void Sweep( QVector2D i_From, QVector2D i_To )
  {
    const QVector2D Along = i_To - i_From;
    const QVector2D Out = QVector2D( Along.y(), -Along.x() ).normalized();
    const auto First = static_cast< std::uint32_t >( Vertices.size() );
    for ( std::uint32_t Side = 0; Side < Sides; ++Side )
    {
      const float Angle = 2 * std::acos( -1.0F ) * static_cast< float >( Side ) / static_cast< float >( Sides );
      const QVector2D Around( std::cos( Angle ), std::sin( Angle ) );
      Add( { Around * i_From.x(), i_From.y() }, { Around * Out.x(), Out.y() } );
      Add( { Around * i_To.x(), i_To.y() }, { Around * Out.x(), Out.y() } );
      const std::uint32_t A = First + 2 * Side, B = First + 2 * ( ( Side + 1 ) % Sides );
      if ( i_From.x() > 0 )
      {
        Indices.insert( Indices.end(), { A, B, B + 1 } );
      }
      if ( i_To.x() > 0 )
      {
        Indices.insert( Indices.end(), { A, B + 1, A + 1 } );
      }
    }
  }
};

/// A square with its corners cut off.
constexpr float Half = 28, Cut = 20;
const std::array< QVector2D, 8 > Housing{ QVector2D( Half, -Cut ),  QVector2D( Half, Cut ),  QVector2D( Cut, Half ),
                                          QVector2D( -Cut, Half ),  QVector2D( -Half, Cut ), QVector2D( -Half, -Cut ),
                                          QVector2D( -Cut, -Half ), QVector2D( Cut, -Half ) };
} // namespace

VMesh MakeCameraMesh()
{
  VBodyMaker Maker;
  constexpr float Back = -100, Bevel = -94, Neck = -40, Ring = -26;
  constexpr float BackScale = 0.86F;
  // The housing, its back bevelled.
  Maker.Face( { { Housing[0] * BackScale, Back },
                { Housing[7] * BackScale, Back },
                { Housing[6] * BackScale, Back },
                { Housing[5] * BackScale, Back },
                { Housing[4] * BackScale, Back },
                { Housing[3] * BackScale, Back },
                { Housing[2] * BackScale, Back },
                { Housing[1] * BackScale, Back } } );
  Maker.Wall( Housing, BackScale, Back, 1, Bevel );
  Maker.Wall( Housing, 1, Bevel, 1, Ring );
  // The collar that carries the strobes, with a rim about them.
  Maker.Sweep( { Half - 4, Neck }, { Radius, Ring } );
  Maker.Sweep( { Radius, Ring }, { Radius, -3 } );
  Maker.Sweep( { Radius, -3 }, { Radius - 3, 0 } );
  Maker.Sweep( { Radius - 3, 0 }, { Radius / 2, 0 } );
  // The lens lies sunk in its middle.
  Maker.Sweep( { Radius / 2, 0 }, { Radius / 2 - 6, -12 } );
  Maker.Sweep( { Radius / 2 - 6, -12 }, { 0, -8 } );
  return VMesh( BodyLayout, Maker.Vertices, Maker.Indices );
}

const VVertexLayout& LineLayout()
{
  static const VVertexLayout Layout(
      sizeof( VLineVertex ), 0,
      { { EAttributePosition, 3, GL_FLOAT, false, 0 }, { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 12 } } );
  return Layout;
}

namespace
{
constexpr float Corners[4][2] = { { -1, -1 }, { 1, -1 }, { 1, 1 }, { -1, 1 } };

VLineVertex Corner( std::size_t i_Index, std::uint32_t i_Colour )
{
  return { { Corners[i_Index % 4][0], Corners[i_Index % 4][1], 1 }, i_Colour };
}
} // namespace

std::vector< VLineVertex > FrustumLines( std::uint32_t i_Colour )
{
  std::vector< VLineVertex > Lines;
  for ( std::size_t Index = 0; Index < 4; ++Index )
  {
    Lines.push_back( { { 0, 0, 0 }, i_Colour } );
    Lines.push_back( Corner( Index, i_Colour ) );
    Lines.push_back( Corner( Index, i_Colour ) );
    Lines.push_back( Corner( Index + 1, i_Colour ) );
  }
  return Lines;
}

std::vector< VLineVertex > FrustumFaces()
{
  std::vector< VLineVertex > Faces;
  for ( std::size_t Index = 0; Index < 4; ++Index )
  {
    Faces.push_back( { { 0, 0, 0 } } );
    Faces.push_back( Corner( Index, 0xFFFFFFFF ) );
    Faces.push_back( Corner( Index + 1, 0xFFFFFFFF ) );
  }
  for ( const std::size_t Index : { 0u, 1u, 2u, 0u, 2u, 3u } )
  {
    Faces.push_back( Corner( Index, 0xFFFFFFFF ) );
  }
  return Faces;
}

std::vector< VLineVertex > AxisLines( float i_Length )
{
  constexpr std::uint32_t Colours[3] = { 0xFF3333E6, 0xFF33CC33, 0xFFFF664D };
  std::vector< VLineVertex > Lines;
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    VLineVertex End{ { 0, 0, 0 }, Colours[Axis] };
    Lines.push_back( End );
    End.Position[Axis] = i_Length;
    Lines.push_back( End );
  }
  return Lines;
}

} // namespace MoxelGraphics

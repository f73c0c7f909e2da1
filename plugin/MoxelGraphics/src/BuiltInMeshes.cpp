#include "BuiltInMeshes.h"

#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

struct VMeshVertex
{
  QVector3D Position;
  QVector3D Normal;
  std::uint32_t Colour = 0xFFFFFFFF;
};
static_assert( sizeof( VMeshVertex ) == 28 );

const VVertexLayout MeshLayout( sizeof( VMeshVertex ), 0,
                                { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                  { EAttributeNormal, 3, GL_FLOAT, false, 12 },
                                  { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 24 } } );

constexpr std::uint32_t Sides = 20;
constexpr float HeadBegin = 0.8F;
constexpr float HeadRadius = 2.2F;

struct VMaker
{
  std::vector< VMeshVertex > Vertices;
  std::vector< std::uint32_t > Indices;

  void Quad( const QVector3D ( &i_rCorners )[4], const QVector3D ( &i_rNormals )[4] )
  {
    const auto First = static_cast< std::uint32_t >( Vertices.size() );
    for ( int Corner = 0; Corner < 4; ++Corner )
    {
      Vertices.push_back( { i_rCorners[Corner], i_rNormals[Corner] } );
    }
    Indices.insert( Indices.end(), { First, First + 1, First + 2, First, First + 2, First + 3 } );
  }
  /// The surface that a line from (radius, height) to another sweeps about the z axis; rising lines face outwards.
  void Sweep( QVector2D i_From, QVector2D i_To )
  {
    const QVector2D Along = i_To - i_From;
    const QVector2D Out = QVector2D( Along.y(), -Along.x() ).normalized();
    for ( std::uint32_t Side = 0; Side < Sides; ++Side )
    {
      const auto At = []( std::uint32_t i_Side )
      {
        const float Angle = 2 * std::acos( -1.0F ) * static_cast< float >( i_Side ) / static_cast< float >( Sides );
        return QVector2D( std::cos( Angle ), std::sin( Angle ) );
      };
      const QVector2D A = At( Side ), B = At( Side + 1 );
      const auto Point = []( const QVector2D& i_rAround, const QVector2D& i_rProfile )
      {
        return QVector3D( i_rAround * i_rProfile.x(), i_rProfile.y() );
      };
      Quad( { Point( A, i_From ), Point( B, i_From ), Point( B, i_To ), Point( A, i_To ) },
            { Point( A, Out ), Point( B, Out ), Point( B, Out ), Point( A, Out ) } );
    }
  }
};
} // namespace

VMesh MakeBoxMesh( std::uint32_t i_Faces )
{
  VMaker Maker;
  for ( int Face = 0; Face < 6; ++Face )
  {
    if ( ( i_Faces >> Face & 1u ) == 0 )
    {
      continue;
    }
    const int Axis = Face / 2;
    const float Side = Face % 2 == 0 ? -0.5F : 0.5F;
    QVector3D Normal, U, V;
    Normal[Axis] = 2 * Side;
    U[( Axis + 1 ) % 3] = 0.5F;
    V[( Axis + 2 ) % 3] = 0.5F;
    if ( Side < 0 )
    {
      std::swap( U, V );
    }
    const QVector3D Middle = 0.5F * Normal;
    Maker.Quad( { Middle - U - V, Middle + U - V, Middle + U + V, Middle - U + V },
                { Normal, Normal, Normal, Normal } );
  }
  return VMesh( MeshLayout, Maker.Vertices, Maker.Indices );
}

VMesh MakeBoxEdges()
{
  VMaker Maker;
  for ( std::uint32_t Corner = 0; Corner < 8; ++Corner )
  {
    const auto Part = [&]( std::uint32_t i_Axis )
    {
      return ( Corner >> i_Axis & 1u ) != 0 ? 0.5F : -0.5F;
    };
    const QVector3D Place( Part( 0 ), Part( 1 ), Part( 2 ) );
    Maker.Vertices.push_back( { Place, Place.normalized() } );
    for ( std::uint32_t Axis = 0; Axis < 3; ++Axis )
    {
      if ( ( Corner >> Axis & 1u ) == 0 )
      {
        Maker.Indices.insert( Maker.Indices.end(), { Corner, Corner | 1u << Axis } );
      }
    }
  }
  return VMesh( MeshLayout, Maker.Vertices, Maker.Indices );
}

VMesh MakeArrowMesh()
{
  VMaker Maker;
  Maker.Sweep( { 0, 0 }, { 1, 0 } );
  Maker.Sweep( { 1, 0 }, { 1, HeadBegin } );
  Maker.Sweep( { 1, HeadBegin }, { HeadRadius, HeadBegin } );
  Maker.Sweep( { HeadRadius, HeadBegin }, { 0, 1 } );
  return VMesh( MeshLayout, Maker.Vertices, Maker.Indices );
}

} // namespace MoxelGraphics

#include "SubjectMeshes.h"

#include <HarrowPluginInterface/VMeshScene.h>

#include <QtGui/QVector2D>
#include <QtGui/QVector3D>

#include <cmath>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;

struct VBoneVertex
{
  QVector3D Position;
  QVector3D Normal;
  QVector2D UV;
};
static_assert( sizeof( VBoneVertex ) == 32 );
const VVertexLayout BoneLayout( sizeof( VBoneVertex ), 0,
                                { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                  { EAttributeNormal, 3, GL_FLOAT, false, 12 },
                                  { EAttributeUV, 2, GL_FLOAT, false, 24 } } );

struct VAxisVertex
{
  QVector3D Position;
  QVector3D Normal;
  std::uint32_t Colour = 0;
};
static_assert( sizeof( VAxisVertex ) == 28 );
const VVertexLayout AxisLayout( sizeof( VAxisVertex ), 0,
                                { { EAttributePosition, 3, GL_FLOAT, false, 0 },
                                  { EAttributeNormal, 3, GL_FLOAT, false, 12 },
                                  { EAttributeColour, 4, GL_UNSIGNED_BYTE, true, 24 } } );

// The faces look along y and z, and so gently along x that the one towards y is the stripe of the bone's shader.
constexpr float Waist = 0.15F;
constexpr float HalfWidth = 0.07F;

constexpr std::uint32_t AxisSides = 8;
constexpr float ShaftRadius = 0.025F;
constexpr float HeadRadius = 0.07F;
constexpr float HeadBegin = 0.76F;
constexpr std::uint32_t Red = 0xFF3333E6, Green = 0xFF33CC33, Blue = 0xFFFF664D;

constexpr std::uint32_t StickSides = 6;

/// A place on a circle about z.
QVector3D Around( std::uint32_t i_Side, std::uint32_t i_Sides, float i_Height )
{
  const float Angle = 2 * std::acos( -1.0F ) * static_cast< float >( i_Side ) / static_cast< float >( i_Sides );
  return { std::cos( Angle ), std::sin( Angle ), i_Height };
}

struct VAxisMaker
{
  std::vector< VAxisVertex > Vertices;
  std::vector< std::uint32_t > Indices;

  /// A ring of faces about z, from one radius and height to another, turned and coloured.
  void Ring( const QVector3D ( &i_rTurn )[3], std::uint32_t i_Colour, QVector2D i_From, QVector2D i_To )
  {
    const QVector2D Out = QVector2D( i_To.y() - i_From.y(), i_From.x() - i_To.x() ).normalized();
    const auto Turned = [&]( const QVector3D& i_rPoint )
    {
      return i_rTurn[0] * i_rPoint.x() + i_rTurn[1] * i_rPoint.y() + i_rTurn[2] * i_rPoint.z();
    };
    const auto First = static_cast< std::uint32_t >( Vertices.size() );
    for ( std::uint32_t Side = 0; Side < AxisSides; ++Side )
    {
      const QVector3D Circle = Around( Side, AxisSides, 0 );
      const QVector3D Normal = Turned( Circle * Out.x() + QVector3D( 0, 0, Out.y() ) );
      Vertices.push_back( { Turned( Circle * i_From.x() + QVector3D( 0, 0, i_From.y() ) ), Normal, i_Colour } );
      Vertices.push_back( { Turned( Circle * i_To.x() + QVector3D( 0, 0, i_To.y() ) ), Normal, i_Colour } );
      const std::uint32_t A = First + 2 * Side, B = First + 2 * ( ( Side + 1 ) % AxisSides );
      Indices.insert( Indices.end(), { A, B, B + 1, A, B + 1, A + 1 } );
    }
  }
  void Arrow( const QVector3D ( &i_rTurn )[3], std::uint32_t i_Colour )
  {
    Ring( i_rTurn, i_Colour, { ShaftRadius, 0 }, { ShaftRadius, HeadBegin } );
    Ring( i_rTurn, i_Colour, { ShaftRadius, HeadBegin }, { HeadRadius, HeadBegin } );
    Ring( i_rTurn, i_Colour, { HeadRadius, HeadBegin }, { 0, 1 } );
  }
};
} // namespace

CoreGraphics::VMesh MakeBoneMesh()
{
  const QVector3D Begin( 0, 0, 0 ), End( 1, 0, 0 );
  const QVector3D Corners[] = { { Waist, HalfWidth, -HalfWidth },
                                { Waist, HalfWidth, HalfWidth },
                                { Waist, -HalfWidth, HalfWidth },
                                { Waist, -HalfWidth, -HalfWidth } };
  std::vector< VBoneVertex > Vertices;
  std::vector< std::uint32_t > Indices;
  const auto Face = [&]( const QVector3D& i_rA, const QVector3D& i_rB, const QVector3D& i_rC )
  {
    const QVector3D Normal = QVector3D::normal( i_rA, i_rB, i_rC );
    for ( const QVector3D& rCorner : { i_rA, i_rB, i_rC } )
    {
      Indices.push_back( static_cast< std::uint32_t >( Vertices.size() ) );
      Vertices.push_back( { rCorner, Normal, { rCorner.x(), 0.5F } } );
    }
  };
  for ( int Side = 0; Side < 4; ++Side )
  {
    const QVector3D &rA = Corners[Side], &rB = Corners[( Side + 1 ) % 4];
    Face( rA, rB, End );
    Face( rB, rA, Begin );
  }
  return VMesh( BoneLayout, Vertices, Indices );
}

std::unique_ptr< CoreGraphics::VMesh > MakeBoneMesh( const HarrowPluginInterface::VMeshScene& i_rScene )
{
  std::vector< VBoneVertex > Vertices;
  std::vector< std::uint32_t > Indices;
  for ( const HarrowPluginInterface::VMeshSurface& rSurface : i_rScene.Surfaces )
  {
    const auto First = static_cast< std::uint32_t >( Vertices.size() );
    if ( rSurface.Normals.size() != rSurface.Positions.size() || rSurface.UVs.size() != rSurface.Positions.size() )
    {
      continue;
    }
    for ( std::size_t Index = 0; Index < rSurface.Positions.size(); ++Index )
    {
      const auto &rPlace = rSurface.Positions[Index], &rNormal = rSurface.Normals[Index];
      const auto& rUV = rSurface.UVs[Index];
      Vertices.push_back(
          { { rPlace[0], rPlace[1], rPlace[2] }, { rNormal[0], rNormal[1], rNormal[2] }, { rUV[0], rUV[1] } } );
    }
    for ( const std::uint32_t Index : rSurface.Triangles )
    {
      Indices.push_back( First + Index );
    }
  }
  return Indices.empty() ? nullptr : std::make_unique< VMesh >( BoneLayout, Vertices, Indices );
}

CoreGraphics::VMesh MakeAxesMesh()
{
  const QVector3D X( 1, 0, 0 ), Y( 0, 1, 0 ), Z( 0, 0, 1 );
  VAxisMaker Maker;
  // An arrow along z, turned about y by 90 degrees and about x by -90 degrees for the other two.
  Maker.Arrow( { -Z, Y, X }, Red );
  Maker.Arrow( { X, -Z, Y }, Green );
  Maker.Arrow( { X, Y, Z }, Blue );
  return VMesh( AxisLayout, Maker.Vertices, Maker.Indices );
}

CoreGraphics::VMesh MakeStickMesh()
{
  std::vector< QVector3D > Points;
  std::vector< std::uint32_t > Indices;
  for ( std::uint32_t Side = 0; Side < StickSides; ++Side )
  {
    Points.push_back( Around( Side, StickSides, 0 ) );
    Points.push_back( Around( Side, StickSides, 1 ) );
    const std::uint32_t A = 2 * Side, B = 2 * ( ( Side + 1 ) % StickSides );
    Indices.insert( Indices.end(), { A, B, B + 1, A, B + 1, A + 1 } );
  }
  for ( std::uint32_t Side = 1; Side + 1 < StickSides; ++Side )
  {
    const std::uint32_t B = 2 * Side, C = 2 * Side + 2;
    Indices.insert( Indices.end(), { 0, C, B, 1, B + 1, C + 1 } );
  }
  return VMesh( PositionLayout(), Points, Indices );
}

CoreGraphics::VMesh MakeStickLine()
{
  const std::vector< QVector3D > Points{ QVector3D( 0, 0, 0 ), QVector3D( 0, 0, 1 ) };
  const std::vector< std::uint32_t > Indices{ 0, 1 };
  return VMesh( PositionLayout(), Points, Indices );
}

const CoreGraphics::VVertexLayout& SphereNormalLayout()
{
  static constexpr VVertexLayout Layout(
      12, 0, { { EAttributePosition, 3, GL_FLOAT, false, 0 }, { EAttributeNormal, 3, GL_FLOAT, false, 0 } } );
  return Layout;
}

} // namespace MoxelGraphics

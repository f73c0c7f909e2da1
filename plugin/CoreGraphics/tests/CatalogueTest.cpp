#include "TestContext.h"

#include <CoreGraphics/ShaderResources.h>

#include <QtCore/QDirIterator>
#include <QtCore/QFile>
#include <QtCore/QRegularExpression>

#include <set>

using namespace CoreGraphics;
using namespace CoreGraphicsTests;

namespace
{
// Vertex shaders and the fragment shaders that each is drawn with.
const char* const Pairs = R"(FloorGrid: FloorGrid UniformColour; ScreenSpaceAxis: Colour; Sphere: SimpleLighting;
SpherePoint: SimpleLighting; SphereShadow: Colour; Simple3D: UniformColour; Simple3DUniformColour: Colour;
Simple3DVertexColour: Colour; FullScreen: Copy Distort; Simple: Outlines AntiAlias;
ForcePlate: ForcePlate SimpleLighting; Simple3DModel: SimpleLighting;
Simple3DModelColour: SimpleLighting ClipFloor CameraCoverageFurstum;
Simple3DModelWireframe: Colour UniformColour; Locator: Colour; Billboard: ActiveLabelHalo;
PlumeMarkerTrails: Colour; MarkerTrail: Colour; Label: Label; Point3D: Colour; Simple3DPointSize: UniformColour; SimpleColour: Colour;
ColoredLine: StippledLine; Camera: Camera; CameraRay: Colour CameraCoverageFurstum ClipFloor StippledLine;
Edge3D: Colour; Edge2D: Colour; General2D: Colour; MaskSquare: Mask MaskSelection;
Greyscale2D: Greyscale2D Greyscale2DSelection; GreyscaleMaximised: Greyscale2D Greyscale2DSelection;
Greyscale3D: Colour; WandWave2D: WandWave2D; Centroid2D: Centroid2D Centroid2DSelection Colour;
Centroid3D: Colour; Frame: UniformColour; Centroid3DTiles: Colour; Centroid2DTiles: Colour Greyscale2DSelection;
Centroid2DTileQuads: Centroid2DTileQuads Centroid2DTileQuadsSelection;
Greyscale2DTiles: Greyscale2DTiles Greyscale2DTilesSelection; MaskSquareTiles: MaskTiles MaskTilesSelection;
Edge2DTiles: MaskTiles; WandWave2DTiles: WandWave2DTiles;
Video: VideoBayer VideoLuminance VideoYUV VideoYUVPlanar VideoImage;
Stick: Colour SimpleLighting; StickBetween: Colour; StickShadow: Colour; Target: SimpleLighting Colour; Segment: Segment;
NonUniformSphere: Covariance; MissingMarker: MissingMarker; FBXSkin: FBXMaterial XRay;
FBXMesh: FBXMaterial XRay; FBXColoredMesh: FBXMaterial SimpleLighting XRay;)";
} // namespace

using CatalogueTest = DrawingTest;
INSTANTIATE_TEST_SUITE_P( Contexts, CatalogueTest, AllKinds, KindName );

TEST_P( CatalogueTest, EverySourceIsInAPairAndEveryPairLinks )
{
  EXPECT_EQ( rResources.Dialect(), IsOldContext() ? EDialectDesktop330 : EDialectES300 );
  std::set< QString > Listed = { "FragmentShaders/Selection.glsl" };
  const auto ExpectLinks = [&]( const QString& i_rVertex, const QString& i_rFragment, EShaderForm i_Form )
  {
    EXPECT_TRUE( rResources.GetProgram( i_rVertex.toStdString(), i_rFragment.toStdString(), i_Form )->IsUsable() )
        << i_rVertex.toStdString() << ' ' << i_rFragment.toStdString() << ' ' << i_Form;
  };
  for ( const QString& rLook : QString( Pairs ).simplified().split( ';', Qt::SkipEmptyParts ) )
  {
    const QString Vertex = rLook.section( ':', 0, 0 ).trimmed();
    for ( const QString& rFragment : rLook.section( ':', 1 ).split( ' ', Qt::SkipEmptyParts ) )
    {
      ExpectLinks( Vertex, rFragment, EFormSingle );
      ExpectLinks( Vertex, rFragment, EFormInstanced );
      Listed.insert( "FragmentShaders/" + rFragment + ".glsl" );
    }
    // Whatever can be drawn can be picked.
    ExpectLinks( Vertex, "Selection", EFormSingle );
    if ( !rRender.Context()->isOpenGLES() && Vertex == "Greyscale2DTiles" )
    {
      ExpectLinks( Vertex, Vertex, EFormTextureBuffers );
      ExpectLinks( Vertex, Vertex + "Selection", EFormTextureBuffers );
    }
    ExpectLinks( Vertex, "Selection", EFormInstancedSelection );
    ExpectLinks( Vertex, "Selection", EFormPointsSelection );
    Listed.insert( "VertexShaders/" + Vertex + ".glsl" );
  }
  // The software driver computes in full precision whatever it is asked for.
  const QRegularExpression Wrong( "\\b(lowp|mediump)\\b|#version|uniform\\s+(?!sampler2D\\b)([iu]?sampler\\w+)" );
  const QByteArray Head = VShader::Compose( {}, EFragmentShader, EFormSingle, EDialectES300 );
  EXPECT_TRUE( Head.startsWith( "#version 300 es\n#undef highp\nprecision highp sampler2D;\n#undef highp\n"
                                "precision highp float;\n" ) );
  for ( const QString& rFolder : { QString( "VertexShaders/" ), QString( "FragmentShaders/" ) } )
  {
    for ( QDirIterator It( ":/" + rFolder ); It.hasNext(); )
    {
      QFile File( It.next() );
      ASSERT_TRUE( File.open( QIODevice::ReadOnly ) );
      EXPECT_FALSE( QString( File.readAll() ).contains( Wrong ) ) << It.fileName().toStdString();
      EXPECT_TRUE( Listed.count( rFolder + It.fileName() ) ) << It.fileName().toStdString();
    }
  }
}
